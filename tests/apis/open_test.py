"""TALO.Session "open": who gets a session, and what the browser is told."""

import calendar
import json
import os
import re
import time
import unittest

import appliance
from appliance import ApplianceTest, account, post, session, session_ids

ID = re.compile(r"s[A-Za-z0-9_-]{43}")


class Open(ApplianceTest):
    def test_answers_the_id_and_who_the_user_is(self):
        for name, is_admin in (("boss", True), ("normal", False)):
            data = self.open(name).data
            self.assertRegex(data["sid"], ID)
            self.assertEqual(data, {"sid": data["sid"], "account": name, "is_admin": is_admin})
            self.assertIn(data["sid"], session_ids())

    def test_sends_the_cookie_for_the_browser_only_and_for_this_site_only(self):
        reply = self.open("normal")
        self.assertEqual(reply.cookie,
                         f"id={reply.data['sid']}; Path=/; HttpOnly; SameSite=Strict")

    def test_sends_a_secure_cookie_on_https_only(self):
        plain = "id={}; Path=/; HttpOnly; SameSite=Strict"
        for variables, secure in (({"HTTPS": "on"}, True), ({"HTTPS": "ON"}, True),
                                  ({"HTTP_X_FORWARDED_PROTO": "https"}, True),
                                  ({"SCRIPT_URI": "https://nas.local/webapi/entry.cgi"}, True),
                                  ({"HTTPS": "off"}, False),
                                  ({"SCRIPT_URI": "http://nas.local/webapi/entry.cgi"}, False)):
            with self.subTest(variables):
                reply = self.open("normal", variables=variables)
                self.assertEqual(reply.cookie, plain.format(reply.data["sid"])
                                 + ("; Secure" if secure else ""))

    def test_remembers_for_a_week_by_the_browsers_clock(self):
        reply = self.open("normal", remember=True, client_time=1700000000)
        self.assertEqual(
            reply.cookie,
            f"id={reply.data['sid']}; Path=/; HttpOnly; SameSite=Strict; Max-Age=604800; "
            "Expires=Tue, 21 Nov 2023 22:13:20 GMT")
        self.assertEqual(session("info", reply.data["sid"]).data["timeout"], 7 * 24 * 60)

    def test_remembers_by_its_own_clock_when_the_browser_tells_none(self):
        for parameters in ({}, {"client_time": None}):
            before = time.time()
            cookie = self.open("normal", remember=True, variables={"HTTPS": "on"},
                               **parameters).cookie
            match = re.fullmatch(r".*; Max-Age=604800; Expires=(.*); Secure", cookie)
            expires = calendar.timegm(time.strptime(match[1], "%a, %d %b %Y %H:%M:%S GMT"))
            self.assertAlmostEqual(expires, before + 604800, delta=60)

    def test_does_not_remember_unless_asked(self):
        for parameters in ({}, {"remember": False}, {"client_time": 1700000000}):
            reply = self.open("normal", **parameters)
            self.assertNotIn("Max-Age", reply.cookie)
            self.assertEqual(session("info", reply.data["sid"]).data["timeout"], 30)

    def test_survives_clocks_that_no_date_can_be_told_from(self):
        for clock in (-1, -2**63, 2**63 - 1, 2**62, 10**15):
            with self.subTest(clock):
                reply = self.open("normal", remember=True, client_time=clock)
                self.assertTrue(reply.cookie.endswith("; SameSite=Strict; Max-Age=604800"),
                                reply.cookie)

    def test_gives_a_new_id_always(self):
        first = self.log_in("normal")
        ids = {first, self.log_in("normal")}
        for known in (first, "s" + "A" * 43, "12345"):
            ids.add(self.open("normal", cookie=known).data["sid"])
            ids.add(self.open("normal", _sid=known).data["sid"])
        self.assertEqual(len(ids), 8)
        self.assertEqual(session_ids(), sorted(ids))

    def test_reads_json_as_well_as_a_form(self):
        body = {"api": "TALO.Session", "version": 1, "method": "open", "account": "normal",
                "passwd": "Normal-pass"}
        self.assertEqual(post(json.dumps(body)).data["account"], "normal")


