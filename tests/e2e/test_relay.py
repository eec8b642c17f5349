"""Calls that another appliance answers, over TLS."""

import json
import os
from concurrent.futures import ThreadPoolExecutor

from appliance import PASSWORD
from client import form
from multipart import Content, Form, Sender, file_digest, upload
from relay_case import RelayCase, RelayError, start_appliances
from webserver import wait_until

MEBIBYTE = 1 << 20


def setUpModule():
    start_appliances()


class Tls(RelayCase):
    def test_is_known_to_the_entry(self):
        reply = self.client.call("TALO.Session", "open", account="bob",
                                 passwd=json.dumps(PASSWORD))
        self.assertIn("; Secure", reply.header("Set-Cookie"))
        reply = self.client.call("Test.Cookie", "redirect")
        self.assertTrue(reply.header("Location").startswith("https://"), reply)


class Calls(RelayCase):
    def setUp(self):
        super().setUp()
        self.lets_call()
        self.ann = self.log_in("ann")

    def test_run_on_the_other_appliance(self):
        self.assertEqual(self.second.sessions(), [])
        data = self.data(self.call(self.ann, api="TALO.Session", method="info"))
        self.assertEqual((data["account"], data["is_admin"]), ("ann", True))
        self.assertEqual(len(self.second.sessions()), 1)
        info = self.data(self.call(self.ann, api="TALO.System", method="info", version=2))
        self.assertEqual(info["hostname"], os.uname().nodename)

    def test_are_answered_with_the_others_body_behind_this_ones_header(self):
        direct = self.second.client().get("api=TALO.System&version=1&method=ping&text=hi")
        relayed = self.call(self.ann, api="TALO.System", method="ping", text="hi")
        self.assertEqual(relayed.body, direct.body)
        self.assertEqual(relayed.header("Cache-Control"), direct.header("Cache-Control"))
        self.assertEqual(relayed.header("Content-type"), 'text/html; charset="UTF-8"')
        sid = self.second.log_in("ann")
        echo = self.second.client().call("Test.Relay", "echo", _sid=sid)
        self.assertEqual(echo.header("X-Echo"), "here")
        relayed = self.call(self.ann)
        self.assertIsNone(relayed.header("X-Echo"))
        self.assertIsNone(relayed.header("Set-Cookie"))

    def test_carry_every_parameter_but_those_of_the_relay(self):
        parameters = {
            "number": 17, "text of digits": "17", "largest": (1 << 63) - 1, "less": -5,
            "fraction": 0.1, "true": True, "text of true": "true", "null": None, "empty": "",
            "list": [1, "1", [], {}], "object": {"a": {"b": "c"}}, "text of a list": "[1]",
            "a&b=c%41 +": "a&b=c%41 +", "ü€🐧": "ü€🐧", "line\r\nend": "line\r\nend",
            "quote\"": "'\"\\", "user": "bob", "id": "x", "secret": "y", "node": 3}
        sid = self.second.log_in("ann")
        document = {"api": "Test.Relay", "version": 1, "method": "echo", "_sid": sid}
        direct = self.data(self.second.client().post(json.dumps({**document, **parameters})))
        relayed = self.echo(self.ann, relay_timeout=20, **parameters)
        direct["params"].pop("_sid", None)
        for name, value in parameters.items():
            with self.subTest(name):
                self.assertEqual(relayed["params"][name], value)
                self.assertIs(type(relayed["params"][name]), type(value))
        self.assertEqual(relayed["params"], direct["params"])

    def test_carry_the_callers_name_and_language(self):
        record = self.first.session_file(self.ann)
        record.write_text(json.dumps({**json.loads(record.read_text()), "language": "ger"}))
        data = self.echo(self.ann)
        self.assertEqual((data["user"], data["admin"], data["language"]), ("ann", True, "ger"))
        self.assertEqual((data["application"], data["hops"]), ("relay", "1"))
        data = self.echo(self.log_in("bob"))
        self.assertEqual((data["user"], data["admin"]), ("bob", False))
        self.assertNotEqual(data["language"], "ger")

    def test_carry_the_version(self):
        for version in (1, 2):
            self.assertEqual(self.echo(self.ann, version=version)["version"], version)

    def test_by_form_and_by_query_are_relayed_alike(self):
        call = {"api": "Test.Relay", "version": 1, "method": "echo", "relay_nd": 2, "a": "b"}
        cookie = {"Cookie": f"id={self.ann}"}
        for reply in (self.client.get(form(**call), headers=cookie),
                      self.client.post(form(**call), headers=cookie),
                      self.client.post("a=b", form(**call), headers=cookie)):
            self.assertEqual(self.data(reply)["params"]["a"], "b")

    def test_errors_of_the_other_come_through(self):
        sid = self.second.log_in("ann")
        call = {"api": "TALO.File", "version": 1, "method": "list", "folder": "/no-such-share"}
        direct = self.second.client().post(json.dumps({**call, "_sid": sid}))
        self.assertFalse(direct.document()["success"])
        relayed = self.call(self.ann, **call)
        self.assertEqual((relayed.status, relayed.body), (200, direct.body))

    def test_of_large_documents_are_whole(self):
        text = "ab" * (2 * MEBIBYTE)
        self.assertEqual(self.echo(self.ann, text=text)["params"]["text"], text)

    def test_take_time_where_no_limit_was_set(self):
        limits = ({}, {"relay_timeout": 0}, {"relay_timeout": -1}, {"relay_timeout": 20})
        with ThreadPoolExecutor(max_workers=len(limits)) as pool:
            replies = pool.map(lambda limit: self.call(
                self.ann, method="sleep", version=2, seconds=1, **limit), limits)
            self.assertEqual([self.data(reply) for reply in replies], ["slept"] * len(limits))

    def test_that_are_not_answered_in_time_are_109(self):
        self.relay_fails(RelayError.TIMED_OUT, lambda: self.call(
            self.ann, method="sleep", version=2, seconds=3, relay_timeout=1))

    def test_of_an_appliance_that_nobody_knows_are_109(self):
        for number in (3, 1, (1 << 63) - 1):
            with self.subTest(number):
                mark = self.first.log.mark()
                self.fails(self.call(self.ann, relay_nd=number), 109)
                self.assertTrue(wait_until(lambda: self.first.log.since(mark), 5))
        for number in (0, -2):
            with self.subTest(number):
                self.fails(self.call(self.ann, relay_nd=number), 109)

    def test_of_no_appliance_at_all_are_101_and_run_nowhere(self):
        for number in ("x", "", "2x", 2.5, [2], {}, True, "9223372036854775808"):
            with self.subTest(number):
                self.fails(self.call(self.ann, relay_nd=number), 101)

    def test_do_not_follow_a_proxy_of_the_client(self):
        headers = {"Proxy": "http://127.0.0.1:1", "Https-Proxy": "http://127.0.0.1:1"}
        self.assertEqual(self.data(self.call(self.ann, headers=headers))["user"], "ann")

    def test_at_once_are_all_answered(self):
        with ThreadPoolExecutor(max_workers=8) as pool:
            texts = list(pool.map(
                lambda number: self.echo(self.ann, number=number)["params"]["number"], range(16)))
        self.assertEqual(texts, list(range(16)))


