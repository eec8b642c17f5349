"""The peers behind a web server: a program with an HTTP library, and a script of PHP-FPM."""

import os
import pathlib
import shutil
import socket
import subprocess
import tempfile

from appliance import HOST, HERE, free_port, wait_until

PEERS = HERE.parent / "peers"


def php_fpm():
    """The newest that is installed; Debian's name has the version in it."""
    found = sorted(pathlib.Path("/usr/sbin").glob("php-fpm*"))
    if not found:
        raise SystemExit("no php-fpm is installed")
    return found[-1]


class Peers:
    """Started and stopped together. `paths` says under which path each one answers."""

    paths = {
        "cpp-httplib": "/httplib",
        "cpp-httplib, description parsed once": "/httplib-described",
        "PHP-FPM": "/php",
    }
    # Only nginx keeps its connections to a program behind it.
    nginx_paths = {"cpp-httplib, connections kept": "/httplib-kept"}

    def __init__(self, server, root, build, run_dir):
        self.server = server
        self.build = build
        self.root = root
        self.run_dir = pathlib.Path(run_dir)
        shutil.rmtree(self.run_dir, ignore_errors=True)
        for folder in ("tmp", "htdocs"):
            (self.run_dir / folder).mkdir(parents=True)
        # A socket's path is short.
        self._short = tempfile.TemporaryDirectory(prefix="bench-peers-")
        self._processes = []
        try:
            self._start()
        except BaseException:
            self.stop()
            raise

    def _start(self):
        self.port, plain, described = (free_port() for _ in range(3))
        self._values = {
            "RUN_DIR": self._short.name, "PORT": self.port, "HTTPLIB_PORT": plain,
            "DESCRIBED_PORT": described, "PEERS_DIR": PEERS,
            "SESSIONS": self.root / "run/talo/session",
            "DESCRIPTION": self.root / "usr/talo/taloman/webapi/TALO.System.lib",
        }
        os.makedirs(f"{self._short.name}/tmp")
        os.makedirs(f"{self._short.name}/htdocs")
        program = self.build / "bench/bench-httplib"
        facts = [self._values["SESSIONS"], self._values["DESCRIPTION"]]
        self._launch(program, HOST, plain, *facts)
        self._launch(program, HOST, described, *facts, "keep")
        as_root = os.geteuid() == 0
        user = "user = root\ngroup = root" if as_root else ""
        self._launch(php_fpm(), "-F", "-y", self._configuration("php-fpm", user),
                     *(["-R"] if as_root else []))
        user = "user root;" if as_root else ""
        configuration = self._configuration(self.server, user)
        if self.server == "nginx":
            self._launch("nginx", "-p", self._short.name, "-c", configuration, "-e",
                         self.run_dir / "error.log")
        else:
            self._launch("lighttpd", "-D", "-f", configuration)
        for port in (self.port, plain, described):
            self._await(lambda port=port: answers(port))
        self._await((pathlib.Path(self._short.name) / "php.sock").exists)

    def _configuration(self, name, user):
        text = (PEERS / f"{name}.conf.in").read_text()
        for key, value in {**self._values, "USER_LINE": user}.items():
            text = text.replace(f"@{key}@", str(value))
        path = self.run_dir / f"{name}.conf"
        path.write_text(text)
        return path

    def _launch(self, *words):
        with open(self.run_dir / "output.log", "ab") as log:
            self._processes.append(subprocess.Popen(
                ["setpriv", "--pdeathsig", "TERM", *map(str, words)], stdin=subprocess.DEVNULL,
                stdout=log, stderr=log, env={**os.environ, "PATH": os.environ["PATH"] +
                                             ":/usr/sbin:/sbin"}))

    def _await(self, condition):
        alive = all(process.poll() is None for process in self._processes)
        if not alive or not wait_until(condition):
            raise RuntimeError("the peers do not start: " +
                               (self.run_dir / "output.log").read_text(errors="replace"))

    def urls(self):
        paths = {**self.paths, **(self.nginx_paths if self.server == "nginx" else {})}
        return {name: (self.port, path) for name, path in paths.items()}

    def stop(self):
        for process in reversed(self._processes):
            process.terminate()
        for process in self._processes:
            process.wait(timeout=30)
        self._short.cleanup()


def answers(port):
    try:
        socket.create_connection((HOST, port), timeout=1).close()
    except OSError:
        return False
    return True
