"""A gibibyte up and down, and what it takes."""

from client import ENTRY
from multipart import Content, Form, body_digest, file_digest
from volumes import VolumeCase, file_call, forget_peaks

SIZE = 1 << 30
PEAK_KIBIBYTES = 16 * 1024


class Gibibyte(VolumeCase):
    def test_goes_up_and_comes_back(self):
        content = Content(SIZE)
        forget_peaks(self.server)
        data = self.uploads(Form().field("a", "1").file("file", "large.bin", content))
        self.assertEqual(int(data["params"]["file_size"]), SIZE)
        self.assertEqual(file_digest(self.kept / "file"), content.sha256())
        self.assertEqual(self.leftovers(), [])
        note = self.folder / "note"
        url = f"{ENTRY}?{file_call('download', path=self.kept / 'file', note=note)}"
        self.assertEqual(body_digest(self.client, url), content.sha256())
        if not self.is_sanitized():
            self.assertLess(data["peak"], PEAK_KIBIBYTES)
            self.assertLess(int(note.read_text().split()[3]), PEAK_KIBIBYTES)
