"""Many requests in one process: each is answered as a process of its own answers it."""

import json
import os
import pathlib
import shutil
import subprocess
import tempfile
import unittest

from appliance import ENTRY_CGI, HOST, PASSED_ON, ROOT, TIMEOUT, ADDRESS, element, form
from file_case import BOUNDARY, FileTest

PROGRAM = os.environ["ONE_PROCESS"]
# AddressSanitizer keeps a record of each library that was opened and each block that
# was freed.
SANITIZED = os.environ["WEBAPI_SANITIZED"] == "1"
MOST_GROWTH_KIB = 256


def multipart(parts):
    """A body of (name, file name or None, content)."""
    text = b""
    for name, filename, content in parts:
        text += f'--{BOUNDARY}\r\nContent-Disposition: form-data; name="{name}"'.encode()
        text += f'; filename="{filename}"'.encode() if filename is not None else b""
        text += b"\r\n\r\n" + content + b"\r\n"
    return text + f"--{BOUNDARY}--\r\n".encode()


class Request:
    def __init__(self, body=b"", cookie=None, **variables):
        self.body = body
        self.environ = {"PATH": "/usr/bin:/bin", "GATEWAY_INTERFACE": "CGI/1.1",
                        "REQUEST_METHOD": "POST", "CONTENT_LENGTH": str(len(body)),
                        "CONTENT_TYPE": "application/x-www-form-urlencoded",
                        "REMOTE_ADDR": ADDRESS, "HTTP_HOST": HOST}
        self.environ.update({name: os.environ[name] for name in PASSED_ON if name in os.environ})
        if cookie is not None:
            self.environ["HTTP_COOKIE"] = cookie
        self.environ.update(variables)


def call(api, method, version=1, cookie=None, variables=None, **parameters):
    body = form({"api": api, "version": version, "method": method, **parameters}).encode()
    return Request(body, cookie, **(variables or {}))


def get(query, cookie=None):
    return Request(b"", cookie, REQUEST_METHOD="GET", QUERY_STRING=query)


def upload(cookie, name, content, more=(), body=None):
    fields = {"api": "TALO.File", "version": "1", "method": "upload", "path": "/data",
              "mtime": "1000000000", "overwrite": "true"}
    body = body or multipart([(key, None, value.encode()) for key, value in fields.items()] +
                             [("file", name, content), *more])
    return Request(body, cookie, CONTENT_TYPE=f"multipart/form-data; boundary={BOUNDARY}")


def stable(reply):
    """A reply without what differs from one moment to the next."""
    head, _, body = reply.partition(b"\r\n\r\n")
    try:
        document = json.loads(body)
    except ValueError:
        return reply
    data = document.get("data")
    moving = [name for name in ("uptime", "load", "memory", "last_use")
              if isinstance(data, dict) and name in data]
    if not moving:
        return reply
    for name in moving:
        del data[name]
    return head, json.dumps(document)


