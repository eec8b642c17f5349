"""A run of tests ends with what failed, and how."""

import os
import pathlib
import subprocess
import tempfile
import unittest

PROJECT = pathlib.Path(__file__).resolve().parents[2]
RUN = """set -eu
. "$1/scripts/lib/common.sh"
. "$1/scripts/lib/build.sh"
build_folder() { echo "$FOLDER"; }
run_tests any
"""
SUITE = """\
[ RUN      ] Suite.Good
noise of a good case
[       OK ] Suite.Good (0 ms)
[ RUN      ] Suite.Bad
Value of: truth
[  FAILED  ] Suite.Bad (0 ms)
""" + "[ RUN      ] Suite.Other\n[       OK ] Suite.Other (0 ms)\n" * 100


class RunTests(unittest.TestCase):
    def run_with(self, tests, *properties):
        """Status, and the lines after CTest's summary, of a run of tests: shell lines
        by name."""
        with tempfile.TemporaryDirectory() as folder:
            lines = [f"add_test({name} /bin/sh [==[-c]==] [==[{line}]==])"
                     for name, line in tests.items()]
            path = pathlib.Path(folder) / "CTestTestfile.cmake"
            path.write_text("\n".join([*lines, *properties]) + "\n")
            (pathlib.Path(folder) / "suite").write_text(SUITE)
            ran = subprocess.run(
                ["bash", "-c", RUN, "bash", PROJECT], env={**os.environ, "FOLDER": folder},
                stdout=subprocess.PIPE, stderr=subprocess.STDOUT, timeout=50, check=False,
                encoding="utf-8", errors="replace")
            after = ran.stdout.partition("Errors while running CTest\n")[2]
            return ran.returncode, after.splitlines()

    def test_that_all_pass_ends_with_the_summary(self):
        self.assertEqual(self.run_with({"good": "echo fine"}), (0, []))

    def test_with_a_failure_fails_and_ends_with_its_name(self):
        status, lines = self.run_with({"good": "echo fine", "bad": "echo reason; exit 3"})
        self.assertNotEqual(status, 0)
        self.assertEqual(lines[-1], "1 failed: bad")
        self.assertIn("reason", lines)
        self.assertNotIn("fine", lines)

    def test_shows_the_last_sixty_lines_of_each(self):
        _, lines = self.run_with({"one": "seq 1 200; exit 1", "two": "echo short; exit 1"})
        numbers = [int(line) for line in lines if line.isdigit()]
        self.assertEqual(numbers, list(range(141, 201)))
        self.assertIn("[140 lines before these]", lines)
        self.assertIn("short", lines)
        self.assertEqual(lines[-1], "2 failed: one, two")

    def test_shows_the_end_however_much_was_printed(self):
        _, lines = self.run_with({"loud": "seq 1 300000; echo the end; exit 1"})
        self.assertIn("the end", lines)

    def test_shows_bytes_that_are_no_text(self):
        _, lines = self.run_with({"odd": r"printf 'a <b> & \001\377 c\n'; exit 1"})
        shown = [line for line in lines if line.startswith("a <b> & ")]
        self.assertEqual(len(shown), 1)
        self.assertTrue(shown[0].endswith(" c"))

    def test_shows_only_the_failed_cases_of_a_suite(self):
        _, lines = self.run_with({"suite": "cat suite; exit 1"})
        self.assertIn("Value of: truth", lines)
        self.assertNotIn("noise of a good case", lines)
        self.assertNotIn("[ RUN      ] Suite.Other", lines)

    def test_names_what_was_ended_or_could_not_start(self):
        status, lines = self.run_with(
            {"late": "exec sleep 30", "dies": "kill -SEGV $$"},
            "set_tests_properties(late PROPERTIES TIMEOUT 1)",
            "add_test(absent /no/such/program)")
        self.assertNotEqual(status, 0)
        self.assertEqual(lines[-1], "3 failed: late, dies, absent")

    def test_does_not_name_what_was_skipped_on_purpose(self):
        _, lines = self.run_with(
            {"skipped": "exit 77", "bad": "exit 1"},
            "set_tests_properties(skipped PROPERTIES SKIP_RETURN_CODE 77)")
        self.assertEqual(lines[-1], "1 failed: bad")


if __name__ == "__main__":
    unittest.main()
