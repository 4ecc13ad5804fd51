#!/usr/bin/env python3
"""The open menu under real hands: the keyboard alone, wheel and Alt, clicks during a slide, another window.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder."""

import os
import re
import subprocess
import unittest

from desktop import Home, Picture, Program, Window, click, point, press, run, type_text, wait_until
from peer import Peer, process_number

STATUS_ITEM = Window("Tessel status item")
PANEL = Window("Tessel start menu")
LEFT_PANE = 170
ACTION_BUTTON = 62  # its height in the panel: "All Programs" or "Back"


class MenuByHand(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.home = Home()
        for title in [f"Program {i:02}" for i in range(40)] + ["Calculator"]:
            cls.home.write_entry(title.replace(" ", ""), title)
        daemon = Program("tesselDaemon", "--record", cls.home.name + "/record", "--machine", "host")
        wait_until("the status item", STATUS_ITEM.is_open)
        cls.wait_for("^menu.update sent")
        cls.peer = Peer(os.path.join(os.environ["XDG_RUNTIME_DIR"], "com.corvane.kxipc"))
        agent, = run("pgrep", "--parent", str(daemon.process.pid), "corvane-tessel").split()
        cls.agent_port = Peer.port_of(process_number(int(agent)))

    @classmethod
    def tearDownClass(cls):
        cls.peer.close()
        Program.end_all()
        cls.home.cleanup()

    @classmethod
    def recorded(cls):
        return cls.home.read("record")

    @classmethod
    def wait_for(cls, pattern, after=""):
        """Until the record holds such lines behind what it held before."""
        return wait_until(pattern, lambda: re.search(pattern, cls.recorded().removeprefix(after), re.S | re.M))

    def setUp(self):
        """Opens the panel, and waits until it shows the update that it asked for: that begins the walk anew."""
        before = self.recorded()
        x, y, width, height = STATUS_ITEM.frame()
        click(x + width // 2, y + height // 2)
        wait_until("the panel", PANEL.is_open)
        point(5, 790)  # no row under the pointer
        self.wait_for("^menu.refresh received.*^menu.update sent", before)
        handled = self.peer.send(self.agent_port, "are you there", synchronous=True)
        self.assertTrue(handled, "and with it all that came before")

    def tearDown(self):
        while PANEL.is_open():
            press("Escape")

    def right_pane(self):
        x, y, width, height = PANEL.frame()
        picture = Picture()
        lines = range(y + ACTION_BUTTON + 24, y + height - 12)
        return [picture.pixels[3 * (line * picture.width + x + LEFT_PANE + 10):
                               3 * (line * picture.width + x + width - 15)] for line in lines]

    def changes(self, what, action):
        before = self.right_pane()
        action()
        wait_until(what, lambda: self.right_pane() != before)

    def search(self, text):
        self.changes("results", lambda: type_text(text))

    def chosen(self, action):
        before = self.recorded()
        action()
        wait_until("the panel to close", lambda: not PANEL.is_open())
        # A launch changes what is used frequently, which is an update by itself.
        return self.wait_for("^menu.onAction received ([^\n]*).*^launchApplication: performed.*^menu.update sent", before)[1]

    def test_keys_and_clicks_during_a_slide_are_not_lost(self):
        x, y, _, _ = PANEL.frame()
        for _ in range(5):  # opens, and at once back, and types while that still slides
            run("xdotool", "mousemove", str(x + LEFT_PANE + 60), str(y + ACTION_BUTTON), "click", "1",
                "mousemove", str(x + LEFT_PANE + 60), str(y + ACTION_BUTTON), "click", "1",
                "type", "--delay", "1", "calculator")
            self.assertIn("Calculator", self.chosen(lambda: press("Return")))
            self.setUp()
            press("Escape")  # the search

    def test_the_keyboard_alone_reaches_rows_out_of_view(self):
        self.search("program")
        run("xdotool", "key", "--repeat", "30", "--delay", "5", "Down")
        self.assertIn("Program30", self.chosen(lambda: press("Return")))
        self.setUp()
        run("xdotool", "key", "--repeat", "29", "--delay", "5", "Down", "key", "--repeat", "3", "Up")
        self.assertIn("Program26", self.chosen(lambda: press("Return")), "the search survives a short closing")
        self.setUp()
        press("Escape")

    def test_the_wheel_scrolls_the_applications_from_either_pane(self):
        x, y, _, _ = PANEL.frame()
        first_row = y + ACTION_BUTTON + 54  # below the arrow
        for place, wheel, program in ((80, "5", "03"), (LEFT_PANE + 60, "5", "03"), (80, "55554", "07")):
            self.search("program")
            point(x + place, y + 300)
            run("xdotool", *(word for button in wheel for word in ("click", button)))
            self.assertIn("Program" + program, self.chosen(lambda: click(x + LEFT_PANE + 60, first_row)))
            self.setUp()
            press("Escape")

    def test_alt_shows_alternates_while_it_is_held(self):
        item = {"title": "Plain", "altMenuItem": {"title": "Something else"}}
        self.changes("the item", lambda: self.peer.send(self.agent_port, "menu.update", {"menu": {"pinnedApps": [item]}}))
        plain = self.right_pane()
        try:
            self.changes("the alternate", lambda: run("xdotool", "keydown", "Alt_L"))
        finally:
            run("xdotool", "keyup", "Alt_L")
        wait_until("the item again", lambda: self.right_pane() == plain)

    def test_another_window_takes_the_keyboard_and_closes_it(self):
        other = subprocess.Popen(["xmessage", "-geometry", "200x100+100+600", "another window"])
        try:
            wait_until("the panel to close", lambda: not PANEL.is_open())
        finally:
            other.kill()
            other.wait()

    def test_a_click_outside_closes_it(self):
        click(200, 700)
        wait_until("the panel to close", lambda: not PANEL.is_open())


if __name__ == "__main__":
    unittest.main(verbosity=2)
