"""The built server over an API of the tests' own, and an SCGI client for it."""

import json
import os
import shutil
import signal
import socket
import subprocess
import tempfile
import time
import unittest

SERVER = os.environ["WEBAPI_SERVER"]
WEBAPI_DIR = os.environ["WEBAPI_DIR"]
MODULE = os.environ["SERVER_MODULE"]
OTHER_MODULE = os.environ["OTHER_SERVER_MODULE"]
LIVING = "Probe.ServerLiving"
ONCE = "Probe.ServerOnce"
BAD_MODULE = os.environ["BAD_SERVER_MODULE"]
BAD = "Probe.ServerBad"
METHODS = ["echo", "dawdle", "hang", "hangWithChild", "crash", "vanish"]
METHODS += [{"stream": {"allowDownload": True}}, {"stall": {"allowDownload": True}}]
LONG = 60


def netstring(variables):
    block = b"".join(
        name.encode() + b"\0" + value.encode() + b"\0" for name, value in variables.items()
    )
    return str(len(block)).encode() + b":" + block + b","


def query_request(api, method, **parameters):
    query = f"api={api}&version=1&method={method}"
    for name, value in parameters.items():
        query += f"&{name}={value}"
    return netstring(
        {
            "CONTENT_LENGTH": "0",
            "SCGI": "1",
            "GATEWAY_INTERFACE": "CGI/1.1",
            "REQUEST_METHOD": "GET",
            "QUERY_STRING": query,
            "PROBE_NAME": api,
        }
    )


class Reply:
    def __init__(self, raw):
        head, separator, body = raw.partition(b"\r\n\r\n")
        if not separator:
            raise ConnectionError(f"no reply: {raw!r}")
        self.raw = raw
        self.headers = head.split(b"\r\n")
        self.status = 200
        for line in self.headers:
            if line.lower().startswith(b"status:"):
                self.status = int(line.split()[1])
        self.body = json.loads(body)


def wait_for(condition, seconds=LONG):
    """Waits for what is to come about; the last answer of the condition."""
    end = time.monotonic() + seconds
    while True:
        answer = condition()
        if answer or time.monotonic() > end:
            return answer
        time.sleep(0.02)


def alive(pid):
    try:
        with open(f"/proc/{pid}/stat", encoding="ascii") as file:
            return file.read().rpartition(")")[2].split()[0] not in "ZX"
    except (FileNotFoundError, ProcessLookupError):
        return False


class ServerTest(unittest.TestCase):
    """Describes the API, in the web API directory, for as long as a test class runs."""

    @classmethod
    def setUpClass(cls):
        cls.folder = tempfile.mkdtemp(prefix="webapi-server-")
        cls.libraries = {}
        for api in (LIVING, ONCE):
            cls.libraries[api] = os.path.join(cls.folder, api + ".so")
            shutil.copyfile(MODULE, cls.libraries[api])
            cls.describe(api)

    @classmethod
    def tearDownClass(cls):
        for api in (LIVING, ONCE):
            cls.forget(api)
        shutil.rmtree(cls.folder)

    @classmethod
    def describe(cls, api, methods=None, **members):
        document = {
            "lib": cls.libraries[api],
            "minVersion": 1,
            "maxVersion": 1,
            "authLevel": 0,
            "deadline": 1,
            "methods": {"1": methods or METHODS},
        }
        document.update(members)
        if api == LIVING:
            document["isolation"] = "worker"
        name = os.path.join(WEBAPI_DIR, api + ".lib")
        with open(name + ".new", "w", encoding="utf-8") as file:
            json.dump({api: document}, file)
        os.rename(name + ".new", name)

    @classmethod
    def forget(cls, api):
        os.unlink(os.path.join(WEBAPI_DIR, api + ".lib"))

    def start(self, *options, socket_path=None):
        self.socket = socket_path or os.path.join(self.folder, self._testMethodName)
        command = [SERVER, "--socket", self.socket, *options]
        self.server = subprocess.Popen(command, stdin=subprocess.DEVNULL)
        self.addCleanup(self.stop, self.server, self.socket)
        self.assertTrue(wait_for(self.listens))
        return self.server

    def listens(self):
        with open("/proc/net/unix", encoding="utf-8") as file:
            sockets = [line.split() for line in file]
        return any(line[3] == "00010000" and line[-1] == self.socket for line in sockets)

    def stop(self, server, path):
        """A clean end, after which no process is left."""
        if server.poll() is None:
            server.send_signal(signal.SIGTERM)
            self.assertEqual(server.wait(LONG), 0)
        self.assertEqual(wait_for(lambda: not self.processes(path)), True)

    def processes(self, path=None):
        """The server's processes, by the socket in their command line."""
        mark = (path or self.socket).encode()
        found = []
        for entry in os.listdir("/proc"):
            try:
                if not entry.isdigit() or not alive(int(entry)):
                    continue
                with open(f"/proc/{entry}/cmdline", "rb") as file:
                    words = file.read().split(b"\0")
            except OSError:
                continue
            if mark in words:
                found.append(int(entry))
        return found

    def children(self, pid):
        found = []
        for process in self.processes():
            try:
                with open(f"/proc/{process}/stat", encoding="ascii") as file:
                    if int(file.read().rpartition(")")[2].split()[1]) == pid:
                        found.append(process)
            except OSError:
                pass
        return found

    def connect(self):
        connection = socket.socket(socket.AF_UNIX)
        connection.settimeout(LONG)
        try:
            connection.connect(self.socket)
        except OSError:
            connection.close()
            raise
        return connection

    @staticmethod
    def read_all(connection):
        raw = b""
        while block := connection.recv(1 << 16):
            raw += block
        return raw

    def raw(self, api, method, **parameters):
        with self.connect() as connection:
            connection.sendall(query_request(api, method, **parameters))
            return self.read_all(connection)

    def ask(self, api, method, **parameters):
        return Reply(self.raw(api, method, **parameters))

    def echo(self, api=LIVING, nonce="n"):
        reply = self.ask(api, "echo", nonce=nonce)
        self.assertIs(reply.body["success"], True, reply.raw)
        self.assertEqual(reply.body["data"]["nonce"], nonce)
        return reply.body["data"]
