"""Compares the modes of the web API with other ways to serve: scripts/bench peers --help."""

import argparse
import json
import pathlib
import statistics
import sys

HERE = pathlib.Path(__file__).resolve().parent
sys.path.insert(0, str(HERE))

import document  # noqa: E402
import plot  # noqa: E402
import wrk  # noqa: E402
from appliance import (ENTRY, HOST, INFO, ONCE, PROJECT, Appliance, add_account,  # noqa: E402
                       ask, has_warm_mode, install_module, write_settings)
from mounts import in_own_mounts, root_of  # noqa: E402
from peers import Peers  # noqa: E402
from table import markdown, number  # noqa: E402

COLD = "cold CGI"
ONCE_ROW = "warm, one request per process"
LIVING = "warm, living workers"
HTTPLIB = "cpp-httplib"
PHP = "PHP-FPM"
CONNECTIONS = (1, 16)
# An error's reply is shorter than the right one by more.
SIZE_TOLERANCE = 100


class Subject:
    """What is measured: a way to serve, behind a web server."""

    def __init__(self, name, server, port, target, sid):
        self.name = name
        self.server = server
        self.port = port
        self.target = target
        self.sid = sid
        self.samples = {connections: wrk.Samples() for connections in CONNECTIONS}
        self.complaints = []

    def right_size(self):
        """Of its reply, which has to tell success."""
        return ask(self.port, f"GET {self.target}", self.sid).size

    def measure(self, connections, seconds):
        expected = self.right_size()
        sample = wrk.run(f"http://{HOST}:{self.port}{self.target}",
                         {"Cookie": f"id={self.sid}"}, connections, seconds)
        if abs(sample.bytes - expected) > SIZE_TOLERANCE:
            self.complaints.append(f"replies of {sample.bytes:.0f} bytes instead of {expected}")
        if sample.failures:
            self.complaints.append(f"at {connections}: {sample.failures}")
        self.samples[connections].add(sample)


def lives_on(warm):
    """Whether the measured API lets its worker serve the next request."""
    description = json.loads((warm.webapi / "TALO.System.lib").read_text())
    return description["TALO.System"].get("isolation") == "worker"


class Field:
    """All that runs at the same time."""

    def __init__(self, servers, root, build, run_dir):
        self._stops = []
        self.subjects = []
        self.warm = []
        add_account(root)
        write_settings(root)
        install_module(root, build)
        try:
            for server in servers:
                self._start(server, root, build, run_dir)
        except BaseException:
            self.stop()
            raise

    def _start(self, server, root, build, run_dir):
        cold = Appliance(root, run_dir / f"{server}-cgi", server, "cgi")
        self._stops.append(cold.stop)
        sid = cold.log_in()

        def add(name, port, target):
            self.subjects.append(Subject(name, server, port, target, sid))

        add(COLD, cold.web.port, f"{ENTRY}?{INFO}")
        if has_warm_mode(root):
            warm = Appliance(root, run_dir / f"{server}-warm", server, "warm")
            self._stops.append(warm.stop)
            self.warm.append(warm)
            add(ONCE_ROW, warm.web.port, f"{ENTRY}?{ONCE}")
            if lives_on(warm):
                add(LIVING, warm.web.port, f"{ENTRY}?{INFO}")
        peers = Peers(server, root, build, run_dir / f"{server}-peers")
        self._stops.append(peers.stop)
        for name, (port, path) in peers.urls().items():
            add(name, port, f"{path}?{INFO}")

    def stop(self):
        for stop in reversed(self._stops):
            stop()


def dirty_kibibytes(pid):
    """Private memory of a process that is its own alone."""
    text = pathlib.Path(f"/proc/{pid}/smaps_rollup").read_text()
    return sum(int(line.split()[1]) for line in text.splitlines()
               if line.startswith("Private_Dirty:"))


def idle_memory(field):
    """The median over the workers that wait, in MiB; None where there are none."""
    sizes = [dirty_kibibytes(pid) for warm in field.warm[:1] for pid in warm.workers()]
    return statistics.median(sizes) / 1024 if sizes else None


def cell(samples, subjects, connections):
    """Requests a second, p50, p99 and the ratio to cold CGI behind the same server."""
    if not samples:
        return ["not measured", "", "", ""]
    cold = subjects[COLD].samples[connections].rate
    return [number(samples.rate), number(samples.p50), number(samples.p99),
            f"{samples.rate / cold:.2f}"]


def by_name(field, server):
    return {subject.name: subject for subject in field.subjects if subject.server == server}


ROWS = (COLD, ONCE_ROW, LIVING, HTTPLIB, "cpp-httplib, description parsed once",
        "cpp-httplib, connections kept", PHP)


