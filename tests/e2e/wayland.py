#!/usr/bin/env python3
"""The agent in a Wayland session, through its X server: panel placed, typing, item in the bar, nothing black.

With KX_TEST_BIN naming the programs' folder. The compositor draws to memory, and does not run as root: as nobody then."""

import os
import re
import shutil
import subprocess
import sys
import tempfile
import unittest

from desktop import Picture, Window, run, wait_until

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
        cls.home = tempfile.mkdtemp()
        os.mkdir(cls.home + "/runtime", 0o700)
        cls.record = cls.home + "/record"
        config = cls.write("config", CONFIG.format(cls.home))
        for name in ("DISPLAY", "WAYLAND_DISPLAY", "DBUS_SESSION_BUS_ADDRESS"):
            os.environ.pop(name, None)
        os.environ.update(HOME=cls.home, XDG_RUNTIME_DIR=cls.home + "/runtime", XDG_DATA_HOME=cls.home + "/data",
                          XDG_CONFIG_HOME=cls.home + "/config-home", WLR_BACKENDS="headless",
                          WLR_LIBINPUT_NO_DEVICES="1", WLR_RENDERER="pixman")
        cls.processes = []
        cls.start("dbus-run-session", "--", "sway", "-c", config)
        session = wait_until("the compositor", lambda: re.search("^DISPLAY=.*\n", cls.read("session"), re.M) and cls.read("session"))
        os.environ.update(line.split("=", 1) for line in session.splitlines()
                          if re.match("DISPLAY|WAYLAND_DISPLAY|DBUS_SESSION_BUS_ADDRESS|SWAYSOCK", line))
        cls.start(BIN + "/tesselDaemon", "--record", cls.record, "--machine", "Sample guest")
        wait_until("the item in the bar", cls.item)
        wait_until("an update", lambda: "menu.update sent" in cls.read("record"))

    @classmethod
    def start(cls, *command):
        cls.processes.append(subprocess.Popen(command, stdout=subprocess.DEVNULL,
                                              stderr=subprocess.DEVNULL))

    @classmethod
    def tearDownClass(cls):
        for process in reversed(cls.processes):
            process.terminate()
            process.wait()
        shutil.rmtree(cls.home, ignore_errors=True)

    @classmethod
    def write(cls, name, text):
        with open(f"{cls.home}/{name}", "w", encoding="utf-8") as file:
            file.write(text)
        return file.name

    @classmethod
    def read(cls, name):
        try:
            with open(f"{cls.home}/{name}", encoding="utf-8", errors="replace") as file:
                return file.read()
        except FileNotFoundError:
            return ""

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
        wait_until("the action", lambda: "menu.onAction received" in self.read("record"))
        self.assertIn("Calculator", self.read("record").rsplit("menu.onAction received", 1)[1])
        wait_until("the panel to close", lambda: not PANEL.is_open())


if __name__ == "__main__":
    if os.geteuid() == 0:
        os.execvp("setpriv", ["setpriv", "--reuid=65534", "--regid=65534", "--clear-groups", "/usr/bin/python3",
                              *sys.argv])
    unittest.main(verbosity=2)
