"""TALO.File.Checksum: SHA-256 in the background."""

import hashlib
import json
import os
import pathlib
import shutil
import subprocess
import tempfile
import unittest

from appliance import ROOT, ApplianceTest, call, forget_tasks, wait_until

SHARES_FILE = ROOT / "etc/talo/shares"


def sha256(content):
    return hashlib.sha256(content).hexdigest()


def sum_by_tools(folder):
    """A folder's sum as anybody can compute it."""
    return subprocess.run(
        "find . -type f -printf '%P\\0' | LC_ALL=C sort -z | xargs -0 -r sha256sum -z -- "
        "| sha256sum", shell=True, check=True, cwd=folder, capture_output=True,
        text=True).stdout.split()[0]


class ChecksumTest(ApplianceTest):
    def setUp(self):
        super().setUp()
        self.folder = pathlib.Path(tempfile.mkdtemp(dir=ROOT))
        self.addCleanup(shutil.rmtree, self.folder, ignore_errors=True)
        self.addCleanup(SHARES_FILE.unlink, missing_ok=True)
        self.addCleanup(forget_tasks)
        SHARES_FILE.write_text(json.dumps(
            {"name": "data", "folder": str(self.folder), "readers": ["normal"]}) + "\n",
            encoding="utf-8")
        SHARES_FILE.chmod(0o600)
        self.sid = self.log_in("normal")

    def write(self, name, content):
        path = self.folder / name
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_bytes(content)

    # As large as it takes to be stopped in the middle, and no block of the disk.
    def write_endless(self):
        with open(self.folder / "endless", "wb") as file:
            file.truncate(1 << 42)

    def start(self, sid=None, **parameters):
        return call("TALO.File.Checksum", "start", 1, sid or self.sid, **parameters)

    def task(self, method, task_id, sid=None, **parameters):
        return call("TALO.Task", method, 1, sid or self.sid, task_id=task_id, **parameters)

    def status(self, task_id):
        return self.task("status", task_id).data

    def finished(self, task_id):
        self.assertTrue(wait_until(lambda: self.status(task_id)["finish"]), task_id)
        return self.status(task_id)

    def result(self, **parameters):
        return self.finished(self.start(**parameters).data["task_id"])["data"]


class Sums(ChecksumTest):
    def test_are_those_of_files(self):
        for content in (b"", b"abc", bytes(range(256)) * 10000):
            self.write("file", content)
            data = self.result(path="/data/file")
            self.assertEqual((data["state"], data["sha256"], data["files"], data["bytes"]),
                             ("done", sha256(content), 1, len(content)))
            self.assertNotIn("checksums", data)
            self.assertGreaterEqual(data["rate"], 0)

    def test_are_those_of_folders(self):
        for name in ("b/c", "b-", "b.", "b/a", "a", "-x", "new\nline", "ä"):
            self.write(f"tree/{name}", name.encode())
        (self.folder / "tree/empty").mkdir()
        (self.folder / "tree/link").symlink_to("a")
        (self.folder / "tree/out").symlink_to("/etc/passwd")
        os.mkfifo(self.folder / "tree/pipe")
        pathlib.Path(os.fsdecode(os.fsencode(self.folder) + b"/tree/\xff")).write_text("x")
        data = self.result(path="/data/tree")
        self.assertEqual((data["sha256"], data["files"]), (sum_by_tools(self.folder / "tree"), 9))
        self.assertEqual(
            data["checksums"],
            [{"path": name, "sha256": sha256(name.encode()), "size": len(name.encode())}
             for name in ("-x", "a", "b-", "b.", "b/a", "b/c", "new\nline", "ä")])

    def test_are_those_of_a_share_and_of_an_empty_folder(self):
        self.assertEqual(self.result(path="/data")["sha256"], sha256(b""))
        self.write("a/b", b"x")
        self.assertEqual(self.result(path="/data")["sha256"], sum_by_tools(self.folder))

    def test_are_listed_up_to_a_thousand(self):
        for number in range(1001):
            self.write(f"tree/{number}", b"x")
        data = self.result(path="/data/tree")
        self.assertEqual((data["files"], len(data["checksums"])), (1001, 1000))
        self.assertEqual(data["sha256"], sum_by_tools(self.folder / "tree"))

    def test_come_with_progress(self):
        self.write("file", b"x" * 3000000)
        task_id = self.start(path="/data/file").data["task_id"]
        self.finished(task_id)
        progress = self.task("progress", task_id).data
        self.assertEqual(progress["percent"], 100)
        self.assertRegex(progress["text"], r"\A3000000 of 3000000 bytes, \d+ bytes/s\Z")


