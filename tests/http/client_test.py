"""A client of the field, wbemcli, and raw CIM-XML against `nvrcim serve`, over a simulated host."""

import html
import http.server
import json
import os
import queue
import re
import shlex
import subprocess
import sys
import tempfile
import threading
import unittest

from served import NAMESPACE, PRIVATE, Server

NVRCIM, NVRSIMCTL, SCENARIO = sys.argv.pop(1), sys.argv.pop(1), sys.argv.pop(1)


def setUpModule():  # pylint: disable=invalid-name
    global SERVER  # pylint: disable=global-statement
    SERVER = Server(NVRCIM, SCENARIO)


def tearDownModule():  # pylint: disable=invalid-name
    SERVER.stop()


def request(*arguments, **options):
    return SERVER.request(*arguments, **options)


def wbemcli(*arguments):
    done = subprocess.run(["wbemcli", *arguments], capture_output=True, text=True, check=False)
    if done.returncode or "Exception" in done.stderr + done.stdout:
        raise AssertionError(f"wbemcli {arguments}: {done.stdout}{done.stderr}")
    return done.stdout.splitlines()


def url(path):
    return f"http://localhost:{SERVER.port}/{path}"


def object_url(line):
    """What wbemcli printed as a path, as its argument."""
    return "http://" + re.sub(r"^[^/]*", f"localhost:{SERVER.port}", line)


def names(class_name):
    return wbemcli("ein", url(f"{NAMESPACE}:{class_name}"))


def bare(lines):
    """Paths without the server's name, so that two ways to them can be compared."""
    return sorted(re.sub(r"^[^/]*/", "", line) for line in lines)


def told(words):
    """Without the quotes and escapes that the two set differently around references within paths."""
    return re.sub(r'[\\"]', "", words)


def told_value(value):
    """A value of nvrcim's JSON as wbemcli prints it."""
    if isinstance(value, list):
        return ",".join(told_value(each) for each in value)
    if isinstance(value, bool):
        return str(value).upper()
    return "" if value is None else told(str(value))


def listed_instances(lines):
    """What wbemcli -nl printed: the properties of each path."""
    found, last = {}, None
    for line in lines:
        if line.startswith("-"):
            name, _, value = line[1:].partition("=")
            last[name] = told(value)
        elif line:
            last = found.setdefault(told(bare([line])[0]), {})
    return found


def nvrcim_each(commands):
    """The answers to many commands, run where they share one copy of the settings."""
    with tempfile.TemporaryDirectory() as folder:
        nvrcim_json = [NVRCIM, "--scenario", SCENARIO, "--json"]
        script = "".join(f"{shlex.join([*nvrcim_json, *command])} >{folder}/{i} 2>/dev/null\n"
                         for i, command in enumerate(commands))
        subprocess.run([*PRIVATE, "sh"], input=script, text=True, check=False)
        answers = []
        for i, command in enumerate(commands):
            with open(f"{folder}/{i}", encoding="utf-8") as file:
                text = file.read()
            if not text.startswith("{"):
                raise AssertionError(f"nvrcim {command}: {text}")
            answers.append(json.loads(text))
        return answers


def nvrcim(*arguments):
    done = subprocess.run([*PRIVATE, NVRCIM, "--scenario", SCENARIO, "--json", *arguments], capture_output=True,
                          text=True, check=False)
    return json.loads(done.stdout)


def xml_instance(class_name, **properties):
    text = "".join(value if value.startswith("<") else
                   f'<PROPERTY NAME="{name}" TYPE="string"><VALUE>{html.escape(value)}</VALUE></PROPERTY>'
                   for name, value in properties.items())
    return f'<IPARAMVALUE NAME="NewInstance"><INSTANCE CLASSNAME="{class_name}">{text}</INSTANCE></IPARAMVALUE>'


