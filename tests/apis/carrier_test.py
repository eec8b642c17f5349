"""Enciphered parameters within a request, from the browser's ciphers to the method
that finds them, and what it finds when they cannot be read."""

import json
import os
import subprocess
import unittest

import appliance
from appliance import compound, element, form, post, session
from cipher_case import CIPHER_DIR, CipherTest, PREFIX, browser, encipher, seal, seal_all, under

ECHO = {"api": "Test.Basic", "version": 1, "method": "echo"}
IDENTITY = set(ECHO)
CALL = form(ECHO)
BASE64 = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_"


def flipped(text, at):
    """The text with one bit of the character there turned over."""
    bit = 1 << at % 6
    return text[:at] + BASE64[BASE64.index(text[at]) ^ bit] + text[at + 1:]


class CarrierTest(CipherTest):
    def setUp(self):
        super().setUp()
        self.key = session("cipher").data["key"]
        self.token = session("cipher").data["token"]
        self.describe_api("Test.Basic", {
            "lib": os.environ["TEST_MODULE_DIR"] + "/TestBasic.so", "authLevel": 0,
            "minVersion": 1, "maxVersion": 1, "methods": {"1": ["echo"]}})

    def sealed(self, line):
        return {"__cIpHeRtExT": seal(line, self.key)}

    def found(self, reply):
        """What the method was given, without the call's identity."""
        return {name: value for name, value in reply.data.items() if name not in IDENTITY}

    def echo(self, **parameters):
        return self.found(post(form({**ECHO, **parameters})))


class Read(CarrierTest):
    def test_a_line_within_a_plain_one(self):
        self.assertEqual(self.echo(a=1, b="x", **self.sealed("a=2&c=%5B1%5D&d=e+f")),
                         {"a": 2, "b": "x", "c": [1], "d": "e f"})

    def test_a_text_under_a_token(self):
        self.assertEqual(self.echo(a=1, b="x", **under(self.token, "a=2&c=%5B1%5D&d=e+f")),
                         {"a": 2, "b": "x", "c": [1], "d": "e f"})

    def test_a_token_of_the_clients_own(self):
        for token in ("t", "t\u00f6ken \u20ac", "x" * 4096):
            self.assertEqual(self.echo(**under(token, "a=J%C3%BCrgen")), {"a": "J\u00fcrgen"})

    def test_in_the_query_as_in_the_body(self):
        for carriers in (self.sealed("a=2"), under(self.token, "a=2")):
            reply = post("", REQUEST_METHOD="GET", QUERY_STRING=form({**ECHO, "a": 1, **carriers}))
            self.assertEqual(self.found(reply), {"a": 2})

    def test_a_line_of_two_kilobytes_and_one_of_two_megabytes(self):
        for size in (2048, 2 << 20):
            value = "x" * size
            self.assertEqual(self.echo(**self.sealed("a=" + value)), {"a": value})
            self.assertEqual(self.echo(**under(self.token, "a=" + value)), {"a": value})

    def test_in_a_nested_object(self):
        self.assertEqual(
            self.echo(webapi={**self.sealed("b=2"), "__cIpHeRtOkEn": "t", "a": 1}),
            {"webapi": {"a": 1, "b": 2}})
        self.assertEqual(self.echo(webapi={"a": 1, **under(self.token, "b=2")}),
                         {"webapi": {"a": 1, "b": 2}})

    def test_in_nested_objects_on_every_level(self):
        self.assertEqual(
            self.echo(**self.sealed("a=1"),
                      webapi={**self.sealed("b=2"),
                              "webapi": {**under(self.token, "c=3"),
                                         "webapi": self.sealed("d=4")}}),
            {"a": 1, "webapi": {"b": 2, "webapi": {"c": 3, "webapi": {"d": 4}}}})

    def test_one_carrier_out_of_another(self):
        within = form(under(self.token, "a=1"))
        self.assertEqual(self.echo(**self.sealed(within)), {"a": 1})
        within = form(self.sealed("a=1"))
        self.assertEqual(self.echo(**under(self.token, within)), {"a": 1})
        within = form({"webapi": self.sealed("a=1")})
        self.assertEqual(self.echo(**self.sealed(within)), {"webapi": {"a": 1}})

    def test_within_a_line_that_is_sealed_whole(self):
        for carriers in (self.sealed("a=2"), under(self.token, "a=2"),
                         {"webapi": self.sealed("a=2")}):
            names = {"webapi": {"a": 2}} if "webapi" in carriers else {"a": 2}
            reply = post(seal(form({**ECHO, **carriers}), self.key))
            self.assertEqual(self.found(reply), names)

    def test_the_calls_own_name(self):
        for carriers in (self.sealed(CALL), under(self.token, CALL)):
            self.assertEqual(post(form({**carriers, "a": 1})).data, {**ECHO, "a": 1})

    def test_the_session(self):
        sid = self.log_in("normal")
        for carriers in (self.sealed(form({"_sid": sid})), under(self.token, form({"_sid": sid}))):
            self.assertEqual(session("info", **carriers).data["account"], "normal")

    def test_a_login(self):
        secret = form({"account": "normal", "passwd": self.PASSWORDS["normal"]})
        for carriers in (self.sealed(secret), under(self.token, secret)):
            self.assertEqual(session("open", **carriers).data["account"], "normal")

    def test_by_a_program_that_calls_in_process(self):
        for carriers in (self.sealed("a=2"), under(self.token, "a=2"),
                         {"__cIpHeRtExT": "unreadable"}):
            process = subprocess.run(
                [os.environ["WEBAPI_CALL"], "--compact", "--user", "normal", "Test.Basic", "echo",
                 *(f"{name}={value}" for name, value in {"b": 1, **carriers}.items())],
                check=True, capture_output=True, timeout=60)
            data = json.loads(process.stdout)["data"]
            expected = {"b": 1} if "unreadable" in carriers.values() else {"a": 2, "b": 1}
            self.assertEqual(data, {**ECHO, **expected})

    def test_in_the_elements_of_a_compound_request(self):
        reply = compound([element("Test.Basic", "echo", **self.sealed("a=1")),
                          self.sealed(CALL + "&b=2"),
                          {**under(self.token, CALL + "&c=3")}])
        self.assertEqual([self.found_in(result) for result in reply.data["result"]],
                         [{"a": 1}, {"b": 2}, {"c": 3}])

    def found_in(self, result):
        self.assertTrue(result["success"], result)
        return {name: value for name, value in result["data"].items() if name not in IDENTITY}


