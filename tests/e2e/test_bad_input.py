"""Requests as a bad client, or a hostile one, sends them."""

import time

from case import Case
from client import form
from multipart import Sender

PING = "api=TALO.System&version=1&method=ping"
ECHO = "api=Test.Basic&version=1&method=echo"


class Identity(Case):
    def test_without_an_api_it_is_101(self):
        self.fails(self.client.get("version=1&method=ping"), 101)

    def test_without_a_method_it_is_101(self):
        self.fails(self.client.get("api=TALO.System&version=1"), 101)

    def test_versions_that_are_none_are_101(self):
        for version in ("0", "-1", "abc", "2147483648", "1.5", "[]", "{}", "", "null", "%22x%22"):
            query = f"api=TALO.System&version={version}&method=ping"
            with self.subTest(version, way="query"):
                self.fails(self.client.get(query), 101)
            with self.subTest(version, way="body"):
                self.fails(self.client.post(query), 101)

    def test_an_api_that_is_no_text_is_101(self):
        for api in ("[]", "%7B%7D", '["TALO.System"]'):
            with self.subTest(api):
                self.fails(self.client.get(f"api={api}&version=1&method=ping".replace('"', "%22")),
                           101)

    def test_an_api_name_never_leads_out_of_the_directory(self):
        for name in ("../../etc/x", "A..B", "..", "/etc/passwd", ".lib", "lib/TALO.System",
                     "TALO.System/../TALO.System", "TALO.System\0", "TALO.*", "~", "A" * 70000,
                     "A." * 35000):
            with self.subTest(name[:40]):
                self.fails(self.client.call(name, "ping"), 102)

    def test_a_query_of_70000_letters_is_refused_by_the_server_or_102(self):
        reply = self.client.get(form(api="A" * 70000, version=1, method="ping"))
        self.answers_itself(reply, self.by_server(lighttpd=431, nginx=414, apache=414))


class RequestLine(Case):
    def first_line(self, line):
        return self.client.raw(line.encode() + b"\r\nHost: here\r\nConnection: close\r\n\r\n")

    def test_a_blank_in_the_query_is_a_letter_or_refused_by_the_server(self):
        reply = self.first_line(f"GET /webapi/entry.cgi?{PING}&text=a b HTTP/1.1")
        if self.server.name == "lighttpd":
            self.succeeds(reply, {"text": "a b"})
        else:
            self.answers_itself(reply, 400)

    def test_trace_gives_no_request_back(self):
        reply = self.first_line(f"TRACE /webapi/entry.cgi?{PING} HTTP/1.1")
        if self.server.name == "lighttpd":
            self.succeeds(reply, {})
        else:
            self.answers_itself(reply, 405)

    def test_a_method_that_is_none_is_answered_or_refused_by_the_server(self):
        reply = self.first_line(f"NONSENSE /webapi/entry.cgi?{PING} HTTP/1.1")
        if self.server.name == "lighttpd":
            self.answers_itself(reply, 501)
        else:
            self.succeeds(reply, {})

    def test_a_request_of_http_1_0_is_answered(self):
        self.succeeds(self.first_line(f"GET /webapi/entry.cgi?{PING} HTTP/1.0"), {})


class Values(Case):
    def ping(self, text):
        return self.client.get(f"{PING}&text={text}")

    def test_a_nul_is_a_letter_like_others_when_escaped(self):
        self.succeeds(self.ping("a%00b"), {"text": "a\0b"})
        self.succeeds(self.client.post(f"{PING}&text=a%00b"), {"text": "a\0b"})

    def test_a_nul_in_a_name_hides_nothing(self):
        self.succeeds(self.client.post(f"{PING}&te%00xt=1"), {})

    def test_a_body_ends_at_a_bare_nul(self):
        self.succeeds(self.client.post(f"{PING}&text=a\0b&count=1"), {"text": "a"})

    def test_a_percent_sign_cut_short_stays(self):
        for text in ("%", "%4", "a%", "%zz", "%4g", "%%"):
            with self.subTest(text, way="body"):
                self.succeeds(self.client.post(f"{PING}&text={text}"), {"text": text})
            with self.subTest(text, way="query"):
                self.succeeds(self.ping(text), {"text": text})

    def test_invalid_utf8_still_gives_one_valid_document(self):
        for octets in ("%FF", "%C3", "%C3%28", "%ED%A0%80", "%F5%80%80%80", "%C0%AF", "x%80y"):
            with self.subTest(octets, where="value"):
                self.assertIs(self.ping(octets).document()["success"], True)
            with self.subTest(octets, where="name"):
                reply = self.client.post(f"{ECHO}&{octets}=1")
                self.assertIs(reply.document()["success"], True)

    def test_bare_invalid_utf8_in_a_body_still_gives_one_valid_document(self):
        reply = self.client.post(PING.encode() + b"&text=\xff\xc3")
        self.assertIs(reply.document()["success"], True)

    def test_utf8_comes_back_as_it_was(self):
        self.succeeds(self.ping("%C3%A4%E2%82%AC%F0%9F%90%A7"), {"text": "ä€🐧"})

    def test_a_parameter_of_another_type_is_refused_by_name(self):
        reply = self.client.get(f"{PING}&count=many")
        self.assertIs(reply.document()["success"], False)
        self.assertEqual(reply.document()["error"]["errors"], "count")


