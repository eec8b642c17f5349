"""The installed entry.cgi without a web server: what no server lets through."""

import json
import os
import pathlib
import subprocess
import sys
import time
import unittest

ENTRY = None  # the program's path, from the command line
PING = b"api=TALO.System&version=1&method=ping"
CACHE_LINES = (b"Cache-Control: max-age=0, no-cache, no-store, must-revalidate\r\n"
               b"Pragma: no-cache\r\nExpires: 0\r\n")


def run(body=b"", **environment):
    process = subprocess.run([ENTRY], input=body, capture_output=True, timeout=60,
                             env={"REQUEST_METHOD": "POST", **environment})
    header, _, document = process.stdout.partition(b"\r\n\r\n")
    return process, header + b"\r\n", document


class Entry(unittest.TestCase):
    def answers(self, document, body, **environment):
        process, _, reply = run(body, **environment)
        self.assertEqual(json.loads(reply), document)
        self.assertEqual(process.returncode, 0)
        self.assertEqual(process.stderr, b"")

    def fails_101(self, body, **environment):
        self.answers({"success": False, "error": {"code": 101}}, body, **environment)

    def test_writes_its_lines_in_order(self):
        _, header, document = run(PING, CONTENT_LENGTH=str(len(PING)))
        self.assertEqual(header, b'Content-type: text/html; charset="UTF-8"\r\n' + CACHE_LINES)
        self.assertEqual(document, b'{"data":{},"success":true}')

    def test_takes_lengths_that_are_none_for_an_empty_body(self):
        self.fails_101(PING)
        for length in ("", "0", "-1", "-9223372036854775809", "9223372036854775808", "12abc",
                       "1e3", "99999999999999999999999"):
            with self.subTest(length):
                self.fails_101(PING, CONTENT_LENGTH=length)

    def test_reads_no_more_than_the_length(self):
        self.answers({"success": True, "data": {"text": "a"}}, PING + b"&text=abc",
                     CONTENT_LENGTH=str(len(PING) + 7))

    def test_takes_what_there_is_of_a_shorter_body(self):
        self.answers({"success": True, "data": {"text": "a"}}, PING + b"&text=a",
                     CONTENT_LENGTH="1000")

    def test_a_promise_of_16_mebibytes_costs_nothing_and_one_byte_more_is_101(self):
        self.answers({"success": True, "data": {}}, PING, CONTENT_LENGTH=str(16 << 20))
        self.fails_101(PING, CONTENT_LENGTH=str((16 << 20) + 1))

    def test_takes_in_a_body_that_it_does_not_want(self):
        process = subprocess.Popen([ENTRY], stdin=subprocess.PIPE, stdout=subprocess.PIPE,
                                   env={"REQUEST_METHOD": "POST", "CONTENT_LENGTH": "99999999"})
        reply, _ = process.communicate(b"x" * (20 << 20), timeout=60)
        self.assertIn(b'"code":101', reply)

    def test_takes_in_an_upload_that_it_refuses_although_the_client_pauses(self):
        process = subprocess.Popen(
            [ENTRY], stdin=subprocess.PIPE, stdout=subprocess.PIPE, bufsize=0,
            env={"REQUEST_METHOD": "POST", "CONTENT_TYPE": "multipart/form-data; boundary=b",
                 "QUERY_STRING": "api=No.Such&version=1&method=upload",
                 "CONTENT_LENGTH": str(100 << 20)})
        for _ in range(100):
            time.sleep(0.002)
            self.assertEqual(process.stdin.write(b"x" * (1 << 20)), 1 << 20)
        reply, _ = process.communicate(timeout=60)
        self.assertIn(b'"code":102', reply)

    def test_serves_with_closed_standard_descriptors(self):
        command = f"exec '{ENTRY}' <&- 2>&-"
        output = subprocess.run(["/bin/sh", "-c", command], stdout=subprocess.PIPE, timeout=60,
                                env={"QUERY_STRING": PING.decode()}).stdout
        self.assertIn(b'"success":true', output)

    def test_ends_well_when_nobody_reads_the_reply(self):
        reader, writer = os.pipe()
        os.close(reader)
        status = subprocess.run([ENTRY], stdin=subprocess.DEVNULL, stdout=writer, timeout=60,
                                env={"QUERY_STRING": PING.decode()}).returncode
        os.close(writer)
        self.assertEqual(status, 0)


if __name__ == "__main__":
    ENTRY = str(pathlib.Path(sys.argv.pop(1)) / "usr/talo/taloman/webapi/entry.cgi")
    unittest.main()
