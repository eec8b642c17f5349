"""A share with a file or two in it, and how to send and fetch files."""

import json
import os
import pathlib
import shutil
import subprocess
import tempfile

import appliance
from appliance import (ADDRESS, ENTRY_CGI, HOST, PASSED_ON, ROOT, TIMEOUT, ApplianceTest, Reply, call,
                       forget_tasks)

SHARES_FILE = ROOT / "etc/talo/shares"
BOUNDARY = "a-boundary"


def environment(sid, more):
    result = {name: os.environ[name] for name in PASSED_ON if name in os.environ}
    result.update({"PATH": "/usr/bin:/bin", "GATEWAY_INTERFACE": "CGI/1.1", "HTTP_HOST": HOST,
                   "REMOTE_ADDR": ADDRESS, "HTTP_COOKIE": f"id={sid}"})
    result.update(more)
    return result


def run(sid, body=b"", **variables):
    return subprocess.run([ENTRY_CGI], input=body, capture_output=True, timeout=TIMEOUT,
                          check=True, env=environment(sid, variables)).stdout


def upload(sid, fields, filename=None, content=b"", **variables):
    """Posts a form, with a file in the field "file" when it has a name."""
    parts = [f'Content-Disposition: form-data; name="{name}"\r\n\r\n{value}'.encode()
             for name, value in {"api": "TALO.File", "version": "1", "method": "upload",
                                 **fields}.items()]
    if filename is not None:
        parts.append(b'Content-Disposition: form-data; name="file"; filename="' +
                     (filename if isinstance(filename, bytes) else filename.encode()) +
                     b'"\r\n\r\n' + content)
    body = b"".join(b"--" + BOUNDARY.encode() + b"\r\n" + part + b"\r\n" for part in parts)
    body += b"--" + BOUNDARY.encode() + b"--\r\n"
    return Reply(run(sid, body, REQUEST_METHOD="POST", CONTENT_LENGTH=str(len(body)),
                     CONTENT_TYPE=f"multipart/form-data; boundary={BOUNDARY}", **variables))


class Answer:
    """A download's answer; the body is bytes."""

    def __init__(self, output):
        head, separator, self.body = output.partition(b"\r\n\r\n")
        assert separator, output
        self.headers = [tuple(line.split(": ", 1)) for line in head.decode("ascii").split("\r\n")]

    def all(self, name):
        return [value for key, value in self.headers if key.lower() == name.lower()]

    def one(self, name):
        values = self.all(name)
        assert len(values) == 1, (name, self.headers)
        return values[0]


def download(sid, method="GET", variables=None, **parameters):
    query = appliance.form({"api": "TALO.File", "version": 1, "method": "download", **parameters})
    return run(sid, REQUEST_METHOD=method, QUERY_STRING=query, **(variables or {}))


class FileTest(ApplianceTest):
    """"data" is written by normal and read by other; "closed" is nobody's."""

    def setUp(self):
        super().setUp()
        self.top = pathlib.Path(tempfile.mkdtemp(dir=ROOT))
        self.addCleanup(shutil.rmtree, self.top, ignore_errors=True)
        self.addCleanup(SHARES_FILE.unlink, missing_ok=True)
        self.addCleanup(forget_tasks)
        self.folder = self.top / "data"
        self.folder.mkdir()
        (self.top / "closed").mkdir()
        (self.top / "closed/file").write_text("closed")
        (self.top / "secret").write_text("SECRET")
        SHARES_FILE.write_text("".join(json.dumps(line) + "\n" for line in (
            {"name": "data", "folder": str(self.folder), "writers": ["normal"],
             "readers": ["other"]},
            {"name": "closed", "folder": str(self.top / "closed")},
            {"name": "lost", "folder": str(self.top / "lost"), "readers": ["@users"]})),
            encoding="utf-8")
        SHARES_FILE.chmod(0o600)
        # Without a volume uploads go to file systems that are counted in 32 bits: whether
        # one fits would depend on how much the machine's disk holds at the moment.
        volume = tempfile.mkdtemp(dir=ROOT)
        self.addCleanup(shutil.rmtree, volume, ignore_errors=True)
        appliance.configure(f'volumes="{volume}"\nvolumes_folders="yes"\n')
        self.sid = self.log_in("normal")

    def write(self, name, content=b"content"):
        path = self.folder / name
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_bytes(content)
        return path

    def file(self, method, sid=None, **parameters):
        return call("TALO.File", method, 1, sid or self.sid, **parameters)

    def names(self):
        return sorted(path.name for path in self.folder.iterdir())

    def listed(self, **parameters):
        data = self.file("list", folder="/data", **parameters).data
        return [entry["name"] for entry in data["entries"]]


METHODS = {"list": "folder", "stat": "path", "mkdir": "path", "rename": "path", "remove": "path",
           "download": "path"}
