"""Cases whose uploads go to a folder of their own, and the processes that read them."""

import os
import pathlib

from case import Case
from client import form
from multipart import upload
from webserver import wait_until

UPLOAD_PREFIX = "webapi-upload-"


def file_call(method, **parameters):
    return form(api="Test.File", version=1, method=method, **parameters)


def processes(server, like="self"):
    """The program's processes of a server's root, as the process `like` sees it. Others may
    run, of other roots that are mounted at the same place."""
    program = str(server.warm_program if server.mode == "warm" else server.entry)
    mounts = os.readlink(f"/proc/{like}/ns/mnt")
    for process in pathlib.Path("/proc").glob("[0-9]*"):
        try:
            if (os.readlink(process / "exe") == program and
                    os.readlink(process / "ns/mnt") == mounts):
                yield process
        except OSError:
            pass


def entries(server, like="self"):
    """The ids of those that serve a request."""
    found = []
    for process in processes(server, like):
        try:
            # A worker that waits has no connection there.
            if (server.mode == "cgi" or
                    os.readlink(process / "fd/0").startswith("socket:")):
                found.append(int(process.name))
        except OSError:
            pass
    return found


def forget_peaks(server, like="self"):
    """The most memory that a worker has had may be of a request that it served before: a
    login takes 16 MiB for a moment."""
    for process in processes(server, like):
        try:
            (process / "clear_refs").write_text("5")
        except (FileNotFoundError, ProcessLookupError):
            pass


class VolumeCase(Case):
    """The configured data volume is `volume`; uploads leave nothing behind there."""

    def setUp(self):
        super().setUp()
        self.configuration = self.server.root / "etc/talo/host.conf"
        self.volume = self.folder / "volume"
        self.volume.mkdir(mode=0o777)
        self.configure(self.volume)
        self.kept = self.folder / "kept"
        self.kept.mkdir(mode=0o777)

    def configure(self, volume):
        before = self.configuration.read_bytes() if self.configuration.exists() else None
        self.configuration.parent.mkdir(parents=True, exist_ok=True)
        self.configuration.write_text(f'volumes="{volume}"\nvolumes_folders="yes"\n')
        if before is None:
            self.addCleanup(self.configuration.unlink)
        else:
            self.addCleanup(self.configuration.write_bytes, before)

    def leftovers(self, volume=None):
        """What uploads have left in a volume. The sweep's own mark does not count."""
        folder = pathlib.Path(volume or self.volume) / "@tmp"
        return sorted(path.name for path in folder.glob(UPLOAD_PREFIX + "*"))

    def upload(self, method, form, headers=None, **parameters):
        return upload(self.client, file_call(method, **parameters), form, headers)

    def uploads(self, form, **parameters):
        """The data of a successful "upload", whose files are in `kept`."""
        reply = self.upload("upload", form, keep=self.kept, **parameters)
        self.assertTrue(reply.document()["success"], reply)
        return reply.document()["data"]

    def refuses(self, reply, result):
        self.check_document(reply, {"success": False, "error": {
            "code": 108, "errors": {"upload_err": result}}})

    def entries(self):
        return entries(self.server)

    def awaits_no_entry(self):
        self.assertTrue(wait_until(lambda: not self.entries()), "an entry still runs")
