"""How the cost of a request grows with what it has to do: scripts/bench growth --help."""

import argparse
import json
import os
import pathlib
import secrets
import statistics
import sys
import time
import urllib.parse

HERE = pathlib.Path(__file__).resolve().parent
sys.path.insert(0, str(HERE))

import document  # noqa: E402
import fit  # noqa: E402
import plot  # noqa: E402
import wrk  # noqa: E402
from appliance import (ENTRY, HOST, INFO, PROJECT, Appliance, add_account,  # noqa: E402
                       has_warm_mode, install_module, write_settings)
from mounts import in_own_mounts, root_of  # noqa: E402
from table import markdown, number, seconds  # noqa: E402

KIB, MIB = 1 << 10, 1 << 20
ROUNDS = 15
LEAST_ROUNDS = 3
# Of one series; what is slow is measured less often.
SECONDS = 8.0


def costs(askers):
    """{n: median seconds} of (n, function that asks and returns seconds), interleaved. The
    first rounds do not count: processes that live on are not all warm yet."""
    samples = {n: [] for n, _ in askers}
    for _ in range(LEAST_ROUNDS):
        for _, ask in askers:
            ask()
    start = time.monotonic()
    for turn in range(ROUNDS):
        if turn >= LEAST_ROUNDS and time.monotonic() - start > SECONDS:
            break
        for n, ask in askers:
            samples[n].append(ask())
    return {n: statistics.median(times) for n, times in samples.items()}


