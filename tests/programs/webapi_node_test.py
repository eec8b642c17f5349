"""webapi-account's commands about other appliances."""

import http.server
import json
import os
import pathlib
import pwd
import socket
import ssl
import subprocess
import sys
import tempfile
import termios
import threading
import unittest
import urllib.parse

from account_program import MODULES, NODES, SUCCESS, ProgramTest, Terminal

URL = "https://nas2.local:5001/webapi/entry.cgi"
PIN = "sha256//47DEQpj8HBSa+/TImW+5JCeuQeRkm5NMpJWZG3hSuFU="
REACHED = ("node", "add", "2", "--url", URL, "--self", "1")
ACCEPTED = ("node", "add", "2", "--accept")


class NodeProgramTest(ProgramTest):
    def nodes(self):
        return {entry["id"]: entry for entry in json.loads(self.done("node", "list", "--json"))}

    def stored(self):
        return [json.loads(line) for line in NODES.read_text().splitlines()]


class NodeCommands(NodeProgramTest):
    def test_help_names_them(self):
        text = self.done("--help")
        for word in ("node add ID", "node list", "node remove ID", "node test ID", "--url", "--self",
                     "--authority", "--pin", "--accept", "--class", "--user"):
            self.assertIn(word, text)
        self.assertFalse(NODES.exists())

    def test_wrong_usage_shows_the_usage(self):
        for words in (("node",), ("node", "fly"), ("node", "fly", "2"), ("node", "add"),
                      ("node", "add", "2"), ("node", "add", "0", "--accept"),
                      ("node", "add", "-1", "--accept"), ("node", "add", "two", "--accept"),
                      ("node", "add", "2.0", "--accept"), ("node", "add", "", "--accept"),
                      ("node", "add", "9223372036854775808", "--accept"),
                      ("node", "add", " 2", "--accept"), ("node", "add", "2", "3", "--accept"),
                      ("node", "add", "2", "--url", URL), ("node", "add", "2", "--self", "1"),
                      ("node", "add", "2", "--url", "", "--self", "1"),
                      ("node", "add", "2", "--url", URL, "--self", "0"),
                      ("node", "add", "2", "--url", URL, "--self", "x"),
                      ("node", "add", "2", "--url", URL, "--self"),
                      ("node", "add", "2", "--accept", "--pin", PIN),
                      ("node", "add", "2", "--accept", "--authority", "/a"),
                      ("node", "add", "2", "--pin", PIN),
                      ("node", "add", "2", "--class", "normal.local"),
                      (*REACHED, "--class", "normal.local"), (*ACCEPTED, "--class", ""),
                      (*ACCEPTED, "--class"), (*REACHED, "--authority", ""),
                      (*REACHED, "--pin", ""), (*REACHED, "--secret", "x"),
                      (*ACCEPTED, "--user", "anna"), (*ACCEPTED, "--json"),
                      (*ACCEPTED, "--generate"), ("node", "list", "2"),
                      ("node", "list", "--accept"), ("node", "remove"), ("node", "remove", "x"),
                      ("node", "remove", "2", "3"), ("node", "remove", "2", "--accept"),
                      ("node", "test"), ("node", "test", "0"), ("node", "test", "2", "anna"),
                      ("node", "test", "2", "--user", ""), ("node", "test", "2", "--json"),
                      ("add", "anna", "--accept"), ("list", "--url", URL)):
            with self.subTest(words):
                self.misused(*words)
        self.assertFalse(NODES.exists())

    def test_wrong_usage_says_what_is_wrong(self):
        for words, text in ((("node", "add"), "the appliance's number is missing"),
                            (("node", "remove", "x"), "a number from 1 up"),
                            (("node", "add", "2"), "--url or --accept is missing"),
                            (("node", "add", "2", "--url", URL), "--url and --self go together"),
                            (("node", "fly"), 'unknown command "node fly"')):
            self.assertIn(text, self.misused(*words).splitlines()[0])


