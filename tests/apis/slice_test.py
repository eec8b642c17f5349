"""TALO.File: uploads in slices."""

import hashlib
import json
import os
import pathlib
import shutil
import subprocess
import tempfile
import time
import unittest

import appliance
from appliance import ADDRESS, ENTRY_CGI, HOST, PASSED_ON, ROOT, TIMEOUT, ApplianceTest, Reply, call

SHARES_FILE = ROOT / "etc/talo/shares"
SLICE_DIR = ROOT / "var/lib/talo/slice"

CONTENT = bytes((index * index >> 3) & 255 for index in range(300000))


def sha256(content):
    return hashlib.sha256(content).hexdigest()


def variables(sid, parameters, length, more):
    """The environment that a web server gives to a slice's request."""
    result = {name: os.environ[name] for name in PASSED_ON if name in os.environ}
    result.update({
        "PATH": "/usr/bin:/bin",
        "GATEWAY_INTERFACE": "CGI/1.1",
        "REQUEST_METHOD": "POST",
        "CONTENT_TYPE": "application/octet-stream",
        "CONTENT_LENGTH": str(length),
        "HTTP_X_TYPE_NAME": "SLICEUPLOAD",
        "REMOTE_ADDR": ADDRESS,
        "HTTP_HOST": HOST,
        "HTTP_COOKIE": f"id={sid}" if sid else None,
        "QUERY_STRING": appliance.form({"api": "TALO.File", "version": 1,
                                        "method": "upload_slice", **parameters}),
    })
    result.update(more)
    return {name: value for name, value in result.items() if value is not None}


def send(sid, body=b"", promised=None, more=None, **parameters):
    """Sends a slice; may promise another length than it has."""
    length = len(body) if promised is None else promised
    process = subprocess.run(
        [ENTRY_CGI], input=body, capture_output=True, timeout=TIMEOUT, check=False,
        env=variables(sid, parameters, length, more or {}))
    assert process.returncode == 0 and process.stderr == b"", process
    return Reply(process.stdout)


def start(sid, length, **parameters):
    """A slice whose bytes are still to come."""
    return subprocess.Popen(
        [ENTRY_CGI], stdin=subprocess.PIPE, stdout=subprocess.PIPE,
        env=variables(sid, parameters, length, {}))


def status(sid, upload_id):
    return call("TALO.File", "upload_status", cookie=sid, upload_id=upload_id)


class SliceTest(ApplianceTest):
    def setUp(self):
        super().setUp()
        self.folder = pathlib.Path(tempfile.mkdtemp(dir=ROOT))
        self.addCleanup(shutil.rmtree, self.folder, ignore_errors=True)
        shutil.rmtree(SLICE_DIR, ignore_errors=True)
        self.addCleanup(shutil.rmtree, SLICE_DIR, ignore_errors=True)
        self.addCleanup(SHARES_FILE.unlink, missing_ok=True)
        self.share(self.folder, ["normal"], ["other"])
        self.sid = self.log_in("normal")

    def share(self, folder, writers, readers):
        lines = [{"name": "data", "folder": str(folder), "writers": writers, "readers": readers},
                 {"name": "secret", "folder": str(folder), "writers": ["boss"]}]
        SHARES_FILE.write_text("".join(json.dumps(line) + "\n" for line in lines),
                               encoding="utf-8")
        SHARES_FILE.chmod(0o600)

    def begin(self, length, name="file", **parameters):
        """Begins an upload without a byte and answers its id."""
        data = send(self.sid, path=f"/data/{name}", length=length, **parameters).data
        self.assertEqual((data["offset"], data["length"], data["complete"]), (0, length, False))
        return data["upload_id"]

    def names(self):
        return sorted(path.name for path in self.folder.iterdir())

    def content(self, name="file"):
        return (self.folder / name).read_bytes()

    def offset(self, upload_id):
        return status(self.sid, upload_id).data["offset"]

    def whole(self, reply, upload_id, length):
        self.assertEqual(reply.data, {"upload_id": upload_id, "offset": length, "length": length,
                                      "complete": True})


