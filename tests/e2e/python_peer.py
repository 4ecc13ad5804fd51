#!/usr/bin/env python3
"""A peer in another language is a server to the real agent, and a client to the real daemon.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder."""

import os
import shutil
import subprocess
import tempfile
import unittest

from desktop import Program, Window, end, press, start, type_text, wait_until
from peer import SERVER, Peer, process_number


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
        self.check_recording(server, port)

    def check_recording(self, server, port):
        """What the agent gets can be watched, recorded, and sent to it again."""
        tool = os.path.join(os.environ["KX_TEST_BIN"], "kxipc")
        recording, watched = self.home + "/recording", self.home + "/watched"
        programs = start(tool, "record", recording, port), start(tool, "watch", port, "--json", output=watched)

        def holds(path, text):
            if not os.path.exists(path):
                return False
            with open(path, "rb") as file:
                return text in file.read()

        wait_until("both to look", lambda: server.send(port, "menu.hide") or (
            holds(recording, b"menu.hide") and holds(watched, b'"name":"menu.hide"')))
        server.send(port, "menu.show")
        wait_until("the panel", Window("Tessel start menu").is_open)
        wait_until("the recording", lambda: holds(recording, b"menu.show") and holds(watched, b'"name":"menu.show"'))
        for program in programs:
            end(program)
        server.send(port, "menu.hide")
        wait_until("the panel to close", lambda: not Window("Tessel start menu").is_open())
        subprocess.run([tool, "replay", recording, port, "--speed", "0"], check=True)
        wait_until("the panel, opened by the recording", Window("Tessel start menu").is_open)

    def test_is_a_client_of_the_daemon(self):
        Program("tesselDaemon", "--no-agent", "--machine", "sample")
        wait_until("the daemon", lambda: os.path.exists(os.path.join(self.directory, SERVER)))
        client = Peer(self.directory)
        self.addCleanup(client.close)
        table = {"KX_IPC_PARAM_MSG_TABLE": [{"name": "menu.update"}], "KX_IPC_PARAM_PSN": client.number}
        client.send_together(SERVER, ("KX_IPC_ADD_LISTENER_NOTIFICATION", table), ("menu.refresh", None))
        info, sender = client.wait_for("KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION")
        self.assertEqual(info["KX_IPC_PARAM_PSN"], sender)
        client.wait_for("menu.update")
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
        client.send_together(client.name, ("one", None), ("two", None))
        client.wait_for("one")
        self.assertEqual([each["message"]["name"] for each in client.arrived], ["two"])


if __name__ == "__main__":
    unittest.main(verbosity=2)