class Compounds(RelayCase):
    def setUp(self):
        super().setUp()
        self.lets_call()
        self.ann = self.log_in("ann")

    def compound(self, calls, **parameters):
        return self.data(self.call(self.ann, api="TALO.Entry.Request", method="request",
                                   compound=calls, **parameters))["result"]

    def test_an_element_cannot_be_relayed(self):
        call = {"api": "Test.Relay", "version": 1, "method": "echo"}
        one, two = self.compound([{**call, "relay_nd": 2}, call], relay_nd=None)
        self.assertEqual((one["success"], one["error"]), (False, {"code": 109}))
        self.assertEqual(two["data"]["application"], "")
        self.assertEqual(self.second.sessions(), [])

    def test_can_be_relayed_as_a_whole(self):
        call = {"api": "Test.Relay", "version": 1, "method": "echo"}
        one, two = self.compound([call, {**call, "relay_nd": 1}])
        self.assertEqual(one["data"]["application"], "relay")
        self.assertEqual(two["error"], {"code": 109})


class Uploads(RelayCase):
    def setUp(self):
        super().setUp()
        self.lets_call()
        self.ann = self.log_in("ann")
        self.kept = self.folder / "kept"
        self.kept.mkdir()

    def query(self, **parameters):
        return form(api="Test.Relay", version=2, method="take", relay_nd=2, _sid=self.ann,
                    **parameters)

    def arrives(self, content, **parameters):
        body = (Form().field("a", "ä=&+%41").file("file", "a.bin", content).field("b", "")
                .field("keep", self.kept))
        data = self.data(upload(self.client, self.query(**parameters), body))
        self.assertEqual(file_digest(self.kept / "file"), content.sha256())
        self.assertEqual(data["params"]["file_filename"], "a.bin")
        self.assertEqual((data["params"]["a"], data["params"]["b"]), ("ä=&+%41", ""))
        self.assertEqual((data["user"], data["application"]), ("ann", "relay"))
        return data

    def test_arrive_whole(self):
        for size in (0, 1, 65535, 65536, MEBIBYTE + 7, 32 * MEBIBYTE):
            with self.subTest(size):
                self.arrives(Content(size), relay_timeout=60)

    def test_at_once_all_arrive(self):
        folders = [self.folder / str(number) for number in range(6)]
        for folder in folders:
            folder.mkdir()

        def send(folder):
            content = Content(3 * MEBIBYTE)
            body = Form().field("keep", folder).file("file", "x", content)
            return content, upload(self.client, self.query(), body)

        with ThreadPoolExecutor(max_workers=6) as pool:
            results = list(pool.map(send, folders))
        for folder, (content, reply) in zip(folders, results):
            self.data(reply)
            self.assertEqual(file_digest(folder / "file"), content.sha256())

    def test_whose_form_names_the_method_cannot_be_relayed(self):
        body = (Form().field("api", "Test.Relay").field("version", 2).field("method", "take")
                .file("file", "x", b"text"))
        mark = self.first.log.mark()
        self.fails(upload(self.client, form(relay_nd=2, _sid=self.ann), body), 109)
        self.assertTrue(wait_until(lambda: self.first.log.since(mark), 5))
        self.assertEqual(self.second.sessions(), [])

    def test_that_break_off_leave_nothing(self):
        body = list(Form().field("keep", self.kept).file("file", "x", Content(8 * MEBIBYTE)))
        sender = Sender(self.client, self.query(), sum(map(len, body)))
        self.addCleanup(sender.close)
        for piece in body[:5]:
            sender.send(piece)
        self.assertTrue(wait_until(self.second.entries))
        # One that begins later would meet the next case.
        self.assertTrue(wait_until(self.second.sessions))
        sender.close()
        for appliance in (self.first, self.second):
            self.assertTrue(wait_until(lambda: not appliance.entries()), "an entry still runs")
        self.assertEqual(list(self.kept.iterdir()), [])
        self.assertEqual(list((self.second.volume / "@tmp").glob("webapi-upload-*")), [])