class Refusal(ApplianceTest):
    def tearDown(self):
        self.assertEqual(session_ids(), [])

    def test_does_not_tell_a_wrong_account_from_a_wrong_password(self):
        replies = [session("open", account=name, passwd=password) for name, password in (
            ("normal", "wrong"), ("nobody", "wrong"), ("nobody", "Normal-pass"),
            ("other", "Normal-pass"), ("no name/at..all", "x"))]
        for reply in replies:
            self.refused(reply, 401)
            self.assertEqual(reply.text, replies[0].text)
            self.assertEqual(reply.headers, replies[0].headers)

    def test_refuses_a_password_that_is_nearly_right(self):
        for password in ("", "normal-pass", "Normal-pass ", "Normal-pas", "Normal-pass\0"):
            appliance.forget_sessions()
            self.refused(session("open", account="normal", passwd=password), 401)

    def test_names_the_parameter_that_is_missing_or_wrong(self):
        for parameters, name in (
                ({"passwd": "x"}, "account"), ({"account": "normal"}, "passwd"), ({}, "account"),
                ({"account": ["normal"], "passwd": "x"}, "account"),
                ({"account": {}, "passwd": "x"}, "account"),
                ({"account": 1.5, "passwd": "x"}, "account"),
                ({"account": "normal", "passwd": ["Normal-pass"]}, "passwd"),
                ({"account": "normal", "passwd": {}}, "passwd"),
                ({"account": "normal", "passwd": "Normal-pass", "remember": "soon"}, "remember"),
                ({"account": "normal", "passwd": "Normal-pass", "remember": 1}, "remember"),
                ({"account": "normal", "passwd": "Normal-pass", "client_time": "now"},
                 "client_time"),
                ({"account": "normal", "passwd": "Normal-pass", "client_time": 1.5},
                 "client_time")):
            with self.subTest(parameters):
                self.refused(session("open", **parameters), 400, name)

    def test_refuses_another_sites_page_with_105(self):
        for variables in ({"HTTP_ORIGIN": "http://evil.example"}, {"HTTP_ORIGIN": "null"},
                          {"HTTP_SEC_FETCH_SITE": "cross-site"},
                          {"HTTP_SEC_FETCH_SITE": "same-site"}):
            with self.subTest(variables):
                self.refused(self.open("normal", variables=variables), 105)

    def test_tells_that_an_account_is_locked_only_to_who_knows_the_password(self):
        account("lock", "normal")
        try:
            self.refused(self.open("normal"), 402)
            self.refused(session("open", account="normal", passwd="wrong"), 401)
        finally:
            account("unlock", "normal")

    def test_tells_that_a_password_has_expired_only_to_who_knows_it(self):
        account("passwd", "other", "--expires", "0", password="Other-pass")
        try:
            self.refused(self.open("other"), 404)
            self.refused(session("open", account="other", passwd="wrong"), 401)
        finally:
            account("passwd", "other", password="Other-pass")

    def test_answers_405_when_the_accounts_cannot_be_read(self):
        os.chmod(appliance.ACCOUNTS_FILE, 0o666)
        try:
            self.refused(self.open("normal"), 405)
        finally:
            os.chmod(appliance.ACCOUNTS_FILE, 0o600)

    def test_answers_405_when_no_session_can_be_written(self):
        appliance.SESSION_DIR.parent.mkdir(parents=True, exist_ok=True)
        appliance.SESSION_DIR.write_text("no folder", encoding="utf-8")
        try:
            self.refused(self.open("normal"), 405)
        finally:
            appliance.SESSION_DIR.unlink()


class Wait(ApplianceTest):
    def fail_until_told_to_wait(self):
        for _ in range(50):
            reply = session("open", account="normal", passwd="wrong")
            if reply.code != 401:
                return reply
        return self.fail("never told to wait")

    def test_is_asked_after_failures_and_ends(self):
        reply = self.fail_until_told_to_wait()
        self.assertEqual(reply.code, 403)
        self.assertIsNone(reply.cookie)
        seconds = reply.errors["wait"]
        self.assertEqual(reply.errors, {"wait": seconds})
        self.assertGreaterEqual(seconds, 1)
        self.assertEqual(self.open("normal").code, 403)
        self.assertEqual(session_ids(), [])
        time.sleep(seconds)
        self.assertEqual(self.open("normal").data["account"], "normal")

    def test_does_not_concern_others_elsewhere(self):
        self.fail_until_told_to_wait()
        elsewhere = {"REMOTE_ADDR": "203.0.113.5"}
        self.assertEqual(self.open("other", variables=elsewhere).code, 0)


