"""webapi-server as a process: what web servers get of it, whatever becomes of its parts."""

import contextlib
import os
import random
import signal
import socket
import stat
import subprocess
import threading
import time
import unittest

import scgi_server
from scgi_server import LIVING, LONG, ONCE, PATIENT, SERVER, Reply, query_request, wait_for


class Answers(scgi_server.ServerTest):
    def test_answers_a_request(self):
        self.start()
        self.assertEqual(self.echo()["nonce"], "n")
        self.assertEqual(self.echo(ONCE)["nonce"], "n")

    def test_serves_one_request_after_the_other_with_a_living_worker(self):
        self.start("--max-workers", "1", "--min-workers", "1")
        first = self.echo()
        second = self.echo()
        self.assertEqual(second["pid"], first["pid"])
        self.assertEqual(second["served"], 2)

    def test_serves_each_request_with_a_process_of_its_own(self):
        self.start()
        replies = [self.echo(ONCE) for _ in range(20)]
        self.assertEqual(len({reply["pid"] for reply in replies}), 20)
        self.assertEqual({reply["served"] for reply in replies}, {1})

    def test_gives_each_client_its_own_answer(self):
        self.start("--max-workers", "8")
        wrong = []

        def client(number):
            for count in range(50):
                nonce = f"c{number}-{count}"
                reply = self.ask(ONCE if count % 5 == 0 else LIVING, "echo", nonce=nonce)
                if reply.body.get("data", {}).get("nonce") != nonce:
                    wrong.append(reply.raw)

        clients = [threading.Thread(target=client, args=(number,)) for number in range(8)]
        for thread in clients:
            thread.start()
        for thread in clients:
            thread.join()
        self.assertEqual(wrong, [])

    def test_lets_requests_wait_until_there_is_a_worker(self):
        self.start("--min-workers", "1", "--max-workers", "2")
        connections = [self.connect() for _ in range(10)]
        for number, connection in enumerate(connections):
            connection.sendall(query_request(LIVING, "dawdle", milliseconds=50, nonce=f"w{number}"))
        for number, connection in enumerate(connections):
            with connection:
                reply = Reply(self.read_all(connection))
            self.assertEqual(reply.body["data"]["nonce"], f"w{number}")

    def test_answers_503_when_too_many_wait(self):
        self.start("--min-workers", "1", "--max-workers", "1", "--queue", "2")
        self.occupy()
        connections = [self.connect() for _ in range(8)]
        for connection in connections:
            connection.sendall(query_request(LIVING, "echo"))
        for connection in connections[2:]:
            with connection:
                reply = Reply(self.read_all(connection))
            self.assertEqual(reply.status, 503)
            self.assertEqual(reply.body, {"success": False, "error": {"code": 100}})
        self.free()
        for connection in connections[:2]:
            with connection:
                self.assertIs(Reply(self.read_all(connection)).body["success"], True)

    def test_answers_503_to_who_is_still_sending(self):
        self.start("--min-workers", "1", "--max-workers", "1", "--queue", "1")
        self.occupy()
        waiting = self.connect()
        with waiting, self.connect() as connection:
            body = b"x" * (4 << 20)
            self.send_while_taken(connection, query_request(LIVING, "echo") + body)
            self.assertEqual(Reply(self.read_all(connection)).status, 503)
        self.free()

    def test_answers_500_when_a_method_crashes(self):
        self.start()
        for method in ("crash", "vanish"):
            for api in (LIVING, ONCE):
                reply = self.ask(api, method)
                self.assertEqual(reply.status, 500, (method, api))
                self.assertEqual(reply.body, {"success": False, "error": {"code": 117}})
        self.echo()

    def test_answers_504_when_a_method_hangs(self):
        self.start()
        for method in ("hang", "hangWithChild"):
            reply = self.ask(LIVING, method)
            self.assertEqual(reply.status, 504)
            self.assertEqual(reply.body, {"success": False, "error": {"code": 117}})
        # The master, the template, and workers: none of them the method's child.
        self.assertTrue(wait_for(lambda: len(self.processes()) == 4), self.processes())

    def test_lets_a_download_that_makes_progress_go_on(self):
        self.start()
        self.assertEqual(self.raw(LIVING, "stream").partition(b"\r\n\r\n")[2], 15 * b"part ")

    def test_ends_a_download_that_makes_none(self):
        self.start()
        self.assertEqual(self.raw(LIVING, "stall").partition(b"\r\n\r\n")[2], b"part ")
        self.echo()

    def test_serves_others_when_a_library_cannot_be_loaded(self):
        self.libraries[scgi_server.BAD] = scgi_server.BAD_MODULE
        self.describe(scgi_server.BAD)
        self.addCleanup(self.forget, scgi_server.BAD)
        self.start()
        self.echo()
        self.echo(ONCE)
        self.assertEqual(self.ask(scgi_server.BAD, "echo").status, 500)
        self.echo()

    def test_outlives_clients_that_have_gone(self):
        self.start("--min-workers", "1", "--max-workers", "2")
        for cut in range(0, 60, 7):
            with self.connect() as connection:
                connection.sendall(query_request(LIVING, "echo")[:cut])
        self.echo()

    def test_answers_400_to_what_is_no_request(self):
        self.start()
        with self.connect() as connection:
            connection.sendall(b"GET / HTTP/1.0\r\n\r\n")
            self.assertEqual(Reply(self.read_all(connection)).status, 400)


