#!/usr/bin/env python3
"""The panel under a window manager: where it stands, who has the keyboard, what closes it, what lies behind it.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder. The arguments are the command of a
compositor."""

import os
import re
import signal
import subprocess
import sys
import threading
import unittest

from desktop import Home, Picture, Program, Window, click, end, press, run, start, wait_until

ITEM = Window("Tessel status item")
PANEL = Window("Tessel start menu")
AGENT = os.environ["KX_TEST_BIN"] + "/corvane-tesselStartMenu"
MANAGER = os.environ.get("KX_WINDOW_MANAGER", "openbox").split()[0]
BLURS = MANAGER == "kwin_x11" and os.environ.get("KWIN_COMPOSE") != "N"
BLUR = "_KDE_NET_WM_BLUR_BEHIND_REGION"
LOAD_BLUR = ("dbus-send", "--session", "--print-reply", "--dest=org.kde.KWin", "/Effects",
             "org.kde.kwin.Effects.loadEffect", "string:blur")
LETTERS = "calculator"
OTHERS = {"one": (60, 430), "two": (400, 430)}  # windows, and where
STRIP_AT_LEFT = (610, 0, 30, 22)  # on a screen cut in two halves
TINT2 = """panel_items = C
panel_position = top right horizontal
panel_size = 700 120
panel_layer = top
rounded = 0
background_color = #ff0000 100
panel_background_id = 1
"""


def words_of_root(key):
    return [int(word.strip(","), 16) for word in run("xprop", "-root", key).split() if word.startswith("0x")]


