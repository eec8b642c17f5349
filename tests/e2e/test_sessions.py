"""Logging in, calling under a session, and all the ways to be refused."""

import http.client
import json
import os
import re
import shutil
import subprocess
import time

from case import Case
from client import ENTRY, Client, Reply, form
from webserver import HOST

PASSWORD = "correct horse, battery"


class Sessions(Case):
    def setUp(self):
        super().setUp()
        self.accounts("add", "ann", "--admin", password=PASSWORD)
        self.accounts("add", "bob", password=PASSWORD)
        self.addCleanup(self.forget)

    def accounts(self, *words, password=""):
        subprocess.run([str(self.server.root / "usr/bin/webapi-account"), *words],
                       input=password + "\n", text=True, check=True, capture_output=True)

    def forget(self):
        for name in ("ann", "bob"):
            self.accounts("remove", name)
        for folder in ("session", "throttle"):
            shutil.rmtree(self.server.root / "run/talo" / folder, ignore_errors=True)

    def open(self, account, password=PASSWORD, headers=None):
        return self.client.call("TALO.Session", "open", account=account,
                                passwd=json.dumps(password), headers=headers)

    def log_in(self, account):
        reply = self.open(account)
        self.assertEqual(reply.status, 200, reply)
        return reply.document()["data"]["sid"]

    def catalog(self, sid, client=None, headers=None):
        return (client or self.client).call("TALO.Catalog", "list",
                                            headers={"Cookie": f"id={sid}", **(headers or {})})

    def refuses(self, reply, code, text):
        self.fails(reply, code)
        self.assertEqual(reply.header("x-request-error"), text)

    def session_file(self, sid):
        return self.server.root / "run/talo/session" / sid


class LoggingIn(Sessions):
    def test_a_session_begins_serves_calls_and_ends(self):
        reply = self.open("ann")
        sid = reply.document()["data"]["sid"]
        self.succeeds(reply, {"account": "ann", "is_admin": True, "sid": sid})
        self.assertEqual(reply.header("Set-Cookie"),
                         f"id={sid}; Path=/; HttpOnly; SameSite=Strict")
        self.assertEqual(self.catalog(sid).document()["success"], True)
        self.succeeds(self.client.call("TALO.Session", "close", headers={"Cookie": f"id={sid}"}))
        self.refuses(self.catalog(sid), 105, "noprivilege")

    def test_a_parameter_names_the_session_as_well_as_a_cookie(self):
        sid = self.log_in("bob")
        reply = self.client.call("TALO.Catalog", "list", _sid=sid)
        self.assertTrue(reply.document()["success"], reply)
        reply = self.client.call("TALO.Catalog", "list", _sid=sid,
                                 headers={"Cookie": "id=" + "s" * 44})
        self.assertTrue(reply.document()["success"], reply)

    def test_without_a_session_there_is_none(self):
        self.refuses(self.client.call("TALO.Catalog", "list"), 119, "unauth")
        self.refuses(self.client.call("TALO.System", "info", version=2), 119, "unauth")

    def test_two_browsers_of_one_user_have_sessions_of_their_own(self):
        first, second = self.log_in("bob"), self.log_in("bob")
        self.assertNotEqual(first, second)
        self.succeeds(self.client.call("TALO.Session", "close", headers={"Cookie": f"id={first}"}))
        self.assertTrue(self.catalog(second).document()["success"])
        self.refuses(self.catalog(first), 105, "noprivilege")

    def test_a_compound_request_runs_under_the_callers_login(self):
        sid = self.log_in("ann")
        calls = [{"api": "TALO.System", "version": 2, "method": "info"},
                 {"api": "TALO.Catalog", "version": 1, "method": "list"},
                 {"api": "TALO.System", "version": 1, "method": "ping", "text": "hi"}]
        reply = self.client.call("TALO.Entry.Request", "request", compound=json.dumps(calls),
                                 headers={"Cookie": f"id={sid}"})
        data = reply.document()["data"]
        self.assertEqual([result["success"] for result in data["result"]], [True] * 3)
        self.assertFalse(data["has_fail"])