class Growths:
    """Each method measures one table: (title, name of n, {series: {n: seconds}})."""

    def __init__(self, appliance, sid, options):
        self._appliance = appliance
        self._sid = sid
        self._options = options
        self.complaints = []

    def _sizes(self, *sizes):
        """All of them, or the smallest few for a trial."""
        return sizes[:3] if self._options.trial else sizes

    def _get(self, query):
        return lambda: self._appliance.get(query, self._sid).seconds

    def _post(self, body):
        return lambda: self._appliance.post(body, self._sid).seconds

    def described(self):
        """The state grows, so the sizes come one after the other."""
        template = json.loads((self._appliance.webapi / "TALO.System.lib").read_text())
        info, catalog = {}, {}
        made = 0
        shipped = len(list(self._appliance.webapi.glob("*.lib")))
        for size in self._sizes(10, 30, 100, 300, 1000):
            while shipped + made < size:
                made += 1
                name = f"Bench.Api{made:04}"
                text = json.dumps({name: template["TALO.System"]}, indent=4)
                (self._appliance.webapi / f"{name}.lib").write_text(text)
            self._settle()
            info.update(costs([(size, self._get(INFO))]))
            catalog.update(costs([(size, self._get("api=TALO.Catalog&version=1&method=list"))]))
        for path in self._appliance.webapi.glob("Bench.Api*.lib"):
            path.unlink()
        self._settle()
        return ("APIs described", "APIs", {"a call": info, "the list of all": catalog})

    def _settle(self):
        """A server that watches the folder may take a moment to see what is new."""
        if self._options.mode == "warm":
            time.sleep(6)
        self._appliance.get(INFO, self._sid)

    def parameters(self):
        askers = []
        for size in self._sizes(KIB, 10 * KIB, 100 * KIB, MIB, 10 * MIB):
            text = f"{INFO}&pad={'p' * size}"
            # Of so many bytes each that the limit of a document's values is not reached.
            array = f"{INFO}&pad=" + json.dumps(["p" * 96] * max(1, size // 100))
            askers.append((size, self._post(text), self._post(array)))
        return ("Size of the parameters", "bytes", {
            "a text": costs([(n, text) for n, text, _ in askers]),
            "a JSON array of texts": costs([(n, array) for n, _, array in askers])})

    def replies(self):
        askers = [(rows * 1000, self._get(f"api=Bench.Reply&version=1&method=rows&count={rows}"))
                  for rows in self._sizes(1, 10, 100, 1000, 10000, 100000)]
        return ("Size of the reply", "bytes", {"rows of 1,000 bytes": costs(askers)})

    def elements(self):
        call = {"api": "TALO.System", "version": 2, "method": "info"}
        askers = [(count, self._post(urllib.parse.urlencode({
            "api": "TALO.Entry.Request", "version": 1, "method": "request",
            "compound": json.dumps([call] * count)})))
            for count in self._sizes(1, 3, 10, 30, 100, 300, 1000)]
        return ("Elements of a compound request", "elements", {"info under a session":
                                                                costs(askers)})

    def sessions(self):
        """Files of another user's sessions, made as the host makes them."""
        folder = self._appliance.sessions
        record = json.loads((folder / self._sid).read_text())
        sizes = self._sizes(10, 100, 1000, 10000, 100000)
        if self._options.million:
            sizes += (1000000,)
        check, listing = {}, {}
        made = len(os.listdir(folder))
        for size in sizes:
            for number_of in range(made, size):
                record.update(user="other", handle="h" + secrets.token_urlsafe(9))
                path = folder / ("s" + secrets.token_urlsafe(32))
                path.write_text(json.dumps(record, separators=(",", ":")))
                path.chmod(0o600)
                made = number_of + 1
            check.update(costs([(size, self._get(INFO))]))
            listing.update(costs([(size, self._get("api=TALO.Session&version=1&method=list"))]))
        return ("Sessions", "session files", {"a session check": check,
                                              "the list of one's own": listing})

    def _await_calm(self, usual):
        """What the clients before have asked for may still be worked at."""
        deadline = time.monotonic() + 20
        while time.monotonic() < deadline:
            try:
                if self._get(INFO)() <= 3 * usual:
                    return
            except RuntimeError:
                pass  # refused
            time.sleep(0.1)

    def clients(self):
        """What one request costs when so many ask at once, and how long each waits."""
        sizes = self._sizes(1, 2, 4, 8, 16, 32, 64, 128, 256)
        url = f"http://{HOST}:{self._appliance.web.port}{ENTRY}?{INFO}"
        samples = {size: wrk.Samples() for size in sizes}
        usual = costs([(1, self._get(INFO))])[1]
        for _ in range(1 if self._options.trial else 3):
            for size in sizes:
                # Where each request takes a process, all have their turn in some seconds only.
                span = 4 if self._options.mode == "cgi" and size >= 64 else 1
                self._await_calm(usual)
                samples[size].add(wrk.run(url, {"Cookie": f"id={self._sid}"}, size, span))
        for size in sizes:
            if failures := samples[size].failures():
                self.complaints.append(f"{size} clients: not all were served: {failures}")
        sizes = [size for size in sizes if not samples[size].failures()]
        return ("Concurrent clients", "clients", {
            "one answer for each": {size: size / samples[size].rate for size in sizes},
            "median wait": {size: samples[size].p50 / 1000 for size in sizes}})


TABLES = {
    "apis": Growths.described,
    "parameters": Growths.parameters,
    "reply": Growths.replies,
    "compound": Growths.elements,
    "clients": Growths.clients,
    # Last: it leaves as many sessions as it has made.
    "sessions": Growths.sessions,
}


def text_of(title, what, series):
    header, rows = [what], []
    for name in series:
        header += [name, "a unit"]
    sizes = list(next(iter(series.values())))
    for size in sizes:
        row = [f"{size:,}"]
        for points in series.values():
            row += [seconds(points[size]), seconds(points[size] / size)]
        rows.append(row)
    grown = {name: fit.grow(list(points.items())) for name, points in series.items()}
    last = ["growth"]
    for growth in grown.values():
        last += [growth.words(), "" if growth.flat else f"+ {seconds(growth.per_unit)}"]
    return (f"### {title}\n\n{markdown(header, [*rows, last])}",
            [f"{title}, {name}: {growth.words()}" for name, growth in grown.items()
             if not growth.is_linear_or_better()])


def arguments():
    parser = argparse.ArgumentParser(prog="scripts/bench growth",
                                     description=__doc__.partition(":")[0] + ".")
    parser.add_argument("tables", nargs="*", metavar="TABLE",
                        help=f"of {', '.join(TABLES)}; all unless given")
    parser.add_argument("--build", default=PROJECT / "build/release", type=pathlib.Path,
                        help="folder of the release build")
    parser.add_argument("--server", default="lighttpd", choices=("lighttpd", "nginx"))
    parser.add_argument("--mode", choices=("cgi", "warm"),
                        help="warm unless given, where this build has it")
    parser.add_argument("--million", action="store_true",
                        help="1,000,000 sessions too: takes minutes and 4 GiB of memory")
    parser.add_argument("--trial", action="store_true", help="the smallest sizes only")
    parser.add_argument("--document", action="store_true",
                        help="put the results into docs/performance.md")
    options = parser.parse_args()
    unknown = set(options.tables) - set(TABLES)
    if unknown:
        parser.error(f"no table {', '.join(sorted(unknown))}")
    if options.document and (options.tables or options.trial):
        parser.error("only a whole run goes into the document")
    return options


def measure_all(appliance, options):
    """The tables, and what went wrong."""
    growths = Growths(appliance, appliance.log_in(), options)
    measured = []
    for name, measure in TABLES.items():
        if not options.tables or name in options.tables:
            start = time.monotonic()
            measured.append(measure(growths))
            print(f"{name}: {number(time.monotonic() - start)} s", file=sys.stderr)
    return measured, growths.complaints


def report(measured, complaints, note, results, in_document):
    """Prints and publishes; whether all is well."""
    texts, worse = zip(*(text_of(*table) for table in measured))
    worse = [growth for found in worse for growth in found]
    print("\n" + "\n\n".join([note, *texts]) + "\n")
    print("\n".join(complaints + worse or ["Everything grows linearly or better."]))
    panels = [(title, what, [(name, list(points.items())) for name, points in series.items()])
              for title, what, series in measured]
    picture = plot.panels("Time from the request to the end of the reply", panels)
    parts = [note, "![How the cost of a request grows](performance-growth.svg)", *texts]
    document.publish("growth", "\n\n".join(parts), {"performance-growth.svg": picture}, results,
                     in_document and not complaints)
    return not complaints and not worse


def main():
    options = arguments()
    build = options.build.resolve()
    root = root_of(build)
    in_own_mounts(__file__, root, build)
    warning = document.load_warning()
    add_account(root)
    write_settings(root)
    install_module(root, build)
    options.mode = options.mode or ("warm" if has_warm_mode(root) else "cgi")
    appliance = Appliance(root, build / "run/bench-growth", options.server, options.mode)
    try:
        measured, complaints = measure_all(appliance, options)
    finally:
        appliance.stop()
    note = (f"Measured {document.machine()}; {options.mode} behind {options.server}, "
            f"medians. {warning}").strip()
    well = report(measured, complaints, note, build / "bench-results", options.document)
    return 0 if well else 1


if __name__ == "__main__":
    sys.exit(main())
