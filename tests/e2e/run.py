"""All end-to-end cases against one web server: run.py --help."""

import argparse
import json
import os
import pathlib
import shutil
import signal
import sys
import unittest

HERE = pathlib.Path(__file__).resolve().parent
sys.path.insert(0, str(HERE))

from case import Case  # noqa: E402
from webserver import WebServer, processes_that_mention, wait_until  # noqa: E402

MOUNTED = "WEBAPI_E2E_MOUNTED"
SMALL_VOLUME_MEBIBYTES = 48


def install_test_apis(root, modules, life):
    """Puts the test APIs beside the shipped ones, and lets all workers live that long."""
    webapi_dir = pathlib.Path(root) / "usr/talo/taloman/webapi"
    libraries = list(pathlib.Path(modules).glob("*.so"))
    if not libraries:
        raise SystemExit(f"no API libraries in {modules}")
    for path in libraries:
        shutil.copy(path, webapi_dir / "lib")
    for path in [*HERE.parent.glob("modules/*.lib"), *HERE.glob("*.lib")]:
        shutil.copy(path, webapi_dir)
    for path in webapi_dir.glob("*.lib") if life else ():
        set_isolation(path, life)


def set_isolation(path, life):
    apis = json.loads(path.read_text(encoding="utf-8"))
    for description in apis.values():
        description["isolation"] = life
    path.write_text(json.dumps(apis), encoding="utf-8")


def in_own_mounts(root, build, small_volume):
    """Begins anew with an installation of our own in the root's place, and with a small
    file system on that folder; both end with us, and nobody else sees them. Capabilities
    that this takes are given back before anything is tested."""
    if MOUNTED in os.environ:
        return
    os.makedirs(root, exist_ok=True)
    os.makedirs(small_volume, exist_ok=True)
    unshare = ["unshare", "--mount"]
    drop = ""
    if os.geteuid() != 0:
        unshare += ["--user", "--map-current-user", "--keep-caps"]
        drop = "setpriv --inh-caps=-all --ambient-caps=-all"
    script = (f'mount -t tmpfs -o mode=755 none "$1" && '
              f'env -u DESTDIR cmake --install "$2" >/dev/null && '
              f'mount -t tmpfs -o size={SMALL_VOLUME_MEBIBYTES}m,mode=777 none "$3" && '
              f'shift 3 && exec {drop} "$@"')
    os.execvpe("unshare", [*unshare, "sh", "-c", script, "sh", root, build, small_volume,
                           sys.executable, "-B", os.path.abspath(__file__), *sys.argv[1:]],
               {**os.environ, MOUNTED: "yes"})


def run_cases(files, pattern):
    loader = unittest.TestLoader()
    if pattern:
        loader.testNamePatterns = [f"*{pattern}*"]
    suite = loader.discover(str(HERE), pattern=files)
    result = unittest.TextTestRunner(verbosity=2).run(suite)
    return result.testsRun > 0 and result.wasSuccessful() and not result.skipped


def complaints_after(server, status):
    if status != 0:
        yield f"the script ended with {status}: {''.join(server.script.output)}"
    if not wait_until(lambda: not processes_that_mention(str(server.run_dir))):
        yield f"still running: {processes_that_mention(str(server.run_dir))}"
    if server.service_program.exists():
        yield f"{server.service_program} was left behind"
    yield from server.sanitizers()


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("--server", required=True, choices=("lighttpd", "nginx", "apache"))
    parser.add_argument("--mode", default="cgi", choices=("cgi", "warm"))
    parser.add_argument("--life", choices=("request", "worker"),
                        help="of a warm worker, whatever the descriptions say")
    parser.add_argument("--root", required=True, help="the root that the build was made for")
    parser.add_argument("--build", required=True, help="the build's folder, to install from")
    parser.add_argument("--run-dir", required=True, help="the web server's own folder")
    parser.add_argument("--modules", required=True, help="folder of the test API libraries")
    parser.add_argument("--slow", action="store_true", help="the cases that take minutes")
    parser.add_argument("pattern", nargs="?", help="only cases with this in their name")
    arguments = parser.parse_args()
    run_dir = os.path.abspath(arguments.run_dir)
    small_volume = f"{run_dir}-small-volume"
    in_own_mounts(arguments.root, arguments.build, small_volume)
    Case.small_volume = pathlib.Path(small_volume)

    install_test_apis(arguments.root, arguments.modules, arguments.life)
    server = Case.server = WebServer(arguments.server, arguments.root, run_dir,
                                     mode=arguments.mode)
    try:
        files = "slow_*.py" if arguments.slow else "test_*.py"
        passed = run_cases(files, arguments.pattern)
    finally:
        status = server.script.stop(signal.SIGTERM)
    complaints = list(complaints_after(server, status))
    for complaint in complaints:
        print(complaint, file=sys.stderr)
    if not passed:
        print(server.logs()[-4000:], file=sys.stderr)
    return 0 if passed and not complaints else 1


if __name__ == "__main__":
    sys.exit(main())
