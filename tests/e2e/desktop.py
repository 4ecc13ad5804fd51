"""What the end-to-end tests do on a private X server: start programs, point, type, look."""

import os
import re
import shutil
import subprocess
import tempfile
import time


def run(*command):
    return subprocess.run(command, capture_output=True, text=True, check=False).stdout


def wait_until(what, condition, seconds=30):
    """The condition's first true answer. Polls; fails with `what` when the time is over."""
    deadline = time.monotonic() + seconds
    while True:
        answer = condition()
        if answer:
            return answer
        if time.monotonic() > deadline:
            raise AssertionError(f"waited {seconds} s in vain: {what}")
        time.sleep(0.02)


class Window:
    """A window that can be seen, told by its name."""

    def __init__(self, name):
        self.name = name

    def id(self):
        return run("xdotool", "search", "--onlyvisible", "--name", f"^{self.name}$").split("\n")[0]

    def is_open(self):
        return bool(self.id())

    def frame(self):
        """(x, y, width, height), from the top left of the screen; None while it is not there to be seen."""
        text = run("xdotool", "getwindowgeometry", "--shell", self.id())
        frame = re.search(r"X=(-?\d+)\nY=(-?\d+)\nWIDTH=(\d+)\nHEIGHT=(\d+)", text)
        return frame and tuple(map(int, frame.groups()))


def point(x, y):
    run("xdotool", "mousemove", str(x), str(y))


def click(x, y, button=1):
    run("xdotool", "mousemove", str(x), str(y), "click", str(button))


def type_text(text):
    run("xdotool", "type", "--delay", "5", text)


def press(key):
    run("xdotool", "key", key)


class Picture:
    """The screen as it is now; of another display with another command that writes it as PPM."""

    def __init__(self, command=("import", "-window", "root", "-depth", "8", "-type", "TrueColor", "ppm:-")):
        raw = subprocess.run(command, capture_output=True, check=True).stdout
        header = re.match(rb"P6\s+(\d+)\s+(\d+)\s+255\s", raw)
        self.width, self.height = int(header[1]), int(header[2])
        self.pixels = raw[header.end():]

    def pixel(self, x, y):
        at = 3 * (y * self.width + x)
        return tuple(self.pixels[at:at + 3])

    def inked_runs(self, x, width, top, bottom):
        """Vertical stretches (top, bottom) in which some pixel of the columns is not white."""
        white = bytes([255]) * (3 * width)
        runs, start = [], None
        for y in range(top, bottom + 1):
            at = 3 * (y * self.width + x)
            inked = y < bottom and self.pixels[at:at + 3 * width] != white
            if inked and start is None:
                start = y
            elif not inked and start is not None:
                runs.append((start, y))
                start = None
        return runs


class Home:
    """A home directory of the test's own, the user's for every program started from now on, and files in it."""

    def __init__(self):
        self.name = tempfile.mkdtemp()
        os.environ.update(HOME=self.name, XDG_DATA_HOME=self.name + "/data", XDG_CONFIG_HOME=self.name + "/config")

    def cleanup(self):
        shutil.rmtree(self.name, ignore_errors=True)

    def write(self, name, text):
        """Answers the path."""
        path = os.path.join(self.name, name)
        os.makedirs(os.path.dirname(path), exist_ok=True)
        with open(path, "w", encoding="utf-8") as file:
            file.write(text)
        return path

    def write_entry(self, name, title, command="true"):
        self.write(f"data/applications/{name}.desktop",
                   f"[Desktop Entry]\nType=Application\nName={title}\nExec={command}\n")

    def read(self, name):
        """Empty while there is no such file."""
        try:
            with open(os.path.join(self.name, name), encoding="utf-8", errors="replace") as file:
                return file.read()
        except FileNotFoundError:
            return ""


def start(*command, output=os.devnull):
    """Another program; whoever starts it ends it."""
    with open(output, "w", encoding="utf-8") as file:
        return subprocess.Popen(command, stdout=file, stderr=subprocess.DEVNULL)


def end(process):
    process.kill()
    process.wait()


class Program:
    """A program of the build under test. Ends with the test."""

    running = []

    def __init__(self, name, *arguments):
        self.process = subprocess.Popen([os.path.join(os.environ["KX_TEST_BIN"], name), *arguments])
        Program.running.append(self)

    def kill(self):
        end(self.process)

    @classmethod
    def end_all(cls):
        for program in cls.running:
            if program.process.poll() is None:
                program.process.terminate()
                try:
                    program.process.wait(20)
                except subprocess.TimeoutExpired:
                    program.kill()
