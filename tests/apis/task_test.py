"""TALO.Task: background tasks, started by an API of the test's own."""

import json
import os
import pathlib
import signal
import sqlite3
import time
import unittest

import appliance
from appliance import (TASK_DIR, ApplianceTest, call, forget_tasks, form, last_use, leave_unused,
                       post, session, wait_until)

HERE = pathlib.Path(__file__).resolve().parent
DESCRIPTION = json.loads((HERE.parent / "e2e/Test.Task.lib").read_text(encoding="utf-8"))
METHODS = ("status", "progress", "stop", "list")


def task(method, cookie=None, variables=None, **parameters):
    return call("TALO.Task", method, 1, cookie, variables, **parameters)


def lives(pid):
    """Whether there is such a process, and not just what its parent has yet to ask for."""
    try:
        state = pathlib.Path(f"/proc/{pid}/stat").read_text(encoding="utf-8")
    except OSError:
        return False
    return state.rpartition(")")[2].split()[0] not in "ZX"


class TaskTest(ApplianceTest):
    def setUp(self):
        super().setUp()
        forget_tasks()
        self.describe_api("Test.Task", {
            **DESCRIPTION["Test.Task"],
            "lib": os.environ["TEST_MODULE_DIR"] + "/TestTask.so"})
        self.pids = []

    def tearDown(self):
        for pid in self.pids:
            if lives(pid):
                os.kill(pid, signal.SIGKILL)
        forget_tasks()

    def start(self, sid, **parameters):
        """Answers the full id of a task that runs on."""
        task_id = call("Test.Task", "start", 1, sid, **parameters).data["task_id"]
        data = self.status(sid, task_id).get("data")
        if data is not None:
            self.pids.append(data["pid"])
        return task_id

    def status(self, sid, task_id):
        return task("status", sid, task_id=task_id).data

    def finished(self, sid, task_id):
        """The status once the task has finished."""
        self.assertTrue(wait_until(lambda: self.status(sid, task_id)["finish"]))
        return self.status(sid, task_id)


class NeedsASession(TaskTest):
    def test_for_every_method(self):
        for method in METHODS:
            with self.subTest(method):
                self.refused_as(task(method, task_id="normal/1"), 119, "unauth")
                self.refused_as(task(method, "s" + "A" * 43, task_id="normal/1"), 105,
                                "noprivilege")

    def test_that_looking_does_not_keep_alive(self):
        sid = self.log_in("normal")
        task_id = self.start(sid, seconds=0)
        for method, renews in (("status", False), ("progress", False), ("list", True),
                               ("stop", True)):
            leave_unused(sid, 29 * 60)
            before = last_use(sid)
            self.assertEqual(task(method, sid, task_id=task_id).code, 0, method)
            self.assertEqual(last_use(sid) > before, renews, method)


class Start(TaskTest):
    def test_answers_the_full_id_and_nothing_else(self):
        sid = self.log_in("normal")
        data = call("Test.Task", "start", 1, sid, prefix="index-", seconds=0).data
        self.assertEqual(list(data), ["task_id"])
        self.assertRegex(data["task_id"], r"\Anormal/index-[A-Za-z0-9_.-]+\Z")

    def test_refuses_a_prefix_that_is_no_name(self):
        sid = self.log_in("normal")
        for prefix in ("a b", "../x", "a/b", "ä", "x" * 65, "*", "a\nb", "a\0b"):
            with self.subTest(prefix):
                self.refused(call("Test.Task", "start", 1, sid, prefix=prefix, seconds=0), 117)
        self.assertEqual(task("list", sid).data, {"user": []})

    def test_shares_with_administrators_for_one_of_them_only(self):
        self.refused(call("Test.Task", "start", 1, self.log_in("normal"), group="admin"), 400, 505)
        self.refused(call("Test.Task", "start", 1, self.log_in("normal"), group="x"), 400, 502)
        self.assertRegex(self.start(self.log_in("boss"), group="admin", seconds=0),
                         r"\A@administrators/")

    def test_answers_110_when_there_may_be_no_more_processes(self):
        sid = self.log_in("normal")
        self.refused(call("Test.Task", "start", 1, sid, full=1), 110)
        self.assertEqual(task("list", sid).data, {"user": []})


