"""The compile commands that clang-tidy goes by."""

import json
import pathlib
import shlex
import subprocess
import unittest

PROJECT = pathlib.Path(__file__).resolve().parents[2]
RUN = """set -eu
. "$1/scripts/lib/common.sh"
. "$1/scripts/lib/checks.sh"
one_command_per_file
"""


def one_per_file(*commands):
    """What is left of (file, words of the command), in that form."""
    given = [{"directory": "/build", "file": file, "command": shlex.join(words)}
             for file, words in commands]
    ran = subprocess.run(["bash", "-c", RUN, "bash", PROJECT], input=json.dumps(given),
                         stdout=subprocess.PIPE, timeout=50, check=True, encoding="utf-8")
    return [(command["file"], shlex.split(command["command"]))
            for command in json.loads(ran.stdout)]


class OneCommandPerFile(unittest.TestCase):
    def test_keeps_the_first_of_a_file(self):
        self.assertEqual(
            sorted(one_per_file(("/a.cpp", ["c++", "-DFIRST"]), ("/b.cpp", ["c++"]),
                                ("/a.cpp", ["c++", "-DSECOND"]))),
            [("/a.cpp", ["c++", "-DFIRST"]), ("/b.cpp", ["c++"])])

    def test_leaves_compiled_headers_out(self):
        words = ["c++", "-Wall", "-fpch-preprocess", "-std=c++17", "-Winvalid-pch", "-include",
                 "/build/some folder/cmake_pch.hxx", "-o", "a.o", "-c", "/a.cpp"]
        self.assertEqual(
            one_per_file(("/a.cpp", words)),
            [("/a.cpp", ["c++", "-Wall", "-std=c++17", "-o", "a.o", "-c", "/a.cpp"])])

    def test_keeps_other_forced_headers_and_quoted_words(self):
        words = ["c++", "-include", "config.h", '-DTEXT="two words"', "-c", "/a.cpp"]
        self.assertEqual(one_per_file(("/a.cpp", words)), [("/a.cpp", words)])


if __name__ == "__main__":
    unittest.main()
