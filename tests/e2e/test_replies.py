"""What a reply carries besides its document, and what happens after it."""

import os
import subprocess
import threading

from case import Case
from client import form
from webserver import wait_until

CACHE_LINES = [
    ("Cache-Control", "max-age=0, no-cache, no-store, must-revalidate"),
    ("Pragma", "no-cache"),
    ("Expires", "0"),
]


class Headers(Case):
    def test_a_status_is_the_status_of_the_reply(self):
        for status in (201, 302, 404, 500, 503):
            with self.subTest(status):
                reply = self.client.call("Test.Basic", "status", code=status, message="so it is")
                self.assertEqual(reply.status, status)
                self.check_document(reply, {"success": True})

    def test_lines_of_a_method_come_in_order_of_their_names_before_the_cache_lines(self):
        reply = self.client.call("Test.Basic", "serverError", text="it happened")
        names = ["x-request-error"] + [name for name, _ in CACHE_LINES]
        self.assertEqual([pair for pair in reply.headers if pair[0] in names],
                         [("x-request-error", "it happened")] + CACHE_LINES)

    def test_the_cache_lines_come_with_an_error_too(self):
        reply = self.client.get("")
        self.assertEqual([pair for pair in reply.headers if pair in CACHE_LINES], CACHE_LINES)
        self.fails(reply, 101)

    def test_a_reply_carries_no_markup(self):
        reply = self.client.call("TALO.System", "ping", text="<script>&")
        self.assertNotIn(b"<", reply.body)
        self.succeeds(reply, {"text": "<script>&"})


class Afterwards(Case):
    def test_a_reply_is_complete_while_its_callback_still_runs(self):
        # Whoever opens a named pipe for writing waits for a reader.
        pipe = self.folder / "pipe"
        os.mkfifo(pipe)
        self.succeeds(self.client.call("Test.Basic", "later", file=str(pipe), text="done"))
        with open(pipe) as reader:
            self.assertEqual(reader.read(), "done")

    def test_a_reply_is_complete_on_a_connection_that_stays_open(self):
        pipe = self.folder / "pipe"
        os.mkfifo(pipe)
        self.succeeds(self.client.call("Test.Basic", "later", file=str(pipe), text="done",
                                       headers={"Connection": "keep-alive"}))
        with open(pipe) as reader:
            self.assertEqual(reader.read(), "done")


class Restart(Case):
    def succeeds_again(self):
        self.succeeds(self.client.call("TALO.System", "ping", text="after"), {"text": "after"})
        self.assertTrue(self.server.script.is_alive())

    def test_a_response_restarts_the_web_server(self):
        before = self.server.restarts()
        self.succeeds(self.client.call("Test.Basic", "restart"))
        self.assertTrue(wait_until(lambda: self.server.restarts() > before))
        for _ in range(20):
            self.succeeds_again()

    def test_a_restart_leaves_running_requests_alone(self):
        started, finish = self.folder / "started", self.folder / "finish"
        replies = []
        slow = threading.Thread(target=lambda: replies.append(self.client.call(
            "Test.Slow", "wait", started=str(started), finish=str(finish))))
        slow.start()
        self.addCleanup(slow.join)
        self.addCleanup(finish.touch)
        self.assertTrue(wait_until(started.exists))
        before = self.server.restarts()
        subprocess.run([self.server.service_program, "httpd", "restart"], check=True)
        # Time for a server that would end its requests to do so.
        self.assertFalse(wait_until(lambda: replies, seconds=2))
        finish.touch()
        slow.join()
        self.succeeds(replies[0], "waited")
        self.assertTrue(wait_until(lambda: self.server.restarts() > before))
        self.succeeds_again()

    def test_the_service_program_refuses_other_services(self):
        self.assertNotEqual(
            subprocess.run([self.server.service_program, "sshd", "restart"]).returncode, 0)


class Folder(Case):
    """Of the web API directory, only the entry is served."""

    def test_nothing_else_is_served(self):
        for path in ("/webapi/lib.def", "/webapi/TALO.System.lib", "/webapi/lib/TALO.System.so",
                     "/webapi/lib/", "/webapi/", "/webapi", "/webapi/entry.cgi/lib.def",
                     "/webapi/entry.cgi/../lib.def", "/webapi/entry.cgi/..%2flib.def",
                     "/webapi/entry.cgi%00.html", "/webapi//lib.def", "/%2e%2e/webapi/lib.def",
                     "/tmp/", "/lib.def", "/../error.log"):
            with self.subTest(path):
                reply = self.client.request("GET", path)
                self.assertIn(reply.status, (400, 403, 404), reply)
                for secret in (b"minVersion", b"authLevel", b"ELF", b"#!/bin"):
                    self.assertNotIn(secret, reply.body)

    def test_the_root_says_what_this_is(self):
        for path in ("/", "/index.html"):
            reply = self.client.request("GET", path)
            self.assertEqual(reply.status, 200)
            self.assertIn(b"/webapi/entry.cgi", reply.body)
            self.assertIn("text/html", reply.header("Content-type"))

    def test_a_get_without_a_query_is_101(self):
        self.fails(self.client.request("GET", "/webapi/entry.cgi"), 101)

    def test_pings_answer_with_a_query_alone(self):
        self.succeeds(self.client.get(form(api="TALO.System", version=1, method="ping")), {})
