"""norvane-provider-register against stand-ins of the servers' programs, which keep a state and write down each call."""

import json
import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import unittest

TOOL, DATA = sys.argv.pop(1), sys.argv.pop(1)

# A stand-in: notes its call, may be told to fail, and keeps what a server of its kind would keep in $WORLD/server.json.
STAND_IN = r'''#!/usr/bin/python3
import json, os, re, signal, sys
world = os.environ["WORLD"]
name, words = os.path.basename(sys.argv[0]), sys.argv[1:]
with open(world + "/calls", "a") as calls:
    calls.write(" ".join([name] + [os.path.basename(word) if word.startswith("/") else word for word in words]) + "\n")
if os.path.exists(world + "/fail-" + name):
    only = open(world + "/fail-" + name).read()
    if only in " ".join(words):
        sys.stdout.buffer.write(b"told to fail \xc3\xa9\xff\n")
        sys.exit(3)
if os.path.exists(world + "/end-" + name):
    os.unlink(world + "/end-" + name)
    os.kill(os.getppid(), signal.SIGTERM)
    signal.pause()
path = world + "/server.json"
state = json.load(open(path)) if os.path.exists(path) else {"stage": [], "modules": [], "classes": []}
if name == "sfcbstage":
    for word in words[2:]:
        if word != "-r" and [words[1], os.path.basename(word)] not in state["stage"]:
            assert os.path.isfile(word), word
            state["stage"].append([words[1], os.path.basename(word)])
elif name == "sfcbunstage":
    for word in words[2:]:
        if word != "-r":
            state["stage"].remove([words[1], word])
elif name == "cimprovider" and words == ["-l"]:
    print("\n".join(["OperatingSystemModule"] + state["modules"]))
elif name == "cimprovider" and words[0] == "-r":
    state["modules"].remove(words[2])
elif name == "cimmof":
    text = open(words[-1]).read()
    namespace = words[words.index("-n") + 1]
    for module in re.findall(r'instance of PG_ProviderModule \{\s+Name = "(\w+)"', text):
        state["modules"].append(module)
    for declared in re.findall(r"^class (\w+)", text, re.M):
        if [namespace, declared] not in state["classes"]:
            state["classes"].append([namespace, declared])
elif name == "cimcli" and words[0] == "nc":
    known = [declared for namespace, declared in state["classes"] if namespace == words[2]]
    if not known:
        sys.exit("no such namespace")
    print("\n".join(known))
elif name == "cimcli" and words[0] == "dc":
    state["classes"].remove([words[3], words[1]])
json.dump(state, open(path, "w"))
'''
SFCB = ("sfcbstage", "sfcbunstage", "sfcbrepos")
PEGASUS = ("cimmof", "cimprovider", "cimcli")
MODULE = "norvane_fc_provider"


def miniature(folder):
    """Class files of the same names with a few classes, since each class costs a call of a stand-in."""
    files = {
        "mof/00_qualifiers.mof": ("", []),
        "mof/10_schema.mof": ("", ["CIM_FCPort", "CIM_RegisteredProfile"]),
        "mof/20_module.mof": ("", ["NVRHBA_FCPort", "NVRHBA_RegisteredProfile"]),
        "interop/30_schema.mof": ("", ["CIM_RegisteredProfile"]),
        "interop/31_module.mof": ("", ["NVRHBA_RegisteredProfile"]),
        "pegasus/registration.mof": (f'instance of PG_ProviderModule {{\n    Name = "{MODULE}";\n}};\n', []),
        f"sfcb/{MODULE}.reg": ("[NVRHBA_FCPort]\n   namespace: root/norvane\n", []),
    }
    for name, (text, classes) in files.items():
        path = folder / name
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_text(text + "".join(f"class {declared} {{\n}};\n" for declared in classes), encoding="utf-8")
    lines = [f"{name} {declared}\n" for name, (_, classes) in files.items() for declared in classes]
    (folder / "classes.txt").write_text("".join(lines), encoding="utf-8")


