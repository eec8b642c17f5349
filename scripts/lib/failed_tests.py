"""Prints how each failed test of a CTest run ended: failed_tests.py JUNIT-FILE"""

import sys
import xml.etree.ElementTree

LAST_LINES = 60


def failed(report):
    """The tests that count as failed, each with why and what it printed. One that was
    skipped on purpose says so with a return code or a text of its own."""
    for test in xml.etree.ElementTree.parse(report).getroot().iter("testcase"):
        reason = test.find("failure")
        if reason is None and test.get("status") == "notrun":
            reason = test.find("skipped")
            if reason is not None and reason.get("message", "").startswith("SKIP_"):
                continue
        if reason is not None:
            printed = test.findtext("system-out") or ""
            why = reason.get("message") or f"failed after {float(test.get('time')):.1f} s"
            yield test.get("name"), why, printed


def without_passed_cases(printed):
    """The lines that tell of failure: a suite of GoogleTest has many cases."""
    kept, case = [], None
    for line in printed.rstrip().splitlines():
        if line.startswith("[ RUN      ]"):
            case = len(kept)
        if line.startswith("[       OK ]") and case is not None:
            del kept[case:]
            case = None
        else:
            kept.append(line)
    return kept


def main():
    tests = list(failed(sys.argv[1]))
    for name, why, printed in tests:
        lines = without_passed_cases(printed)
        print(f"\n--- {name}: {why}")
        if len(lines) > LAST_LINES:
            print(f"[{len(lines) - LAST_LINES} lines before these]")
        print("\n".join(lines[-LAST_LINES:]))
    if tests:
        print(f"\n{len(tests)} failed: " + ", ".join(name for name, _, _ in tests))


if __name__ == "__main__":
    main()