class Panel(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.home = Home()
        cls.home.write_entry("calculator", "Calculator")
        cls.home.write_entry("opener", "Opener", f"sh -c \"{' '.join(cls.watcher('opened', (740, 430)))} >{cls.home.name}/opened\"")
        cls.processes = [start(*sys.argv[1:])] if sys.argv[1:] else []
        if BLURS:  # not by itself where the processor draws
            wait_until("blur", lambda: run(*LOAD_BLUR) and BLUR in run("xprop", "-root"))
        Program("tesselDaemon", "--record", cls.home.name + "/record", "--machine", "host")
        wait_until("the item", ITEM.is_open)
        wait_until("an update", lambda: "menu.update sent" in cls.home.read("record"))
        for name, place in OTHERS.items():
            cls.processes.append(start(*cls.watcher(name, place), output=cls.home.name + "/" + name))
            wait_until("another window", Window(name).is_open)

    @staticmethod
    def watcher(name, place):
        """The command of a window that tells which keys it gets."""
        return ["xev", "-name", name, "-geometry", "300x200+{}+{}".format(*place), "-event", "keyboard"]

    @classmethod
    def tearDownClass(cls):
        Program.end_all()
        for process in reversed(cls.processes):
            end(process)
        cls.home.cleanup()

    def setUp(self):
        self.activate("one")

    def start(self, *command):
        self.addCleanup(end, start(*command))

    def tearDown(self):
        subprocess.run([AGENT, "--hide"], check=True)

    @classmethod
    def typed(cls, name):
        return "".join(re.findall(r"KeyPress[^K]*?keysym 0x[0-9a-f]+, (\w)\)", cls.home.read(name)))

    def gets_keys(self, name):
        """Whether what is typed goes to that window."""
        before = self.typed(name)
        press("z")
        try:
            return wait_until("a key", lambda: len(self.typed(name)) > len(before), 0.5)
        except AssertionError:
            return False

    def activate(self, name):
        run("xdotool", "windowactivate", Window(name).id())
        wait_until(name + " to have the keyboard", lambda: self.gets_keys(name))

    def keeps_keyboard(self, name):
        wait_until("the panel to close", lambda: not PANEL.is_open())
        wait_until(name + " to have the keyboard", lambda: self.gets_keys(name))
        self.assertTrue(self.gets_keys(name), "and to keep it")

    def actions(self):
        return self.home.read("record").count("menu.onAction received")

    def show(self):
        subprocess.run([AGENT, "--show"], check=True)
        self.assertTrue(PANEL.is_open())

    def chooses(self, *keys, after=()):
        """By what is typed at once after those doings of the mouse, of which no letter is lost."""
        before, elsewhere = self.actions(), self.typed("one")
        run("xdotool", *after, "key", "ctrl+a", *keys, "Return")  # the last search may still be there
        wait_until("the action", lambda: self.actions() > before)
        self.assertEqual(self.typed("one"), elsewhere)
        return self.home.read("record").rsplit("menu.onAction received", 1)[1]

    def test_typing_at_once_however_it_was_opened(self):
        x, y, width, height = ITEM.frame()
        agent = int(run("xdotool", "getwindowpid", ITEM.id()))
        for button in "1", "3", "1":
            self.assertIn("calculator", self.chooses(
                *LETTERS, after=("mousemove", str(x + width // 2), str(y + height // 2), "click", button)))
            self.keeps_keyboard("one")
            self.show()
            self.assertIn("calculator", self.chooses(*LETTERS))
            self.keeps_keyboard("one")
            # The agent is late: what is typed waits from the press on, for as long as the button is held.
            os.kill(agent, signal.SIGSTOP)
            run("xdotool", "mousedown", button)
            wait_until("the press", lambda: not self.gets_keys("one"))
            threading.Timer(1, os.kill, (agent, signal.SIGCONT)).start()
            self.assertIn("calculator", self.chooses(*LETTERS))
            run("xdotool", "mouseup", button)
            self.keeps_keyboard("one")

    def test_a_program_that_it_opens_gets_the_keyboard(self):
        self.show()
        self.assertIn("opener", self.chooses(*"opener"))
        opened = wait_until("its window", Window("opened").id)
        self.keeps_keyboard("opened")
        run("xdotool", "windowkill", opened)
        wait_until("its end", lambda: not Window("opened").is_open())

    def test_closes_when_the_user_turns_to_something_else(self):
        two = Window("two").id()
        for turn, then in ((lambda: run("xdotool", "key", "Escape", "Escape"), "one"),  # the first may leave a search
                           (lambda: click(640, 750), "" if MANAGER == "openbox" else "one"),
                           (lambda: click(110, 550), "one"),
                           (lambda: click(450, 550), "two"),
                           (lambda: run("xdotool", "windowfocus", two, "windowactivate", two), "two")):
            self.activate("one")
            self.show()
            turn()
            wait_until("the panel to close", lambda: not PANEL.is_open())
            if then:
                self.keeps_keyboard(then)

    def test_stays_open_when_a_window_of_an_input_method_is_clicked(self):
        self.start(*self.watcher("candidates", (60, 60)))
        candidates = wait_until("a window", Window("candidates").id)
        run("xdotool", "windowunmap", "--sync", candidates, "set_window", "--overrideredirect", "1", candidates)
        self.activate("one")
        self.show()
        run("xdotool", "windowmap", "--sync", candidates, "windowraise", candidates)
        x, y, _, _ = Window("candidates").frame()
        click(x + 20, y + 20)
        self.assertIn("calculator", self.chooses(*LETTERS))

    def test_stands_above_docks_on_every_workspace_and_in_no_list(self):
        run("xdotool", "set_num_desktops", "2")
        self.addCleanup(run, "xdotool", "set_desktop", "0")
        self.show()
        x, y, width, height = PANEL.frame()
        for key in ("_NET_CLIENT_LIST", "_NET_CLIENT_LIST_STACKING"):
            self.assertNotIn(int(PANEL.id()), words_of_root(key))
        self.start("tint2", "-c", self.home.write("dock", TINT2))
        # Docks come up above all windows, and stay so above those that a window manager manages.
        wait_until("the dock", lambda: Picture().pixel(1279 - 690, 60) == (255, 0, 0))
        wait_until("the panel above it", lambda: Picture().pixel(x + width - 30, 60) != (255, 0, 0))

        def is_seen():
            subprocess.run([AGENT, "--show"], check=True)  # again if the window manager gave somebody the keyboard
            return Picture().pixel(x + width - 30, y + height - 40) > (250,) * 3
        for desktop in ("1", "0"):
            run("xdotool", "set_desktop", desktop)
            wait_until("the desktop", lambda: run("xdotool", "get_desktop").strip() == desktop)
            wait_until("white in the right pane", is_seen)

    def test_opens_on_the_screen_of_the_click(self):
        run("xrandr", "--setmonitor", "left", "640/170x800/200+0+0", "screen")
        run("xrandr", "--setmonitor", "right", "640/170x800/200+640+0", "none")
        self.addCleanup(run, "xrandr", "--delmonitor", "left", "--delmonitor", "right")
        wait_until("the item at the primary monitor", lambda: ITEM.frame() == STRIP_AT_LEFT)
        self.show()
        x, _, width, _ = PANEL.frame()
        self.assertEqual((x < 640, x + width), (True, 641))
        click(1000, 600)  # the other screen
        wait_until("the panel to close", lambda: not PANEL.is_open())

        self.addCleanup(wait_until, "the strip", lambda: ITEM.frame() == STRIP_AT_LEFT)
        self.start("trayer", "--edge", "top", "--align", "left", "--monitor", "1", "--margin", "60",
                   "--widthtype", "request", "--height", "40", "--SetDockType", "true")

        def item_at_other():
            frame = ITEM.frame() or STRIP_AT_LEFT
            return frame if frame[0] >= 700 else None
        x, y, _, _ = wait_until("the item at the other", item_at_other)
        click(x + 5, y + 5)
        wait_until("the panel", PANEL.is_open)
        self.assertEqual(PANEL.frame()[0], x - 1, "no room to the left: mirrored at the item")
        self.assertIn("calculator", self.chooses(*LETTERS))

    def test_lies_over_a_blurred_picture_of_the_screen_without_itself(self):
        how = "by the compositor" if BLURS else "of a picture of the screen"
        self.assertRegex(run(AGENT, "--doctor"), "blur +ok +" + how)
        stripes = self.home.name + "/stripes.ppm"
        with open(stripes, "wb") as file:
            file.write(b"P6 1200 700 255\n" + (b"\xff\x80\x00" * 8 + b"\x00\x80\xff" * 8) * (75 * 700))
        self.start("display", "-title", "stripes", "-geometry", "+60+0", stripes)

        def red(x, y, width):
            picture = Picture()
            return [picture.pixel(i, y)[0] for i in range(x, x + width)]
        wait_until("the stripes", lambda: set(red(900, 300, 32)) == {0, 255})
        shown = []
        for _ in range(3):
            self.show()
            x, y, _, height = PANEL.frame()
            asked = "CARDINAL" in run("xprop", "-id", PANEL.id(), BLUR)
            self.assertEqual(asked, BLURS)
            wait_until("blurred stripes", lambda: max(red(x + 20, y + height - 40, 100)) < 255)
            shown.append(red(x + 20, y + height - 40, 100))
            self.assertLess(max(shown[-1]) - min(shown[-1]), 40, "no stripe stands out")
            self.assertGreater(min(shown[-1]), 120, "and nothing is black")
            subprocess.run([AGENT, "--hide"], check=True)
        self.assertLess(abs(sum(shown[0]) - sum(shown[2])), 300, "no picture of itself, which would be lighter")


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
