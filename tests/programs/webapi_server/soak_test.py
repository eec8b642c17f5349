"""Many requests, after which the server is what it was.

SOAK_REQUESTS says how many, 100,000 unless it is set."""

import os
import subprocess
import sys
import time
import unittest

import scgi_server
from scgi_server import LONG, wait_for

CLIENT = os.environ["SOAK_CLIENT"]
REQUESTS = int(os.environ.get("SOAK_REQUESTS", "100000"))
CLIENTS = 16
WORKERS = 4
FAR_TOO_LONG = 3600
# What the allocator may keep of what was there at the same time, once.
GROWTH_KIB = 1024


class Soak(scgi_server.ServerTest):
    def test_leaves_the_server_as_it_was(self):
        server = self.start("--min-workers", str(WORKERS), "--max-workers", str(WORKERS))
        self.echo()
        begun = time.monotonic()
        self.send(0, REQUESTS // 10)
        before = self.look(server.pid)
        self.send(REQUESTS // 10, REQUESTS - REQUESTS // 10)
        after = self.look(server.pid)
        seconds = time.monotonic() - begun
        print(f"{REQUESTS} requests, {seconds:.0f} s: {before} {after}", file=sys.stderr)
        self.assertLessEqual(after["memory"], before["memory"] + GROWTH_KIB)
        self.assertEqual(after["descriptors"], before["descriptors"])

    def send(self, first, count):
        subprocess.run(
            [CLIENT, self.socket, str(count), str(CLIENTS), str(first)],
            check=True,
            timeout=FAR_TOO_LONG,
        )

    def look(self, pid):
        """Once as many workers are ready as there always are."""
        self.assertTrue(wait_for(lambda: len(self.processes()) == WORKERS + 2, LONG))
        descriptors = []

        def is_quiet():
            descriptors.append(len(os.listdir(f"/proc/{pid}/fd")))
            return len(descriptors) > 20 and descriptors[-20:] == 20 * descriptors[-1:]

        self.assertTrue(wait_for(is_quiet), descriptors)
        with open(f"/proc/{pid}/status", encoding="ascii") as file:
            [memory] = [int(line.split()[1]) for line in file if line.startswith("VmRSS:")]
        return {"memory": memory, "descriptors": descriptors[-1]}


if __name__ == "__main__":
    unittest.main()
