"""A process for each request, and workers that stand ready: both answer alike, byte by
byte."""

import difflib
import re
import socket
import subprocess
import tempfile
import unittest

import scgi
from client import ENTRY, Client, form
from multipart import TYPE, Form
from test_sessions import Sessions
from volumes import UPLOAD_PREFIX
from webserver import HOST, wait_until

FORM = "application/x-www-form-urlencoded"

# What no two replies have in common, and what stands for it.
DIFFERENT = [
    (re.compile(rb"\bs[A-Za-z0-9_-]{43}\b"), b"SESSION"),
    (re.compile(UPLOAD_PREFIX.encode() + rb"[A-Za-z0-9-]+"), b"UPLOAD"),
    (re.compile(rb"(boundary=|^--)[0-9a-f]{32}\b", re.MULTILINE), rb"\1BOUNDARY"),
    (re.compile(rb'"peak":\d+'), b"PEAK"),
    (re.compile(rb"(?im)^Date: .*\r\n"), b""),
    (re.compile(rb"(?im)^Server: .*\r\n"), b""),
]

LENGTH = re.compile(rb"(?im)\r\nContent-Length: ([0-9]+)(?=\r|\Z)")

# What an API can rely on; a web server adds others of its own.
VARIABLES = ("REQUEST_METHOD", "QUERY_STRING", "REQUEST_URI", "SCRIPT_NAME", "SERVER_PROTOCOL",
             "SERVER_NAME", "SERVER_ADDR", "REMOTE_ADDR", "REQUEST_SCHEME", "GATEWAY_INTERFACE")


def load_tests(_loader, tests, _pattern):
    """Where there are two modes to compare."""
    return tests if Sessions.server.mode == "warm" else unittest.TestSuite()


def same(reply):
    for pattern, text in DIFFERENT:
        reply = pattern.sub(text, reply)
    return reply


class Asked:
    """A request, for whoever it is sent to."""

    def __init__(self, query="", body=None, kind=FORM, method=None, **headers):
        self.query = query
        self.body = body.encode() if isinstance(body, str) else body
        self.method = method or ("GET" if body is None else "POST")
        self.headers = {name.replace("_", "-"): value for name, value in headers.items()}
        self.headers["Host"] = "appliance"
        self.ends = False  # with less than its length says
        if body is not None:
            self.headers["Content-Type"] = kind
            self.headers["Content-Length"] = str(len(self.body))

    def variables(self):
        """The environment of a CGI program."""
        found = {"REQUEST_METHOD": self.method, "QUERY_STRING": self.query,
                 "SCRIPT_NAME": ENTRY, "REQUEST_URI": f"{ENTRY}?{self.query}",
                 "SERVER_PROTOCOL": "HTTP/1.0", "SERVER_NAME": "appliance",
                 "SERVER_PORT": "80", "REMOTE_ADDR": HOST, "GATEWAY_INTERFACE": "CGI/1.1"}
        for name, value in self.headers.items():
            name = name.upper().replace("-", "_")
            found[name if name.startswith("CONTENT_") else f"HTTP_{name}"] = value
        return found

    def bytes(self):
        """As a client sends it. Of HTTP 1.0, so that no reply is cut into chunks."""
        query = f"?{self.query}" if self.query else ""
        lines = "".join(f"{name}: {value}\r\n" for name, value in self.headers.items())
        return (f"{self.method} {ENTRY}{query} HTTP/1.0\r\n{lines}\r\n".encode() +
                (self.body or b""))


def call(api, method, version=1, **parameters):
    return form(api=api, version=version, method=method, **parameters)


def test_call(method, **parameters):
    return call("Test.Basic", method, **parameters)


def posted(content):
    """What makes a request one that sends this form."""
    return dict(body=b"".join(content), kind=TYPE)


def plain_calls():
    """By what a reader of a failure should know about it."""
    ping = call("TALO.System", "ping", text="hi", count=3)
    yield "nothing", Asked()
    yield "a query", Asked(ping)
    yield "the header alone", Asked(ping, method="HEAD")
    yield "another request method", Asked(ping, method="DELETE")
    yield "a body", Asked(body=ping)
    yield "query and body", Asked(ping, body="text=body")
    yield "a document", Asked(body='{"api":"TALO.System","version":1,"method":"ping","text":1.5}')
    yield "a broken document", Asked(body='{"api":"TALO.System","version":1,')
    yield "a body of another type", Asked(ping, body="text=body", kind="text/plain")
    yield "an empty body", Asked(ping, body="")
    yield "a large reply", Asked(body=call("TALO.System", "ping", text="ä€🐧<" * 100000))
    yield "a compound", Asked(body=call("TALO.Entry.Request", "request", compound=(
        '[{"api":"TALO.System","version":1,"method":"ping","text":"a"},'
        '{"api":"TALO.System","version":9,"method":"ping"},'
        '{"api":"Test.Basic","version":1,"method":"fail","code":400},'
        '{"api":"Test.Basic","version":1,"method":"throwNumber"},{}]')))
    yield "an unlisted version", Asked(call("TALO.System", "ping", version=9))
    yield "an unknown API", Asked(call("No.Such", "ping"))
    yield "a relay without a session", Asked(ping + "&relay_nd=2")
    for library in ("Missing", "NoTable", "NullTable", "NullCheck", "Folder", "Text"):
        yield f"library {library}", Asked(call(f"Test.{library}", "ok"))
    yield "an enciphered line that is none", Asked(body=ping + "&__cIpHeRtExT=x")


