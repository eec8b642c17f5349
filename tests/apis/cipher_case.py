"""An appliance with ciphers, and what a browser makes of parameters for it."""

import atexit
import functools
import json
import os
import pathlib
import shutil
import subprocess
import time

from appliance import ApplianceTest, ROOT

CIPHER_DIR = ROOT / "var/lib/talo/cipher"
SEEN_DIR = ROOT / "run/talo/cipher"
KEYS = CIPHER_DIR / "keys"

# The module as it is installed.
CIPHER_JS = pathlib.Path(os.environ["CIPHER_JS"]).as_uri()
WEBCRYPTO = (pathlib.Path(__file__).resolve().parents[1] / "console/webcrypto.mjs").as_uri()
PREFIX = "~talo-line.1~"

PROGRAM = f"""
    import {{createInterface}} from "node:readline";
    import {json.dumps(WEBCRYPTO)};
    import * as cipher from {json.dumps(CIPHER_JS)};
    for await (const line of createInterface({{input: process.stdin}})) {{
        const results = [];
        for (const [name, ...words] of JSON.parse(line)) {{
            results.push(await cipher[name](...words));
        }}
        process.stdout.write(JSON.stringify(results) + "\\n");
    }}
"""


class Browser:
    """A process with console/cipher.js, for as long as the tests run."""

    def __init__(self):
        self.process = subprocess.Popen(
            ["node", "--no-warnings", "--input-type=module", "-e", PROGRAM],
            stdin=subprocess.PIPE, stdout=subprocess.PIPE)
        atexit.register(self.close)

    def call(self, calls):
        self.process.stdin.write(json.dumps(calls).encode("ascii") + b"\n")
        self.process.stdin.flush()
        return json.loads(self.process.stdout.readline())

    def close(self):
        self.process.stdin.close()
        self.process.wait(60)
        self.process.stdout.close()


@functools.lru_cache(maxsize=None)
def the_browser():
    return Browser()


def browser(*calls):
    """The results of functions of console/cipher.js, each called as [name, ...]."""
    return the_browser().call(calls)


def seal_all(lines, key, when=None):
    """Parameter lines under the appliance's own cipher."""
    when = time.time() if when is None else when
    return browser(*(["encipherLine", key, line, when] for line in lines))


def seal(line, key, when=None):
    return seal_all([line], key, when)[0]


def encipher(token, line):
    """A parameter line under the key of a token."""
    return browser(["encipherWithToken", token, line])[0]


def under(token, line):
    """The same as the parameters that carry it."""
    return {"__nEkOtReHpIc": token, "__tXeTrEhPiC": encipher(token, line)}


class CipherTest(ApplianceTest):
    def setUp(self):
        super().setUp()
        self.forget_keys()
        self.addCleanup(self.forget_keys)

    @staticmethod
    def forget_keys():
        shutil.rmtree(CIPHER_DIR, ignore_errors=True)
        shutil.rmtree(SEEN_DIR, ignore_errors=True)
