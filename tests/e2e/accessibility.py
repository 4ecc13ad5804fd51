#!/usr/bin/env python3
"""What a screen reader finds: a client of the accessibility bus reads and works the menu of ten thousand applications.

Started by tools/with-display, with KX_TEST_BIN naming the programs' folder."""

import os
import tempfile
import unittest

import gi

gi.require_version("Atspi", "2.0")
from gi.repository import Atspi, GLib  # noqa: E402

import desktop  # noqa: E402
from desktop import Program, Window, click, press, type_text  # noqa: E402

STATUS_ITEM = Window("Tessel status item")
PANEL = Window("Tessel start menu")
APPLICATIONS = 10000
ENTRY = "[Desktop Entry]\nType=Application\nName=Testing {0}\nExec=true {0}\nCategories=Office;\n"


def wait_until(what, condition):
    """With patience for ten thousand rows under load, and for a bus that gives up sooner."""
    def answer():
        try:
            return condition()
        except GLib.Error:
            return None
    return desktop.wait_until(what, answer, 120)


def find(node, role, name=None):
    """The first one below that has the role, and the name if one is given."""
    if node is None:
        return None
    for index in range(node.get_child_count() if node.get_role() != Atspi.Role.LIST else 0):
        child = node.get_child_at_index(index)
        if child and child.get_role() == role and name in (None, child.get_name()):
            return child
        found = find(child, role, name)
        if found:
            return found
    return None


def has(node, *states):
    return all(node.get_state_set().contains(state) for state in states)


def rows(menu_list):
    children = [menu_list.get_child_at_index(index) for index in range(menu_list.get_child_count())]
    return [child for child in children if child and child.get_role() == Atspi.Role.LIST_ITEM]


class Accessibility(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        # The bus's own limit is less than a second, and an answer counts as none after it: an update of ten
        # thousand applications may take longer with sanitizers.
        Atspi.set_timeout(20000, 20000)
        wait_until("the bus", lambda: Atspi.get_desktop(0))  # before the agent looks for it
        cls.home = tempfile.TemporaryDirectory()
        entries = os.path.join(cls.home.name, "data/applications")
        os.makedirs(entries)
        for number in range(APPLICATIONS):
            with open(f"{entries}/app{number:05}.desktop", "w", encoding="utf-8") as file:
                file.write(ENTRY.format(f"{number:05}"))
        os.environ.update(HOME=cls.home.name, XDG_DATA_HOME=cls.home.name + "/data",
                          XDG_CONFIG_HOME=cls.home.name + "/config", QT_LINUX_ACCESSIBILITY_ALWAYS_ON="1")
        cls.record = os.path.join(cls.home.name, "record")
        Program("tesselDaemon", "--record", cls.record)
        wait_until("the status item", STATUS_ITEM.is_open)
        wait_until("an update", lambda: cls.recorded("menu.update sent"))
        x, y, width, height = STATUS_ITEM.frame()
        click(x + width // 2, y + height // 2)
        wait_until("the panel", PANEL.is_open)
        cls.panel = wait_until("the panel on the bus", cls.find_panel)
        cls.field = find(cls.panel, Atspi.Role.TEXT)
        cls.heard = []
        cls.listener = Atspi.EventListener.new(lambda event: cls.heard.append((event.type, event.source)))
        for kind in ("focus", "object:state-changed:focused", "object:property-change:accessible-description",
                     "object:children-changed"):
            cls.listener.register(kind)

    @classmethod
    def tearDownClass(cls):
        Program.end_all()
        cls.home.cleanup()

    @classmethod
    def recorded(cls, start):
        with open(cls.record, encoding="utf-8") as file:
            return "".join(line for line in file if line.startswith(start))

    @staticmethod
    def find_panel():
        desktop = Atspi.get_desktop(0)
        for index in range(desktop.get_child_count()):
            panel = find(desktop.get_child_at_index(index), Atspi.Role.FRAME, "Start menu")
            if panel:
                return panel
        return None

    def menu_list(self, name):
        self.panel.clear_cache()
        return find(self.panel, Atspi.Role.LIST, name)

    def await_event(self, what, condition):
        def heard():
            while GLib.MainContext.default().iteration(False):
                pass
            return any(condition(*event) for event in self.heard)
        wait_until(what, heard)

    def search(self, text, count):
        press("ctrl+a")
        type_text(text)
        wait_until(f"{count} results", lambda: self.field.get_description() == f"{count} results")

    def test_1_reads_panel_lists_and_states(self):
        self.assertTrue(has(self.panel, Atspi.StateType.SHOWING))
        self.assertEqual(self.field.get_name(), "Search applications")
        self.assertTrue(has(self.field, Atspi.StateType.FOCUSED))
        self.assertTrue(find(self.panel, Atspi.Role.PUSH_BUTTON, "All Programs"))
        self.assertTrue(find(self.panel, Atspi.Role.COMBO_BOX))
        places = rows(self.menu_list("Places and commands"))
        self.assertTrue(all(place.get_name() for place in places))
        folder = next(place for place in places if has(place, Atspi.StateType.EXPANDABLE))
        self.assertFalse(has(folder, Atspi.StateType.EXPANDED))
        folder.get_action_iface().do_action(0)
        wait_until("the folder to open", lambda: folder.clear_cache() or has(folder, Atspi.StateType.EXPANDED))

    def test_2_reads_ten_thousand_results_and_chooses_one(self):
        self.search("testing", APPLICATIONS)
        self.await_event("the count", lambda kind, source: "accessible-description" in kind and source == self.field)
        results = self.menu_list("Applications")
        wait_until("the rows", lambda: results.clear_cache() or results.get_child_count() >= APPLICATIONS)

        def read_all():
            """None when an update came in the middle: then some row was between the old list and the new."""
            found = rows(results)
            return found if len(found) == APPLICATIONS else None

        found = wait_until("every row", read_all)
        names = [row.get_name() for row in found]
        self.assertEqual(sorted(names), [f"Testing {number:05}" for number in range(APPLICATIONS)])
        self.assertFalse(has(found[-1], Atspi.StateType.SHOWING))

        press("Down")
        self.await_event("the focus", lambda kind, source: kind.startswith("object:state-changed:focused")
                         and source.get_name() == names[1])
        second = found[1]
        second.clear_cache()
        self.assertTrue(has(second, Atspi.StateType.SELECTED, Atspi.StateType.FOCUSED, Atspi.StateType.SHOWING))
        frame = second.get_component_iface().get_extents(Atspi.CoordType.SCREEN)
        x, y, width, height = PANEL.frame()
        self.assertTrue(x < frame.x < x + width and y < frame.y < y + height)
        hit = results.get_component_iface().get_accessible_at_point(frame.x + 30, frame.y + 5, Atspi.CoordType.SCREEN)
        self.assertEqual(hit.get_name(), names[1])

        self.search("testing 0999", 10)
        wait_until("fewer rows", lambda: results.clear_cache() or results.get_child_count() < 20)
        second.clear_cache()
        self.assertEqual(second.get_name(), "Testing 09991", "the position shows what is there now")
        self.assertFalse([event for event in self.heard if "children-changed" in event[0]])
        second.get_action_iface().do_action(0)
        wait_until("the action", lambda: "09991" in self.recorded("menu.onAction received"))
        wait_until("the panel to close", lambda: not PANEL.is_open())


if __name__ == "__main__":
    unittest.main(verbosity=2)
