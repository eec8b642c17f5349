"""Calls of appliances that are gone, are others than they say, or mean no good."""

import pathlib
import socket
import tempfile
import time

import hostile
from appliance import make_certificate
from client import ENTRY, form
from hostile import Target, raw, reply, whole_reply
from multipart import Content, Form, upload
from relay_case import (  # noqa: F401
    RelayCase, RelayError, only_with_lighttpd as load_tests, start_appliances)
from webserver import HOST, free_port

NUMBER = 9  # what the first knows the target by
ERROR_109 = b'{"error":{"code":109},"success":false}'


def setUpModule():
    start_appliances()


class TroubleCase(RelayCase):
    def setUp(self):
        super().setUp()
        folder = tempfile.TemporaryDirectory(prefix="target-")
        self.addCleanup(folder.cleanup)
        self.pem = pathlib.Path(folder.name) / "tls.pem"
        self.authority = make_certificate(self.pem)
        self.bob = self.log_in("bob")

    def knows(self, url, *options, authority=None):
        self.first.accounts("node", "add", NUMBER, "--url", url, "--self", 1, "--authority",
                            authority or self.authority, *options, given="A" * 43)

    def target(self, answer, **options):
        target = Target(self.pem, answer, **options)
        self.addCleanup(target.close)
        self.knows(target.url)
        return target

    def ask(self, **parameters):
        return self.call(self.bob, relay_nd=NUMBER, **parameters)

    def fails_within(self, seconds, *errors, **parameters):
        """The call fails for one of these reasons, and not later."""
        before = time.monotonic()
        mark = self.first.log.mark()
        answer = self.ask(**parameters)
        took = time.monotonic() - before
        self.assertEqual(answer.body, ERROR_109)
        self.fails(answer, 109)
        self.logged(mark, errors)
        self.assertLess(took, seconds)
        return took


class Unreachable(TroubleCase):
    def test_nobody_listens(self):
        self.knows(f"https://{HOST}:{free_port()}{ENTRY}")
        self.fails_within(5, RelayError.NOT_REACHED)

    def test_a_host_that_has_no_address(self):
        self.knows(f"https://no-such-host.invalid{ENTRY}")
        self.fails_within(30, RelayError.NOT_REACHED)

    def test_accepts_and_says_nothing(self):
        for options in ({"speaks": False}, {"opens": False}, {}):
            with self.subTest(options):
                self.target(hostile.nothing, **options)
                took = self.fails_within(6, RelayError.TIMED_OUT, RelayError.NOT_REACHED,
                                         relay_timeout=1)
                self.assertGreater(took, 0.9)

    def test_is_gone_in_the_middle(self):
        self.target(reply(b"{}"))
        self.ask()
        listener = socket.create_server((HOST, 0))
        self.knows(f"https://{HOST}:{listener.getsockname()[1]}{ENTRY}")
        listener.close()
        self.fails_within(5, RelayError.NOT_REACHED)

    def test_goes_away_without_an_answer(self):
        for options in ({}, {"opens": False}):
            with self.subTest(options):
                self.target(raw(b""), **options)
                self.fails_within(5, RelayError.BROKEN)

    def test_breaks_off_its_answer(self):
        for data in (b"HTTP/1.1 200 OK\r\nContent-Le", whole_reply(b"x" * 100)[:-1],
                     b"HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5\r\nabc"):
            with self.subTest(data[:60]):
                self.target(raw(data))
                self.fails_within(5, RelayError.BROKEN)


class Untrusted(TroubleCase):
    def test_a_certificate_of_somebody_else(self):
        target = self.target(reply(b"{}"))
        self.knows(target.url, authority=self.second.authority)
        self.fails_within(5, RelayError.NOT_TRUSTED)
        self.assertEqual(target.requests, [])

    def test_a_certificate_for_another_name(self):
        self.authority = make_certificate(self.pem, "DNS:nas2.invalid,IP:127.0.0.9")
        target = self.target(reply(b"{}"))
        self.fails_within(5, RelayError.NOT_TRUSTED)
        self.assertEqual(target.requests, [])

    def test_another_key_than_the_one_that_was_settled(self):
        target = self.target(reply(b"{}"))
        self.knows(target.url, "--pin", "sha256//" + "A" * 43 + "=")
        self.fails_within(5, RelayError.NOT_TRUSTED)
        self.assertEqual(target.requests, [])

    def test_speaks_no_tls(self):
        self.target(raw(whole_reply(b"{}")), speaks=False)
        self.fails_within(5, RelayError.NOT_TRUSTED, RelayError.NOT_REACHED, RelayError.BROKEN)


