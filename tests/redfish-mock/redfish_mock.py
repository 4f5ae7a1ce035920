#!/usr/bin/env python3
"""A Redfish service for the tests of the redfish: source, on the loopback interface.

Written for these tests with Python's standard library alone (http.server and ssl); the resources
it serves are the JSON files of services/, written after the published Redfish schema. It serves
HTTPS with keep-alive, asks for HTTP Basic authentication everywhere but the service root, and
misbehaves on request, so that the tests can show what the provider makes of every kind of
answer. Nothing it serves is ever changed: it answers GET and refuses every other method.

Commands:
  pki DIR
      Makes the certificates the tests use, with the openssl command: two authorities (ca.pem,
      other-ca.pem), and for 127.0.0.1, ::1 and localhost a server certificate of each
      (server.pem, other-server.pem), plus one of the first authority for another name
      (wrong-name.pem); the servers share the key server.key.
  serve --service FILE --cert FILE --key FILE --ready-fd N --events FILE [options]
      Serves FILE on a free loopback port, writes the port and a line end to the inherited file
      descriptor N once it listens (and closes it, so a reader that gets no port knows the mock
      ended before it listened), and
      appends one line per event to --events: "connect" for every TLS handshake, "handshake-failed
      <why>", "<METHOD> <path> <status>" for every request.
        --user/--password  the account it accepts (default reader / reader-pass)
        --behave PATH=KIND  how PATH misbehaves (repeatable):
            status:<code>         answers with that HTTP status and a Redfish error body
            slow:<seconds>        answers after that many seconds
            oversized             a 2 MiB body, with its Content-Length
            oversized-chunked     a 2 MiB body in chunks, without a length
            truncated             the first half of the resource's JSON
            redirect:<url>        302 to <url> ("{port}" stands for the mock's own port)
            hang-up               closes the connection without answering
        --lifetime SECONDS  exits on its own after that long (for the CTest fixture)
  fixture-start --dir DIR --service FILE
      The CTest fixture: makes the certificates and a credentials file in DIR, starts a mock in
      the background and writes the complete source text to DIR/source.txt (the pid to
      DIR/mock.pid).
  fixture-stop --dir DIR
      Stops the mock of fixture-start by its pid and removes DIR/source.txt.
"""

import argparse
import base64
import http.server
import json
import os
import signal
import socket
import ssl
import subprocess
import sys
import threading
import time

SERVICE_ROOTS = ("/redfish/v1/", "/redfish/v1")
OVERSIZED = 2 * 1024 * 1024


def error_body(code, message):
    return json.dumps(
        {
            "error": {
                "code": "Base.1.0.GeneralError",
                "message": message,
                "@Message.ExtendedInfo": [{"MessageId": "Base.1.0.GeneralError", "Message": message}],
            }
        }
    ).encode()


class Events:
    """The events file, appended to by the handler threads one whole line at a time."""

    def __init__(self, path):
        self.path = path
        self.lock = threading.Lock()

    def write(self, line):
        with self.lock:
            with open(self.path, "a", encoding="utf-8") as out:
                out.write(line.replace("\n", " ") + "\n")