class Status(TaskTest):
    def test_tells_of_a_task_that_runs_and_then_that_it_has_finished(self):
        sid = self.log_in("normal")
        task_id = self.start(sid, seconds=30, finish=str(appliance.HOST_CONF))
        running = self.status(sid, task_id)
        pid = running["data"]["pid"]
        self.assertTrue(lives(pid))
        self.assertEqual(running, {
            "success": True, "data": {"state": "running", "pid": pid}, "finish": False,
            "auto_remove": True,
            "info": {"api": "Test.Task", "version": 1, "method": "start", "group": "",
                     "prefix": "",
                     "param": {"seconds": 30, "finish": str(appliance.HOST_CONF)}}})
        appliance.configure("")
        finished = self.finished(sid, task_id)
        self.assertEqual(finished["data"], {"state": "done", "pid": pid})
        self.assertEqual({**running, "finish": True, "data": None}, {**finished, "data": None})

    def test_tells_of_work_that_threw(self):
        sid = self.log_in("normal")
        task_id = self.start(sid, report="throw", auto_remove=False)
        status = self.finished(sid, task_id)
        self.assertEqual((status["success"], status["error"]), (False, {"code": 117}))
        self.assertIs(status["auto_remove"], False)

    def test_hides_secret_parameters(self):
        sid = self.log_in("normal")
        reply = post(form({"api": "Test.Task", "version": 1, "method": "start", "_sid": sid,
                           "passwd": "hidden-1", "pin": "hidden-2", "seconds": 0}))
        text = task("status", sid, task_id=reply.data["task_id"]).text
        param = json.loads(text)["data"]["info"]["param"]
        self.assertEqual(param, {"passwd": "*****", "pin": "*****", "seconds": 0,
                                 **({"_sid": "*****"} if "_sid" in param else {})})
        self.assertNotIn(sid, text)
        for path in TASK_DIR.iterdir():
            content = path.read_bytes()
            for secret in (sid.encode(), b"hidden-1", b"hidden-2"):
                self.assertNotIn(secret, content, path)

    def test_answers_several_at_once(self):
        sid = self.log_in("normal")
        mine = self.start(sid, seconds=0)
        shared = self.start(self.log_in("other"), group="everyone", seconds=0)
        theirs = self.start(self.log_in("other"), seconds=0)
        for task_id in (mine, shared):
            self.finished(sid, task_id)
        data = task("status", sid, task_id=[mine, "malformed", theirs, "normal/none", shared,
                                            "@administrators/x", ""]).data
        self.assertEqual(data, {mine: self.status(sid, mine), "normal/none": {},
                                shared: self.status(sid, shared)})
        self.assertEqual(task("status", sid, task_id=[]).data, {})

    def test_is_not_told_to_another_user_even_an_administrator(self):
        task_id = self.start(self.log_in("normal"), seconds=0)
        for name in ("other", "boss"):
            for method in ("status", "progress", "stop"):
                self.refused(task(method, self.log_in(name), task_id=task_id), 503)

    def test_of_a_shared_task_is_told_to_those_it_is_shared_with(self):
        boss, normal = self.log_in("boss"), self.log_in("normal")
        task_id = self.start(boss, group="admin", seconds=0)
        self.refused(task("status", normal, task_id=task_id), 503)
        self.refused(task("progress", normal, task_id=task_id), 503)
        self.refused(task("stop", normal, task_id=task_id), 503)
        self.assertEqual(self.status(self.log_in("boss"), task_id)["info"]["group"], "admin")
        task_id = self.start(boss, group="everyone", seconds=0)
        self.assertEqual(self.status(normal, task_id)["info"]["group"], "everyone")

    def test_refuses_what_names_no_task(self):
        sid = self.log_in("normal")
        for task_id, code, errors in (
                ("", 502, None), ("none", 503, None), ("normal/none", 508, None),
                ("normal/", 508, None), ("/x", 503, None), ("normal/../boss", 508, None),
                ("normal/a/b", 508, None), ("@users/none", 508, None),
                ("normal/x\0", 508, None), ("x" * 100000, 503, None),
                ("normal/" + "x" * 100000, 508, None),
                (None, 502, "task_id"), (7, 502, "task_id"), (True, 502, "task_id"),
                ({"a": "normal/1"}, 502, "task_id"), ([1], 502, "task_id"),
                (["normal/1", None], 502, "task_id"), (["normal/1"] * 1001, 502, "task_id")):
            with self.subTest(str(task_id)[:40]):
                self.refused(task("status", sid, task_id=task_id), code, errors)
        self.refused(task("status", sid), 502, "task_id")
        self.assertEqual(task("status", sid, task_id=["normal/1"] * 1000).data, {"normal/1": {}})

    def test_tells_of_a_task_whose_process_was_killed(self):
        sid = self.log_in("normal")
        silent = self.start(sid, report="throw")
        told = self.start(sid, seconds=60)
        os.kill(self.pids[-1], signal.SIGKILL)
        self.assertTrue(wait_until(lambda: not lives(self.pids[-1])))
        self.let_the_sweep_be_due()
        status = self.finished(sid, told)
        self.assertEqual((status["success"], status["data"]["state"]), (True, "running"))
        self.assertEqual(self.status(sid, silent)["error"], {"code": 117})

    def let_the_sweep_be_due(self):
        path = next(path for path in TASK_DIR.iterdir()
                    if path.read_bytes()[:15] == b"SQLite format 3")
        with sqlite3.connect(path, timeout=30) as store:
            store.execute("UPDATE state SET value = 0 WHERE name = 'swept'")
        store.close()