def tables(field, servers):
    header = ["", "1: req/s", "p50 ms", "p99 ms", "× cold", "16: req/s", "p50 ms", "p99 ms",
              "× cold"]
    for server in servers:
        subjects = by_name(field, server)
        rows = []
        for name in ROWS:
            if name not in subjects and name.endswith("kept"):
                continue
            row = [name]
            for connections in CONNECTIONS:
                samples = subjects[name].samples[connections] if name in subjects else None
                row += cell(samples, subjects, connections)
            rows.append(row)
        yield markdown([f"behind {server}", *header[1:]], rows)


def best(field, name, connections):
    """The rate and the subject behind whichever server is better for it."""
    found = [(subject.samples[connections].rate, subject) for subject in field.subjects
             if subject.name == name]
    return max(found, key=lambda pair: pair[0]) if found else None


def goal_rows(field, memory):
    """(goal, value measured, whether it is met)."""
    for connections, factor in ((1, 6.0), (16, 4.5)):
        once = best(field, ONCE_ROW, connections)
        if once:
            ratio = once[0] / best(field, COLD, connections)[0]
            yield (f"one request per process, at {connections}: at least {factor:g} × cold CGI",
                   f"{ratio:.2f}", ratio >= factor)
    for peer, factor in ((HTTPLIB, 1.0), (PHP, 2.0)):
        for connections in CONNECTIONS:
            for server in sorted({subject.server for subject in field.subjects}):
                subjects = by_name(field, server)
                if LIVING in subjects:
                    ratio = (subjects[LIVING].samples[connections].rate /
                             subjects[peer].samples[connections].rate)
                    yield (f"living workers behind {server}, at {connections}: at least "
                           f"{factor:g} × {peer}", f"{ratio:.2f}", ratio >= factor)
    living = best(field, LIVING, 16)
    if living:
        samples = living[1].samples[16]
        yield ("living workers, at 16: p99 at most 4 × p50", f"{samples.p99 / samples.p50:.2f}",
               samples.p99 <= 4 * samples.p50)
    if memory is not None:
        yield ("idle worker: at most 1.5 MiB of private dirty memory", f"{memory:.2f} MiB",
               memory <= 1.5)


def goals(field, memory):
    rows = [(goal, value, "yes" if met else "no") for goal, value, met in goal_rows(field, memory)]
    return markdown(["goal", "measured", "met"], rows) if rows else ""


def picture(field, servers):
    groups = []
    for server in servers:
        subjects = by_name(field, server)
        groups.append((f"behind {server}", [
            (name, [subjects[name].samples[connections].rate for connections in CONNECTIONS])
            for name in ROWS if name in subjects]))
    return plot.bars("One call with a session check: requests a second", groups,
                     [f"{count} connection{'s' if count > 1 else ''}" for count in CONNECTIONS],
                     "more is better")


def arguments():
    parser = argparse.ArgumentParser(prog="scripts/bench peers",
                                     description=__doc__.partition(":")[0] + ".")
    parser.add_argument("--build", default=PROJECT / "build/release", type=pathlib.Path,
                        help="folder of the release build")
    parser.add_argument("--servers", default="lighttpd,nginx", help="lighttpd,nginx unless given")
    parser.add_argument("--rounds", type=int, default=7, help="of which the median counts")
    parser.add_argument("--seconds", type=int, default=1, help="of each measurement")
    parser.add_argument("--document", action="store_true",
                        help="put the results into docs/performance.md")
    return parser.parse_args()


def measure_all(field, rounds, seconds):
    for turn in range(rounds):
        for subject in field.subjects:
            for connections in CONNECTIONS:
                subject.measure(connections, seconds)
        print(f"round {turn + 1} of {rounds}", file=sys.stderr)


def report(field, servers, memory, note, results, in_document):
    """Prints and publishes; whether every request was answered well."""
    complaints = [f"{subject.name} behind {subject.server}: {complaint}"
                  for subject in field.subjects for complaint in subject.complaints]
    parts = [*tables(field, servers), goals(field, memory)]
    print("\n" + "\n\n".join(filter(None, [note, *parts])))
    for complaint in complaints:
        print(f"wrong: {complaint}", file=sys.stderr)
    plotted = "![Requests a second of each way to serve](performance-peers.svg)"
    document.publish("peers", "\n\n".join(filter(None, [note, plotted, *parts])),
                     {"performance-peers.svg": picture(field, servers)}, results,
                     in_document and not complaints)
    return not complaints


def main():
    options = arguments()
    build = options.build.resolve()
    root = root_of(build)
    in_own_mounts(__file__, root, build)
    servers = options.servers.split(",")
    warning = document.load_warning()
    field = Field(servers, root, build, build / "run/bench-peers")
    try:
        memory = idle_memory(field)
        measure_all(field, options.rounds, options.seconds)
    finally:
        field.stop()
    note = (f"Measured {document.machine()}; medians of {options.rounds} interleaved rounds of "
            f"{options.seconds} s. {warning}").strip()
    well = report(field, servers, memory, note, build / "bench-results", options.document)
    return 0 if well else 1


if __name__ == "__main__":
    sys.exit(main())