class Refusals(Sessions):
    def test_a_session_that_was_not_used_for_long_has_timed_out(self):
        sid = self.log_in("bob")
        long_ago = time.time() - 31 * 60
        os.utime(self.session_file(sid), (long_ago, long_ago))
        self.refuses(self.catalog(sid), 106, "timeout")

    def test_a_call_counts_as_a_use(self):
        sid = self.log_in("bob")
        before = time.time() - 20 * 60
        os.utime(self.session_file(sid), (before, before))
        self.assertTrue(self.catalog(sid).document()["success"])
        self.assertGreater(self.session_file(sid).stat().st_mtime, before + 60)

    def test_a_stolen_id_is_worth_nothing_at_another_address(self):
        sid = self.log_in("ann")
        connection = http.client.HTTPConnection(HOST, self.server.port, timeout=60,
                                                source_address=("127.0.0.2", 0))
        self.addCleanup(connection.close)
        query = form(api="TALO.Catalog", version=1, method="list")
        connection.request("GET", f"{ENTRY}?{query}", headers={"Cookie": f"id={sid}"})
        response = connection.getresponse()
        self.refuses(Reply(response.status, response.getheaders(), response.read()), 105,
                     "noprivilege")
        self.assertTrue(self.catalog(sid).document()["success"])

    def test_another_sites_page_is_refused(self):
        sid = self.log_in("ann")
        own = f"http://{HOST}:{self.server.port}"
        self.assertTrue(self.catalog(sid, headers={"Origin": own}).document()["success"])
        for headers in ({"Origin": "http://evil.example"}, {"Origin": "null"},
                        {"Sec-Fetch-Site": "cross-site"}):
            with self.subTest(headers):
                self.refuses(self.catalog(sid, headers=headers), 105, "noprivilege")
                self.fails(self.open("ann", headers=headers), 105)

    def test_ids_that_no_session_has(self):
        for sid in ("", "x", "s" * 4000,
                    "../accounts", "..%2f..%2fetc", "%2e%2e", "s" * 43 + "%00", "s" * 44):
            with self.subTest(sid[:50]):
                reply = self.catalog(sid)
                self.assertIn(reply.document()["error"]["code"], (105, 119))

    def test_wrong_passwords_are_throttled_and_the_right_one_works_after_the_wait(self):
        codes = [self.open("bob", "wrong").document()["error"]["code"] for _ in range(50)]
        self.assertEqual(codes[:5], [401] * 5)
        self.assertIn(403, codes)
        self.assertLess(codes.count(401), 15)
        reply = self.open("bob").document()
        if not reply["success"]:
            self.assertEqual(reply["error"]["code"], 403)
            wait = reply["error"]["errors"]["wait"]
            self.assertTrue(0 < wait <= 300, wait)
            time.sleep(wait + 1)
            self.assertTrue(self.open("bob").document()["success"])


class CookieLines(Case):
    def test_a_header_line_sets_a_cookie(self):
        reply = self.client.call("Test.Cookie", "set")
        self.succeeds(reply)
        self.assertEqual(reply.header("Set-Cookie"), "third=3; Path=/")

    def test_lines_without_a_header_name_set_none(self):
        reply = self.client.call("Test.Cookie", "add")
        self.assertIsNone(reply.header("Set-Cookie"))
        expected = self.by_server(lighttpd=200, nginx=502, apache=500)
        self.assertEqual(reply.status, expected, reply)

    def test_a_redirect_goes_to_a_path_of_the_same_host(self):
        reply = self.client.call("Test.Cookie", "redirect")
        self.assertEqual(reply.status, 302)
        self.assertTrue(re.search(r"://[^/]+/elsewhere$", reply.header("Location")), reply)
