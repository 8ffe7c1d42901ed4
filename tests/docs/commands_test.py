"""Each nvrcim line that the documents show is one that the command understands; those over a scenario are run."""

import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import unittest

SOURCE, NVRCIM = pathlib.Path(sys.argv.pop(1)), sys.argv.pop(1)
# They run until they are told to end.
ENDLESS = re.compile(r" (serve|listen)( |$)")


def shown():
    """The lines with nvrcim in blocks of shell code, and in the examples of the manual page."""
    for page in sorted([SOURCE / "README.md", *(SOURCE / "docs").glob("*.md")]):
        for block in re.findall(r"^```sh\n(.*?)^```", page.read_text(encoding="utf-8"), re.M | re.S):
            for line in block.replace("\\\n", " ").splitlines():
                found = re.match(r"(?:\$nvrcim|\S*/nvrcim|nvrcim) (.*)", line)
                if found and not line.startswith("nvrcim="):
                    yield page.name, re.sub(r"\s+#.*$", "", found.group(1)).rstrip(" &")


class Commands(unittest.TestCase):
    def setUp(self):
        self.folder = pathlib.Path(tempfile.mkdtemp())
        self.addCleanup(shutil.rmtree, self.folder)
        (self.folder / "simulator").symlink_to(SOURCE / "simulator")
        shutil.copytree("/etc", self.folder / "etc", symlinks=True, ignore=self.unreadable)

    @staticmethod
    def unreadable(folder, names):
        """Settings of the module start as none, and what the machine keeps to itself is of no use here."""
        wanted = {"hosts", "nsswitch.conf", "host.conf", "resolv.conf", "ld.so.cache", "passwd", "group", "fonts", "issue"}
        return [name for name in names if folder == "/etc" and name not in wanted]

    def run_line(self, arguments):
        """In a mount namespace whose /etc is the test's own, since the module writes its settings there."""
        script = f"mount --bind etc /etc && exec '{NVRCIM}' {arguments}"
        return subprocess.run(["unshare", "-m" if self.is_root() else "-rm", "sh", "-c", script], cwd=self.folder,
                              input="y\n", capture_output=True, text=True, timeout=120, check=False)

    @staticmethod
    def is_root():
        return subprocess.run(["id", "-u"], capture_output=True, text=True, check=True).stdout == "0\n"

    def test_the_documents_show_some(self):
        self.assertGreater(len(list(shown())), 12)

    def test_each_is_understood(self):
        for page, arguments in shown():
            with self.subTest(page=page, line=arguments):
                # The options are read before the module is looked for, which is not there.
                done = self.run_line(re.sub(r"--scenario \S+ ", "", arguments) + " --module /none/module.so")
                self.assertEqual(done.returncode, 64)
                self.assertIn("the module is unfit", done.stderr)

    def test_those_over_a_scenario_run(self):
        for page, arguments in shown():
            if "--scenario" not in arguments or ENDLESS.search(arguments):
                continue
            with self.subTest(page=page, line=arguments):
                done = self.run_line(arguments)
                self.assertEqual(done.returncode, 0, done.stderr)
                self.assertTrue(done.stdout or " graph " in arguments)


if __name__ == "__main__":
    unittest.main()
