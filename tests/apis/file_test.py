"""TALO.File: rights, lists, paths, changes, uploads."""

import os
import pathlib
import subprocess
import unittest

import appliance
from appliance import ENTRY_CGI, TIMEOUT, Reply, call, wait_until
from file_case import environment, run, upload, Answer, download, FileTest, METHODS


class Rights(FileTest):
    def test_every_method_needs_a_login(self):
        for method, parameter in METHODS.items():
            reply = call("TALO.File", method, 1, **{parameter: "/data"})
            self.refused_as(reply, 119, "unauth")
        self.assertEqual(upload("none", {"path": "/data"}, "a", b"x").code, 105)
        self.assertEqual(self.names(), [])

    def test_a_reader_changes_nothing(self):
        self.write("file")
        other = self.log_in("other")
        self.assertEqual(self.file("stat", other, path="/data/file").data["writable"], False)
        self.refused(self.file("mkdir", other, path="/data/new"), 402, "/data/new")
        self.refused(self.file("remove", other, path="/data/file"), 402, "/data/file")
        self.refused(self.file("rename", other, path="/data/file", to="/data/x"), 402,
                     "/data/file")
        self.refused(upload(other, {"path": "/data"}, "new", b"x"), 402, "/data/new")
        self.assertEqual(self.names(), ["file"])

    def test_a_share_that_is_not_the_callers_looks_like_none(self):
        for share in ("closed", "none"):
            path = f"/{share}/file"
            self.refused(self.file("list", folder=f"/{share}"), 401, f"/{share}")
            for method in ("stat", "mkdir", "remove"):
                self.refused(self.file(method, path=path), 401, path)
            self.refused(Reply(download(self.sid, path=path)), 401, path)
            self.refused(upload(self.sid, {"path": f"/{share}"}, "file", b"x"), 401, path)
            self.write("file")
            self.refused(self.file("rename", path="/data/file", to=path), 401, path)
        self.assertEqual((self.top / "closed/file").read_text(), "closed")

    def test_an_administrator_may_everything(self):
        boss = self.log_in("boss")
        self.assertEqual(self.file("stat", boss, path="/closed/file").data["size"], 6)
        self.assertEqual(self.file("remove", boss, path="/closed/file").code, 0)

    def test_the_shares_are_listed_that_the_caller_may_read(self):
        def shares(name):
            data = self.file("list", self.log_in(name), folder="/").data
            return [(entry["name"], entry["writable"]) for entry in data["entries"]]
        self.assertEqual(shares("normal"), [("data", True), ("lost", False)])
        self.assertEqual(shares("other"), [("data", False), ("lost", False)])
        self.assertEqual(shares("boss"), [("closed", True), ("data", True), ("lost", True)])

    def test_a_share_without_its_folder_is_empty_of_everything(self):
        self.refused(self.file("list", folder="/lost"), 401, "/lost")


