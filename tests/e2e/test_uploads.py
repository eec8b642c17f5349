"""Uploads through a web server, good and bad ones."""

import os
import threading
import time
from concurrent.futures import ThreadPoolExecutor

from client import form
from multipart import BLOCK, BOUNDARY, Content, Form, Sender, file_digest, upload
from volumes import UPLOAD_PREFIX, VolumeCase, file_call, forget_peaks
from webserver import wait_until

MEBIBYTE = 1 << 20
PEAK_KIBIBYTES = 16 * 1024

NOTHING, NO_SPACE, GONE, MALFORMED, STORE = -6, -2, -1, -3, -5


class Files(VolumeCase):
    def arrives(self, content, **parameters):
        data = self.uploads(Form().file("file", "a.bin", content), **parameters)
        self.assertEqual(list(data["files"]), ["file"])
        self.assertEqual(data["params"]["file_filename"], "a.bin")
        self.assertEqual(int(data["params"]["file_size"]), len(content))
        self.assertEqual((self.kept / "file").stat().st_mode & 0o777, 0o600)
        self.assertEqual((self.kept / "file").stat().st_size, len(content))
        self.assertEqual(file_digest(self.kept / "file"), content.sha256())
        self.assertEqual(self.leftovers(), [])
        return data

    def test_files_of_all_sizes_arrive(self):
        for size in (0, 1, 2, 4095, 4096, 65536, 65537, 262144, 262145, 5 * MEBIBYTE + 3):
            with self.subTest(size):
                self.arrives(Content(size))

    def test_a_large_file_arrives_and_takes_little_memory(self):
        forget_peaks(self.server)
        data = self.arrives(Content(64 * MEBIBYTE))
        if not self.is_sanitized():
            self.assertLess(data["peak"], PEAK_KIBIBYTES)

    def test_the_form_may_say_itself_which_api_it_is_for(self):
        content = Content(300000)
        body = (Form().field("api", "Test.File").field("version", 1).field("method", "upload")
                .field("keep", self.kept).field("more", "and more").file("file", "b", content))
        data = upload(self.client, "", body).document()["data"]
        self.assertEqual(data["params"]["more"], "and more")
        self.assertEqual(data["params"]["file_filename"], "b")
        self.assertEqual(file_digest(self.kept / "file"), content.sha256())

    def test_fields_and_files_may_alternate(self):
        first, second = Content(70000), Content(80000)
        data = self.uploads(Form().field("a", "1").file("one", "x", first).field("b", "ä=&+%41")
                            .file("two", "y", second).field("c", ""))
        self.assertEqual([data["params"][name] for name in "abc"], ["1", "ä=&+%41", ""])
        self.assertEqual(file_digest(self.kept / "one"), first.sha256())
        self.assertEqual(file_digest(self.kept / "two"), second.sha256())

    def test_two_files_of_one_field_both_arrive(self):
        first, second = Content(1000), Content(2000)
        data = self.uploads(Form().file("file", "x", first).file("file", "y", second))
        self.assertEqual(sorted(data["files"]), ["file", "file_2"])
        self.assertEqual(data["params"]["file_filename"], "x")
        self.assertEqual(data["params"]["file_2_filename"], "y")
        self.assertEqual(file_digest(self.kept / "file"), first.sha256())
        self.assertEqual(file_digest(self.kept / "file_2"), second.sha256())

    def test_a_chunked_upload_arrives_where_the_server_gives_it_a_length(self):
        content = Content(200000)
        body = Form().file("file", "x", content)
        chunks = b"".join(b"%x\r\n%s\r\n" % (len(piece), piece) for piece in body) + b"0\r\n\r\n"
        head = (f"POST /webapi/entry.cgi?{file_call('upload', keep=self.kept)} HTTP/1.1\r\n"
                f"Host: here\r\nConnection: close\r\nTransfer-Encoding: chunked\r\n"
                f"Content-Type: multipart/form-data; boundary={BOUNDARY}\r\n\r\n")
        reply = self.client.raw(head.encode() + chunks)
        if self.refuses_chunks():
            self.answers_itself(reply, 411)
        elif self.server.name == "apache":  # gives the program no length at all
            self.refuses(reply, NOTHING)
        else:
            self.assertTrue(reply.document()["success"], reply)
            self.assertEqual(file_digest(self.kept / "file"), content.sha256())

    def test_32_uploads_at_once_all_arrive(self):
        folders = [self.folder / str(number) for number in range(32)]
        for folder in folders:
            folder.mkdir(mode=0o777)

        def send(number):
            content = Content(2 * MEBIBYTE + number)
            reply = upload(self.client, file_call("upload", keep=folders[number]),
                           Form().field("number", f"n{number}").file("file", "x", content))
            return content.sha256(), reply

        with ThreadPoolExecutor(max_workers=32) as pool:
            results = list(pool.map(send, range(32)))
        for number, (sha256, reply) in enumerate(results):
            self.assertEqual(reply.document()["data"]["params"]["number"], f"n{number}")
            self.assertEqual(file_digest(folders[number] / "file"), sha256)
        self.assertEqual(self.leftovers(), [])

    def test_files_that_nobody_keeps_are_gone_with_the_request(self):
        reply = self.upload("upload", Form().file("file", "x", Content(100000)))
        path = reply.document()["data"]["files"]["file"]
        self.assertTrue(path.startswith(f"{self.volume}/@tmp/{UPLOAD_PREFIX}"), path)
        self.assertTrue(wait_until(lambda: not self.leftovers()))


