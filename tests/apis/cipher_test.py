"""TALO.Session cipher: what a client needs to encipher its parameters."""

import base64
import concurrent.futures
import os
import stat
import subprocess
import time
import unittest

import appliance
from appliance import form, post, session
from cipher_case import CIPHER_DIR, CipherTest, KEYS, PREFIX, seal, under


class Cipher(CipherTest):
    def test_answers_key_token_and_time_without_a_session(self):
        before = int(time.time())
        data = session("cipher").data
        self.assertEqual(set(data), {"key", "key_id", "token", "time"})
        self.assertRegex(data["key"], r"^[A-Za-z0-9_-]{43}$")
        self.assertEqual(len(base64.urlsafe_b64decode(data["key"] + "=")), 32)
        self.assertEqual(data["key_id"], data["key"][:12])
        self.assertRegex(data["token"], r"^t[A-Za-z0-9_-]{32}$")
        self.assertTrue(before <= data["time"] <= int(time.time()), data)

    def test_begins_no_session_and_leaves_one_alone(self):
        reply = session("cipher")
        self.assertIsNone(reply.cookie)
        self.assertEqual(appliance.session_ids(), [])
        sid = self.log_in("normal")
        self.assertEqual(set(session("cipher", sid).data), {"key", "key_id", "token", "time"})
        self.assertEqual(session("cipher", "nonsense").code, 0)
        self.assertEqual(session("info", sid).data["account"], "normal")

    def test_the_key_stays_and_the_token_does_not(self):
        answers = [session("cipher").data for _ in range(4)]
        self.assertEqual(len({answer["key"] for answer in answers}), 1)
        self.assertEqual(len({answer["token"] for answer in answers}), 4)

    def test_the_secret_is_for_nobody_else_and_not_in_the_answer(self):
        reply = session("cipher")
        self.assertEqual(stat.S_IMODE(KEYS.stat().st_mode), 0o600)
        self.assertEqual(stat.S_IMODE(CIPHER_DIR.stat().st_mode), 0o700)
        _, public, secret, _ = KEYS.read_text().splitlines()[1].split(" ")
        self.assertEqual(public, reply.data["key"])
        self.assertNotIn(secret, reply.text)

    def test_rotate_key_makes_another(self):
        first = session("cipher").data["key"]
        appliance.account("rotate-key")
        second = session("cipher").data["key"]
        self.assertNotEqual(first, second)
        self.assertIn(f"\nprevious {first} ", KEYS.read_text())
        appliance.account("rotate-key")
        self.assertIn(f"\nprevious {second} ", KEYS.read_text())
        self.assertNotIn(first, KEYS.read_text())

    def test_rotate_key_takes_no_words(self):
        for words in (("rotate-key", "now"), ("rotate-key", "--json")):
            with self.assertRaises(subprocess.CalledProcessError) as caught:
                appliance.account(*words)
            self.assertEqual(caught.exception.returncode, 2)
            self.assertIn(b"usage: webapi-account", caught.exception.stderr)
        self.assertFalse(KEYS.exists())

    def test_keys_that_are_not_to_be_trusted_are_407(self):
        session("cipher")
        content = KEYS.read_text()
        os.chmod(KEYS, 0o644)
        self.refused(session("cipher"), 407)
        with self.assertRaises(subprocess.CalledProcessError) as caught:
            appliance.account("rotate-key")
        self.assertEqual(caught.exception.returncode, 1)
        self.assertRegex(caught.exception.stderr, rb"^webapi-account: [^\n]+\n$")
        os.chmod(KEYS, 0o600)
        KEYS.write_text("garbage\n")
        self.refused(session("cipher"), 407)
        self.assertEqual(KEYS.read_text(), "garbage\n")
        KEYS.write_text(content)
        self.assertIn(session("cipher").data["key"], content)

    def test_works_for_many_at_once(self):
        with concurrent.futures.ThreadPoolExecutor(8) as pool:
            answers = list(pool.map(lambda _: session("cipher").data["key"], range(16)))
        self.assertEqual(len(set(answers)), 1)


