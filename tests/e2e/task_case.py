"""What the cases about background tasks have in common."""

import os
import pathlib
import shutil
import signal
import tempfile

from test_sessions import Sessions
from webserver import wait_until


def lives(pid):
    """Whether there is such a process, and not just what its parent has yet to ask for."""
    try:
        state = pathlib.Path(f"/proc/{pid}/stat").read_text(encoding="utf-8")
    except OSError:
        return False
    return state.rpartition(")")[2].split()[0] not in "ZX"


class TaskCase(Sessions):
    """ann is an administrator, bob is not."""

    def setUp(self):
        super().setUp()
        # Outside of the web server's folder, which a start of the server empties.
        folder = tempfile.TemporaryDirectory(prefix="task-test-")
        self.addCleanup(folder.cleanup)
        self.finish = pathlib.Path(folder.name) / "finish"

    def forget(self):
        super().forget()
        shutil.rmtree(self.server.root / "var/lib/talo/task", ignore_errors=True)

    def ask(self, sid, method, **parameters):
        return self.client.call("TALO.Task", method, headers={"Cookie": f"id={sid}"}, **parameters)

    def data(self, sid, method, **parameters):
        document = self.ask(sid, method, **parameters).document()
        self.assertTrue(document["success"], document)
        return document["data"]

    def status(self, sid, task_id):
        return self.data(sid, "status", task_id=task_id)

    def start(self, sid, **parameters):
        """Starts a task that runs until the file self.finish is there."""
        return self.client.call("Test.Task", "start", headers={"Cookie": f"id={sid}"},
                                finish=str(self.finish), **parameters)

    def started(self, sid, **parameters):
        """The id of a task that was started and told something, and its process."""
        reply = self.start(sid, **parameters)
        self.assertEqual(list(reply.document()["data"]), ["task_id"])
        task_id = reply.document()["data"]["task_id"]
        status = self.status(sid, task_id)
        self.assertEqual((status["data"]["state"], status["finish"]), ("running", False))
        pid = status["data"]["pid"]
        self.addCleanup(lambda: lives(pid) and os.kill(pid, signal.SIGKILL))
        return task_id, pid

    def finishes(self, sid, task_id):
        """Lets the task come to its end; answers the status that it then has."""
        self.assertIs(self.status(sid, task_id)["finish"], False)
        self.finish.touch()
        self.assertTrue(wait_until(lambda: self.status(sid, task_id)["finish"]))
        return self.status(sid, task_id)