class NodeAdd(NodeProgramTest):
    def test_says_how_an_appliance_is_reached(self):
        self.assertEqual("", self.done(*REACHED, typed="shown\nnot this\n"))
        self.assertEqual([{"id": 2, "url": URL, "self": 1, "secret": "shown"}], self.stored())
        self.assertEqual(0o600, NODES.stat().st_mode & 0o777)

    def test_takes_authority_and_pin(self):
        self.done(*REACHED, "--authority", "/etc/talo/nas2.pem", "--pin", PIN, typed="shown")
        self.assertEqual([{"id": 2, "url": URL, "self": 1, "secret": "shown", "pin": PIN,
                           "authority": "/etc/talo/nas2.pem"}], self.stored())

    def test_lets_an_appliance_act_for_local_users_who_are_no_administrators(self):
        secret = self.done(*ACCEPTED)
        self.assertRegex(secret, r"^[A-Za-z0-9_-]{43}\n$")
        stored, = self.stored()
        self.assertEqual(["normal.local"], stored["accepts"]["classes"])
        self.assertRegex(stored["accepts"]["secret_hash"], r"^[0-9a-f]{64}$")
        self.assertNotIn(secret.strip(), NODES.read_text())

    def test_lets_it_act_for_the_classes_that_are_named(self):
        self.done(*ACCEPTED, "--class", "normal.ldap", "--class", "admin.local")
        self.assertEqual(["normal.ldap", "admin.local"], self.nodes()[2]["classes"])
        self.done(*ACCEPTED, "--class", "normal.domain")
        self.assertEqual(["normal.domain"], self.nodes()[2]["classes"])

    def test_makes_another_secret_each_time(self):
        hashes = []
        secrets = set()
        for _ in range(3):
            secrets.add(self.done(*ACCEPTED))
            hashes.append(self.stored()[0]["accepts"]["secret_hash"])
        self.assertEqual((3, 3), (len(secrets), len(set(hashes))))

    def test_keeps_the_other_half(self):
        self.done(*REACHED, "--pin", PIN, typed="shown\n")
        self.done(*ACCEPTED, "--class", "normal.ldap")
        self.done("node", "add", "2", "--url", "https://[::1]/", "--self", "5", typed="other\n")
        self.assertEqual({"id": 2, "url": "https://[::1]/", "self": 5, "pin": "", "authority": "",
                          "accepted": True, "classes": ["normal.ldap"]}, self.nodes()[2])
        self.done(*ACCEPTED)
        self.assertEqual("other", self.stored()[0]["secret"])

    def test_may_say_both_at_once(self):
        secret = self.done(*REACHED, "--accept", typed="shown\n")
        self.assertRegex(secret, r"^[A-Za-z0-9_-]{43}\n$")
        self.assertEqual("shown", self.stored()[0]["secret"])
        self.assertTrue(self.nodes()[2]["accepted"])

    def test_refuses_what_cannot_be(self):
        self.done(*REACHED, typed="shown\n")
        for url in ("http://nas2.local/", "nas2.local", "https://anna@nas2.local/",
                    "https://nas2.local", "https://nas2.local/#top", "https://nas2.local/\n"):
            text = self.refused("node", "add", "2", "--url", url, "--self", "1", typed="shown\n")
            self.assertIn("https://HOST[:PORT]/PATH", text)
        for secret in ("", "\n", "two words\n", "x" * 257 + "\n", "x" * 5000 + "\n", "\u00e4\n"):
            self.assertIn("secret", self.refused(*REACHED, typed=secret))
        for pin in ("x", "sha256//x", PIN[:-1], PIN + ";" + PIN):
            self.assertIn("pin", self.refused(*REACHED, "--pin", pin, typed="shown\n"))
        self.assertIn("authority", self.refused(*REACHED, "--authority", "nas2.pem", typed="s\n"))
        for name in ("everybody", "normal", "Normal.local", "normal.local,admin.local"):
            self.assertIn("class", self.refused(*ACCEPTED, "--class", name))
        self.refused(*ACCEPTED, "--class", "normal.ldap", "--class", "normal.ldap")

    def test_shows_no_secret_that_does_not_count(self):
        NODES.parent.mkdir(parents=True)
        NODES.write_text("# ours\n")
        NODES.chmod(0o644)
        self.assertIn("cannot use", self.refused(*ACCEPTED))

    def test_needs_the_module_that_hashes(self):
        (MODULES / "talo-digest.so").unlink()
        self.assertIn("no secret can be made", self.refused(*ACCEPTED))
        self.done(*REACHED, typed="shown\n")

    def test_keeps_comments_and_broken_lines(self):
        NODES.parent.mkdir(parents=True)
        other = b"# ours\n\nnot json \xff\0 at all\r\n"
        NODES.write_bytes(other)
        NODES.chmod(0o600)
        self.done(*ACCEPTED)
        self.assertTrue(NODES.read_bytes().startswith(other))
        self.assertEqual([2], list(self.nodes()))

    def test_takes_the_greatest_number(self):
        self.done("node", "add", "9223372036854775807", "--accept")
        self.assertEqual([9223372036854775807], list(self.nodes()))

    def test_terminal_asks_once_and_shows_nothing(self):
        terminal = Terminal(*REACHED)
        terminal.wait_for(b"Secret: ")
        self.assertFalse(termios.tcgetattr(terminal.screen)[3] & termios.ECHO)
        terminal.type(b"sesame\n")
        shown, status = terminal.end()
        self.assertEqual(SUCCESS, status)
        self.assertNotIn(b"sesame", shown)
        self.assertEqual("sesame", self.stored()[0]["secret"])


