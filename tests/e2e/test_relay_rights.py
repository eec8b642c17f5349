"""For whom an appliance lets another one call it, and how far a call goes on."""

import os
import time

from client import form
from multipart import Content, Form, upload
from relay_case import (  # noqa: F401
    ALL, RelayCase, RelayError, only_with_lighttpd as load_tests, start_appliances)

MEBIBYTE = 1 << 20


def setUpModule():
    start_appliances()


class SessionsThere(RelayCase):
    """The session that the first has at the second for a user."""

    def setUp(self):
        super().setUp()
        self.lets_call()
        self.ann = self.log_in("ann")

    def session(self):
        self.assertEqual(self.echo(self.ann)["user"], "ann")
        [sid] = self.second.sessions()
        return sid

    def test_is_opened_once_for_each_user(self):
        sid = self.session()
        self.assertEqual(self.session(), sid)
        self.assertEqual(self.echo(self.first.log_in("ann"))["user"], "ann")
        self.assertEqual(self.second.sessions(), [sid])
        self.assertEqual(self.echo(self.log_in("bob"))["user"], "bob")
        self.assertEqual(len(self.second.sessions()), 2)

    def test_is_kept_where_nobody_else_reads_it(self):
        sid = self.session()
        [kept] = self.first.kept_sessions()
        self.assertIn(sid, kept.read_text())
        self.assertEqual(kept.stat().st_mode & 0o777, 0o600)
        self.assertEqual(kept.parent.stat().st_mode & 0o777, 0o700)

    def test_is_opened_anew_once_it_is_gone(self):
        sid = self.session()
        self.second.session_file(sid).unlink()
        self.assertNotEqual(self.session(), sid)

    def test_is_opened_anew_once_it_has_timed_out(self):
        sid = self.session()
        long_ago = time.time() - 31 * 60
        os.utime(self.second.session_file(sid), (long_ago, long_ago))
        self.assertEqual(self.echo(self.ann)["user"], "ann")
        self.assertNotEqual(self.second.sessions(), [sid])

    def test_is_opened_anew_when_what_was_kept_is_damaged(self):
        self.session()
        [kept] = self.first.kept_sessions()
        for text in ("", "x", "s" * 44, "\0", "x\r\nX-Evil: 1", "s" * 100000):
            with self.subTest(text[:20]):
                kept.write_text(text)
                self.assertEqual(self.echo(self.ann)["user"], "ann")


