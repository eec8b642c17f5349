"""Methods that crash: the client hears of it, and hears the next reply."""

from task_case import TaskCase

BODY = b'{"error":{"code":117},"success":false}'
CACHE_LINES = [
    ("Cache-Control", "max-age=0, no-cache, no-store, must-revalidate"),
    ("Pragma", "no-cache"),
    ("Expires", "0"),
]


class Crashes(TaskCase):
    def ways(self):
        """A sanitizer reports what it takes for a fault, and that is no fault of ours."""
        ways = ["abort", "thread", "exit", "_exit"]
        if not self.is_sanitized():
            ways += ["segfault", "bus", "divide", "illegal", "overflow", "killed"]
        return ways

    def crash(self, method, how):
        return self.client.call("Test.Crash", method, how=how)

    def test_are_a_500_with_a_document(self):
        for how in self.ways():
            with self.subTest(how):
                reply = self.crash("crash", how)
                self.assertEqual((reply.status, reply.body), (500, BODY), reply)
                self.assertEqual(reply.header("Content-type"), 'text/html; charset="UTF-8"')
                self.assertEqual([pair for pair in reply.headers if pair in CACHE_LINES],
                                 CACHE_LINES)
                self.succeeds(self.client.call("TALO.System", "ping", text="after"),
                              {"text": "after"})

    def test_add_nothing_to_a_reply_that_has_begun(self):
        for how in self.ways():
            with self.subTest(how):
                reply = self.crash("download", how)
                self.assertNotIn(b"117", reply.body)
                self.assertTrue(b"half a file".startswith(reply.body) or reply.status != 200,
                                reply)

    def test_of_a_child_do_not_concern_the_client(self):
        for how in self.ways():
            with self.subTest(how):
                self.succeeds(self.crash("child", how), "answered")

    def test_of_a_background_task_do_not_concern_the_client(self):
        for how in self.ways():
            with self.subTest(how):
                reply = self.crash("task", how)
                document = reply.document()
                self.assertEqual((reply.status, document["success"]), (200, True), reply)
                self.assertEqual(list(document["data"]), ["task_id"])