class Handler(http.server.BaseHTTPRequestHandler):
    protocol_version = "HTTP/1.1"
    server_version = "KestaTestRedfish/1"

    def log_message(self, format, *args):  # the events file is the log
        pass

    def respond(self, status, body=b"", headers=(), close=False):
        reason = self.responses.get(status, ("Unknown",))[0]
        lines = [f"HTTP/1.1 {status} {reason}", "OData-Version: 4.0"]
        if body is not None:
            lines += ["Content-Type: application/json; charset=utf-8", f"Content-Length: {len(body)}"]
        lines += list(headers)
        if close:
            lines.append("Connection: close")
            self.close_connection = True
        # Written down before the answer leaves, so a test that has its answer finds the event.
        self.server.events.write(f"{self.command} {self.path} {status}")
        # One write for the head and the body: two small writes would meet the peer's delayed
        # acknowledgement and cost tens of milliseconds a request.
        self.wfile.write(("\r\n".join(lines) + "\r\n\r\n").encode() + (body or b""))

    def authorised(self):
        if self.path in SERVICE_ROOTS:
            return True
        expected = base64.b64encode(f"{self.server.user}:{self.server.password}".encode()).decode()
        return self.headers.get("Authorization", "") == "Basic " + expected

    def do_GET(self):
        behaviour = self.server.behaviours.get(self.path)
        kind, _, argument = (behaviour or "").partition(":")
        if kind == "hang-up":
            self.server.events.write(f"GET {self.path} hang-up")
            self.close_connection = True
            self.connection.close()
            return
        if not self.authorised():
            self.respond(401, error_body(401, "The account was not accepted."),
                         ['WWW-Authenticate: Basic realm="Redfish"'])
            return
        if kind == "status":
            self.respond(int(argument), error_body(int(argument), "The request failed."))
            return
        if kind == "redirect":
            self.respond(302, b"", [f"Location: {argument.replace('{port}', str(self.server.server_port))}"])
            return
        if kind == "oversized":
            self.respond(200, json.dumps({"Name": "x" * OVERSIZED}).encode())
            return
        if kind == "oversized-chunked":
            self.send_chunked(json.dumps({"Name": "x" * OVERSIZED}).encode())
            return
        if kind == "slow":
            time.sleep(float(argument))
        resource = self.server.resources.get(self.path)
        if resource is None and self.path in SERVICE_ROOTS:
            resource = self.server.resources.get("/redfish/v1/")
        if resource is None:
            self.respond(404, error_body(404, "No such resource."))
            return
        body = json.dumps(resource, indent=1).encode()
        if kind == "truncated":
            body = body[: len(body) // 2]
        self.respond(200, body)

    def send_chunked(self, body):
        self.server.events.write(f"GET {self.path} 200")
        head = "HTTP/1.1 200 OK\r\nContent-Type: application/json\r\nTransfer-Encoding: chunked\r\n\r\n"
        self.wfile.write(head.encode())
        step = 64 * 1024
        for start in range(0, len(body), step):
            chunk = body[start : start + step]
            self.wfile.write(f"{len(chunk):x}\r\n".encode() + chunk + b"\r\n")
        self.wfile.write(b"0\r\n\r\n")

    def refuse_method(self):
        self.respond(405, error_body(405, "This service only answers GET."), ["Allow: GET"])

    do_POST = do_PUT = do_PATCH = do_DELETE = do_HEAD = do_OPTIONS = refuse_method


class Server(http.server.ThreadingHTTPServer):
    daemon_threads = True
    allow_reuse_address = True

    def finish_request(self, request, client_address):
        # The handshake happens in the connection's own thread, so a client that never completes
        # it holds up nobody else.
        request.settimeout(30)
        request.setsockopt(socket.IPPROTO_TCP, socket.TCP_NODELAY, 1)
        try:
            tls = self.context.wrap_socket(request, server_side=True)
        except (ssl.SSLError, OSError) as error:
            self.events.write(f"handshake-failed {error}")
            return
        self.events.write("connect")
        try:
            self.RequestHandlerClass(tls, client_address, self)
        finally:
            tls.close()

    def handle_error(self, request, client_address):
        pass  # a client that went away (the provider's timeout) is not an error of the mock


def serve(args):
    with open(args.service, encoding="utf-8") as source:
        resources = json.load(source)
    behaviours = {}
    for entry in args.behave or []:
        path, _, kind = entry.partition("=")
        behaviours[path] = kind
    context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
    context.load_cert_chain(args.cert, args.key)
    server = Server((args.bind, 0), Handler)
    server.context = context
    server.resources = resources
    server.behaviours = behaviours
    server.user = args.user
    server.password = args.password
    server.events = Events(args.events)
    if args.lifetime:
        threading.Timer(args.lifetime, lambda: os._exit(0)).start()
    signal.signal(signal.SIGTERM, lambda *_: os._exit(0))
    with os.fdopen(args.ready_fd, "w", encoding="utf-8") as ready:
        ready.write(f"{server.server_port}\n")
    server.serve_forever()


def openssl(*arguments, cwd):
    subprocess.run(["openssl", *arguments], cwd=cwd, check=True, stdout=subprocess.DEVNULL,
                   stderr=subprocess.PIPE)


def make_pki(directory):
    os.makedirs(directory, exist_ok=True)
    for key in ("ca.key", "other-ca.key", "server.key"):
        openssl("genpkey", "-algorithm", "EC", "-pkeyopt", "ec_paramgen_curve:P-256", "-out", key,
                cwd=directory)
    for name, subject in (("ca", "Kesta Test Authority"), ("other-ca", "Kesta Other Authority")):
        openssl("req", "-x509", "-new", "-key", f"{name}.key", "-out", f"{name}.pem", "-days", "30",
                "-subj", f"/CN={subject}", "-addext", "basicConstraints=critical,CA:TRUE",
                "-addext", "keyUsage=critical,keyCertSign,cRLSign", cwd=directory)
    openssl("req", "-new", "-key", "server.key", "-subj", "/CN=localhost", "-out", "server.csr",
            cwd=directory)
    certificates = (
        ("server", "ca", "IP:127.0.0.1,IP:::1,DNS:localhost"),
        ("other-server", "other-ca", "IP:127.0.0.1,IP:::1,DNS:localhost"),
        ("wrong-name", "ca", "DNS:elsewhere.test"),
    )
    for serial, (name, authority, names) in enumerate(certificates, start=1):
        with open(os.path.join(directory, f"{name}.ext"), "w", encoding="utf-8") as out:
            out.write(
                "[v3]\n"
                f"subjectAltName={names}\n"
                "basicConstraints=critical,CA:FALSE\n"
                "keyUsage=critical,digitalSignature\n"
                "extendedKeyUsage=serverAuth\n"
            )
        openssl("x509", "-req", "-in", "server.csr", "-CA", f"{authority}.pem", "-CAkey",
                f"{authority}.key", "-set_serial", str(serial), "-days", "30", "-out", f"{name}.pem",
                "-extfile", f"{name}.ext", "-extensions", "v3", cwd=directory)


def fixture_start(args):
    directory = os.path.abspath(args.dir)
    pki = os.path.join(directory, "pki")
    os.makedirs(directory, exist_ok=True)
    fixture_stop(args, quiet=True)
    make_pki(pki)
    credentials = os.path.join(directory, "credentials.conf")
    with open(credentials, "w", encoding="utf-8") as out:
        out.write("# the account of the mock Redfish service\nuser = reader\npassword = reader-pass\n")
    os.chmod(credentials, 0o600)
    # The mock says it listens by writing its port to the pipe; the read blocks until then, or
    # ends empty when the mock ended before (its end of the pipe closes with it).
    ready, ready_to_write = os.pipe()
    with open(os.path.join(directory, "mock.log"), "w", encoding="utf-8") as log:
        process = subprocess.Popen(
            [sys.executable, os.path.abspath(__file__), "serve", "--service", args.service,
             "--cert", os.path.join(pki, "server.pem"), "--key", os.path.join(pki, "server.key"),
             "--ready-fd", str(ready_to_write), "--events", os.path.join(directory, "events.log"),
             "--lifetime", str(args.lifetime)],
            stdin=subprocess.DEVNULL, stdout=log, stderr=log, start_new_session=True,
            pass_fds=(ready_to_write,))
    os.close(ready_to_write)
    with os.fdopen(ready, encoding="utf-8") as source:
        port = source.readline().strip()
    if not port:
        process.wait()
        sys.exit("the mock Redfish service did not start; see " + os.path.join(directory, "mock.log"))
    with open(os.path.join(directory, "mock.pid"), "w", encoding="utf-8") as out:
        out.write(f"{process.pid}\n")
    text = (f"redfish:https://127.0.0.1:{port}?credentials={credentials}"
            f"&ca={os.path.join(pki, 'ca.pem')}")
    with open(os.path.join(directory, "source.txt"), "w", encoding="utf-8") as out:
        out.write(text + "\n")
    print(text)


def fixture_stop(args, quiet=False):
    directory = os.path.abspath(args.dir)
    pid_file = os.path.join(directory, "mock.pid")
    for name in ("source.txt",):
        path = os.path.join(directory, name)
        if os.path.exists(path):
            os.remove(path)
    if not os.path.exists(pid_file):
        if not quiet:
            print("no mock Redfish service is running in " + directory)
        return
    with open(pid_file, encoding="utf-8") as source:
        pid = int(source.read().strip())
    os.remove(pid_file)
    # The mock keeps nothing worth a clean exit: its events are written line by line.
    try:
        os.kill(pid, signal.SIGKILL)
    except ProcessLookupError:
        pass


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    commands = parser.add_subparsers(dest="command", required=True)
    pki = commands.add_parser("pki")
    pki.add_argument("dir")
    run = commands.add_parser("serve")
    run.add_argument("--service", required=True)
    run.add_argument("--cert", required=True)
    run.add_argument("--key", required=True)
    run.add_argument("--ready-fd", type=int, required=True)
    run.add_argument("--events", required=True)
    run.add_argument("--bind", default="127.0.0.1")
    run.add_argument("--user", default="reader")
    run.add_argument("--password", default="reader-pass")
    run.add_argument("--behave", action="append")
    run.add_argument("--lifetime", type=float, default=0)
    start = commands.add_parser("fixture-start")
    start.add_argument("--dir", required=True)
    start.add_argument("--service", required=True)
    start.add_argument("--lifetime", type=float, default=3600)
    stop = commands.add_parser("fixture-stop")
    stop.add_argument("--dir", required=True)
    args = parser.parse_args()
    if args.command == "pki":
        make_pki(args.dir)
    elif args.command == "serve":
        serve(args)
    elif args.command == "fixture-start":
        fixture_start(args)
    else:
        fixture_stop(args)


if __name__ == "__main__":
    main()
