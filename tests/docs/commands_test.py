"""Each command that the documents show is run here, or by the test that is named for it.

nvrcim's lines are read whole by the command itself, and run over a simulated host; the others run where what they would
change is the test's own.
"""

import os
import pathlib
import re
import shlex
import shutil
import signal
import subprocess
import sys
import tempfile
import unittest

SOURCE, BUILD, NVRCIM, NVRSIMCTL = (pathlib.Path(sys.argv.pop(1)) for _ in range(4))
SMALL = "simulator/scenarios/small.toml"

# They run until they are told to end.
ENDLESS = re.compile(r" (serve|listen)( |$)")
# Real names of other hosts.
ELSEWHERE = re.compile(r"https://")
# Lines that other tests run, or that run the tests.
OTHERWISE = {
    "builds, and runs the tests": r"\./demo|\./check|cmake --preset release.*|cmake --build --preset release",
    "packaging.packages": r"\(cd build/release && cpack -G DEB\)|sudo apt install \S+\.deb|cmake --install build/release .*|"
                          r"(sudo )?norvane-provider-register (register|status)",
    "packaging.register": r"data=.*|(sfcbstage|sfcbrepos|systemctl|cimmof|cimprovider) .*|for file in .*cimmof.*",
}


def blocks():
    """The lines in blocks of shell code, and in the examples of the manual pages."""
    for page in sorted([SOURCE / "README.md", *(SOURCE / "docs").glob("*.md")]):
        for block in re.findall(r"^```sh\n(.*?)^```", page.read_text(encoding="utf-8"), re.M | re.S):
            yield page.name, block.replace("\\\n", " ")
    for page in (SOURCE / "host/nvrcim.1", SOURCE / "simulator/nvrsimctl.1"):
        examples = re.search(r"\.SH EXAMPLES\n\.nf\n(.*?)\.fi", page.read_text(encoding="utf-8"), re.S).group(1)
        yield page.name, examples.replace(r"\-", "-").replace(r"\(aq", "'").replace(r"\(dq", '"')


def lines():
    for page, block in blocks():
        for line in block.splitlines():
            line = re.sub(r"\s+# .*$", "", line).rstrip(" &")
            if line and not line.startswith("nvrcim="):
                yield page, line


def of_nvrcim():
    """What stands behind nvrcim's name in lines that begin with it."""
    for page, line in lines():
        found = re.match(r"(?:\$nvrcim|\S*/nvrcim|nvrcim) (.*)", line)
        if found:
            yield page, found.group(1)


