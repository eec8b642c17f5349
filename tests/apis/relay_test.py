"""TALO.Relay: another appliance acts for a user here, and how far."""

import json
import os
import pathlib
import subprocess
import unittest

import appliance
from appliance import ApplianceTest, call, catalog, compound, element, session, session_ids

NODES_FILE = appliance.ROOT / "etc/talo/nodes"
NODE = 7
PAGE = ({"HTTP_ORIGIN": "http://nas.local"}, {"HTTP_ORIGIN": "http://evil.example"},
        {"HTTP_ORIGIN": "null"}, {"HTTP_SEC_FETCH_SITE": "same-origin"},
        {"HTTP_SEC_FETCH_SITE": "cross-site"}, {"HTTP_SEC_FETCH_SITE": "none"},
        {"HTTP_SEC_FETCH_MODE": "navigate"}, {"HTTP_SEC_FETCH_DEST": "document"})

REFUSED_HEADERS = ["Content-type", "Cache-Control", "Pragma", "Expires"]


def administer(*words):
    """Runs webapi-account and answers what it prints."""
    return subprocess.run([os.environ["WEBAPI_ACCOUNT"], *words], check=True, input=b"shown\n",
                          stdout=subprocess.PIPE, timeout=appliance.TIMEOUT).stdout.decode()


def accept(node=NODE, *classes):
    """Lets an appliance act for users and answers its secret."""
    options = [word for name in classes for word in ("--class", name)]
    return administer("node", "add", str(node), "--accept", *options).strip()


def forget_nodes():
    for path in NODES_FILE.parent.glob("nodes*"):
        path.unlink()


class RelayTest(ApplianceTest):
    def setUp(self):
        super().setUp()
        forget_nodes()
        self.addCleanup(forget_nodes)

    def ask(self, secret, user="normal", node=NODE, variables=None, **parameters):
        """Every parameter as JSON, as an appliance sends them."""
        values = {"node": node, "secret": secret, "user": user, **parameters}
        return call("TALO.Relay", "open", variables=variables,
                    **{name: json.dumps(value) for name, value in values.items()
                       if value is not ...})

    def act(self, secret, user="normal", **more):
        return self.ask(secret, user, **more).data["sid"]

    def not_opened(self, reply):
        """One answer, whatever the reason is."""
        self.assertEqual(reply.body, {"success": False, "error": {"code": 500}}, reply)
        self.assertEqual([name for name, _ in reply.headers], REFUSED_HEADERS)
        self.assertEqual(session_ids(), [])


class Open(RelayTest):
    def test_begins_a_session_for_the_user(self):
        reply = self.ask(accept(), lang="fre")
        sid = reply.data["sid"]
        self.assertEqual(reply.data, {"sid": sid})
        self.assertIsNone(reply.cookie)
        self.assertEqual(session_ids(), [sid])
        data = session("info", sid).data
        self.assertEqual((data["account"], data["address"], data["is_admin"], data["node"]),
                         ("normal", appliance.ADDRESS, False, NODE))
        record = json.loads((appliance.SESSION_DIR / sid).read_text(encoding="utf-8"))
        self.assertEqual((record["application"], record["language"], record["node"]),
                         ("relay", "fre", NODE))
        self.assertFalse(record["skipAddress"])
        self.assertEqual((record["privilege"], record["timeout"]), ("", 0))

    def test_begins_another_one_each_time(self):
        secret = accept()
        self.assertEqual(len({self.act(secret) for _ in range(3)}), 3)

    def test_needs_no_language(self):
        secret = accept()
        for language in (..., "", None, "enu", "de_AT", "x" * 16):
            with self.subTest(language):
                self.assertEqual(self.ask(secret, lang=language).code, 0)

    def test_takes_texts_that_a_form_sends_as_they_stand(self):
        secret = accept()
        reply = call("TALO.Relay", "open", node=NODE, secret=secret, user="normal", lang="enu")
        self.assertEqual(session("info", reply.data["sid"]).data["account"], "normal")

    def test_may_be_an_element_of_a_compound(self):
        secret = accept()
        opening = element("TALO.Relay", "open", node=NODE, secret=secret, user="normal")
        reply = compound([opening], self.log_in("other"))
        self.assertEqual(list(reply.data["result"][0]["data"]), ["sid"])


