"""TALO.System: the way to an API library, and the machine itself."""

import platform
import unittest

from appliance import ApplianceTest, call


def info(cookie=None, version=2, **parameters):
    return call("TALO.System", "info", version, cookie, **parameters)


class System(ApplianceTest):
    def test_ping_needs_no_login(self):
        for version in (1, 2):
            self.assertEqual(call("TALO.System", "ping", version, text="a", count=2).data,
                             {"text": "a", "count": 2})

    def test_ping_asks_nothing_of_a_session_that_is_none(self):
        for cookie in ("s" + "A" * 43, "garbage"):
            self.assertEqual(call("TALO.System", "ping", 1, cookie).code, 0)

    def test_ping_names_the_parameter_that_is_wrong(self):
        self.refused(call("TALO.System", "ping", 1, text=1), 400, "text")
        self.refused(call("TALO.System", "ping", 1, count="x"), 400, "count")

    def test_info_needs_a_login(self):
        self.refused_as(info(), 119, "unauth")
        self.refused(info("s" + "A" * 43), 105)
        for name in ("normal", "boss"):
            sid = self.log_in(name)
            self.assertEqual(info(sid).data["hostname"], platform.node())
            self.assertEqual(info(_sid=sid).data["kernel"], platform.release())

    def test_info_tells_about_the_machine(self):
        data = info(self.log_in("normal")).data
        self.assertEqual(sorted(data), ["hostname", "kernel", "load", "machine", "memory",
                                        "uptime"])
        self.assertEqual(data["machine"], platform.machine())
        self.assertGreater(data["uptime"], 0)
        self.assertEqual(len(data["load"]), 3)
        self.assertTrue(0 < data["memory"]["free"] < data["memory"]["total"])

    def test_info_is_not_of_version_1(self):
        self.refused(info(self.log_in("normal"), version=1), 103)

    def test_info_is_not_for_another_sites_page(self):
        sid = self.log_in("normal")
        self.refused(info(sid, variables={"HTTP_ORIGIN": "http://evil.example"}), 105)
        self.refused(info(sid, variables={"REMOTE_ADDR": "203.0.113.5"}), 107)


if __name__ == "__main__":
    unittest.main()
