"""scripts/serve in a fresh copy of the project, as a new user meets it."""

import json
import pathlib
import re
import shutil
import signal
import socket
import subprocess
import sys
import tempfile
import time
import unittest

HERE = pathlib.Path(__file__).resolve().parent
sys.path.insert(0, str(HERE))

from client import ENTRY, Client, form  # noqa: E402
from multipart import Content, Form, digest, upload  # noqa: E402
from webserver import (  # noqa: E402
    HOST, PROJECT, Foreground, free_port, processes_that_mention, wait_until)

PING = "api=TALO.System&version=1&method=ping&text=hi"
BUILD_SECONDS = 600


def copy_project(folder):
    """The files that a clone would have, uncommitted ones included."""
    names = subprocess.run(
        ["git", "-c", f"safe.directory={PROJECT}", "ls-files", "-z", "--cached", "--others",
         "--exclude-standard"], cwd=PROJECT, check=True, stdout=subprocess.PIPE).stdout
    for name in filter(None, names.decode().split("\0")):
        if (PROJECT / name).is_file():
            target = folder / name
            target.parent.mkdir(parents=True, exist_ok=True)
            shutil.copy2(PROJECT / name, target)


class Serve(unittest.TestCase):
    administrators = {}  # name and password by state, once a new one has shown them

    @classmethod
    def setUpClass(cls):
        # Closed to others, as a home folder is.
        folder = tempfile.TemporaryDirectory(prefix="serve-test-")
        cls.addClassCleanup(folder.cleanup)
        cls.checkout = pathlib.Path(folder.name)
        copy_project(cls.checkout)

    def start(self, *arguments):
        script = Foreground([str(self.checkout / "scripts/serve"), *arguments], BUILD_SECONDS)
        self.addCleanup(lambda: script.is_alive() and script.stop())
        return script

    def serves(self, *arguments, tls=False, state=""):
        """A script that serves, its port and a client of it."""
        port = free_port()
        options = ["--tls"] * tls + (["--state", state] if state else [])
        before = time.monotonic()
        script = self.start("--port", str(port), *arguments, *options)
        self.assertTrue(script.ready, "".join(script.output))
        print(f"{arguments} {options}: ready after {time.monotonic() - before:.1f} s",
              file=sys.stderr)
        self.assertIn(f"ready http{'s' * tls}://{HOST}:{port}/\n", script.output)
        client = Client(HOST, port, self.certificate(script, state) if tls else None)
        self.assertIn(b'"success":true', client.get(PING).body)
        self.assertEqual(self.has_workers(port), "cgi" not in arguments)
        self.logs_in(script, client, state)
        self.assertTrue(wait_until(lambda: "".join(script.output).count("curl ") == 8))
        return script, port, client

    def has_workers(self, port):
        """Whether workers stand ready for the server of this port."""
        return any("webapi-server" in line
                   for line in processes_that_mention(str(self.checkout))
                   if re.search(rf"/run/\w+-{port}\b", line))

    def certificate(self, script, state):
        """The certificate that was made is shown, and its key is nobody else's to read."""
        [path] = re.findall(r"^certificate: (\S+)$", "".join(script.output), re.MULTILINE)
        self.assertTrue(path.startswith(state or str(self.checkout)), path)
        key = pathlib.Path(path).with_suffix(".pem")
        self.assertIn("PRIVATE KEY", key.read_text())
        self.assertEqual(key.stat().st_mode & 0o777, 0o600)
        self.assertNotIn("PRIVATE KEY", pathlib.Path(path).read_text())
        return path

    def serves_and_stops(self, number, *arguments, **options):
        script, port, _ = self.serves(*arguments, **options)
        self.assertEqual(script.stop(number), 0, "".join(script.output))
        self.assertTrue(wait_until(lambda: not processes_that_mention(str(self.checkout))),
                        processes_that_mention(str(self.checkout)))
        with socket.socket() as again:
            again.setsockopt(socket.SOL_SOCKET, socket.SO_REUSEADDR, 1)
            again.bind((HOST, port))

    def logs_in(self, script, client, state):
        """The administrator of a new appliance is shown once, before the ready line."""
        shown = re.findall(r"^administrator: (\S+) (\S+)$(?=.*^ready)", "".join(script.output),
                           re.MULTILINE | re.DOTALL)
        if state not in self.administrators:
            self.assertEqual(len(shown), 1, "".join(script.output))
            self.administrators[state] = shown[0]
        else:
            self.assertEqual(shown, [])
        name, password = self.administrators[state]
        reply = client.call("TALO.Session", "open", account=name, passwd=json.dumps(password))
        self.assertTrue(reply.document()["success"], reply)
        self.shares(client, reply.document()["data"]["sid"])

    def shares(self, client, sid):
        """The share of a new root takes a file and gives it back."""
        content = Content(3 << 20)
        call = {"api": "TALO.File", "version": 1, "_sid": sid}
        reply = upload(client, form(method="upload", path="/public", overwrite="true", **call),
                       Form().file("file", "a file", content))
        self.assertTrue(reply.document()["success"], reply)
        reply = client.get(form(method="list", folder="/public", **call))
        self.assertEqual([entry["name"] for entry in reply.document()["data"]["entries"]],
                         ["a file"])
        reply = client.get(form(method="download", path="/public/a file", **call))
        self.assertEqual(digest([reply.body]), content.sha256())

    def test_serves_with_each_web_server_until_it_is_told_to_stop(self):
        self.serves_and_stops(signal.SIGTERM)
        self.serves_and_stops(signal.SIGINT)
        for server in ("lighttpd", "nginx", "apache"):
            for number, mode in ((signal.SIGINT, "warm"), (signal.SIGTERM, "warm"),
                                 (signal.SIGTERM, "cgi")):
                with self.subTest(server, signal=number, mode=mode):
                    self.serves_and_stops(number, "--server", server, "--mode", mode)
        del self.administrators[""]
        self.serves_and_stops(signal.SIGTERM, "--reset")

    def test_serves_with_tls(self):
        for server in ("lighttpd", "nginx", "apache"):
            with self.subTest(server):
                self.serves_and_stops(signal.SIGTERM, "--server", server, tls=True)

    def test_serves_two_appliances_at_once(self):
        state = str(self.checkout / "build/second")
        first, _, first_client = self.serves(tls=True)
        second, _, second_client = self.serves(tls=True, state=state)
        for client, own, other in ((first_client, "", state), (second_client, state, "")):
            for administrator, success in ((own, True), (other, False)):
                name, password = self.administrators[administrator]
                reply = client.call("TALO.Session", "open", account=name,
                                    passwd=json.dumps(password))
                self.assertEqual(reply.document()["success"], success, reply)
        self.relays(first_client, second_client, state)
        self.assertEqual(second.stop(), 0, "".join(second.output))
        self.assertIn(b'"success":true', first_client.get(PING).body)
        self.assertEqual(first.stop(), 0, "".join(first.output))
        del self.administrators[state]
        self.serves_and_stops(signal.SIGTERM, "--reset", state=state)

    def relays(self, client, target, state):
        """The first appliance calls the second, once both know of it."""
        account = str(self.checkout / "build/release/root/usr/bin/webapi-account")
        secret = subprocess.run(
            [str(self.checkout / "scripts/with-state"), state, account, "node", "add", "1",
             "--accept", "--class", "admin.local"],
            check=True, stdout=subprocess.PIPE, text=True, timeout=60).stdout
        subprocess.run(
            [account, "node", "add", "2", "--self", "1", "--url",
             f"https://{HOST}:{target.port}{ENTRY}", "--authority", f"{state}/etc/tls.crt"],
            check=True, input=secret, text=True, timeout=60)
        name, password = self.administrators[""]
        reply = client.call("TALO.Session", "open", account=name, passwd=json.dumps(password))
        reply = client.call("TALO.System", "info", version=2, relay_nd=2,
                            _sid=reply.document()["data"]["sid"])
        self.assertIn("hostname", reply.document()["data"])
        # Those of two logins, and the one of this call.
        self.assertEqual(len(list(pathlib.Path(state, "run/talo/session").glob("s*"))), 3)

    def test_leaves_a_folder_alone_that_is_no_state(self):
        folder = self.checkout / "build/mine"
        (folder / "etc").mkdir(parents=True)
        for arguments in ([], ["--reset"]):
            script = self.start("--state", str(folder), "--port", str(free_port()), *arguments)
            self.assertEqual(script.process.wait(timeout=BUILD_SECONDS), 1)
            self.assertTrue(wait_until(lambda: "not an appliance's" in "".join(script.output)))
            self.assertEqual([path.name for path in folder.iterdir()], ["etc"])

    def test_says_so_when_the_port_is_taken(self):
        with socket.socket() as taken:
            taken.bind((HOST, 0))
            taken.listen()
            script = self.start("--port", str(taken.getsockname()[1]))
            self.assertEqual(script.process.wait(timeout=60), 1)
            self.assertIn("is taken", "".join(script.output))

    def test_refuses_wrong_arguments(self):
        for arguments in (["--port", "0"], ["--port", "65536"], ["--port", "x"], ["--port"],
                          ["--server", "iis"], ["--mode", "hot"], ["--mode"], ["--bind", "a b"],
                          ["--speed"], ["--state"], ["--state", "", "--reset"]):
            with self.subTest(arguments):
                script = self.start(*arguments)
                self.assertEqual(script.process.wait(timeout=60), 2)

    def test_explains_itself(self):
        for name in ("serve", "test", "check", "bench", "web-server", "with-state"):
            with self.subTest(name):
                said = subprocess.run([self.checkout / "scripts" / name, "--help"], timeout=60,
                                      check=True, stdout=subprocess.PIPE, text=True).stdout
                self.assertIn(f"Usage: scripts/{name}", said)


if __name__ == "__main__":
    unittest.main(verbosity=2)
