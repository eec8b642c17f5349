"""What is installed in the private root, for tests that run it as processes.

CTest gives the places in the environment: WEBAPI_CALL, WEBAPI_DIR, PROBE_API and
WEBAPI_SANITIZED.
"""

import json
import os
import subprocess
import unittest

WEBAPI_CALL = os.environ["WEBAPI_CALL"]
WEBAPI_DIR = os.environ["WEBAPI_DIR"]
ENTRY_CGI = os.path.join(WEBAPI_DIR, "entry.cgi")
SANITIZED = os.environ["WEBAPI_SANITIZED"] == "1"

# A web server's environment is small; a sanitizer's options and a coverage
# file's place may pass.
PASSED_ON = ("ASAN_OPTIONS", "UBSAN_OPTIONS", "LSAN_OPTIONS")


def environment(**variables):
    kept = {name: os.environ[name] for name in PASSED_ON if name in os.environ}
    kept["PATH"] = "/usr/bin:/bin"
    kept.update(variables)
    return kept


def get(query, **variables):
    """The environment of a GET."""
    return environment(
        GATEWAY_INTERFACE="CGI/1.1", REQUEST_METHOD="GET", QUERY_STRING=query, **variables
    )


def split_reply(output):
    """Header lines and the decoded body of a CGI program's output."""
    head, separator, body = output.partition(b"\r\n\r\n")
    assert separator, output
    return head.split(b"\r\n"), json.loads(body)


def run(command, **options):
    options.setdefault("env", environment())
    options.setdefault("stdin", subprocess.DEVNULL)
    options.setdefault("timeout", 60)
    return subprocess.run(
        command, stdout=subprocess.PIPE, stderr=subprocess.PIPE, check=False, **options
    )


class ProbeTest(unittest.TestCase):
    """Lends the installed framework an API of the test's own, and takes it away."""

    @classmethod
    def setUpClass(cls):
        cls.api = f"Probe.P{os.getpid()}"
        cls.description = os.path.join(WEBAPI_DIR, cls.api + ".lib")
        methods = ["process", "parameters", "large"]
        document = {
            "lib": os.environ["PROBE_API"],
            "minVersion": 1,
            "maxVersion": 2,
            "authLevel": 0,
            "methods": {"1": methods, "2": methods},
        }
        with open(cls.description, "w", encoding="utf-8") as file:
            json.dump({cls.api: document}, file)

    @classmethod
    def tearDownClass(cls):
        os.unlink(cls.description)

    def query(self, method):
        return f"api={self.api}&version=1&method={method}"

    def get(self, method, **variables):
        return get(self.query(method), PROBE_NAME=self.api, **variables)
