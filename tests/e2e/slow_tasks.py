"""A background task that never tells anything holds its caller for a minute."""

import time

from task_case import TaskCase
from webserver import wait_until


class SilentWork(TaskCase):
    def test_is_answered_for_after_sixty_seconds(self):
        sid = self.log_in("bob")
        self.client.timeout = 120
        before = time.monotonic()
        reply = self.start(sid, report="never", seconds=90)
        waited = time.monotonic() - before
        task_id = reply.document()["data"]["task_id"]
        self.succeeds(reply, {"task_id": task_id})
        self.assertTrue(60 <= waited < 75, waited)
        status = self.status(sid, task_id)
        self.assertIs(status["finish"], False)
        self.assertNotIn("success", status)
        self.finish.touch()
        self.assertTrue(wait_until(lambda: self.status(sid, task_id)["finish"]))
        self.assertNotIn("success", self.status(sid, task_id))
