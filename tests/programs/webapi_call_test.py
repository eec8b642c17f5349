"""webapi-call as a process."""

import json
import os
import pwd
import tempfile
import unittest

import installed
from installed import WEBAPI_CALL, environment, run


class WebapiCall(installed.ProbeTest):
    def call(self, *words, **options):
        options.setdefault("env", environment(PROBE_NAME=self.api))
        return run([WEBAPI_CALL, *words], **options)

    def parameters(self, *words, **options):
        """The parameters that the method saw."""
        result = self.call(self.api, "parameters", *words, **options)
        self.assertEqual(result.returncode, 0, result)
        params = json.loads(result.stdout)["data"]["params"]
        for name in ("api", "method", "version"):
            del params[name]
        return params

    def assert_wrong_usage(self, *words, **options):
        result = self.call(*words, **options)
        self.assertEqual(result.returncode, 2, result)
        self.assertEqual(result.stdout, b"")
        self.assertTrue(result.stderr.startswith(b"webapi-call: "), result.stderr)
        self.assertIn(b"usage: webapi-call API METHOD", result.stderr)

    def test_prints_the_indented_document_and_answers_0(self):
        result = self.call("TALO.System", "ping", "version=2", 'text="hello"')
        self.assertEqual(result.returncode, 0)
        self.assertEqual(result.stderr, b"")
        document = json.loads(result.stdout)
        self.assertEqual(
            document, {"data": {"text": "hello"}, "httpd_restart": False, "success": True}
        )
        self.assertIn(b'\n  "data"', result.stdout)

    def test_prints_one_line_when_compact(self):
        result = self.call("TALO.System", "ping", "--compact", "text=hi")
        self.assertEqual(result.returncode, 0)
        self.assertEqual(result.stdout.count(b"\n"), 1)
        self.assertEqual(json.loads(result.stdout)["data"], {"text": "hi"})

    def test_answers_1_for_an_error_of_the_api(self):
        for words, code in [
            (("TALO.System", "nothing"), 103),
            (("TALO.Nothing", "ping"), 102),
            (("TALO.System", "ping", "version=3"), 104),
            (("TALO.System", "ping", "version=0"), 101),
            (("TALO.System", "ping", "count=many"), 400),
            (("../../etc/x", "ping"), 102),
        ]:
            result = self.call(*words)
            self.assertEqual(result.returncode, 1, words)
            document = json.loads(result.stdout)
            self.assertIs(document["success"], False)
            self.assertEqual(document["error"]["code"], code, words)

    def test_answers_2_for_wrong_usage(self):
        self.assert_wrong_usage()
        self.assert_wrong_usage("TALO.System")
        self.assert_wrong_usage("TALO.System", "ping", "word")
        self.assert_wrong_usage("TALO.System", "ping", "=value")
        self.assert_wrong_usage("TALO.System", "ping", "version=two")
        self.assert_wrong_usage("TALO.System", "ping", "version=1.5")
        self.assert_wrong_usage("TALO.System", "ping", "version=2147483648")
        self.assert_wrong_usage("TALO.System", "ping", "--nothing")
        self.assert_wrong_usage("TALO.System", "ping", "-x")
        self.assert_wrong_usage("TALO.System", "ping", "--user")
        self.assert_wrong_usage("TALO.System", "ping", "--attrs", "[]")
        self.assert_wrong_usage("TALO.System", "ping", "--attrs", "{a:1}")
        self.assert_wrong_usage("TALO.System", "ping", "--params", "/nothing/here")
        self.assert_wrong_usage("TALO.System", "ping", "--params", "/tmp")

    def test_explains_itself(self):
        for words in (("--help",), ("TALO.System", "ping", "--help")):
            result = self.call(*words)
            self.assertEqual(result.returncode, 0)
            self.assertEqual(result.stderr, b"")
            self.assertTrue(result.stdout.startswith(b"usage: webapi-call API METHOD"))
            for option in (b"--user", b"--attrs", b"--params", b"--compact", b"Exit status"):
                self.assertIn(option, result.stdout)

    def test_reads_values_by_the_rules_of_a_request(self):
        rows = {
            "1": 1,
            "-1": -1,
            "007": "007",
            "01": "01",
            "1.5": 1.5,
            "1.": "1.",
            "true": True,
            "tru": "tru",
            "null": None,
            '"1"': "1",
            "": "",
            "text": "text",
            "a=b": "a=b",
            "a&b=c": "a&b=c",
            "a+b%41": "a+b%41",
            '["a", {"b": 1}]': ["a", {"b": 1}],
            "[1,]": "[1,]",
            "// 1": "// 1",
            "\u00e9": "\u00e9",
            "[" * 65 + "]" * 65: "[" * 65 + "]" * 65,
        }
        for text, value in rows.items():
            self.assertEqual(self.parameters(f"v={text}"), {"v": value}, text)

    def test_lets_a_later_word_replace_an_earlier_one(self):
        self.assertEqual(self.parameters("a=1", "b=2", "a=3"), {"a": 3, "b": 2})

    def test_calls_the_version_that_is_asked_for(self):
        for words, version in (((), 1), (("version=2",), 2), (("version=1",), 1)):
            result = self.call(self.api, "parameters", *words)
            params = json.loads(result.stdout)["data"]["params"]
            self.assertEqual(params["version"], version)

    def test_takes_parameters_from_a_file_and_words_on_top(self):
        with tempfile.NamedTemporaryFile("w", suffix=".json") as file:
            file.write('{"a": [1, "x&y"], "b": "007"}\n')
            file.flush()
            self.assertEqual(
                self.parameters("--params", file.name), {"a": [1, "x&y"], "b": "007"}
            )
            self.assertEqual(
                self.parameters("b=2", "--params", file.name, "c=3"),
                {"a": [1, "x&y"], "b": 2, "c": 3},
            )

    def test_takes_parameters_from_standard_input(self):
        options = {"stdin": None, "input": b' {"a": {"b": null}} '}
        self.assertEqual(self.parameters("--params", "-", **options), {"a": {"b": None}})
        for text in (b"", b"[1]", b"1", b"{", b"{} {}", b"{'a': 1}"):
            self.assert_wrong_usage(
                self.api, "parameters", "--params", "-", stdin=None, input=text
            )

    def test_passes_attributes(self):
        result = self.call(self.api, "parameters", "--attrs", '{"a": 1, "b": {"c": 2}}')
        self.assertEqual(json.loads(result.stdout)["data"]["attr"], {"a": 1, "b": {"c": 2}})

    def test_acts_as_the_caller_or_another_user(self):
        result = self.call(self.api, "process", "--user", "no-such-user-anywhere")
        data = json.loads(result.stdout)["data"]
        self.assertEqual((data["user"], data["admin"]), ("no-such-user-anywhere", False))
        self.assertEqual(data["environment"]["TALO_WEBAPI_USERNAME"], "no-such-user-anywhere")
        result = self.call(self.api, "process", "--user=root")
        data = json.loads(result.stdout)["data"]
        self.assertEqual((data["user"], data["admin"]), ("root", True))
        own = pwd.getpwuid(os.getuid()).pw_name
        data = json.loads(self.call(self.api, "process").stdout)["data"]
        self.assertEqual(data["user"], own)

    def test_works_from_any_directory(self):
        result = self.call("TALO.System", "ping", cwd="/")
        self.assertEqual(result.returncode, 0)

    def test_reads_a_file_named_from_where_it_was_called(self):
        with tempfile.TemporaryDirectory() as folder:
            with open(os.path.join(folder, "p.json"), "w", encoding="utf-8") as file:
                file.write('{"a": 1}')
            self.assertEqual(self.parameters("--params", "p.json", cwd=folder), {"a": 1})


if __name__ == "__main__":
    unittest.main()