class Commands(unittest.TestCase):
    def setUp(self):
        self.folder = pathlib.Path(tempfile.mkdtemp())
        self.addCleanup(shutil.rmtree, self.folder)
        (self.folder / "simulator").symlink_to(SOURCE / "simulator")
        (self.folder / "build").mkdir()
        (self.folder / "build/release").symlink_to(BUILD)
        for scenario in (SOURCE / "simulator/scenarios").iterdir():
            (self.folder / scenario.name).symlink_to(scenario)
        shutil.copytree("/etc", self.folder / "etc", symlinks=True, ignore=self.unreadable)

    @staticmethod
    def unreadable(folder, names):
        """Settings of the module start as none, and what the machine keeps to itself is of no use here."""
        wanted = {"hosts", "nsswitch.conf", "host.conf", "resolv.conf", "ld.so.cache", "passwd", "group", "fonts", "issue"}
        return [name for name in names if folder == "/etc" and name not in wanted]

    def private(self, script):
        """A script's words in a mount namespace whose /etc is the test's own: the module writes its settings there."""
        return ["unshare", "-m" if os.getuid() == 0 else "-rm", "sh", "-c", f"mount --bind etc /etc && {script}"]

    def run_script(self, script, **environment):
        return subprocess.run(self.private(script), cwd=self.folder, env={**os.environ, **environment}, input="y\n",
                              capture_output=True, text=True, timeout=120, check=False)

    def run_nvrcim(self, arguments):
        return self.run_script(f"exec '{NVRCIM}' {arguments}")

    def start(self, arguments, until, **environment):
        """An endless nvrcim, and the line of its output that tells that it is ready."""
        started = subprocess.Popen(self.private(f"exec '{NVRCIM}' --scenario {SMALL} {arguments} 2>&1"), cwd=self.folder,
                                   stdout=subprocess.PIPE, text=True, env={**os.environ, **environment})
        def end():
            started.send_signal(signal.SIGTERM)
            started.communicate(timeout=60)
        self.addCleanup(end)
        line = started.stdout.readline()
        self.assertIn(until, line)
        return line

    def shown(self, pattern):
        """The lines that the documents show of a kind; each kind must be there."""
        found = [line for _, line in lines() if re.fullmatch(pattern, line)]
        self.assertTrue(found, pattern)
        return found

    def test_every_line_is_known_to_a_test(self):
        here = [r"(\$nvrcim|\S*/nvrcim|nvrcim) .*", r"wbemcli .*", r"nvrsimctl .*", r"printf .*", r"LD_LIBRARY_PATH=.* program",
                r"unshare .*"]
        self.assertEqual([line for line in lines() if not any(
            re.fullmatch(pattern, line[1]) for pattern in [*here, *OTHERWISE.values()])], [])
        self.assertGreater(len(list(of_nvrcim())), 30)

    def test_each_of_nvrcim_is_understood(self):
        for page, arguments in of_nvrcim():
            with self.subTest(page=page, line=arguments):
                # The options are read before the module is looked for, which is not there.
                done = self.run_nvrcim(re.sub(r"--scenario \S+ ", "", arguments) + " --module /none/module.so")
                self.assertEqual(done.returncode, 64)
                self.assertIn("the module is unfit", done.stderr)

    def test_each_of_nvrcim_runs(self):
        for page, arguments in of_nvrcim():
            if ENDLESS.search(arguments) or ELSEWHERE.search(arguments):
                continue
            with self.subTest(page=page, line=arguments):
                if "--scenario" not in arguments:  # the host's own hardware
                    arguments = f"--scenario {SMALL} {arguments}"
                done = self.run_nvrcim(arguments)
                self.assertEqual(done.returncode, 0, done.stderr)
                self.assertTrue(done.stdout or " graph " in arguments)

    def test_the_page_of_field_names_has_each_column(self):
        page = (SOURCE / "docs/field-names.md").read_text(encoding="utf-8")
        for verb in ("ports", "paths"):
            rows = re.search(rf"^\| `nvrcim {verb}` \|.*\n\|[-|]+\n((?:\|.*\n)+)", page, re.M).group(1)
            named = [re.search(r"`(\w+)`", row.split("|")[2]).group(1) for row in rows.splitlines()]
            columns = self.run_nvrcim(f"--scenario {SMALL} {verb} --csv").stdout.splitlines()[0].split(",")
            self.assertEqual(named, columns)

    def test_clients_ask_a_server_of_ours(self):
        port = re.search(r":(\d+)/cimom", self.start("serve --port 0", "for trying and testing")).group(1)
        for line in self.shown(r"wbemcli .*"):
            done = subprocess.run(["sh", "-c", re.sub(r"localhost(:5988)?/", f"localhost:{port}/", line)],
                                  capture_output=True, text=True, check=False)
            self.assertIn("10000000C9A00001", done.stdout, line + done.stderr)

    def test_simulated_hardware_is_steered(self):
        socket = f"{self.folder}/sim.sock"
        self.start("listen", "listening", NVRSIM_SOCKET=socket)
        for line in self.shown(r"nvrsimctl .*"):
            with self.subTest(line=line):
                line = line.replace("/run/sim.sock", socket).replace("nvrsimctl ", f"'{NVRSIMCTL}' ", 1)
                done = self.run_script(line, NVRSIM_SOCKET=socket)
                self.assertEqual(done.returncode, 0, done.stderr)
        self.assertIn("[generate]", (self.folder / "large.toml").read_text(encoding="utf-8"))

    def test_any_program_sees_simulated_hardware(self):
        for line in self.shown(r"LD_LIBRARY_PATH=.* program"):
            done = self.run_script(line.replace(" program", f" '{NVRCIM}' enum NVRHBA_FCPort"))
            self.assertIn("10000000C9A00004", done.stdout, done.stderr)
        (self.folder / "etc/hba.conf").write_text("", encoding="utf-8")
        for line in self.shown(r"unshare .*"):
            done = self.run_script(line.replace("exec program", "cat /etc/hba.conf"))
            self.assertIn("libnvrsim_hba_vendor.so", done.stdout, done.stderr)

    def test_the_trace_is_switched_on(self):
        for line in self.shown(r"printf .*"):
            trace = self.folder / "norvane.trace"
            script = line.replace("sudo ", "").replace("/var/log/norvane.trace", str(trace))
            done = self.run_script(f"{script} && exec '{NVRCIM}' --scenario {SMALL} names NVRHBA_FCPort")
            self.assertEqual(done.returncode, 0, done.stderr)
            self.assertIn("Norvane Provider v", trace.read_text(encoding="utf-8", errors="replace"))


class LogWords(unittest.TestCase):
    MODULE = (BUILD / "lib/libnorvane_fc_provider.so").read_bytes()

    def pieces(self, words):
        """How many texts of the module the words are made of, longest first; none if some are not the module's."""
        count = 0
        while words:
            size = next((size for size in range(len(words), 2, -1) if words[:size].encode() in self.MODULE), None)
            if not size:
                return None
            words, count = words[size:], count + 1
        return count

    def test_the_words_to_look_for_are_those_that_the_module_logs(self):
        quoted = []
        for name in ("troubleshooting.md", "configuration.md"):
            page = re.sub(r"^```.*?^```", "", (SOURCE / "docs" / name).read_text(encoding="utf-8"), flags=re.M | re.S)
            quoted += [" ".join(words.split()) for words in re.findall(r'"([^"]{5,})"', page)]
        self.assertGreater(len(quoted), 25)
        for words in quoted:
            # What differs from case to case stands as "..." or within brackets.
            for part in re.split(r"\.\.\.|\[|\]", words):
                with self.subTest(words=words):
                    pieces = self.pieces(part)
                    self.assertIsNotNone(pieces)
                    self.assertLessEqual(pieces, 1 + len(part) // 12)

    def test_other_words_are_found_out(self):
        self.assertGreater(self.pieces("The adapter has gone fishing") or 99, 3)


if __name__ == "__main__":
    unittest.main()
