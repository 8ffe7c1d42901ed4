"""A client of the field, wbemcli, and raw CIM-XML against `nvrcim serve`, over a simulated host."""

import html
import http.client
import http.server
import json
import os
import queue
import re
import shutil
import subprocess
import sys
import tempfile
import threading
import unittest

NVRCIM, NVRSIMCTL, SCENARIO = sys.argv.pop(1), sys.argv.pop(1), sys.argv.pop(1)
NAMESPACE = "root/norvane"
# The module keeps its settings in /etc when it goes.
PRIVATE = ["sh", os.path.join(os.path.dirname(os.path.abspath(__file__)), "../../scripts/private_etc.sh"), NVRCIM]


def setUpModule():  # pylint: disable=invalid-name
    global SERVER, PORT, WORK  # pylint: disable=global-statement
    WORK = tempfile.mkdtemp()
    SERVER = subprocess.Popen(
        [*PRIVATE, "--scenario", SCENARIO, "serve", "--port", "0"], stdout=subprocess.PIPE, text=True,
        env={**os.environ, "NVRSIM_SOCKET": WORK + "/socket"})
    first = SERVER.stdout.readline()
    assert "for trying and testing" in first, first
    PORT = int(re.search(r":(\d+)/cimom", first).group(1))


def tearDownModule():  # pylint: disable=invalid-name
    SERVER.terminate()
    status = SERVER.wait(60)
    shutil.rmtree(WORK)
    assert status == 0, f"nvrcim serve ended with {status}"


def wbemcli(*arguments):
    done = subprocess.run(["wbemcli", *arguments], capture_output=True, text=True, check=False)
    if done.returncode or "Exception" in done.stderr + done.stdout:
        raise AssertionError(f"wbemcli {arguments}: {done.stdout}{done.stderr}")
    return done.stdout.splitlines()


def url(path):
    return f"http://localhost:{PORT}/{path}"


def object_url(line):
    """What wbemcli printed as a path, as its argument."""
    return "http://" + re.sub(r"^[^/]*", f"localhost:{PORT}", line)


def names(class_name):
    return wbemcli("ein", url(f"{NAMESPACE}:{class_name}"))


def bare(lines):
    """Paths without the server's name, so that two ways to them can be compared."""
    return sorted(re.sub(r"^[^/]*/", "", line) for line in lines)


def nvrcim(*arguments):
    done = subprocess.run([*PRIVATE, "--scenario", SCENARIO, "--json", *arguments], capture_output=True, text=True,
                          check=False)
    return json.loads(done.stdout)


def request(operation, parameters, namespace=NAMESPACE, extrinsic=None):
    spaces = "".join(f'<NAMESPACE NAME="{part}"/>' for part in namespace.split("/"))
    spaces = f"<LOCALNAMESPACEPATH>{spaces}</LOCALNAMESPACEPATH>"
    if extrinsic:
        inner = (f'<METHODCALL NAME="{operation}"><LOCALINSTANCEPATH>{spaces}{extrinsic}</LOCALINSTANCEPATH>'
                 f"{parameters}</METHODCALL>")
    else:
        inner = f'<IMETHODCALL NAME="{operation}">{spaces}{parameters}</IMETHODCALL>'
    body = ('<?xml version="1.0" encoding="utf-8"?><CIM CIMVERSION="2.0" DTDVERSION="2.0">'
            f'<MESSAGE ID="1" PROTOCOLVERSION="1.0"><SIMPLEREQ>{inner}</SIMPLEREQ></MESSAGE></CIM>')
    connection = http.client.HTTPConnection("localhost", PORT, timeout=60)
    connection.request("POST", "/cimom", body.encode(), {
        "Content-Type": 'application/xml; charset="utf-8"', "CIMOperation": "MethodCall", "CIMMethod": operation,
        "CIMObject": namespace.replace("/", "%2F")})
    answer = connection.getresponse()
    text = answer.read().decode()
    connection.close()
    if answer.status != 200:
        raise AssertionError(f"{answer.status} {answer.headers.get('CIMError')}: {text}")
    return text


def xml_instance(class_name, **properties):
    text = "".join(value if value.startswith("<") else
                   f'<PROPERTY NAME="{name}" TYPE="string"><VALUE>{html.escape(value)}</VALUE></PROPERTY>'
                   for name, value in properties.items())
    return f'<IPARAMVALUE NAME="NewInstance"><INSTANCE CLASSNAME="{class_name}">{text}</INSTANCE></IPARAMVALUE>'


