#!/usr/bin/env python3
"""Runs the lint on small trees with known faults."""

import re
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

LINT = Path(__file__).resolve().parents[2] / "tools/lint/lint"
DOCUMENT = """
| Folder | May include |
|---|---|
| `lib/base` | |
| `lib/base/inner` | `lib/base` |
| `platform` | `lib/base` |
| `platform/linux` | `platform`, `lib/base` |
| `app` | `platform`, `lib/base` |
| `tests` | everything |

A program's `main` (`app/main.cpp`, `x/main.cpp`) is its composition root.
"""
GOOD = {
    "docs/architecture.md": DOCUMENT,
    "lib/base/Log.h": "/// Text.\n#pragma once\n",
    "lib/base/inner/In.h": '#pragma once\n#include "lib/base/Log.h"\n',
    "platform/linux/Poll.h": '#pragma once\n#include "platform/Clock.h"\n#include <sys/stat.h>\n#ifdef __linux__\n#endif\n',
    "platform/Clock.h": '#pragma once\n#include "lib/base/Log.h"\n',
    "app/main.cpp": '#include "app/ui_menu.h"\n#include "platform/linux/Poll.h"\n#include <QWidget>\n',
    "tests/TestLog.cpp": '#include "platform/linux/Poll.h"\n#include <sys/wait.h>\n',
}


def function(head, lines=3, body="    use();\n"):
    return f"{head} {{\n{body * (lines - 2)}}}\n"


class LintTest(unittest.TestCase):
    def lint(self, files, *arguments):
        """The exit status, the output and its faults as (file, line, message)."""
        with tempfile.TemporaryDirectory() as root:
            for name, text in {**GOOD, **files}.items():
                path = Path(root) / name
                path.parent.mkdir(parents=True, exist_ok=True)
                path.write_text(text, encoding="utf-8")
            run = subprocess.run([sys.executable, LINT, "--root", root, *arguments], capture_output=True, text=True)
        self.assertEqual(run.stderr, "")
        faults = [(name, int(line), message) for name, line, message in
                  re.findall(r"^([^\s:]+):(\d+):(?:\d+:)? (.*)$", run.stdout, re.MULTILINE)]
        self.assertEqual(run.returncode, 1 if faults else 0, run.stdout)
        return run.stdout, faults

    def assert_faults(self, name, text, *expected):
        """Expected are a line and a word of the message each, for a file of these contents alone."""
        _, faults = self.lint({name: text}, "--sources-only")
        self.assertEqual([(name, line) for line, _ in expected], [fault[:2] for fault in faults], (text, faults))
        for (_, word), fault in zip(expected, faults):
            self.assertIn(word, fault[2])

    def test_a_clean_tree_passes(self):
        output, faults = self.lint({"tools/run": "#!/bin/sh\n# why\nrun\n"})
        self.assertEqual(faults, [])
        self.assertRegex(output, r"all code +13\n")
        self.assertRegex(output, r"scripts +1\n")
        self.assertRegex(output, r"tests for a line of code 0\.15\n")

    def test_includes(self):
        self.assert_faults("lib/base/a.cpp", '#include "platform/Clock.h"\n# include "lib/base/inner/In.h"\n',
                           (1, "lib/base may not include platform"), (2, "may not include lib/base/inner"))
        self.assert_faults("app/a.cpp", '#include "Log.h"\n#include "platform/linux/Poll.h"\n',
                           (1, "no path from the root"), (2, "may not include platform/linux"))
        self.assert_faults("app/a.cpp", "#include <X11/Xlib.h>\n#include <QDBusMessage>\n#include <gio/gio.h>\n"
                           "#include <sys/stat.h>\n#include <wayland-client.h>\n", (1, "X11"), (2, "D-Bus"),
                           (3, "GLib"), (4, "kernel"), (5, "Wayland"))
        self.assert_faults("platform/a.cpp", "#include <QtCore/QObject>\n#include <Quick.h>\n", (1, "without Qt"))
        self.assert_faults("tools/a.cpp", "", (1, "no row"))
        self.assert_faults("app/a.h", "#ifndef A\n#endif\n", (1, "#pragma once"))
        self.assert_faults("app/a.cpp", "#if defined(__APPLE__)\n#endif\n#if DEBUG\n#endif\n", (1, "__APPLE__"))

    def test_a_missing_table_is_a_fault(self):
        self.assertIn(("docs/architecture.md", 1, "has no include table"), self.lint({"docs/architecture.md": ""})[1])

    def test_long_files_and_functions(self):
        self.assert_faults("app/a.cpp", "//\n" * 501, (500, "501 lines"))
        self.assertIn("note: app/a.cpp has 301 lines", self.lint({"app/a.cpp": "//\n" * 301})[0])
        head = "\nnamespace a {\nA::A(int b)\n    : m_b{b}\n    , m_c(b)"
        self.assert_faults("app/a.cpp", function(head, 60 - 2) + "}\n")
        self.assert_faults("app/a.cpp", function(head, 61 - 2) + "}\n", (3, "A has 61 lines"))
        self.assert_faults("app/a.cpp", function("struct A {\nauto operator()() const -> int", 61), (2, "operator()"))

    def test_parameters(self):
        six = "std::map<int, int> a, int b = f(1, 2), int c, int d, int e, std::function<void(int, int)> g"
        self.assert_faults("app/a.cpp", function(f"template <class T, class U>\nvoid A::f({six})"))
        self.assert_faults("app/a.cpp", function(f"[[nodiscard]] void A::f({six}, int h) noexcept"), (1, "7 parameters"))
        self.assert_faults("app/a.cpp", function(f"bool Raster_Scale({six}, int h)"))

    def test_nesting(self):
        def nested(*heads):
            return function("void f()", 3, " {\n".join(heads) + " {\n" + "}\n" * len(heads))
        self.assert_faults("app/a.cpp", nested("if (a)", "for (;;)", "switch (b)"))
        self.assert_faults("app/a.cpp", nested("if (a)", "for (;;)", "switch (b)", "case '{':\nwhile (c)"), (6, "nests"))
        self.assert_faults("app/a.cpp", nested("for (;;)\nfor (;;)\nif (a)", "do"), (5, "nests"))
        self.assert_faults("app/a.cpp", nested("if (a)", "if (b)", "run([&](int x)", "if (c)", "if (d)"))
        self.assert_faults("app/a.cpp", nested('log("{{");\nif (a)', "} else if (b)", "} else", "} if (c)", "if (d)")
                           .replace("}\n}\n}\n", "}\n"))

    def test_other_programs(self):
        self.assertEqual([fault[1] for fault in self.lint({"app/a.cpp": "int  a;\n// teh\n"})[1]], [1, 2])


if __name__ == "__main__":
    unittest.main()