class Register(unittest.TestCase):
    def setUp(self):
        self.world = pathlib.Path(tempfile.mkdtemp())
        self.addCleanup(shutil.rmtree, self.world)
        (self.world / "bin").mkdir()
        self.data = self.world / "data"
        miniature(self.data)

    def install(self, *programs):
        for program in programs:
            path = self.world / "bin" / program
            path.write_text(STAND_IN, encoding="utf-8")
            path.chmod(0o755)

    def fail(self, program, words=""):
        (self.world / f"fail-{program}").write_text(words, encoding="utf-8")

    def mend(self, program):
        (self.world / f"fail-{program}").unlink()

    def run_tool(self, *arguments, data=None, stdout=subprocess.PIPE, **environment):
        return subprocess.run(
            [sys.executable, TOOL, *arguments, "--data", data or self.data, "--state", self.world / "state/registered.json",
             "--log", self.world / "log"],
            env={"WORLD": str(self.world), "PATH": f"{self.world}/bin:/usr/bin:/bin", **environment},
            stdout=stdout, stderr=subprocess.PIPE, text=True, check=False)

    def everything(self):
        """All files of the world with their content, and all folders, but for what tells of runs."""
        return {path: path.read_bytes() if path.is_file() else None
                for path in self.world.rglob("*") if path.name not in ("log", "calls")}

    def calls(self):
        path = self.world / "calls"
        lines = path.read_text(encoding="utf-8").splitlines() if path.exists() else []
        path.unlink(missing_ok=True)
        return lines

    def server(self):
        path = self.world / "server.json"
        if not path.exists():
            return {"stage": [], "modules": [], "classes": []}
        return json.loads(path.read_text(encoding="utf-8"))

    def test_registered_twice_and_taken_back_nothing_is_left(self):
        self.install(*SFCB, *PEGASUS)
        (self.world / "server.json").write_text(json.dumps(
            {"stage": [["root/cimv2", "other.mof"]], "modules": ["Other"], "classes": [["root/PG_InterOp", "CIM_Other"]]}),
            encoding="utf-8")
        before = self.everything()
        for command in ("register", "register", "unregister"):
            self.assertEqual(self.run_tool(command).returncode, 0)
        self.assertEqual(self.everything(), before)

    def test_a_failure_leaves_nothing_either(self):
        self.install(*SFCB)
        (self.world / "server.json").write_text(json.dumps({"stage": [], "modules": [], "classes": []}), encoding="utf-8")
        self.fail("sfcbstage", "root/interop")
        before = self.everything()
        self.assertEqual(self.run_tool("register").returncode, 1)
        self.assertEqual(self.everything(), before)

    def test_what_is_broken_off_is_taken_back(self):
        self.install(*SFCB)
        (self.world / "end-sfcbrepos").write_text("", encoding="utf-8")
        self.assertEqual(self.run_tool("register").returncode, 1)
        self.assertEqual(self.server()["stage"], [])
        self.assertFalse(self.has_state())

    def test_taking_back_goes_on_where_it_failed(self):
        self.install(*SFCB)
        self.assertEqual(self.run_tool("register").returncode, 0)
        self.fail("sfcbunstage", "root/norvane")
        self.assertEqual(self.run_tool("unregister").returncode, 1)
        self.assertTrue(self.has_state())
        self.mend("sfcbunstage")
        self.calls()
        self.assertEqual(self.run_tool("unregister").returncode, 0)
        self.assertEqual([call.split()[:3] for call in self.calls()],
                         [["sfcbunstage", "-n", "root/norvane"], ["sfcbrepos", "-f"]])
        self.assertEqual(self.server()["stage"], [])

    def test_everybody_may_ask_for_the_status(self):
        self.install(*SFCB)
        self.assertEqual(self.run_tool("register").returncode, 0)
        self.assertEqual((self.world / "state/registered.json").stat().st_mode & 0o777, 0o644)

    def test_nobody_who_reads_the_words_and_words_that_cannot_be_printed_stop_nothing(self):
        self.install(*SFCB)
        reader, writer = os.pipe()
        os.close(reader)
        self.assertEqual(self.run_tool("register", stdout=writer).returncode, 0)
        os.close(writer)
        self.assertTrue(self.has_state())
        self.fail("sfcbunstage")
        done = self.run_tool("unregister", PYTHONIOENCODING="ascii")
        self.assertEqual(done.returncode, 1)
        self.assertIn("told to fail ", done.stderr)

    def test_a_namespace_is_a_name(self):
        self.install(*SFCB)
        for name in ("", "root/", "root norvane", 'root"; };', "root/../etc", "root\nprovider: other"):
            done = self.run_tool("register", "--namespace", name)
            self.assertEqual((done.returncode, name in done.stdout), (2, name == ""), done.stderr)
        self.assertEqual(self.calls(), [])

    def has_state(self):
        return (self.world / "state/registered.json").exists()

    def test_without_a_server_nothing_is_done_and_nothing_fails(self):
        for command in ("register", "unregister"):
            done = self.run_tool(command)
            self.assertEqual(done.returncode, 0, done.stderr)
            self.assertEqual(done.stdout, "No CIM server is installed on this host: nothing to do.\n")
        self.assertFalse((self.world / "state").exists())
        self.assertEqual(self.run_tool("status").stdout, "sfcb: not on this host\npegasus: not on this host\n")

    def test_a_server_that_is_asked_for_must_be_there(self):
        done = self.run_tool("register", "--server", "sfcb")
        self.assertEqual(done.returncode, 1)
        self.assertEqual(done.stderr, "The programs of sfcb are not on this host.\n")

    def test_sfcb_is_registered_once_and_taken_back_whole(self):
        self.install(*SFCB)
        first = self.run_tool("register")
        self.assertEqual(first.returncode, 0, first.stderr)
        self.assertEqual(self.calls(), [
            f"sfcbstage -n root/norvane -r {MODULE}.reg 10_schema.mof 20_module.mof",
            "sfcbstage -n root/interop 30_schema.mof 31_module.mof",
            "sfcbrepos -f"])
        self.assertEqual(self.run_tool("status").stdout, "sfcb: registered in root/norvane\npegasus: not on this host\n")

        again = self.run_tool("register")
        self.assertEqual((again.returncode, again.stdout), (0, "sfcb: registered already in root/norvane.\n"))
        self.assertEqual(self.calls(), [])

        back = self.run_tool("unregister")
        self.assertEqual(back.returncode, 0, back.stderr)
        self.assertEqual(self.calls(), [
            "sfcbunstage -n root/interop 30_schema.mof 31_module.mof",
            f"sfcbunstage -n root/norvane -r {MODULE}.reg 10_schema.mof 20_module.mof",
            "sfcbrepos -f"])
        self.assertEqual(self.server()["stage"], [])
        self.assertFalse(self.has_state())
        self.assertEqual(self.run_tool("unregister").stdout, "sfcb: was not registered.\n")

    def test_a_failed_rebuild_leaves_nothing_staged(self):
        self.install(*SFCB)
        self.fail("sfcbstage", "root/interop")
        done = self.run_tool("register")
        self.assertEqual(done.returncode, 1)
        self.assertIn("sfcb: not registered. sfcbstage ended with 3:\ntold to fail", done.stderr)
        self.assertEqual(self.server()["stage"], [])
        self.assertFalse(self.has_state())
        self.assertIn("told to fail", (self.world / "log").read_text(encoding="utf-8"))
        self.mend("sfcbstage")
        self.assertEqual(self.run_tool("register").returncode, 0)

    def test_pegasus_is_registered_once_and_taken_back_whole(self):
        self.install(*PEGASUS)
        first = self.run_tool("register", "--server", "pegasus")
        self.assertEqual(first.returncode, 0, first.stderr)
        self.assertEqual([call for call in self.calls() if call.startswith("cimmof")], [
            "cimmof -aE -aV -uc -n root/norvane 00_qualifiers.mof",
            "cimmof -aE -aV -uc -n root/norvane 10_schema.mof",
            "cimmof -aE -aV -uc -n root/norvane 20_module.mof",
            "cimmof -aE -n root/PG_InterOp 30_schema.mof",
            "cimmof -aE -n root/PG_InterOp 31_module.mof",
            "cimmof -n root/PG_InterOp registration.mof"])
        self.assertEqual(self.server()["modules"], [MODULE])
        self.assertIn(["root/norvane", "NVRHBA_FCPort"], self.server()["classes"])
        self.assertIn(["root/PG_InterOp", "NVRHBA_RegisteredProfile"], self.server()["classes"])

        self.assertEqual(self.run_tool("register").stdout, "pegasus: registered already in root/norvane.\n")
        self.assertEqual(self.calls(), [])

        back = self.run_tool("unregister")
        self.assertEqual(back.returncode, 0, back.stderr)
        self.assertEqual(self.server(), {"stage": [], "modules": [], "classes": []})
        self.assertFalse(self.has_state())

    def block_of(self, heading):
        """Runs the first block of shell code under a heading of the installation's page, with the stand-ins."""
        page = (pathlib.Path(__file__).parents[2] / "docs/install.md").read_text(encoding="utf-8")
        section = page[page.index(f"\n## {heading}\n"):]
        block = re.search(r"^```sh\n(.*?)^```", section, re.M | re.S).group(1)
        script = block.replace("data=/usr/share/norvane-fc-provider", f"data={self.data}")
        done = subprocess.run(["sh", "-e", "-c", script], capture_output=True, text=True, check=False,
                              env={"WORLD": str(self.world), "PATH": f"{self.world}/bin:/usr/bin:/bin"})
        self.assertEqual(done.returncode, 0, done.stderr)
        return self.calls()

    def test_the_page_shows_for_sfcb_what_the_command_does(self):
        self.install(*SFCB, "systemctl")
        by_hand = self.block_of("sfcb by hand")
        self.assertEqual(by_hand.pop(), "systemctl restart sblim-sfcb")
        (self.world / "server.json").unlink()
        self.assertEqual(self.run_tool("register").returncode, 0)
        self.assertEqual(by_hand, self.calls())

    def test_the_page_shows_for_pegasus_what_the_command_does(self):
        self.install(*PEGASUS)
        by_hand = self.block_of("OpenPegasus by hand")
        self.assertEqual(by_hand.pop(), "cimprovider -l")
        (self.world / "server.json").unlink()
        self.assertEqual(self.run_tool("register").returncode, 0)
        self.assertEqual(by_hand, [call for call in self.calls() if call.startswith("cimmof")])

    def test_classes_that_pegasus_had_before_stay(self):
        self.install(*PEGASUS)
        before = {"stage": [], "modules": [], "classes": [["root/PG_InterOp", "CIM_RegisteredProfile"]]}
        (self.world / "server.json").write_text(json.dumps(before), encoding="utf-8")
        self.assertEqual(self.run_tool("register").returncode, 0)
        self.assertEqual(self.run_tool("unregister").returncode, 0)
        self.assertEqual(self.server(), before)

    def test_pegasus_that_is_down_is_told_and_can_be_done_later(self):
        self.install(*PEGASUS)
        self.fail("cimprovider")
        done = self.run_tool("register")
        self.assertEqual(done.returncode, 1)
        self.assertEqual(done.stderr,
                         "pegasus: not registered. OpenPegasus does not answer: start its server and run this again.\n")
        self.assertFalse(self.has_state())
        self.mend("cimprovider")
        self.assertEqual(self.run_tool("register").returncode, 0)
        self.fail("cimprovider")
        self.assertEqual(self.run_tool("unregister").returncode, 1)
        self.assertTrue(self.has_state())
        self.mend("cimprovider")
        self.assertEqual(self.run_tool("unregister").returncode, 0)
        self.assertFalse(self.has_state())

    def test_an_older_registration_is_replaced(self):
        self.install(*SFCB)
        older = self.world / "older"
        shutil.copytree(self.data, older)
        with open(older / "mof/20_module.mof", "a", encoding="utf-8") as file:
            file.write("// older\n")
        self.assertEqual(self.run_tool("register", data=older).returncode, 0)
        self.assertIn("sfcb: registered in root/norvane, by an earlier version\n", self.run_tool("status").stdout)
        self.calls()
        self.assertEqual(self.run_tool("register").returncode, 0)
        self.assertEqual([call.split()[0] for call in self.calls()],
                         ["sfcbunstage", "sfcbunstage", "sfcbrepos", "sfcbstage", "sfcbstage", "sfcbrepos"])

    def test_both_servers_are_done_and_one_failure_does_not_stop_the_other(self):
        self.install(*SFCB, *PEGASUS)
        self.fail("sfcbrepos")
        done = self.run_tool("register")
        self.assertEqual(done.returncode, 1)
        self.assertEqual(self.server()["modules"], [MODULE])
        self.assertEqual(self.run_tool("status").stdout, "sfcb: not registered\npegasus: registered in root/norvane\n")

    def test_another_namespace_is_staged_under_its_name(self):
        self.install(*SFCB)
        self.assertEqual(self.run_tool("register", "--namespace", "root/cimv2", data=DATA).returncode, 0)
        self.assertIn(["root/cimv2", "20_module.mof"], self.server()["stage"])
        listed = self.run_tool("list", "--namespace", "root/cimv2", data=DATA).stdout.splitlines()
        self.assertEqual(len(listed), 141)
        self.assertIn("NVRHBA_FCPort root/cimv2", listed)
        self.assertIn("NVRHBA_RegisteredProfile root/cimv2 root/pg_interop root/interop", listed)

    def test_a_state_file_that_is_broken_or_cannot_be_written_stops_before_anything_is_done(self):
        self.install(*SFCB)
        (self.world / "state").mkdir()
        for content in ("{", "[]", '{"sfcb": 5}', '{"sfcb": {"done": {}}}',
                        '{"sfcb": {"namespace": "a", "fingerprint": "b", "done": {"staged": [{"namespace": 1}]}}}'):
            (self.world / "state/registered.json").write_text(content, encoding="utf-8")
            done = self.run_tool("register")
            self.assertEqual(done.returncode, 1)
            self.assertIn("Cannot read", done.stderr)
        shutil.rmtree(self.world / "state")
        (self.world / "state").write_text("a file", encoding="utf-8")
        self.assertIn("Cannot ", self.run_tool("register").stderr)
        self.assertEqual(self.calls(), [])

    def test_missing_class_files_are_told(self):
        self.install(*SFCB)
        done = self.run_tool("register", data=str(self.world))
        self.assertEqual((done.returncode, done.stderr), (1, f"There are no class files in {self.world}.\n"))

    def test_a_log_that_cannot_be_written_stops_nothing(self):
        self.install(*SFCB)
        (self.world / "log").mkdir()
        self.assertEqual(self.run_tool("register").returncode, 0)


unittest.main(verbosity=2)
