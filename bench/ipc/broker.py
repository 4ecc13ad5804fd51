"""broker.py LISTENER: becomes dbus-broker's launcher, in a mount namespace of its own: `unshare -m broker.py LISTENER`.

It takes its listener as a service manager hands it over, and does not start where nobody reads the journal.
"""

import os
import socket
import subprocess
import sys

subprocess.run(["mount", "-t", "tmpfs", "none", "/run/systemd"], check=True)
os.mkdir("/run/systemd/journal")
journal = socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM)
journal.bind("/run/systemd/journal/socket")
journal.set_inheritable(True)
os.dup2(int(sys.argv[1]), 3)
os.environ.update(LISTEN_FDS="1", LISTEN_PID=str(os.getpid()))
os.execvp("dbus-broker-launch", ["dbus-broker-launch", "--scope", "user"])