class Start(ChecksumTest):
    def test_needs_a_login(self):
        self.refused_as(call("TALO.File.Checksum", "start", 1, path="/data"), 119, "unauth")

    def test_says_at_once_what_is_wrong(self):
        self.write("file", b"x")
        os.mkfifo(self.folder / "pipe")
        (self.folder / "out").symlink_to("/etc")
        for parameters, code, errors in (
                ({}, 400, "path"), ({"path": "/"}, 400, "path"), ({"path": "/data/.."}, 400, "path"),
                ({"path": 1}, 400, "path"), ({"path": "/none/x"}, 401, "/none/x"),
                ({"path": "/data/none"}, 401, "/data/none"),
                ({"path": "/data/file/x"}, 404, "/data/file/x"),
                ({"path": "/data/pipe"}, 405, "/data/pipe"),
                ({"path": "/data/out"}, 406, "/data/out"),
                ({"path": "/data/file", "group": "staff"}, 400, "group"),
                ({"path": "/data/file", "group": 1}, 400, "group"),
                ({"path": "/data/file", "auto_remove": "x"}, 400, "auto_remove"),
                ({"path": "/data/file", "prefix": "a/b"}, 400, "prefix"),
                ({"path": "/data/file", "prefix": "x" * 65}, 400, "prefix"),
                ({"path": "/data/file", "group": "admin"}, 105, None)):
            self.refused(self.start(**parameters), code, errors)
        self.refused(self.start(self.log_in("other"), path="/data/file"), 401, "/data/file")
        self.assertEqual(call("TALO.Task", "list", 1, self.sid).data, {"user": []})

    def test_takes_group_prefix_and_removal(self):
        self.write("file", b"x")
        self.assertRegex(self.start(path="/data/file").data["task_id"], r"\Anormal/checksum-")
        boss = self.log_in("boss")
        shared = self.start(boss, path="/data/file", group="admin").data["task_id"]
        self.assertRegex(shared, r"\A@administrators/checksum-")
        task_id = self.start(path="/data/file", group="everyone", prefix="mine.",
                             auto_remove=False).data["task_id"]
        self.assertRegex(task_id, r"\A@users/mine\.")
        status = self.finished(task_id)
        self.assertIs(status["auto_remove"], False)
        self.assertEqual(self.task("status", task_id, self.log_in("other")).data["data"]["sha256"],
                         sha256(b"x"))

    def test_answers_while_the_work_goes_on(self):
        self.write_endless()
        task_id = self.start(path="/data/endless").data["task_id"]
        status = self.task("status", task_id).data
        self.assertIs(status["finish"], False)
        self.assertEqual((status["success"], status["data"]["state"]), (True, "running"))
        self.assertEqual(self.task("stop", task_id).code, 0)


class Stop(ChecksumTest):
    def test_leaves_a_result_within_a_second(self):
        self.write_endless()
        self.write("tree/a", b"x")
        os.link(self.folder / "endless", self.folder / "tree/b")
        for path in ("/data/endless", "/data/tree"):
            task_id = self.start(path=path).data["task_id"]
            self.assertEqual(self.task("stop", task_id).code, 0)
            # Much more than the second that it may take, for a busy machine.
            self.assertTrue(wait_until(lambda: not self.status(task_id)["success"], 10))
            status = self.status(task_id)
            self.assertEqual(status["error"]["code"], 415)
            errors = status["error"]["errors"]
            self.assertEqual((errors["state"], errors["path"]), ("stopped", path))
            self.assertLess(errors["bytes"], 1 << 42)
            self.assertIs(status["finish"], True)


if __name__ == "__main__":
    unittest.main()
