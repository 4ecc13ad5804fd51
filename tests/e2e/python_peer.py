#!/usr/bin/env python3
"""A peer without our library, as docs/protocol.md describes one: a server to the real agent, and a client to the
real daemon. Started by tools/with-display, with KX_TEST_BIN naming the programs' folder."""

import array
import fcntl
import os
import plistlib
import shutil
import socket
import struct
import subprocess
import tempfile
import unittest

from desktop import Program, Window, press, type_text, wait_until

HEADER = struct.Struct("<4sHHQQ")
WAITS, ANSWER, IN_MEMORY = 1, 2, 4
MOST_INLINE = 128 * 1024
SEALS = fcntl.F_SEAL_SEAL | fcntl.F_SEAL_SHRINK | fcntl.F_SEAL_GROW | fcntl.F_SEAL_WRITE
SERVER = "com.corvane.kxipc.server2"


def process_number(pid):
    with open(f"/proc/{pid}/stat", encoding="utf-8") as file:
        start = int(file.read().rpartition(")")[2].split()[19])
    return (start & 0xFFFFFFFF) << 32 | pid


class Peer:
    """Owns one port and sends to others, one message at a time."""

    def __init__(self, directory, name=None):
        self.number = process_number(os.getpid())
        self.directory, self.name = directory, name or self.port_of(self.number)
        self.counter, self.connections, self.arrived = 0, {}, []
        self.lock = os.open(self.path(self.name + ".lock"), os.O_CREAT | os.O_RDWR | os.O_CLOEXEC, 0o600)
        fcntl.flock(self.lock, fcntl.LOCK_EX | fcntl.LOCK_NB)
        self.listener = socket.socket(socket.AF_UNIX, socket.SOCK_SEQPACKET)
        self.listener.setsockopt(socket.SOL_SOCKET, socket.SO_PASSCRED, 1)
        self.listener.bind(self.path("." + self.name))
        self.listener.listen()
        os.rename(self.path("." + self.name), self.path(self.name))
        self.senders = []

    def close(self):
        os.unlink(self.path(self.name))
        for each in [self.listener, *self.senders, *self.connections.values()]:
            each.close()
        os.close(self.lock)

    def path(self, name):
        return os.path.join(self.directory, name)

    @staticmethod
    def port_of(number):
        return f"com.corvane.kxipc.{number >> 32}.{number & 0xFFFFFFFF}"

    def post_notice(self, name):
        fresh = self.path(f"notices/.{os.getpid()}.1")
        with open(fresh, "wb"):
            os.rename(fresh, self.path("notices/" + name))

    def send(self, port, name, info=None, synchronous=False):
        """Waits for the answer to a synchronous one, and says whether there was one."""
        self.counter += 1
        message = {"name": name} if info is None else {"name": name, "userInfo": info}
        payload = plistlib.dumps({"message": message, "psnKey": self.number, "messageID": self.counter,
                                  "synchronous": synchronous}, fmt=plistlib.FMT_BINARY)
        if port not in self.connections:
            self.connections[port] = socket.socket(socket.AF_UNIX, socket.SOCK_SEQPACKET)
            self.connections[port].connect(self.path(port))
        connection, flags = self.connections[port], WAITS if synchronous else 0
        if len(payload) <= MOST_INLINE:
            connection.send(HEADER.pack(b"KXPC", 1, flags, len(payload), self.counter) + payload)
        else:
            memory = os.memfd_create("message", os.MFD_CLOEXEC | os.MFD_ALLOW_SEALING)
            os.writev(memory, [payload])
            fcntl.fcntl(memory, fcntl.F_ADD_SEALS, SEALS)
            socket.send_fds(connection, [HEADER.pack(b"KXPC", 1, flags | IN_MEMORY, len(payload), self.counter)], [memory])
            os.close(memory)
        if not synchronous:
            return False
        connection.settimeout(20)
        return connection.recv(HEADER.size) == HEADER.pack(b"KXPC", 1, ANSWER, 0, self.counter)

    def receive(self, sender):
        """Takes what has come from one sender; false at its end."""
        packet, control, _, _ = sender.recvmsg(HEADER.size + MOST_INLINE, 256)
        if not packet:
            return False
        magic, version, flags, length, sequence = HEADER.unpack_from(packet)
        assert (magic, version) == (b"KXPC", 1)
        payload = packet[HEADER.size:]
        for level, kind, data in control:
            if (level, kind) == (socket.SOL_SOCKET, socket.SCM_RIGHTS):
                memory, = array.array("i", data)
                payload = os.pread(memory, length, 0)
                os.close(memory)
        assert len(payload) == length
        self.arrived.append(plistlib.loads(payload))
        if flags & WAITS:
            sender.send(HEADER.pack(b"KXPC", 1, ANSWER, 0, sequence))
        return True

    def turn(self):
        """Takes all that has come."""
        for each in [self.listener, *self.senders]:
            each.setblocking(False)
            try:
                while each is self.listener:
                    self.senders.append(each.accept()[0])
                while self.receive(each):
                    pass
                each.close()
                self.senders.remove(each)
            except BlockingIOError:
                continue

    def wait_for(self, name):
        """The user information of the next message of that name, and who sent it. What came before is forgotten."""
        def look():
            self.turn()
            while self.arrived:
                envelope = self.arrived.pop(0)
                if envelope["message"]["name"] == name:
                    return [envelope["message"].get("userInfo"), envelope["psnKey"]]
            return None
        return wait_until(name, look)


