"""TALO.File: downloads of files and folders."""

import io
import os
import pathlib
import unittest
import urllib.parse
import zipfile

from appliance import Reply
from file_case import Answer, download, FileTest


class Download(FileTest):
    def test_sends_a_file_with_its_own_type(self):
        self.write("page.html", b"<script>")
        answer = Answer(download(self.sid, path="/data/page.html"))
        self.assertEqual(answer.body, b"<script>")
        self.assertTrue(answer.one("Content-Type").startswith("text/html"))
        self.assertEqual(answer.one("X-Content-Type-Options"), "nosniff")
        self.assertEqual(answer.one("Content-Disposition"), 'attachment; filename="page.html"')
        self.assertEqual(answer.one("Content-Length"), "8")
        self.assertEqual(answer.all("Status"), [])

    def test_sends_an_empty_file_and_any_bytes(self):
        for content in (b"", bytes(range(256)) * 1000):
            self.write("file", content)
            answer = Answer(download(self.sid, path="/data/file"))
            self.assertEqual(answer.body, content)
            self.assertEqual(answer.one("Content-Type"), "application/octet-stream")

    def test_encodes_the_name(self):
        for name, plain in (('a"b', "a_b"), ("ä€.txt", "__.txt"), ("a\r\nSet-Cookie: x", None)):
            self.write(name)
            answer = Answer(download(self.sid, path=f"/data/{name}"))
            self.assertEqual(answer.body, b"content")
            value = answer.one("Content-Disposition")
            self.assertEqual(answer.all("Set-Cookie"), [])
            if plain is not None:
                quoted = urllib.parse.quote(name, safe="")
                self.assertEqual(
                    value, f'attachment; filename="{plain}"; filename*=UTF-8\'\'{quoted}')

    def test_sends_one_range_and_several(self):
        self.write("file.txt", b"0123456789")
        part = Answer(download(self.sid, path="/data/file.txt",
                               variables={"HTTP_RANGE": "bytes=2-4"}))
        self.assertEqual((part.body, part.one("Status")), (b"234", "206 Partial Content"))
        parts = Answer(download(self.sid, path="/data/file.txt",
                                variables={"HTTP_RANGE": "bytes=0-1,4-5"}))
        self.assertEqual(parts.one("Status"), "206 Partial Content")
        kind, boundary = parts.one("Content-Type").split("; boundary=")
        self.assertEqual(kind, "multipart/byteranges")
        self.assertEqual(parts.body, "".join(
            f"{start}--{boundary}\r\nContent-Type: text/plain\r\n"
            f"Content-Range: bytes {span}/10\r\n\r\n{content}"
            for start, span, content in (("", "0-1", "01"), ("\r\n", "4-5", "45"))
        ).encode() + f"\r\n--{boundary}--\r\n".encode())

    def test_sends_only_headers_for_head(self):
        self.write("file")
        self.write("folder/file")
        for path in ("/data/file", "/data/folder"):
            self.assertEqual(Answer(download(self.sid, "HEAD", path=path)).body, b"")

    def test_sends_a_folder_as_an_archive(self):
        self.write("folder/a/ä.txt", b"1" * 100000)
        self.write("folder/b", b"")
        self.write("folder/.talo-new-0123456789abcdef")
        (self.folder / "folder/out").symlink_to(self.top / "secret")
        (self.folder / "folder/empty").mkdir()
        pathlib.Path(os.fsdecode(os.fsencode(self.folder) + b"/folder/\xff")).write_text("x")
        os.mkfifo(self.folder / "folder/pipe")
        answer = Answer(download(self.sid, path="/data/folder"))
        self.assertEqual(answer.one("Content-Type"), "application/zip")
        self.assertEqual(answer.one("Content-Disposition"), 'attachment; filename="folder.zip"')
        self.assertEqual(answer.one("X-Content-Type-Options"), "nosniff")
        with zipfile.ZipFile(io.BytesIO(answer.body)) as archive:
            self.assertIsNone(archive.testzip())
            self.assertEqual(sorted(archive.namelist()), [
                "folder/", "folder/%FF", "folder/a/", "folder/a/ä.txt", "folder/b",
                "folder/empty/"])
            self.assertEqual(archive.read("folder/a/ä.txt"), b"1" * 100000)

    def test_sends_several_under_names_of_their_own(self):
        for name, content in (("a/x.txt", b"1"), ("b/x.txt", b"2"), ("x.txt", b"3")):
            self.write(name, content)
        paths = ["/data/a/x.txt", "/data/b/x.txt", "/data/x.txt", "/data/a"]
        answer = Answer(download(self.sid, paths=paths))
        with zipfile.ZipFile(io.BytesIO(answer.body)) as archive:
            self.assertEqual({name: archive.read(name) for name in archive.namelist()},
                             {"x.txt": b"1", "x (2).txt": b"2", "x (3).txt": b"3", "a/": b"",
                              "a/x.txt": b"1"})
        self.assertEqual(answer.one("Content-Disposition"), 'attachment; filename="download.zip"')

    def test_says_before_it_begins_what_is_not_there(self):
        self.write("file")
        os.mkfifo(self.folder / "pipe")
        self.refused(Reply(download(self.sid, paths=["/data/file", "/data/none"])), 401,
                     "/data/none")
        self.refused(Reply(download(self.sid, paths=["/data/file", "/closed/file"])), 401,
                     "/closed/file")
        self.refused(Reply(download(self.sid, path="/data/pipe")), 405, "/data/pipe")

    def test_names_the_parameter_that_is_wrong(self):
        for parameters, name in (({}, "path"), ({"path": "/data/a", "paths": ["/data/a"]}, "path"),
                                 ({"paths": []}, "paths"), ({"paths": "/data/a"}, "paths"),
                                 ({"paths": [1]}, "paths"), ({"paths": ["/"]}, "paths"),
                                 ({"paths": ["/data/a"] * 1001}, "paths"),
                                 ({"path": ["/data/a"]}, "path")):
            self.refused(self.file("download", **parameters), 400, name)


if __name__ == "__main__":
    unittest.main()
