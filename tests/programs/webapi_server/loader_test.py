"""A program that begins again with what the loader takes from the environment."""

import os
import pathlib
import subprocess
import unittest

PROBE = os.environ["LOADER_PROBE"]
BOUND = "LD_BIND_NOW=webapi-server"
KEEPING = {"GLIBC_TUNABLES=glibc.malloc.tcache_count=1000", "glibc.malloc.mxfast=0"}


class Beginning(unittest.TestCase):
    def begin(self, **variables):
        """What the program says, what it was begun with at last, and its name."""
        with subprocess.Popen([PROBE, "one", "two words"], env=variables, text=True,
                              stdin=subprocess.PIPE, stdout=subprocess.PIPE) as process:
            said = []
            while not said or not said[-1].startswith("process "):
                said.append(process.stdout.readline().rstrip("\n"))
                self.assertTrue(said[-1])
            place = pathlib.Path(f"/proc/{process.pid}")
            # The C library ends each setting in its place.
            begun = (place / "environ").read_text().replace(":glibc", "\0glibc")
            begun = set(begun.split("\0")) - {""}
            name = (place / "comm").read_text().strip()
            process.communicate("\n")
            self.assertEqual(process.returncode, 0)
        self.assertEqual(said.pop(), f"process {process.pid}")
        arguments = [line for line in said if line.startswith("argument ")]
        self.assertEqual(arguments[1:], ["argument one", "argument two words"])
        shown = {line.partition(" ")[2] for line in said if line.startswith("variable ")}
        return shown, begun, name

    def test_is_told_to_nobody(self):
        shown, begun, name = self.begin(LANG="C", A="b")
        self.assertEqual(shown, {"LANG=C", "A=b"})
        self.assertEqual(begun, {"LANG=C", "A=b", BOUND} | KEEPING)
        self.assertEqual(name, os.path.basename(PROBE)[:15])

    def test_leaves_other_settings_of_the_allocator(self):
        shown, begun, _ = self.begin(GLIBC_TUNABLES="glibc.malloc.perturb=1")
        self.assertEqual(shown, {"GLIBC_TUNABLES=glibc.malloc.perturb=1"})
        self.assertEqual(begun, {"GLIBC_TUNABLES=glibc.malloc.perturb=1", BOUND})

    def test_comes_also_where_libraries_are_bound_at_once_already(self):
        shown, begun, _ = self.begin(LD_BIND_NOW="1")
        self.assertEqual((shown, begun), (set(), {BOUND} | KEEPING))


if __name__ == "__main__":
    unittest.main()