class Refuses(RelayTest):
    def test_who_does_not_prove_to_be_the_appliance(self):
        secret, other = accept(), accept(8)
        for wrong in ("", "x", secret[:-1], secret + "A", secret + " ", secret.swapcase(), other,
                      secret + "\0", "x" * 65536):
            with self.subTest(wrong[:60]):
                self.not_opened(self.ask(wrong))
        for node in (0, -NODE, 1, 8, 77, 2**63 - 1):
            with self.subTest(node):
                self.not_opened(self.ask(secret, node=node))

    def test_the_hash_in_the_place_of_the_secret(self):
        accept()
        stored = json.loads(NODES_FILE.read_text(encoding="utf-8"))
        self.not_opened(self.ask(stored["accepts"]["secret_hash"]))

    def test_an_appliance_that_is_only_called(self):
        administer("node", "add", "7", "--url", "https://nas7.local/", "--self", "1")
        for secret in ("shown", ""):
            self.not_opened(self.ask(secret))

    def test_an_account_that_there_is_not_or_that_may_not_log_in(self):
        secret = accept()
        for name in ("", "nobody", "Normal", "normal ", "../normal", "normal\0", "x" * 65536):
            with self.subTest(name[:60]):
                self.not_opened(self.ask(secret, name))
        appliance.account("lock", "normal")
        self.addCleanup(appliance.account, "unlock", "normal")
        self.not_opened(self.ask(secret))

    def test_a_user_of_a_class_that_was_not_granted(self):
        for granted, allowed in ((("normal.local",), "normal"), (("admin.local",), "boss"),
                                 (("normal.domain", "admin.ldap"), None)):
            secret = accept(NODE, *granted)
            for name in ("normal", "boss"):
                with self.subTest((granted, name)):
                    appliance.forget_sessions()
                    if name == allowed:
                        self.act(secret, name)
                    else:
                        self.not_opened(self.ask(secret, name))

    def test_an_administrator_unless_that_was_said(self):
        secret = accept()
        self.not_opened(self.ask(secret, "boss"))
        self.not_opened(self.ask(secret, "root"))

    def test_a_page_of_whatever_site(self):
        secret = accept()
        for variables in PAGE:
            with self.subTest(variables):
                self.not_opened(self.ask(secret, variables=variables))

    def test_parameters_that_are_missing_or_of_another_type(self):
        secret = accept()
        for name in ("node", "secret", "user"):
            with self.subTest(name):
                self.not_opened(self.ask(**{"secret": secret, name: ...}))
            for value in (None, True, [NODE], {"a": 1}, 1.5, ""):
                with self.subTest((name, value)):
                    self.not_opened(self.ask(**{"secret": secret, name: value}))
        self.not_opened(self.ask(secret, 7))
        self.not_opened(self.ask(7))

    def test_a_language_that_is_none(self):
        secret = accept()
        for language in (7, True, ["enu"], "e n", "enu\n", "../enu", "x" * 17, "\u00e9", "e\0"):
            with self.subTest(language):
                self.not_opened(self.ask(secret, lang=language))

    def test_everybody_when_others_may_read_the_file(self):
        secret = accept()
        NODES_FILE.chmod(0o640)
        self.not_opened(self.ask(secret))

    def test_everybody_without_the_module_that_hashes(self):
        secret = accept()
        module, = pathlib.Path(appliance.ROOT, "usr").rglob("talo-digest.so")
        hidden = module.rename(module.with_name("hidden.so"))
        self.addCleanup(hidden.rename, module)
        self.not_opened(self.ask(secret))


class Session(RelayTest):
    """What a session is good for that an appliance has opened."""

    def ended(self, sid):
        self.refused(session("info", sid), 105)
        self.refused_as(catalog("list", sid), 105, "noprivilege")

    def test_does_what_its_user_may(self):
        sid = self.act(accept())
        self.assertEqual(catalog("list", sid).code, 0)
        self.assertEqual(session("close", sid).code, 0)

    def test_is_bound_to_the_address_of_the_appliance(self):
        sid = self.act(accept())
        self.refused(session("info", sid, {"REMOTE_ADDR": "203.0.113.5"}), 107)

    def test_ends_with_the_appliance(self):
        sid = self.act(accept())
        administer("node", "remove", str(NODE))
        self.ended(sid)

    def test_ends_when_the_appliance_is_only_called(self):
        sid = self.act(accept())
        forget_nodes()
        administer("node", "add", str(NODE), "--url", "https://nas7.local/", "--self", "1")
        self.ended(sid)

    def test_ends_when_the_grant_is_narrowed(self):
        sid = self.act(accept(NODE, "normal.local", "admin.local"))
        accept(NODE, "admin.local")
        self.ended(sid)

    def test_ends_with_the_lock_of_the_account(self):
        sid = self.act(accept())
        appliance.account("lock", "normal")
        self.addCleanup(appliance.account, "unlock", "normal")
        self.ended(sid)

    def test_gains_nothing_when_the_account_is_promoted(self):
        sid = self.act(accept())
        appliance.account("groups", "normal", "administrators")
        self.addCleanup(appliance.account, "groups", "normal", "--none")
        self.ended(sid)

    def test_counts_no_more_when_the_file_is_not_believed(self):
        sid = self.act(accept())
        NODES_FILE.chmod(0o604)
        self.ended(sid)

    def test_ends_with_the_secret_that_opened_it(self):
        old = accept()
        self.act(old)
        own = self.log_in("normal")
        other = self.act(accept(8), node=8)
        self.assertNotEqual(accept(), old)
        self.assertEqual(session_ids(), sorted([own, other]))
        appliance.forget_sessions()
        self.not_opened(self.ask(old))

    def test_does_not_come_back_with_its_appliance(self):
        sid = self.act(accept())
        administer("node", "remove", str(NODE))
        accept()
        self.ended(sid)

    def test_stays_when_only_the_way_back_is_told(self):
        sid = self.act(accept())
        administer("node", "add", str(NODE), "--url", "https://nas7.local/", "--self", "1")
        self.assertEqual(session("info", sid).code, 0)

    def test_shows_its_appliance_in_the_list(self):
        own = self.log_in("normal")
        self.act(accept())
        nodes = [entry.get("node") for entry in session("list", own).data["sessions"]]
        self.assertEqual(sorted(nodes, key=str), [NODE, None])
        self.assertNotIn("node", session("info", own).data)


if __name__ == "__main__":
    unittest.main()
