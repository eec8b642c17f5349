"""What a change did to the micro-benchmarks: scripts/bench --compare REV [GROUP]...

Runs the benchmark program of this checkout and that of another revision in turns, and
prints the medians of both with their ratio."""

import argparse
import re
import statistics
import subprocess
import sys

ROW = re.compile(r"^  (\S.*?) +([0-9.]+) us +[0-9.]+  +[+-][0-9.]+ us$")


def rows_of(output):
    """{(title, row): microseconds} of the table that the benchmark program prints."""
    found, title = {}, ""
    for line in output.splitlines():
        row = ROW.match(line)
        if row:
            found[title, row[1]] = float(row[2])
        elif line.strip():
            title = line.strip()
    return found


def run(program, groups):
    return rows_of(subprocess.run([program, *groups], stdout=subprocess.PIPE, text=True,
                                  check=True).stdout)


def compare(theirs, ours, groups, rounds):
    """[(title, row, [theirs], [ours])], in the order of the tables."""
    times = {}
    for turn in range(rounds):
        for side, program in enumerate((theirs, ours)):
            for key, value in run(program, groups).items():
                times.setdefault(key, ([], []))[side].append(value)
        print(f"round {turn + 1} of {rounds}", file=sys.stderr)
    return [(*key, *sides) for key, sides in times.items()]


def table(name, rows):
    yield f"{'medians in µs':<46} {name:>12} {'now':>12} {'ratio':>7}"
    before = None
    for title, row, theirs, ours in rows:
        if title != before:
            yield f"\n{title}"
            before = title
        left, right = (statistics.median(side) if side else None for side in (theirs, ours))
        texts = ["-" if value is None else f"{value:.2f}" for value in (left, right)]
        ratio = f"{right / left:.3f}" if left and right else "-"
        yield f"  {row:<44} {texts[0]:>12} {texts[1]:>12} {ratio:>7}"


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("name", help="of the other revision")
    parser.add_argument("theirs", help="its benchmark program")
    parser.add_argument("ours", help="the one of this checkout")
    parser.add_argument("groups", nargs="*", help="of the benchmark program; all unless given")
    parser.add_argument("--rounds", type=int, default=5)
    options = parser.parse_args()
    rows = compare(options.theirs, options.ours, options.groups, options.rounds)
    if not rows:
        raise SystemExit(f"nothing was measured: {' '.join(options.groups)}")
    print("\n".join(table(options.name, rows)))


if __name__ == "__main__":
    main()
