"""Each test that docs/promises.md names for a promise exists, and each promise of its table has one."""

import pathlib
import re
import sys
import unittest

SOURCE = pathlib.Path(sys.argv.pop(1))
TEST = re.compile(r"^TEST(?:_[FP])?\(\s*(\w+),\s*(\w+)\)", re.M)


def written():
    """The tests of the sources, as "Suite.Name"."""
    return {".".join(names)
            for path in (SOURCE / "tests").rglob("*.cpp")
            for names in TEST.findall(path.read_text(encoding="utf-8"))}


def promises():
    """(promise, tests named for it) of each row of the table."""
    page = (SOURCE / "docs/promises.md").read_text(encoding="utf-8")
    table = page.split("| promise |", 1)[1].split("\n\n", 1)[0]
    for row in table.splitlines()[2:]:
        promise, shown = row.strip("| ").split(" | ", 1)
        yield promise, re.findall(r"`(\w+\.\w+)`", shown)


class Promises(unittest.TestCase):
    def test_each_is_shown_by_tests_that_exist(self):
        known = written()
        self.assertGreater(len(known), 1000)
        count = 0
        for promise, tests in promises():
            count += 1
            self.assertTrue(tests, promise)
            self.assertEqual([test for test in tests if test not in known], [], promise)
        self.assertGreaterEqual(count, 5)


unittest.main()
