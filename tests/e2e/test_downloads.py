"""Files as answers, sent by the entry itself or by the web server in its place."""

import email
import email.policy
import os
import pathlib
import re
import socket
import subprocess
import tempfile

from case import Case
from client import ENTRY, Client
from multipart import Content, digest
from volumes import entries, file_call, forget_peaks
from webserver import HOST, processes_that_mention, wait_until

MEBIBYTE = 1 << 20
PEAK_KIBIBYTES = 16 * 1024
TYPE = "application/x-of-mine"


class DownloadCase(Case):
    def make(self, content, name="file.bin", folder=None):
        path = (folder or self.folder) / name
        with open(path, "wb") as file:
            for block in [content] if isinstance(content, bytes) else content:
                file.write(block)
        return path

    def get(self, path, headers=None, method="GET", client=None, **parameters):
        query = file_call("download", path=path, **{"type": TYPE, **parameters})
        return (client or self.client).request(method, f"{ENTRY}?{query}", headers=headers)

    def note(self, path):
        """Result, whether the server could send, bytes written, peak memory in KiB."""
        self.assertTrue(wait_until(path.exists))
        return [int(word) for word in path.read_text().split()]


class Files(DownloadCase):
    def test_files_of_all_sizes_arrive(self):
        for size in (0, 1, 4095, 65536, 262143, 262144, 262145, 3 * MEBIBYTE + 1):
            for way in ({}, {"open": 1}):
                with self.subTest(size, way=way):
                    content = Content(size)
                    reply = self.get(self.make(content), **way)
                    self.assertEqual(reply.status, 200)
                    self.assertEqual(len(reply.body), size)
                    self.assertEqual(digest([reply.body]), content.sha256())
                    self.assertEqual(reply.header("Content-Length"), str(size))
                    self.assertEqual(reply.header("Accept-Ranges"), "bytes")

    def test_a_large_file_arrives_and_takes_little_memory(self):
        content = Content(64 * MEBIBYTE)
        note = self.folder / "note"
        path = self.make(content)
        forget_peaks(self.server)
        reply = self.get(path, note=note)
        self.assertEqual(digest([reply.body]), content.sha256())
        result, enabled, written, peak = self.note(note)
        self.assertEqual((result, enabled), (0, 0))
        self.assertGreaterEqual(written, 64 * MEBIBYTE)
        if not self.is_sanitized():
            self.assertLess(peak, PEAK_KIBIBYTES)

    def test_a_method_that_takes_its_own_out_sends_one_content_type(self):
        reply = self.get(self.make(b"text"))
        self.assertEqual([value for name, value in reply.headers if name.lower() == "content-type"],
                         [TYPE])

    def test_the_type_of_a_path_comes_from_its_name(self):
        path = self.make(b"text", "page.html")
        query = file_call("download", path=path, header="Content-type", value="text/html")
        reply = self.client.get(query)
        self.assertEqual(reply.header("Content-Type"), "text/html")

    def test_a_file_that_is_not_there_is_404(self):
        self.assertEqual(self.get(self.folder / "none").status, 404)
        self.assertEqual(self.get(self.folder).status, 404)

    def test_a_client_that_goes_ends_the_process(self):
        note = self.folder / "note"
        path = self.make(Content(256 * MEBIBYTE))
        query = file_call("download", path=path, note=note)
        with socket.socket() as client:
            client.setsockopt(socket.SOL_SOCKET, socket.SO_RCVBUF, 4096)
            client.connect((HOST, self.server.port))
            client.sendall(f"GET {ENTRY}?{query} HTTP/1.1\r\nHost: x\r\n\r\n".encode())
            self.assertTrue(client.recv(100))
        self.assertTrue(wait_until(lambda: not entries(self.server)))