class Workers(scgi_server.ServerTest):
    def test_has_workers_ready_and_more_under_load(self):
        self.start("--min-workers", "2", "--max-workers", "6")
        self.assertTrue(wait_for(lambda: len(self.processes()) == 4), self.processes())
        self.occupy(6)
        self.assertEqual(len(self.processes()), 8)
        self.free()
        self.echo()
        self.assertLessEqual(len(self.processes()), 8)

    def test_replaces_a_worker_that_died_while_idle(self):
        server = self.start("--min-workers", "6")
        self.echo()
        template = self.children(server.pid)[0]
        wait_for(lambda: len(self.children(template)) == 6)
        before = self.children(template)
        for worker in before:
            os.kill(worker, signal.SIGKILL)
        self.assertNotIn(self.echo()["pid"], before)
        self.assertTrue(wait_for(lambda: len(self.children(template)) == 6))

    def test_replaces_a_template_that_died(self):
        server = self.start()
        self.echo(ONCE)
        template = self.children(server.pid)[0]
        os.kill(template, signal.SIGKILL)
        for _ in range(5):
            self.echo(ONCE)
        self.assertNotIn(template, self.children(server.pid))

    def accepts(self):
        with contextlib.suppress(ConnectionRefusedError):
            self.connect().close()
            return True
        return False

    def test_gives_a_worker_no_descriptor_but_its_own(self):
        server = self.start("--max-workers", "4")
        busy = [self.connect() for _ in range(3)]
        for connection in busy:
            connection.sendall(query_request(LIVING, "dawdle", milliseconds=600))
        time.sleep(0.3)
        seen = {}
        for worker in [pid for pid in self.processes() if pid != server.pid]:
            for number in os.listdir(f"/proc/{worker}/fd"):
                try:
                    target = os.readlink(f"/proc/{worker}/fd/{number}")
                except FileNotFoundError:
                    continue
                if target.startswith("socket:"):
                    seen.setdefault(target, set()).add(worker)
        # The template has none of a request; what it has is of all of them.
        (template,) = self.children(server.pid)
        common = {target for target, users in seen.items() if template in users}
        self.assertEqual(len(common), 2, common)
        shared = {target: users for target, users in seen.items()
                  if len(users) > 1 and target not in common}
        self.assertEqual(sum(target not in common for target in seen), 3 + 3 + 1)
        for connection in busy:
            with connection:
                self.read_all(connection)
        self.assertEqual(shared, {})

    def test_keeps_no_descriptor_of_a_request(self):
        server = self.start("--min-workers", "1", "--max-workers", "1")
        self.echo()

        def descriptors():
            folder = f"/proc/{server.pid}/fd"
            found = []
            for name in os.listdir(folder):
                # One may be closed between the two looks.
                with contextlib.suppress(FileNotFoundError):
                    found.append(os.readlink(f"{folder}/{name}").split(":")[0])
            return found

        # Longer than the server waits before it looks for changes.
        self.assertTrue(wait_for(lambda: len(self.processes()) == 3))
        looks = []
        while looks[-20:] != 20 * looks[-1:] or len(looks) < 20:
            time.sleep(0.1)
            looks.append(sorted(descriptors()))
        before = looks[-1]
        for _ in range(100):
            self.echo()
        self.ask(LIVING, "vanish", milliseconds=50)
        self.echo()
        self.assertTrue(wait_for(lambda: sorted(descriptors()) == before), before)

    def test_ends_with_its_master(self):
        server = self.start()
        self.echo()
        self.rest()
        with self.connect() as connection:
            connection.sendall(query_request(PATIENT, "dawdle", milliseconds=500, nonce="late"))
            self.assertTrue(wait_for(self.busy))
            server.kill()
            server.wait()
            self.assertEqual(Reply(self.read_all(connection)).body["data"]["nonce"], "late")
        self.assertTrue(wait_for(lambda: not self.processes()), self.processes())

    def test_is_replaced_when_it_is_killed(self):
        """Also while a worker of it has a request, and others wait."""
        server = self.start("--min-workers", "1", "--max-workers", "1")
        self.echo()
        self.rest()
        with self.connect() as busy, self.connect() as waiting:
            busy.sendall(query_request(PATIENT, "dawdle", milliseconds=1500, nonce="late"))
            self.assertTrue(wait_for(self.busy))
            server.kill()
            server.wait()
            waiting.settimeout(LONG)
            self.assertEqual(waiting.recv(1), b"")
            # Until then whoever connects would wait for the one that is gone.
            self.assertTrue(wait_for(lambda: not self.accepts()))
            self.start()
            self.assertTrue(wait_for(self.accepts))
            self.echo()
            self.assertEqual(Reply(self.read_all(busy)).body["data"]["nonce"], "late")


