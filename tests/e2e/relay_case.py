"""What the cases about relayed calls have in common: three whole appliances with TLS."""

import enum
import json
import os
import unittest

from appliance import Appliance
from case import Case
from webserver import wait_until


class RelayError(enum.IntEnum):
    """The number behind "relay request fail"."""
    UNKNOWN_NODE = 1
    UNAVAILABLE = 2
    TOO_MANY_HOPS = 3
    NOT_REACHED = 5
    NOT_TRUSTED = 6
    TIMED_OUT = 7
    BROKEN = 8
    TOO_LONG = 9
    STATUS = 10
    REFUSED = 11


ALL = ("admin.local", "normal.local")


def start_appliances():
    """For setUpModule. ann is an administrator on each, bob is not."""
    server = Case.server
    started = []
    for number, name in enumerate(("first", "second", "third"), start=1):
        appliance = Appliance(number, server.name, server.root, f"{server.run_dir}-{name}",
                              server.mode)
        started.append(appliance)
        unittest.addModuleCleanup(stop, appliance)
        appliance.add_account("ann", "--admin")
        appliance.add_account("bob")
    first, second, _ = RelayCase.appliances = started
    first.may_call(second, *ALL)
    RelayCase.nodes = {appliance: (appliance.settings / "nodes").read_bytes()
                       for appliance in (first, second)}
    for name in ("ann", "bob"):
        sid = first.log_in(name)
        file = first.session_file(sid)
        RelayCase.logins[name] = sid, file.read_bytes(), file.stat()


def only_with_lighttpd(_loader, tests, _pattern):
    """For load_tests, where the web server in front makes no difference."""
    return tests if Case.server.name == "lighttpd" else type(tests)()


def write_private(path, content):
    path.unlink(missing_ok=True)
    with open(os.open(path, os.O_WRONLY | os.O_CREAT | os.O_EXCL, 0o600), "wb") as file:
        file.write(content)


def stop(appliance):
    complaints = appliance.stop()
    if complaints:
        raise AssertionError(f"appliance {appliance.number}: {complaints}")


class RelayCase(Case):
    """The first calls the others, which know it by the number 1."""

    appliances = []
    nodes = {}  # the files of the first and the second when the first may call
    logins = {}  # session at the first, its file's content and facts, by user

    def setUp(self):
        super().setUp()
        self.first, self.second, self.third = self.appliances
        for appliance in self.appliances:
            appliance.forget_all()
        self.client = self.first.client()

    def lets_call(self, *classes):
        """The first may call the second for these classes, all unless given."""
        if classes:
            self.first.may_call(self.second, *classes)
            return
        for appliance, nodes in self.nodes.items():
            write_private(appliance.settings / "nodes", nodes)

    def log_in(self, name):
        """A session at the first, just used."""
        sid, record, facts = self.logins[name]
        file = self.first.session_file(sid)
        write_private(file, record)
        os.chown(file, facts.st_uid, facts.st_gid)  # the web server's user may be another
        return sid

    def call(self, sid, api="Test.Relay", method="echo", version=1, relay_nd=2, headers=None,
             **parameters):
        """A call by a document, so that parameters have types."""
        document = {"api": api, "version": version, "method": method, "_sid": sid, **parameters}
        if relay_nd is not None:
            document["relay_nd"] = relay_nd
        return self.client.post(json.dumps(document), headers=headers)

    def data(self, reply):
        self.assertTrue(reply.document()["success"], reply)
        self.assertEqual(reply.status, 200)
        return reply.document()["data"]

    def echo(self, sid, **parameters):
        return self.data(self.call(sid, **parameters))

    def relay_fails(self, error, call, log=None):
        """The call is answered with 109, and the system log has the number."""
        log = log or self.first.log
        mark = log.mark()
        reply = call()
        self.fails(reply, 109)
        self.logged(mark, [error], log)

    def logged(self, mark, errors, log=None):
        """The system log has the number of one of these since then."""
        log = log or self.first.log
        signs = [f"relay request fail[{int(error)}]" for error in errors]
        self.assertTrue(wait_until(lambda: any(
            sign in line for line in log.since(mark) for sign in signs), 5), log.since(mark))
