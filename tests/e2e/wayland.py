#!/usr/bin/env python3
"""The agent in a Wayland session, through its X server: panel placed, typing, item in the bar, nothing black.

With KX_TEST_BIN naming the programs' folder. The compositor draws to memory, and does not run as root: as nobody then."""

import os
import re
import sys
import unittest

from desktop import Home, Picture, Window, run, start, wait_until

BIN = os.environ["KX_TEST_BIN"]
AGENT = BIN + "/corvane-tesselStartMenu"
ICON = (1266, 785)
PANEL = Window("Tessel start menu")
CONFIG = """output * bg #ff8000 solid_color
output * resolution 1280x800
bar {{
    position bottom
    height 30
    colors {{
        background #202020
    }}
}}
exec env >{0}/session
"""


class Wayland(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.home = Home()
        os.mkdir(cls.home.name + "/runtime", 0o700)
        config = cls.home.write("sway", CONFIG.format(cls.home.name))
        for name in ("DISPLAY", "WAYLAND_DISPLAY", "DBUS_SESSION_BUS_ADDRESS"):
            os.environ.pop(name, None)
        os.environ.update(XDG_RUNTIME_DIR=cls.home.name + "/runtime", WLR_BACKENDS="headless",
                          WLR_LIBINPUT_NO_DEVICES="1", WLR_RENDERER="pixman")
        cls.processes = [start("dbus-run-session", "--", "sway", "-c", config)]
        session = wait_until("the compositor", lambda: re.search("^DISPLAY=.*\n", cls.home.read("session"), re.M) and cls.home.read("session"))
        os.environ.update(line.split("=", 1) for line in session.splitlines()
                          if re.match("DISPLAY|WAYLAND_DISPLAY|DBUS_SESSION_BUS_ADDRESS|SWAYSOCK", line))
        cls.processes.append(start(BIN + "/tesselDaemon", "--record", cls.home.name + "/record",
                                   "--machine", "Sample guest"))
        wait_until("the item in the bar", cls.item)
        wait_until("an update", lambda: "menu.update sent" in cls.home.read("record"))

    @classmethod
    def tearDownClass(cls):
        run("swaymsg", "exit")  # and with it the bus
        for process in reversed(cls.processes):
            process.terminate()
            process.wait()
        cls.home.cleanup()

    @classmethod
    def item(cls):
        """The bus name of our item, when the bar has it."""
        items = run("dbus-send", "--session", "--print-reply", "--dest=org.kde.StatusNotifierWatcher",
                        "/StatusNotifierWatcher", "org.freedesktop.DBus.Properties.Get",
                        "string:org.kde.StatusNotifierWatcher", "string:RegisteredStatusNotifierItems")
        found = re.search(r'"([^"/]+)(/[^"]*)"', items)
        return found and found[1]

    @staticmethod
    def pixel(x, y):
        return Picture(["grim", "-t", "ppm", "-"]).pixel(x, y)

    def test_placed_typed_in_and_painted(self):
        self.assertIn("blur               ok     none", run(AGENT, "--doctor"))
        wait_until("the icon in the bar", lambda: self.pixel(*ICON)[2] > 100)
        run("dbus-send", "--session", "--type=method_call", "--dest=" + self.item(), "/StatusNotifierItem",
                 "org.kde.StatusNotifierItem.Activate", f"int32:{ICON[0]}", f"int32:{ICON[1]}")
        wait_until("the panel", PANEL.is_open)
        x, y, width, height = PANEL.frame()
        self.assertLessEqual(x + width, 1281)
        self.assertLess(abs(y + height - ICON[1]), 20, "above the click: X programs are not told where the bar is")
        white = wait_until("the right pane", lambda: self.pixel(x + width - 30, y + height - 40) > (250,) * 3)
        self.assertTrue(white)
        left = self.pixel(x + 60, y + height - 60)
        self.assertGreater(min(left), 60, "no black behind the left pane")
        run("wtype", "-k", "Shift_L", "-s", "200", "calcul", "-s", "200", "-k", "Return")
        wait_until("the action", lambda: "menu.onAction received" in self.home.read("record"))
        self.assertIn("Calculator", self.home.read("record").rsplit("menu.onAction received", 1)[1])
        wait_until("the panel to close", lambda: not PANEL.is_open())


if __name__ == "__main__":
    if os.geteuid() == 0:
        os.execvp("setpriv", ["setpriv", "--reuid=65534", "--regid=65534", "--clear-groups", "/usr/bin/python3",
                              *sys.argv])
    unittest.main(verbosity=2)
