"""Shares through a web server: files up, down, listed and removed, in slices too."""

import hashlib
import json
import shutil

from client import ENTRY, form
from multipart import Content, Form, Sender, digest, upload
from test_sessions import Sessions
from volumes import VolumeCase
from webserver import wait_until

MEBIBYTE = 1 << 20
SLICE = {"X-Type-Name": "SLICEUPLOAD", "Content-Type": "application/octet-stream"}


class FileCase(Sessions, VolumeCase):
    """ann is an administrator, bob may write the share "ours" and read "theirs"."""

    def setUp(self):
        super().setUp()
        self.shares = self.server.root / "etc/talo/shares"
        before = self.shares.read_bytes() if self.shares.exists() else None
        for name in ("ours", "theirs", "hers"):
            (self.volume / name).mkdir()
        self.shares.write_text("".join(json.dumps(line) + "\n" for line in (
            {"name": "ours", "folder": str(self.volume / "ours"), "writers": ["@users"]},
            {"name": "theirs", "folder": str(self.volume / "theirs"), "readers": ["bob"]},
            {"name": "hers", "folder": str(self.volume / "hers")})))
        self.shares.chmod(0o600)
        self.addCleanup(lambda: self.shares.unlink() if before is None else
                        self.shares.write_bytes(before))
        self.login = {name: {"Cookie": f"id={self.log_in(name)}"} for name in ("ann", "bob")}

    def ask(self, user, method, api="TALO.File", **parameters):
        return self.client.call(api, method, headers=self.login[user], **parameters)

    def data(self, reply):
        document = reply.document()
        self.assertTrue(document["success"], document)
        return document["data"]

    def fails_with(self, reply, code, about):
        self.check_document(reply, {"success": False, "error": {"code": code, "errors": about}})

    def put(self, user, folder, name, content, **fields):
        body = Form()
        for field, value in fields.items():
            body.field(field, value)
        query = form(api="TALO.File", version=1, method="upload", path=folder)
        return upload(self.client, query, body.file("file", name, content), self.login[user])

    def get(self, user, path, headers=None, method="GET"):
        query = form(api="TALO.File", version=1, method="download", path=path)
        return self.client.request(method, f"{ENTRY}?{query}",
                                   headers={**self.login[user], **(headers or {})})

    def names(self, user, folder):
        return [entry["name"] for entry in self.data(self.ask(user, "list", folder=folder))["entries"]]


class Shares(FileCase):
    def test_a_file_goes_up_is_listed_comes_back_and_goes(self):
        content = Content(5 * MEBIBYTE + 1)
        entry = self.data(self.put("bob", "/ours", "a file.bin", content, mtime=1000000000))
        self.assertEqual((entry["path"], entry["size"]), ("/ours/a file.bin", len(content)))
        self.assertEqual(self.names("bob", "/ours"), ["a file.bin"])
        facts = self.data(self.ask("bob", "stat", path="/ours/a file.bin"))
        self.assertEqual((facts["type"], facts["mtime"]), ("file", 1000000000))
        reply = self.get("bob", "/ours/a file.bin")
        self.assertEqual(digest([reply.body]), content.sha256())
        self.assertEqual([value for name, value in reply.headers if name.lower() == "content-type"],
                         ["application/octet-stream"])
        self.assertEqual(reply.header("X-Content-Type-Options"), "nosniff")
        self.assertEqual(reply.header("Content-Disposition").split(";")[0], "attachment")
        self.assertEqual(self.data(self.ask("bob", "remove", path="/ours/a file.bin"))["removed"],
                         1)
        self.assertEqual(self.names("bob", "/ours"), [])
        self.assertEqual(self.leftovers(), [])

    def test_each_user_has_the_rights_of_the_share(self):
        self.assertEqual(self.names("ann", "/"), ["hers", "ours", "theirs"])
        self.assertEqual(self.names("bob", "/"), ["ours", "theirs"])
        self.data(self.put("ann", "/theirs", "x", b"text"))
        self.assertEqual(self.get("bob", "/theirs/x").body, b"text")
        self.fails_with(self.put("bob", "/theirs", "y", b"text"), 402, "/theirs/y")
        self.fails_with(self.ask("bob", "remove", path="/theirs/x"), 402, "/theirs/x")
        self.data(self.put("ann", "/hers", "z", b"text"))
        for path in ("/hers/z", "/nobodys/z"):
            self.fails_with(self.ask("bob", "stat", path=path), 401, path)
            self.fails_with(self.get("bob", path), 401, path)
        self.assertEqual(self.leftovers(), [])

    def test_without_a_session_nothing_is_taken(self):
        query = form(api="TALO.File", version=1, method="upload", path="/ours")
        reply = upload(self.client, query, Form().file("file", "x", Content(MEBIBYTE)))
        self.fails(reply, 119)
        self.assertEqual(list((self.volume / "ours").iterdir()), [])
        self.assertEqual(self.leftovers(), [])

    def test_two_uploads_to_one_name_leave_one_whole_file(self):
        first, second = Content(MEBIBYTE), Content(2 * MEBIBYTE)
        query = form(api="TALO.File", version=1, method="upload", path="/ours")
        senders = []
        for content in (first, second):
            body = list(Form().file("file", "x", content))
            sender = Sender(self.client, query, sum(map(len, body)), self.login["bob"])
            self.addCleanup(sender.close)
            senders.append((sender, body))
        for sender, body in senders:
            sender.send(body[0])
        for sender, body in senders:
            sender.send(b"".join(body[1:]))
        replies = [sender.reply().document() for sender, _ in senders]
        self.assertEqual(sorted(reply["success"] for reply in replies), [False, True], replies)
        refused = [reply for reply in replies if not reply["success"]][0]
        self.assertEqual(refused["error"], {"code": 403, "errors": "/ours/x"})
        winner = first if replies[0]["success"] else second
        self.assertEqual(digest([self.get("bob", "/ours/x").body]), winner.sha256())
        self.assertEqual(self.leftovers(), [])
        self.data(self.put("bob", "/ours", "x", b"new", overwrite="true"))
        self.assertEqual(self.get("bob", "/ours/x").body, b"new")

    def test_hostile_names_stay_in_the_share(self):
        entry = self.data(self.put("bob", "/ours", "../../../evil", b"text"))
        self.assertEqual(entry["path"], "/ours/evil")
        for folder in ("/ours/..", "/ours/../hers", "/..", "ours", "/ours//x", "/ours/."):
            with self.subTest(folder):
                self.assertFalse(self.put("bob", folder, "x", b"t").document()["success"])
        (self.volume / "ours" / "way").symlink_to("/etc")
        self.fails_with(self.get("bob", "/ours/way/passwd"), 406, "/ours/way/passwd")
        self.fails_with(self.put("bob", "/ours/way", "x", b"t"), 406, "/ours/way/x")
        self.assertEqual(list((self.volume / "hers").iterdir()), [])

    def test_names_that_mean_something_in_a_header_come_back_in_one_line(self):
        for name in ('quo"te', "per%0d%0aX-Evil: 1", "ä€🐧", "semi;colon=1"):
            with self.subTest(name):
                self.data(self.put("bob", "/ours", name.replace('"', '\\"'), b"text"))
                reply = self.get("bob", f"/ours/{name}")
                self.assertEqual((reply.status, reply.body), (200, b"text"))
                self.assertIsNone(reply.header("X-Evil"))
        # No upload makes such a name, a user's own program may.
        (self.volume / "ours" / "a\r\nX-Evil: 1\r\n").write_bytes(b"text")
        reply = self.get("bob", "/ours/a\r\nX-Evil: 1\r\n")
        self.assertEqual((reply.status, reply.body), (200, b"text"))
        self.assertIsNone(reply.header("X-Evil"))
        self.assertIn("attachment", reply.header("Content-Disposition"))

    def test_a_checksum_is_computed_in_the_background(self):
        content = Content(3 * MEBIBYTE)
        self.data(self.put("bob", "/ours", "x", content))
        task_id = self.data(self.ask("bob", "start", api="TALO.File.Checksum",
                                     path="/ours/x"))["task_id"]

        def status():
            return self.data(self.ask("bob", "status", api="TALO.Task", task_id=task_id))
        self.assertTrue(wait_until(lambda: status()["finish"]))
        self.assertEqual(status()["data"]["sha256"], content.sha256())


