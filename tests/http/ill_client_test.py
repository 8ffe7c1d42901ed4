"""Clients of `nvrcim serve` that mean ill: whatever they send, the next honest one is answered as before."""

import os
import re
import socket
import sys
import unittest
from html import escape

from served import Server, message, space_path

# The last: each how many of the classes are gone through, but for those who ask for all.
NVRCIM, SCENARIO, EACH = sys.argv.pop(1), sys.argv.pop(1), int(sys.argv.pop(1))
if "NVR_ALL" in os.environ:
    EACH = 1
HUGE = "A" * 1048576
TEXT = escape("%s%n%x \"'<&>")
PORTS = '<IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="NVRHBA_FCPort"/></IPARAMVALUE>'


def setUpModule():  # pylint: disable=invalid-name
    global SERVER, CLASSES  # pylint: disable=global-statement
    SERVER = Server(NVRCIM, SCENARIO)
    names = SERVER.request("EnumerateClassNames", parameter("DeepInheritance", "<VALUE>TRUE</VALUE>"))
    CLASSES = re.findall(r'<CLASSNAME NAME="(NVRHBA_\w+)"', names)
    assert len(CLASSES) == 141, CLASSES


def some_classes(first=0):
    return CLASSES[first % EACH::EACH]


def tearDownModule():  # pylint: disable=invalid-name
    SERVER.stop()


def parameter(name, inner):
    return f'<IPARAMVALUE NAME="{name}">{inner}</IPARAMVALUE>'


def bare_name(class_name, keys=""):
    return f'<INSTANCENAME CLASSNAME="{class_name}">{keys}</INSTANCENAME>'


def key(name, value):
    return f'<KEYBINDING NAME="{name}">{value}</KEYBINDING>'


def text_key(name, text):
    return key(name, f'<KEYVALUE VALUETYPE="string">{text}</KEYVALUE>')


def some_name(class_name):
    """The first instance's, or one that nobody has."""
    text = SERVER.ask("EnumerateInstanceNames", PORTS.replace("NVRHBA_FCPort", class_name))[2]
    # A name may hold names.
    named = re.search(r"<IRETURNVALUE>(<INSTANCENAME.*?</INSTANCENAME>)(?=<INSTANCENAME|</IRETURNVALUE>)", text, re.S)
    return named.group(1) if named else bare_name(class_name)


def declared(class_name):
    return SERVER.request("GetClass", PORTS.replace("NVRHBA_FCPort", class_name) +
                          parameter("LocalOnly", "<VALUE>FALSE</VALUE>"))


STRANGE_VALUES = [
    "", f"<VALUE>{TEXT}</VALUE>", "<VALUE/>", "<VALUE>-99999999999999999999999</VALUE>", "<VALUE.ARRAY/>",
    "<VALUE.ARRAY><VALUE>1</VALUE><VALUE.NULL/><VALUE>x</VALUE></VALUE.ARRAY>", "<VALUE.REFERENCE/>",
    "<VALUE.REFARRAY><VALUE.NULL/></VALUE.REFARRAY>",
    '<VALUE.REFERENCE><INSTANCENAME CLASSNAME="NVRHBA_Nothing"/></VALUE.REFERENCE>',
    '<VALUE.REFERENCE><CLASSNAME NAME="NVRHBA_FCPort"/></VALUE.REFERENCE>',
    f"<VALUE>{HUGE}</VALUE>",
    "<VALUE.ARRAY>" + "<VALUE>1</VALUE>" * 20000 + "</VALUE.ARRAY>",
]


class Asking(unittest.TestCase):
    def setUp(self):
        self.calls = 0

    def succeeds(self, what, operation, parameters, **options):
        """Whether it does. What fails is told as CIM tells it, or refused by HTTP as no request."""
        self.calls += 1
        status, headers, text = SERVER.ask(operation, parameters, **options)
        what = (what, operation, parameters[:200], status, text[:300])
        if status == 400:
            self.assertTrue(headers.get("CIMError"), what)
            return False
        self.assertEqual(status, 200, what)
        self.assertRegex(text, "<I?METHODRESPONSE NAME=[^>]*>"
                         "(<I?RETURNVALUE>|<RETURNVALUE |<PARAMVALUE |<ERROR CODE=|</I?METHODRESPONSE>)", what)
        return "<ERROR CODE=" not in text

    def fails(self, what, operation, parameters, **options):
        self.assertFalse(self.succeeds(what, operation, parameters, **options), (what, operation, parameters[:200]))