class Parts(DownloadCase):
    """Ranges and conditions."""

    def setUp(self):
        super().setUp()
        self.bytes = b"".join(Content(300000))
        self.path = self.make(self.bytes)

    def range(self, text, **headers):
        return self.get(self.path, {"Range": text, **headers})

    def test_single_ranges(self):
        size = len(self.bytes)
        for text, first, end in (("bytes=0-0", 0, 1), ("bytes=100-199", 100, 200),
                                 ("bytes=299999-", 299999, size), ("bytes=-10", size - 10, size),
                                 ("bytes=262100-262200", 262100, 262201),
                                 ("bytes=5-400000", 5, size)):
            with self.subTest(text):
                reply = self.range(text)
                self.assertEqual(reply.status, 206)
                self.assertEqual(reply.header("Content-Range"), f"bytes {first}-{end - 1}/{size}")
                self.assertEqual(reply.header("Content-Length"), str(end - first))
                self.assertEqual(reply.body, self.bytes[first:end])

    def test_several_ranges(self):
        reply = self.get(self.path, {"Range": "bytes=0-9,1000-1999,-5"})
        self.assertEqual(reply.status, 206)
        # A header that a method sets is another line: the boundary is the body's.
        boundary = re.match(rb"--([0-9a-f]+)\r\n", reply.body).group(1).decode()
        message = email.message_from_bytes(
            f"Content-Type: multipart/byteranges; boundary={boundary}\r\n\r\n".encode() +
            reply.body, policy=email.policy.HTTP)
        parts = [part.get_payload(decode=True) for part in message.get_payload()]
        ranges = [part["Content-Range"] for part in message.get_payload()]
        size = len(self.bytes)
        self.assertEqual(ranges, [f"bytes 0-9/{size}", f"bytes 1000-1999/{size}",
                                  f"bytes {size - 5}-{size - 1}/{size}"])
        self.assertEqual(parts[1], self.bytes[1000:2000])

    def test_a_range_behind_the_end_is_416(self):
        reply = self.range("bytes=300000-")
        self.assertEqual(reply.status, 416)
        self.assertEqual(reply.header("Content-Range"), "bytes */300000")

    def test_ranges_that_are_none_give_the_whole(self):
        for text in ("bytes=", "bytes=5-4", "lines=1-2", "bytes=a-b"):
            with self.subTest(text):
                reply = self.range(text)
                self.assertEqual((reply.status, reply.body), (200, self.bytes))

    def test_if_range_gives_the_part_of_the_same_file_only(self):
        whole = self.get(self.path)
        for header in ("ETag", "Last-Modified"):
            os.utime(self.path, (1000000000, 1000000000))
            whole = self.get(self.path)
            with self.subTest(header):
                reply = self.range("bytes=0-9", **{"If-Range": whole.header(header)})
                self.assertEqual((reply.status, reply.body), (206, self.bytes[:10]))
        for other in ('"other"', "Thu, 01 Jan 2015 00:00:00 GMT"):
            with self.subTest(other):
                reply = self.range("bytes=0-9", **{"If-Range": other})
                self.assertEqual((reply.status, reply.body), (200, self.bytes))

    def test_a_copy_that_is_still_good_is_304(self):
        whole = self.get(self.path)
        for headers in ({"If-None-Match": whole.header("ETag")},
                        {"If-Modified-Since": whole.header("Last-Modified")}):
            with self.subTest(headers):
                reply = self.get(self.path, headers)
                self.assertEqual((reply.status, reply.body), (304, b""))
        reply = self.get(self.path, {"If-None-Match": '"other"'})
        self.assertEqual((reply.status, reply.body), (200, self.bytes))

    def test_head_answers_the_header_alone(self):
        reply = self.get(self.path, method="HEAD")
        self.assertEqual((reply.status, reply.body), (200, b""))
        self.assertEqual(reply.header("Content-Length"), "300000")
        self.assertEqual(reply.header("ETag"), self.get(self.path).header("ETag"))

    def test_curl_resumes_a_download(self):
        url = f"http://{HOST}:{self.server.port}{ENTRY}?{file_call('download', path=self.path)}"
        copy = self.make(self.bytes[:123456], "copy")
        subprocess.run(["curl", "--noproxy", "*", "-fsS", "-C", "-", "-o", copy, url], check=True)
        self.assertEqual(copy.read_bytes(), self.bytes)
        part = subprocess.run(["curl", "--noproxy", "*", "-fsS", "-r", "10-19", url], check=True,
                              stdout=subprocess.PIPE).stdout
        self.assertEqual(part, self.bytes[10:20])