class Unreadable(CarrierTest):
    def test_lines_leave_the_parameters_missing(self):
        line, other = seal_all(["a=2", "a=3"], self.key)
        bad = {
            "empty": "", "plain": "a=2", "prefix only": PREFIX, "prefix and a line": PREFIX + "a=2",
            "no text": 7, "null": None, "object": {"a": 2}, "array": [line],
            "with more behind": line + "A", "joined": line + other,
            "with white space": " " + line, "with a NUL before": "\0" + line,
            "cut by one": line[:-1], "half": line[:len(line) // 2],
            "under a token": encipher(self.token, "a=2"),
        }
        for name, text in bad.items():
            with self.subTest(name):
                self.assertEqual(self.echo(b=1, __cIpHeRtExT=text), {"b": 1})
        self.assertEqual(self.echo(b=1, __cIpHeRtExT=line), {"a": 2, "b": 1})

    def test_lines_with_a_bit_turned_over_anywhere(self):
        line = seal("a=2", self.key)
        for at in range(len(PREFIX), len(line)):
            self.assertEqual(self.echo(b=1, __cIpHeRtExT=flipped(line, at)), {"b": 1}, at)
        for at in range(len(PREFIX)):
            bad = line[:at] + chr(ord(line[at]) ^ 1) + line[at + 1:]
            self.assertEqual(self.echo(b=1, __cIpHeRtExT=bad), {"b": 1}, at)
        self.assertEqual(self.echo(__cIpHeRtExT=line), {"a": 2})

    def test_lines_to_another_key(self):
        carriers = self.sealed("a=2")
        self.forget_keys()
        self.assertEqual(self.echo(b=1, **carriers), {"b": 1})

    def test_lines_cut_anywhere(self):
        line = seal("a=2", self.key)
        elements = [{**ECHO, "b": 1, "__cIpHeRtExT": line[:size]} for size in range(len(line))]
        for result in compound(elements).data["result"]:
            self.assertEqual(result["data"], {**ECHO, "b": 1})

    def test_lines_that_came_before(self):
        carriers = self.sealed("a=2")
        self.assertEqual(self.echo(b=1, **carriers), {"a": 2, "b": 1})
        for _ in range(2):
            self.assertEqual(self.echo(b=1, **carriers), {"b": 1})
        self.assertEqual(self.echo(b=1, webapi=carriers), {"b": 1, "webapi": {}})
        twice = self.sealed("a=3")
        self.assertEqual(self.echo(**twice, webapi={"webapi": twice}),
                         {"a": 3, "webapi": {"webapi": {}}})

    def test_lines_that_came_whole_before(self):
        text = seal(CALL + "&a=2", self.key)
        self.assertEqual(self.found(post(text)), {"a": 2})
        self.assertEqual(self.echo(b=1, __cIpHeRtExT=text), {"b": 1})
        text = seal(CALL + "&a=2", self.key)
        self.assertEqual(self.echo(b=1, __cIpHeRtExT=text), {"a": 2, "b": 1})
        self.refused(post(text), 101)

    def test_nested_lines(self):
        line = seal("a=2", self.key)
        for bad in ("", 7, line[:-1], flipped(line, 60), [line]):
            with self.subTest(bad):
                nested = {"b": 1, "__cIpHeRtExT": bad, "__cIpHeRtOkEn": "t"}
                self.assertEqual(self.echo(webapi=nested), {"webapi": {"b": 1}})
                self.assertEqual(self.echo(webapi={"webapi": nested, "c": 1}),
                                 {"webapi": {"webapi": {"b": 1, "__cIpHeRtOkEn": "t"}, "c": 1}})

    def test_nested_texts_under_a_token(self):
        text = encipher(self.token, "a=2")
        for token, bad in (("other", text), ("", text), (self.token, ""), (self.token, text[:-1]),
                           (self.token, flipped(text, 30)), (7, text), (None, text), ([], {})):
            with self.subTest((token, bad)):
                nested = {"b": 1, "__nEkOtReHpIc": token, "__tXeTrEhPiC": bad}
                self.assertEqual(self.echo(webapi=nested), {"webapi": {"b": 1}})

    def test_texts_under_a_token_make_a_bad_request(self):
        text = encipher(self.token, "a=2")
        bad = [("other", text), ("", text), (self.token, ""), ("", ""), (self.token, text + "A"),
               ("x" * 4097, text), (self.token, [text]), (None, text), (self.token, "a=2")]
        bad += [(self.token, flipped(text, at)) for at in range(len(text))]
        bad += [(self.token, text[:size]) for size in range(len(text))]
        for token, altered in bad:
            with self.subTest((token, altered)):
                carriers = {"__nEkOtReHpIc": token, "__tXeTrEhPiC": altered}
                self.refused(post(form({**ECHO, "b": 1, **carriers})), 101)
        reply = post("", REQUEST_METHOD="GET", QUERY_STRING=form({**ECHO, **under("other", "a=2"),
                                                                 "__nEkOtReHpIc": "t"}))
        self.assertEqual(reply.body, {})
        self.assertEqual(self.echo(__nEkOtReHpIc=self.token, __tXeTrEhPiC=text), {"a": 2})

    def test_texts_under_a_token_within_a_line_leave_the_parameters_missing(self):
        bad = form({"a": 2, "__nEkOtReHpIc": "other",
                    "__tXeTrEhPiC": encipher(self.token, "c=3")})
        self.assertEqual(self.echo(b=1, **self.sealed(bad)), {"a": 2, "b": 1})

    def test_a_text_or_a_token_alone_is_an_ordinary_parameter(self):
        text = encipher(self.token, "a=2")
        self.assertEqual(self.echo(__tXeTrEhPiC=text), {"__tXeTrEhPiC": text})
        self.assertEqual(self.echo(__nEkOtReHpIc=self.token), {"__nEkOtReHpIc": self.token})

    def test_a_login_whose_password_cannot_be_read_is_none(self):
        secret = seal(form({"account": "normal", "passwd": self.PASSWORDS["normal"]}), self.key)
        plain = session("open")
        for bad in (secret[:-1], flipped(secret, 80), ""):
            reply = session("open", __cIpHeRtExT=bad)
            self.assertEqual((reply.code, reply.errors), (plain.code, plain.errors))
            self.assertNotEqual(reply.code, 0)
        self.assertEqual(appliance.session_ids(), [])

    def test_keys_that_are_not_to_be_trusted_open_nothing(self):
        carriers = self.sealed("a=2")
        os.chmod(CIPHER_DIR / "keys", 0o644)
        self.assertEqual(self.echo(b=1, **carriers), {"b": 1})
        os.chmod(CIPHER_DIR / "keys", 0o600)
        self.assertEqual(self.echo(b=1, **carriers), {"a": 2, "b": 1})


class Hostile(CarrierTest):
    def test_lines_that_go_deeper_and_deeper_are_read_to_some_depth(self):
        """Each hangs an object of 60 levels to the deepest one of the line before."""
        for lines, is_read in ((1, True), (2, False), (12, False)):
            line = "deepest=1"
            for _ in range(lines):
                nested = json.dumps(under("t", line))
                line = "webapi=" + '{"webapi":' * 60 + nested + "}" * 60
            reply = post(CALL + "&" + line)
            self.assertEqual(reply.code, 0)
            self.assertEqual('"deepest"' in reply.text, is_read, lines)

    def test_lines_with_too_many_pairs_are_read_up_to_the_limit(self):
        line = "&".join(f"n{number}=1" for number in range(10001))
        found = self.echo(b=1, **self.sealed(line))
        self.assertEqual(found, {"b": 1, **{f"n{number}": 1 for number in range(10000)}})
        self.refused(post(form({**ECHO, **under(self.token, line)})), 101)

    def test_browsers_functions_give_no_text_twice(self):
        texts = browser(*([["encipherLine", self.key, "a=1"]] * 3
                          + [["encipherWithToken", "t", "a=1"]] * 3))
        self.assertEqual(len(set(texts)), 6)


if __name__ == "__main__":
    unittest.main()
