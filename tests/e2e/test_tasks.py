"""Background tasks: they outlive their request, the caller and the web server."""

import http.client
import json
import signal
import socket
import time

from client import ENTRY, Client, form
from task_case import TaskCase, lives
from webserver import HOST, wait_until


class Start(TaskCase):
    def raw_start(self, sid, connection_header):
        body = form(api="Test.Task", version=1, method="start", finish=str(self.finish))
        return (f"POST {ENTRY} HTTP/1.1\r\nHost: {HOST}:{self.server.port}\r\n"
                f"Connection: {connection_header}\r\nCookie: id={sid}\r\n"
                f"Content-Type: application/x-www-form-urlencoded\r\n"
                f"Content-Length: {len(body)}\r\n\r\n{body}").encode()

    def test_the_server_closes_the_connection_while_the_task_runs(self):
        sid = self.log_in("bob")
        received = b""
        with socket.create_connection((HOST, self.server.port), timeout=20) as connection:
            connection.sendall(self.raw_start(sid, "close"))
            while block := connection.recv(65536):
                received += block
        self.assertTrue(received.startswith(b"HTTP/1.1 200 "), received)
        ids = self.data(sid, "list")["user"]
        self.assertEqual(len(ids), 1)
        self.assertIn(json.dumps(ids[0]).encode(), received)
        status = self.status(sid, ids[0])
        self.assertTrue(lives(status["data"]["pid"]))
        self.assertEqual(self.finishes(sid, ids[0])["data"]["state"], "done")

    def test_a_kept_connection_serves_the_next_call_while_the_task_runs(self):
        sid = self.log_in("bob")
        connection = http.client.HTTPConnection(HOST, self.server.port, timeout=20)
        self.addCleanup(connection.close)
        headers = {"Cookie": f"id={sid}", "Content-Type": "application/x-www-form-urlencoded"}
        connection.request("POST", ENTRY, form(api="Test.Task", version=1, method="start",
                                               finish=str(self.finish)), headers)
        task_id = json.loads(connection.getresponse().read())["data"]["task_id"]
        connection.request("POST", ENTRY, form(api="TALO.Task", version=1, method="status",
                                               task_id=task_id), headers)
        self.assertIs(json.loads(connection.getresponse().read())["data"]["finish"], False)
        self.finishes(sid, task_id)

    def test_a_task_goes_on_when_the_caller_has_left(self):
        sid = self.log_in("bob")
        with socket.create_connection((HOST, self.server.port), timeout=20) as connection:
            connection.sendall(self.raw_start(sid, "close"))
            self.assertTrue(wait_until(lambda: self.data(sid, "list")["user"]))
        task_id = self.data(sid, "list")["user"][0]
        self.assertTrue(wait_until(lambda: "data" in self.status(sid, task_id)))
        self.assertEqual(self.finishes(sid, task_id)["data"]["state"], "done")

    def test_without_room_for_a_process_there_is_no_task(self):
        sid = self.log_in("bob")
        self.fails(self.start(sid, full=1), 110)
        self.assertEqual(self.data(sid, "list"), {"user": []})

    def test_work_that_throws_leaves_an_error(self):
        sid = self.log_in("bob")
        task_id = self.start(sid, report="throw").document()["data"]["task_id"]
        self.assertTrue(wait_until(lambda: self.status(sid, task_id)["finish"]))
        self.assertEqual(self.status(sid, task_id)["error"], {"code": 117})

    def test_needs_a_login(self):
        self.refuses(self.client.call("Test.Task", "start"), 119, "unauth")

    def test_secrets_stay_out_of_the_record(self):
        sid = self.log_in("bob")
        reply = self.client.call("Test.Task", "start", _sid=sid, pin="hidden-pin",
                                 passwd="hidden-passwd", group="everyone", seconds=0)
        task_id = reply.document()["data"]["task_id"]
        reply = self.ask(self.log_in("ann"), "status", task_id=task_id)
        param = reply.document()["data"]["info"]["param"]
        self.assertEqual((param["pin"], param["passwd"]), ("*****", "*****"))
        self.assertEqual(param.get("_sid", "*****"), "*****")
        for secret in (sid, "hidden-pin", "hidden-passwd"):
            self.assertNotIn(secret.encode(), reply.body)
            for path in (self.server.root / "var/lib/talo/task").iterdir():
                self.assertNotIn(secret.encode(), path.read_bytes(), path)