class List(FileTest):
    def setUp(self):
        super().setUp()
        for name, size, mtime in (("b", 1, 300), ("a", 3, 100), ("C", 2, 200)):
            os.utime(self.write(name, b"x" * size), (mtime, mtime))
        (self.folder / "folder").mkdir()
        os.utime(self.folder / "folder", (400, 400))

    def test_tells_about_each_entry(self):
        data = self.file("list", folder="/data").data
        self.assertEqual(data["entries"][0], {"name": "C", "type": "file", "size": 2, "mtime": 200})
        self.assertEqual(data["entries"][3],
                         {"name": "folder", "type": "folder", "size": 0, "mtime": 400})
        self.assertEqual((data["total"], data["offset"], data["writable"], data["undecodable"]),
                         (4, 0, True, 0))

    def test_sorts(self):
        for sort, names in (("name", "C a b folder"), ("size", "folder b C a"),
                            ("mtime", "a C b folder"), ("type", "folder C a b")):
            self.assertEqual(self.listed(sort=sort), names.split())
            self.assertEqual(self.listed(sort=sort, direction="desc"), names.split()[::-1])

    def test_pages(self):
        for sort in ("name", "mtime"):
            whole = self.listed(sort=sort)
            for offset in range(6):
                self.assertEqual(self.listed(sort=sort, offset=offset, limit=2),
                                 whole[offset:offset + 2])
        self.assertEqual(self.file("list", folder="/data", offset=3).data["total"], 4)

    def test_names_the_parameter_that_is_wrong(self):
        for name, values in (("sort", ("colour", 1)), ("direction", ("up", 1)),
                             ("offset", (-1, "x", 1.5, 1000001, [])),
                             ("limit", (0, -1, 10001, "all")), ("folder", (1, "", "data", [])),):
            for value in values:
                self.refused(self.file("list", **{"folder": "/data", name: value}), 400, name)
        self.refused(self.file("list"), 400, "folder")

    def test_counts_names_that_are_no_text(self):
        pathlib.Path(os.fsdecode(os.fsencode(self.folder) + b"/\xff\xfe")).write_text("x")
        data = self.file("list", folder="/data").data
        self.assertEqual((data["undecodable"], data["total"], len(data["entries"])), (1, 4, 4))

    def test_carries_any_name_that_is_text(self):
        names = ["ä", "a\nb", "<b>", '"', "\u2028", "😀"]
        for name in names:
            self.write(name)
        self.assertLessEqual(set(names), set(self.listed()))

    def test_hides_files_that_are_not_whole(self):
        self.write(".talo-new-0123456789abcdef")
        self.assertEqual(self.listed(), ["C", "a", "b", "folder"])

    def test_shows_links(self):
        (self.folder / "in").symlink_to("a")
        (self.folder / "out").symlink_to(self.top / "secret")
        data = self.file("list", folder="/data").data
        links = {entry["name"]: entry for entry in data["entries"] if "link" in entry}
        self.assertEqual((links["in"]["type"], links["in"]["size"]), ("file", 3))
        self.assertEqual((links["out"]["type"], links["out"]["size"]), ("link", 0))

    def test_is_of_folders_only(self):
        self.refused(self.file("list", folder="/data/a"), 404, "/data/a")
        self.refused(self.file("list", folder="/data/none"), 401, "/data/none")

    def test_does_not_load_what_it_does_not_need(self):
        query = appliance.form({"api": "TALO.File", "version": 1, "method": "list",
                                "folder": "/data"})
        result = subprocess.run(
            [ENTRY_CGI], capture_output=True, timeout=TIMEOUT, check=True,
            env=environment(self.sid, {"REQUEST_METHOD": "GET", "QUERY_STRING": query,
                                       "LD_DEBUG": "files"}))
        self.assertIn(b"TALO.File.so", result.stderr)
        for library in (b"libarchive", b"libcrypto", b"libsqlite3"):
            self.assertNotIn(library, result.stderr)


class Paths(FileTest):
    HOSTILE = ("", "data", "//data", "/data//a", "/data/", "/data/..", "/data/../secret",
               "/data/./file", "/..", "/data/a\0b", "/data/" + "x" * 256,
               "/data" + "/x" * 2046, "/data/.talo-new-0123456789abcdef", 1, None, [], {})

    def test_are_refused_by_every_method(self):
        self.write("file")
        for path in self.HOSTILE:
            for method, parameter in METHODS.items():
                variables = {parameter: path, **({"to": "/data/x"} if method == "rename" else {})}
                self.refused(self.file(method, **variables), 400, parameter)
            self.refused(self.file("rename", path="/data/file", to=path), 400, "to")
        self.assertEqual(self.names(), ["file"])

    def test_leave_the_share_by_no_link(self):
        (self.folder / "up").symlink_to("..")
        (self.folder / "root").symlink_to("/")
        (self.folder / "secret").symlink_to(self.top / "secret")
        self.refused(self.file("list", folder="/data/up"), 406, "/data/up")
        self.refused(Reply(download(self.sid, path="/data/secret")), 406, "/data/secret")
        self.refused(Reply(download(self.sid, path="/data/up/secret")), 406, "/data/up/secret")
        for method in ("stat", "mkdir", "remove"):
            self.refused(self.file(method, path="/data/up/secret"), 406, "/data/up/secret")
        self.refused(upload(self.sid, {"path": "/data/up", "overwrite": "true"}, "secret", b"x"),
                     406, "/data/up/secret")
        self.assertEqual((self.top / "secret").read_text(), "SECRET")

    def test_may_go_through_a_link_that_stays(self):
        self.write("folder/file")
        (self.folder / "link").symlink_to("folder")
        self.assertEqual(Answer(download(self.sid, path="/data/link/file")).body, b"content")


