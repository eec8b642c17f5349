"""The installed units of systemd, as systemd itself reads them."""

import pathlib
import shutil
import subprocess
import sys
import unittest

FOLDER = None  # of the units, from the command line
ANALYZE = None  # the path of systemd-analyze, where it is installed
SERVICE, SOCKET = "webapi-server.service", "webapi-server.socket"

# Of systemd's own scale from 0 to 100; a service without any restriction has 96.
MOST_EXPOSED = 40


def read(name):
    """All values of each setting, in a row."""
    found = {}
    for line in (FOLDER / name).read_text(encoding="utf-8").splitlines():
        key, equals, value = line.partition("=")
        if equals and not line.startswith("#"):
            found[key] = f"{found.get(key, '')} {value}".strip()
    return found


class Units(unittest.TestCase):
    def setUp(self):
        self.service = read(SERVICE)
        self.socket = read(SOCKET)

    def test_nothing_is_left_to_fill_in(self):
        for name in (SERVICE, SOCKET):
            self.assertNotRegex((FOLDER / name).read_text(encoding="utf-8"), r"@[A-Z_]+@")

    def test_the_program_is_the_installed_one(self):
        program = pathlib.Path(self.service["ExecStart"].strip('"'))
        self.assertTrue(program.is_file(), program)
        self.assertEqual(program.name, "webapi-server")

    def test_what_a_request_needs_is_writable(self):
        writable = self.service["ReadWritePaths"]
        for folder in ("/etc/talo", "/run/talo", "/var/lib/talo"):
            self.assertIn(folder, writable)
        self.assertEqual(self.service["ProtectSystem"], "strict")

    def test_a_stop_leaves_background_tasks_alone(self):
        self.assertEqual(self.service["KillMode"], "process")

    def test_web_servers_alone_may_connect(self):
        self.assertEqual(self.socket["SocketMode"], "0660")
        self.assertTrue(self.socket["SocketGroup"])


class Analyzed(unittest.TestCase):
    """By systemd's own program."""

    def analyze(self, *words):
        done = subprocess.run([ANALYZE, *words], timeout=50, stdout=subprocess.PIPE,
                              stderr=subprocess.STDOUT, text=True)
        self.assertEqual(done.returncode, 0, done.stdout)
        return done.stdout

    def test_nothing_is_wrong(self):
        self.assertEqual(self.analyze("verify", "--man=no", str(FOLDER / SERVICE),
                                      str(FOLDER / SOCKET)), "")

    def test_the_service_is_hardened(self):
        self.analyze("security", "--offline=yes", f"--threshold={MOST_EXPOSED}",
                     str(FOLDER / SERVICE))


def load_tests(_loader, tests, _pattern):
    if ANALYZE is None:
        tests = unittest.defaultTestLoader.loadTestsFromTestCase(Units)
    return tests


if __name__ == "__main__":
    FOLDER = pathlib.Path(sys.argv.pop(1))
    ANALYZE = shutil.which("systemd-analyze")
    unittest.main()
