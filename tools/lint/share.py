"""How many lines of C++ the tests have for a line of code, by folder, and the scripts apart. Blank lines and comments do
not count."""

import re

CODE_FOLDERS = ("app", "lib", "platform", "server", "tools")
BLOCK_COMMENT = re.compile(r"/\*.*?\*/", re.DOTALL)


def lines_of(text, comment):
    return sum(1 for line in text.splitlines() if line.strip() and not line.lstrip().startswith(comment))


def count_lines(path):
    """The lines of C++ and of script in a file."""
    try:
        text = path.read_text(encoding="utf-8")
    except UnicodeDecodeError:
        return 0, 0
    if path.suffix in (".h", ".cpp"):
        return lines_of(BLOCK_COMMENT.sub("", text), "//"), 0
    is_script = path.suffix in (".py", ".sh") or (path.suffix == "" and text.startswith("#!"))
    return 0, lines_of(text, "#") if is_script else 0


def counts(root, folder):
    """Lines of C++ by the folder's own folders, with those of the files that lie in it under its own name; and how many
    lines of script there are."""
    code, scripts = {}, 0
    for path in sorted((root / folder).rglob("*")):
        if path.is_file() and "__pycache__" not in path.parts:
            inner = path.relative_to(root / folder).parts
            name = f"{folder}/{inner[0]}" if len(inner) > 1 else folder
            lines, script = count_lines(path)
            code[name] = code.get(name, 0) + lines
            scripts += script
    return {name: count for name, count in code.items() if count}, scripts


def table(root):
    tests, test_scripts = counts(root, "tests")
    code, scripts = {}, 0
    for folder in CODE_FOLDERS:
        lines, script = counts(root, folder)
        code.update(lines)
        scripts += script
    all_tests, all_code = sum(tests.values()), sum(code.values())
    if not all_code:
        return []
    rows = [*code.items(), ("all code", all_code), *tests.items(), ("all tests", all_tests),
            ("scripts", scripts), ("scripts of tests", test_scripts)]
    lines = [f"{name:<24}{count:>7}" for name, count in rows]
    return [*lines, f"tests for a line of code {all_tests / all_code:.2f}"]