class NodeListAndRemove(NodeProgramTest):
    def test_list_is_a_table_with_a_heading(self):
        self.assertRegex(self.done("node", "list"),
                         r"^ID +ACTS HERE FOR +NUMBER THERE +URL +CHECKED BY\n$")
        self.done("node", "add", "10", "--accept", "--class", "normal.ldap", "--class",
                  "admin.ldap")
        self.done(*REACHED, typed="shown\n")
        self.done("node", "add", "3", "--url", URL, "--self", "4", "--pin", PIN, "--authority",
                  "/a.pem", typed="shown\n")
        _, first, second, third = self.done("node", "list").splitlines()
        self.assertEqual(["2", "-", "1", URL, "system"], first.split())
        self.assertEqual(["3", "-", "4", URL, "/a.pem", PIN], second.split())
        self.assertEqual(["10", "normal.ldap,admin.ldap", "-", "-", "-"], third.split())

    def test_list_is_json_for_programs(self):
        self.assertEqual("[]\n", self.done("node", "list", "--json"))
        self.done(*REACHED, "--pin", PIN, typed="shown\n")
        self.done("node", "add", "1", "--accept")
        self.assertEqual(
            [{"id": 1, "url": "", "authority": "", "pin": "", "self": 0, "accepted": True,
              "classes": ["normal.local"]},
             {"id": 2, "url": URL, "authority": "", "pin": PIN, "self": 1, "accepted": False,
              "classes": []}], json.loads(self.done("node", "list", "--json")))

    def test_list_never_shows_a_secret(self):
        made = self.done(*REACHED, "--accept", typed="sesame\n").strip()
        stored = self.stored()[0]["accepts"]["secret_hash"]
        for words in (("node", "list"), ("node", "list", "--json")):
            shown = self.done(*words)
            for secret in (made, stored, "sesame"):
                self.assertNotIn(secret, shown)

    def test_remove_forgets_an_appliance(self):
        self.done(*REACHED, "--accept", typed="shown\n")
        self.done("node", "add", "3", "--accept")
        self.assertEqual("", self.done("node", "remove", "2"))
        self.assertEqual([3], list(self.nodes()))
        self.assertIn("there is no appliance 2", self.refused("node", "remove", "2"))

    def test_a_file_that_others_may_read_is_refused(self):
        self.done(*ACCEPTED)
        NODES.chmod(0o640)
        for words in (("node", "list"), ("node", "remove", "2"), ("node", "test", "2")):
            self.refused(*words)


