"""Serves a folder on the loopback address, to read and to write, until standard input ends.

    file_server.py http FOLDER
    file_server.py https FOLDER CERTIFICATE KEY
    file_server.py ftp FOLDER

The first line of the output is the port; then comes a line for each request: its method and path.
"""
import functools
import http.server
import os
import ssl
import sys
import threading


def say(line):
    print(line, flush=True)


class Files(http.server.SimpleHTTPRequestHandler):
    protocol_version = "HTTP/1.1"

    def do_PUT(self):
        size = int(self.headers["Content-Length"])
        with open(self.translate_path(self.path), "wb") as file:
            file.write(self.rfile.read(size))
        self.send_response(201)
        self.send_header("Content-Length", "0")
        self.end_headers()

    def do_GET(self):
        # A transfer that breaks off: the half of what was promised.
        if not self.path.startswith("/broken/"):
            super().do_GET()
            return
        self.send_response(200)
        self.send_header("Content-Length", "1000")
        self.end_headers()
        self.wfile.write(b"x" * 500)
        self.close_connection = True

    def log_message(self, *_):
        pass

    def log_request(self, *_):
        credentials = self.headers.get("Authorization", "-") if hasattr(self, "headers") else "-"
        say(self.requestline.rsplit(" ", 1)[0] + " " + credentials)


def web_server(folder, certificate=None, key=None):
    server = http.server.ThreadingHTTPServer(("127.0.0.1", 0), functools.partial(Files, directory=folder))
    if certificate:
        context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
        context.load_cert_chain(certificate, key)
        server.socket = context.wrap_socket(server.socket, server_side=True)
    return server, server.server_address[1]


def ftp_server(folder):
    import logging
    from pyftpdlib.authorizers import DummyAuthorizer
    from pyftpdlib.handlers import FTPHandler
    from pyftpdlib.servers import FTPServer

    logging.disable(logging.CRITICAL)
    authorizer = DummyAuthorizer()
    authorizer.add_anonymous(folder, perm="elradfmw")

    class Handler(FTPHandler):
        def on_file_sent(self, file):
            say("RETR " + os.path.basename(file))

        def on_file_received(self, file):
            say("STOR " + os.path.basename(file))

    Handler.authorizer = authorizer
    server = FTPServer(("127.0.0.1", 0), Handler)
    return server, server.socket.getsockname()[1]


def main():
    kind, folder, *more = sys.argv[1:]
    server, port = ftp_server(folder) if kind == "ftp" else web_server(folder, *more)
    threading.Thread(target=server.serve_forever, daemon=True).start()
    say(port)
    sys.stdin.read()
    os._exit(0)


main()