class WithWbemcli(unittest.TestCase):
    def roots(self):
        return [record["class"] for record in nvrcim("classes", "--all")["classes"] if not record["superclass"]]

    def compare(self, instances, others):
        """Property by property, but for what differs between processes: times, and the simulator's folders."""
        self.assertEqual(sorted(instances), sorted(others))
        for path, properties in instances.items():
            expected = others[path]
            self.assertEqual(sorted(properties), sorted(expected), path)
            for name, value in properties.items():
                if name == "DumpDirectory" or all(re.fullmatch(r"\d{14}\.\d{6}[+-]\d{3}", each)
                                                  for each in (value, expected[name])):
                    continue
                if value != expected[name]:  # numbers of 32 bits are written with fewer digits
                    self.assertAlmostEqual(float(value), float(expected[name]), 6, f"{path}.{name}")

    def test_names_and_instances_of_every_class_are_those_that_nvrcim_tells(self):
        roots = self.roots()
        self.assertGreater(len(roots), 5)
        answers = nvrcim_each([[verb, root] for root in roots for verb in ("names", "enum")])
        total = 0
        for number, root in enumerate(roots):
            by_name, whole = answers[2 * number], answers[2 * number + 1]
            if by_name["status"]:
                for verb in ("ein", "ei"):
                    with self.assertRaisesRegex(AssertionError, re.escape(by_name["name"].removeprefix("CMPI_RC"))):
                        wbemcli(verb, url(f"{NAMESPACE}:{root}"))
                continue
            self.assertEqual(sorted(map(told, bare(names(root)))), sorted(map(told, by_name["paths"])), root)
            self.compare(listed_instances(wbemcli("-nl", "ei", url(f"{NAMESPACE}:{root}"))),
                         {told(each["path"]): {name: told_value(value) for name, value in each["properties"].items()}
                          for each in whole["instances"]})
            total += len(whole["instances"])
        self.assertGreater(total, 900)

    def test_an_instance_is_the_one_that_nvrcim_tells(self):
        path = names("NVRHBA_FCPort")[0]
        shown = wbemcli("-nl", "gi", object_url(path))[1:]
        values = dict(line[1:].split("=", 1) for line in shown if line.startswith("-"))
        told = nvrcim("get", bare([path])[0])["instance"]["properties"]
        for name in ("DeviceID", "ElementName", "Speed", "PermanentAddress", "PortType"):
            self.assertEqual(values[name].strip('"'), str(told[name]), name)

    def test_instances_come_with_the_properties_that_were_asked_for(self):
        only = wbemcli("-nl", "ei", url(f"{NAMESPACE}:NVRHBA_FCPort"), "DeviceID,Speed")
        self.assertEqual({line.split("=")[0] for line in only if line.startswith("-")}, {"-DeviceID", "-Speed"})

    def test_classes(self):
        self.assertIn("PermanentAddress", " ".join(wbemcli("gc", url(f"{NAMESPACE}:NVRHBA_FCPort"))))
        self.assertIn('<PROPERTY NAME="PermanentAddress" TYPE="string">',
                      " ".join(wbemcli("gcd", url(f"{NAMESPACE}:NVRHBA_FCPort"))))
        self.assertIn("CIM_ManagedElement", " ".join(wbemcli("ecn", url(f"{NAMESPACE}:"))))
        self.assertIn("NVRHBA_FCPort", " ".join(wbemcli("ec", url(f"{NAMESPACE}:CIM_FCPort"))))

    def traversals(self, start, among=None):
        """What wbemcli finds from an instance by associators and references, whose names must agree."""
        results = []
        for names_verb, verb, option in (("ain", "ai", "-ac"), ("rin", "ri", "-arc")):
            options = [option, among] if among else []
            found = listed_instances(wbemcli("-nl", verb, *options, object_url("x/" + start)))
            by_name = map(told, bare(wbemcli(names_verb, *options, object_url("x/" + start))))
            # Names tell of the host, whose instance another provider publishes.
            self.assertEqual(*({path.split(":", 1)[1] for path in paths if ":CIM_ComputerSystem." not in path}
                               for paths in (by_name, found)), (start, among))
            results.append(found)
        return results

    def test_traversals_of_every_association_class_are_those_that_nvrcim_tells(self):
        classes = [record["class"] for record in nvrcim("classes")["classes"] if "association" in record["kinds"]]
        self.assertGreater(len(classes), 80)
        starts, walked = {}, set()
        for name in classes:
            ends = instance_ends(name)
            if ends:
                walked.add(name)
            # Few starts, and none that only names tell of.
            ends = [end for end in ends or [] if ":CIM_ComputerSystem." not in end] or [bare(names("NVRHBA_FCPort"))[0]]
            starts[name] = ([end for end in ends if end in starts.values()] or ends)[0]
        self.assertGreater(len(walked), 60)
        different = sorted(set(starts.values()))
        answers = nvrcim_each([[verb, start] for start in different for verb in ("associators", "references")])
        whole = {}
        for number, start in enumerate(different):
            whole[start] = [{told(each["path"]): {name: told_value(value) for name, value in each["properties"].items()}
                             for each in answer["instances"]} for answer in answers[2 * number:2 * number + 2]]
            for found, expected in zip(self.traversals(start), whole[start]):
                self.compare(found, expected)
        for name, start in starts.items():
            others, links = self.traversals(start, name)
            for found, expected in zip((others, links), whole[start]):
                self.compare(found, {path: properties for path, properties in expected.items() if path in found})
            self.assertEqual(sorted(links), sorted(path for path in whole[start][1] if f":{name}." in path), name)
            self.assertEqual(bool(links), name in walked, name)

    def test_traversals_lead_from_one_end_to_the_other(self):
        near, far = instance_ends("NVRHBA_ControlledBy")
        for start, end in ((near, far), (far, near)):
            found = wbemcli("ain", "-ac", "NVRHBA_ControlledBy", object_url("x/" + start))
            self.assertIn(end.split(":", 1)[1], " ".join(line.split(":", 2)[-1] for line in found))
        role, other = "Antecedent", "Dependent"
        results = [wbemcli("ain", "-ac", "NVRHBA_ControlledBy", *options, object_url("x/" + near))
                   for options in ([], ["-ar", role], ["-ar", other], ["-arr", role], ["-arr", other])]
        self.assertTrue(results[0])
        # The start stands at one of the two ends.
        self.assertEqual(sorted(map(len, results[1:3])), [0, len(results[0])])
        self.assertEqual(results[1], results[4])
        self.assertEqual(results[2], results[3])
        self.assertEqual(results[0], wbemcli("ain", "-ac", "NVRHBA_ControlledBy", "-arc", "CIM_ManagedElement",
                                             object_url("x/" + near)))

    def test_what_is_not_served_is_told(self):
        with self.assertRaisesRegex(AssertionError, "CIM_ERR_NOT_SUPPORTED"):
            wbemcli("dc", url(f"{NAMESPACE}:NVRHBA_FCPort"))
        port = object_url(names("NVRHBA_FCPort")[0])
        for verb, arguments in (("di", [port]), ("ci", [port, 'DeviceID="1"'])):
            with self.assertRaisesRegex(AssertionError, "CIM_ERR_NOT_SUPPORTED"):
                wbemcli(verb, *arguments)

    def test_a_management_suite_finds_the_profiles_and_what_conforms_to_them(self):
        profiles = wbemcli("ein", url("root/pg_interop:CIM_RegisteredProfile"))
        self.assertEqual(sorted(bare(profiles)),
                         sorted(nvrcim("-n", "root/pg_interop", "names", "CIM_RegisteredProfile")["paths"]))
        self.assertEqual(len(wbemcli("ein", url("root/interop:CIM_RegisteredProfile"))), len(profiles))
        of_adapters = [line for line in profiles if line.endswith('"NVR:Storage HBA"')]
        self.assertEqual(len(of_adapters), 1, profiles)
        conforming = wbemcli("ain", "-ac", "CIM_ElementConformsToProfile", object_url(of_adapters[0]))
        self.assertEqual(sum(":NVRHBA_PortController." in line for line in conforming), 4, conforming)

    def test_failures_are_told_by_their_status(self):
        for arguments, code in ((("ein", url(f"{NAMESPACE}:NVRHBA_Nothing")), "CIM_ERR_INVALID_CLASS"),
                                (("ein", url("root/nowhere:NVRHBA_FCPort")), "CIM_ERR_INVALID_NAMESPACE"),
                                (("gi", url(f'{NAMESPACE}:NVRHBA_ProviderConfigSetting.InstanceID="none"')),
                                 "CIM_ERR_NOT_FOUND")):
            with self.assertRaisesRegex(AssertionError, code):
                wbemcli(*arguments)


