"""A served appliance with an account and a session, and what it costs to ask it."""

import json
import os
import pathlib
import shutil
import socket
import subprocess
import sys
import time
import urllib.parse

HERE = pathlib.Path(__file__).resolve().parent
PROJECT = HERE.parents[1]
sys.path.insert(0, str(PROJECT / "tests/e2e"))

from webserver import HOST, WebServer, free_port, wait_until  # noqa: E402,F401

ENTRY = "/webapi/entry.cgi"
USER = "bench"
PASSWORD = "a password of the bench"
INFO = "api=TALO.System&version=2&method=info"
ONCE = "api=Bench.Once&version=1&method=info"


def has_warm_mode(root):
    """Whether this build has the server that keeps workers."""
    return (root / "usr/sbin/webapi-server").exists()


def install_module(root, build):
    """The bench's own APIs beside the shipped ones."""
    webapi = root / "usr/talo/taloman/webapi"
    shutil.copy(build / "bench/Bench.so", webapi / "lib")
    for description in (PROJECT / "bench/module").glob("*.lib"):
        shutil.copy(description, webapi)


def add_account(root):
    subprocess.run([root / "usr/bin/webapi-account", "add", USER], input=PASSWORD + "\n",
                   text=True, check=True, stdout=subprocess.DEVNULL)


def write_settings(root):
    """What an appliance is set up with: a settings file is there, whatever it says."""
    (root / "etc/talo/host.conf").write_text('session_timeout="30"\n', encoding="utf-8")


class Appliance:
    """Behind a web server, in one mode: "cgi" or "warm"."""

    def __init__(self, root, run_dir, server, mode):
        self.web = WebServer(server, root, run_dir, mode=mode)
        self.url = f"http://{HOST}:{self.web.port}{ENTRY}"
        self.sessions = root / "run/talo/session"
        self.webapi = self.web.webapi_dir

    def log_in(self):
        """The id of a new session."""
        reply = self.post(urllib.parse.urlencode({
            "api": "TALO.Session", "version": 1, "method": "open", "account": USER,
            "passwd": json.dumps(PASSWORD)}))
        return json.loads(reply.body)["data"]["sid"]

    def get(self, query, sid=None):
        return ask(self.web.port, f"GET {ENTRY}?{query}", sid)

    def post(self, body, sid=None):
        return ask(self.web.port, f"POST {ENTRY}", sid, body.encode())

    def workers(self):
        """The ids of the processes of webapi-server but its first one."""
        found = {}
        mounts = os.readlink("/proc/self/ns/mnt")
        for process in pathlib.Path("/proc").glob("[0-9]*"):
            try:
                if (os.readlink(process / "exe").endswith("/webapi-server") and
                        os.readlink(process / "ns/mnt") == mounts):
                    found[int(process.name)] = int(
                        (process / "stat").read_text().rpartition(")")[2].split()[1])
            except OSError:
                pass
        parents = set(found.values())
        return [pid for pid in found if pid not in parents]

    def stop(self):
        return self.web.script.stop()


class Reply:
    """What came back; of a large body the beginning and the end."""

    def __init__(self, head, body, size, seconds):
        self.head = head
        self.body = body
        self.size = size
        self.seconds = seconds


KEPT = 1 << 16


def ask(port, line, sid=None, body=b""):
    """The time from the first byte of the question to the last of the answer."""
    cookie = f"Cookie: id={sid}\r\n" if sid else ""
    length = (f"Content-Type: application/x-www-form-urlencoded\r\n"
              f"Content-Length: {len(body)}\r\n") if line.startswith("POST") else ""
    head = (f"{line} HTTP/1.0\r\nHost: {HOST}\r\n{cookie}{length}\r\n").encode()
    block = bytearray(1 << 20)
    size, first, last = 0, b"", b""
    with socket.create_connection((HOST, port), timeout=120) as connection:
        connection.setsockopt(socket.IPPROTO_TCP, socket.TCP_NODELAY, 1)
        start = time.perf_counter()
        connection.sendall(head + body if len(body) < KEPT else head)
        if len(body) >= KEPT:
            connection.sendall(body)
        while got := connection.recv_into(block):
            size += got
            if len(first) < KEPT:
                first += block[:min(got, KEPT)]
            last = (last + block[max(0, got - 64):got])[-64:]
        seconds = time.perf_counter() - start
    header, _, text = first.partition(b"\r\n\r\n")
    if b" 200 " not in header.split(b"\r\n")[0] or b'"success":true}' not in last:
        raise RuntimeError(f"not the reply that was expected: {first[:400]!r} ... {last!r}")
    return Reply(header, text, size, seconds)
