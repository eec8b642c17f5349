"""webapi-server under load, when workers take who connects by themselves."""

import contextlib
import os
import subprocess
import unittest

import scgi_server
from scgi_server import LIVING, LONG, wait_for

SOAK_CLIENT = os.environ["SOAK_CLIENT"]
SANITIZED = os.environ["WEBAPI_SANITIZED"] == "1"
MANY = 100_000_000


class Taken(scgi_server.ServerTest):
    @contextlib.contextmanager
    def load(self):
        """More clients than requests may begin at once."""
        command = [SOAK_CLIENT, self.socket, str(MANY), "16", "0"]
        clients = subprocess.Popen(command, stderr=subprocess.DEVNULL)
        try:
            yield
        finally:
            clients.terminate()
            clients.wait()

    def test_answers_for_a_worker_that_is_killed_with_whom_it_has(self):
        self.start()
        self.echo()
        with self.load():
            for _ in range(20):
                reply = self.ask(LIVING, "vanish", milliseconds=50)
                self.assertEqual(reply.status, 500)
                self.assertEqual(reply.body, {"success": False, "error": {"code": 117}})

    def test_ends_a_worker_that_hangs_with_whom_it_has(self):
        self.start()
        self.echo()
        with self.load():
            for _ in range(3):
                self.assertEqual(self.ask(LIVING, "hang").status, 504)

    def test_wakes_the_master_for_few_requests_under_load(self):
        """But where the machine is so slow that requests do not count as new ones."""
        if SANITIZED:
            self.skipTest("a request of a sanitized worker takes too long to count as a new one")
        server = self.start()
        self.echo()
        requests = 4000
        command = [SOAK_CLIENT, self.socket, str(requests), str(min(8 * os.cpu_count(), 64)), "0"]

        def waits():
            with open(f"/proc/{server.pid}/status", encoding="ascii") as file:
                return sum(int(line.split()[1]) for line in file if line.startswith("voluntary"))

        found = []
        while (not found or min(found) >= requests / 2) and len(found) < 10:
            before = waits()
            subprocess.run(command, check=True, timeout=LONG)
            found.append(waits() - before)
        # One for each at least, where it hands over every one.
        self.assertLess(min(found), requests / 2)

    def test_lets_go_of_clients_that_workers_took(self):
        server = self.start("--max-workers", "4")
        self.echo()
        sockets = f"/proc/{server.pid}/fd"
        command = [SOAK_CLIENT, self.socket, "5000", "16", "0"]
        subprocess.run(command, check=True, timeout=LONG)
        # Signals, events, listener, template, and two for each worker.
        self.assertTrue(wait_for(lambda: len(os.listdir(sockets)) <= 3 + 4 + 2 * 4),
                        os.listdir(sockets))


if __name__ == "__main__":
    unittest.main()