class Progress(TaskTest):
    def progress(self, sid, task_id, **parameters):
        return task("progress", sid, task_id=task_id, **parameters).data

    def test_of_a_task_that_tells_nothing(self):
        sid = self.log_in("normal")
        task_id = self.start(sid, seconds=0)
        self.finished(sid, task_id)
        self.assertEqual(self.progress(sid, task_id), {
            "percent": None, "text": "", "log": [], "offset": 0, "next": 0, "time": None,
            "finish": True})

    def test_tells_the_lines_from_an_offset_on(self):
        sid = self.log_in("normal")
        before = int(time.time())
        task_id = self.start(sid, lines=5, seconds=0)
        self.finished(sid, task_id)
        lines = [f"line {number}" for number in range(5)]
        for offset, first in ((0, 0), (3, 3), (5, 5), (6, 5), (2**62, 5), (None, 0)):
            with self.subTest(offset):
                data = self.progress(sid, task_id, offset=offset)
                self.assertTrue(before <= data.pop("time") <= time.time())
                self.assertEqual(data, {"percent": 100.0, "text": "logging", "log": lines[first:],
                                        "offset": first, "next": 5, "finish": True})

    def test_does_not_tell_lines_that_have_gone(self):
        sid = self.log_in("normal")
        task_id = self.start(sid, lines=620, seconds=0)
        self.finished(sid, task_id)
        for offset, first in ((0, 120), (119, 120), (121, 121), (619, 619)):
            data = self.progress(sid, task_id, offset=offset)
            self.assertEqual((data["offset"], data["next"]), (first, 620))
            self.assertEqual(data["log"], [f"line {number}" for number in range(first, 620)])

    def test_comes_while_the_task_runs(self):
        sid = self.log_in("normal")
        task_id = self.start(sid, lines=2, seconds=30)
        self.assertTrue(wait_until(lambda: self.progress(sid, task_id)["next"] == 2))
        self.assertIs(self.progress(sid, task_id)["finish"], False)

    def test_refuses_wrong_parameters(self):
        sid = self.log_in("normal")
        for parameters, code, errors in (
                ({}, 502, "task_id"), ({"task_id": ["normal/1"]}, 502, "task_id"),
                ({"task_id": ""}, 502, None), ({"task_id": "none"}, 503, None),
                ({"task_id": "normal/none"}, 508, None),
                ({"task_id": "normal/1", "offset": -1}, 502, "offset"),
                ({"task_id": "normal/1", "offset": "x"}, 502, "offset"),
                ({"task_id": "normal/1", "offset": 1.5}, 502, "offset"),
                ({"task_id": "normal/1", "offset": 2**70}, 502, "offset")):
            with self.subTest(parameters):
                self.refused(task("progress", sid, **parameters), code, errors)


