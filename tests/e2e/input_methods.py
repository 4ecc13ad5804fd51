#!/usr/bin/env python3
"""What input methods compose of several keys is searched for: dead keys, by the toolkit itself and by IBus.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder."""

import os
import subprocess
import unittest

from desktop import Home, Program, Window, end, run, start, wait_until

AGENT = os.environ["KX_TEST_BIN"] + "/corvane-tesselStartMenu"


class InputMethods(unittest.TestCase):
    def setUp(self):
        before = dict(os.environ)
        self.addCleanup(lambda: (os.environ.clear(), os.environ.update(before)))
        self.home = Home()
        self.addCleanup(self.home.cleanup)
        os.environ.update(LC_ALL="C.UTF-8", XDG_CACHE_HOME=self.home.name + "/cache")
        self.home.write_entry("composed", "Calm")
        self.home.write(".XCompose", '<dead_acute> <x> : "c"\n')
        run("setxkbmap", "us", "-variant", "intl")  # has dead keys

    def finds_what_is_composed(self, method):
        os.environ["QT_IM_MODULE"] = method
        Program("tesselDaemon", "--record", self.home.name + "/record", "--machine", "host")
        self.addCleanup(Program.end_all)
        wait_until("the item", Window("Tessel status item").is_open)
        wait_until("an update", lambda: "menu.update sent" in self.home.read("record"))

        def is_chosen():
            """Asked for again, as a method may take its time until it listens to a new window."""
            for command in ("--hide", "--show"):
                subprocess.run([AGENT, command], check=True)
            run("xdotool", "key", "--delay", "30", "ctrl+a", "dead_acute", "x", *"alm", "Return")
            return "composed.desktop" in self.home.read("record")
        wait_until("what was composed", is_chosen)

    def test_dead_keys(self):
        self.finds_what_is_composed("compose")

    def test_ibus(self):
        self.addCleanup(end, start("ibus-daemon", "--panel=disable", "--config=disable", "--emoji-extension=disable"))
        wait_until("its engine", lambda: run("ibus", "engine", "xkb:us:intl:eng") + run("ibus", "engine") == "xkb:us:intl:eng\n")
        self.finds_what_is_composed("ibus")


if __name__ == "__main__":
    unittest.main(verbosity=2)