class Changes(FileTest):
    def test_mkdir_makes_one_folder(self):
        data = self.file("mkdir", path="/data/new").data
        self.assertEqual((data["name"], data["type"], data["path"], data["writable"]),
                         ("new", "folder", "/data/new", True))
        self.refused(self.file("mkdir", path="/data/new"), 403, "/data/new")
        self.refused(self.file("mkdir", path="/data/none/new"), 401, "/data/none/new")
        self.refused(self.file("mkdir", path="/data"), 400, "path")

    def test_rename_moves_and_replaces_when_asked(self):
        self.write("a", b"A")
        self.write("b", b"B")
        self.refused(self.file("rename", path="/data/a", to="/data/b"), 403, "/data/b")
        self.refused(self.file("rename", path="/data/a", to="/data/b", overwrite="x"), 400,
                     "overwrite")
        data = self.file("rename", path="/data/a", to="/data/b", overwrite=True).data
        self.assertEqual(data["path"], "/data/b")
        self.assertEqual((self.names(), self.write("c").name), (["b"], "c"))
        self.assertEqual((self.folder / "b").read_bytes(), b"A")

    def test_rename_says_why_not(self):
        self.write("folder/inner/file")
        self.write("file")
        self.refused(self.file("rename", path="/data/none", to="/data/x"), 401, "/data/none")
        self.refused(self.file("rename", path="/data/folder", to="/data/folder/inner/x"), 410,
                     "/data/folder")
        (self.folder / "empty").mkdir()
        self.refused(self.file("rename", path="/data/empty", to="/data/folder", overwrite=True),
                     407, "/data/folder")
        self.refused(self.file("rename", path="/data/file", to="/data"), 400, "to")

    def test_stat_tells_about_a_share(self):
        self.assertEqual(self.file("stat", path="/data").data["type"], "share")
        self.refused(self.file("stat", path="/"), 400, "path")
        self.refused(self.file("stat", path="/data/none"), 401, "/data/none")


class Remove(FileTest):
    def test_takes_a_file_away_at_once(self):
        self.write("file")
        self.assertEqual(self.file("remove", path="/data/file").data,
                         {"state": "done", "removed": 1})
        self.assertEqual(self.names(), [])
        self.refused(self.file("remove", path="/data/file"), 401, "/data/file")

    def test_takes_an_empty_folder_and_a_link_away_at_once(self):
        (self.folder / "empty").mkdir()
        (self.folder / "link").symlink_to(self.top / "closed")
        for name in ("empty", "link"):
            self.assertEqual(self.file("remove", path=f"/data/{name}").data["state"], "done")
        self.assertTrue((self.top / "closed/file").exists())

    def test_takes_a_tree_away_in_the_background(self):
        for number in range(50):
            self.write(f"tree/{number % 5}/{number}")
        (self.folder / "tree/out").symlink_to(self.top / "closed")
        task_id = self.file("remove", path="/data/tree").data["task_id"]
        self.assertRegex(task_id, r"\Anormal/remove-")

        def status():
            return call("TALO.Task", "status", 1, self.sid, task_id=task_id).data

        self.assertTrue(wait_until(lambda: status()["finish"]))
        self.assertEqual(status()["data"], {"state": "done", "removed": 57})
        self.assertEqual(self.names(), [])
        self.assertTrue((self.top / "closed/file").exists())

    def test_spares_the_share(self):
        self.write("file")
        self.refused(self.file("remove", path="/data"), 400, "path")
        self.assertEqual(self.names(), ["file"])


