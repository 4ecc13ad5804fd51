#!/usr/bin/env python3
"""kxipc and a daemon that comes and goes. KX_TEST_BIN names the programs' folder."""

import os
import plistlib
import resource
import signal
import subprocess
import tempfile
import threading
import time
import unittest

CONNECTED = "KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION"


class Kxipc(unittest.TestCase):
    def setUp(self):
        home = tempfile.TemporaryDirectory()
        self.addCleanup(home.cleanup)
        os.environ.update(HOME=home.name, XDG_RUNTIME_DIR=home.name, QT_QPA_PLATFORM="offscreen")
        signal.signal(signal.SIGALRM, lambda *_: self.fail("waited in vain"))
        signal.alarm(90)
        self.recording = home.name + "/recording"
        self.choice = home.name + "/choice"
        with open(self.choice, "wb") as file:
            plistlib.dump({"selectedIndex": 0}, file)

    def start(self, program, *arguments):
        process = subprocess.Popen([f"{os.environ['KX_TEST_BIN']}/{program}", *arguments], stdout=subprocess.PIPE,
                                   text=True, restore_signals=False)
        self.addCleanup(self.end, process, signal.SIGKILL)
        return process

    @staticmethod
    def end(process, number):
        process.send_signal(number)
        if not process.stdout.closed:
            process.communicate()
        return process.returncode

    def start_daemon(self):
        return self.start("tesselDaemon", "--no-agent", "--machine", "Sample guest")

    @staticmethod
    def run_tool(*arguments, given=None):
        return subprocess.run([os.environ["KX_TEST_BIN"] + "/kxipc", *arguments], input=given, text=True,
                              capture_output=True, check=False, timeout=60)

    def assert_exits(self, code, *arguments, given=None):
        self.assertEqual(self.run_tool(*arguments, given=given).returncode, code, arguments)

    def post_until(self, condition):
        deadline = time.monotonic() + 60
        while self.run_tool("post", "menu.selectIndex", "--file", self.choice).returncode or not condition():
            self.assertLess(time.monotonic(), deadline)

    def replay_until(self, seen):
        while not seen.is_set():
            self.run_tool("replay", self.recording, "--speed", "0")

    def assert_prints(self, process, *texts):
        """The texts stand in the next lines that the program prints, in this order."""
        for text in texts:
            line = next((line for line in process.stdout if text in line), None)
            self.assertIsNotNone(line, f"no {text}")

    def test_follows_a_server_that_is_killed_and_talks_to_the_next(self):
        self.assert_exits(0, "--version")
        self.assert_exits(2, "pots")
        self.assert_exits(1, "post", "menu.refresh")
        listener = self.start("kxipc", "listen", "menu.update", CONNECTED)
        for _ in range(3):
            daemon = self.start_daemon()
            self.assert_prints(listener, "name: " + CONNECTED, "object: com.corvane.")
            self.assert_exits(0, "post", "menu.refresh")
            self.assert_prints(listener, "name: menu.update", "info.selectedIndex: ")
            self.end(daemon, signal.SIGKILL)
        self.start_daemon()
        self.assert_prints(listener, "name: " + CONNECTED)
        with open(self.choice, encoding="utf-8") as file:
            self.assert_exits(0, "post", "menu.selectIndex", "--file", "-", given=file.read())
        self.assert_prints(listener, "name: menu.update")
        self.assert_exits(1, "post", "menu.selectIndex", "--file", "/dev/null")
        self.assertRegex(self.run_tool("ports").stdout, r"^com.corvane.kxipc.\d+.\d+\ncom.corvane.kxipc.server2\n$")
        self.assertEqual(self.end(listener, signal.SIGTERM), 0)

    def test_watches_records_and_replays(self):
        self.assert_exits(1, "watch")
        daemon = self.start_daemon()
        self.post_until(lambda: True)
        recorder = self.start("kxipc", "record", self.recording)
        self.post_until(lambda: os.path.exists(self.recording) and os.path.getsize(self.recording) > 200)
        self.assertEqual(self.end(recorder, signal.SIGTERM), 0)
        recorder = self.start("kxipc", "record", self.recording + ".cut")
        resource.prlimit(recorder.pid, resource.RLIMIT_FSIZE, (200, 200))
        self.post_until(lambda: recorder.poll() is not None)
        self.assertEqual(recorder.returncode, 1, "ends at the first that cannot be written")

        watch = self.start("kxipc", "watch", "--json")
        seen = threading.Event()
        self.addCleanup(seen.set)
        threading.Thread(target=self.replay_until, args=(seen,)).start()
        self.assert_prints(watch, '"direction":"in"', '"name":"menu.selectIndex","userInfo":{"selectedIndex":0}}')
        seen.set()
        self.assertRegex(self.run_tool("stats").stdout, r"^connections \d+\nreceived [1-9]\d*\nsent \d+\nqueued 0\n"
                         r"queuedBytes 0\ndropped 0\n$")
        self.assert_exits(1, "replay", self.choice)
        self.end(daemon, signal.SIGKILL)
        watch.communicate(timeout=60)
        self.assertEqual(watch.returncode, 0, "a watch ends with what it watches")


if __name__ == "__main__":
    unittest.main()
