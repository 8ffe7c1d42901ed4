"""Each room of the module includes only rooms on floors below its own, as the table of docs/architecture.md has them."""

import pathlib
import re
import sys
import unittest

SOURCE = pathlib.Path(sys.argv.pop(1))
# Stands with the class records, but belongs to what composes the module.
MODULE_TABLE = "classes/module_table.h"


def floors():
    """Rooms with their floors: {"agent": 4, ...}."""
    table = (SOURCE / "docs/architecture.md").read_text(encoding="utf-8")
    return {room: int(floor)
            for floor, rooms in re.findall(r"^\| (\d+) \| ([^|]*) \|", table, re.M)
            for room in re.findall(r"`([\w/]+)/`", rooms)}


FLOORS = floors()


def room(path):
    """The room of a file; None for one that is in no room of the module."""
    if path == MODULE_TABLE:
        return "classes/derivedObjects"
    return max((name for name in FLOORS if path.startswith(name + "/")), key=len, default=None)


def includes():
    """(file, included file) of all files of the rooms."""
    for name in FLOORS:
        for path in sorted((SOURCE / name).rglob("*")):
            if path.suffix in (".cpp", ".h"):
                for included in re.findall(r'^#\s*include "([^"]+)"', path.read_text(encoding="utf-8"), re.M):
                    yield str(path.relative_to(SOURCE)), included


class Floors(unittest.TestCase):
    def test_the_table_names_ten_rooms_that_exist(self):
        self.assertEqual(len(FLOORS), 10)
        for name in FLOORS:
            self.assertTrue((SOURCE / name).is_dir(), name)

    def test_nobody_includes_what_does_not_stand_below(self):
        count = 0
        for path, included in includes():
            own, other = room(path), room(included)
            if other in (None, own):
                continue
            count += 1
            self.assertGreater(FLOORS[own], FLOORS[other], f"{path} includes {included}")
        self.assertGreater(count, 500)


unittest.main()
