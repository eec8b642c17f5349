"""What wrk, the load generator, measures of a URL."""

import json
import pathlib
import re
import statistics
import subprocess

SCRIPT = pathlib.Path(__file__).resolve().parent / "wrk.lua"
FAILURES = ("connect", "read", "write", "status", "timeout")


class Sample:
    """One run: requests a second, p50 and p99 in milliseconds."""

    def __init__(self, measured):
        self.requests = measured["requests"]
        self.rate = self.requests / (measured["microseconds"] / 1e6)
        self.p50 = measured["p50"] / 1000
        self.p99 = measured["p99"] / 1000
        self.bytes = measured["bytes"] / max(1, self.requests)
        self.failures = {name: measured[name] for name in FAILURES if measured[name]}


def run(url, headers, connections, seconds):
    """One thread: the load generator shall not take both processors of a small machine."""
    command = ["wrk", "-t1", f"-c{connections}", f"-d{seconds}s", "--timeout", "10s", "-s",
               str(SCRIPT)]
    for name, value in headers.items():
        command += ["-H", f"{name}: {value}"]
    output = subprocess.run([*command, url], stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
                            text=True, check=False).stdout
    found = re.search(r"^measured (\{.*\})$", output, re.M)
    if not found:
        raise RuntimeError(f"wrk says of {url}: {output}")
    measured = json.loads(found[1])
    if measured["requests"] == 0:
        raise RuntimeError(f"no answer from {url} to {connections} clients in {seconds} s")
    return Sample(measured)


class Samples:
    """The runs of one subject, and their medians."""

    def __init__(self):
        self._samples = []

    def add(self, sample):
        self._samples.append(sample)

    def __bool__(self):
        return bool(self._samples)

    def _median(self, name):
        return statistics.median(getattr(sample, name) for sample in self._samples)

    @property
    def rate(self):
        return self._median("rate")

    @property
    def p50(self):
        return self._median("p50")

    @property
    def p99(self):
        return self._median("p99")

    def failures(self):
        found = {}
        for sample in self._samples:
            for name, count in sample.failures.items():
                found[name] = found.get(name, 0) + count
        return found
