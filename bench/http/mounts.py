"""An installation of our own in the root's place, which nobody else sees."""

import os
import pathlib
import signal
import sys

MOUNTED = "WEBAPI_BENCH_MOUNTED"
# What a service gets; a shell's environment would go through each request of some ways
# to serve, and not of others.
KEPT = ("PATH", "HOME", "LANG", "TMPDIR")


def in_own_mounts(script, root, build):
    """Begins `script` anew with a fresh installation mounted over the root. Accounts,
    sessions and test APIs that are made there end with us."""
    if MOUNTED in os.environ:
        # What was started ends with us then, as after an interruption.
        signal.signal(signal.SIGTERM, lambda *_: sys.exit(1))
        return
    os.makedirs(root, exist_ok=True)
    unshare = ["unshare", "--mount"]
    drop = ""
    if os.geteuid() != 0:
        unshare += ["--user", "--map-current-user", "--keep-caps"]
        drop = "setpriv --inh-caps=-all --ambient-caps=-all"
    commands = ('mount -t tmpfs -o mode=755,size=80%,nr_inodes=0 none "$1" && '
                'env -u DESTDIR cmake --install "$2" >/dev/null && '
                f'shift 2 && exec {drop} "$@"')
    os.execvpe("unshare", [*unshare, "sh", "-c", commands, "sh", str(root), str(build),
                           sys.executable, "-B", os.path.abspath(script), *sys.argv[1:]],
               {**{name: os.environ[name] for name in KEPT if name in os.environ},
                MOUNTED: "yes"})


def root_of(build):
    """The TALO_ROOT that a build was given."""
    for line in (pathlib.Path(build) / "CMakeCache.txt").read_text().splitlines():
        if line.startswith("TALO_ROOT:"):
            return pathlib.Path(line.partition("=")[2])
    raise SystemExit(f"{build} is no build")