class Slices(SliceTest):
    def test_make_a_file_that_appears_when_it_is_whole(self):
        upload = self.begin(len(CONTENT))
        for offset in (0, 100000, 200000):
            self.assertEqual(self.names(), [])
            reply = send(self.sid, CONTENT[offset:offset + 100000], upload_id=upload, offset=offset)
            self.assertEqual(reply.data, {
                "upload_id": upload, "offset": offset + 100000, "length": len(CONTENT),
                "complete": offset == 200000})
        self.assertEqual(self.names(), ["file"])
        self.assertEqual(self.content(), CONTENT)

    def test_can_be_a_single_one(self):
        reply = send(self.sid, CONTENT, path="/data/file", length=len(CONTENT), offset=0)
        self.whole(reply, reply.data["upload_id"], len(CONTENT))
        self.assertEqual(self.content(), CONTENT)

    def test_make_an_empty_file_without_a_byte(self):
        reply = send(self.sid, path="/data/file", length=0)
        self.whole(reply, reply.data["upload_id"], 0)
        self.assertEqual(self.content(), b"")

    def test_keep_bytes_as_they_are(self):
        for number, content in enumerate((b"\0", b"a=1&b=2", b"%41+", b'{"api":"x"}', b"\r\n\r\n",
                                          bytes(range(256)))):
            reply = send(self.sid, content, path=f"/data/{number}", length=len(content))
            self.assertTrue(reply.data["complete"])
            self.assertEqual(self.content(str(number)), content)

    def test_on_another_file_system_make_the_same_file(self):
        with tempfile.TemporaryDirectory(dir="/dev/shm") as folder:
            self.share(folder, ["normal"], [])
            upload = self.begin(len(CONTENT))
            send(self.sid, CONTENT[:1000], upload_id=upload, offset=0)
            self.whole(send(self.sid, CONTENT[1000:], upload_id=upload, offset=1000), upload,
                       len(CONTENT))
            self.assertEqual(os.listdir(folder), ["file"])
            self.assertEqual((pathlib.Path(folder) / "file").read_bytes(), CONTENT)

    def test_give_the_file_its_time(self):
        send(self.sid, b"abc", path="/data/old", length=3, mtime=1000000000)
        self.assertEqual((self.folder / "old").stat().st_mtime, 1000000000)
        send(self.sid, b"abc", path="/data/new", length=3)
        self.assertLess(abs((self.folder / "new").stat().st_mtime - time.time()), 60)

    def test_leave_nothing_but_a_note(self):
        reply = send(self.sid, b"abc", path="/data/file", length=3)
        files = [path.name for path in SLICE_DIR.rglob("u*") if path.is_file()]
        self.assertEqual(files, [reply.data["upload_id"] + ".done"])


class BrokenSlices(SliceTest):
    def test_keep_what_arrived_and_go_on_there(self):
        upload = self.begin(len(CONTENT))
        reply = send(self.sid, CONTENT[:70000], promised=len(CONTENT), upload_id=upload, offset=0)
        self.refused(reply, 421, {"upload_id": upload, "offset": 70000})
        self.assertEqual(status(self.sid, upload).data, {
            "upload_id": upload, "offset": 70000, "length": len(CONTENT), "complete": False})
        self.assertEqual(self.names(), [])
        self.whole(send(self.sid, CONTENT[70000:], upload_id=upload, offset=70000), upload,
                   len(CONTENT))
        self.assertEqual(self.content(), CONTENT)

    def test_outlive_a_process_that_is_killed(self):
        upload = self.begin(len(CONTENT))
        process = start(self.sid, len(CONTENT), upload_id=upload, offset=0)
        process.stdin.write(CONTENT[:150000])
        process.stdin.flush()
        self.wait_for(lambda: self.offset(upload) > 0)
        process.kill()
        process.communicate()
        offset = self.offset(upload)
        self.assertLessEqual(offset, 150000)
        self.whole(send(self.sid, CONTENT[offset:], upload_id=upload, offset=offset), upload,
                   len(CONTENT))
        self.assertEqual(self.content(), CONTENT)

    def test_whose_last_answer_was_lost_are_known_to_be_complete(self):
        upload = self.begin(3)
        send(self.sid, b"abc", upload_id=upload, offset=0)
        self.whole(status(self.sid, upload), upload, 3)
        self.whole(send(self.sid, upload_id=upload, offset=3), upload, 3)
        self.refused(send(self.sid, b"abc", upload_id=upload, offset=0), 418,
                     {"upload_id": upload, "offset": 3})
        self.assertEqual(self.content(), b"abc")

    def test_are_one_at_a_time(self):
        upload = self.begin(10)
        process = start(self.sid, 10, upload_id=upload, offset=0)
        process.stdin.write(b"01234")
        process.stdin.flush()
        self.wait_for(lambda: self.offset(upload) == 5)
        self.refused(send(self.sid, b"abcde", upload_id=upload, offset=5), 417, upload)
        output = process.communicate(b"56789")[0]
        self.whole(Reply(output), upload, 10)
        self.assertEqual(self.content(), b"0123456789")

    def wait_for(self, condition):
        for _ in range(1000):
            if condition():
                return
            time.sleep(0.02)
        self.fail("it does not come")