class OneProcess(FileTest):
    def setUp(self):
        super().setUp()
        self.place = pathlib.Path(tempfile.mkdtemp(dir=ROOT))
        self.addCleanup(shutil.rmtree, self.place, ignore_errors=True)
        self.other = self.log_in("other")
        self.boss = self.log_in("boss")
        self.write("file")
        self.mine, self.his, self.chief = (f"id={sid}" for sid in (self.sid, self.other, self.boss))

    def prepare(self):
        """The share as both ways of serving find it. A download tells which file it
        is, so "file" stays the same one."""
        for path in self.folder.iterdir():
            if path.name != "file":
                path.unlink()

    def alone(self, request):
        return subprocess.run([ENTRY_CGI], input=request.body, capture_output=True, check=True,
                              timeout=TIMEOUT, env=request.environ).stdout

    def together(self, requests, times=1):
        """Answers the replies and what the process told of itself."""
        rows = []
        for number, request in enumerate(requests):
            body = self.place / f"body{number}"
            body.write_bytes(request.body)
            rows.append({"environ": request.environ, "body": str(body),
                         "output": str(self.place / f"output{number}"), "times": times})
        process = subprocess.run([PROGRAM], input=json.dumps(rows).encode(), capture_output=True,
                                 timeout=TIMEOUT * 5, check=False, env=os.environ)
        self.assertEqual((process.returncode, process.stderr), (0, b""), process.stderr[:2000])
        return ([(self.place / f"output{number}").read_bytes() for number in range(len(rows))],
                json.loads(process.stdout))

    def assert_same(self, requests):
        self.prepare()
        alone = [self.alone(request) for request in requests]
        left = self.names()
        self.prepare()
        together, facts = self.together(requests)
        for number, (one, other) in enumerate(zip(alone, together)):
            self.assertEqual(stable(one), stable(other), (number, requests[number].body[:200]))
        self.assertEqual(self.names(), left)
        return alone, facts

    def test_answers_as_fresh_processes_do(self):
        compound = [element("TALO.System", "ping", text="one"),
                    element("TALO.File", "list", folder="/data"),
                    element("TALO.File", "download", path="/data/file"), element("No.Such", "x")]
        requests = [
            call("TALO.System", "ping", text="first"),
            call("TALO.System", "info", 2),
            call("TALO.System", "info", 2, self.mine),
            call("TALO.System", "info", 2),
            call("TALO.System", "info", 2, _sid=self.sid),
            call("TALO.System", "info", 2),
            call("TALO.System", "info", 9, self.mine),
            call("TALO.System", "none", 1, self.mine),
            call("No.Such.API", "list"),
            get("api=TALO.System&version=1&method=ping&text=%22query%22"),
            get(""),
            Request(b"garbage=%zz&&&=", CONTENT_LENGTH="100000"),
            Request(b"", CONTENT_LENGTH="-1"),
            call("TALO.Session", "info", 1, self.mine),
            call("TALO.Session", "info", 1, self.his),
            call("TALO.Session", "info", 1),
            call("TALO.Catalog", "list", 1, self.chief),
            call("TALO.Catalog", "list", 1, self.his),
            call("TALO.Catalog", "describe", 1, self.mine, name="TALO.File"),
            call("TALO.File", "list", 1, self.his, folder="/data", fields=["name"]),
            call("TALO.File", "list", 1, self.his, folder="/closed"),
            call("TALO.File", "list", 1, self.chief, folder="/closed"),
            call("TALO.File", "list", 1, None, folder="/closed"),
            call("TALO.File", "mkdir", 1, self.his, path="/data/no"),
            call("TALO.Task", "list", 1, self.mine),
            call("TALO.Task", "list", 1, None),
            call("TALO.Task", "status", 1, self.his, task_id="none"),
            call("TALO.Entry.Request", "request", 1, self.his, compound=compound),
            call("TALO.Entry.Request", "request", 1, None, compound=compound),
            call("TALO.System", "ping", 1, None, {"HTTP_ORIGIN": "http://elsewhere"}),
            call("TALO.System", "info", 2, self.mine, {"HTTP_ORIGIN": "http://elsewhere"}),
            call("TALO.System", "info", 2, self.mine, {"REMOTE_ADDR": "192.0.2.99"}),
            call("TALO.System", "info", 2, self.mine, {"REMOTE_ADDR": ""}),
            call("TALO.System", "info", 2, "id=garbage"),
            get("api=TALO.File&version=1&method=download&path=/data/file", self.mine),
            get("api=TALO.File&version=1&method=download&path=/closed/file", self.mine),
            get("api=TALO.File&version=1&method=download&path=/data/file"),
            call("TALO.System", "ping", text="last"),
        ]
        alone, _ = self.assert_same(requests + requests[::-1])
        self.assertIn(b'"success":true', alone[2])
        self.assertIn(b'"code":119', alone[3])
        self.assertTrue(alone[34].endswith(b"content"), alone[34])

    def test_has_nothing_of_an_earlier_upload(self):
        broken = multipart([("api", None, b"TALO.File"), ("version", None, b"1"),
                            ("method", None, b"upload"), ("file", "x", b"half of it")])[:-40]
        requests = [
            upload(self.mine, "a", b"first" * 100000, [("note", None, b"a")]),
            call("TALO.System", "ping", text="plain"),
            upload(self.mine, "b", b"second", [("file", "again", b"twice"),
                                               ("file_2", None, b"forged")]),
            upload(self.mine, "", b""),
            upload(self.mine, None, b"", body=broken),
            upload(self.mine, "c", b"third"),
            upload(None, "d", b"not logged in"),
            upload(self.his, "e", b"only a reader"),
            upload(self.mine, None, b"", body=b"no multipart body at all"),
            call("TALO.File", "list", 1, self.mine, folder="/data", fields=["name"]),
            upload(self.mine, "a", b"replaced"),
        ]
        alone, _ = self.assert_same(requests)
        self.assertEqual([b'"success":true' in reply for reply in alone],
                         [True, True, True, False, False, True, False, False, False, True, True])
        self.assertEqual((self.folder / "a").read_bytes(), b"replaced")

    def test_keeps_its_name_descriptors_and_memory(self):
        ping = call("TALO.System", "ping", 1, text="a", count=2)
        info = call("TALO.System", "info", 2, self.mine)
        stranger = call("TALO.System", "info", 2, _sid="none")
        warm = [ping, info, stranger]
        replies, facts = self.together([*warm * 3, ping], 1200)
        self.assertEqual(len(set(facts["descriptors"])), 1, facts)
        self.assertEqual(len(set(facts["name"])), 1, facts)
        growth = facts["memory"][-1] - facts["memory"][2]
        if not SANITIZED:
            self.assertLess(growth, MOST_GROWTH_KIB, facts)
        self.assertIn(b'"text":"a"', replies[-1])


del FileTest

if __name__ == "__main__":
    unittest.main()