class Answer(http.server.BaseHTTPRequestHandler):
    """An appliance that knows one user."""

    def do_POST(self):
        size = int(self.headers["Content-Length"])
        asked = urllib.parse.parse_qs(self.rfile.read(size).decode())
        self.server.asked.append({name: values[0] for name, values in asked.items()})
        known = asked["user"][0] in ('"anna"', json.dumps(pwd.getpwuid(os.geteuid()).pw_name))
        body = {"success": True, "data": {"sid": "s" + "A" * 43}} if known else \
            {"success": False, "error": {"code": 500}}
        content = json.dumps(body).encode()
        self.send_response(200)
        self.send_header("Content-Length", str(len(content)))
        self.end_headers()
        self.wfile.write(content)

    def log_message(self, *_):
        pass


class NodeTest(NodeProgramTest):
    """node test, with an appliance on a port of this machine."""

    @classmethod
    def setUpClass(cls):
        cls.folder = tempfile.TemporaryDirectory()
        cls.certificate = pathlib.Path(cls.folder.name, "certificate.pem")
        key = pathlib.Path(cls.folder.name, "key.pem")
        subprocess.run(
            ["openssl", "req", "-x509", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:P-256",
             "-nodes", "-days", "2", "-subj", "/CN=localhost", "-addext",
             "subjectAltName=IP:127.0.0.1", "-keyout", key, "-out", cls.certificate],
            check=True, capture_output=True)
        context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
        context.load_cert_chain(cls.certificate, key)
        cls.server = http.server.ThreadingHTTPServer(("127.0.0.1", 0), Answer)
        cls.server.socket = context.wrap_socket(cls.server.socket, server_side=True)
        threading.Thread(target=cls.server.serve_forever, daemon=True).start()

    @classmethod
    def tearDownClass(cls):
        cls.server.shutdown()
        cls.server.server_close()
        cls.folder.cleanup()

    def setUp(self):
        super().setUp()
        self.server.asked = []

    def add(self, *more, port=None):
        port = self.server.server_address[1] if port is None else port
        self.done("node", "add", "2", "--url", f"https://127.0.0.1:{port}/entry.cgi", "--self", "7",
                  *more, typed="sesame\n")

    def test_says_that_the_appliance_lets_this_one_act(self):
        self.add("--authority", str(self.certificate))
        self.assertIn('"anna"', self.done("node", "test", "2", "--user", "anna"))
        asked, = self.server.asked
        self.assertEqual(("TALO.Relay", "open", "7", '"sesame"', '"anna"'),
                         tuple(asked[name] for name in ("api", "method", "node", "secret",
                                                        "user")))

    def test_asks_for_the_user_of_the_process_unless_told(self):
        self.add("--authority", str(self.certificate))
        self.assertIn(pwd.getpwuid(os.geteuid()).pw_name, self.done("node", "test", "2"))

    def test_fails_when_the_appliance_refuses(self):
        self.add("--authority", str(self.certificate))
        text = self.refused("node", "test", "2", "--user", "bob")
        self.assertIn("does not let this one act", text)
        self.assertIn("(error 11)", text)

    def test_fails_when_the_certificate_is_not_trusted(self):
        self.add()
        self.assertIn("(error 6)", self.refused("node", "test", "2", "--user", "anna"))
        self.add("--authority", str(self.certificate), "--pin", PIN)
        self.assertIn("(error 6)", self.refused("node", "test", "2", "--user", "anna"))
        self.assertEqual([], self.server.asked)

    def test_fails_when_nobody_is_there(self):
        with socket.create_server(("127.0.0.1", 0)) as closed:
            port = closed.getsockname()[1]
        self.add(port=port)
        self.assertIn("(error 5)", self.refused("node", "test", "2", "--user", "anna"))

    def test_fails_for_an_appliance_that_is_not_called(self):
        self.assertIn("(error 1)", self.refused("node", "test", "2"))
        self.done(*ACCEPTED)
        self.assertIn("(error 1)", self.refused("node", "test", "2"))

    def test_fails_without_the_module(self):
        self.add("--authority", str(self.certificate))
        (MODULES / "talo-relay.so").unlink()
        self.assertIn("(error 2)", self.refused("node", "test", "2", "--user", "anna"))


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1])
