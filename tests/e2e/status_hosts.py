#!/usr/bin/env python3
"""The status item in real hosts: two trays and a bar on the bus that is also a bridge from the one to the other.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder. In each host the item is looked at and
clicked, and the host is killed and started again while the menu is open."""

import os
import re
import time
import unittest

from desktop import Home, Picture, Program, Window, click, end, press, run, start, type_text, wait_until

ITEM = Window("Tessel status item")
PANEL = Window("Tessel start menu")
STRIP = (1250, 0, 30, 22)
SCREEN = (1280, 800)

TINT2 = """panel_items = SC
panel_position = bottom center horizontal
panel_size = 100% 30
panel_background_id = 0
"""
LXQT = """panels=panel1
[panel1]
plugins=statusnotifier,tray
position=Bottom
[statusnotifier]
alignment=Right
type=statusnotifier
[tray]
type=tray
"""


def trayer(edge, align):
    return ["trayer", "--edge", edge, "--align", align, "--widthtype", "request", "--height", "40",
            "--SetDockType", "true", "--SetPartialStrut", "true"]


def item_is_in_strip():
    return ITEM.frame() == STRIP


def item_is_in_tray():
    frame = ITEM.frame()
    return frame if frame and frame != STRIP else None


def is_selected(frame):
    """The highlight fills the item up to its corners."""
    red, _, blue = Picture().pixel(frame[0] + 2, frame[1] + 2)
    return blue > red + 110  # the background is a little blue, too


def inked(x, y, width, height):
    """Whether something stands out in that piece of the screen."""
    picture = Picture()
    return any(picture.pixel(i, j) != picture.pixel(x, y) for i in range(x, x + width) for j in range(y, y + height))


