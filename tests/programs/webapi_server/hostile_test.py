"""webapi-server among clients, methods and processes that mean it no good."""

import os
import resource
import select
import signal
import threading
import time
import unittest

import scgi_server
from scgi_server import LIVING, LONG, ONCE, PATIENT, Reply, query_request, wait_for


class Clients(scgi_server.ServerTest):
    CROWD = 10000

    def test_a_crowd_is_served_or_refused_and_leaves_nothing(self):
        server = self.start("--max-workers", "4")
        self.echo()
        before = len(os.listdir(f"/proc/{server.pid}/fd"))
        self.raise_file_limit()
        statuses = {}
        ends = time.monotonic() + 2 * LONG
        crowd = {}
        poll = select.poll()

        def take(patience):
            for number, _ in poll.poll(patience):
                connection, nonce, raw = crowd[number]
                block = connection.recv(1 << 16)
                if block:
                    crowd[number] = (connection, nonce, raw + block)
                    continue
                poll.unregister(number)
                connection.close()
                del crowd[number]
                reply = Reply(raw)
                statuses[reply.status] = statuses.get(reply.status, 0) + 1
                if reply.status == 200:
                    self.assertEqual(reply.body["data"]["nonce"], nonce)

        # All connect before the first one says what it wants.
        for count in range(self.CROWD):
            connection = self.connect()
            self.addCleanup(connection.close)
            crowd[connection.fileno()] = (connection, f"c{count}", b"")
        for number, (connection, nonce, _) in crowd.items():
            self.send_while_taken(connection, query_request(LIVING, "echo", nonce=nonce))
            poll.register(number, select.POLLIN)
        while crowd and time.monotonic() < ends:
            take(1000)
        self.assertEqual(crowd, {})
        self.assertEqual(sum(statuses.values()), self.CROWD)
        self.assertEqual(set(statuses), {200, 503})
        self.echo()
        self.assertTrue(
            wait_for(lambda: len(os.listdir(f"/proc/{server.pid}/fd")) <= before + 8),
            os.listdir(f"/proc/{server.pid}/fd"),
        )

    def raise_file_limit(self):
        soft, hard = resource.getrlimit(resource.RLIMIT_NOFILE)
        resource.setrlimit(resource.RLIMIT_NOFILE, (min(hard, self.CROWD + 1000), hard))
        self.addCleanup(resource.setrlimit, resource.RLIMIT_NOFILE, (soft, hard))

    def test_who_says_nothing_or_little_holds_up_nobody_else(self):
        self.start("--min-workers", "4", "--max-workers", "4")
        whole = query_request(LIVING, "echo")
        with self.connect() as silent, self.connect() as half, self.connect() as slow:
            half.sendall(whole[: len(whole) // 2])
            stopped = threading.Event()

            def dribble():
                for byte in whole:
                    self.send_while_taken(slow, bytes([byte]))
                    if stopped.wait(1):
                        return

            thread = threading.Thread(target=dribble)
            thread.start()
            begun = time.monotonic()
            while time.monotonic() < begun + 3:
                self.echo()
            for connection in (silent, half, slow):
                self.assertEqual(Reply(self.read_all(connection)).status, 400)
            self.assertLess(time.monotonic() - begun, LONG)
            stopped.set()
            thread.join()
        self.echo()


class Workers(scgi_server.ServerTest):
    def test_a_child_that_stays_keeps_neither_the_client_nor_others_waiting(self):
        self.start("--min-workers", "1", "--max-workers", "1")
        for api in (LIVING, ONCE):
            with self.subTest(api):
                reply = self.ask(api, "leaveChild")
                self.assertIs(reply.body["success"], True)
                worker = reply.body["data"]["pid"]
                self.echo()
                children = lambda: [p for p in self.processes()
                                    if os.getpgid(p) == worker and p != worker]
                if api == LIVING:
                    self.assertTrue(wait_for(lambda: not children()))
                    continue
                # It is not the server's to end, but in reach of whoever ends its group.
                [child] = children()
                os.kill(child, signal.SIGKILL)

    def test_a_worker_that_is_stopped_is_ended_at_its_deadline(self):
        # Also where it is stopped before it knows the API's own.
        self.start("--min-workers", "1", "--max-workers", "1", "--deadline", "1")
        with self.connect() as connection:
            connection.sendall(query_request(LIVING, "hang"))
            self.assertTrue(wait_for(self.busy))
            for worker in self.busy():
                os.kill(worker, signal.SIGSTOP)
            self.assertEqual(Reply(self.read_all(connection)).status, 504)
        self.echo()

    def test_serves_who_had_not_spoken_yet_when_the_worker_died(self):
        server = self.start("--min-workers", "1", "--max-workers", "1")
        self.echo()
        [template] = self.children(server.pid)
        [worker] = wait_for(lambda: self.children(template))
        os.kill(worker, signal.SIGSTOP)
        with self.connect() as connection:
            time.sleep(0.2)
            os.kill(worker, signal.SIGKILL)
            self.assertTrue(wait_for(lambda: self.children(template) not in ([], [worker])))
            connection.sendall(query_request(LIVING, "echo", nonce="late"))
            self.assertEqual(Reply(self.read_all(connection)).body["data"]["nonce"], "late")


class Stopped(scgi_server.ServerTest):
    """What the server notices only after a while."""

    def test_a_worker_that_does_not_take_its_request_is_ended(self):
        server = self.start("--min-workers", "1", "--max-workers", "1")
        self.echo()
        [template] = self.children(server.pid)
        [worker] = wait_for(lambda: self.children(template))
        os.kill(worker, signal.SIGSTOP)
        reply = self.ask(LIVING, "echo", nonce="n")
        self.assertEqual(reply.status, 504)
        self.echo()

    def test_a_template_that_starts_no_worker_is_replaced(self):
        server = self.start("--min-workers", "1", "--max-workers", "1")
        self.echo()
        [template] = self.children(server.pid)
        os.kill(template, signal.SIGSTOP)
        for _ in range(2):
            self.echo(ONCE)
        self.assertFalse(scgi_server.alive(template))


class Orphans(scgi_server.ServerTest):
    """Workers whose master was killed."""

    def end_master(self):
        self.server.kill()
        self.server.wait()
        self.assertTrue(wait_for(lambda: not self.processes()), self.processes())

    def test_end_when_they_hang_in_a_method(self):
        self.start("--deadline", "1")
        with self.connect() as connection:
            connection.sendall(query_request(LIVING, "hangWithChild"))
            self.assertTrue(wait_for(self.busy))
            self.end_master()
            self.assertEqual(self.read_all(connection), b"")

    def test_end_when_the_web_server_does_not_send_all_of_a_request(self):
        self.start("--deadline", "1")
        with self.connect() as connection:
            connection.sendall(query_request(LIVING, "echo", length=100000) + b"x" * 50)
            self.assertTrue(wait_for(self.busy))
            self.end_master()

    def test_end_when_the_web_server_does_not_take_a_reply(self):
        self.start()
        with self.connect() as connection:
            connection.sendall(query_request(LIVING, "flood"))
            connection.recv(1)
            self.end_master()

    def test_end_when_their_template_went_before(self):
        server = self.start("--min-workers", "1", "--max-workers", "1", "--deadline", "1")
        with self.connect() as connection:
            connection.sendall(query_request(LIVING, "hang"))
            self.assertTrue(wait_for(self.busy))
            [template] = [pid for pid in self.children(server.pid) if pid not in self.busy()]
            os.kill(template, signal.SIGKILL)
            new = wait_for(
                lambda: [p for p in self.children(server.pid) if p not in (template, *self.busy())]
            )
            self.assertTrue(new)
            self.end_master()

    def test_serve_their_request_to_its_end(self):
        self.start()
        with self.connect() as connection:
            request = query_request(PATIENT, "dawdle", milliseconds=3000, nonce="late")
            connection.sendall(request)
            self.assertTrue(wait_for(self.busy))
            self.server.kill()
            self.server.wait()
            self.assertEqual(Reply(self.read_all(connection)).body["data"]["nonce"], "late")
        self.assertTrue(wait_for(lambda: not self.processes()), self.processes())


if __name__ == "__main__":
    unittest.main()