class WithIll(Asking):
    HEAD = b"POST /cimom HTTP/1.1\r\nHost: here\r\nContent-Type: application/xml\r\nConnection: close\r\n"

    def setUp(self):
        super().setUp()
        self.before = SERVER.request("EnumerateInstanceNames", PORTS)

    def tearDown(self):
        self.assertEqual(SERVER.request("EnumerateInstanceNames", PORTS), self.before)
        self.assertIsNone(SERVER.process.poll())

    def assert_status(self, data, status):
        """The status of the answer to these bytes; 0: there is none."""
        line = SERVER.raw(data)[:12]
        self.assertEqual(line, b"HTTP/1.1 %d" % status if status else b"", data[:300])

    def post(self, body):
        return self.HEAD + b"Content-Length: %d\r\n\r\n" % len(body) + body

    def test_lengths_that_lie(self):
        body = message(f'<IMETHODCALL NAME="EnumerateInstanceNames">{space_path()}{PORTS}</IMETHODCALL>')
        self.assert_status(self.post(body), 200)
        for length, status in ((b"0", 400), (b"1", 400), (b"%d" % (len(body) - 1), 400), (b"-1", 400), (b"+5", 400),
                               (b"0x10", 400), (b"ten", 400), (b"", 400), (b"18446744073709551615", 413),
                               (b"18446744073709551616", 413), (b"9" * 1000, 413),
                               (b"%d" % (len(body) + 1), 0)):  # it ends before it is whole
            self.assert_status(self.HEAD + b"Content-Length: " + length + b"\r\n\r\n" + body, status)
        chunked = self.HEAD + b"Transfer-Encoding: chunked\r\n\r\n"
        for chunks, status in ((b"zz\r\n", 400), (b"-1\r\n", 400), (b"5\r\nabcdefg\r\n0\r\n\r\n", 400),
                               (b"0\r\n\r\n", 400), (b"ffffffffffffffffff\r\nx", 413),
                               # A line without an end fills what libmicrohttpd has for a connection, which it takes
                               # for a fault of its own.
                               (b"5;" + b"x" * 100000, 500),
                               (b"", 0), (b"5\r\nab", 0)):  # as above
            self.assert_status(chunked + chunks, status)

    def test_heads_that_are_none(self):
        for head, status in ((b"POST /cimom HTTP/9.9\r\n\r\n", 505),
                             (b"POST /cimom HTTP/1.1\r\n: no name\r\n\r\n", 400),
                             (b"POST " + b"/" * 100000 + b" HTTP/1.1\r\n\r\n", 414),
                             (b"POST /cimom HTTP/1.1\r\n" + b"A: b\r\n" * 20000 + b"\r\n", 431),
                             (bytes(range(256)) * 100, 400),
                             (b"", 0), (b"\r\n" * 1000, 0), (b"\0" * 1000, 0), (b"GET", 0), (b"POST /cimom", 0),
                             (b"POST\r\n\r\n", 0), (b"\x16\x03\x01\x02\x00" * 50, 0)):
            self.assert_status(head, status)

    def test_bodies_that_are_none(self):
        entities = "".join(f'<!ENTITY e{i} "{f"&e{i - 1};" * 10 if i else "x" * 10}">' for i in range(20))
        for body in (b"", b"<", b"\0" * 1000, b"<CIM", b"<CIM>" * 100000, b"<" * 1000000, b"&" * 100000, b"]]>",
                     ("<CIM" + "".join(f' A{i}="b"' for i in range(100000)) + "/>").encode(),
                     message("x" * 1000000), message("<![CDATA["), message("<A>" * 50000 + "</A>" * 50000),
                     f"<!DOCTYPE CIM [{entities}]><CIM>&e19;</CIM>".encode(),
                     b'<!DOCTYPE CIM [<!ENTITY f SYSTEM "file:///etc/passwd">]><CIM>&f;</CIM>',
                     message('<IMETHODCALL NAME="EnumerateInstances"/>').decode().encode("utf-16"),
                     bytes(range(256)) * 1000):
            answer = SERVER.raw(self.post(body))
            self.assertRegex(answer[:12], rb"^HTTP/1\.1 (200|4\d\d|501)$", body[:100])
            self.assertNotIn(b"root:", answer)
            if answer.startswith(b"HTTP/1.1 200"):
                self.assertIn(b"<ERROR CODE=", answer, body[:100])

    def test_operations_that_nobody_knows(self):
        for name in ("", "NoSuchOperation", "x" * 100000, "&#0;", "../..", "EnumerateInstances&#x0a;X: y"):
            answer = SERVER.raw(self.post(message(f'<IMETHODCALL NAME="{name}">{space_path("root")}</IMETHODCALL>')))
            is_refused = answer.startswith((b"HTTP/1.1 400", b"HTTP/1.1 501"))
            self.assertTrue(b"<ERROR CODE=" in answer or is_refused, answer[:300])

    def test_more_connections_than_it_takes(self):
        connections = []
        try:
            for number in range(600):
                connections.append(socket.create_connection(("127.0.0.1", SERVER.port), timeout=60))
                try:
                    connections[-1].sendall(self.HEAD[:number % len(self.HEAD)])
                except (BrokenPipeError, ConnectionResetError):  # it has enough
                    pass
        finally:
            for connection in connections:
                connection.close()

    def strange_names(self, class_name, number):
        """What may stand where a name should. Each class gets a huge one of another make."""
        good = some_name(class_name)
        keys = re.findall(r'<KEYBINDING NAME="(\w+)"', good) or ["InstanceID"]
        nested = good
        for _ in range(20):
            nested = bare_name(class_name, key(keys[0], f"<VALUE.REFERENCE>{nested}</VALUE.REFERENCE>"))
        long = HUGE if number % 8 == 0 else HUGE[:20000]
        huge = [bare_name(class_name, text_key(keys[0], long)), bare_name(long),
                bare_name(class_name, text_key(long, "")),
                bare_name(class_name, "".join(text_key(f"K{i}", "") for i in range(20000)))]
        return [
            "", "<VALUE/>", f"<VALUE>{TEXT}</VALUE>", "<INSTANCENAME/>", '<CLASSNAME NAME=""/>',
            bare_name(class_name), bare_name("NVRHBA_Nothing", text_key("Name", "x")),
            bare_name(class_name, "<KEYBINDING/>"),
            bare_name(class_name, text_key("NoSuchKey", TEXT)), bare_name(class_name, text_key(keys[0], "")),
            bare_name(class_name, text_key(keys[0], TEXT)), bare_name(class_name, key(keys[0], "<VALUE.REFERENCE/>")),
            bare_name(class_name, key(keys[0], '<KEYVALUE VALUETYPE="numeric">-1e999</KEYVALUE>')),
            bare_name(class_name, text_key(keys[0], "x") * 2), nested, huge[number // 8 % len(huge)]]

    def test_names_that_are_none(self):
        roles = [parameter(name, inner) for name in ("AssocClass", "ResultClass", "Role", "ResultRole")
                 for inner in ("", "<VALUE/>", f"<VALUE>{TEXT}</VALUE>", '<CLASSNAME NAME=""/>',
                               '<CLASSNAME NAME="NVRHBA_Nothing"/>', "<VALUE.ARRAY/>")]
        named = parameter("PropertyName", "<VALUE>InstanceID</VALUE>")
        strange = parameter("NewValue", f"<VALUE>{TEXT}</VALUE>")
        for number, class_name in enumerate(some_classes()):
            for at, name in enumerate(self.strange_names(class_name, number)):
                given = parameter("InstanceName", name)
                role = roles[(number + at) % len(roles)]
                # Some classes have one instance whatever its keys.
                calls = [
                    (self.succeeds, "GetInstance", given),
                    (self.fails, "DeleteInstance", given),
                    (self.succeeds, "GetProperty", given + named),
                    (self.fails, "SetProperty", given + named + strange),
                    (self.fails, "ModifyInstance", parameter("ModifiedInstance", (
                        f'<VALUE.NAMEDINSTANCE>{name}<INSTANCE CLASSNAME="{class_name}"/></VALUE.NAMEDINSTANCE>'))),
                    *((self.succeeds, verb, parameter("ObjectName", name) + role)
                      for verb in ("Associators", "AssociatorNames", "References", "ReferenceNames"))]
                # A third of them each time, so that over the classes all are made with all names and roles.
                for ask, operation, parameters in calls[(number + at) % 3::3]:
                    ask((class_name, at), operation, parameters)
        self.assertGreater(self.calls, 6000 // EACH)

    def test_traversals_for_what_there_is_not(self):
        port = parameter("ObjectName", some_name("NVRHBA_FCPort"))
        classes = ["", "<CLASSNAME/>", '<CLASSNAME NAME="NVRHBA_Nothing"/>', f'<CLASSNAME NAME="{TEXT}"/>',
                   f'<CLASSNAME NAME="{HUGE}"/>', "<VALUE>NVRHBA_ControlledBy</VALUE>"]
        texts = ["", "<VALUE/>", f"<VALUE>{TEXT}</VALUE>", f"<VALUE>{HUGE}</VALUE>", "<VALUE.ARRAY/>"]
        lists = ["", "<VALUE/>", "<VALUE.ARRAY/>", f"<VALUE.ARRAY><VALUE>{HUGE}</VALUE></VALUE.ARRAY>",
                 "<VALUE.ARRAY>" + "<VALUE>x</VALUE>" * 20000 + "</VALUE.ARRAY>"]
        for verb, names in (("Associators", ("AssocClass", "ResultClass", "Role", "ResultRole", "PropertyList")),
                            ("AssociatorNames", ("AssocClass", "ResultClass", "Role", "ResultRole")),
                            ("References", ("ResultClass", "Role", "PropertyList")),
                            ("ReferenceNames", ("ResultClass", "Role"))):
            for name in names:
                for inner in classes if "Class" in name else lists if name == "PropertyList" else texts:
                    self.succeeds(name, verb, port + parameter(name, inner))
                self.fails(name, verb, port + parameter(name, "") * 2)
            self.fails("", verb, port + parameter("NoSuchParameter", ""))

    def test_queries(self):
        texts = ["", "<VALUE/>", "<VALUE>SELECT * FROM NVRHBA_FCPort</VALUE>", f"<VALUE>{TEXT}</VALUE>",
                 f"<VALUE>{HUGE}</VALUE>", "<VALUE.ARRAY/>"]
        self.fails("", "ExecQuery", "")
        for query in texts:
            for language in texts:
                self.fails("", "ExecQuery", parameter("QueryLanguage", language) + parameter("Query", query))

    def test_instances_that_are_none(self):
        for class_name in some_classes(1):
            name = some_name(class_name)
            properties = re.findall(r'<PROPERTY([.\w]*) NAME="(\w+)"', declared(class_name))
            instances = ["", "<INSTANCE/>", '<INSTANCE CLASSNAME="NVRHBA_Nothing"/>',
                         f'<INSTANCE CLASSNAME="{class_name}"/>',
                         f'<INSTANCE CLASSNAME="{class_name}"><PROPERTY NAME="NoSuchProperty"/></INSTANCE>']
            for value in STRANGE_VALUES[:-1]:
                others = value if len(value) < 1000 else ""  # one huge value will do
                whole = "".join(f'<PROPERTY{form} NAME="{each}">{others if at else value}</PROPERTY{form}>'
                                for at, (form, each) in enumerate(properties))
                instances.append(f'<INSTANCE CLASSNAME="{class_name}">{whole}</INSTANCE>')
            for at, instance in enumerate(instances):
                what = (class_name, at)
                self.fails(what, "CreateInstance", parameter("NewInstance", instance))
                self.succeeds(what, "ModifyInstance", parameter(
                    "ModifiedInstance", f"<VALUE.NAMEDINSTANCE>{name}{instance}</VALUE.NAMEDINSTANCE>"))
        self.assertGreater(self.calls, 4000 // EACH)

    def test_properties_that_are_none(self):
        names = ["", "<VALUE/>", f"<VALUE>{TEXT}</VALUE>", "<VALUE.ARRAY/>", f"<VALUE>{HUGE}</VALUE>"]
        for class_name in {*some_classes(2), "NVRHBA_FCPort", "NVRHBA_ProviderConfigSetting"}:
            name = parameter("InstanceName", some_name(class_name))
            properties = re.findall(r'<PROPERTY[.\w]* NAME="(\w+)"', declared(class_name))
            for inner in names if class_name in ("NVRHBA_FCPort", "NVRHBA_ProviderConfigSetting") else names[:-1]:
                named = name + parameter("PropertyName", inner)
                self.fails(class_name, "GetProperty", named)
                self.fails(class_name, "SetProperty", named + parameter("NewValue", ""))
            # Another strange value for each property, and all for those that can be set.
            for at, each in enumerate(properties):
                can_be_set = class_name in ("NVRHBA_ProviderConfigSetting", "NVRHBA_DumpData") or at == 0
                named = name + parameter("PropertyName", f"<VALUE>{each}</VALUE>")
                for value in STRANGE_VALUES if can_be_set else [STRANGE_VALUES[at % (len(STRANGE_VALUES) - 2)]]:
                    self.succeeds((class_name, each), "SetProperty", named + parameter("NewValue", value))


class WithIllAfterwards(Asking):
    """What may change the host; by its name it runs behind the others."""

    def statuses(self):
        answers = {name: SERVER.ask("EnumerateInstances", PORTS.replace("NVRHBA_FCPort", name))[2] for name in CLASSES}
        return {name: re.findall('<ERROR CODE="(\\d+)"', answer) for name, answer in answers.items()}

    def plausible(self, form, kind):
        """Something that a method may take."""
        value = {"boolean": "FALSE", "datetime": "00000000000001.000000:000",
                 "string": "10000000C9A0F001"}.get(kind, "1")
        if form == "PARAMETER":
            return f"<VALUE>{value}</VALUE>"
        if form == "PARAMETER.ARRAY":
            return f"<VALUE.ARRAY><VALUE>{value}</VALUE></VALUE.ARRAY>"
        port = f"<VALUE.REFERENCE>{self.port}</VALUE.REFERENCE>"
        return port if form == "PARAMETER.REFERENCE" else f"<VALUE.REFARRAY>{port}</VALUE.REFARRAY>"

    def test_arguments_of_every_method_are_missing_or_strange(self):
        before = self.statuses()
        self.port = some_name("NVRHBA_FCPort")
        called = set()
        for class_name in some_classes(CLASSES.index("NVRHBA_HelpService")):
            target = some_name(class_name)
            for method, inner in re.findall(r'<METHOD NAME="(\w+)".*?>(.*?)</METHOD>', declared(class_name), re.S):
                good = {name: self.plausible(form, re.search('TYPE="(\\w+)"', rest + 'TYPE="none"').group(1))
                        for form, name, rest in re.findall(r'<(PARAMETER[.\w]*) NAME="(\w+)"([^>]*)>', inner)}

                def call(what, arguments, ask=self.succeeds):
                    written = "".join(f'<PARAMVALUE NAME="{name}">{value}</PARAMVALUE>'
                                      for name, value in arguments.items())
                    ask((class_name, what), method, written, extrinsic=target)  # pylint: disable=cell-var-from-loop

                call("without arguments", {})
                call("with all", good)
                call("with one more", {**good, "NoSuchParameter": "<VALUE/>"}, self.fails)
                for name in good:
                    call(f"without {name}", {other: value for other, value in good.items() if other != name})
                    for at, value in enumerate(STRANGE_VALUES):
                        call(f"{name} = strange value {at}", {**good, name: value})
                self.succeeds(class_name, method, "", extrinsic=f'<CLASSNAME NAME="{class_name}"/>')
                called.add((class_name, method))
            self.fails(class_name, "NoSuchMethod", "", extrinsic=target)
        self.assertIn(("NVRHBA_HelpService", "GetHelp"), called)
        self.assertGreater(len(called), 150 // EACH // 2)
        self.assertGreater(self.calls, 3000 // EACH // 2)
        self.assertEqual(self.statuses(), before)
        self.assertIsNone(SERVER.process.poll())


unittest.main(verbosity=2)
