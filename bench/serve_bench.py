"""serve_bench.py NVRCIM NVRSIMCTL [NUMBER...]: `wbemcli ei` of so many instances (64, 1,000 and 10,000 if none are named)
against `nvrcim serve`, and how much of its time the module has.

Prints the medians of several runs. It runs as root, or as a user who may make user namespaces.
"""

import http.client
import os
import pathlib
import re
import statistics
import subprocess
import sys
import tempfile
import time

NVRCIM, NVRSIMCTL = sys.argv[1:3]
RUNS = 7
CLASS = "NVRHBA_StorageVolume"
# Ports, targets and units of a target, by the number of volumes.
HOSTS = {64: (2, 4, 8), 1000: (4, 10, 25), 10000: (10, 20, 50)}
PRIVATE_ETC = pathlib.Path(__file__).parent.parent / "scripts/private_etc.sh"
REQUEST = ('<?xml version="1.0"?><CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="1" PROTOCOLVERSION="1.0"><SIMPLEREQ>'
           '<IMETHODCALL NAME="EnumerateInstances"><LOCALNAMESPACEPATH><NAMESPACE NAME="root"/><NAMESPACE NAME="norvane"/>'
           f'</LOCALNAMESPACEPATH><IPARAMVALUE NAME="ClassName"><CLASSNAME NAME="{CLASS}"/></IPARAMVALUE></IMETHODCALL>'
           '</SIMPLEREQ></MESSAGE></CIM>')


def milliseconds(action):
    start = time.perf_counter()
    action()
    return (time.perf_counter() - start) * 1000


class Served:
    """nvrcim serve over a simulated host, with its log."""

    def __init__(self, number, folder):
        ports, targets, luns = HOSTS[number]
        scenario, self._log = f"{folder}/host.toml", pathlib.Path(folder, "server.log")
        with open(scenario, "w", encoding="utf-8") as file:
            subprocess.run([NVRSIMCTL, "generate", "--ports", str(ports), "--targets", str(targets), "--luns", str(luns)],
                           stdout=file, check=True)
        self._server = subprocess.Popen(
            ["sh", str(PRIVATE_ETC), NVRCIM, "--scenario", scenario, "--server-log", str(self._log), "serve", "--port", "0"],
            stdout=subprocess.PIPE, text=True, env={**os.environ, "NVRSIM_SOCKET": f"{folder}/socket"})
        self.port = int(re.search(r":(\d+)/cimom", self._server.stdout.readline()).group(1))

    def end(self):
        self._server.terminate()
        self._server.wait()

    def by_wbemcli(self):
        with open(os.devnull, "w", encoding="utf-8") as nowhere:
            subprocess.run(["wbemcli", "ei", f"http://localhost:{self.port}/root/norvane:{CLASS}"], stdout=nowhere, check=True)

    def by_http(self):
        connection = http.client.HTTPConnection("localhost", self.port)
        connection.request("POST", "/cimom", REQUEST, {"Content-Type": "application/xml"})
        text = connection.getresponse().read()
        connection.close()
        return text.count(b"<VALUE.NAMEDINSTANCE>")

    def in_module(self):
        """Times of all enumerations so far, as the server's log has them."""
        return [float(found) for found in re.findall(rf"enumerateInstances {CLASS}: .* ([\d.]+) ms",
                                                     self._log.read_text(encoding="utf-8"))]


def main():
    print(f"{'instances':>9}  {'wbemcli ms':>10}  {'request ms':>10}  {'module ms':>9}  {'of wbemcli':>10}  {'of request':>10}")
    for number in [int(word) for word in sys.argv[3:]] or HOSTS:
        with tempfile.TemporaryDirectory() as folder:
            server = Served(number, folder)
            try:
                server.by_http()  # loads the module and reads the SAN
                found = server.by_http()
                before = len(server.in_module())
                by_wbemcli = [milliseconds(server.by_wbemcli) for _ in range(RUNS)]
                by_http = [milliseconds(server.by_http) for _ in range(RUNS)]
                in_module = server.in_module()[before:]
            finally:
                server.end()
        if found != number or len(in_module) != 2 * RUNS:
            sys.exit(f"{found} instances, {len(in_module)} enumerations")
        whole, request, module = (statistics.median(each) for each in (by_wbemcli, by_http, in_module))
        print(f"{found:9}  {whole:10.1f}  {request:10.1f}  {module:9.2f}  {module / whole:10.1%}  {module / request:10.1%}")


if __name__ == "__main__":
    main()
