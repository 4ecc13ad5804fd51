"""How many lines the tests have for a line of code, by folder. Blank lines and comments do not count."""

import re

CODE_FOLDERS = ("app", "lib", "platform", "server", "tools")
BLOCK_COMMENT = re.compile(r"/\*.*?\*/", re.DOTALL)


def count_lines(path):
    try:
        text = path.read_text(encoding="utf-8")
    except UnicodeDecodeError:
        return 0
    is_script = path.suffix in (".py", ".sh") or (path.suffix == "" and text.startswith("#!"))
    if path.suffix not in (".h", ".cpp") and not is_script:
        return 0
    comment = "#" if is_script else "//"
    lines = (text if is_script else BLOCK_COMMENT.sub("", text)).splitlines()
    return sum(1 for line in lines if line.strip() and not line.lstrip().startswith(comment))


def counts(root, folder):
    """Lines by the folder's own folders, with those of the files that lie in it under its own name."""
    lines = {}
    for path in sorted((root / folder).rglob("*")):
        if path.is_file() and "__pycache__" not in path.parts:
            inner = path.relative_to(root / folder).parts
            name = f"{folder}/{inner[0]}" if len(inner) > 1 else folder
            lines[name] = lines.get(name, 0) + count_lines(path)
    return {name: count for name, count in lines.items() if count}


def table(root):
    tests = counts(root, "tests")
    code = {}
    for folder in CODE_FOLDERS:
        code.update(counts(root, folder))
    all_tests, all_code = sum(tests.values()), sum(code.values())
    if not all_code:
        return []
    rows = [*code.items(), ("all code", all_code), *tests.items(), ("all tests", all_tests)]
    lines = [f"{name:<24}{count:>7}" for name, count in rows]
    return [*lines, f"tests for a line of code {all_tests / all_code:.2f}"]