class WithWbemcliAfterwards(unittest.TestCase):
    """What changes the state that the other tests compare; by its name it runs behind them."""

    def test_a_setting_is_changed_and_read_back(self):
        path = object_url([line for line in names("NVRHBA_ProviderConfigSetting") if "cachetimeout" in line][0])
        for minutes in ("20", "10"):
            wbemcli("sp", path, f"current={minutes}")
            self.assertIn(minutes, " ".join(wbemcli("gp", path, "current")))
            self.assertIn(f"-current={minutes}", wbemcli("-nl", "gi", path))

    def test_a_modified_instance_is_read_back(self):
        path = object_url([line for line in names("NVRHBA_ProviderConfigSetting") if "cachetimeout" in line][0])
        for minutes in ("21", "10"):
            wbemcli("mi", path, f"current={minutes}")
            self.assertIn(f"-current={minutes}", wbemcli("-nl", "gi", path))

    def test_methods_with_each_type_of_parameter_answer_as_they_do_nvrcim(self):
        port = bare(names("NVRHBA_FCPort")[:1])[0].split(":", 1)[1]
        log = [line for line in names("NVRHBA_RecordLog") if "ProviderLog" in line][0]
        services = {name: names(name)[0] for name in (
            "NVRHBA_FCHBAWWNService", "NVRHBA_FCHBADriverParamService", "NVRHBA_SoftwareInstallationService")}
        calls = [
            # numbers and a reference
            (services["NVRHBA_FCHBAWWNService"], "ReadWWN", ["Type=3", f"Target={port}"], 0),
            # booleans and texts
            (services["NVRHBA_FCHBADriverParamService"], "SetDriverParameter",
             ["bPermanent=false", "bGlobal=true", 'strParam="lun-queue-depth"', 'strValue="40"', f"Target={port}"], 0),
            # a date-time
            (log, "RequestStateChange", ["RequestedState=2", 'TimeoutPeriod="00000000000100.000000:000"'], None),
            # arrays: bytes that are no image
            (services["NVRHBA_SoftwareInstallationService"], "InstallFromByteStream",
             ["Image=1,2,3", f"Target={port}"], None),
        ]
        answers = nvrcim_each([
            ["call", bare([path])[0], method,
             *[re.sub(r"^Image=(.*)", r"Image=[\1]", argument) for argument in arguments]]
            for path, method, arguments, _ in calls])
        for (path, method, arguments, expected), answer in zip(calls, answers):
            answered = " ".join(wbemcli("cm", object_url(path), f"{method}.{','.join(arguments)}"))
            self.assertIn(f"{method}: {answer['returnValue']}", answered)
            if expected is not None:
                self.assertEqual(answer["returnValue"], expected, method)
            for name, value in answer["out"].items():
                if value is not None:
                    self.assertIn(told_value(value), told(answered), f"{method}, {name}")
        self.assertIn("10000000", json.dumps(answers[0]["out"]).replace(":", "").upper())
        as_xml = " ".join(wbemcli("cmx", object_url(services["NVRHBA_FCHBAWWNService"]),
                                  f"ReadWWN.Type=3,Target={port}"))
        self.assertIn('<RETURNVALUE PARAMTYPE="uint32"><VALUE>0</VALUE></RETURNVALUE>', as_xml)

    def test_a_filter_is_created_and_deleted(self):
        space = "root/pg_interop"
        keys = 'SystemCreationClassName="",SystemName="",CreationClassName="CIM_IndicationFilter",Name="by wbemcli"'
        path = url(f"{space}:CIM_IndicationFilter.{keys}")
        wbemcli("ci", path, f'{keys},Query="SELECT * FROM NVRHBA_AlertIndication",QueryLanguage="WQL"')
        with self.assertRaisesRegex(AssertionError, "CIM_ERR_ALREADY_EXISTS"):
            wbemcli("ci", path, keys)
        self.assertIn('-QueryLanguage="WQL"', wbemcli("-nl", "gi", path))
        self.assertEqual(len(wbemcli("ein", url(f"{space}:CIM_IndicationFilter"))), 1)
        wbemcli("di", path)
        with self.assertRaisesRegex(AssertionError, "CIM_ERR_NOT_FOUND"):
            wbemcli("di", path)


