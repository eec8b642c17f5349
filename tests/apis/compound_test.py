"""TALO.Entry.Request: several calls in one, each with the caller's login."""

import time
import unittest

import appliance
from appliance import ApplianceTest, compound, element, last_use, leave_unused

PING = element("TALO.System", "ping")
INFO = element("TALO.System", "info", 2)
SESSION = element("TALO.Session", "info")
CATALOG = element("TALO.Catalog", "list")


def codes(reply):
    return [0 if result["success"] else result["error"]["code"]
            for result in reply.data["result"]]


class Compound(ApplianceTest):
    def test_answers_in_order_under_one_login(self):
        for where in ({"cookie": self.log_in("normal")}, {"_sid": self.log_in("normal")}):
            reply = compound([element("TALO.System", "ping", text="a"), SESSION, INFO, CATALOG],
                             **where)
            self.assertEqual(codes(reply), [0, 0, 0, 0])
            self.assertIs(reply.data["has_fail"], False)
            first, second, third, fourth = reply.data["result"]
            self.assertEqual(first, {"success": True, "data": {"text": "a"}, "api": "TALO.System",
                                     "version": 1, "method": "ping"})
            self.assertEqual((second["api"], second["data"]["account"]), ("TALO.Session", "normal"))
            self.assertEqual((third["api"], third["version"], third["method"]),
                             ("TALO.System", 2, "info"))
            self.assertIn("apis", fourth["data"])

    def test_refuses_each_element_that_needs_a_login_without_one(self):
        reply = compound([PING, INFO, PING, SESSION, CATALOG])
        self.assertEqual(codes(reply), [0, 119, 0, 119, 119])
        self.assertIs(reply.data["has_fail"], True)
        self.assertEqual(reply.header("x-request-error"), "unauth")

    def test_checks_the_rights_of_each_element(self):
        self.describe_api("Test.Admin", {
            "lib": "lib/TALO.System.so", "minVersion": 1, "maxVersion": 1, "authLevel": 1,
            "allowUser": ["admin.local"], "methods": {"1": ["run"]}})
        elements = [SESSION, element("Test.Admin", "run"), SESSION, PING]
        # Whoever passes the check learns that the library has no such method.
        for name, code in (("normal", 105), ("boss", 121)):
            reply = compound(elements, self.log_in(name))
            self.assertEqual(codes(reply), [0, code, 0, 0])
            for index in (0, 2):
                data = reply.data["result"][index]["data"]
                self.assertEqual((data["account"], data["is_admin"]), (name, name == "boss"))

    def test_does_not_log_in_the_elements_behind_an_open(self):
        opening = element("TALO.Session", "open", account="boss", passwd="Boss-pass")
        reply = compound([SESSION, opening, SESSION, INFO, CATALOG])
        self.assertEqual(codes(reply), [119, 0, 119, 119, 119])
        self.assertIsNone(reply.cookie)
        sid = self.log_in("normal")
        reply = compound([opening, SESSION], sid)
        self.assertEqual(codes(reply), [0, 0])
        self.assertEqual(reply.data["result"][1]["data"]["account"], "normal")

    def test_does_not_take_a_session_from_an_element(self):
        boss = self.log_in("boss")
        self.assertEqual(codes(compound([{**SESSION, "_sid": boss}, {**INFO, "_sid": boss}])),
                         [119, 119])
        reply = compound([{**SESSION, "_sid": boss}], self.log_in("normal"))
        self.assertEqual(reply.data["result"][0]["data"]["account"], "normal")

    def test_ends_a_session_for_the_elements_behind_it(self):
        reply = compound([SESSION, element("TALO.Session", "close"), SESSION, INFO],
                         self.log_in("normal"))
        self.assertEqual(codes(reply), [0, 0, 105, 105])

    def test_skips_the_rest_after_a_failure_when_asked(self):
        wrong = element("TALO.System", "ping", count="x")
        sid = self.log_in("normal")
        self.assertEqual(codes(compound([PING, wrong, INFO, PING], sid, stop_when_error=True)),
                         [0, 400, 112, 112])
        self.assertEqual(codes(compound([PING, wrong, INFO, PING], sid)), [0, 400, 0, 0])

    def test_nests_three_deep(self):
        elements = [SESSION, PING, INFO]
        for _ in range(3):
            elements = [element("TALO.Entry.Request", "request", compound=elements), SESSION]
        reply = compound(elements, self.log_in("normal"))
        for _ in range(3):
            self.assertEqual(codes(reply), [0, 0])
            self.assertIs(reply.data["has_fail"], False)
            self.assertEqual(reply.data["result"][1]["data"]["account"], "normal")
            reply = _Inner(reply.data["result"][0]["data"])
        self.assertEqual(codes(reply), [0, 0, 0])
        self.assertEqual(reply.data["result"][0]["data"]["account"], "normal")

    def test_runs_a_thousand_elements(self):
        elements = [element("TALO.System", "ping", count=number) if number % 2 else SESSION
                    for number in range(1000)]
        results = compound(elements, self.log_in("normal")).data["result"]
        self.assertEqual(len(results), 1000)
        for number, result in enumerate(results):
            self.assertTrue(result["success"], result)
            if number % 2:
                self.assertEqual(result["data"], {"count": number})
            else:
                self.assertEqual(result["data"]["account"], "normal")

    def test_answers_101_in_the_place_of_what_is_no_element(self):
        reply = compound([PING, 1, None, "x", [], {"api": ""}, PING], self.log_in("normal"))
        self.assertEqual(codes(reply), [0, 101, 101, 101, 101, 101, 0])
        self.assertIs(reply.data["has_fail"], True)

    def test_needs_a_list(self):
        sid = self.log_in("normal")
        for elements in ({}, "x", 1, None):
            self.refused(compound(elements, sid), 110)
        self.refused(appliance.call("TALO.Entry.Request", "request", 1, sid), 110)
        self.assertEqual(compound([], sid).data, {"result": [], "has_fail": False})

    def test_renews_the_session_when_an_element_does(self):
        sid = self.log_in("normal")
        leave_unused(sid, 600)
        before = last_use(sid)
        compound([PING, SESSION], sid)
        self.assertEqual(last_use(sid), before)
        now = time.time()
        compound([SESSION, CATALOG], sid)
        self.assertGreaterEqual(last_use(sid), now - 1)

    def test_is_as_closed_to_thieves_as_a_single_call(self):
        sid = self.log_in("normal")
        moved = {"REMOTE_ADDR": "203.0.113.5"}
        elsewhere = {"HTTP_ORIGIN": "http://evil.example"}
        self.assertEqual(codes(compound([PING, SESSION, CATALOG], sid, moved)), [0, 107, 105])
        self.assertEqual(codes(compound([PING, SESSION, CATALOG], sid, elsewhere)), [0, 105, 105])
        leave_unused(sid, 31 * 60)
        self.assertEqual(codes(compound([PING, SESSION, CATALOG], sid)), [0, 106, 106])


class _Inner:
    """The data of a compound within a compound, read like a reply's."""

    def __init__(self, data):
        self.data = data


if __name__ == "__main__":
    unittest.main()