class TypedPassword(ApplianceTest):
    """A form sends no types: what looks like JSON is meant as it was typed."""

    LOOKS = ("12345", "0", "-7", "true", "false", "null", "18446744073709551615", "007", "1e5x")
    PASSWORDS = {**ApplianceTest.PASSWORDS,
                 **{f"typed{index}": password for index, password in enumerate(LOOKS)},
                 "exponent": "1e5", "fraction": "1.50", "4711": "4711"}

    def open_typed(self, name, password):
        return post(f"api=TALO.Session&version=1&method=open&account={name}&passwd={password}")

    def test_is_taken_as_it_was_typed(self):
        for index, password in enumerate(self.LOOKS):
            with self.subTest(password):
                self.assertEqual(self.open_typed(f"typed{index}", password).code, 0)
                self.assertEqual(self.open_typed(f"typed{index}", f"%22{password}%22").code, 0)

    def test_is_not_taken_for_another(self):
        for index, password in ((3, "1"), (4, "0"), (5, ""), (1, "false"), (7, "7"), (0, "12346")):
            appliance.forget_sessions()
            with self.subTest(password):
                self.refused(self.open_typed(f"typed{index}", password), 401)

    def test_whose_spelling_is_lost_is_refused(self):
        for name, password in (("exponent", "1e5"), ("exponent", "100000.0"),
                               ("fraction", "1.50"), ("fraction", "1.5"),
                               ("normal", "18446744073709551616")):
            with self.subTest(password):
                self.refused(self.open_typed(name, password), 400, "passwd")

    def test_can_be_sent_as_a_json_text(self):
        self.assertEqual(self.open_typed("exponent", "%221e5%22").code, 0)
        self.assertEqual(self.open_typed("fraction", "%221.50%22").code, 0)

    def test_belongs_to_an_account_that_may_look_like_a_number_too(self):
        self.assertEqual(self.open_typed("4711", "4711").data["account"], "4711")


class HeaderInjection(ApplianceTest):
    """Every reply's header lines are checked on the way: none is the client's."""

    LINE = "\r\nSet-Cookie: evil=1\r\n\r\n<script>"

    def test_fails_through_every_parameter_of_open(self):
        good = {"account": "normal", "passwd": "Normal-pass", "remember": True}
        for name, code in (("account", 401), ("passwd", 401), ("remember", 400),
                           ("client_time", 400)):
            for text in (self.LINE, "normal" + self.LINE, "1" + self.LINE, "\n", "\r", "\0"):
                with self.subTest((name, text)):
                    appliance.forget_sessions()
                    reply = session("open", **{**good, name: text})
                    self.assertEqual(reply.code, code)
                    self.assertIsNone(reply.cookie)

    def test_fails_through_identity_and_session(self):
        for text in (self.LINE, "TALO.Session" + self.LINE):
            self.assertNotEqual(appliance.call(text, "open").code, 0)
            self.assertNotEqual(session("open" + text).code, 0)
            self.assertEqual(session("info", _sid=text).code, 105)
            self.assertEqual(session("end", self.log_in("normal"), handle=text).code, 406)

    def test_fails_through_the_servers_variables(self):
        for name in ("HTTP_HOST", "SCRIPT_URI", "HTTP_X_FORWARDED_PROTO", "HTTP_X_FORWARDED_FOR",
                     "HTTP_USER_AGENT"):
            with self.subTest(name):
                reply = self.open("normal", variables={name: "https" + self.LINE})
                self.assertEqual(reply.cookie.split("; ")[:4], [
                    f"id={reply.data['sid']}", "Path=/", "HttpOnly", "SameSite=Strict"])

    def test_does_not_break_out_of_the_body(self):
        text = appliance.call("TALO.System", "ping", text=self.LINE)
        self.assertEqual(text.data["text"], self.LINE)
        self.assertNotIn("<", text.text)


if __name__ == "__main__":
    unittest.main()
