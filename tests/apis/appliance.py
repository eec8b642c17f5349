"""An appliance in the private root, and the way to call it: the installed entry
as a process with the environment that a web server would give it.

CTest gives the places in the environment: TALO_ROOT, WEBAPI_DIR, WEBAPI_ACCOUNT.
"""

import json
import os
import pathlib
import shutil
import subprocess
import time
import unittest
import urllib.parse

ROOT = pathlib.Path(os.environ["TALO_ROOT"])
WEBAPI_DIR = pathlib.Path(os.environ["WEBAPI_DIR"])
ENTRY_CGI = WEBAPI_DIR / "entry.cgi"
SESSION_DIR = ROOT / "run/talo/session"
THROTTLE_DIR = ROOT / "run/talo/throttle"
ACCOUNTS_FILE = ROOT / "etc/talo/accounts"
HOST_CONF = ROOT / "etc/talo/host.conf"
TASK_DIR = ROOT / "var/lib/talo/task"

ADDRESS = "192.0.2.1"
HOST = "nas.local"
TIMEOUT = 60

PASSED_ON = ("ASAN_OPTIONS", "UBSAN_OPTIONS", "LSAN_OPTIONS")
HEADERS = ("Content-type", "Set-Cookie", "x-request-error", "Cache-Control", "Pragma", "Expires")


class Reply:
    """One answer. Whatever the call was, its header block holds nothing but what
    the appliance says itself."""

    def __init__(self, output):
        head, separator, body = output.partition(b"\r\n\r\n")
        assert separator, output
        self.headers = []
        for line in head.decode("utf-8").split("\r\n"):
            name, colon, value = line.partition(": ")
            assert colon and name in HEADERS and "\n" not in line and "\r" not in line, line
            self.headers.append((name, value))
        self.text = body.decode("utf-8")
        self.body = json.loads(self.text)

    def header(self, name):
        values = [value for key, value in self.headers if key == name]
        assert len(values) <= 1, values
        return values[0] if values else None

    @property
    def cookie(self):
        return self.header("Set-Cookie")

    @property
    def code(self):
        """0 for a success."""
        return 0 if self.body["success"] else self.body["error"]["code"]

    @property
    def errors(self):
        return self.body["error"].get("errors")

    @property
    def data(self):
        assert self.body["success"], self.body
        return self.body["data"]

    def __repr__(self):
        return f"{self.headers} {self.text[:500]}"


def form(parameters):
    """Texts go as a form sends them, everything else as JSON."""
    return urllib.parse.urlencode({
        name: value if isinstance(value, (str, bytes)) else json.dumps(value)
        for name, value in parameters.items()
    })


def post(body, **variables):
    """Posts a parameter line. A variable that is None is not set."""
    environment = {name: os.environ[name] for name in PASSED_ON if name in os.environ}
    content = body.encode("utf-8")
    environment.update({
        "PATH": "/usr/bin:/bin",
        "GATEWAY_INTERFACE": "CGI/1.1",
        "REQUEST_METHOD": "POST",
        "CONTENT_TYPE": "application/x-www-form-urlencoded",
        "CONTENT_LENGTH": str(len(content)),
        "REMOTE_ADDR": ADDRESS,
        "HTTP_HOST": HOST,
    })
    environment.update(variables)
    process = subprocess.run(
        [ENTRY_CGI], input=content, capture_output=True, timeout=TIMEOUT, check=False,
        env={name: value for name, value in environment.items() if value is not None})
    assert process.returncode == 0 and process.stderr == b"", process
    return Reply(process.stdout)


def call(api, method, version=1, cookie=None, variables=None, **parameters):
    """Calls a method, under the session of a cookie or of the parameter _sid."""
    variables = dict(variables or {})
    if cookie is not None:
        variables["HTTP_COOKIE"] = f"id={cookie}"
    return post(form({"api": api, "version": version, "method": method, **parameters}), **variables)


def session(method, cookie=None, variables=None, **parameters):
    return call("TALO.Session", method, 1, cookie, variables, **parameters)