def method_calls():
    for method in ("ok", "nothing", "throwException", "throwNumber", "throwAfterSuccess",
                   "readInput", "notInTable", "unlisted", "print", "download"):
        yield method, Asked(test_call(method, text="of its own"))
    for status in (201, 302, 404, 500, 503):
        yield f"status {status}", Asked(test_call("status", code=status, message="so it is"))
    yield "a header line", Asked(test_call("header", name="X-Mine", value="a; b"))
    yield "an error in a header", Asked(test_call("serverError", text="it happened"))
    yield "an error with details", Asked(test_call("fail", code=401, details='["a",{"b":1}]'))
    yield "a folder", Asked(test_call("process"))
    yield "a check", Asked(call("Test.Check", "stop"))
    for method in ("set", "redirect"):
        yield f"cookie {method}", Asked(call("Test.Cookie", method))


def uploads():
    yield "a form that is not allowed", Asked(call("TALO.System", "ping"),
                                              **posted(Form().field("a", "1")))
    yield "a form that names its API", Asked(**posted(
        Form().field("api", "Test.Basic").field("version", 1).field("method", "uploadEcho")
        .field("text", "ä=&+%41")))
    upload = call("Test.File", "upload")
    yield "a file", Asked(upload, **posted(Form().file("file", "a b", b"x" * 100000)))
    yield "a name that nobody may have", Asked(upload, **posted(
        Form().file("file", "..", b"x" * 100000)))
    yield "a form cut short", Asked(upload, b"".join(Form().field("a", "1"))[:-9], TYPE)
    yield "no form", Asked(upload, b"x" * 1000, TYPE)


def read_by_the_method():
    """To the end of standard input."""
    small = posted(Form().field("a", "1"))
    yield "a form", Asked(test_call("upload"), **small)
    yield "a form that is deferred", Asked(test_call("uploadDeferred"), **small)


def downloads(path):
    file = call("Test.File", "download", path=path, type="text/x")
    yield "a file", Asked(file)
    yield "its header", Asked(file, method="HEAD")
    for ranges in ("bytes=0-0", "bytes=5-", "bytes=999999-", "bytes=0-1,4-5", "lines=1"):
        yield f"of a file, {ranges}", Asked(file, Range=ranges)
    yield "a file that changed", Asked(file, If_Match='"other"')
    yield "a file that did not", Asked(file, If_None_Match="*")
    yield "no file", Asked(call("Test.File", "download", path=f"{path}.none", type="text/x"))


def logged_in(sid):
    cookie = dict(Cookie=f"id={sid}")
    yield "a login", Asked(body=call("TALO.Session", "open", account="ann",
                                     passwd='"correct horse, battery"'))
    yield "a login that fails", Asked(body=call("TALO.Session", "open", account="nobody",
                                                passwd='"x"'))
    yield "a session's facts", Asked(call("TALO.Session", "info"), **cookie)
    yield "a session in a parameter", Asked(body=call("TALO.Session", "info", _sid=sid))
    yield "no session", Asked(call("TALO.Session", "info"))
    yield "a session that is none", Asked(call("TALO.Session", "info"), Cookie="id=sNone")
    yield "a catalog", Asked(call("TALO.Catalog", "list"), **cookie)
    yield "a missing target", Asked(call("TALO.System", "ping", relay_nd=9), **cookie)
    yield "no task", Asked(call("TALO.Task", "list"), **cookie)
    yield "a session's end", Asked(call("TALO.Session", "close"), Cookie="id=sNone")


class Modes(Sessions):
    """`first` and `second` send a request, each in a mode of its own."""

    def answer_alike(self, rows):
        number = 0
        for number, (name, asked) in enumerate(rows, start=1):
            with self.subTest(name):
                replies = [same(send(asked)) for send in (self.first, self.second)]
                self.assertTrue(replies[0])
                if replies[0] != replies[1]:
                    self.fail("\n".join(difflib.ndiff(*(
                        repr(reply[:4000]).split("\\r\\n") for reply in replies))))
        self.assertGreater(number, 0)

    def all_answer_alike(self):
        self.answer_alike(plain_calls())
        self.answer_alike(method_calls())
        self.answer_alike(uploads())
        path = self.folder / "file"
        path.write_bytes(bytes(range(256)) * 1000)
        self.answer_alike(downloads(path))
        self.answer_alike(logged_in(self.log_in("ann")))


