"""A gibibyte over another appliance, and what it takes on both."""

import threading

from client import form
from multipart import Content, Form, file_digest, upload
from relay_case import RelayCase, start_appliances

SIZE = 1 << 30
PEAK_KIBIBYTES = 16 * 1024


def setUpModule():
    start_appliances()


class PeakMemory:
    """The largest resident memory of an appliance's entries, watched while they run."""

    def __init__(self, appliance):
        self.kibibytes = 0
        self._appliance = appliance
        appliance.forget_peaks()
        self._stop = threading.Event()
        self._thread = threading.Thread(target=self._watch, daemon=True)
        self._thread.start()

    def _watch(self):
        while not self._stop.wait(0.05):
            for pid in self._appliance.entries():
                self.kibibytes = max(self.kibibytes, peak_of(pid))

    def stop(self):
        self._stop.set()
        self._thread.join()
        return self.kibibytes


def peak_of(pid):
    try:
        with open(f"/proc/{pid}/status", encoding="ascii", errors="replace") as file:
            facts = dict(line.split(":", 1) for line in file)
        return int(facts["VmHWM"].split()[0])
    except (OSError, KeyError):
        return 0  # it has just ended


class Gibibyte(RelayCase):
    def test_goes_on_to_the_other_and_takes_little_memory(self):
        self.lets_call()
        content = Content(SIZE)
        query = form(api="Test.Relay", version=2, method="take", relay_nd=2,
                     _sid=self.log_in("ann"))
        self.client.timeout = 200
        peaks = [PeakMemory(self.first), PeakMemory(self.second)]
        body = Form().field("keep", self.folder).file("file", "large.bin", content)
        data = self.data(upload(self.client, query, body))
        here, there = [peak.stop() for peak in peaks]
        self.assertEqual(file_digest(self.folder / "file"), content.sha256())
        self.assertEqual((data["user"], int(data["params"]["file_size"])), ("ann", SIZE))
        print(f"peak memory: {here} KiB here, {there} KiB there", end=" ", flush=True)
        self.assertGreater(min(here, there), 0)
        if not self.is_sanitized():
            self.assertLess(here, PEAK_KIBIBYTES)
            self.assertLess(max(there, data["peak"]), PEAK_KIBIBYTES)
