"""Which libraries a plain request loads: the start of a process is most of its cost."""

import os
import re
import unittest

from installed import ENTRY_CGI, SANITIZED, get, run, split_reply

ALLOWED = {
    "libwebapi-ORB5.so",
    "libtaloplatform.so",
    "libjsoncpp.so",
    "libstdc++.so",
    "libm.so",
    "libgcc_s.so",
    "libc.so",
    "ld-linux",
    "TALO.System.so",
}
SANITIZERS = {"libasan.so", "libubsan.so", "libdl.so", "libpthread.so", "librt.so"}


def base_name(path):
    """Without folder and version: "libjsoncpp.so.25" is "libjsoncpp.so"."""
    name = os.path.basename(path)
    if name.startswith("ld-linux"):
        return "ld-linux"
    return re.sub(r"\.so\..*$", ".so", name)


class LoadedLibraries(unittest.TestCase):
    def setUp(self):
        variables = get("api=TALO.System&version=1&method=ping", LD_DEBUG="files")
        result = run([ENTRY_CGI], env=variables)
        self.assertIs(split_reply(result.stdout)[1]["success"], True)
        paths = re.findall(rb"calling init: (\S+)", result.stderr)
        self.loaded = {base_name(path.decode()) for path in paths}

    def test_are_the_framework_and_what_it_stands_on(self):
        allowed = ALLOWED | (SANITIZERS if SANITIZED else set())
        self.assertEqual(self.loaded - allowed, set())

    def test_are_seen_at_all(self):
        for name in ("libwebapi-ORB5.so", "libtaloplatform.so", "libc.so", "TALO.System.so"):
            self.assertIn(name, self.loaded)
        self.assertEqual("libasan.so" in self.loaded, SANITIZED)


if __name__ == "__main__":
    unittest.main()
