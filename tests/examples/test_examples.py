"""The example programs against a development service. SORN_EXAMPLES is the folder that they were built in."""

import os
import subprocess
import tempfile
import unittest
from pathlib import Path

from tools.command import ROOT, TOOL
from tools.service import PATIENCE, Service

EMULATOR = TOOL[:-1]


class Examples(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.bus = str(Path(folder.name, "bus"))

    def run_example(self, name):
        program = Path(os.environ["SORN_EXAMPLES"], f"example_{name}")
        done = subprocess.run([*EMULATOR, program], capture_output=True, text=True, timeout=PATIENCE,
                              env={**os.environ, "SORN_BUS": self.bus})
        return done.returncode, done.stdout, done.stderr

    def with_service(self):
        return Service(self.bus, "--load", ROOT / "examples/data/recordings.jsonl", "--load", ROOT / "examples/data/channels.jsonl")

    def test_send_and_wait(self):
        with self.with_service():
            self.assertEqual(self.run_example("send_and_wait"), (0, "Ferry Road\nSaltmarsh Surgery\n夜の渡し船\n", ""))

    def test_callbacks(self):
        with self.with_service():
            self.assertEqual(self.run_example("callbacks"), (0, "channels: a list\nrecordings: a list\n", ""))

    def test_live_stream(self):
        with self.with_service():
            lists = "request 1: 0 entries\nrequest 1: 1 entries\nrequest 1: 0 entries\n"
            self.assertEqual(self.run_example("live_stream"), (0, lists, ""))

    def test_event_loop(self):
        with self.with_service():
            self.assertEqual(self.run_example("event_loop"), (0, "the response is a channelList\n", ""))

    def test_without_a_service(self):
        for name in ("send_and_wait", "callbacks", "live_stream", "event_loop"):
            self.assertEqual(self.run_example(name), (1, "", 'no response; does "sorn serve" run?\n'), name)


if __name__ == "__main__":
    unittest.main()