class Socket(scgi_server.ServerTest):
    def run_server(self, *options, **more):
        return subprocess.run(
            [SERVER, *options], capture_output=True, timeout=LONG, check=False, **more
        )

    def test_lets_owner_and_group_connect(self):
        self.start()
        self.assertEqual(stat.S_IMODE(os.stat(self.socket).st_mode), 0o660)

    def test_refuses_a_socket_that_is_in_use(self):
        self.start()
        result = self.run_server("--socket", self.socket)
        self.assertEqual(result.returncode, 1)
        self.assertIn(b"in use", result.stderr)
        self.echo()

    def test_explains_wrong_usage(self):
        for options in ((), ("--queue", "x"), ("--nonsense",), ("--socket", "/x", "more")):
            result = self.run_server(*options)
            self.assertEqual(result.returncode, 2, options)
            self.assertIn(b"usage:", result.stderr)
        self.assertEqual(self.run_server("--help").returncode, 0)

    def test_takes_the_socket_that_systemd_hands_over(self):
        self.socket = os.path.join(self.folder, "handed-over")
        with socket.socket(socket.AF_UNIX) as listening:
            listening.bind(self.socket)
            listening.listen(16)
            script = (
                "import os, sys; os.dup2(int(sys.argv[1]), 3);"
                "os.environ.update(LISTEN_FDS='1', LISTEN_PID=str(os.getpid()));"
                "os.execv(sys.argv[2], sys.argv[3:])"
            )
            # Its name is the socket's, by which the test finds its processes.
            server = subprocess.Popen(
                ["/usr/bin/python3", "-c", script]
                + [str(listening.fileno()), SERVER, self.socket, "--queue", "5"],
                pass_fds=(listening.fileno(),),
            )
            self.addCleanup(self.stop, server, self.socket)
            self.echo()
            server.send_signal(signal.SIGTERM)
            self.assertEqual(server.wait(LONG), 0)
            self.assertTrue(os.path.exists(self.socket))


class Trouble(scgi_server.ServerTest):
    def helps_a_worker(self, pid):
        """A sanitizer's process, which a worker that ends would wait for without an end."""
        with contextlib.suppress(OSError):
            of = scgi_server.parent(pid)
            return (of in self.processes() and of != self.server.pid and
                    os.getsid(of) != of)  # nor the template, whose the workers are
        return False

    def test_gives_no_foreign_answer_whoever_is_killed(self):
        """Workers, template and master die at random under eight clients."""
        self.start("--max-workers", "6")
        self.echo()
        ends = time.monotonic() + 5
        foreign = []
        right = [0]

        def client(number):
            count = 0
            while time.monotonic() < ends:
                count += 1
                nonce = f"k{number}-{count}"
                try:
                    reply = self.ask(ONCE if count % 4 == 0 else LIVING, "echo", nonce=nonce)
                except OSError:
                    continue
                if reply.status == 500 and reply.body["error"] == {"code": 117}:
                    continue
                if reply.body.get("data", {}).get("nonce") != nonce:
                    foreign.append(reply.raw)
                right[0] += 1

        clients = [threading.Thread(target=client, args=(number,)) for number in range(8)]
        for thread in clients:
            thread.start()
        choice = random.Random(7)
        round_ = 0
        while time.monotonic() < ends:
            time.sleep(0.05)
            round_ += 1
            if round_ % 30 == 0:
                self.server.kill()
                self.server.wait()
                self.start("--max-workers", "6", socket_path=self.socket)
                continue
            others = [pid for pid in self.processes()
                      if pid != self.server.pid and not self.helps_a_worker(pid)]
            if others:
                try:
                    os.kill(choice.choice(others), signal.SIGKILL)
                except ProcessLookupError:
                    pass
        for thread in clients:
            thread.join()
        self.assertEqual(foreign, [])
        self.assertGreater(right[0], 100)
        self.echo()
        self.assertTrue(wait_for(lambda: len(self.processes()) <= 8), self.processes())


if __name__ == "__main__":
    unittest.main()