class StatusHosts(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.home = Home()
        cls.home.write("config/lxqt/panel.conf", LXQT)
        cls.tint2rc = cls.home.write("tint2rc", TINT2)
        Program("tesselDaemon", "--record", cls.home.name + "/record", "--machine", "Sample guest")
        wait_until("the strip", item_is_in_strip)
        wait_until("an update", lambda: "menu.update sent" in cls.home.read("record"))

    @classmethod
    def tearDownClass(cls):
        Program.end_all()
        cls.home.cleanup()

    def start(self, *command, output=os.devnull):
        process = start(*command, output=output)
        self.addCleanup(end, process)
        return process

    @staticmethod
    def close_panel():
        while PANEL.is_open():
            press("Escape")  # the first may only leave a search
            time.sleep(0.1)

    def tearDown(self):
        self.close_panel()

    def open_at(self, x, y, button=1):
        click(x, y, button)
        wait_until("the panel", PANEL.is_open)

    def opens_by_any_button_and_types(self, x, y, buttons):
        for button in buttons:
            self.open_at(x, y, button)
            click(x, y, button)
            wait_until("the panel to close at the second click", lambda: not PANEL.is_open())
        actions = self.home.read("record").count("menu.onAction received")
        self.open_at(x, y)
        press("ctrl+a")  # the last search may still be there
        type_text("calcul")
        press("Return")
        wait_until("the action", lambda: self.home.read("record").count("menu.onAction received") > actions)
        self.assertIn("Calculator", self.home.read("record").rsplit("menu.onAction received", 1)[1])
        wait_until("the panel to close", lambda: not PANEL.is_open())

    def moves_to_strip_and_back(self, command, host, is_back):
        """With the panel open. A window manager may take the keyboard when the bar dies, which closes the panel."""
        end(host)
        wait_until("the item in the strip", item_is_in_strip)
        wait_until("the item selected if the panel is open", lambda: is_selected(STRIP) == PANEL.is_open())
        host = self.start(*command)
        wait_until("the item in its host again", is_back)
        return host

    def lives_in_tray(self, command):
        host = self.start(*command)
        x, y, width, height = wait_until("the item in the tray", item_is_in_tray)
        wait_until("the icon", lambda: inked(x, y, width, height))
        self.assertFalse(is_selected((x, y)))
        self.opens_by_any_button_and_types(x + 5, y + height // 2, (1, 3))
        self.open_at(x + 5, y + height // 2)
        wait_until("the highlight", lambda: is_selected((x, y)))
        panel = PANEL.frame()
        host = self.moves_to_strip_and_back(command, host, item_is_in_tray)
        wait_until("the highlight in the new tray, too", lambda: is_selected(item_is_in_tray()) == PANEL.is_open())
        self.close_panel()
        wait_until("the highlight to go", lambda: not is_selected(item_is_in_tray()))
        end(host)
        wait_until("the strip", item_is_in_strip)
        return (x, y, width, height), panel

    def test_tray_at_the_top(self):
        item, panel = self.lives_in_tray(trayer("top", "right"))
        self.assertEqual(panel[0] + panel[2], item[0] + item[2] + 1, "one point past the item's right edge")
        self.assertEqual(panel[1], item[1] + item[3], "right below the item")

    def test_tray_at_the_bottom(self):
        item, panel = self.lives_in_tray(["tint2", "-c", self.tint2rc])
        self.assertEqual(panel[0], item[0] - 1, "in the left corner it is mirrored: one point past the left edge")
        self.assertEqual(panel[1] + panel[3], item[1], "right above the item")

    def test_tray_at_the_left(self):
        self.start(*trayer("left", "center"))
        x, y, _, height = wait_until("the item in the tray", item_is_in_tray)
        wait_until("room for the tray", lambda: " 40, 0, 1240, 800" in run("xprop", "-root", "_NET_WORKAREA"))
        self.open_at(x + 5, y + 5)
        left, top, _, panel_height = PANEL.frame()
        self.assertEqual(left, 40, "beside the tray")
        self.assertLessEqual(top + panel_height, SCREEN[1])
        self.assertLessEqual(top, y + height)

    def test_bar_on_the_bus(self):
        self.start("dbus-monitor", "--session", output=self.home.name + "/bus")
        wait_until("the monitor", lambda: self.home.read("bus"))
        host = self.start("lxqt-panel")

        def is_there():
            return not ITEM.frame() and inked(1258, 774, 20, 20)
        wait_until("the icon in the bar", is_there)
        bus = ("dbus-send", "--session", "--print-reply")
        name, = re.findall(r'"(org\.kde\.StatusNotifierItem-.*)"', run(*bus, "--dest=org.freedesktop.DBus", "/",
                                                                      "org.freedesktop.DBus.ListNames"))
        item = run(*bus, "--dest=" + name, "/StatusNotifierItem", "org.freedesktop.DBus.Properties.GetAll",
                   "string:org.kde.StatusNotifierItem")
        self.assertEqual(item.count('"Start menu"'), 2, "title and tooltip")
        self.assertGreater(len(re.findall(r"int32 (\d+)\n +int32 \1\n", item)), 3, "sizes of the icon")
        x, y = 1268, 784
        self.opens_by_any_button_and_types(x, y, (1, 2, 3))
        for member in ("Activate", "SecondaryActivate", "ContextMenu"):
            self.assertRegex(self.home.read("bus"), rf"member={member}\n +int32 {x}\n +int32 {y}\n")
        self.assertEqual(len(re.findall("member=RegisterStatusNotifierItem", self.home.read("bus"))), 1)
        icons = self.home.read("bus").count("member=NewIcon")
        self.open_at(x, y)
        wait_until("the selected icon", lambda: self.home.read("bus").count("member=NewIcon") > icons)
        _, top, _, height = PANEL.frame()
        self.assertEqual(top + height, SCREEN[1] - 32, "right above the bar")
        host = self.moves_to_strip_and_back(["lxqt-panel"], host, is_there)
        self.close_panel()
        self.opens_by_any_button_and_types(x, y, (1,))
        end(host)
        wait_until("the strip", item_is_in_strip)


if __name__ == "__main__":
    unittest.main(verbosity=2)