def catalog(method, cookie=None, **parameters):
    return call("TALO.Catalog", method, 1, cookie, **parameters)


def compound(elements, cookie=None, variables=None, **parameters):
    return call("TALO.Entry.Request", "request", 1, cookie, variables, compound=elements,
                **parameters)


def element(api, method, version=1, **parameters):
    return {"api": api, "version": version, "method": method, **parameters}


def account(*words, password=None):
    """Runs the program that manages accounts."""
    subprocess.run(
        [os.environ["WEBAPI_ACCOUNT"], *words], check=True, capture_output=True, timeout=TIMEOUT,
        input=b"" if password is None else password.encode("utf-8") + b"\n")


def configure(text):
    HOST_CONF.parent.mkdir(parents=True, exist_ok=True)
    HOST_CONF.write_text(text, encoding="utf-8")


def forget_sessions():
    """As if the appliance had been started again."""
    shutil.rmtree(SESSION_DIR, ignore_errors=True)
    shutil.rmtree(THROTTLE_DIR, ignore_errors=True)


def forget_accounts():
    for path in (ACCOUNTS_FILE, ACCOUNTS_FILE.with_name("accounts.lock"), HOST_CONF):
        path.unlink(missing_ok=True)


def is_entry_of_ours(process):
    """Others, in tests with mounts of their own, have another file system."""
    try:
        return (os.readlink(process / "exe") == str(ENTRY_CGI) and
                os.readlink(process / "ns/mnt") == os.readlink("/proc/self/ns/mnt"))
    except OSError:
        return False


def wait_until(condition, seconds=60):
    """Long, for a busy machine: only a failure takes all of it."""
    deadline = time.monotonic() + seconds
    while not condition():
        if time.monotonic() > deadline:
            return False
        time.sleep(0.02)
    return True


def forget_tasks():
    """Takes the store away when nobody has it open any more: whoever closes the last
    connection to a store takes away a log of that name, which may be the next one's."""
    processes = pathlib.Path("/proc")
    assert wait_until(
        lambda: not any(map(is_entry_of_ours, processes.glob("[0-9]*")))), "a task runs"
    shutil.rmtree(TASK_DIR, ignore_errors=True)


def session_ids():
    return sorted(path.name for path in SESSION_DIR.iterdir()) if SESSION_DIR.is_dir() else []


def last_use(sid):
    return os.stat(SESSION_DIR / sid).st_mtime


def leave_unused(sid, seconds):
    when = int(time.time()) - seconds
    os.utime(SESSION_DIR / sid, (when, when))


class ApplianceTest(unittest.TestCase):
    """An appliance with an administrator and two other users."""

    PASSWORDS = {"boss": "Boss-pass", "normal": "Normal-pass", "other": "Other-pass"}

    @classmethod
    def setUpClass(cls):
        forget_accounts()
        ACCOUNTS_FILE.parent.mkdir(parents=True, exist_ok=True)
        for name, password in cls.PASSWORDS.items():
            account("add", name, *(["--admin"] if name == "boss" else []), password=password)

    @classmethod
    def tearDownClass(cls):
        forget_sessions()
        forget_accounts()

    def setUp(self):
        forget_sessions()
        HOST_CONF.unlink(missing_ok=True)

    def open(self, name, **parameters):
        return session("open", account=name, passwd=self.PASSWORDS[name], **parameters)

    def log_in(self, name):
        """Answers the new session's id."""
        return self.open(name).data["sid"]

    def handle_of(self, sid):
        return session("info", sid).data["handle"]

    def describe_api(self, name, description):
        """Lends the appliance the description of an API."""
        path = WEBAPI_DIR / f"{name}.lib"
        path.write_text(json.dumps({name: description}), encoding="utf-8")
        self.addCleanup(path.unlink)

    def refused(self, reply, code, errors=None):
        self.assertEqual((reply.code, reply.errors), (code, errors), reply)
        self.assertIsNone(reply.cookie)

    def refused_as(self, reply, code, text):
        """Refused by the check of the session, with a word for the client."""
        self.refused(reply, code)
        self.assertEqual(reply.header("x-request-error"), text)
