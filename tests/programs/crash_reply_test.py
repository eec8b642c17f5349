"""entry.cgi when a method ends the process: the client is answered all the same."""

import json
import os
import pathlib
import signal
import tempfile
import unittest

import installed
from installed import ENTRY_CGI, WEBAPI_DIR, get, run

HERE = pathlib.Path(__file__).resolve().parent
MODULE = os.path.join(os.environ["TEST_MODULE_DIR"], "TestCrash.so")

REPLY = (
    b"Status: 500 Internal Server Error\r\n"
    b'Content-type: text/html; charset="UTF-8"\r\n'
    b"Cache-Control: max-age=0, no-cache, no-store, must-revalidate\r\n"
    b"Pragma: no-cache\r\n"
    b"Expires: 0\r\n"
    b"\r\n"
    b'{"error":{"code":117},"success":false}'
)

# How a method may crash, and the signal that it dies of.
CRASHES = {
    "segfault": signal.SIGSEGV,
    "bus": signal.SIGBUS,
    "divide": signal.SIGFPE,
    "illegal": signal.SIGILL,
    "overflow": signal.SIGSEGV,
    "abort": signal.SIGABRT,
    "thread": signal.SIGABRT,
    "killed": signal.SIGSEGV,
}


class CrashReply(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        with open(HERE.parent / "e2e" / "Test.Crash.lib", encoding="utf-8") as file:
            document = json.load(file)
        document["Test.Crash"]["lib"] = MODULE
        cls.description = os.path.join(WEBAPI_DIR, "Test.Crash.lib")
        with open(cls.description, "w", encoding="utf-8") as file:
            json.dump(document, file)

    @classmethod
    def tearDownClass(cls):
        os.unlink(cls.description)

    def call(self, method, how):
        query = f"api=Test.Crash&version=1&method={method}&how={how}"
        return run([ENTRY_CGI], env=get(query))

    def check_died_of(self, result, number):
        # A sanitizer ends the process its own way.
        if installed.SANITIZED and number != signal.SIGABRT:
            self.assertNotEqual(result.returncode, 0)
        else:
            self.assertEqual(result.returncode, -number, result)

    def test_every_crash_is_answered_and_still_is_a_crash(self):
        for how, number in CRASHES.items():
            with self.subTest(how):
                result = self.call("crash", how)
                self.assertEqual(result.stdout, REPLY)
                self.check_died_of(result, number)

    def test_a_crash_adds_nothing_to_a_reply_that_has_begun(self):
        for how, number in CRASHES.items():
            with self.subTest(how):
                result = self.call("download", how)
                self.assertEqual(
                    result.stdout, b"Content-type: text/plain\r\n\r\nhalf a file"
                )
                self.check_died_of(result, number)

    def test_a_method_that_exits_is_answered(self):
        result = self.call("crash", "exit")
        self.assertEqual((result.stdout, result.returncode), (REPLY, 0))
        result = self.call("download", "exit")
        self.assertTrue(result.stdout.endswith(b"half a file"), result)

    def test_a_method_that_exits_past_all_handlers_is_answered(self):
        result = self.call("crash", "_exit")
        self.assertEqual((result.stdout, result.returncode), (REPLY, 0))
        result = self.call("download", "_exit")
        self.assertEqual(result.stdout, b"Content-type: text/plain\r\n\r\nhalf a file")

    def test_a_crash_of_a_child_is_none_of_the_clients_business(self):
        for how in [*CRASHES, "exit", "_exit"]:
            with self.subTest(how):
                result = self.call("child", how)
                self.assertEqual(result.returncode, 0, result)
                header, _, body = result.stdout.partition(b"\r\n\r\n")
                self.assertNotIn(b"Status", header)
                self.assertEqual(body, b'{"data":"answered","success":true}')

    def test_without_a_reader_the_process_still_ends_by_its_signal(self):
        with tempfile.TemporaryFile() as nothing:
            command = ["/bin/sh", "-c", 'exec "$0" >&-', ENTRY_CGI]
            query = "api=Test.Crash&version=1&method=crash&how=abort"
            result = run(command, env=get(query), stdin=nothing)
            self.assertEqual(result.returncode, -signal.SIGABRT)


if __name__ == "__main__":
    unittest.main()