class RefusedSlices(SliceTest):
    def test_at_a_wrong_offset_are_told_the_right_one(self):
        upload = self.begin(10)
        send(self.sid, b"01234", upload_id=upload, offset=0)
        for offset in (0, 4, 6, 10, 11, 10 ** 17):
            self.refused(send(self.sid, b"xyz", upload_id=upload, offset=offset), 418,
                         {"upload_id": upload, "offset": 5})
        self.whole(send(self.sid, b"56789", upload_id=upload, offset=5), upload, 10)
        self.assertEqual(self.content(), b"0123456789")

    def test_beyond_the_end(self):
        upload = self.begin(10)
        send(self.sid, b"01234", upload_id=upload, offset=0)
        self.refused(send(self.sid, b"567890", upload_id=upload, offset=5), 419,
                     {"upload_id": upload, "offset": 5})
        self.refused(send(self.sid, b"abcd", path="/data/other", length=3), 419, "/data/other")
        self.assertEqual(self.offset(upload), 5)

    def test_with_another_digest(self):
        upload = self.begin(10)
        reply = send(self.sid, b"hallo", upload_id=upload, offset=0, digest=sha256(b"hello"))
        self.refused(reply, 422, {"upload_id": upload, "offset": 0})
        reply = send(self.sid, b"hello", upload_id=upload, offset=0, digest=sha256(b"hello"))
        self.assertEqual(reply.data["offset"], 5)
        reply = send(self.sid, b"world", upload_id=upload, offset=5,
                     digest=sha256(b"world").upper())
        self.whole(reply, upload, 10)

    def test_that_make_another_file_end_the_upload(self):
        upload = self.begin(10, file_digest=sha256(b"helloworld"))
        send(self.sid, b"hello", upload_id=upload, offset=0)
        self.refused(send(self.sid, b"World", upload_id=upload, offset=5), 424, upload)
        self.refused(status(self.sid, upload), 416, upload)
        self.assertEqual(self.names(), [])
        upload = self.begin(10, file_digest=sha256(b"helloworld"))
        self.whole(send(self.sid, b"helloworld", upload_id=upload, offset=0), upload, 10)

    def test_that_are_none(self):
        for name, more in {
                "no header": {"HTTP_X_TYPE_NAME": None},
                "another header": {"HTTP_X_TYPE_NAME": "FILE"},
                "a form": {"CONTENT_TYPE": "multipart/form-data; boundary=x"},
                "read as a page": {"REQUEST_METHOD": "GET"},
        }.items():
            with self.subTest(name):
                self.refused(send(self.sid, b"abc", more=more, path="/data/file", length=3), 414)
        self.assertEqual(self.names(), [])

    def test_with_a_wrong_parameter(self):
        upload = self.begin(10)
        good = {"path": "/data/x", "length": 3}
        more = {"upload_id": upload, "offset": 0}
        for wrong, parameters in (
                ("length", {"path": "/data/x"}),
                ("length", {**good, "length": -1}),
                ("length", {**good, "length": "many"}),
                ("length", {**good, "length": 1.5}),
                ("length", {**good, "length": 10 ** 30}),
                ("length", {**more, "length": 11}),
                ("offset", {**good, "offset": 1}),
                ("offset", {"upload_id": upload}),
                ("offset", {**more, "offset": -1}),
                ("offset", {**more, "offset": "x"}),
                ("offset", {**more, "offset": None}),
                ("upload_id", {"upload_id": 5, "offset": 0}),
                ("upload_id", {"upload_id": None, "offset": 0}),
                ("upload_id", {"upload_id": "", "offset": 0}),
                ("upload_id", {"upload_id": "../../etc/passwd", "offset": 0}),
                ("upload_id", {"upload_id": upload + "/..", "offset": 0}),
                ("digest", {**more, "digest": "abc"}),
                ("digest", {**more, "digest": 5}),
                ("file_digest", {**good, "file_digest": "g" * 64}),
                ("overwrite", {**good, "overwrite": "perhaps"}),
                ("mtime", {**good, "mtime": -5}),
                ("path", {"length": 3}),
                ("path", {**good, "path": "/data"}),
                ("path", {**good, "path": "/"}),
                ("path", {**good, "path": "/data/../x"}),
                ("path", {**good, "path": "data/x"}),
                ("path", {**good, "path": 5})):
            with self.subTest((wrong, parameters)):
                self.refused(send(self.sid, b"abc", **parameters), 400, wrong)
        self.assertEqual(self.names(), [])
        self.assertEqual(self.offset(upload), 0)

    def test_whose_length_nobody_says(self):
        for more in ({"CONTENT_LENGTH": None, "HTTP_TRANSFER_ENCODING": "chunked"},
                     {"CONTENT_LENGTH": "-1"}, {"CONTENT_LENGTH": "3x"},
                     {"CONTENT_LENGTH": "9" * 30}):
            reply = send(self.sid, b"abc", more=more, path="/data/file", length=3)
            self.refused(reply, 400, "CONTENT_LENGTH")

    def test_of_an_upload_that_is_not_there(self):
        unknown = "u" + "0" * 40
        self.refused(send(self.sid, b"abc", upload_id=unknown, offset=0), 416, unknown)
        self.refused(status(self.sid, unknown), 416, unknown)
        for bad in ("../" + unknown, "x", "u" * 100000):
            self.refused(status(self.sid, bad), 416, bad)
        self.refused(status(self.sid, 5), 400, "upload_id")

    def test_beyond_the_configured_limits(self):
        appliance.configure("slice_per_user=2\nslice_max_bytes=100\n")
        self.refused(send(self.sid, path="/data/x", length=101), 419, "/data/x")
        self.begin(100)
        self.begin(100)
        self.refused(send(self.sid, path="/data/x", length=1), 420, "/data/x")

    def test_of_an_upload_that_has_expired(self):
        upload = self.begin(10)
        long_ago = time.time() - 3 * 86400
        for path in SLICE_DIR.rglob("u*"):
            os.utime(path, (long_ago, long_ago))
        self.refused(send(self.sid, b"abc", upload_id=upload, offset=0), 416, upload)


