#!/usr/bin/env python3
"""What the session does to the agent and the daemon: commands from outside, and everything that goes missing.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder. A full disk and a read-only home take
rights to mount; without them a plain file where the log's directory should be stands for both."""

import glob
import os
import shutil
import signal
import stat
import subprocess
import tempfile
import unittest

from desktop import Window, press, run, type_text, wait_until

ITEM = Window("Tessel status item")
PANEL = Window("Tessel start menu")
BIN = os.environ["KX_TEST_BIN"]
AGENT = "corvane-tesselStartMenu"
PORT = "com.corvane.tesselStartMenu"


class Faults(unittest.TestCase):
    def setUp(self):
        self.home = tempfile.mkdtemp()
        self.addCleanup(shutil.rmtree, self.home, ignore_errors=True)
        runtime = self.home + "/runtime"
        os.mkdir(runtime, 0o700)
        self.environment = dict(os.environ, HOME=self.home + "/home", XDG_RUNTIME_DIR=runtime,
                                XDG_DATA_HOME=self.home + "/data", XDG_CONFIG_HOME=self.home + "/config")
        os.mkdir(self.environment["HOME"])
        self.record = self.home + "/record"

    def start(self, *command):
        """A program that ends with the test, at the latest."""
        process = subprocess.Popen(command, env=self.environment, cwd=self.home, stdout=subprocess.PIPE,
                                   stderr=subprocess.DEVNULL, text=True)
        self.addCleanup(process.stdout.close)
        self.addCleanup(self.end, process)
        return process

    def end(self, process, how=signal.SIGTERM):
        if process.poll() is None:
            process.send_signal(how)
        return process.wait(20)

    def serve(self):
        """A daemon, and the agent that it starts, which has its menu."""
        daemon = self.start(BIN + "/tesselDaemon", "--record", self.record, "--machine", "Sample guest")
        wait_until("the item", ITEM.is_open)
        wait_until("an update", lambda: "menu.update sent" in self.read(self.record))
        return daemon

    @staticmethod
    def read(path):
        try:
            with open(path, encoding="utf-8", errors="replace") as file:
                return file.read()
        except OSError:
            return ""

    def log(self, program=AGENT):
        return self.read(f"{self.environment['HOME']}/Library/Logs/Corvane Tessel/{program}.log")

    def ask(self, *arguments, program=AGENT):
        """(exit code, what it says) of a program that ends by itself."""
        result = subprocess.run([f"{BIN}/{program}", *arguments], env=self.environment, capture_output=True, text=True,
                                check=False, timeout=60)
        return result.returncode, result.stdout + result.stderr

    def does(self, *arguments):
        self.assertEqual(self.ask(*arguments), (0, ""), arguments)

    def menu_works(self):
        before = self.read(self.record).count("menu.onAction received")
        self.does("--show")
        press("ctrl+a")
        type_text("calcul")
        press("Return")
        wait_until("the action", lambda: self.read(self.record).count("menu.onAction received") > before)
        wait_until("the panel to close", lambda: not PANEL.is_open())

    def bus(self):
        address = f"unix:path={self.home}/bus"
        process = self.start("dbus-daemon", "--session", "--nofork", "--nopidfile", "--address=" + address)
        wait_until("the bus", lambda: os.path.exists(self.home + "/bus"))
        self.environment["DBUS_SESSION_BUS_ADDRESS"] = address
        return process

    def test_commands_act_on_the_one_that_runs(self):
        for command in ("--toggle", "--show", "--hide", "--quit"):
            self.assertEqual(self.ask(command), (1, AGENT + ": no start menu runs in this session\n"))
        self.assertRegex(self.ask("--doctor")[1], "agent +ok +does not run\nserver +FAULT +does not run\n +Start")
        self.serve()
        for command, opens in (("--hide", False), ("--toggle", True), ("--show", True), ("--toggle", False),
                               ("--show", True), ("--hide", False)):
            self.does(command)
            self.assertEqual(PANEL.is_open(), opens, command)
        self.assertEqual(self.ask(), (1, AGENT + ": the start menu runs already in this session\n"))
        self.menu_works()
        code, text = self.ask("--doctor")
        self.assertEqual((code, text.count("FAULT")), (0, 0), text)
        self.assertFalse(glob.glob(self.environment["HOME"] + "/Library/Logs/*/*-0.log"), "rotated by nobody else")
        self.does("--quit")
        wait_until("the item to go", lambda: not ITEM.is_open())
        wait_until("the daemon to know", lambda: "as it was asked to" in self.log("tesselDaemon"))
        self.assertEqual(self.ask("--wrong")[0], 2)

    def test_the_bus_dies_and_comes_back(self):
        bus = self.bus()
        daemon = self.serve()
        self.menu_works()
        self.end(bus, signal.SIGKILL)
        self.menu_works()
        os.remove(self.home + "/bus")
        self.bus()
        self.menu_works()
        self.assertIsNone(daemon.poll())
        self.assertNotIn("ended", self.log("tesselDaemon"))

    def test_without_a_bus(self):
        self.environment["DBUS_SESSION_BUS_ADDRESS"] = f"unix:path={self.home}/none"
        self.serve()
        self.menu_works()
        self.assertRegex(self.ask("--doctor")[1], "\nbus +FAULT .*\n +Bars")

    def test_the_window_manager_starts_again(self):
        self.serve()
        for manager in ("xfwm4 --replace --compositor=off", "openbox --replace --sm-disable"):
            window = run("xprop", "-root", "_NET_SUPPORTING_WM_CHECK")
            self.start(*manager.split())
            wait_until(manager, lambda: run("xprop", "-root", "_NET_SUPPORTING_WM_CHECK") not in (window, ""))
            wait_until("the item", ITEM.is_open)
            self.menu_works()

    def test_the_display_goes_and_comes_back(self):
        display = self.home + "/number"
        number = None
        for _ in range(2):
            with open(display, "w", encoding="utf-8") as file:
                server = subprocess.Popen(["Xvfb", *(number or ["-displayfd", str(file.fileno())]), "-screen", "0",
                                           "640x480x24", "-nolisten", "tcp", "-noreset"], pass_fds=[file.fileno()],
                                          stderr=subprocess.DEVNULL)
            self.addCleanup(self.end, server)
            if number is None:
                number = [":" + wait_until("a display", lambda: self.read(display)).strip()]
                self.environment["DISPLAY"] = number[0]
                daemon = self.start(BIN + "/tesselDaemon")
            wait_until("the agent", lambda: self.ask("--show")[0] == 0, 90)
            self.end(server, signal.SIGKILL)
            wait_until("the agent to end", lambda: self.ask("--show")[0] == 1)
            wait_until("the agent to be missed", lambda: "exit code 1" in self.log("tesselDaemon"))
            self.assertEqual(glob.glob(f"{self.environment['XDG_RUNTIME_DIR']}/*/{PORT}"), [], "it ended in order")
        self.assertNotIn("signal", self.log("tesselDaemon"))
        wait_until("it to say why", lambda: "Cannot run: there is no display" in self.log(), 90)
        self.assertEqual(glob.glob(self.home + "/core*"), [])
        self.assertIsNone(daemon.poll())
        self.assertRegex(self.ask("--doctor")[1], "display +FAULT .* does not answer\n +Is")

    def test_a_home_without_room(self):
        home = self.environment["HOME"]
        for options in ("size=64k", "ro"):
            if subprocess.run(["mount", "-t", "tmpfs", "-o", options, "tmpfs", home], capture_output=True,
                              check=False).returncode == 0:
                self.addCleanup(subprocess.run, ["umount", home], check=True)
                if options != "ro":
                    os.makedirs(home + "/Library/Logs/Corvane Tessel")
                    with open(home + "/filler", "wb", buffering=0) as file, self.assertRaises(OSError):
                        while True:
                            file.write(bytes(4096))
            else:
                with open(home + "/Library", "a", encoding="utf-8"):
                    pass
            daemon = self.serve()
            self.menu_works()
            self.assertEqual(self.log() + self.log("tesselDaemon"), "")
            self.assertRegex(self.ask("--doctor")[1], "log +FAULT .*\n +The menu works, but nothing is logged")
            self.assertEqual(self.end(daemon), 0)
            wait_until("the item to go", lambda: not ITEM.is_open())
            os.remove(self.record)

    def test_runtime_directories_that_are_missing_or_not_ours(self):
        ports = self.environment["XDG_RUNTIME_DIR"] + "/com.corvane.kxipc"
        os.mkdir(ports, 0o755)
        for spoil in (lambda: os.chmod(ports, 0o755), lambda: (os.chmod(ports, 0o700), os.chown(ports, 65534, -1))):
            spoil()
            for program in (AGENT, "tesselDaemon"):
                before = self.log(program)
                self.assertEqual(self.ask(program=program), (1, f"{program}: {ports} cannot be used\n"))
                self.assertRegex(self.log(program).removeprefix(before),
                                 f"^[^\n]* {ports} is not a directory of this user alone, refusing to use it\n$")
            self.assertRegex(self.ask("--doctor")[1], f"runtime directory +FAULT +{ports}: .*\n +It must be yours alone")
            if os.geteuid() != 0:
                break  # nobody else can give a directory away
        del self.environment["XDG_RUNTIME_DIR"]
        self.serve()
        self.menu_works()
        usual = f"/run/user/{os.geteuid()}"
        place = usual + "/com.corvane.kxipc" if os.path.isdir(usual) else f"/tmp/com.corvane.kxipc-{os.geteuid()}"
        self.assertEqual(stat.S_IMODE(os.stat(place).st_mode), 0o700)


if __name__ == "__main__":
    unittest.main(verbosity=2)