class Upload(FileTest):
    def test_puts_a_file_into_a_folder(self):
        (self.folder / "folder").mkdir()
        reply = upload(self.sid, {"path": "/data/folder", "mtime": "1000000000"}, "ä b.txt",
                       b"\0\r\n--content")
        self.assertEqual(reply.data, {
            "name": "ä b.txt", "type": "file", "size": 12, "mtime": 1000000000,
            "path": "/data/folder/ä b.txt", "writable": True})
        path = self.folder / "folder/ä b.txt"
        self.assertEqual(path.read_bytes(), b"\0\r\n--content")
        self.assertEqual(path.stat().st_mode & 0o777, 0o644)
        self.assertEqual(len(list((self.folder / "folder").iterdir())), 1)

    def test_puts_it_into_the_share_itself(self):
        self.assertEqual(upload(self.sid, {"path": "/data"}, "a", b"x").code, 0)
        self.assertEqual(self.names(), ["a"])

    def test_replaces_only_when_asked(self):
        self.write("a", b"old")
        self.refused(upload(self.sid, {"path": "/data"}, "a", b"new"), 403, "/data/a")
        self.refused(upload(self.sid, {"path": "/data", "overwrite": "false"}, "a", b"new"), 403,
                     "/data/a")
        self.assertEqual((self.folder / "a").read_bytes(), b"old")
        self.assertEqual(
            upload(self.sid, {"path": "/data", "overwrite": "true"}, "a", b"new").code, 0)
        self.assertEqual((self.folder / "a").read_bytes(), b"new")

    def test_replaces_no_folder(self):
        (self.folder / "a").mkdir()
        self.refused(upload(self.sid, {"path": "/data", "overwrite": "true"}, "a", b"x"), 405,
                     "/data/a")

    def test_names_the_parameter_that_is_wrong(self):
        for name, value in (("overwrite", "maybe"), ("mtime", "-1"), ("mtime", "x"),
                            ("mtime", "253402300800"), ("path", "/"), ("path", "data"),
                            ("path", "/data/.."), ("path", "")):
            self.refused(upload(self.sid, {"path": "/data", name: value}, "a", b"x"), 400, name)
        self.assertEqual(self.names(), [])

    def test_takes_nothing_but_what_was_uploaded(self):
        victim = self.top / "secret"
        self.refused(upload(self.sid, {"path": "/data", "file": str(victim),
                                       "file_filename": "stolen"}), 414)
        self.refused(upload(self.sid, {"path": "/data"}), 414)
        reply = self.file("upload", path="/data", file=str(victim), file_filename="stolen")
        self.assertNotEqual(reply.code, 0)
        self.assertEqual((self.names(), victim.read_text()), ([], "SECRET"))

    def test_puts_nothing_anywhere_else_whatever_the_name(self):
        for name in ("../secret", "/etc/passwd", "..", ".", "a/../../secret", "..\\\\secret"):
            reply = upload(self.sid, {"path": "/data", "overwrite": "true"}, name, b"x")
            self.assertIn(reply.code, (0, 108, 400, 414), name)
        self.assertLessEqual(set(self.names()), {"secret", "passwd"})
        self.assertEqual((self.top / "secret").read_text(), "SECRET")
        self.assertEqual(sorted(path.name for path in self.top.iterdir()),
                         ["closed", "data", "secret"])

    def test_needs_the_folder(self):
        self.write("file")
        self.refused(upload(self.sid, {"path": "/data/none"}, "a", b"x"), 401, "/data/none/a")
        self.refused(upload(self.sid, {"path": "/data/file"}, "a", b"x"), 404, "/data/file/a")


if __name__ == "__main__":
    unittest.main()