class SentByTheServer(DownloadCase):
    """The web server reads the file, where it was set up to."""

    @classmethod
    def setUpClass(cls):
        # Started last, the second server has written the service program.
        program = cls.server.service_program.read_bytes()
        cls.addClassCleanup(cls.server.service_program.chmod, 0o755)
        cls.addClassCleanup(cls.server.service_program.write_bytes, program)
        folder = tempfile.TemporaryDirectory(dir=cls.server.run_dir / "tmp")
        cls.addClassCleanup(folder.cleanup)
        cls.data = pathlib.Path(folder.name) / "data"
        cls.data.mkdir()
        cls.second = cls.server.other("sends", ["--send-files", cls.data])
        cls.addClassCleanup(cls.stop)

    @classmethod
    def stop(cls):
        status = cls.second.script.stop()
        assert status == 0, "".join(cls.second.script.output)
        assert wait_until(lambda: not processes_that_mention(str(cls.second.run_dir)))

    def setUp(self):
        super().setUp()
        self.client = Client(HOST, self.second.port)
        self.note_path = self.folder / "note"

    def sends(self, path, **parameters):
        """The reply, and how much of it the entry's process wrote."""
        self.note_path.unlink(missing_ok=True)
        reply = self.get(path, note=self.note_path, **parameters)
        result, enabled, written, _ = self.note(self.note_path)
        self.assertEqual(result, 0)
        self.assertEqual(enabled, "own" not in parameters)
        return reply, written

    def test_a_large_file_passes_by_the_entry(self):
        content = Content(32 * MEBIBYTE)
        path = self.make(content, folder=self.data)
        reply, written = self.sends(path)
        self.assertEqual(reply.status, 200)
        self.assertEqual(digest([reply.body]), content.sha256())
        self.assertLess(written, 4096)
        self.assertEqual(reply.header("Content-Type"), TYPE)
        for name in ("X-Sendfile", "X-Accel-Redirect"):
            self.assertIsNone(reply.header(name))

    def test_a_file_that_was_another_one_a_moment_ago_arrives_as_it_is_now(self):
        for text in (b"x" * 100000, b"y" * 10, b"z" * 50000):
            reply, _ = self.sends(self.make(text, "changing", self.data))
            self.assertEqual(reply.body, text)

    def test_a_method_can_send_itself_all_the_same(self):
        content = Content(MEBIBYTE)
        for way in ({"own": 1}, {"open": 1, "own": 1}):
            reply, written = self.sends(self.make(content, folder=self.data), **way)
            self.assertEqual(digest([reply.body]), content.sha256())
            self.assertGreaterEqual(written, MEBIBYTE)

    def test_files_of_all_names_and_sizes_arrive(self):
        for number, name in enumerate(("a b.txt", "ä€🐧", "100%41%2f..", "a?b#c&d=e", "+", "a\\b",
                                       "'\"", "a;b", "~", "[x]")):
            with self.subTest(name):
                text = b"" if number == 0 else b"x" * number
                reply, written = self.sends(self.make(text, name, self.data))
                self.assertEqual((reply.status, reply.body), (200, text), reply)

    def test_ranges_are_the_servers(self):
        content = b"".join(Content(300000))
        path = self.make(content, folder=self.data)
        reply = self.get(path, {"Range": "bytes=100-199"})
        self.assertEqual((reply.status, reply.body), (206, content[100:200]))
        reply = self.get(path, {"Range": "bytes=300000-"})
        self.assertEqual(reply.status, 416)

    def test_no_file_of_another_folder_is_sent(self):
        secret = self.make(b"a secret of the host", "secret")
        beside = self.make(b"a secret of the host", "x", self.beside())
        refused = self.by_server(lighttpd=403, nginx=404, apache=404)
        for path in (secret, beside, self.data / ".." / "data-too" / "x", "/etc/passwd"):
            with self.subTest(str(path)):
                reply = self.get(path)
                self.assertEqual(reply.status, refused, reply)
                self.assertNotIn(b"a secret of the host", reply.body)
                self.assertNotIn(b"root:", reply.body)

    def beside(self):
        """A folder whose name begins like the one that may be sent."""
        folder = self.data.with_name("data-too")
        folder.mkdir(exist_ok=True)
        return folder

    def test_no_link_is_followed_below_the_folder(self):
        secret = self.make(b"a secret of the host", "secret")
        (self.data / "link").symlink_to(secret)
        # The entry names what the link leads to, which is not below the folder.
        reply = self.get(self.data / "link")
        self.assertEqual(reply.status, self.by_server(lighttpd=403, nginx=404, apache=404), reply)
        self.assertNotIn(b"a secret of the host", reply.body)

    def test_no_client_asks_the_server_for_a_file_itself(self):
        path = self.make(b"a secret of the host", "plain", self.data)
        for target in (f"/sent-by-server{path}", str(path), f"/streamed{path}", "/streamed"):
            with self.subTest(target):
                reply = self.client.request("GET", target)
                self.assertIn(reply.status, (403, 404), reply)
                self.assertNotIn(b"a secret of the host", reply.body)
        reply = self.client.get("api=TALO.System&version=1&method=ping",
                                {"X-Sendfile": str(path), "X-Accel-Redirect": str(path)})
        self.succeeds(reply, {})