def instance_ends(association):
    """The two ends of an association's first instance, as "namespace:Class.keys"."""
    text = request("EnumerateInstances",
                   f'<IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="{association}"/></IPARAMVALUE>')
    for named in re.findall(r"<INSTANCENAME.*?<INSTANCE CLASSNAME", text):
        ends = re.findall(r"<LOCALINSTANCEPATH>(.*?)</LOCALINSTANCEPATH>", named)
        paths = [path_text(end) for end in ends[:2]]
        if len(paths) == 2:
            return paths
    return None


def path_text(xml):
    space = "/".join(re.findall(r'<NAMESPACE NAME="([^"]*)"', xml))
    class_name = re.search(r'CLASSNAME="([^"]*)"', xml).group(1)
    keys = [f'{name}={value}' if kind != "string" else f'{name}="{html.unescape(value)}"'
            for name, kind, value in re.findall(
                r'<KEYBINDING NAME="([^"]*)"><KEYVALUE VALUETYPE="([^"]*)">([^<]*)</KEYVALUE>', xml)]
    return f"{space}:{class_name}.{','.join(keys)}"


class Listener(http.server.BaseHTTPRequestHandler):
    received = queue.Queue()

    def do_POST(self):  # pylint: disable=invalid-name
        body = self.rfile.read(int(self.headers["Content-Length"])).decode()
        Listener.received.put((self.headers["CIMExportMethod"], body))
        self.send_response(200)
        self.send_header("Content-Length", "0")
        self.end_headers()

    def log_message(self, *_):  # pylint: disable=arguments-differ
        pass


