"""A whole appliance with TLS, beside others of the same build."""

import json
import os
import pathlib
import shutil
import socket
import subprocess
import tempfile
import threading

from client import ENTRY, Client
from volumes import entries, forget_peaks
from webserver import HOST, PROJECT, WebServer

PASSWORD = "correct horse, battery"

# Gives what it runs a /dev of its own, whose "log" is the socket $2; $1 is an empty
# folder. The rights that this takes are given back.
OWN_LOG = r"""
set -e
old=$1 log=$2
shift 2
mount --rbind /dev "$old"
mount -t tmpfs -o size=1m,mode=755 none /dev
for name in null zero full random urandom tty; do
    touch /dev/$name
    mount --bind "$old/$name" /dev/$name
done
mkdir /dev/shm
mount --bind "$old/shm" /dev/shm
ln -s /proc/self/fd /dev/fd
ln -s "$log" /dev/log
[ "$(id -u)" = 0 ] || set -- setpriv --inh-caps=-all --ambient-caps=-all "$@"
exec "$@"
"""


def make_certificate(path, names="DNS:localhost,IP:127.0.0.1"):
    """A file with a key and a certificate that signs itself."""
    certificate = path.with_suffix(".crt")
    subprocess.run(
        ["openssl", "req", "-x509", "-noenc", "-newkey", "ec", "-pkeyopt",
         "ec_paramgen_curve:prime256v1", "-days", "2", "-subj", "/CN=localhost",
         "-addext", f"subjectAltName={names}", "-keyout", str(path), "-out", str(certificate)],
        check=True, capture_output=True)
    with open(path, "a", encoding="ascii") as file:
        file.write(certificate.read_text())
    return certificate


class SystemLog:
    """What the processes that were started through `command` say to syslog."""

    def __init__(self):
        # A socket's path is short.
        self._temporary = tempfile.TemporaryDirectory(prefix="log-")
        self._folder = folder = pathlib.Path(self._temporary.name)
        self._lines = []
        folder.chmod(0o755)
        (folder / "dev").mkdir()
        self._socket = socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM)
        self._socket.bind(str(folder / "log"))
        (folder / "log").chmod(0o666)
        threading.Thread(target=self._read, daemon=True).start()

    def command(self):
        unshare = ["unshare", "--mount"]
        if os.geteuid() != 0:
            unshare += ["--user", "--map-current-user", "--keep-caps"]
        return [*unshare, "sh", "-c", OWN_LOG, "sh", str(self._folder / "dev"),
                str(self._folder / "log")]

    def _read(self):
        while True:
            try:
                line = self._socket.recv(1 << 16)
            except OSError:
                return
            if not line:
                return
            self._lines.append(line.decode(errors="replace"))

    def mark(self):
        return len(self._lines)

    def since(self, mark):
        return self._lines[mark:]

    def close(self):
        self._socket.shutdown(socket.SHUT_RD)
        self._socket.close()
        self._temporary.cleanup()


class Appliance:
    """Serves the installed root with a state of its own.

    `number` is what the other appliances of a test know it by.
    """

    def __init__(self, number, server, root, run_dir, mode="cgi"):
        self.number = number
        self.root = pathlib.Path(root).resolve()
        self._folder = folder = pathlib.Path(f"{run_dir}-state")
        shutil.rmtree(folder, ignore_errors=True)
        folder.mkdir(parents=True)
        self.state = folder / "state"
        self.settings = self.state / "etc/talo"
        self.authority = make_certificate(folder / "tls.pem")
        self.log = SystemLog()
        self.server = WebServer(
            server, root, run_dir, options=["--tls", folder / "tls.pem"],
            through=[*self.log.command(), *self.on_state()], mode=mode)
        self.url = f"https://{HOST}:{self.server.port}{ENTRY}"
        self.volume = self.state / "volume1"
        self.configure()

    def on_state(self):
        return [str(PROJECT / "scripts/with-state"), "--root", str(self.root), str(self.state)]

    def client(self):
        return Client(HOST, self.server.port, str(self.authority))

    def configure(self, **settings):
        """The settings in addition to the volume for uploads."""
        settings = {"volumes": self.volume, "volumes_folders": "yes", **settings}
        text = "".join(f'{key}="{value}"\n' for key, value in settings.items())
        (self.settings / "host.conf").write_text(text)

    def accounts(self, *words, given=""):
        """What webapi-account prints."""
        return subprocess.run(
            [*self.on_state(), str(self.root / "usr/bin/webapi-account"), *map(str, words)],
            input=given + "\n", text=True, check=True, stdout=subprocess.PIPE,
            stderr=subprocess.PIPE).stdout

    def add_account(self, name, *options):
        self.accounts("add", name, *options, given=PASSWORD)

    def log_in(self, name):
        reply = self.client().call("TALO.Session", "open", account=name,
                                   passwd=json.dumps(PASSWORD))
        return reply.document()["data"]["sid"]

    def session_file(self, sid):
        return self.state / "run/talo/session" / sid

    def sessions(self):
        return sorted(path.name for path in self._folder_of("session").glob("s*"))

    def kept_sessions(self):
        """What this one keeps of its sessions at others."""
        return [path for path in self._folder_of("relay").rglob("*") if path.is_file()]

    def _folder_of(self, name):
        return self.state / "run/talo" / name

    def forget_all(self):
        """Other appliances, sessions, settings: all but the accounts."""
        for sid in self.sessions():
            self.session_file(sid).unlink(missing_ok=True)
        for name in ("relay", "throttle"):
            shutil.rmtree(self._folder_of(name), ignore_errors=True)
        (self.settings / "nodes").unlink(missing_ok=True)
        self.configure()

    def entries(self):
        """The ids of the entry processes that work for this appliance."""
        return entries(self.server, self.server.script.process.pid)

    def forget_peaks(self):
        forget_peaks(self.server, self.server.script.process.pid)

    # Other appliances

    def accepts(self, other, *classes):
        """The secret that the other has to show from now on."""
        words = [word for name in classes for word in ("--class", name)]
        return self.accounts("node", "add", other.number, "--accept", *words).strip()

    def reaches(self, number, url, secret, authority, own_number=None):
        self.accounts("node", "add", number, "--url", url, "--self", own_number or self.number,
                      "--authority", authority, given=secret)

    def may_call(self, other, *classes, query=""):
        """This one may call the other, for users of these classes."""
        secret = other.accepts(self, *classes)
        self.reaches(other.number, other.url + query, secret, other.authority)

    def forgets(self, number):
        self.accounts("node", "remove", number)

    def stop(self):
        """Complaints."""
        status = self.server.script.stop()
        complaints = self.server.sanitizers()
        if status != 0:
            complaints.append(f"the script ended with {status}: {self.server.script.output}")
        self.log.close()
        shutil.rmtree(self._folder)
        return complaints
