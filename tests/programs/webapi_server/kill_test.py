"""webapi-server behind a real web server, while any of the processes may be killed."""

import collections
import contextlib
import http.client
import json
import os
import pathlib
import random
import re
import shutil
import signal
import socket
import subprocess
import sys
import threading
import time
import unittest

import scgi_server
from scgi_server import LIVING, ONCE, SERVER, wait_for

SNIPPET = pathlib.Path(os.environ["WEB_SERVER_SNIPPET"])
LIGHTTPD = shutil.which("lighttpd", path="/usr/sbin:/usr/bin:/sbin:/bin")
HOST = "127.0.0.1"
ENTRY = "/webapi/entry.cgi"
CLIENTS = 16
LOAD_SECONDS = 60
LAST_SECONDS = 5  # of the load, without the killer
QUIET_SECONDS = 60
MOST_SECONDS = 30  # until a client has its answer
MIN_WORKERS = 2
LARGE = 20000  # nonces, more than sockets hold at a time
NONCE = re.compile(rb"k\d+x\d+y")
# Code that the first look had not run yet, and what the allocator keeps of the load.
MEMORY_KIB = 1024

# The tests' API takes its name from the environment.
CONFIGURATION = """
server.modules = ("mod_setenv")
server.bind = "{host}"
server.port = {port}
server.document-root = "{folder}"
server.errorlog = "{folder}/error.log"
server.max-connections = 256
$HTTP["querystring"] =~ "api={living}&" {{
    setenv.add-environment = ("PROBE_NAME" => "{living}")
}}
$HTTP["querystring"] =~ "api={once}&" {{
    setenv.add-environment = ("PROBE_NAME" => "{once}")
}}
{snippet}
"""


def free_port():
    with socket.socket() as probe:
        probe.bind((HOST, 0))
        return probe.getsockname()[1]


class Appliance:
    """The two services, each started again at once when it ends, as systemd would."""

    def __init__(self, folder, socket_path):
        self.socket = socket_path
        self.port = free_port()
        self.listening = socket.socket(socket.AF_UNIX)
        self.listening.bind(socket_path)
        self.listening.listen(4096)
        snippet = re.sub(r'"socket" => "[^"]*"', f'"socket" => "{socket_path}"',
                         SNIPPET.read_text(encoding="utf-8"))
        self.configuration = os.path.join(folder, "lighttpd.conf")
        with open(self.configuration, "w", encoding="utf-8") as file:
            file.write(CONFIGURATION.format(host=HOST, port=self.port, folder=folder,
                                            living=LIVING, once=ONCE, snippet=snippet))
        self.running = True
        self.started = {}
        self.keepers = [threading.Thread(target=self.keep, args=(name, start))
                        for name, start in (("master", self.master), ("web", self.web))]
        for keeper in self.keepers:
            keeper.start()

    def keep(self, name, start):
        while self.running:
            process = self.started[name] = start()
            process.wait()

    def master(self):
        script = ("import os, sys; os.dup2(int(sys.argv[1]), 3);"
                  "os.environ.update(LISTEN_FDS='1', LISTEN_PID=str(os.getpid()));"
                  "os.execv(sys.argv[2], sys.argv[3:])")
        return subprocess.Popen(
            ["/usr/bin/python3", "-c", script, str(self.listening.fileno()), SERVER, SERVER,
             "--min-workers", str(MIN_WORKERS), "--max-workers", "12"],
            pass_fds=(self.listening.fileno(),), stdin=subprocess.DEVNULL)

    def web(self):
        return subprocess.Popen([LIGHTTPD, "-D", "-f", self.configuration],
                                stdin=subprocess.DEVNULL)

    def pid(self, name):
        return self.started[name].pid

    def stop(self):
        self.running = False
        for process in self.started.values():
            process.terminate()
        for keeper in self.keepers:
            keeper.join()
        self.listening.close()


class Outcome:
    """What a client got."""

    def __init__(self):
        self.lock = threading.Lock()
        self.counts = collections.Counter()
        self.wrong = []

    def add(self, kind, detail=None):
        with self.lock:
            self.counts[kind] += 1
            if detail is not None:
                self.wrong.append((kind, detail))


