"""TALO.Catalog: what the caller may call, and nothing else."""

import json
import unittest

import appliance
from appliance import ApplianceTest, catalog

SHIPPED = ("TALO.Catalog", "TALO.Entry.Request", "TALO.Relay", "TALO.Session", "TALO.System",
           "TALO.Task")
DESCRIPTION = {"lib": "lib/none.so", "minVersion": 1, "maxVersion": 1, "methods": {"1": ["run"]}}


class Catalog(ApplianceTest):
    def listed(self, sid):
        return {entry["name"]: entry for entry in catalog("list", sid).data["apis"]}

    def test_needs_a_login(self):
        for method in ("list", "describe"):
            self.refused_as(catalog(method, name="TALO.System"), 119, "unauth")
            self.refused_as(catalog(method, "s" + "A" * 43, name="TALO.System"), 105, "noprivilege")

    def test_lists_the_shipped_apis_for_everybody(self):
        for name in ("normal", "boss"):
            self.assertLessEqual(set(SHIPPED), set(self.listed(self.log_in(name))))

    def test_lists_every_version_and_method_that_a_description_offers(self):
        apis = self.listed(self.log_in("normal"))
        for name in SHIPPED:
            path = appliance.WEBAPI_DIR / f"{name}.lib"
            description = json.loads(path.read_text(encoding="utf-8"))[name]
            offered = {
                version: sorted(name for entry in entries
                                for name in (entry if isinstance(entry, dict) else [entry]))
                for version, entries in description["methods"].items()
            }
            with self.subTest(name):
                self.assertEqual(
                    {version: sorted(methods) for version, methods
                     in apis[name]["versions"].items()}, offered)
                self.assertEqual(apis[name]["min_version"], description["minVersion"])
                self.assertEqual(apis[name]["max_version"], description["maxVersion"])
                self.assertEqual(apis[name]["auth_level"], description["authLevel"])

    def test_shows_the_attributes_of_a_method(self):
        methods = catalog("describe", self.log_in("normal"),
                          name="TALO.Session").data["versions"]["1"]
        self.assertIs(methods["close"]["attributes"]["allowTimeout"], True)
        self.assertIs(methods["info"]["attributes"]["passive"], True)
        self.assertIs(methods["list"]["attributes"]["allowTimeout"], False)
        self.assertNotIn("passive", methods["list"]["attributes"])

    def test_documents_everything_that_is_shipped(self):
        apis = self.listed(self.log_in("normal"))
        for name in SHIPPED:
            self.assertTrue(apis[name]["summary"], name)
            for version, methods in apis[name]["versions"].items():
                for method, shown in methods.items():
                    with self.subTest((name, version, method)):
                        self.check_documentation(shown["doc"])

    def check_documentation(self, doc):
        self.assertTrue(doc["summary"])
        for name, parameter in doc["params"].items():
            self.assertEqual(sorted(parameter), ["required", "text", "type"], name)
            self.assertIn(parameter["type"],
                          ("string", "integer", "number", "boolean", "array", "object"))
            self.assertIsInstance(parameter["required"], bool)
            self.assertTrue(parameter["text"])

    def test_describes_one_api_as_it_lists_it(self):
        sid = self.log_in("normal")
        for name, entry in self.listed(sid).items():
            self.assertEqual(catalog("describe", sid, name=name).data, entry)

    def test_shows_an_administrators_api_to_administrators_only(self):
        self.describe_api("Test.Admin", {**DESCRIPTION, "authLevel": 1,
                                         "allowUser": ["admin.local"]})
        normal, boss = self.log_in("normal"), self.log_in("boss")
        self.assertNotIn("Test.Admin", self.listed(normal))
        self.refused(catalog("describe", normal, name="Test.Admin"), 401, "Test.Admin")
        self.assertIn("Test.Admin", self.listed(boss))
        self.assertEqual(catalog("describe", boss, name="Test.Admin").data["name"], "Test.Admin")

    def test_shows_an_applications_api_to_who_may_use_the_application(self):
        self.describe_api("Test.Photo", {**DESCRIPTION, "authLevel": 1, "appPriv": "TALO.Photo"})
        sid = self.log_in("normal")
        self.assertNotIn("Test.Photo", self.listed(sid))
        appliance.account("grant", "normal", "TALO.Photo", "--network", "192.0.2.0/24")
        try:
            self.assertIn("Test.Photo", self.listed(sid))
        finally:
            appliance.account("revoke", "normal", "TALO.Photo")
        self.assertNotIn("Test.Photo", self.listed(sid))

    def test_shows_an_api_whose_login_is_by_default_or_optional(self):
        self.describe_api("Test.Default", DESCRIPTION)
        self.describe_api("Test.Nobody", {**DESCRIPTION, "authLevel": 1, "allowUser": []})
        self.describe_api("Test.Optional", {**DESCRIPTION, "authLevel": 2, "allowUser": []})
        self.describe_api("Test.Open", {**DESCRIPTION, "authLevel": 0, "allowUser": []})
        listed = self.listed(self.log_in("normal"))
        self.assertIn("Test.Default", listed)
        self.assertNotIn("Test.Nobody", listed)
        self.assertIn("Test.Optional", listed)
        self.assertIn("Test.Open", listed)
        self.assertEqual(listed["Test.Default"]["auth_level"], 1)

    def test_lists_only_versions_that_can_be_called(self):
        methods = {"0": ["a"], "1": ["b"], "2": ["c"], "3": ["d"], "02": ["e"], "x": ["f"]}
        self.describe_api("Test.Versions", {**DESCRIPTION, "minVersion": 2, "maxVersion": 2,
                                            "methods": methods})
        entry = catalog("describe", self.log_in("normal"), name="Test.Versions").data
        self.assertEqual(sorted(entry["versions"]), ["2"])
        self.assertEqual(sorted(entry["versions"]["2"]), ["c"])
        self.assertNotIn("summary", entry)
        self.assertNotIn("doc", entry["versions"]["2"]["c"])

    def test_lists_by_name_and_once_what_several_files_describe(self):
        """The file whose name comes last counts."""
        closed = {**DESCRIPTION, "authLevel": 1, "allowUser": []}
        for first, last, is_listed in ((closed, DESCRIPTION, True), (DESCRIPTION, closed, False)):
            for name, description in (("Test.Twice", first), ("Test.Zwice", last)):
                path = appliance.WEBAPI_DIR / f"{name}.lib"
                self.addCleanup(path.unlink, missing_ok=True)
                path.write_text(json.dumps({"Test.Twice": description,
                                            "Another." + name: DESCRIPTION}), encoding="utf-8")
            names = [entry["name"] for entry in
                     catalog("list", self.log_in("normal")).data["apis"]]
            self.assertEqual(names, sorted(names))
            self.assertEqual(names.count("Test.Twice"), int(is_listed))
            self.assertIn("Another.Test.Twice", names)

    def test_survives_documentation_that_is_none(self):
        for number, doc in enumerate(("text", 1, [], None, {"summary": 1, "methods": []},
                                      {"methods": {"run": "text"}}, {"methods": None})):
            with self.subTest(doc):
                name = f"Test.Doc{number}"
                self.describe_api(name, {**DESCRIPTION, "doc": doc})
                entry = catalog("describe", self.log_in("normal"), name=name).data
                self.assertNotIn("summary", entry)
                self.assertNotIn("doc", entry["versions"]["1"]["run"])

    def test_knows_nothing_of_what_is_no_api(self):
        sid = self.log_in("normal")
        for name in ("TALO.Nothing", "", "lib.def", "../webapi/TALO.System", "TALO.System.lib",
                     "talo.system", "TALO", "/etc/passwd", "TALO.System\0", "x" * 5000, "*"):
            with self.subTest(name[:40]):
                self.refused(catalog("describe", sid, name=name), 401, name)

    def test_needs_a_name(self):
        sid = self.log_in("normal")
        self.refused(catalog("describe", sid), 400, "name")
        for name in (1, True, ["TALO.System"], {}):
            self.refused(catalog("describe", sid, name=name), 400, "name")
        self.refused(catalog("describe", sid, name=None), 401, "")


if __name__ == "__main__":
    unittest.main()
