"""What the cases of all files have in common."""

import tempfile
import pathlib
import unittest

from client import Client
from webserver import HOST


class Case(unittest.TestCase):
    server = None  # the WebServer of this run
    small_volume = None  # folder on a file system of its own, of some mebibytes

    def setUp(self):
        self.client = Client(HOST, self.server.port)
        folder = tempfile.TemporaryDirectory(dir=self.server.run_dir / "tmp")
        self.addCleanup(folder.cleanup)
        self.folder = pathlib.Path(folder.name)

    def check_document(self, reply, document):
        self.assertIsNotNone(reply, "the server closed the connection")
        self.assertEqual(reply.document(), document, reply)
        self.assertEqual(reply.header("Content-type"), 'text/html; charset="UTF-8"')

    def succeeds(self, reply, data=None):
        document = {"success": True} if data is None else {"success": True, "data": data}
        self.check_document(reply, document)
        self.assertEqual(reply.status, 200)

    def fails(self, reply, code):
        self.check_document(reply, {"success": False, "error": {"code": code}})
        self.assertEqual(reply.status, 200)

    def by_server(self, **expectations):
        """What is expected of the server of this run, which may differ in mode warm; see
        docs/web-servers.md."""
        name = self.server.name
        return expectations.get(f"{self.server.mode}_{name}", expectations[name])

    def refuses_chunks(self):
        """Whether the web server takes no body without a length."""
        return self.server.name == "apache" and self.server.mode == "warm"

    def answers_itself(self, reply, status):
        """The web server refuses on its own: the entry never sees the request."""
        self.assertIsNotNone(reply, "the server closed the connection")
        self.assertEqual(reply.status, status, reply)
        self.assertNotIn(b'"success"', reply.body)

    def is_sanitized(self):
        """A sanitizer's own memory says nothing about the program's."""
        return b"__asan_init" in self.server.entry.read_bytes()
