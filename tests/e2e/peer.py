"""A peer without our library, as docs/protocol.md describes one."""

import array
import fcntl
import os
import plistlib
import socket
import struct

from desktop import wait_until

HEADER = struct.Struct("<4sHHQQ")
WAITS, ANSWER, IN_MEMORY = 1, 2, 4
MOST_INLINE = 256 * 1024
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

    def connection(self, port):
        if port not in self.connections:
            self.connections[port] = socket.socket(socket.AF_UNIX, socket.SOCK_SEQPACKET)
            self.connections[port].setsockopt(socket.SOL_SOCKET, socket.SO_SNDBUF, 2 * MOST_INLINE)
            self.connections[port].connect(self.path(port))
        return self.connections[port]

    def payload(self, name, info, synchronous=False):
        self.counter += 1
        message = {"name": name} if info is None else {"name": name, "userInfo": info}
        return plistlib.dumps({"message": message, "psnKey": self.number, "messageID": self.counter,
                               "synchronous": synchronous}, fmt=plistlib.FMT_BINARY)

    def send_together(self, port, *messages):
        """Names with their user information, in one packet."""
        payloads = [self.payload(*message) for message in messages]
        self.connection(port).send(b"".join(HEADER.pack(b"KXPC", 1, 0, len(each), 0) + each for each in payloads))

    def send(self, port, name, info=None, synchronous=False):
        """Waits for the answer to a synchronous one, and says whether there was one."""
        payload = self.payload(name, info, synchronous)
        connection, flags = self.connection(port), WAITS if synchronous else 0
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
        memory = [os.fdopen(number, "rb") for level, kind, data in control
                  if (level, kind) == (socket.SOL_SOCKET, socket.SCM_RIGHTS) for number in array.array("i", data)]
        while packet:
            magic, version, flags, length, sequence = HEADER.unpack_from(packet)
            assert (magic, version) == (b"KXPC", 1)
            end = HEADER.size + (0 if flags & IN_MEMORY else length)
            payload, packet = packet[HEADER.size:end], packet[end:]
            if flags & IN_MEMORY:
                payload = os.pread(memory[0].fileno(), length, 0)
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