class Programs(Modes):
    """Without a web server: what entry.cgi prints, and what comes over the socket."""

    def setUp(self):
        super().setUp()
        folder = tempfile.TemporaryDirectory(prefix="modes-")
        self.addCleanup(folder.cleanup)
        self.socket = f"{folder.name}/socket"
        self.log = open(f"{folder.name}/log", "w+b")
        self.addCleanup(self.log.close)
        self.program = subprocess.Popen([self.server.warm_program, "--socket", self.socket],
                                        env={}, stdin=subprocess.DEVNULL, stdout=self.log,
                                        stderr=self.log)
        self.addCleanup(self.stop)
        self.assertTrue(wait_until(self.listens))

    def listens(self):
        with socket.socket(socket.AF_UNIX) as probe:
            return probe.connect_ex(self.socket) == 0

    def stop(self):
        self.program.terminate()
        self.assertEqual(self.program.wait(timeout=30), 0)
        self.log.seek(0)
        self.assertEqual(self.log.read(), b"")

    def first(self, asked):
        return subprocess.run([self.server.entry], input=asked.body or b"", timeout=60,
                              env=asked.variables(), stdout=subprocess.PIPE, check=True).stdout

    def second(self, asked):
        return scgi.request(self.socket, asked.variables(), asked.body or b"", asked.ends)

    def test_answer_alike(self):
        self.all_answer_alike()
        # Web servers have their own ways with these, and not the same each time.
        self.answer_alike([
            ("cookie add", Asked(call("Test.Cookie", "add"))),
            ("no header", Asked(test_call("printRaw", text="of its own"))),
            ("a large body that is refused", Asked(body=b"x" * ((16 << 20) + 1)))])

    def test_have_the_same_environment(self):
        self.answer_alike([("environment", Asked(test_call("caller"), body="x=1", Cookie="a=b",
                                                 X_Mine="c"))])

    def test_take_a_body_that_is_shorter_than_its_length(self):
        asked = Asked(call("TALO.System", "ping"), body="text=short")
        asked.headers["Content-Length"] = "1000"
        asked.ends = True
        self.answer_alike([("a short body", asked)])


class Served(Modes):
    """Behind a web server each."""

    timeout = 60

    @classmethod
    def setUpClass(cls):
        # Started last, the second server has written the service program.
        program = cls.server.service_program.read_bytes()
        cls.addClassCleanup(cls.server.service_program.chmod, 0o755)
        cls.addClassCleanup(cls.server.service_program.write_bytes, program)
        cls.cold = cls.server.other("cold", mode="cgi")
        cls.addClassCleanup(cls.stop)

    @classmethod
    def stop(cls):
        status = cls.cold.script.stop()
        assert status == 0, "".join(cls.cold.script.output)

    def test_let_a_method_read_to_the_end_of_the_body(self):
        self.timeout = 5
        self.answer_alike(read_by_the_method())

    def first(self, asked):
        return self.send(self.cold, asked)

    def second(self, asked):
        return self.send(self.server, asked)

    def send(self, server, asked):
        """Without the length, which servers add when all of a short reply has come before
        they begin to send. Of two replies to one request, it may be so with either."""
        reply = b""
        with socket.create_connection((HOST, server.port), timeout=self.timeout) as connection:
            connection.sendall(asked.bytes())
            while block := connection.recv(65536):
                reply += block
        head, blank, body = reply.partition(b"\r\n\r\n")
        length = LENGTH.search(head)
        if length and asked.method != "HEAD":
            self.assertEqual(int(length.group(1)), len(body))
        return LENGTH.sub(b"", head) + blank + body

    def test_answer_alike(self):
        self.all_answer_alike()

    def test_tell_an_api_the_length_that_the_client_has_told(self):
        for server in (self.cold, self.server):
            reply = Client(HOST, server.port).post("text=hi", test_call("caller"))
            environment = reply.document()["data"]["environment"]
            self.assertEqual(environment["CONTENT_LENGTH"], "7")
            self.assertNotIn("WEBAPI_CONTENT_LENGTH", environment)

    def test_give_an_api_the_same_environment(self):
        found = []
        for server in (self.cold, self.server):
            reply = Client(HOST, server.port).get(test_call("caller"), {
                "Cookie": "a=b", "X-Mine": "c", "Authorization": "Basic eDp5",
                "Proxy": "http://example.org"})
            found.append(reply.document()["data"]["environment"])
        cold, warm = found
        for name in VARIABLES:
            with self.subTest(name):
                self.assertEqual(cold.get(name), warm.get(name))
        of_client = [{name: value for name, value in environment.items()
                      if name.startswith("HTTP_") and name != "HTTP_HOST"}
                     for environment in found]
        self.assertEqual(*of_client)
        for environment, server in ((cold, self.cold), (warm, self.server)):
            self.assertEqual(environment["SERVER_PORT"], str(server.port))
            self.assertEqual(environment["HTTP_HOST"], f"{HOST}:{server.port}")
            self.assertTrue(environment["REMOTE_PORT"].isdigit())
            self.assertEqual(environment.get("CONTENT_LENGTH", "0"), "0")