class Names(VolumeCase):
    def named(self, name):
        data = self.uploads(Form().file("file", name, b"text"))
        self.assertEqual((self.kept / "file").read_bytes(), b"text")
        self.assertTrue(data["files"]["file"].startswith(f"{self.volume}/@tmp/"))
        return data["params"]["file_filename"]

    def test_a_name_that_is_a_path_counts_as_its_last_component(self):
        for name, component in (("../../../../etc/passwd", "passwd"), ("/etc/passwd", "passwd"),
                                ("a/b/c.txt", "c.txt"), ("C:\\Users\\me\\d.txt", "d.txt"),
                                ("..\\..\\e", "e")):
            with self.subTest(name):
                self.assertEqual(self.named(name), component)

    def test_odd_names_arrive_as_data(self):
        for name in ("ä€🐧.txt", "a b;c=d", "%2e%2e%2fa%00b", "'; rm -rf $HOME `x`", "...",
                     "-rf", "<script>&", "x" * 255, "true", "17"):
            with self.subTest(name):
                self.assertEqual(self.named(name), name)

    def test_escaped_quotes_are_part_of_the_name(self):
        self.assertEqual(self.named(b'a\\"b'), 'a"b')

    def test_names_of_rfc_5987_are_understood(self):
        body = Form().raw_file("file", b"filename=\"e.txt\"; filename*=UTF-8''%e2%82%ac.txt", b"t")
        self.assertEqual(self.uploads(body)["params"]["file_filename"], "€.txt")

    def test_names_that_nobody_may_have_are_refused_and_leave_nothing(self):
        for name in (b"..", b".", b"a\0b", b"a\nb", b"a\tb", b"\xff\xfe.txt", b"a\x7f", b"x" * 256,
                     b"a/", b"\xc0\xaf"):
            with self.subTest(name):
                self.refuses(self.upload("upload", Form().file("file", name, b"text")), MALFORMED)
                self.assertEqual(self.leftovers(), [])

    def test_a_line_end_in_a_name_makes_no_header_line(self):
        reply = self.upload("upload", Form().file("file", b"a\r\nX-Evil: 1\r\n", b"text"))
        self.assertFalse(reply.document()["success"])
        self.assertIsNone(reply.header("X-Evil"))
        self.assertEqual(self.leftovers(), [])

    def test_a_path_that_the_client_writes_is_no_uploaded_file(self):
        data = self.uploads(Form().field("file", "/etc/passwd").file("other", "x", b"text"))
        self.assertEqual(data["params"]["file"], "/etc/passwd")
        self.assertEqual(list(data["files"]), ["other"])

    def test_a_client_cannot_write_the_facts_of_a_file_itself(self):
        data = self.uploads(Form().field("file", "/etc/passwd").field("file_size", "7")
                            .field("file_filename", "liar").file("file", "x", b"text")
                            .field("file_size", "8"))
        self.assertEqual(list(data["files"]), ["file"])
        self.assertEqual(data["params"]["file_filename"], "x")
        self.assertEqual(int(data["params"]["file_size"]), 4)


