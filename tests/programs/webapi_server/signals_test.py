"""webapi-server when it is told to load anew or to end, or sees that it should."""

import ctypes
import functools
import os
import signal
import socket
import subprocess
import threading
import time
import unittest

import scgi_server
from scgi_server import LIVING, LONG, ONCE, SERVER, Reply, query_request, wait_for


class Signals(scgi_server.ServerTest):
    def test_serves_who_waits_before_it_ends(self):
        server = self.start("--min-workers", "1", "--max-workers", "1")
        self.echo()
        connections = [self.connect() for _ in range(5)]
        for number, connection in enumerate(connections):
            connection.sendall(query_request(ONCE, "dawdle", milliseconds=100, nonce=f"d{number}"))
        server.send_signal(signal.SIGTERM)
        for number, connection in enumerate(connections):
            with connection:
                reply = Reply(self.read_all(connection))
            self.assertEqual(reply.body["data"]["nonce"], f"d{number}")
        self.assertEqual(server.wait(LONG), 0)
        self.assertFalse(os.path.exists(self.socket))

    def test_takes_signals_from_the_moment_there_is_a_socket(self):
        for number in range(20):
            path = os.path.join(self.folder, f"early-{number}")
            server = subprocess.Popen([SERVER, "--socket", path], stdin=subprocess.DEVNULL)
            self.addCleanup(self.stop, server, path)
            ends = time.monotonic() + LONG
            while not os.path.exists(path) and time.monotonic() < ends:
                pass
            server.send_signal(signal.SIGHUP)
            server.send_signal(signal.SIGTERM)
            self.assertEqual(server.wait(LONG), 0)
            self.assertFalse(os.path.exists(path))

    def test_leaves_no_process_when_it_ends(self):
        take_orphans = functools.partial(ctypes.CDLL(None).prctl, 36)  # as a subreaper
        self.assertEqual(take_orphans(1), 0)
        self.addCleanup(take_orphans, 0)
        for number in range(5):
            server = self.start(socket_path=os.path.join(self.folder, f"short-{number}"))
            self.echo()
            server.send_signal(signal.SIGHUP)
            server.send_signal(signal.SIGTERM)
            self.assertEqual(server.wait(LONG), 0)
            self.assertRaises(ChildProcessError, os.waitpid, -1, os.WNOHANG)

    def test_ends_at_once_when_told_twice(self):
        server = self.start("--min-workers", "1")
        [connection] = self.occupy()
        server.send_signal(signal.SIGTERM)
        time.sleep(0.3)
        self.assertIsNone(server.poll())
        server.send_signal(signal.SIGTERM)
        self.assertEqual(Reply(self.read_all(connection)).status, 504)
        self.assertEqual(server.wait(LONG), 0)

    def test_loses_no_request_when_it_loads_anew(self):
        server = self.start("--max-workers", "4")
        before = self.echo()["pid"]
        failures = []
        ends = time.monotonic() + 1.5

        def client(number):
            count = 0
            while time.monotonic() < ends:
                count += 1
                try:
                    self.echo(ONCE if count % 7 == 0 else LIVING, nonce=f"r{number}-{count}")
                except (OSError, AssertionError) as trouble:
                    failures.append(repr(trouble))

        clients = [threading.Thread(target=client, args=(number,)) for number in range(4)]
        for thread in clients:
            thread.start()
        for _ in range(10):
            time.sleep(0.1)
            server.send_signal(signal.SIGHUP)
        for thread in clients:
            thread.join()
        self.assertEqual(failures, [])
        self.assertTrue(wait_for(lambda: self.echo()["pid"] != before))
        self.assertTrue(wait_for(lambda: len(self.children(server.pid)) == 1))

    def test_notices_a_changed_description(self):
        self.start()
        self.echo()
        self.describe(LIVING, methods=["echo"])
        self.addCleanup(self.describe, LIVING)
        self.assertTrue(
            wait_for(lambda: self.ask(LIVING, "dawdle").body.get("error") == {"code": 103})
        )

    def test_notices_a_replaced_library(self):
        self.start()
        self.assertEqual(self.echo()["mark"], "first")
        library = self.libraries[LIVING]
        for module, mark in ((scgi_server.OTHER_MODULE, "second"), (scgi_server.MODULE, "first")):
            with open(module, "rb") as source, open(library + ".new", "wb") as target:
                target.write(source.read())
            os.rename(library + ".new", library)
            self.assertTrue(wait_for(lambda mark=mark: self.echo()["mark"] == mark))


if __name__ == "__main__":
    unittest.main()