class PythonPeer(unittest.TestCase):
    def setUp(self):
        home = tempfile.TemporaryDirectory()
        self.addCleanup(home.cleanup)
        self.addCleanup(Program.end_all)
        os.environ.update(HOME=home.name, XDG_DATA_HOME=home.name + "/data", XDG_CONFIG_HOME=home.name + "/config",
                          XDG_RUNTIME_DIR=home.name)
        self.directory = home.name + "/com.corvane.kxipc"
        os.mkdir(self.directory, 0o700)
        os.mkdir(self.directory + "/notices", 0o700)

        self.home = home.name

    def start_main_application(self):
        """A process with the application id without which the agent does not open its menu."""
        os.makedirs(self.home + "/data/applications")
        program = shutil.copy("/bin/sleep", self.home)
        with open(self.home + "/data/applications/com.corvane.tesselDaemon.desktop", "w", encoding="utf-8") as entry:
            entry.write(f"[Desktop Entry]\nType=Application\nName=Peer\nExec={program}\n")
        process = subprocess.Popen([program, "600"])
        self.addCleanup(lambda: (process.kill(), process.wait()))

    def test_is_a_server_to_the_agent(self):
        self.start_main_application()
        agent = Program("corvane-tesselStartMenu")
        agent_number = process_number(agent.process.pid)
        wait_until("the agent's port", lambda: os.path.exists(os.path.join(self.directory, Peer.port_of(agent_number))))
        server = Peer(self.directory, SERVER)
        self.addCleanup(server.close)
        server.post_notice("KX_IPC_SERVER_DID_LAUNCH_NOTIFICATION")
        wanted = []
        while "menu.update" not in wanted:
            info, sender = server.wait_for("KX_IPC_ADD_LISTENER_NOTIFICATION")
            self.assertEqual((sender, info["KX_IPC_PARAM_PSN"]), (agent_number, agent_number))
            wanted += [entry["name"] for entry in info["KX_IPC_PARAM_MSG_TABLE"]]
        port = Peer.port_of(agent_number)
        server.send(port, "KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION", {"KX_IPC_PARAM_PSN": server.number})
        icon = {"format": "bgra", "width": 256, "height": 256, "data": bytes([0, 90, 200, 255]) * 256 * 256}
        item = {"title": "Serpent", "action": "run", "tag": -3, "representedObject": {"of": ["ours", 7]},
                "rawIcons": [icon]}
        menu = {"searchableApps": [item], "pinnedApps": [item], "allPrograms": []}
        self.assertTrue(server.send(port, "menu.update", {"menu": menu, "nameList": ["Python"], "selectedIndex": 0},
                                    synchronous=True))
        server.send(port, "menu.show")
        wait_until("the panel", Window("Tessel start menu").is_open)
        server.wait_for("menu.refresh")
        type_text("serp")
        press("Return")
        info, _ = server.wait_for("menu.onAction")
        self.assertEqual(info, {"action": "run", "tag": -3, "representedObject": {"of": ["ours", 7]}})

    def test_is_a_client_of_the_daemon(self):
        Program("tesselDaemon", "--no-agent", "--machine", "sample")
        wait_until("the daemon", lambda: os.path.exists(os.path.join(self.directory, SERVER)))
        client = Peer(self.directory)
        self.addCleanup(client.close)
        client.send(SERVER, "KX_IPC_ADD_LISTENER_NOTIFICATION",
                    {"KX_IPC_PARAM_MSG_TABLE": [{"name": "menu.update"}], "KX_IPC_PARAM_PSN": client.number})
        info, sender = client.wait_for("KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION")
        self.assertEqual(info["KX_IPC_PARAM_PSN"], sender)
        self.assertTrue(client.send(SERVER, "menu.refresh", synchronous=True), "is answered once it is handled")
        icons = []
        while not icons:
            update, _ = client.wait_for("menu.update")
            icons = [icon for item in update["menu"].get("searchableApps", []) for icon in item.get("rawIcons", [])]
        for icon in icons:
            self.assertEqual((icon["format"], len(icon["data"])), ("bgra", icon["width"] * icon["height"] * 4))
        other = 1 - update["selectedIndex"]
        client.send(SERVER, "menu.selectIndex", {"selectedIndex": other})
        while client.wait_for("menu.update")[0]["selectedIndex"] != other:
            pass
        client.send(SERVER, "KX_IPC_REMOVE_LISTENER_NOTIFICATION",
                    {"KX_IPC_PARAM_ALL_MESSAGES": True, "KX_IPC_PARAM_PSN": client.number})
        for _ in range(2):
            client.turn()
            client.arrived.clear()
            self.assertTrue(client.send(SERVER, "menu.refresh", synchronous=True))
        client.turn()
        self.assertEqual(client.arrived, [], "nothing comes once it has left")


if __name__ == "__main__":
    unittest.main(verbosity=2)
