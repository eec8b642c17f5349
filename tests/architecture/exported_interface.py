"""The library shows exactly the symbols of the released interface.

A symbol that is gone breaks the API libraries in the field; a new one is added
to interface.txt on purpose, with the release that brings it. With --write the
list is made anew.
"""

import pathlib
import subprocess
import sys


def exported(library):
    out = subprocess.run(["nm", "-D", "--defined-only", library], check=True,
                         capture_output=True, text=True).stdout
    symbols = {line.split()[2].split("@")[0] for line in out.splitlines()}
    # Sanitizers leave marks of their own.
    return sorted(name for name in symbols if not name.startswith(("__asan", "__odr_asan")))


def main():
    library, listing = sys.argv[1], pathlib.Path(sys.argv[2])
    now = exported(library)
    if sys.argv[3:] == ["--write"]:
        listing.write_text("\n".join(now) + "\n", encoding="utf-8")
        return
    released = listing.read_text(encoding="utf-8").split()
    gone = sorted(set(released) - set(now))
    new = sorted(set(now) - set(released))
    if gone or new:
        sys.exit("\n".join(["gone: " + name for name in gone] + ["new: " + name for name in new]))


main()