class Answers(TroubleCase):
    def test_any_text_comes_through_as_it_is(self):
        for body in (b"", b"{}", b"no JSON", b"\0\xff\r\n\r\n", b"HTTP/1.1 500 No\r\n\r\n"):
            with self.subTest(body):
                self.target(reply(body, lines="Set-Cookie: id=evil\r\nX-Evil: 1\r\n"))
                answer = self.ask()
                self.assertEqual((answer.status, answer.body), (200, body))
                self.assertIsNone(answer.header("Set-Cookie"))
                self.assertIsNone(answer.header("X-Evil"))

    def test_another_status_than_200_is_a_failure(self):
        for status in ("201 Made", "204 Empty", "301 Away", "302 Away", "401 No", "404 No",
                       "500 No"):
            with self.subTest(status):
                elsewhere = Target(self.pem, reply(b"{}"))
                self.addCleanup(elsewhere.close)
                self.target(reply(b"", status=status, lines=f"Location: {elsewhere.url}\r\n"))
                self.fails_within(5, RelayError.STATUS)
                self.assertEqual(elsewhere.requests, [])

    def test_one_byte_a_second_ends_with_the_time_limit(self):
        self.target(hostile.one_byte_a_second)
        self.assertGreater(self.fails_within(8, RelayError.TIMED_OUT, relay_timeout=2), 1.9)

    def test_slow_answers_are_waited_for_without_a_limit(self):
        self.target(hostile.slow_body)
        self.assertEqual(self.ask(relay_timeout=0).body, b"{ }\n")

    def test_a_gibibyte_ends_with_the_size_limit(self):
        for how, answer in hostile.GIBIBYTE.items():
            with self.subTest(how):
                target = self.target(answer)
                self.fails_within(15, RelayError.TOO_LONG, RelayError.UNAVAILABLE)
                # What the sockets' own buffers took is not what was read.
                self.assertLess(target.sent, 64 << 20)

    def test_the_size_limit_is_exact_and_the_hosts_to_settle(self):
        self.first.configure(relay_answer_limit=1000)
        self.target(reply(b"x" * 1000))
        self.assertEqual(self.ask().body, b"x" * 1000)
        self.target(reply(b"x" * 1001))
        self.fails_within(5, RelayError.TOO_LONG)

    def test_an_answer_to_the_opening_that_is_none_is_no_session(self):
        for body in (b"", b"x", b"[]", b'{"success":true}', b'{"success":true,"data":{"sid":7}}',
                     b'{"success":true,"data":{"sid":"a\\r\\nX-Evil: 1"}}',
                     b'{"success":false,"error":{"code":500}}', b'{"success":true,"data":[]}',
                     b'{"success":false,"data":{"sid":"%s"}}' % (b"s" * 44)):
            with self.subTest(body):
                target = self.target(reply(body), opens=False)
                mark = self.first.log.mark()
                self.fails(self.ask(), 109)
                self.logged(mark, [RelayError.REFUSED, RelayError.STATUS])
                self.assertEqual(len(target.requests), 1)

    def test_a_call_that_is_refused_is_repeated_once_with_a_new_session(self):
        refusal = reply(ERROR_109, lines="x-request-error: noprivilege\r\n")
        target = self.target(refusal)
        self.ask()
        openings = [body for _, body in target.requests if b"TALO.Relay" in body]
        self.assertLessEqual(len(openings), 2)
        self.assertLessEqual(len(target.requests) - len(openings), 2)


class WhatIsSent(TroubleCase):
    def request(self, **parameters):
        target = self.target(reply(b"{}"))
        self.assertEqual(self.ask(**parameters).body, b"{}")
        return target.requests[-1], target

    def test_is_a_form_with_the_session_and_the_hop_and_without_the_relay(self):
        (head, body), _ = self.request(a="b c", relay_timeout=20)
        lines = [line.lower() for line in head.split(b"\r\n")]
        self.assertTrue(lines[0].startswith(b"post /webapi/entry.cgi "))
        self.assertIn(b"content-type: application/x-www-form-urlencoded", lines)
        self.assertIn(b"cookie: id=" + hostile.SESSION.lower().encode(), lines)
        self.assertIn(b"x-relay-hops: 1", lines)
        pairs = dict(pair.split(b"=", 1) for pair in body.split(b"&"))
        self.assertEqual(sorted(pairs), [b"a", b"api", b"method", b"version"])
        self.assertEqual(pairs[b"a"].replace(b"%20", b"+"), b"%22b+c%22")
        self.assertNotIn(self.bob.encode(), head + body)

    def test_counts_the_hops_that_came(self):
        for came, sent in (("1", b"2"), ("3", b"4"), ("", b"1"), ("x", b"1"), ("-1", b"1")):
            with self.subTest(came):
                target = self.target(reply(b"{}"))
                self.ask(headers={"X-Relay-Hops": came})
                self.assertIn(b"x-relay-hops: " + sent, target.requests[-1][0].lower())

    def test_is_nothing_once_there_were_four_hops(self):
        for came in ("4", "5", "99999999999999999999"):
            with self.subTest(came):
                target = self.target(reply(b"{}"))
                self.fails_within(5, RelayError.TOO_MANY_HOPS, headers={"X-Relay-Hops": came})
                self.assertEqual(target.requests, [])

    def test_of_an_upload_is_the_body_as_it_came(self):
        target = self.target(reply(b"{}"))
        body = Form().field("relay_nd", "text of the form").file("f", "x", Content(20000))
        call = form(api="Test.Relay", version=2, method="take", relay_nd=NUMBER, _sid=self.bob,
                    relay_timeout=30, more="1")
        whole = b"".join(body)
        self.assertEqual(upload(self.client, call, Whole(whole)).body, b"{}")
        head, sent = target.requests[-1]
        self.assertEqual(sent, whole)
        line = head.split(b"\r\n")[0]
        self.assertNotIn(b"relay_nd", line)
        self.assertNotIn(b"relay_timeout", line)
        self.assertNotIn(b"expect:", head.lower())
        self.assertIn(b"content-type: multipart/form-data; boundary=", head.lower())

    def test_of_an_upload_to_one_that_takes_nothing_ends_with_the_time_limit(self):
        self.target(hostile.nothing, takes=False)
        call = form(api="Test.Relay", version=2, method="take", relay_nd=NUMBER, _sid=self.bob,
                    relay_timeout=2)
        before = time.monotonic()
        answer = upload(self.client, call, Form().file("f", "x", Content(32 << 20)))
        self.fails(answer, 109)
        self.assertLess(time.monotonic() - before, 20)


class Whole:
    """A body of one piece."""

    def __init__(self, data):
        self._data = data

    def __len__(self):
        return len(self._data)

    def __iter__(self):
        yield self._data