class Sharing(TaskCase):
    def test_a_users_task_is_there_for_his_other_sessions_and_nobody_else(self):
        sid = self.log_in("bob")
        task_id, _ = self.started(sid)
        other = self.log_in("bob")
        self.assertEqual(self.data(other, "list")["user"], [task_id])
        admin = self.log_in("ann")
        for method in ("status", "progress", "stop"):
            self.fails(self.ask(admin, method, task_id=task_id), 503)
        self.assertEqual(self.data(admin, "list")["user"], [])
        self.assertEqual(self.finishes(other, task_id)["data"]["state"], "done")

    def test_everyones_task_is_there_for_every_user(self):
        task_id, pid = self.started(self.log_in("ann"), group="everyone")
        self.assertTrue(task_id.startswith("@users/"), task_id)
        sid = self.log_in("bob")
        self.assertEqual(self.data(sid, "list", groups='["everyone"]'), {"everyone": [task_id]})
        self.assertIs(self.data(sid, "progress", task_id=task_id)["finish"], False)
        self.succeeds(self.ask(sid, "stop", task_id=task_id))
        self.assertTrue(wait_until(lambda: not lives(pid)))
        self.assertIs(self.status(sid, task_id)["finish"], True)

    def test_the_administrators_task_is_there_for_them_only(self):
        task_id, pid = self.started(self.log_in("ann"), group="admin")
        self.assertTrue(task_id.startswith("@administrators/"), task_id)
        sid = self.log_in("bob")
        for method in ("status", "progress", "stop"):
            self.fails(self.ask(sid, method, task_id=task_id), 503)
        self.fails(self.ask(sid, "list", groups='["admin"]'), 505)
        self.assertTrue(lives(pid))
        admin = self.log_in("ann")
        self.assertEqual(self.data(admin, "list", groups='["admin"]'), {"admin": [task_id]})
        self.succeeds(self.ask(admin, "stop", task_id=task_id))
        self.assertTrue(wait_until(lambda: not lives(pid)))


class Stop(TaskCase):
    def test_ends_the_process_and_leaves_the_last_result(self):
        sid = self.log_in("bob")
        task_id, pid = self.started(sid)
        self.succeeds(self.ask(sid, "stop", task_id=task_id))
        self.assertTrue(wait_until(lambda: not lives(pid)))
        status = self.status(sid, task_id)
        self.assertEqual((status["finish"], status["data"]["state"]), (True, "running"))

    def test_lets_the_work_leave_a_result_of_its_own(self):
        sid = self.log_in("bob")
        task_id, pid = self.started(sid, graceful="true")
        self.succeeds(self.ask(sid, "stop", task_id=task_id))
        self.assertTrue(wait_until(lambda: not lives(pid)))
        self.assertEqual(self.status(sid, task_id)["data"]["state"], "stopped")


class Progress(TaskCase):
    def test_comes_while_the_task_runs(self):
        sid = self.log_in("bob")
        task_id, _ = self.started(sid, lines=3)
        self.assertTrue(wait_until(
            lambda: self.data(sid, "progress", task_id=task_id)["next"] == 3))
        data = self.data(sid, "progress", task_id=task_id, offset=1)
        self.assertEqual((data["percent"], data["log"], data["finish"]),
                         (100.0, ["line 1", "line 2"], False))


class WebServerGoes(TaskCase):
    def test_a_restart_that_the_response_asks_for_leaves_the_task_alone(self):
        sid = self.log_in("bob")
        before = self.server.restarts()
        task_id, pid = self.started(sid, restart=1)
        self.assertTrue(wait_until(lambda: self.server.restarts() > before))
        # Time for a server that would end what it has started to do so.
        self.assertFalse(wait_until(lambda: not lives(pid), seconds=1))
        self.assertEqual(self.finishes(sid, task_id)["data"], {"state": "done", "pid": pid})

    def test_a_task_goes_on_when_the_web_server_has_stopped(self):
        sid = self.log_in("bob")
        task_id, pid = self.started(sid)
        self.assertEqual(self.server.script.stop(signal.SIGTERM), 0)
        try:
            with self.assertRaises(ConnectionRefusedError):
                self.client.get("")
            time.sleep(0.5)
            self.assertTrue(lives(pid))
        finally:
            self.server.start()
            self.client = Client(HOST, self.server.port)
        self.assertEqual(self.finishes(sid, task_id)["data"], {"state": "done", "pid": pid})