class WithXml(unittest.TestCase):
    def create(self, class_name, **properties):
        text = request("CreateInstance", xml_instance(class_name, **properties), "root/pg_interop")
        return re.search(r"<INSTANCENAME.*</INSTANCENAME>", text).group(0)

    def delete(self, name):
        return request("DeleteInstance", f'<IPARAMVALUE NAME="InstanceName">{name}</IPARAMVALUE>', "root/pg_interop")

    def test_a_link_that_goes_down_reaches_a_subscriber(self):
        listener = http.server.HTTPServer(("localhost", 0), Listener)
        threading.Thread(target=listener.serve_forever, daemon=True).start()
        self.addCleanup(listener.server_close)
        self.addCleanup(listener.shutdown)
        filter_name = self.create("CIM_IndicationFilter", Name="links", QueryLanguage="WQL", SourceNamespace=NAMESPACE,
                                  Query="SELECT * FROM NVRHBA_AlertIndication")
        handler_name = self.create("CIM_ListenerDestinationCIMXML", Name="here",
                                   Destination=f"http://localhost:{listener.server_port}/")
        subscription = self.create(
            "CIM_IndicationSubscription",
            **{end: f'<PROPERTY.REFERENCE NAME="{end}"><VALUE.REFERENCE>{name}</VALUE.REFERENCE></PROPERTY.REFERENCE>'
               for end, name in (("Filter", filter_name), ("Handler", handler_name))})
        self.assertIn('ERROR CODE="1"', self.delete(filter_name), "a filter in use stays")

        port = re.search(r'DeviceID="(\w+)"', names("NVRHBA_FCPort")[0]).group(1)
        subprocess.run([NVRSIMCTL, "--socket", SERVER.socket, "link", "down", port], check=True)
        method, body = Listener.received.get(timeout=60)
        self.assertEqual(method, "ExportIndication")
        self.assertIn('<INSTANCE CLASSNAME="NVRHBA_AlertIndication">', body)

        for name in (subscription, filter_name, handler_name):
            self.assertNotIn("ERROR", self.delete(name))
        self.assertIn('ERROR CODE="6"', self.delete(filter_name))

    def test_a_method_takes_an_instance(self):
        def name_of(class_name, part):
            text = request("EnumerateInstanceNames",
                           f'<IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="{class_name}"/></IPARAMVALUE>')
            return [name for name in re.findall("<INSTANCENAME.*?</INSTANCENAME>", text) if part in name][0]

        def run(settings):
            reference = f"<VALUE.REFERENCE>{name_of('NVRHBA_PortController', '10000000C9A00001')}</VALUE.REFERENCE>"
            return request("RunDiagnosticService",
                           f'<PARAMVALUE NAME="ManagedElement" PARAMTYPE="reference">{reference}</PARAMVALUE>'
                           '<PARAMVALUE NAME="DiagnosticSettings" PARAMTYPE="string">'
                           f"<VALUE>{settings}</VALUE></PARAMVALUE>",
                           extrinsic=name_of("NVRHBA_FCHBADiagnosticTest", "Internal Loopback"))

        settings = ('<INSTANCE CLASSNAME="NVRHBA_FCHBADiagnosticSettingData"><PROPERTY NAME="InstanceID" TYPE="string">'
                    '<VALUE>NVR:FCHBA Internal Loopback Test</VALUE></PROPERTY>'
                    '<PROPERTY NAME="HaltOnError" TYPE="boolean"><VALUE>TRUE</VALUE></PROPERTY></INSTANCE>')
        for written in (html.escape(settings), f"<![CDATA[{settings}]]>"):
            answer = run(written)
            self.assertIn('<RETURNVALUE PARAMTYPE="uint32"><VALUE>0</VALUE></RETURNVALUE>', answer)
            self.assertIn('<PARAMVALUE NAME="Job" PARAMTYPE="reference"><VALUE.REFERENCE>', answer)
        for broken in (html.escape(settings[:-1]), html.escape(settings.replace("HaltOnError", "None")), "no instance",
                       html.escape(settings.replace("TRUE", "&x;")), html.escape(settings.replace("TRUE", "perhaps"))):
            self.assertIn('<ERROR CODE="4"', run(broken))

    def test_every_operation_answers_what_is_not_there(self):
        class_name = '<IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="NVRHBA_Nothing"/></IPARAMVALUE>'
        for operation in ("GetClass", "EnumerateInstances", "EnumerateInstanceNames", "EnumerateClasses",
                          "EnumerateClassNames"):
            self.assertIn('ERROR CODE="5"', request(operation, class_name), operation)
        for operation in ("GetInstance", "DeleteInstance", "GetProperty", "Associators", "References"):
            self.assertIn('ERROR CODE="4"', request(operation, ""), operation)


unittest.main(verbosity=2)
