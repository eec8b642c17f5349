"""TALO.Session: what a session is good for once it is open."""

import time
import unittest

import appliance
from appliance import ApplianceTest, last_use, leave_unused, session, session_ids

CLOSED = "id=; Path=/; HttpOnly; SameSite=Strict; Max-Age=0"
METHODS = ("close", "renew", "info", "list", "end")


class NeedsASession(ApplianceTest):
    def test_every_method_but_open(self):
        for method in METHODS:
            with self.subTest(method):
                self.refused_as(session(method, handle="h"), 119, "unauth")
                self.refused_as(session(method, cookie="", handle="h"), 119, "unauth")

    def test_and_one_that_there_is(self):
        for sid in ("s" + "A" * 43, "s", "007", "x" * 65536, "../../etc/passwd", "%2e%2e", "..",
                    "s/../" + "A" * 39, "A\0B"):
            for method in METHODS:
                with self.subTest((method, sid[:50])):
                    self.refused(session(method, _sid=sid, handle="h"), 105)

    def test_named_by_a_text(self):
        sid = self.log_in("normal")
        for number in (0, 1, True, [sid], {"id": sid}):
            self.refused_as(session("info", _sid=number), 119, "unauth")
            self.assertEqual(session("info", sid, _sid=number).data["account"], "normal")
        for cookie in ("0", "1", "x" * 65536, "%2e%2e", "/", "s%00"):
            self.refused(session("info", cookie), 105)

    def test_that_has_not_timed_out(self):
        sid = self.log_in("normal")
        leave_unused(sid, 31 * 60)
        for method in ("renew", "info", "list", "end"):
            with self.subTest(method):
                self.refused_as(session(method, sid, handle="h"), 106, "timeout")

    def test_that_was_opened_at_this_address(self):
        sid = self.log_in("normal")
        for method in METHODS:
            with self.subTest(method):
                self.refused_as(session(method, sid, {"REMOTE_ADDR": "203.0.113.5"}, handle="h"),
                                107, "noprivilege")
        self.assertEqual(session("info", sid).data["address"], "192.0.2.1")

    def test_for_a_page_of_this_site(self):
        sid = self.log_in("normal")
        for method in METHODS:
            with self.subTest(method):
                self.refused_as(session(method, sid, {"HTTP_ORIGIN": "http://evil.example"},
                                        handle="h"), 105, "noprivilege")
        self.assertEqual(session_ids(), [sid])

    def test_of_an_account_that_may_still_log_in(self):
        sid = self.log_in("other")
        appliance.account("lock", "other")
        try:
            self.refused(session("info", sid), 105)
        finally:
            appliance.account("unlock", "other")
        self.assertEqual(session("info", sid).data["account"], "other")

    def test_by_cookie_or_by_parameter(self):
        sid = self.log_in("normal")
        boss = self.log_in("boss")
        self.assertEqual(session("info", cookie=sid).data["account"], "normal")
        self.assertEqual(session("info", _sid=sid).data["account"], "normal")
        self.assertEqual(session("info", cookie=boss, _sid=sid).data["account"], "normal")
        self.assertEqual(session("info", cookie="s" + "A" * 43, _sid=sid).data["account"], "normal")
        self.refused(session("info", cookie=sid, _sid="s" + "A" * 43), 105)
        among = {"HTTP_COOKIE": f"lang=en; id={sid}; grid=2"}
        self.assertEqual(session("info", variables=among).data["account"], "normal")


class Close(ApplianceTest):
    def test_ends_the_session_and_takes_the_cookie_back(self):
        sid, other = self.log_in("normal"), self.log_in("normal")
        reply = session("close", sid)
        self.assertEqual(reply.body, {"success": True})
        self.assertEqual(reply.cookie, CLOSED)
        self.assertEqual(session_ids(), [other])
        self.refused(session("info", sid), 105)
        self.refused(session("close", sid), 105)

    def test_works_on_a_session_that_has_timed_out(self):
        sid = self.log_in("normal")
        leave_unused(sid, 100 * 24 * 3600)
        self.assertEqual(session("close", sid).cookie, CLOSED)
        self.assertEqual(session_ids(), [])


class Renew(ApplianceTest):
    def test_counts_as_a_use(self):
        sid = self.log_in("normal")
        leave_unused(sid, 29 * 60)
        before = time.time()
        self.assertEqual(session("renew", sid).body, {"success": True})
        self.assertGreaterEqual(last_use(sid), before - 1)

    def test_is_what_list_and_end_do_too(self):
        sid = self.log_in("normal")
        for method in ("list", "end"):
            leave_unused(sid, 29 * 60)
            before = time.time()
            session(method, sid, handle="h")
            self.assertGreaterEqual(last_use(sid), before - 1, method)

    def test_is_not_what_info_does(self):
        sid = self.log_in("normal")
        leave_unused(sid, 29 * 60)
        before = last_use(sid)
        self.assertEqual(session("info", sid).data["last_use"], int(before))
        self.assertEqual(last_use(sid), before)

    def test_comes_too_late_after_the_time_out_and_changes_nothing(self):
        sid = self.log_in("normal")
        leave_unused(sid, 31 * 60)
        before = last_use(sid)
        self.refused(session("renew", sid), 106)
        self.assertEqual(last_use(sid), before)

    def test_is_not_for_others(self):
        sid = self.log_in("normal")
        leave_unused(sid, 29 * 60)
        before = last_use(sid)
        self.assertEqual(session("renew", sid, {"REMOTE_ADDR": "203.0.113.5"}).code, 107)
        self.assertEqual(session("renew", sid, {"HTTP_SEC_FETCH_SITE": "cross-site"}).code, 105)
        self.assertEqual(last_use(sid), before)


