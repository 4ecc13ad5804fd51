#!/usr/bin/env python3
"""The whole path: daemon, agent, a real X server with a window manager, real clicks and keys.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder. Opens the menu of the sample guest,
finds an application by typing, chooses it, kills the daemon and sees the menu work again by itself."""

import os
import re
import subprocess
import sys
import unittest

from desktop import Home, Picture, Program, Window, click, point, press, run, type_text, wait_until

STATUS_ITEM = Window("Tessel status item")
PANEL = Window("Tessel start menu")
LEFT_PANE = 170  # points: to the right of it stand the applications
LIST_TOP = 84  # and below this the list, under "All Programs" or "Back"


class FirstLight(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.home = Home()
        cls.record = os.path.join(cls.home.name, "record")
        cls.start_daemon()
        wait_until("the status item", STATUS_ITEM.is_open)
        cls.wait_for_update()

    @classmethod
    def tearDownClass(cls):
        Program.end_all()
        if cls.log_of("corvane-tesselStartMenu"):
            sys.stderr.write("The agent's log:\n" + cls.log_of("corvane-tesselStartMenu"))
        cls.home.cleanup()

    @classmethod
    def start_daemon(cls):
        cls.daemon = Program("tesselDaemon", "--record", cls.record, "--machine", "Sample guest")

    @classmethod
    def log_of(cls, program):
        return cls.home.read(f"Library/Logs/Corvane Tessel/{program}.log")

    @classmethod
    def recorded(cls, start):
        return [line for line in cls.home.read("record").splitlines() if line.startswith(start)]

    @classmethod
    def wait_for_update(cls, more_than=0):
        """An update has gone out that holds the sample guest's applications."""
        wait_until("an update", lambda: len(cls.recorded("menu.update sent")) > more_than)

    def tearDown(self):
        while PANEL.is_open():
            press("Escape")

    def open_menu(self):
        x, y, width, height = STATUS_ITEM.frame()
        click(x + width // 2, y + height // 2)
        wait_until("the panel", PANEL.is_open)

    def agents(self):
        """The ports of this session's clients, named by their processes."""
        ports = run(os.environ["KX_TEST_BIN"] + "/kxipc", "ports").split()
        return [port for port in ports if re.match(r"com\.corvane\.kxipc\.[0-9]+\.[0-9]+$", port)]

    def rows(self):
        """The titles in the right pane's list, as stretches of the screen that are not white: (top, bottom)."""
        x, y, _, height = PANEL.frame()
        runs = Picture().inked_runs(x + LEFT_PANE + 40, 60, y + LIST_TOP, y + height - 12)
        return [(top, bottom) for top, bottom in runs if bottom - top > 4]  # separators are two points high

    def test_1_opens_with_the_rows_of_the_guest(self):
        self.open_menu()
        item, panel = STATUS_ITEM.frame(), PANEL.frame()
        self.assertEqual(panel[0] + panel[2], item[0] + item[2] + 1, "one point past the item's right edge")
        self.assertEqual(panel[1], item[1] + item[3], "right below the item")
        wait_until("a refresh", lambda: self.recorded("menu.refresh received"))
        wait_until("several rows", lambda: len(self.rows()) >= 5)

        # The row under the pointer turns blue.
        top, bottom = self.rows()[1]
        x, y = panel[0] + LEFT_PANE + 100, (top + bottom) // 2
        before = Picture().pixel(panel[0] + panel[2] - 40, y)
        point(x, y)
        wait_until("the highlight", lambda: Picture().pixel(panel[0] + panel[2] - 40, y) != before)
        red, _, blue = Picture().pixel(panel[0] + panel[2] - 40, y)
        self.assertGreater(blue, red + 60)

        press("Escape")
        wait_until("the panel to close", lambda: not PANEL.is_open())

    def test_2_chooses_what_was_typed_for(self):
        self.open_menu()
        type_text("calcul")
        wait_until("one result", lambda: len(self.rows()) == 1)
        x, y, _, _ = PANEL.frame()
        top, bottom = self.rows()[0]
        click(x + LEFT_PANE + 100, (top + bottom) // 2)
        wait_until("the action", lambda: self.recorded("menu.onAction received"))
        self.assertIn("Calculator", self.recorded("menu.onAction received")[-1])
        wait_until("the panel to close", lambda: not PANEL.is_open())

    def test_3_works_again_after_the_daemon_was_killed(self):
        agents = self.agents()
        updates = len(self.recorded("menu.update sent"))
        self.daemon.kill()
        self.start_daemon()
        self.wait_for_update(updates)
        self.open_menu()
        press("Escape")  # the last search is kept for a while; this leaves it
        wait_until("rows", lambda: len(self.rows()) >= 5)
        self.assertEqual((len(agents), self.agents()), (1, agents), "the same agent, and no second one")
        actions = len(self.recorded("menu.onAction received"))
        type_text("mail")
        press("Return")
        wait_until("the action", lambda: len(self.recorded("menu.onAction received")) > actions)

    def test_4_a_second_daemon_gives_up_and_leaves_the_log(self):
        before = self.log_of("tesselDaemon")
        second = subprocess.run([os.environ["KX_TEST_BIN"] + "/tesselDaemon"], capture_output=True, text=True,
                                check=False, timeout=60)
        self.assertEqual((second.returncode, second.stderr), (1, "tesselDaemon: another daemon serves already\n"))
        self.assertTrue(self.log_of("tesselDaemon").startswith(before))


if __name__ == "__main__":
    unittest.main(verbosity=2)