class Sizes(Case):
    def test_10000_pairs_are_read(self):
        pairs = "&".join(f"p{number}={number}" for number in range(9997))
        data = self.client.post(f"{ECHO}&{pairs}").document()["data"]
        self.assertEqual(len(data), 10000)
        self.assertEqual(data["p9996"], 9996)

    def test_10001_pairs_are_101(self):
        pairs = "&".join(f"p{number}={number}" for number in range(9998))
        self.fails(self.client.post(f"{ECHO}&{pairs}"), 101)

    def test_json_64_levels_deep_is_a_value(self):
        value = "[" * 64 + "]" * 64
        reply = self.client.post(f"{ECHO}&deep={value}")
        self.assertIsInstance(reply.document()["data"]["deep"], list)

    def test_deeper_json_is_a_text(self):
        for depth in (65, 100000):
            with self.subTest(depth):
                value = "[" * depth + "]" * depth
                reply = self.client.post(f"{ECHO}&deep={value}")
                self.assertEqual(reply.document()["data"]["deep"], value)

    def test_a_json_body_counts_its_own_level(self):
        body = '{"api":"Test.Basic","version":1,"method":"echo","deep":%s}'
        shallow = self.client.post(body % ("[" * 63 + "]" * 63))
        self.assertIsInstance(shallow.document()["data"]["deep"], list)
        self.fails(self.client.post(body % ("[" * 64 + "]" * 64)), 101)
        self.fails(self.client.post(body % ("[" * 100000 + "]" * 100000)), 101)

    def test_a_body_of_one_megabyte_is_read(self):
        text = "x" * (1 << 20)
        self.succeeds(self.client.post(f"{PING}&text={text}"), {"text": text})

    def test_a_body_beyond_16_mebibytes_is_101(self):
        self.fails(self.client.post(f"{PING}&text=" + "x" * (16 << 20)), 101)

    def test_a_body_beyond_16_mebibytes_that_halts_is_101(self):
        sender = Sender(self.client, PING, 17 << 20,
                        {"Content-Type": "application/x-www-form-urlencoded"})
        self.addCleanup(sender.close)
        for pause in (0.3, 0):
            sender.send(b"x" * (17 << 19))
            time.sleep(pause)
        self.fails(sender.reply(), 101)


class Lengths(Case):
    """Bodies that are not as long as they say."""

    BODY = (PING + "&text=hi").encode()

    def post(self, length_lines, body=BODY, half_close=False):
        return self.client.raw_post(length_lines, body, half_close)

    def test_a_body_of_its_length_answers(self):
        self.succeeds(self.post(f"Content-Length: {len(self.BODY)}\r\n"), {"text": "hi"})

    def test_a_longer_body_is_read_up_to_its_length(self):
        self.succeeds(self.post(f"Content-Length: {len(self.BODY)}\r\n", self.BODY + b"gh"),
                      {"text": "hi"})

    def test_a_chunked_body_gets_its_length_from_the_server(self):
        chunks = b"%x\r\n%s\r\n0\r\n\r\n" % (len(self.BODY), self.BODY)
        reply = self.post("Transfer-Encoding: chunked\r\n", chunks)
        if self.refuses_chunks():
            self.answers_itself(reply, 411)
        elif self.server.name == "apache":  # gives the program no length at all
            self.fails(reply, 101)
        else:
            self.succeeds(reply, {"text": "hi"})

    def test_a_broken_chunk_is_refused_by_the_server(self):
        self.answers_itself(self.post("Transfer-Encoding: chunked\r\n", b"zz\r\n", True),
                            411 if self.refuses_chunks() else 400)

    def test_a_length_of_zero_is_101(self):
        self.fails(self.post("Content-Length: 0\r\n", b""), 101)

    def test_no_length_and_no_body_is_101_or_refused_by_the_server(self):
        reply = self.post("", b"")
        if self.server.name == "lighttpd":
            self.answers_itself(reply, 411)
        else:
            self.fails(reply, 101)

    def test_an_empty_length_is_refused_by_the_server(self):
        self.answers_itself(self.post("Content-Length: \r\n", b""),
                            self.by_server(lighttpd=411, nginx=400, apache=400))

    def test_lengths_that_are_none_are_refused_by_the_server(self):
        for length in ("-1", "12abc", "+12", "1.5", "0x10", "9223372036854775808"):
            with self.subTest(length):
                self.answers_itself(self.post(f"Content-Length: {length}\r\n"), 400)

    def test_two_different_lengths_are_refused_by_the_server(self):
        self.answers_itself(self.post("Content-Length: 5\r\nContent-Length: 6\r\n"), 400)

    def test_a_body_shorter_than_its_length_never_reaches_the_entry(self):
        for length, body in ((len(self.BODY) + 1, self.BODY), (100, b""), (17 << 20, self.BODY),
                             (9223372036854775807, self.BODY)):
            with self.subTest(length):
                reply = self.post(f"Content-Length: {length}\r\n", body, half_close=True)
                if self.server.name == "apache":
                    self.answers_itself(reply, self.by_server(apache=400, warm_apache=500))
                else:
                    self.assertIsNone(reply)