class WithWbemcli(unittest.TestCase):
    def test_names_of_every_class_are_those_that_nvrcim_tells(self):
        roots = [record["class"] for record in nvrcim("classes", "--all")["classes"] if not record["superclass"]]
        self.assertGreater(len(roots), 5)
        total = 0
        for root in roots:
            answer = nvrcim("names", root)
            if answer["status"]:
                with self.assertRaisesRegex(AssertionError, re.escape(answer["name"].removeprefix("CMPI_RC"))):
                    names(root)
                continue
            listed, told = bare(names(root)), answer["paths"]
            # The two write the path of a reference within a path with and without quotes.
            self.assertEqual(*(sorted(re.sub(r'[\\"]', "", path) for path in paths) for paths in (listed, told)), root)
            total += len(listed)
        self.assertGreater(total, 500)

    def test_an_instance_is_the_one_that_nvrcim_tells(self):
        path = names("NVRHBA_FCPort")[0]
        shown = wbemcli("-nl", "gi", object_url(path))[1:]
        values = dict(line[1:].split("=", 1) for line in shown if line.startswith("-"))
        told = nvrcim("get", bare([path])[0])["instance"]["properties"]
        for name in ("DeviceID", "ElementName", "Speed", "PermanentAddress", "PortType"):
            self.assertEqual(values[name].strip('"'), str(told[name]), name)

    def test_instances_come_with_all_their_properties(self):
        shown = wbemcli("-nl", "ei", url(f"{NAMESPACE}:NVRHBA_FCPort"))
        self.assertEqual(sum(line.startswith("-DeviceID=") for line in shown), 4)
        only = wbemcli("-nl", "ei", url(f"{NAMESPACE}:NVRHBA_FCPort"), "DeviceID,Speed")
        self.assertEqual({line.split("=")[0] for line in only if line.startswith("-")}, {"-DeviceID", "-Speed"})

    def test_classes(self):
        self.assertIn("PermanentAddress", " ".join(wbemcli("gc", url(f"{NAMESPACE}:NVRHBA_FCPort"))))
        self.assertIn("CIM_ManagedElement", " ".join(wbemcli("ecn", url(f"{NAMESPACE}:"))))
        self.assertIn("NVRHBA_FCPort", " ".join(wbemcli("ec", url(f"{NAMESPACE}:CIM_FCPort"))))

    def test_a_setting_is_changed_and_read_back(self):
        path = object_url([line for line in names("NVRHBA_ProviderConfigSetting") if "cachetimeout" in line][0])
        for minutes in ("20", "10"):
            wbemcli("sp", path, f"current={minutes}")
            self.assertIn(minutes, " ".join(wbemcli("gp", path, "current")))
            self.assertIn(f"-current={minutes}", wbemcli("-nl", "gi", path))

    def test_a_method_with_a_reference_and_numbers(self):
        service = object_url(names("NVRHBA_FCHBAWWNService")[0])
        port = bare(names("NVRHBA_FCPort")[:1])[0].split(":", 1)[1]
        answered = " ".join(wbemcli("cm", service, f"ReadWWN.Type=3,Target={port}"))
        self.assertIn("ReadWWN: 0", answered)
        self.assertIn("10000000", answered.replace(":", "").upper())

    def test_traversals_of_every_association_class_lead_from_one_end_to_the_other(self):
        walked = 0
        for record in nvrcim("classes")["classes"]:
            if "association" not in record["kinds"]:
                continue
            name = record["class"]
            ends = instance_ends(name)
            if not ends:
                continue
            walked += 1
            for near, far in (ends, ends[::-1]):
                found = wbemcli("ain", "-ac", name, object_url("x/" + near))
                self.assertIn(far.split(":", 1)[1], " ".join(line.split(":", 2)[-1] for line in found), name)
                self.assertTrue(wbemcli("rin", "-arc", name, object_url("x/" + near)), name)
            self.assertTrue(wbemcli("-nl", "ai", "-ac", name, object_url("x/" + ends[0])), name)
            self.assertTrue(wbemcli("-nl", "ri", "-arc", name, object_url("x/" + ends[0])), name)
        self.assertGreater(walked, 40)

    def test_failures_are_told_by_their_status(self):
        for arguments, code in ((("ein", url(f"{NAMESPACE}:NVRHBA_Nothing")), "CIM_ERR_INVALID_CLASS"),
                                (("ein", url("root/nowhere:NVRHBA_FCPort")), "CIM_ERR_INVALID_NAMESPACE"),
                                (("gi", url(f'{NAMESPACE}:NVRHBA_ProviderConfigSetting.InstanceID="none"')),
                                 "CIM_ERR_NOT_FOUND")):
            with self.assertRaisesRegex(AssertionError, code):
                wbemcli(*arguments)


def instance_ends(association):
    """The two ends of an association's first instance whose ends exist, as "namespace:Class.keys"."""
    text = request("EnumerateInstances", f'<IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="{association}"/></IPARAMVALUE>')
    for named in re.findall(r"<INSTANCENAME.*?<INSTANCE CLASSNAME", text):
        ends = re.findall(r"<LOCALINSTANCEPATH>(.*?)</LOCALINSTANCEPATH>", named)
        paths = [path_text(end) for end in ends[:2]]
        # Hosts and foreign profiles are published by other providers.
        if len(paths) == 2 and not any("CIM_ComputerSystem." in path for path in paths):
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
        subprocess.run([NVRSIMCTL, "--socket", WORK + "/socket", "link", "down", port], check=True)
        method, body = Listener.received.get(timeout=60)
        self.assertEqual(method, "ExportIndication")
        self.assertIn('<INSTANCE CLASSNAME="NVRHBA_AlertIndication">', body)

        for name in (subscription, filter_name, handler_name):
            self.assertNotIn("ERROR", self.delete(name))
        self.assertIn('ERROR CODE="6"', self.delete(filter_name))

    def test_every_operation_answers_what_is_not_there(self):
        class_name = '<IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="NVRHBA_Nothing"/></IPARAMVALUE>'
        for operation in ("GetClass", "EnumerateInstances", "EnumerateInstanceNames", "EnumerateClasses",
                          "EnumerateClassNames"):
            self.assertIn('ERROR CODE="5"', request(operation, class_name), operation)
        for operation in ("GetInstance", "DeleteInstance", "GetProperty", "Associators", "References"):
            self.assertIn('ERROR CODE="4"', request(operation, ""), operation)


unittest.main(verbosity=2)
