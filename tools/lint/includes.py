"""Who may include whom, which headers of the system may stand where, and no conditionals for a platform."""

import re

DOCUMENT = "docs/architecture.md"
SYSTEM_FOLDERS = ("platform/linux", "server/linux", "tests", "bench", "fuzz")
QT_FREE_FOLDERS = ("lib/base", "lib/plist", "lib/raster", "lib/kxAppKit/system", "lib/ipc", "platform", "tools")

SYSTEM_HEADERS = (
    ("X11", re.compile(r"(X11|xcb|xkbcommon)/")),
    ("Wayland", re.compile(r"wayland-")),
    ("D-Bus", re.compile(r"dbus/|QtDBus|QDBus")),
    ("GLib", re.compile(r"(gio|glib|gobject|gmodule)/|(glib|glib-\w+|gmodule)\.h$")),
    ("kernel", re.compile(r"(sys|linux|asm)/")),
)
QT_HEADER = re.compile(r"Q[A-Zt]")

INCLUDE = re.compile(r'^\s*#\s*include\s*(?:"([^"]+)"|<([^>]+)>)')
GENERATED = re.compile(r"(^|/)ui_\w+\.h$|\.moc$")
PLATFORM_CONDITIONAL = re.compile(
    r"^\s*#\s*(?:if|ifdef|ifndef|elif)\b.*\b(_WIN32|_WIN64|WIN32|__APPLE__|__MACH__|linux|__linux|__linux__|unix|"
    r"__unix__|__FreeBSD__|__OpenBSD__|__NetBSD__|__ANDROID__|__CYGWIN__|__MINGW32__|Q_OS_\w+)\b")


class Rules:
    """The include table of the document, and what is held against it."""

    def __init__(self, root):
        self.root = root
        self.faults = []
        document = root / DOCUMENT
        text = document.read_text(encoding="utf-8") if document.is_file() else ""
        self.allowed = dict(read_table(text))
        self.roots = read_composition_roots(text)
        if not self.allowed:
            self.faults.append(f"{DOCUMENT}:1: has no include table")

    def row_of(self, name):
        rows = [row for row in self.allowed if name.startswith(row + "/")]
        return max(rows, key=len, default=None)

    def check(self, name, text):
        row = self.row_of(name)
        if row is None:
            if self.allowed:
                yield f"{name}:1: its folder has no row in the table of {DOCUMENT}"
            return
        if name.endswith(".h") and first_code_line(text) != "#pragma once":
            yield f"{name}:1: does not begin with #pragma once"
        for number, line in enumerate(text.splitlines(), 1):
            fault = self.check_line(name, row, line)
            if fault:
                yield f"{name}:{number}: {fault}"

    def check_line(self, name, row, line):
        conditional = PLATFORM_CONDITIONAL.match(line)
        if conditional and row != "platform/linux":
            return f"a conditional for {conditional[1]}: platforms differ by file"
        include = INCLUDE.match(line)
        if not include:
            return None
        own, system = include.groups()
        if own is not None:
            return self.check_own(name, row, own)
        return check_system(row, system) if name not in self.roots else None

    def check_own(self, name, row, header):
        if GENERATED.search(header):
            return None
        if not (self.root / header).is_file():
            return f'"{header}" is no path from the root'
        other = self.row_of(header)
        if other is None:
            return f'"{header}" lies in a folder without a row in the table of {DOCUMENT}'
        allowed = self.allowed[row]
        if other == row or allowed is None or other in allowed:
            return None
        if name in self.roots and other in ("platform/linux", f"{row}/linux"):
            return None
        return f"{row} may not include {other}"


def read_table(text):
    """Pairs of a folder and those it may include; None stands for all."""
    in_table = False
    for line in text.splitlines():
        cells = [cell.strip() for cell in line.strip().strip("|").split("|")]
        if cells[:2] == ["Folder", "May include"]:
            in_table = True
        elif not line.startswith("|"):
            in_table = False
        elif in_table and cells[0].startswith("`"):
            others = cells[1] if len(cells) > 1 else ""
            yield cells[0].strip("`"), None if others == "everything" else set(re.findall(r"`([^`]+)`", others))


def read_composition_roots(text):
    """The files of the sentence on what a program's `main` is."""
    sentence = re.search(r"A program's `main` \(([^)]*)\)", text)
    return set(re.findall(r"`([^`]+)`", sentence[1])) if sentence else set()


def check_system(row, header):
    for kind, pattern in SYSTEM_HEADERS:
        if row not in SYSTEM_FOLDERS and pattern.match(header):
            return f"<{header}> is a {kind} header, which only {SYSTEM_FOLDERS[0]} and {SYSTEM_FOLDERS[1]} include"
    if row in QT_FREE_FOLDERS and QT_HEADER.match(header):
        return f"<{header}>: {row} does without Qt"
    return None


def first_code_line(text):
    for line in text.splitlines():
        if line.strip() and not line.lstrip().startswith("//"):
            return line.strip()
    return ""
