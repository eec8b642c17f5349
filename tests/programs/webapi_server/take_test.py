"""webapi-server while requests follow each other, and workers take who connects by themselves."""

import contextlib
import os
import subprocess
import time
import unittest

import scgi_server
from scgi_server import LIVING, LONG, Reply, query_request, wait_for

SOAK_CLIENT = os.environ["SOAK_CLIENT"]
SANITIZED = os.environ["WEBAPI_SANITIZED"] == "1"
MANY = 100_000_000
SOON = 10  # below any time after which the server would help itself


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

    @staticmethod
    def wakes(pid):
        with open(f"/proc/{pid}/status", encoding="ascii") as file:
            return sum(int(line.split()[1]) for line in file if line.startswith("voluntary"))

    def assert_wakes_the_master_for_few(self, clients, *options):
        """But where the machine is so slow that requests do not count as new ones."""
        if SANITIZED:
            self.skipTest("a request of a sanitized worker takes too long to count as a new one")
        server = self.start(*options)
        self.echo()
        requests = 4000
        command = [SOAK_CLIENT, self.socket, str(requests), str(clients), "0"]
        found = []
        while (not found or min(found) >= requests / 2) and len(found) < 10:
            before = self.wakes(server.pid)
            subprocess.run(command, check=True, timeout=LONG)
            found.append(self.wakes(server.pid) - before)
        # One for each at least, where it hands over every one.
        self.assertLess(min(found), requests / 2)

    def test_wakes_the_master_for_few_requests_under_load(self):
        self.assert_wakes_the_master_for_few(min(8 * os.cpu_count(), 64))

    def test_wakes_the_master_for_few_requests_that_follow_each_other(self):
        self.assert_wakes_the_master_for_few(1, "--min-workers", "1", "--max-workers", "1")

    def test_keeps_to_the_same_workers_for_requests_one_by_one(self):
        self.start()
        workers = set()
        for _ in range(40):
            workers.add(self.echo()["pid"])
            time.sleep(0.01)
        self.assertLessEqual(len(workers), 3)

    def test_sleeps_when_nobody_comes_any_more(self):
        server = self.start()
        for _ in range(20):
            self.echo()

        def is_quiet():
            before = self.wakes(server.pid)
            time.sleep(1)
            return self.wakes(server.pid) - before < 20  # in line, it would look 500 times

        self.assertTrue(wait_for(is_quiet))
        self.assertEqual(len(self.busy()), 0)

    def test_serves_slow_and_quick_requests_side_by_side(self):
        """The slow ones occupy whoever waits by itself; those who come then need others."""
        self.start()
        for _ in range(5):
            for _ in range(10):
                self.echo()
            slow = [self.connect() for _ in range(12)]
            for number, connection in enumerate(slow):
                connection.sendall(query_request(LIVING, "dawdle", milliseconds=300,
                                                 nonce=f"s{number}"))
            began = time.monotonic()
            self.echo(nonce="quick")
            self.assertLess(time.monotonic() - began, SOON)
            for number, connection in enumerate(slow):
                with connection:
                    reply = Reply(self.read_all(connection))
                self.assertEqual(reply.body["data"]["nonce"], f"s{number}")

    def test_leaves_workers_in_line_that_others_keep_from_work(self):
        """They have no request for longer than one may hesitate to begin one."""
        server = self.start("--min-workers", "4", "--max-workers", "4",
                            "--worker-requests", str(MANY), "--worker-growth", str(1 << 20))
        self.echo()
        with self.load():
            time.sleep(0.5)
        (template,) = self.children(server.pid)
        before = set(self.children(template))
        ends = time.monotonic() + 17
        while time.monotonic() < ends:
            self.echo()
            time.sleep(0.01)
        self.assertEqual(before - set(self.children(template)), set())

    def test_ends_soon_while_workers_wait_for_clients(self):
        server = self.start()
        for _ in range(10):
            self.echo()
        began = time.monotonic()
        server.terminate()
        self.assertEqual(server.wait(LONG), 0)
        self.assertLess(time.monotonic() - began, SOON)

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
