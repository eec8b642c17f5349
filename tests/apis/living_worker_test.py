"""The shipped API libraries promise to leave nothing behind in their process: one
worker runs all their methods over and over, and neither its memory nor its
descriptors grow.

WEBAPI_ROUNDS says how often; each round calls each method at least once.
"""

import hashlib
import json
import os
import pathlib
import socket
import subprocess
import tempfile
import unittest

import appliance
import file_case
import relay_test
from appliance import WEBAPI_DIR, Reply, element, wait_until

ROUNDS = int(os.environ["WEBAPI_ROUNDS"])
SANITIZED = os.environ["WEBAPI_SANITIZED"] == "1"
WARM_UP = max(ROUNDS // 3, 10)
MOST_GROWTH = 1 << 20  # bytes
CONTENT = b"some content\n" * 1000


def block(variables):
    content = b"".join(f"{name}\0{value}\0".encode() for name, value in variables.items())
    return b"%d:%s," % (len(content), content)


class Worker:
    """One worker behind a socket, and the web server's part."""

    def __init__(self, path):
        self.path = path
        self.process = subprocess.Popen([os.environ["ONE_WORKER"], path], stdout=subprocess.PIPE)
        self.pid = int(self.process.stdout.readline())
        self.called = set()

    def exchange(self, body, variables):
        with socket.socket(socket.AF_UNIX) as connection:
            connection.settimeout(appliance.TIMEOUT)
            connection.connect(self.path)
            connection.sendall(block({
                "CONTENT_LENGTH": len(body), "SCGI": 1, "REQUEST_METHOD": "POST",
                "CONTENT_TYPE": "application/x-www-form-urlencoded",
                "REMOTE_ADDR": appliance.ADDRESS, "HTTP_HOST": appliance.HOST, **variables}) + body)
            reply = bytearray()
            while piece := connection.recv(1 << 20):
                reply += piece
            return bytes(reply)

    def raw(self, api, method, version, sid, body=b"", variables=None, **parameters):
        self.called.add((api, version, method))
        line = appliance.form({"api": api, "version": version, "method": method, **parameters})
        cookie = {"HTTP_COOKIE": f"id={sid}"} if sid else {}
        if variables is None:
            return self.exchange(line.encode(), cookie)
        return self.exchange(body, {"QUERY_STRING": line, **cookie, **variables})

    def call(self, api, method, version=1, sid=None, **more):
        reply = Reply(self.raw(api, method, version, sid, **more))
        assert reply.code == 0, (api, method, reply)
        return reply.body.get("data")

    def private(self):
        sizes = pathlib.Path(f"/proc/{self.pid}/statm").read_text().split()
        return (int(sizes[1]) - int(sizes[2])) * os.sysconf("SC_PAGE_SIZE")

    def descriptors(self):
        """Of the worker at rest: it has answered before it has put itself back."""
        seen = []

        def rests():
            seen.append(targets(f"/proc/{self.pid}/fd"))
            return len(seen) > 1 and seen[-1] == seen[-2] is not None

        assert wait_until(rests)
        return seen[-1]

    def end(self):
        self.process.terminate()
        os.kill(self.pid, 9)
        self.process.wait()
        self.process.stdout.close()


def targets(folder):
    """What the descriptors lead to; None when one is closed meanwhile."""
    try:
        return sorted(os.readlink(f"{folder}/{name}") for name in os.listdir(folder))
    except FileNotFoundError:
        return None


def shipped_methods():
    """Of the descriptions, so that a new method has to be called here."""
    for path in WEBAPI_DIR.glob("TALO.*.lib"):
        for api, description in json.loads(path.read_text(encoding="utf-8")).items():
            for version, methods in description["methods"].items():
                for method in methods:
                    name = method if isinstance(method, str) else next(iter(method))
                    yield api, int(version), name


class LivingWorker(file_case.FileTest):
    def setUp(self):
        super().setUp()
        relay_test.forget_nodes()
        self.addCleanup(relay_test.forget_nodes)
        self.secret = relay_test.accept()
        place = tempfile.TemporaryDirectory()
        self.addCleanup(place.cleanup)
        self.worker = Worker(f"{place.name}/socket")
        self.addCleanup(self.worker.end)

    def sessions(self):
        call = self.worker.call
        sid = call("TALO.Session", "open", account="normal",
                   passwd=self.PASSWORDS["normal"])["sid"]
        call("TALO.Session", "renew", sid=sid)
        handle = call("TALO.Session", "info", sid=sid)["handle"]
        call("TALO.Session", "list", sid=sid)
        call("TALO.Session", "cipher")
        call("TALO.Session", "end", sid=self.sid, handle=handle)
        sid = call("TALO.Relay", "open", node=relay_test.NODE, secret=json.dumps(self.secret),
                   user="normal")["sid"]
        call("TALO.Session", "close", sid=sid)

    def upload(self, name):
        body = "".join(f'--{file_case.BOUNDARY}\r\nContent-Disposition: form-data; name="{field}"'
                       f'{more}\r\n\r\n{value}\r\n' for field, more, value in (
                           ("path", "", "/data"),
                           ("file", f'; filename="{name}"', CONTENT.decode())))
        body += f"--{file_case.BOUNDARY}--\r\n"
        self.worker.call("TALO.File", "upload", sid=self.sid, body=body.encode(), variables={
            "CONTENT_TYPE": f"multipart/form-data; boundary={file_case.BOUNDARY}"})

    def slices(self):
        slice_of = {"CONTENT_TYPE": "application/octet-stream", "HTTP_X_TYPE_NAME": "SLICEUPLOAD"}
        send = lambda content, **more: self.worker.call(
            "TALO.File", "upload_slice", sid=self.sid, body=content, variables=slice_of, **more)
        begun = send(CONTENT[:100], path="/data/sliced", length=len(CONTENT), offset=0)
        upload_id = begun["upload_id"]
        self.worker.call("TALO.File", "upload_status", sid=self.sid, upload_id=upload_id)
        send(CONTENT[100:], upload_id=upload_id, offset=100)
        self.assertEqual((self.folder / "sliced").read_bytes(), CONTENT)
        self.worker.call("TALO.File", "remove", sid=self.sid, path="/data/sliced")

    def files(self):
        call = lambda method, **more: self.worker.call("TALO.File", method, sid=self.sid, **more)
        call("mkdir", path="/data/new")
        self.upload("file.txt")
        call("rename", path="/data/file.txt", to="/data/new/file.txt")
        call("stat", path="/data/new/file.txt")
        call("list", folder="/data")
        answer = file_case.Answer(self.worker.raw("TALO.File", "download", 1, self.sid,
                                                  path="/data/new/file.txt"))
        self.assertEqual(answer.body, CONTENT)
        self.worker.raw("TALO.File", "download", 1, self.sid, paths=["/data/new"])
        call("remove", path="/data/new/file.txt")
        call("remove", path="/data/new")

    def tasks(self):
        call = lambda method, **more: self.worker.call("TALO.Task", method, sid=self.sid, **more)
        (self.folder / "summed").write_bytes(CONTENT)
        task = self.worker.call("TALO.File.Checksum", "start", sid=self.sid,
                                path="/data/summed")["task_id"]
        call("status", task_id=task)
        call("progress", task_id=task)
        call("list", prefix="none-")
        call("stop", task_id=task, remove=True)

    def others(self):
        call = self.worker.call
        call("TALO.System", "ping", text="x", count=1)
        call("TALO.System", "ping", 2, text="x", count=1)
        call("TALO.System", "info", 2, sid=self.sid)
        call("TALO.Catalog", "list", sid=self.sid)
        call("TALO.Catalog", "describe", sid=self.sid, name="TALO.File")
        call("TALO.Entry.Request", "request", sid=self.sid, compound=[
            element("TALO.System", "ping", text="x"), element("TALO.Session", "info")])

    def round(self):
        self.others()
        self.sessions()
        self.files()
        self.slices()
        self.tasks()

    def test_stays_as_it_is(self):
        for _ in range(WARM_UP):
            self.round()
        self.assertEqual(sorted(self.worker.called), sorted(shipped_methods()))
        memory, descriptors = self.worker.private(), self.worker.descriptors()
        for _ in range(ROUNDS - WARM_UP):
            self.round()
        self.assertEqual(self.worker.descriptors(), descriptors)
        grown = self.worker.private() - memory
        print(f"{ROUNDS} rounds of {len(self.worker.called)} methods: {grown >> 10} KiB more")
        # A sanitizer keeps what was freed.
        if not SANITIZED:
            self.assertLess(grown, MOST_GROWTH)


if __name__ == "__main__":
    unittest.main()
