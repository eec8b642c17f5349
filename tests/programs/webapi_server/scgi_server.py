"""The built server over an API of the tests' own, and an SCGI client for it."""

import contextlib
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
PATIENT = "Probe.ServerPatient"  # lives on, and may take as long as it likes
BAD_MODULE = os.environ["BAD_SERVER_MODULE"]
BAD = "Probe.ServerBad"
METHODS = ["echo", "dawdle", "hang", "hangWithChild", "leaveChild", "crash", "vanish"]
METHODS += [{name: {"allowDownload": True}} for name in ("stream", "stall", "flood")]
LONG = 60


def netstring(variables):
    block = b"".join(
        name.encode() + b"\0" + value.encode() + b"\0" for name, value in variables.items()
    )
    return str(len(block)).encode() + b":" + block + b","


def query_request(api, method, length=0, **parameters):
    query = f"api={api}&version=1&method={method}"
    for name, value in parameters.items():
        query += f"&{name}={value}"
    return netstring(
        {
            "CONTENT_LENGTH": str(length),
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


def parent(pid):
    with open(f"/proc/{pid}/stat", encoding="ascii") as file:
        return int(file.read().rpartition(")")[2].split()[1])


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
        for api in (LIVING, ONCE, PATIENT):
            cls.libraries[api] = os.path.join(cls.folder, api + ".so")
            shutil.copyfile(MODULE, cls.libraries[api])
            cls.describe(api)

    @classmethod
    def tearDownClass(cls):
        for api in (LIVING, ONCE, PATIENT):
            cls.forget(api)
        shutil.rmtree(cls.folder)

    @classmethod
    def describe(cls, api, methods=None, **members):
        document = {
            "lib": cls.libraries[api],
            "minVersion": 1,
            "maxVersion": 1,
            "authLevel": 0,
            "deadline": 0 if api == PATIENT else 1,
            "methods": {"1": methods or METHODS},
        }
        document.update(members)
        if api in (LIVING, PATIENT):
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
            with contextlib.suppress(OSError):
                if parent(process) == pid:
                    found.append(process)
        return found

    def busy(self):
        """The workers that have read a request and are not done with it."""
        found = []
        for process in self.processes():
            with contextlib.suppress(OSError):
                if os.readlink(f"/proc/{process}/fd/1").startswith("socket:"):
                    found.append(process)
        return found

    def rest(self):
        """Waits until the workers have put themselves back, behind their replies."""
        self.assertTrue(wait_for(lambda: not self.busy()), self.busy())

    def occupy(self, count=1):
        """Connections, each with a worker that hangs until it is killed."""
        connections = [self.connect() for _ in range(count)]
        for connection in connections:
            self.addCleanup(connection.close)
            connection.sendall(query_request(PATIENT, "hang"))
        self.assertTrue(wait_for(lambda: len(self.busy()) == count), self.busy())
        return connections

    def free(self):
        """Ends what `occupy` began."""
        for worker in self.busy():
            with contextlib.suppress(ProcessLookupError):
                os.kill(worker, signal.SIGKILL)

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
    def send_while_taken(connection, data):
        """Who answers before it has read everything may refuse the rest."""
        with contextlib.suppress(BrokenPipeError, ConnectionResetError):
            connection.sendall(data)

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