class TargetsOfSlices(SliceTest):
    def test_must_be_places_for_a_file(self):
        (self.folder / "folder").mkdir()
        (self.folder / "there").write_bytes(b"old")
        (self.folder / "out").symlink_to("/tmp")
        for path, code in (("/data/there", 403), ("/data/folder", 405), ("/data/none/x", 401),
                           ("/data/there/x", 404), ("/data/out/x", 406), ("/nowhere/x", 401)):
            with self.subTest(path):
                self.refused(send(self.sid, b"abc", path=path, length=3), code, path)
        self.assertEqual(self.content("there"), b"old")
        self.assertFalse(any(SLICE_DIR.rglob("u*")))

    def test_are_replaced_only_on_demand(self):
        (self.folder / "file").write_bytes(b"old")
        self.refused(send(self.sid, b"new", path="/data/file", length=3), 403, "/data/file")
        reply = send(self.sid, b"new", path="/data/file", length=3, overwrite=True)
        self.assertTrue(reply.data["complete"])
        self.assertEqual(self.content(), b"new")

    def test_that_came_meanwhile_can_be_replaced_in_the_end(self):
        upload = self.begin(3)
        (self.folder / "file").write_bytes(b"old")
        self.refused(send(self.sid, b"new", upload_id=upload, offset=0), 403, "/data/file")
        self.assertEqual(self.content(), b"old")
        self.assertEqual(status(self.sid, upload).data["complete"], False)
        self.refused(send(self.sid, upload_id=upload, offset=3), 403, "/data/file")
        reply = send(self.sid, upload_id=upload, offset=3, overwrite=True)
        self.whole(reply, upload, 3)
        self.assertEqual(self.content(), b"new")

    def test_need_the_right_to_write(self):
        reader = self.log_in("other")
        self.refused(send(reader, b"abc", path="/data/x", length=3), 402, "/data/x")
        self.refused(send(self.sid, b"abc", path="/secret/x", length=3), 401, "/secret/x")
        self.assertTrue(send(self.log_in("boss"), b"abc", path="/secret/x", length=3)
                        .data["complete"])

    def test_need_the_right_to_the_end(self):
        upload = self.begin(6)
        send(self.sid, b"abc", upload_id=upload, offset=0)
        self.share(self.folder, [], ["normal"])
        self.refused(send(self.sid, b"def", upload_id=upload, offset=3), 402, "/data/file")
        self.assertEqual(self.names(), [])
        self.assertEqual(self.offset(upload), 3)

    def test_need_a_login(self):
        self.refused_as(send(None, b"abc", path="/data/x", length=3), 119, "unauth")
        self.refused_as(status(None, "u" + "0" * 40), 119, "unauth")

    def test_are_nobody_elses_business(self):
        upload = self.begin(6)
        for name in ("other", "boss"):
            other = self.log_in(name)
            self.refused(status(other, upload), 416, upload)
            self.refused(send(other, b"abc", upload_id=upload, offset=0), 416, upload)
        self.assertEqual(self.offset(upload), 0)


if __name__ == "__main__":
    unittest.main()
