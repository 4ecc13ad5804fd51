"""How long files and functions are, how many parameters functions take, and how deep they nest.

A scanner of braces, not a parser: where it cannot tell what a brace opens, it lets it pass.
"""

import re
from dataclasses import dataclass, field

MOST_FILE_LINES = 500
NOTED_FILE_LINES = 300
MOST_FUNCTION_LINES = 60
MOST_PARAMETERS = 6
MOST_NESTING = 3
EXEMPT = {"Raster_CopyBlock", "Raster_Scale"}  # their parameters are given

LITERAL_OR_COMMENT = re.compile(
    r'//[^\n]*|/\*.*?\*/|R"(?P<tag>[^(\s]*)\(.*?\)(?P=tag)"|"(?:\\.|[^"\\\n])*"|'
    r"(?<![0-9A-Za-z_])'(?:\\.|[^'\\\n])+'|^[ \t]*#(?:\\\n|[^\n])*", re.DOTALL | re.MULTILINE)
SCOPE = re.compile(r"\b(namespace|class|struct|union|enum|extern)\b")
CONTROL = re.compile(r"\b(?:else\s+if|if|for|while|do|switch|try|catch|else)\b")
BODY_FOLLOWS = re.compile(r"(?:\)|\}|\bconst|\bnoexcept|\boverride|\bfinal|\bmutable|\btry|->[^;{}()]*)\s*$")
LAMBDA = re.compile(r"\[[^\[\]]*\]\s*(?:<[^<>]*>\s*)?(?:\(.*\)\s*)?"
                    r"(?:mutable\s*|noexcept\s*|->[^;{}()]*)*$", re.DOTALL)
NAME = re.compile(r"((?:[\w~]+\s*::\s*)*(?:operator\s*(?:\(\)|\[\]|[^\s\w(]+|\w+)|~?\w+))\s*\(")
NO_NAMES = {"alignas", "decltype", "explicit", "noexcept", "requires", "sizeof", "__attribute__"}


@dataclass
class Scope:
    kind: str  # "scope" of declarations, "function", "block" or "other"
    line: int
    head: str = ""
    depth: int = 0  # of control statements in the function
    reported: list = field(default_factory=list)


def plain(text):
    """The text with comments, literals and preprocessor lines blanked; lines stay where they are."""
    def blank(match):
        return '""' * match[0].startswith(('"', "R\"")) + "\n" * match[0].count("\n")
    return LITERAL_OR_COMMENT.sub(blank, text)


def matching(text, start):
    depth = 0
    for position in range(start, len(text)):
        depth += {"(": 1, ")": -1}.get(text[position], 0)
        if depth == 0:
            return position
    return len(text)


def signature(head):
    """The name and the parameter list of a function's head, or None."""
    position = 0
    while match := NAME.search(head, position):
        name = re.sub(r"\s", "", match[1])
        end = matching(head, match.end() - 1)
        if name.rsplit("::")[-1] not in NO_NAMES:
            return name.rsplit("::")[-1], head[match.end():end]
        position = end
    return None


def parameter_count(parameters):
    depth, count = 0, 1
    for character in parameters.replace("->", ""):
        depth += {"(": 1, "[": 1, "{": 1, "<": 1, ")": -1, "]": -1, "}": -1, ">": -1}.get(character, 0)
        count += character == "," and depth == 0
    return count if parameters.strip() not in ("", "void") else 0


def open_scope(head, line, outer):
    """What a brace after `head` opens."""
    stripped = head.strip()
    in_function = outer.kind in ("function", "block")
    if LAMBDA.search(stripped) and (in_function or "=" in stripped):
        return Scope("block", line, depth=0)
    if in_function:
        controls = [word for word in CONTROL.findall(stripped)]
        if stripped and not controls and not stripped.endswith((":", ")")):
            return Scope("other", line, depth=outer.depth)
        return Scope("block", line, depth=outer.depth + len(controls))
    if outer.kind != "scope":
        return Scope("other", line)
    before_parenthesis = stripped.split("(")[0]
    if SCOPE.search(re.sub(r"^template\s*<[^()]*>", "", before_parenthesis)) and signature(stripped) is None:
        return Scope("scope", line)
    assigns = "=" in before_parenthesis and "operator" not in before_parenthesis
    if signature(stripped) and BODY_FOLLOWS.search(stripped) and not assigns:
        return Scope("function", line, stripped)
    if re.match(r"(inline\s+)?namespace\b|extern\b", stripped) or SCOPE.match(stripped):
        return Scope("scope", line)
    return Scope("other", line)


def check_function(name, scope, end):
    function, parameters = signature(scope.head)
    if function in EXEMPT:
        return
    length = end - scope.line + 1
    if length > MOST_FUNCTION_LINES:
        yield f"{name}:{scope.line}: {function} has {length} lines, more than {MOST_FUNCTION_LINES}"
    count = parameter_count(parameters)
    if count > MOST_PARAMETERS:
        yield f"{name}:{scope.line}: {function} has {count} parameters, more than {MOST_PARAMETERS}"


def check_functions(name, text):
    stack = [Scope("scope", 0)]
    head, head_line, line, parentheses = "", 1, 1, 0
    for character in plain(text):
        line += character == "\n"
        if not head.strip():
            head, head_line = "", line
        if character == "{":
            scope = open_scope(head, head_line, stack[-1])
            scope.outer = (head, head_line, parentheses)
            if scope.kind == "block" and scope.depth == MOST_NESTING + 1 > stack[-1].depth:
                yield f"{name}:{line}: nests deeper than {MOST_NESTING}"
            stack.append(scope)
            head, parentheses = "", 0
        elif character == "}" and len(stack) > 1:
            scope = stack.pop()
            if scope.kind == "function":
                yield from check_function(name, scope, line)
            head, head_line, parentheses = resumed(scope)
        elif character == ";" and parentheses == 0:
            head = ""
        else:
            parentheses += {"(": 1, ")": -1}.get(character, 0)
            head += character


def resumed(scope):
    """The statement goes on after a braced initialiser or a lambda; after a body, a new one begins."""
    head, line, parentheses = scope.outer
    if scope.kind == "other" or parentheses > 0:
        return head + "{}", line, parentheses
    return "", line, 0


def check(name, text):
    lines = text.count("\n")
    if lines > MOST_FILE_LINES:
        yield f"{name}:{MOST_FILE_LINES}: has {lines} lines, more than {MOST_FILE_LINES}"
    yield from check_functions(name, text)


def notes(name, text):
    lines = text.count("\n")
    if NOTED_FILE_LINES < lines <= MOST_FILE_LINES:
        yield f"note: {name} has {lines} lines, more than {NOTED_FILE_LINES}"
