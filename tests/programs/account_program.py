"""webapi-account over a root of the tests' own, with the modules that it opens.

The command line of the tests: PROGRAM ROOT MODULE [MODULE ...].
"""

import os
import pathlib
import pty
import select
import shutil
import subprocess
import sys
import time
import unittest

PROGRAM, ROOT, *OFFERED = map(os.path.abspath, sys.argv[1:])
ACCOUNTS = pathlib.Path(ROOT, "etc/talo/accounts")
NODES = pathlib.Path(ROOT, "etc/talo/nodes")
MODULES = pathlib.Path(ROOT, "lib/talo")
SUCCESS, FAILURE, WRONG_USAGE = 0, 1, 2


def run(*words, typed=""):
    return subprocess.run([PROGRAM, *words], input=typed.encode(), stdout=subprocess.PIPE,
                          stderr=subprocess.PIPE, timeout=60)


class Terminal:
    """The program on a terminal of its own."""

    def __init__(self, *words):
        self.child, self.screen = pty.fork()
        if self.child == 0:
            os.execv(PROGRAM, [PROGRAM, *words])
        self.shown = b""

    def wait_for(self, text):
        deadline = time.monotonic() + 30
        while text not in self.shown:
            ready, _, _ = select.select([self.screen], [], [], deadline - time.monotonic())
            if not ready:
                raise AssertionError(f"never showed {text}: {self.shown}")
            self.shown += os.read(self.screen, 1024)
        self.shown = self.shown.split(text, 1)[1]

    def type(self, text):
        os.write(self.screen, text)

    def end(self):
        """Everything that was shown since, and the exit status (negative: a signal)."""
        try:
            while block := os.read(self.screen, 1024):
                self.shown += block
        except OSError:  # the terminal is gone with its last user
            pass
        _, status = os.waitpid(self.child, 0)
        os.close(self.screen)
        return self.shown, os.waitstatus_to_exitcode(status)


class ProgramTest(unittest.TestCase):
    """Nothing is there but the modules, and nothing is left."""

    def setUp(self):
        shutil.rmtree(ROOT, ignore_errors=True)
        MODULES.mkdir(parents=True)
        for module in OFFERED:
            (MODULES / os.path.basename(module)).symlink_to(module)

    def tearDown(self):
        shutil.rmtree(ROOT, ignore_errors=True)

    def done(self, *words, typed=""):
        result = run(*words, typed=typed)
        self.assertEqual(SUCCESS, result.returncode, result.stderr)
        self.assertEqual(b"", result.stderr)
        return result.stdout.decode()

    def refused(self, *words, typed=""):
        """The one line that says why. No file has changed."""
        before = contents()
        result = run(*words, typed=typed)
        self.assertEqual(FAILURE, result.returncode, words)
        self.assertEqual(b"", result.stdout)
        self.assertRegex(result.stderr, rb"^webapi-account: [^\n]+\n$")
        self.assertEqual(before, contents())
        return result.stderr.decode()

    def misused(self, *words):
        result = run(*words, typed="secret\n")
        self.assertEqual(WRONG_USAGE, result.returncode, words)
        self.assertEqual(b"", result.stdout, words)
        self.assertIn(b"usage: webapi-account", result.stderr, words)
        return result.stderr.decode()


def contents():
    return [path.read_bytes() if path.exists() else None for path in (ACCOUNTS, NODES)]