class SealedLines(CipherTest):
    def log_in_line(self, **parameters):
        return form({"api": "TALO.Session", "version": 1, "method": "open", "account": "normal",
                     "passwd": self.PASSWORDS["normal"], **parameters})

    def test_log_a_user_in_by_body_and_by_query(self):
        key = session("cipher").data["key"]
        reply = post(seal(self.log_in_line(), key))
        self.assertEqual(reply.data["account"], "normal")
        reply = post("", REQUEST_METHOD="GET", QUERY_STRING=seal(self.log_in_line(), key))
        self.assertEqual(reply.data["account"], "normal")

    def test_count_once(self):
        text = seal(self.log_in_line(), session("cipher").data["key"])
        self.assertEqual(post(text).code, 0)
        for _ in range(3):
            self.refused(post(text), 101)
        # A query that cannot be read has no answer of its own.
        self.assertEqual(post("", REQUEST_METHOD="GET", QUERY_STRING=text).body, {})
        self.assertEqual(len(appliance.session_ids()), 1)

    def test_count_once_for_many_at_once(self):
        text = seal(self.log_in_line(), session("cipher").data["key"])
        with concurrent.futures.ThreadPoolExecutor(8) as pool:
            codes = list(pool.map(lambda _: post(text).code, range(16)))
        self.assertEqual(sorted(codes), [0] + [101] * 15)
        self.assertEqual(len(appliance.session_ids()), 1)

    def test_altered_or_cut_are_refused(self):
        text = seal(self.log_in_line(), session("cipher").data["key"])
        for bad in (PREFIX, PREFIX + "a=1", text[:-1], text[:-4], text + "A", text + "&a=1",
                    text[:80] + ("A" if text[80] != "A" else "B") + text[81:]):
            with self.subTest(bad):
                self.refused(post(bad), 101)
        self.assertEqual(post(text).code, 0)

    def test_of_a_clock_that_is_far_off_are_refused(self):
        key = session("cipher").data["key"]
        for skew in (-700, 700):
            self.refused(post(seal(self.log_in_line(), key, time.time() + skew)), 101)
        self.assertEqual(post(seal(self.log_in_line(), key, time.time() + 500)).code, 0)

    def test_to_another_key_are_refused(self):
        key = session("cipher").data["key"]
        self.forget_keys()
        self.refused(post(seal(self.log_in_line(), key)), 101)

    def test_to_the_previous_key_count_until_it_is_dropped(self):
        key = session("cipher").data["key"]
        appliance.account("rotate-key")
        self.assertEqual(post(seal(self.log_in_line(), key)).code, 0)
        appliance.account("rotate-key")
        self.refused(post(seal(self.log_in_line(), key)), 101)


class LoadedLibraries(CipherTest):
    @staticmethod
    def loaded_by(body):
        """What the loader says while the entry answers one request."""
        content = body.encode("utf-8")
        process = subprocess.run(
            [appliance.ENTRY_CGI], input=content, capture_output=True, timeout=60, check=True,
            env={"LD_DEBUG": "files", "PATH": "/usr/bin:/bin", "REQUEST_METHOD": "POST",
                 "CONTENT_TYPE": "application/x-www-form-urlencoded",
                 "CONTENT_LENGTH": str(len(content)), "REMOTE_ADDR": appliance.ADDRESS,
                 "HTTP_HOST": appliance.HOST})
        return process.stderr.decode("utf-8", "replace")

    def test_a_plain_request_loads_no_cipher(self):
        text = self.loaded_by(form({"api": "TALO.Session", "version": 1, "method": "info"}))
        self.assertIn("TALO.Session.so", text)
        for library in ("libcrypto", "libssl", "talo-cipher"):
            self.assertNotIn(library, text)

    def test_a_sealed_one_does(self):
        text = self.loaded_by(seal("api=TALO.Session&version=1&method=info",
                                   session("cipher").data["key"]))
        self.assertIn("TALO.Session.so", text)
        self.assertIn("libcrypto", text)

    def test_a_carrier_within_a_plain_one_does(self):
        for carriers in ({"__cIpHeRtExT": seal("a=1", session("cipher").data["key"])},
                         {"webapi": {"__cIpHeRtExT": seal("a=1", session("cipher").data["key"])}},
                         under("t", "a=1")):
            text = self.loaded_by(form({"api": "TALO.Session", "version": 1, "method": "info",
                                        **carriers}))
            self.assertIn("TALO.Session.so", text)
            self.assertIn("libcrypto", text)


if __name__ == "__main__":
    unittest.main()