class Slices(FileCase):
    # The folder is that of whoever made it first: the web servers run as different users.
    def setUp(self):
        super().setUp()
        shutil.rmtree(self.server.root / "var/lib/talo/slice", ignore_errors=True)

    def slice(self, body, **parameters):
        query = form(api="TALO.File", version=1, method="upload_slice", **parameters)
        return self.client.request("POST", f"{ENTRY}?{query}", body,
                                   {**SLICE, **self.login["bob"]})

    def status(self, upload_id):
        return self.data(self.ask("bob", "upload_status", upload_id=upload_id))

    def test_slices_become_a_file_when_it_is_whole(self):
        content = b"".join(Content(2 * MEBIBYTE + 5))
        sha256 = hashlib.sha256(content).hexdigest()
        first = self.data(self.slice(content[:MEBIBYTE], path="/ours/x", length=len(content),
                                     file_digest=sha256))
        self.assertEqual((first["offset"], first["complete"]), (MEBIBYTE, False))
        self.assertEqual(self.names("bob", "/ours"), [])
        last = self.data(self.slice(content[MEBIBYTE:], upload_id=first["upload_id"],
                                    offset=MEBIBYTE))
        self.assertEqual((last["offset"], last["complete"]), (len(content), True))
        self.assertEqual(self.get("bob", "/ours/x").body, content)

    def test_an_upload_that_broke_off_in_a_slice_goes_on_where_it_ended(self):
        content = b"".join(Content(6 * MEBIBYTE))
        upload_id = self.data(self.slice(b"", path="/ours/x", length=len(content)))["upload_id"]
        query = form(api="TALO.File", version=1, method="upload_slice", upload_id=upload_id,
                     offset=0)
        sender = Sender(self.client, query, len(content), {**SLICE, **self.login["bob"]})
        self.addCleanup(sender.close)
        sender.send(content[:4 * MEBIBYTE])
        self.assertTrue(wait_until(lambda: self.status(upload_id)["offset"] >= 2 * MEBIBYTE))
        sender.close()
        self.awaits_no_entry()
        arrived = self.status(upload_id)["offset"]
        self.assertGreaterEqual(arrived, 2 * MEBIBYTE)
        wrong = self.slice(b"x", upload_id=upload_id, offset=arrived + 1).document()["error"]
        self.assertEqual((wrong["code"], wrong["errors"]["offset"]), (418, arrived))
        self.data(self.slice(content[arrived:], upload_id=upload_id, offset=arrived))
        self.assertEqual(digest([self.get("bob", "/ours/x").body]), digest([content]))
