"""A web server of scripts/web-server, as the tests start and stop it."""

import os
import pathlib
import queue
import re
import signal
import socket
import subprocess
import threading
import time

PROJECT = pathlib.Path(__file__).resolve().parents[2]
HOST = "127.0.0.1"
SANITIZER = re.compile(r"ERROR: \w*Sanitizer|runtime error:")


def free_port():
    with socket.socket() as probe:
        probe.bind((HOST, 0))
        return probe.getsockname()[1]


def wait_until(condition, seconds=20, pause=0.05):
    """Whether the condition came true in time."""
    deadline = time.monotonic() + seconds
    while not condition():
        if time.monotonic() > deadline:
            return False
        time.sleep(pause)
    return True


def processes_that_mention(text):
    """The command lines of running processes with the text in them."""
    found = []
    for entry in pathlib.Path("/proc").glob("[0-9]*/cmdline"):
        try:
            line = entry.read_bytes().replace(b"\0", b" ").decode(errors="replace")
        except OSError:
            continue
        if text in line and int(entry.parent.name) != os.getpid():
            found.append(line)
    return found


class Foreground:
    """A script in the foreground that says "ready URL" once it serves."""

    def __init__(self, command, seconds=30):
        self.process = subprocess.Popen(
            command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
            text=True)
        self.output = []
        self._lines = queue.Queue()
        threading.Thread(target=self._read, daemon=True).start()
        self.ready = self._await_ready(seconds)

    def _read(self):
        with self.process.stdout:
            for line in self.process.stdout:
                self.output.append(line)
                self._lines.put(line)
        self._lines.put(None)

    def _await_ready(self, seconds):
        deadline = time.monotonic() + seconds
        while True:
            try:
                line = self._lines.get(timeout=max(0, deadline - time.monotonic()))
            except queue.Empty:
                return False
            if line is None:
                return False
            if re.match(r"ready https?://\S+/$", line):
                return True

    def is_alive(self):
        return self.process.poll() is None

    def stop(self, number=signal.SIGTERM):
        """The exit status, after the signal."""
        self.process.send_signal(number)
        return self.process.wait(timeout=30)


class WebServer:
    """Serves a root on a free loopback port. The words of `through` start the script."""

    def __init__(self, name, root, run_dir, options=(), through=(), mode="cgi"):
        self.name = name
        self.mode = mode
        self.through = list(through)
        self.options = [str(option) for option in options]
        self.root = pathlib.Path(root).resolve()
        self.run_dir = pathlib.Path(run_dir)
        self.webapi_dir = self.root / "usr/talo/taloman/webapi"
        self.entry = self.webapi_dir / "entry.cgi"
        self.warm_program = self.root / "usr/sbin/webapi-server"
        self.service_program = self.root / "usr/talo/sbin/talo-service"
        self.start()

    def start(self):
        for _ in range(3):
            self.port = free_port()
            self.script = Foreground(self.command())
            if self.script.ready:
                return
            self.script.process.wait(timeout=30)
        raise RuntimeError("no web server: " + "".join(self.script.output))

    def command(self):
        return [*self.through, str(PROJECT / "scripts/web-server"), "--server", self.name,
                "--mode", self.mode, "--port", str(self.port), "--root", str(self.root),
                "--run-dir", str(self.run_dir), *self.options]

    def other(self, suffix, options=(), mode=None):
        """Another one of the same kind, or of the other mode, for the same root."""
        return WebServer(self.name, self.root, f"{self.run_dir}-{suffix}", options,
                         mode=mode or self.mode)

    def restarts(self):
        """How often the server has finished a start or a restart, by its own log."""
        sign = {"lighttpd": "server started", "nginx": "start worker process ",
                "apache": "resuming normal operations"}[self.name]
        return (self.run_dir / "error.log").read_text(errors="replace").count(sign)

    def logs(self):
        return "".join(path.read_text(errors="replace") for path in self.run_dir.glob("*.log"))

    def sanitizers(self):
        """What sanitizers have found in the programs that the server ran."""
        return [line for line in self.logs().splitlines() if SANITIZER.search(line)]
