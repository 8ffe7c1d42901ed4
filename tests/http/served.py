"""`nvrcim serve` over a simulated host, for as long as a test asks it."""

import http.client
import os
import re
import shutil
import socket
import subprocess
import tempfile

NAMESPACE = "root/norvane"
# The module keeps its settings in /etc when it goes.
PRIVATE = ["sh", os.path.join(os.path.dirname(os.path.abspath(__file__)), "../../scripts/private_etc.sh")]


def space_path(namespace=NAMESPACE):
    spaces = "".join(f'<NAMESPACE NAME="{part}"/>' for part in namespace.split("/"))
    return f"<LOCALNAMESPACEPATH>{spaces}</LOCALNAMESPACEPATH>"


def message(inner):
    """The body of a request for this call."""
    return ('<?xml version="1.0" encoding="utf-8"?><CIM CIMVERSION="2.0" DTDVERSION="2.0">'
            f'<MESSAGE ID="1" PROTOCOLVERSION="1.0"><SIMPLEREQ>{inner}</SIMPLEREQ></MESSAGE></CIM>').encode()


class Server:
    def __init__(self, nvrcim, scenario):
        self.work = tempfile.mkdtemp()
        self.socket = self.work + "/socket"  # of the simulated hardware
        self.process = subprocess.Popen(
            [*PRIVATE, nvrcim, "--scenario", scenario, "serve", "--port", "0"], stdout=subprocess.PIPE, text=True,
            env={**os.environ, "NVRSIM_SOCKET": self.socket})
        first = self.process.stdout.readline()
        assert "for trying and testing" in first and "http://127.0.0.1:" in first, first
        self.port = int(re.search(r":(\d+)/cimom", first).group(1))

    def stop(self):
        self.process.terminate()
        status = self.process.wait(60)
        self.process.stdout.close()
        shutil.rmtree(self.work)
        assert status == 0, f"nvrcim serve ended with {status}"

    def ask(self, operation, parameters, namespace=NAMESPACE, extrinsic=None):
        """The HTTP status of an answer, its headers and its text; `extrinsic` is the path of a method's object."""
        if extrinsic is None:
            inner = f'<IMETHODCALL NAME="{operation}">{space_path(namespace)}{parameters}</IMETHODCALL>'
        else:
            form = "LOCALCLASSPATH" if extrinsic.startswith("<CLASSNAME") else "LOCALINSTANCEPATH"
            inner = (f'<METHODCALL NAME="{operation}"><{form}>{space_path(namespace)}{extrinsic}</{form}>'
                     f"{parameters}</METHODCALL>")
        connection = http.client.HTTPConnection("localhost", self.port, timeout=300)
        connection.request("POST", "/cimom", message(inner), {
            "Content-Type": 'application/xml; charset="utf-8"', "CIMOperation": "MethodCall", "CIMMethod": operation,
            "CIMObject": namespace.replace("/", "%2F")})
        answer = connection.getresponse()
        text = answer.read().decode()
        connection.close()
        return answer.status, answer.headers, text

    def request(self, operation, parameters, namespace=NAMESPACE, extrinsic=None):
        status, headers, text = self.ask(operation, parameters, namespace, extrinsic)
        if status != 200:
            raise AssertionError(f"{status} {headers.get('CIMError')}: {text}")
        return text

    def raw(self, data):
        """All that comes back for these bytes."""
        with socket.create_connection(("127.0.0.1", self.port), timeout=300) as connection:
            answer = b""
            try:
                connection.sendall(data)
                connection.shutdown(socket.SHUT_WR)
            except (BrokenPipeError, ConnectionResetError):  # it does not read on
                pass
            try:
                while part := connection.recv(65536):
                    answer += part
            except ConnectionResetError:
                pass
        return answer
