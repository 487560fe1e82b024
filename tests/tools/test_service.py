"""sorn serve from outside: start and stop, records loaded and kept, the trace."""

import json
import signal
import sqlite3
import tempfile
import unittest
from pathlib import Path

from tools.command import DONE, ROOT, SOME_REFUSED, TOOL, WRONG_USAGE, run
from tools.service import PATIENCE, SEARCH, Service, recording, recording_list


class Serve(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = Path(folder.name)
        self.bus = self.folder / "bus"

    def test_stops_by_signals(self):
        for number in (signal.SIGTERM, signal.SIGINT):
            with Service(self.bus) as service:
                self.assertEqual(service.stop(number), (DONE, b"", b""))
            self.assertFalse(self.bus.exists(), "the socket is left")

    def test_put_search_and_remove(self):
        with Service(self.bus) as service:
            self.assertEqual(service.put(recording(1), recording(2)), (DONE, b"", b""))
            self.assertEqual(json.loads(service.send(SEARCH)[1]), json.loads(recording_list(recording(1), recording(2))))
            self.assertEqual(service.remove('{"type": "recording", "recordingId": "vuka:rc.1"}'), (DONE, b"", b""))
            self.assertEqual(service.recordings(), [json.loads(recording(2))])
            code, _, words = service.put('{"type": "recording"}')
            self.assertEqual(code, SOME_REFUSED)
            self.assertIn(b"bodyId", words)

    def test_loads_files_and_refuses_bad_lines(self):
        good = self.folder / "good.jsonl"
        bad = self.folder / "bad.jsonl"
        good.write_text(recording(1) + "\n\n" + recording(2, ', "title": "a"'))
        bad.write_text("{\n" + recording(3) + "\r\n[]\n" + recording(2, ', "title": "b"') + "\n")
        with Service(self.bus, "--load", good, "--load", bad) as service:
            self.assertEqual([line[: len(str(bad)) + 3] for line in service.words], [f"{bad}:1:", f"{bad}:3:"])
            found = [(each["recordingId"], each.get("title")) for each in service.recordings()]
            self.assertEqual(found, [("vuka:rc.1", None), ("vuka:rc.2", "b"), ("vuka:rc.3", None)])
            self.assertEqual(service.stop(), (DONE, b"", b""))

    def test_loads_the_examples(self):
        loads = []
        for path in sorted((ROOT / "examples/data").glob("*.jsonl")):
            loads += ["--load", path]
        lines = (ROOT / "examples/data/recordings.jsonl").read_text(encoding="utf-8").splitlines()
        records = {each["recordingId"]: each for each in map(json.loads, lines) if each["type"] == "recording"}
        with Service(self.bus, *loads) as service:
            self.assertEqual(service.words, [])
            found = service.recordings()
            self.assertEqual({each["recordingId"]: each for each in found}, records)
            body = b'{"type": "recordingSearch", "recordingId": "%s"}' % next(iter(records)).encode()
            self.assertEqual(json.loads(service.send(body)[1])["recording"], [next(iter(records.values()))])

    def test_a_file_keeps_the_records(self):
        database = self.folder / "records.db"
        with Service(self.bus, "--db", database) as service:
            service.put(recording(1))
            service.stop()
        with Service(self.bus, "--db", database) as service:
            service.put(recording(2))
            service.process.kill()  # nothing that was acknowledged is lost
            service.process.wait()
        with Service(self.bus, "--db", database) as service:
            self.assertEqual(service.recordings(), [json.loads(recording(1)), json.loads(recording(2))])

    def test_the_same_file_loaded_again_changes_nothing(self):
        records = self.folder / "records.jsonl"
        records.write_text(recording(1) + '\n{"type": "recording", "bodyId": "no id"}\n')
        for _ in range(2):
            with Service(self.bus, "--db", self.folder / "records.db", "--load", records) as service:
                self.assertEqual(len(service.recordings()), 2)
                service.stop()

    def test_wrong_usage(self):
        other = self.folder / "other.db"
        with sqlite3.connect(other) as database:
            database.execute("CREATE TABLE t (a)")
        words = f"{other}: the file belongs to another program\n".encode()
        self.assertEqual(run("serve", "--bus", str(self.bus), "--db", str(other)), (WRONG_USAGE, b"", words))
        code, _, words = run("serve", "--bus", str(self.bus), "--load", str(self.folder / "none.jsonl"))
        self.assertEqual(code, WRONG_USAGE)
        self.assertIn(b"none.jsonl", words)
        with Service(self.bus):
            code, _, words = run("serve", "--bus", str(self.bus))
            self.assertEqual(code, WRONG_USAGE)
            self.assertEqual(words, f"{self.bus}: address in use\n".encode())
        self.assertEqual(run("serve", "--no-such-option")[0], WRONG_USAGE)

    def test_trace(self):
        with Service(self.bus, "--trace") as service:
            service.put(recording(1))
            service.send(b'{"type": "recordingSearch", "count": 0}')
            code, out, _ = service.stop()
            self.assertEqual(code, DONE)
        lines = [json.loads(line) for line in out.splitlines()]
        self.assertEqual([line["kind"] for line in lines], ["request", "response"] * 2)
        self.assertEqual(lines[0]["headers"], {"Action": "put"})
        self.assertEqual(lines[0]["body"], json.loads(recording(1)))
        self.assertEqual(lines[1]["body"], {"type": "success"})
        self.assertEqual(lines[2]["requestType"], "recordingSearch")
        self.assertEqual(lines[3]["body"]["recording"], [])

    def test_a_trace_that_nobody_reads(self):
        with Service(self.bus, "--trace") as service:
            service.process.stdout.close()
            service.put(recording(1))
            self.assertEqual(service.recordings(), [json.loads(recording(1))])
            service.process.send_signal(signal.SIGTERM)
            self.assertEqual(service.process.wait(PATIENCE), DONE)
            service.process.stdout = None


if __name__ == "__main__":
    unittest.main()
