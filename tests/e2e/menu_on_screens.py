#!/usr/bin/env python3
"""The menu on other screens: two monitors of different scale, everything twice as large, and from right to left.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder."""

import os
import unittest

from desktop import Home, Program, Window, click, press, run, type_text, wait_until

STATUS_ITEM = Window("Tessel status item")
PANEL = Window("Tessel start menu")
LEFT_PANE = 170
FIRST_RESULT = 104  # its height in the panel


def split_screen(left, right):
    """The strip stands on the primary monitor, the one whose name begins with a star."""
    for name, width, x in ((left, 700, 0), (right, 580, 700)):
        run("xrandr", "--delmonitor", name.strip("*"))
        run("xrandr", "--setmonitor", name, f"{width}/200x800/200+{x}+0", "screen" if x == 0 else "none")


class MenuOnScreens(unittest.TestCase):
    def start(self, **environment):
        before = dict(os.environ)
        self.home = Home()
        self.addCleanup(self.home.cleanup)
        for number in range(40):
            self.home.write_entry(f"program{number:02}", f"Program {number:02}")
        os.environ.update(environment)
        self.addCleanup(lambda: (os.environ.clear(), os.environ.update(before)))
        Program("tesselDaemon", "--record", self.home.name + "/record", "--machine", "host")
        self.addCleanup(Program.end_all)
        wait_until("the status item", STATUS_ITEM.is_open)
        wait_until("an update", lambda: "menu.update sent" in self.recorded())

    def recorded(self):
        return self.home.read("record")

    def open_menu(self):
        x, y, width, height = STATUS_ITEM.frame()
        click(x + width // 2, y + height // 2)
        wait_until("the panel", PANEL.is_open)
        return PANEL.frame()

    def choose_first_result(self, x, y):
        before = self.recorded()
        press("ctrl+a")  # the last search is kept for a while
        type_text("program 1")
        press("Down")
        click(x, y)
        wait_until("the action", lambda: "menu.onAction received" in self.recorded().removeprefix(before))
        self.assertIn("program10", self.recorded().removeprefix(before))
        wait_until("the panel to close", lambda: not PANEL.is_open())

    def test_everything_twice_as_large(self):
        self.start(QT_SCALE_FACTOR="2")
        x, y, width, height = self.open_menu()
        self.assertEqual((width, x + width), (960, 1282), "one point past the right edge")
        self.assertLessEqual(y + height, 800)
        self.choose_first_result(x + 2 * (LEFT_PANE + 60), y + 2 * FIRST_RESULT)

    def test_two_monitors_of_different_scale(self):
        split_screen("*left", "right")
        self.addCleanup(lambda: [run("xrandr", "--delmonitor", name) for name in ("left", "right")])
        self.start(QT_SCREEN_SCALE_FACTORS="left=1;right=1.25")
        x, y, width, _ = self.open_menu()
        self.assertEqual((width, x + width), (480, 701), "on the monitor of the click")
        self.choose_first_result(x + LEFT_PANE + 60, y + FIRST_RESULT)

        split_screen("left", "*right")
        wait_until("the item on the other monitor", lambda: STATUS_ITEM.frame()[0] > 700)
        x, y, width, _ = self.open_menu()
        self.assertEqual(width, 600)
        self.assertGreaterEqual(x, 680)
        self.choose_first_result(x + (LEFT_PANE + 60) * 5 // 4, y + FIRST_RESULT * 5 // 4)

    def test_from_right_to_left(self):
        self.start(LANGUAGE="ar", LANG="ar_EG.UTF-8")
        x, y, width, _ = self.open_menu()
        self.assertEqual(x, STATUS_ITEM.frame()[0] - 1, "one point past the item's left edge")
        self.choose_first_result(x + width - LEFT_PANE - 60, y + FIRST_RESULT)


if __name__ == "__main__":
    unittest.main(verbosity=2)
