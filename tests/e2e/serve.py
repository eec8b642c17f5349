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

from client import Client, form  # noqa: E402
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
    administrator = None  # name and password, once a new root has shown them

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

    def serves_and_stops(self, number, *arguments):
        port = free_port()
        before = time.monotonic()
        script = self.start("--port", str(port), *arguments)
        self.assertTrue(script.ready, "".join(script.output))
        print(f"{arguments}: ready after {time.monotonic() - before:.1f} s", file=sys.stderr)
        self.assertIn(f"ready http://{HOST}:{port}/\n", script.output)
        self.assertIn(b'"success":true', Client(HOST, port).get(PING).body)
        self.logs_in(script, Client(HOST, port))
        self.assertTrue(wait_until(lambda: "".join(script.output).count("curl ") == 8))
        self.assertEqual(script.stop(number), 0, "".join(script.output))
        self.assertTrue(wait_until(lambda: not processes_that_mention(str(self.checkout))),
                        processes_that_mention(str(self.checkout)))
        with socket.socket() as again:
            again.setsockopt(socket.SOL_SOCKET, socket.SO_REUSEADDR, 1)
            again.bind((HOST, port))

    def logs_in(self, script, client):
        """The administrator of a new root is shown once, before the ready line."""
        shown = re.findall(r"^administrator: (\S+) (\S+)$(?=.*^ready)", "".join(script.output),
                           re.MULTILINE | re.DOTALL)
        if self.administrator is None:
            self.assertEqual(len(shown), 1, "".join(script.output))
            type(self).administrator = shown[0]
        else:
            self.assertEqual(shown, [])
        name, password = self.administrator
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
            for number in (signal.SIGINT, signal.SIGTERM):
                with self.subTest(server, signal=number):
                    self.serves_and_stops(number, "--server", server)
        type(self).administrator = None
        self.serves_and_stops(signal.SIGTERM, "--reset")

    def test_says_so_when_the_port_is_taken(self):
        with socket.socket() as taken:
            taken.bind((HOST, 0))
            taken.listen()
            script = self.start("--port", str(taken.getsockname()[1]))
            self.assertEqual(script.process.wait(timeout=60), 1)
            self.assertIn("is taken", "".join(script.output))

    def test_refuses_wrong_arguments(self):
        for arguments in (["--port", "0"], ["--port", "65536"], ["--port", "x"], ["--port"],
                          ["--server", "iis"], ["--bind", "a b"], ["--speed"]):
            with self.subTest(arguments):
                script = self.start(*arguments)
                self.assertEqual(script.process.wait(timeout=60), 2)

    def test_explains_itself(self):
        for name in ("serve", "test", "check", "bench", "web-server"):
            with self.subTest(name):
                said = subprocess.run([self.checkout / "scripts" / name, "--help"], timeout=60,
                                      check=True, stdout=subprocess.PIPE, text=True).stdout
                self.assertIn(f"Usage: scripts/{name}", said)


if __name__ == "__main__":
    unittest.main(verbosity=2)