class Info(ApplianceTest):
    def test_tells_about_the_session(self):
        before = int(time.time())
        for name, is_admin in (("boss", True), ("normal", False)):
            data = session("info", self.log_in(name)).data
            self.assertTrue(before <= data.pop("created") <= time.time())
            self.assertTrue(before - 1 <= data.pop("last_use") <= time.time())
            self.assertRegex(data.pop("handle"), r"\Ah[A-Za-z0-9_-]{12}\Z")
            self.assertEqual(data, {"account": name, "address": "192.0.2.1", "timeout": 30,
                                    "is_admin": is_admin})

    def test_follows_configuration_and_groups(self):
        sid = self.log_in("other")
        appliance.configure('session_timeout="12"\n')
        appliance.account("groups", "other", "administrators")
        try:
            data = session("info", sid).data
            self.assertEqual((data["timeout"], data["is_admin"]), (12, True))
        finally:
            appliance.account("groups", "other", "--none")

    def test_does_not_tell_the_id(self):
        sid = self.log_in("normal")
        self.assertNotIn(sid, session("info", sid).text)


class List(ApplianceTest):
    def accounts(self, sid):
        return [entry["account"] for entry in session("list", sid).data["sessions"]]

    def test_shows_ones_own_sessions_and_an_administrator_all(self):
        normal = [self.log_in("normal"), self.log_in("normal")]
        self.log_in("other")
        boss = self.log_in("boss")
        self.assertEqual(self.accounts(normal[0]), ["normal", "normal"])
        self.assertEqual(sorted(self.accounts(boss)), ["boss", "normal", "normal", "other"])

    def test_marks_the_callers_own(self):
        first, second = self.log_in("normal"), self.log_in("normal")
        for sid in (first, second):
            entries = session("list", sid).data["sessions"]
            own = [entry["handle"] for entry in entries if entry["current"]]
            self.assertEqual(own, [self.handle_of(sid)])
            self.assertEqual(sorted(entries[0]), ["account", "address", "created", "current",
                                                  "handle", "last_use"])

    def test_tells_no_id(self):
        ids = [self.log_in("normal"), self.log_in("other"), self.log_in("boss")]
        text = session("list", ids[2]).text
        for sid in ids:
            self.assertNotIn(sid, text)

    def test_leaves_out_what_has_timed_out(self):
        old, fresh = self.log_in("normal"), self.log_in("normal")
        leave_unused(old, 31 * 60)
        self.assertEqual(self.accounts(fresh), ["normal"])
        self.assertEqual(session_ids(), [fresh])


class End(ApplianceTest):
    def test_ends_another_session_of_ones_own(self):
        here, there = self.log_in("normal"), self.log_in("normal")
        self.assertEqual(session("end", here, handle=self.handle_of(there)).body,
                         {"success": True})
        self.assertEqual(session_ids(), [here])

    def test_ends_the_callers_own_too(self):
        sid = self.log_in("normal")
        self.assertEqual(session("end", sid, handle=self.handle_of(sid)).code, 0)
        self.assertEqual(session_ids(), [])

    def test_ends_others_sessions_only_for_an_administrator(self):
        normal, other, boss = (self.log_in(name) for name in ("normal", "other", "boss"))
        for mine, theirs in ((normal, other), (other, normal), (normal, boss)):
            self.refused(session("end", mine, handle=self.handle_of(theirs)), 406)
        self.assertEqual(len(session_ids()), 3)
        self.assertEqual(session("end", boss, handle=self.handle_of(other)).code, 0)
        self.refused(session("info", other), 105)
        self.assertEqual(session_ids(), sorted([normal, boss]))

    def test_takes_a_handle_and_no_id(self):
        boss, victim = self.log_in("boss"), self.log_in("normal")
        handle = self.handle_of(victim)
        for text in (victim, boss, "h", "", handle + "A", handle[:-1], "*", "../" + victim,
                     "x" * 65536):
            with self.subTest(text[:50]):
                self.refused(session("end", boss, handle=text), 406)
        self.assertEqual(len(session_ids()), 2)

    def test_needs_a_handle(self):
        sid = self.log_in("normal")
        self.refused(session("end", sid), 400, "handle")
        for handle in (1, True, [self.handle_of(sid)], {}):
            with self.subTest(handle):
                self.refused(session("end", sid, handle=handle), 400, "handle")
        self.refused(session("end", sid, handle=None), 406)
        self.assertEqual(session_ids(), [sid])

    def test_does_not_take_a_handle_for_an_id(self):
        sid = self.log_in("normal")
        self.refused(session("info", self.handle_of(sid)), 105)


if __name__ == "__main__":
    unittest.main()