class Rights(RelayCase):
    """For whom the second lets itself be called."""

    def refuses(self, sid, **parameters):
        self.relay_fails(RelayError.REFUSED, lambda: self.call(sid, **parameters))

    def direct(self, sid):
        return self.second.client().call("Test.Relay", "echo", _sid=sid).document()

    def test_a_caller_without_a_session_is_refused_here(self):
        self.lets_call()
        self.fails(self.call(""), 119)
        self.fails(self.call("", api="TALO.System", method="ping"), 119)
        self.fails(self.call("s" + "x" * 43), 105)
        self.assertEqual(self.second.sessions(), [])

    def test_a_caller_whose_session_has_timed_out_is_refused_here(self):
        self.lets_call()
        sid = self.log_in("bob")
        long_ago = time.time() - 31 * 60
        os.utime(self.first.session_file(sid), (long_ago, long_ago))
        self.fails(self.call(sid), 106)
        self.assertEqual(self.second.sessions(), [])

    def test_users_of_a_class_that_was_not_granted_are_refused_there(self):
        ann, bob = self.log_in("ann"), self.log_in("bob")
        for classes, accepted, refused in ((("normal.local",), bob, ann),
                                           (("admin.local",), ann, bob)):
            with self.subTest(classes):
                self.lets_call(*classes)
                self.assertEqual(self.echo(accepted)["application"], "relay")
                self.refuses(refused)

    def test_without_classes_ordinary_users_are_granted(self):
        self.first.may_call(self.second)
        self.assertEqual(self.echo(self.log_in("bob"))["user"], "bob")
        self.refuses(self.log_in("ann"))

    def test_users_that_the_other_does_not_have_are_refused_there(self):
        self.lets_call()
        self.first.add_account("only-here")
        self.addCleanup(self.first.accounts, "remove", "only-here")
        self.refuses(self.first.log_in("only-here"))

    def test_users_that_are_locked_there_are_refused_at_once(self):
        self.lets_call()
        sid = self.log_in("bob")
        self.echo(sid)
        self.second.accounts("lock", "bob")
        self.addCleanup(self.second.accounts, "unlock", "bob")
        self.refuses(sid)

    def test_a_wrong_secret_is_refused(self):
        self.lets_call()
        self.first.reaches(2, self.second.url, "A" * 43, self.second.authority)
        self.refuses(self.log_in("bob"))

    def test_an_appliance_that_may_not_call_is_refused(self):
        self.first.reaches(2, self.second.url, "A" * 43, self.second.authority)
        self.refuses(self.log_in("bob"))

    def test_an_upload_is_refused_before_it_is_sent(self):
        self.lets_call("normal.local")
        content = Content(8 * MEBIBYTE)
        call = form(api="Test.Relay", version=2, method="take", relay_nd=2,
                    _sid=self.log_in("ann"))
        self.relay_fails(RelayError.REFUSED, lambda: upload(
            self.client, call, Form().field("keep", self.folder).file("file", "x", content)))
        self.assertEqual(list(self.folder.iterdir()), [])

    def session_there(self, user):
        sid = self.first.log_in(user)
        self.echo(sid)
        [there] = self.second.sessions()
        self.assertEqual(self.direct(there)["data"]["user"], user)
        return sid, there

    def ended(self, sid, there):
        document = self.direct(there)
        self.assertEqual((document["success"], document["error"]["code"]), (False, 105))
        self.refuses(sid)

    def test_forgetting_an_appliance_ends_its_sessions_at_once(self):
        self.lets_call()
        sid, there = self.session_there("bob")
        self.second.forgets(1)
        self.ended(sid, there)

    def test_narrowing_what_was_granted_counts_at_once(self):
        self.lets_call()
        sid, there = self.session_there("ann")
        self.second.accepts(self.first, "normal.local")
        self.assertEqual(self.direct(there)["error"]["code"], 105)
        self.fails(self.call(sid), 109)

    def test_a_user_who_became_administrator_is_no_ordinary_one_any_more(self):
        self.lets_call("normal.local")
        sid, there = self.session_there("bob")
        self.second.accounts("groups", "bob", "administrators")
        self.addCleanup(self.second.accounts, "groups", "bob", "--none")
        self.ended(sid, there)

    def test_who_may_be_called_may_not_call_back(self):
        self.lets_call()
        self.second.reaches(1, self.first.url, "A" * 43, self.first.authority)
        sid = self.second.log_in("bob")
        reply = self.second.client().call("Test.Relay", "echo", relay_nd=1, _sid=sid)
        self.fails(reply, 109)


class Loops(RelayCase):
    def test_a_call_may_go_on_over_another_appliance(self):
        self.second.may_call(self.third, *ALL)
        self.first.may_call(self.second, *ALL, query="?relay_nd=3")
        data = self.echo(self.log_in("ann"), a="b")
        self.assertEqual((data["user"], data["hops"], data["params"]["a"]), ("ann", "2", "b"))
        self.assertEqual(len(self.third.sessions()), 1)

    def ends(self, last):
        """It is this one that makes no fifth hop; the others pass on its answer."""
        sid = self.log_in("ann")
        before = time.monotonic()
        self.relay_fails(RelayError.TOO_MANY_HOPS, lambda: self.call(sid), last.log)
        self.assertLess(time.monotonic() - before, 10)

    def test_of_two_ends(self):
        self.first.may_call(self.second, *ALL, query="?relay_nd=1")
        self.second.may_call(self.first, *ALL, query="?relay_nd=2")
        # first, second, first, second, first
        self.ends(self.first)

    def test_of_three_ends(self):
        self.first.may_call(self.second, *ALL, query="?relay_nd=3")
        self.second.may_call(self.third, *ALL, query="?relay_nd=1")
        self.third.may_call(self.first, *ALL, query="?relay_nd=2")
        # first, second, third, first, second
        self.ends(self.second)

    def test_of_one_ends(self):
        secret = self.first.accepts(self.first, *ALL)
        self.first.accounts("node", "add", 1, "--url", self.first.url + "?relay_nd=1", "--self",
                            1, "--authority", self.first.authority, given=secret)
        sid = self.log_in("ann")
        self.relay_fails(RelayError.TOO_MANY_HOPS, lambda: self.call(sid, relay_nd=1))
