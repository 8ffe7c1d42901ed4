"""docs/promises.md states each promise in a row of one table, with tests that exist; and its commands are commands."""

import pathlib
import re
import sys
import unittest

SOURCE = pathlib.Path(sys.argv.pop(1))
TEST = re.compile(r"^TEST(?:_[FP])?\(\s*(\w+),\s*(\w+)\)", re.M)
SECTIONS = ["Promises", "How it was tried", "Limitations"]


def written():
    """The tests of the sources, as "Suite.Name" and "Suite.*", and as CTest names what is not GoogleTest's."""
    names = set()
    for path in (SOURCE / "tests").rglob("*.cpp"):
        for suite, name in TEST.findall(path.read_text(encoding="utf-8")):
            names |= {f"{suite}.{name}", f"{suite}.*"}
    for room in ("tests", "bench"):
        for path in (SOURCE / room).rglob("CMakeLists.txt"):
            names |= set(re.findall(r"add_test\(NAME ([\w.]+)", path.read_text(encoding="utf-8")))
    fuzzers = (SOURCE / "fuzz/CMakeLists.txt").read_text(encoding="utf-8")
    return names | {"fuzz." + name for name in re.findall(r"^norvane_fuzzer\((\w+)", fuzzers, re.M)}


def sections():
    """(title, text) of each part of the page; what stands before the first one has the page's title."""
    page = (SOURCE / "docs/promises.md").read_text(encoding="utf-8")
    found = re.split(r"^#{1,2} (.*)\n", page, flags=re.M)
    assert not found[0], found[0]
    return list(zip(found[1::2], found[2::2]))


def rows(text):
    """The cells of each row of a part's tables."""
    lines = [line for line in text.splitlines() if line.startswith("|")]
    return [[cell.strip() for cell in line.strip("|").split(" | ")] for line in lines if not line.startswith("|---")]


class Promises(unittest.TestCase):
    def setUp(self):
        (self.title, self.preamble), *parts = sections()
        self.assertEqual([title for title, _ in parts], SECTIONS)
        self.parts = dict(parts)

    def test_stand_in_one_table_and_nowhere_else(self):
        self.assertEqual(self.preamble.strip(), "")
        text = self.parts["Promises"].strip()
        self.assertEqual(text.count("|---"), 2)
        lead, table = text.split("\n\n", 1)
        self.assertRegex(lead, "^Tests of GoogleTest are named")
        self.assertEqual([line for line in table.splitlines() if not re.fullmatch(r"\|.*\|", line)], [])

    def test_are_each_shown_by_tests_that_exist(self):
        known = written()
        self.assertGreater(len(known), 1000)
        head, *promises = rows(self.parts["Promises"])
        self.assertEqual(head, ["promise", "shown by"])
        self.assertGreaterEqual(len(promises), 15)
        for promise, tests in promises:
            self.assertRegex(tests, r"^`[\w.*]+`(, `[\w.*]+`)*$", promise)
            named = re.findall(r"`([^`]+)`", tests)
            self.assertEqual([test for test in named if test not in known], [], promise)
            self.assertEqual(len(named), len(set(named)), promise)
        self.assertEqual(len({promise for promise, _ in promises}), len(promises))

    def test_were_tried_by_commands_that_exist(self):
        head, *tried = rows(self.parts["How it was tried"])
        self.assertEqual(head, ["what", "how many", "command"])
        self.assertGreaterEqual(len(tried), 5)
        for what, _, command in tried:
            words = command.strip("`").split()
            while re.match(r"\w+=", words[0]):
                words.pop(0)
            path = words[0].removeprefix("build/release/")
            if path == words[0]:
                self.assertTrue((SOURCE / path).is_file(), what)
                continue
            folder, program = path.rsplit("/", 1)
            built = (SOURCE / folder / "CMakeLists.txt").read_text(encoding="utf-8")
            self.assertRegex(built, rf"(add_executable|norvane_test)\({program}\b", what)


unittest.main()
