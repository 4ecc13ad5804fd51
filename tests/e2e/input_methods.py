#!/usr/bin/env python3
"""What input methods compose of several keys is searched for: dead keys, by the toolkit itself and by IBus.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder."""

import os
import shutil
import subprocess
import tempfile
import unittest

from desktop import Program, Window, run, wait_until

AGENT = os.environ["KX_TEST_BIN"] + "/corvane-tesselStartMenu"


class InputMethods(unittest.TestCase):
    def setUp(self):
        home = tempfile.mkdtemp()
        self.addCleanup(shutil.rmtree, home, ignore_errors=True)
        self.record = home + "/record"
        before = dict(os.environ)
        self.addCleanup(lambda: (os.environ.clear(), os.environ.update(before)))
        os.environ.update(HOME=home, LC_ALL="C.UTF-8", XDG_DATA_HOME=home + "/data", XDG_CONFIG_HOME=home + "/config",
                          XDG_CACHE_HOME=home + "/cache")
        os.makedirs(home + "/data/applications")
        for name, text in (("data/applications/composed.desktop", "[Desktop Entry]\nType=Application\nName=Calm\nExec=true\n"),
                           (".XCompose", '<dead_acute> <x> : "c"\n')):
            with open(f"{home}/{name}", "w", encoding="utf-8") as file:
                file.write(text)
        run("setxkbmap", "us", "-variant", "intl")  # has dead keys

    def start(self, *command):
        process = subprocess.Popen(command, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        self.addCleanup(process.wait)
        self.addCleanup(process.kill)

    def recorded(self):
        try:
            with open(self.record, encoding="utf-8") as file:
                return file.read()
        except FileNotFoundError:
            return ""

    def finds_what_is_composed(self, method):
        os.environ["QT_IM_MODULE"] = method
        Program("tesselDaemon", "--record", self.record, "--machine", "host")
        self.addCleanup(Program.end_all)
        wait_until("the item", Window("Tessel status item").is_open)
        wait_until("an update", lambda: "menu.update sent" in self.recorded())

        def is_chosen():
            """Asked for again, as a method may take its time until it listens to a new window."""
            for command in ("--hide", "--show"):
                subprocess.run([AGENT, command], check=True)
            run("xdotool", "key", "--delay", "30", "ctrl+a", "dead_acute", "x", *"alm", "Return")
            return "composed.desktop" in self.recorded()
        wait_until("what was composed", is_chosen)

    def test_dead_keys(self):
        self.finds_what_is_composed("compose")

    def test_ibus(self):
        self.start("ibus-daemon", "--panel=disable", "--config=disable", "--emoji-extension=disable")
        wait_until("its engine", lambda: run("ibus", "engine", "xkb:us:intl:eng") + run("ibus", "engine") == "xkb:us:intl:eng\n")
        self.finds_what_is_composed("ibus")


if __name__ == "__main__":
    unittest.main(verbosity=2)