class Deferred(VolumeCase):
    def test_the_method_reads_the_body_and_hears_how_far_it_came(self):
        content = Content(24 * MEBIBYTE)
        body = Form().field("a", "first").file("file", "x.bin", content).field("b", "last")
        data = self.upload("deferred", body, keep=self.kept).document()["data"]
        self.assertEqual(data["steps"], [1, 1])
        self.assertEqual(data["before"], {"a": "first", "file": "x.bin"})
        self.assertEqual(data["params"]["b"], "last")
        self.assertEqual(data["params"]["file_filename"], "x.bin")
        self.assertEqual(list(data["files"]), ["file"])
        self.assertEqual(file_digest(self.kept / "file"), content.sha256())
        done = [pair[0] for pair in data["progress"]]
        self.assertEqual(done, sorted(done))
        self.assertEqual({pair[1] for pair in data["progress"]}, {len(body)})
        self.assertEqual(data["progress"][-1], [len(body), len(body)])

    def test_progress_is_told_while_the_client_still_sends(self):
        content = Content(2 * MEBIBYTE)
        body = list(Form().file("file", "x", content))
        sender = Sender(self.client, file_call("deferred"), sum(map(len, body)))
        self.addCleanup(sender.close)
        for piece in body[:2]:
            sender.send(piece)
        time.sleep(0.6)
        for piece in body[2:]:
            sender.send(piece[:MEBIBYTE // 2])
            time.sleep(0.6)
            sender.send(piece[MEBIBYTE // 2:])
        progress = sender.reply().document()["data"]["progress"]
        total = progress[-1][1]
        self.assertTrue([step for step in progress if 0 < step[0] < total], progress)

    def test_a_method_that_defers_gets_no_file_from_the_entry(self):
        data = self.upload("deferred", Form().field("file", "no file")).document()["data"]
        self.assertEqual(data["steps"], [1, -8])
        self.assertEqual(data["files"], {})

    def test_an_empty_file_is_none(self):
        data = self.upload("deferred", Form().file("file", "x", b"")).document()["data"]
        self.assertEqual(data["steps"], [1, NOTHING])


class Refusals(VolumeCase):
    def test_a_body_without_length_is_nothing_to_read(self):
        reply = upload(self.client, file_call("upload"), b"")
        self.refuses(reply, NOTHING)

    def test_a_body_that_is_no_form_is_refused_and_leaves_nothing(self):
        for body in (b"x", b"\r\n" * 1000000,
                     f"--{BOUNDARY}\r\n\r\nno name\r\n--{BOUNDARY}--\r\n".encode(),
                     b"".join(Form().file("file", "x", b"y" * 100000))[:-10]):
            with self.subTest(body[:40], size=len(body)):
                document = upload(self.client, file_call("upload"), Raw(body)).document()
                self.assertFalse(document["success"])
                self.assertEqual(document["error"]["code"], 108)
                self.assertEqual(self.leftovers(), [])

    def test_a_refusal_reaches_a_client_that_still_sends(self):
        body = Form().file("file", "..", Content(32 * MEBIBYTE))
        self.refuses(self.upload("upload", body), MALFORMED)
        self.awaits_no_entry()

    def test_more_than_any_disk_holds_is_refused_at_once(self):
        sender = Sender(self.client, file_call("upload"), 1 << 60)
        self.addCleanup(sender.close)
        head = next(iter(Form().file("file", "x", b"")))
        sender.send(head)
        # The others hear the program only once the body is over.
        if self.server.name == "lighttpd":
            self.refuses(sender.reply(), NO_SPACE)
        sender.close()
        self.awaits_no_entry()
        self.assertEqual(self.leftovers(), [])


class Raw:
    """A body that is no form."""

    def __init__(self, data):
        self._data = data

    def __len__(self):
        return len(self._data)

    def __iter__(self):
        yield self._data


class Breaks(VolumeCase):
    """Uploads that do not come to their end."""

    SIZE = 8 * MEBIBYTE

    def begin(self, method="upload"):
        """A sender whose body has come half of the way, to the disk."""
        content = Content(self.SIZE)
        self.rest = list(Form().file("file", "x", content))
        sender = Sender(self.client, file_call(method, keep=self.kept), sum(map(len, self.rest)))
        self.addCleanup(sender.close)
        for _ in range(1 + self.SIZE // BLOCK // 2):
            sender.send(self.rest.pop(0))
        self.assertTrue(wait_until(lambda: len(self.entries()) == 1), self.entries())
        return sender

    def awaits_data(self):
        """The process that reads, once it has written some of it."""
        def written():
            for pid in self.entries():
                if self.wchar(pid) >= 2 * MEBIBYTE:
                    return pid
            return None
        self.assertTrue(wait_until(written))
        return written()

    @staticmethod
    def wchar(pid):
        with open(f"/proc/{pid}/io", encoding="ascii") as counters:
            return int(dict(line.split(": ") for line in counters)["wchar"])

    def test_a_client_that_goes_leaves_nothing(self):
        for method in ("upload", "deferred"):
            with self.subTest(method):
                sender = self.begin(method)
                self.awaits_data()
                sender.close()
                self.awaits_no_entry()
                self.assertEqual(self.leftovers(), [])
                self.assertEqual(list(self.kept.iterdir()), [])

    def test_what_a_killed_process_leaves_is_swept_by_a_later_upload(self):
        started = self.folder / "started"
        holding = threading.Thread(target=lambda: self.upload(
            "hold", Form().file("file", "x", Content(100000)), started=started,
            finish=self.folder / "never"))
        holding.start()
        self.addCleanup(holding.join)
        self.assertTrue(wait_until(lambda: started.exists() and started.read_text()))
        os.kill(int(started.read_text()), 9)
        holding.join()
        left = self.leftovers()
        self.assertEqual(len(left), 1)
        # A day later, and an hour after the last sweep.
        long_ago = time.time() - 25 * 60 * 60
        for path in (self.volume / "@tmp").iterdir():
            os.utime(path, (long_ago, long_ago))
        self.uploads(Form().file("file", "x", b"text"))
        self.assertEqual(self.leftovers(), [])

    def test_a_process_that_is_killed_while_it_reads_is_cleaned_up_after(self):
        sender = self.begin()
        os.kill(self.awaits_data(), 9)
        self.awaits_no_entry()
        sender.close()
        long_ago = time.time() - 25 * 60 * 60
        for path in (self.volume / "@tmp").iterdir():
            os.utime(path, (long_ago, long_ago))
        self.uploads(Form().file("file", "x", b"text"))
        self.assertEqual(self.leftovers(), [])

    def test_a_disk_that_is_full_in_the_middle_is_108_and_leaves_nothing(self):
        self.configure(self.small_volume)
        filler = self.small_volume / "filler"
        self.addCleanup(lambda: filler.unlink(missing_ok=True))
        for method in ("upload", "deferred"):
            with self.subTest(method):
                filler.unlink(missing_ok=True)
                sender = self.begin(method)
                self.awaits_data()
                self.fill(filler)
                try:
                    for piece in self.rest:
                        sender.send(piece)
                except (BrokenPipeError, ConnectionResetError):
                    pass  # the refusal came first
                reply = sender.reply()
                if method == "upload":
                    self.refuses(reply, STORE)
                else:
                    self.assertEqual(reply.document()["data"]["steps"], [1, STORE])
                filler.unlink()
                self.awaits_no_entry()
                self.assertEqual(self.leftovers(self.small_volume), [])
                self.assertEqual(list(self.kept.iterdir()), [])

    @staticmethod
    def fill(filler):
        with open(filler, "wb", buffering=0) as file:
            try:
                while file.write(bytes(65536)) == 65536:
                    pass
            except OSError:
                pass

    def test_a_disk_that_is_too_small_is_passed_over(self):
        # The volume has no room, other folders may: nothing is left where there is none.
        self.configure(self.small_volume)
        data = self.upload("upload", Form().file("file", "x", Content(50 * MEBIBYTE))).document()
        if data["success"]:
            self.assertFalse(data["data"]["files"]["file"].startswith(str(self.small_volume)))
        else:
            self.assertEqual(data["error"], {"code": 108, "errors": {"upload_err": NO_SPACE}})
        self.assertEqual(self.leftovers(self.small_volume), [])


class Limits(VolumeCase):
    def test_the_host_settles_how_large_a_body_may_be(self):
        with open(self.configuration, "a", encoding="ascii") as file:
            file.write('upload_total_bytes="100000"\n')
        self.assertTrue(self.uploads(Form().file("file", "x", Content(99000))))
        reply = self.upload("upload", Form().file("file", "x", Content(100001)))
        self.refuses(reply, -4)

    def test_ordinary_calls_keep_their_limit(self):
        self.fails(self.client.post(form(api="TALO.System", version=1, method="ping") + "&text=" +
                                    "x" * (16 << 20)), 101)