class Stop(TaskTest):
    def test_ends_the_process_and_marks_the_task_finished(self):
        sid = self.log_in("normal")
        for remove in (None, False, True):
            task_id = self.start(sid, seconds=60)
            pid = self.pids[-1]
            self.assertTrue(lives(pid))
            parameters = {} if remove is None else {"remove": remove}
            reply = task("stop", sid, task_id=task_id, **parameters)
            self.assertEqual(reply.body, {"success": True})
            self.assertTrue(wait_until(lambda: not lives(pid)))
            status = self.status(sid, task_id)
            self.assertIs(status["finish"], True)
            self.assertIs(status["auto_remove"], bool(remove))
            self.assertEqual(status["data"]["state"], "running")

    def test_lets_the_work_leave_a_result(self):
        sid = self.log_in("normal")
        # The same of both: either the work or the stop may be the last to finish it.
        task_id = self.start(sid, seconds=60, graceful=True, auto_remove=False)
        self.assertEqual(task("stop", sid, task_id=task_id).code, 0)
        self.assertTrue(wait_until(lambda: not lives(self.pids[-1])))
        status = self.status(sid, task_id)
        self.assertEqual((status["data"]["state"], status["finish"]), ("stopped", True))
        self.assertIs(status["auto_remove"], False)

    def test_may_be_asked_twice(self):
        sid = self.log_in("normal")
        task_id = self.start(sid, seconds=0)
        self.finished(sid, task_id)
        for _ in range(2):
            self.assertEqual(task("stop", sid, task_id=task_id).body, {"success": True})

    def test_of_a_shared_task_is_for_everyone_it_is_shared_with(self):
        task_id = self.start(self.log_in("normal"), group="everyone", seconds=60)
        self.assertEqual(task("stop", self.log_in("other"), task_id=task_id).code, 0)
        self.assertTrue(wait_until(lambda: not lives(self.pids[-1])))

    def test_refuses_what_names_no_task(self):
        sid = self.log_in("normal")
        for parameters, code, errors in (
                ({}, 502, "task_id"), ({"task_id": ["normal/1"]}, 502, "task_id"),
                ({"task_id": ""}, 502, None), ({"task_id": "none"}, 502, None),
                ({"task_id": "boss/1"}, 503, None), ({"task_id": "normal/none"}, 508, None),
                ({"task_id": "normal/1", "remove": "x"}, 502, "remove"),
                ({"task_id": "normal/1", "remove": 1}, 502, "remove")):
            with self.subTest(parameters):
                self.refused(task("stop", sid, **parameters), code, errors)


class List(TaskTest):
    def test_shows_ones_own_tasks_unless_asked_for_others(self):
        normal, other, boss = (self.log_in(name) for name in ("normal", "other", "boss"))
        first = self.start(normal, prefix="copy-", seconds=0)
        second = self.start(normal, prefix="index-", seconds=0)
        shared = self.start(other, prefix="index-", group="everyone", seconds=0)
        admins = self.start(boss, group="admin", seconds=0)
        self.assertEqual({name: sorted(ids) for name, ids in task("list", normal).data.items()},
                         {"user": sorted([first, second])})
        self.assertEqual(task("list", normal, prefix="index-", groups=["everyone", "user"]).data,
                         {"everyone": [shared], "user": [second]})
        self.assertEqual(task("list", other).data, {"user": []})
        self.assertEqual(task("list", boss, groups=["admin", "user"]).data,
                         {"admin": [admins], "user": []})
        self.assertEqual(task("list", normal, groups=[]).data, {})
        self.assertEqual(task("list", normal, groups=None, prefix=None).data.keys(), {"user"})

    def test_takes_a_prefix_that_looks_like_a_number(self):
        sid = self.log_in("normal")
        task_id = call("Test.Task", "start", 1, sid, prefix='"2024"', seconds=0).data["task_id"]
        self.assertEqual(task("list", sid, prefix=2024).data, {"user": [task_id]})
        self.assertEqual(task("list", sid, prefix="2025").data, {"user": []})

    def test_refuses_groups_that_there_are_not(self):
        sid = self.log_in("normal")
        for parameters, code, errors in (
                ({"groups": ["admin"]}, 505, None), ({"groups": ["user", "friends"]}, 503, None),
                ({"groups": ["@users"]}, 503, None), ({"groups": [""]}, 503, None),
                ({"groups": "user"}, 502, "groups"), ({"groups": {"a": "user"}}, 502, "groups"),
                ({"groups": [1]}, 502, "groups"), ({"groups": ["user"] * 4}, 502, "groups"),
                ({"prefix": ["a"]}, 502, "prefix"), ({"prefix": 1.5}, 502, "prefix")):
            with self.subTest(parameters):
                self.refused(task("list", sid, **parameters), code, errors)

    def test_finds_nothing_by_a_prefix_that_no_task_can_have(self):
        sid = self.log_in("normal")
        self.start(sid, prefix="a", seconds=0)
        for prefix in ("a b", "%", "_", "*", "a\0", "ä", "x" * 100000, "a'; --"):
            with self.subTest(prefix[:20]):
                self.assertEqual(task("list", sid, prefix=prefix).data, {"user": []})


if __name__ == "__main__":
    unittest.main()