class Killed(scgi_server.ServerTest):
    def setUp(self):
        self.socket = os.path.join(self.folder, "kill")
        self.appliance = Appliance(self.folder, self.socket)
        self.addCleanup(self.end)
        self.outcome = Outcome()
        self.assertTrue(wait_for(lambda: self.request("first", 0)[0] == 200))

    def end(self):
        self.appliance.stop()
        self.assertTrue(wait_for(lambda: not self.processes()), self.processes())

    def processes(self, path=None):
        """By the program: who serves shows what it serves in its command line. Others may
        run the like, of a root that is mounted at the same place for them alone."""
        mounts = os.readlink("/proc/self/ns/mnt")
        found = []
        for entry in os.listdir("/proc"):
            with contextlib.suppress(OSError):
                if (entry.isdigit() and os.readlink(f"/proc/{entry}/exe") == SERVER and
                        os.readlink(f"/proc/{entry}/ns/mnt") == mounts):
                    found.append(int(entry))
        return found

    @staticmethod
    def ask(nonce, kind):
        """Path and body of a request, which spends its time in one place or another."""
        def path(api, method, **parameters):
            more = "".join(f"&{name}={value}" for name, value in parameters.items())
            return f"{ENTRY}?api={api}&version=1&method={method}{more}"
        return (
            lambda: (path(LIVING, "echo", nonce=nonce), None),
            lambda: (path(ONCE, "echo", nonce=nonce), None),
            lambda: (path(LIVING, "dawdle", nonce=nonce, milliseconds=100), None),
            lambda: (path(ONCE, "dawdle", nonce=nonce, milliseconds=100), None),
            lambda: (path("TALO.System", "ping"), f"text={nonce}".encode()),
            lambda: (path("TALO.System", "ping"), f"text={nonce * LARGE}".encode()),
        )[kind]()

    KINDS = 6
    LARGE_KIND = 5

    def request(self, nonce, kind):
        path, body = self.ask(nonce, kind)
        connection = http.client.HTTPConnection(HOST, self.appliance.port, timeout=MOST_SECONDS)
        try:
            connection.request("GET" if body is None else "POST", path, body, {
                "Connection": "close", "Content-Type": "application/x-www-form-urlencoded"})
            reply = connection.getresponse()
            if kind == self.LARGE_KIND:
                time.sleep(0.05)  # while the worker writes
            return reply.status, reply.read()
        except (http.client.HTTPException, TimeoutError, OSError) as trouble:
            if isinstance(trouble, (http.client.UnknownProtocol, TimeoutError)):
                return 0, repr(trouble).encode()
            # Refused, or closed before the end: the client knows that it has no reply.
            return None, b""
        finally:
            connection.close()

    def judge(self, nonce, kind, status, body):
        if any(found != nonce.encode() for found in NONCE.findall(body)):
            return "foreign"
        if status is None:
            return "closed"
        if status in (500, 502, 503, 504):
            return "error"
        if status != 200:
            return "strange"
        try:
            document = json.loads(body)
        except ValueError:
            # A CGI reply ends where its connection does: a long one may be cut off.
            is_cut = kind == self.LARGE_KIND and (b'{"data":{"text":"' + nonce.encode() * LARGE)
            return "cut" if is_cut and is_cut.startswith(body) else "broken"
        data = document.get("data", {})
        said = data.get("nonce", data.get("text"))
        expected = nonce * LARGE if kind == self.LARGE_KIND else nonce
        return "right" if document["success"] is True and said == expected else "foreign"

    def client(self, number, ends):
        count = 0
        while time.monotonic() < ends:
            count += 1
            nonce = f"k{number}x{count}y"
            kind = (number + count) % self.KINDS
            begun = time.monotonic()
            status, body = self.request(nonce, kind)
            verdict = self.judge(nonce, kind, status, body)
            if time.monotonic() - begun > MOST_SECONDS:
                verdict = "hanging"
            is_good = verdict in ("right", "error", "closed", "cut")
            self.outcome.add(verdict, None if is_good else (nonce, kind, status, body[:300]))
            if status is None:
                time.sleep(0.02)

    def victims(self):
        """Process ids by what they are."""
        found = {"master": [self.appliance.pid("master")], "web": [self.appliance.pid("web")],
                 "template": [], "worker": [], "busy": self.busy()}
        for process in self.processes():
            with contextlib.suppress(ProcessLookupError):
                if process != found["master"][0]:
                    kind = "template" if os.getsid(process) == process else "worker"
                    found[kind].append(process)
        return found

    def killer(self, ends):
        choice = random.Random(7)
        while time.monotonic() < ends:
            time.sleep(choice.uniform(0.02, 0.3))
            victims = self.victims()
            [kind] = choice.choices(("busy", "worker", "template", "master", "web"),
                                    (8, 4, 2, 1, 1))
            if victims[kind]:
                with contextlib.suppress(ProcessLookupError):
                    os.kill(choice.choice(victims[kind]), signal.SIGKILL)
                    self.outcome.add("killed " + kind)

    def load(self, seconds, kills):
        ends = time.monotonic() + seconds
        threads = [threading.Thread(target=self.client, args=(number, ends))
                   for number in range(CLIENTS)]
        if kills:
            threads.append(threading.Thread(target=self.killer, args=(ends,)))
        for thread in threads:
            thread.start()
        for thread in threads:
            thread.join()

    def look(self):
        """What the server takes while nobody asks for anything."""
        self.assertTrue(wait_for(lambda: len(self.processes()) == MIN_WORKERS + 2),
                        self.processes())
        master = self.appliance.pid("master")
        [template] = self.victims()["template"]
        with open(f"/proc/{master}/status", encoding="ascii") as file:
            [memory] = [int(line.split()[1]) for line in file if line.startswith("VmRSS:")]
        return {"master": len(os.listdir(f"/proc/{master}/fd")),
                "template": len(os.listdir(f"/proc/{template}/fd")),
                "memory": memory}

    def test_every_client_gets_its_answer_or_an_error_and_nothing_stays(self):
        self.load(LAST_SECONDS, kills=False)
        self.assertEqual(set(self.outcome.counts), {"right"}, self.outcome.wrong[:5])
        time.sleep(QUIET_SECONDS / 2)
        before = self.look()
        self.load(LOAD_SECONDS, kills=True)
        self.load(LAST_SECONDS, kills=False)
        print(dict(self.outcome.counts), file=sys.stderr)
        self.assertEqual(self.outcome.wrong[:5], [])
        for kind in ("busy", "worker", "template", "master", "web"):
            self.assertGreater(self.outcome.counts["killed " + kind], 2)
        self.assertGreater(self.outcome.counts["right"], 1000)
        time.sleep(QUIET_SECONDS)
        after = self.look()
        print(before, after, file=sys.stderr)
        self.assertEqual(len(self.processes()), MIN_WORKERS + 2)
        self.assertEqual(after["master"], before["master"])
        self.assertEqual(after["template"], before["template"])
        self.assertLessEqual(after["memory"], before["memory"] + MEMORY_KIB)


if __name__ == "__main__":
    unittest.main()
