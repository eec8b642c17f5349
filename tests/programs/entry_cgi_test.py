"""entry.cgi as a process: what it makes of what a web server hands it."""

import json
import os
import socket
import subprocess
import tempfile
import time
import unittest

import installed
from installed import ENTRY_CGI, WEBAPI_DIR, environment, get, run, split_reply

PING = "api=TALO.System&version=1&method=ping"


class EntryCgi(installed.ProbeTest):
    def process(self, **options):
        """What the method saw of its process."""
        variables = options.pop("variables", {})
        result = run([ENTRY_CGI], env=self.get("process", **variables), **options)
        self.assertEqual(result.returncode, 0, result)
        _, body = split_reply(result.stdout)
        self.assertIs(body["success"], True, body)
        return body["data"]

    def test_answers_a_request(self):
        result = run([ENTRY_CGI], env=get(PING + "&text=hi"))
        self.assertEqual(result.returncode, 0)
        self.assertEqual(result.stderr, b"")
        headers, body = split_reply(result.stdout)
        self.assertEqual(
            headers,
            [
                b'Content-type: text/html; charset="UTF-8"',
                b"Cache-Control: max-age=0, no-cache, no-store, must-revalidate",
                b"Pragma: no-cache",
                b"Expires: 0",
            ],
        )
        self.assertEqual(body, {"data": {"text": "hi"}, "success": True})

    def test_answers_a_post(self):
        body = (PING + "&text=hi&count=3").encode()
        variables = environment(REQUEST_METHOD="POST", CONTENT_LENGTH=str(len(body)))
        result = run([ENTRY_CGI], env=variables, stdin=None, input=body)
        self.assertEqual(
            split_reply(result.stdout)[1],
            {"data": {"count": 3, "text": "hi"}, "success": True},
        )

    def test_answers_without_any_environment(self):
        result = run([ENTRY_CGI], env=environment())
        self.assertEqual(result.returncode, 0)
        self.assertEqual(
            split_reply(result.stdout)[1], {"error": {"code": 101}, "success": False}
        )

    def test_closes_inherited_descriptors(self):
        with tempfile.NamedTemporaryFile() as leaked:
            high = os.dup2(leaked.fileno(), 777, inheritable=True)
            try:
                data = self.process(pass_fds=(leaked.fileno(), high))
            finally:
                os.close(high)
            self.assertNotIn(leaked.name, data["descriptors"].values())
            self.assertNotIn("777", data["descriptors"])

    def test_survives_closed_standard_descriptors(self):
        for closed in ("<&-", ">&-", "2>&-", "<&- >&-", "<&- 2>&-", ">&- 2>&-", "<&- >&- 2>&-"):
            for query in (PING, self.query("large")):
                variables = get(query, PROBE_NAME=self.api)
                result = run(["/bin/sh", "-c", f'exec "$0" {closed}', ENTRY_CGI], env=variables)
                self.assertEqual(result.returncode, 0, closed)
                if ">&-" not in closed.replace("2>&-", ""):
                    self.assertIs(split_reply(result.stdout)[1]["success"], True)

    def test_fills_closed_standard_descriptors(self):
        result = run(
            ["/bin/sh", "-c", 'exec "$0" <&- 2>&-', ENTRY_CGI], env=self.get("process")
        )
        descriptors = split_reply(result.stdout)[1]["data"]["descriptors"]
        self.assertEqual((descriptors["0"], descriptors["2"]), ("/dev/null", "/dev/null"))

    def test_answers_101_to_a_post_without_standard_input(self):
        variables = environment(REQUEST_METHOD="POST", CONTENT_LENGTH="100")
        result = run(["/bin/sh", "-c", 'exec "$0" <&-', ENTRY_CGI], env=variables)
        self.assertEqual(result.returncode, 0)
        self.assertEqual(split_reply(result.stdout)[1]["error"]["code"], 101)

    def test_takes_what_comes_of_a_refused_upload(self):
        for variables in (
            {"CONTENT_TYPE": "multipart/form-data; boundary=edge"},
            {"CONTENT_TYPE": "application/octet-stream", "HTTP_X_TYPE_NAME": "SliceUpload"},
        ):
            with self.subTest(variables), subprocess.Popen(
                [ENTRY_CGI],
                bufsize=0,
                stdin=subprocess.PIPE,
                stdout=subprocess.PIPE,
                env=environment(
                    REQUEST_METHOD="POST",
                    QUERY_STRING="api=TALO.File&version=1&method=upload_slice",
                    CONTENT_LENGTH="200",
                    **variables,
                ),
            ) as process:
                time.sleep(0.2)  # refused by then
                process.stdin.write(b"x" * 200)
                process.stdin.close()
                self.assertIs(split_reply(process.stdout.read())[1]["success"], False)

    def test_outlives_a_client_that_has_gone(self):
        for method in ("process", "large"):
            read_end, write_end = os.pipe()
            os.close(read_end)
            with subprocess.Popen(
                [ENTRY_CGI],
                env=self.get(method),
                stdin=subprocess.DEVNULL,
                stdout=write_end,
                stderr=subprocess.PIPE,
            ) as process:
                os.close(write_end)
                _, errors = process.communicate(timeout=60)
            self.assertEqual(process.returncode, 0, method)
            self.assertEqual(errors, b"")
        self.assertIs(self.process()["ignoresPipe"], True)

    def test_outlives_a_full_disk(self):
        with open("/dev/full", "wb") as full:
            process = subprocess.run(
                [ENTRY_CGI],
                env=self.get("large"),
                stdin=subprocess.DEVNULL,
                stdout=full,
                check=False,
                timeout=60,
            )
        self.assertEqual(process.returncode, 0)

    def test_never_poses_as_a_background_task(self):
        data = self.process(
            variables={"task_id": "1", "task_user": "admin", "full_task_id": "@admin/1"}
        )
        for name in ("task_id", "task_user", "full_task_id"):
            self.assertIsNone(data["environment"][name])
        self.assertIs(data["pollingTask"], False)
        self.assertEqual(data["pollingTaskId"], "")

    def test_works_in_the_web_api_directory_wherever_it_was_started(self):
        with tempfile.TemporaryDirectory() as folder:
            for start in ("/", folder, WEBAPI_DIR):
                data = self.process(cwd=start)
                self.assertEqual(data["directory"], os.path.realpath(WEBAPI_DIR))

    def test_leaves_no_description_of_another_directory_in_effect(self):
        with tempfile.TemporaryDirectory() as folder:
            document = {"lib": "x", "minVersion": 1, "maxVersion": 1, "methods": {"1": ["m"]}}
            with open(os.path.join(folder, "Else.Where.lib"), "w", encoding="utf-8") as file:
                json.dump({"Else.Where": document}, file)
            result = run(
                [ENTRY_CGI], env=get("api=Else.Where&version=1&method=m"), cwd=folder
            )
            self.assertEqual(split_reply(result.stdout)[1]["error"]["code"], 102)

    def test_sends_a_reply_in_one_write(self):
        # Such a socket keeps what one write sent apart from the next.
        ours, theirs = socket.socketpair(socket.AF_UNIX, socket.SOCK_SEQPACKET)
        with ours, theirs:
            subprocess.run(
                [ENTRY_CGI],
                env=get(PING + "&text=" + "x" * 20000),
                stdin=subprocess.DEVNULL,
                stdout=theirs,
                check=True,
                timeout=60,
            )
            theirs.close()
            ours.settimeout(60)
            message = ours.recv(1 << 20)
            self.assertIs(split_reply(message)[1]["success"], True)
            self.assertEqual(ours.recv(1 << 20), b"")


if __name__ == "__main__":
    unittest.main()
