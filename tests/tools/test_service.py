"""sorn serve from outside: start and stop, records loaded and kept, the trace."""

import json
import os
import resource
import signal
import sqlite3
import subprocess
import tempfile
import threading
import unittest
from pathlib import Path

from tools.command import DONE, ROOT, SOME_REFUSED, TOOL, WRONG_USAGE, run
from tools.relay import Relay, cut_message
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

    def test_signals_end_it_while_it_loads(self):
        fifo = self.folder / "fifo"
        database = self.folder / "records.db"
        os.mkfifo(fifo)
        end = os.open(fifo, os.O_RDWR)
        self.addCleanup(os.close, end)
        command = [*TOOL, "serve", "--bus", str(self.bus), "--db", str(database), "--load", str(fifo)]
        for number in (signal.SIGTERM, signal.SIGINT):
            tool = subprocess.Popen(command, stderr=subprocess.PIPE)
            self.addCleanup(tool.kill)
            os.write(end, recording(1).encode() + b"\n[]\n")
            self.assertIn(b"fifo:2:", tool.stderr.readline())  # it waits for more
            tool.send_signal(number)
            self.assertEqual(tool.wait(PATIENCE), -number)
            tool.stderr.close()
            self.assertFalse(self.bus.exists())
        with Service(self.bus, "--db", database) as service:
            self.assertEqual(service.recordings(), [], "lines that were not stored yet")

    def test_a_file_that_cannot_be_read(self):
        words = f"{self.folder}:1: Is a directory\n".encode()
        self.assertEqual(run("serve", "--bus", str(self.bus), "--load", str(self.folder)), (WRONG_USAGE, b"", words))

    def test_words_about_lines_show_control_characters(self):
        bad = self.folder / "bad.jsonl"
        bad.write_bytes(b'{"type": "a\x1b[31m\x7f"}\n{"type": "a\xff%s"}\n' % (b"x" * 5000))
        with Service(self.bus, "--load", bad) as service:
            self.assertEqual([words.partition(": ")[0] for words in service.words], [f"{bad}:1", f"{bad}:2"])
            self.assertTrue(service.words[0].endswith("a\\u001B[31m\\u007F\n"), service.words)
            self.assertIn(" a?xxx", service.words[1])
            self.assertTrue(service.words[1].endswith("xxx...\n"), service.words)
            self.assertEqual(len(service.words[1]), len(f"{bad}:2: ") + 1000 + len("...\n"))

    def test_a_disk_that_is_full_while_it_loads(self):
        def limit():
            signal.signal(signal.SIGXFSZ, signal.SIG_IGN)
            resource.setrlimit(resource.RLIMIT_FSIZE, (256 << 10, 256 << 10))

        records = self.folder / "records.jsonl"
        records.write_text("[]\n" + "".join(recording(i, ', "title": "%s"' % ("x" * 10_000)) + "\n" for i in range(38)))
        database = str(self.folder / "records.db")
        tool = subprocess.Popen([*TOOL, "serve", "--bus", str(self.bus), "--db", database, "--load", str(records)],
                                stderr=subprocess.PIPE, preexec_fn=limit)
        self.addCleanup(tool.kill)
        words = [tool.stderr.readline().decode() for _ in range(3)]
        tool.send_signal(signal.SIGTERM)
        self.assertEqual(tool.wait(PATIENCE), DONE)
        tool.stderr.close()
        self.assertTrue(words[0].startswith(f"{records}:1: "), words)
        self.assertTrue(words[1].startswith(f"{records}: lines 1 to 39 were not stored: the store"), words)
        self.assertTrue(words[2].startswith("listening on "), words)
        with Service(self.bus, "--db", database) as service:
            self.assertEqual(service.recordings(), [])

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

    def test_names_that_the_store_would_not_take_for_files(self):
        words = b":memory:: not a name for a file; without one the store is in memory\n"
        command = [*TOOL, "serve", "--bus", str(self.bus), "--db"]
        done = subprocess.run([*command, ":memory:"], capture_output=True, cwd=self.folder, timeout=PATIENCE)
        self.assertEqual((done.returncode, done.stderr), (WRONG_USAGE, words))
        self.assertEqual(list(self.folder.iterdir()), [])
        name = "file:records?mode=memory"
        tool = subprocess.Popen([*command, name], stderr=subprocess.PIPE, cwd=self.folder)
        self.addCleanup(tool.kill)
        tool.stderr.readline()
        self.assertEqual(run("put", "--bus", str(self.bus), text=recording(1).encode())[0], DONE)
        tool.terminate()
        tool.communicate(timeout=PATIENCE)
        with Service(self.bus, "--db", self.folder / name) as service:
            self.assertEqual(service.recordings(), [json.loads(recording(1))])

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

    def test_a_trace_whose_reader_has_stopped(self):
        with Service(self.bus, "--trace") as service:
            self.assertEqual(service.put(*[recording(i) for i in range(1000)]), (DONE, b"", b""))
            service.process.send_signal(signal.SIGTERM)
            self.assertEqual(service.process.wait(PATIENCE), DONE)
            out, err = service.process.communicate()
        lines = out.split(b"\n")[:-1]  # what stands behind the last line feed was cut
        for line in lines:
            json.loads(line)
        self.assertLess(len(lines), 2000, "more than a pipe holds")
        self.assertEqual(err, b"%d messages of the trace were not shown\n" % (2000 - len(lines)))

    def test_a_trace_whose_reader_goes_on_is_told_what_it_missed(self):
        n_records, title = 12, "x" * 4_000_000
        with Service(self.bus, "--trace") as service:
            for i in range(n_records):
                self.assertEqual(service.put(recording(i, ', "title": "%s"' % title)), (DONE, b"", b""))
            out = []
            reader = threading.Thread(target=lambda: out.extend(service.process.stdout))
            reader.start()
            words = service.process.stderr.readline()  # while the service runs
            service.process.send_signal(signal.SIGTERM)
            reader.join()
            self.assertEqual(service.process.wait(PATIENCE), DONE)
        for line in out:
            json.loads(line)
        self.assertGreater(len(out), 4, "16 MiB wait")
        self.assertLess(len(out), 2 * n_records)
        self.assertEqual(words, b"%d messages of the trace were not shown\n" % (2 * n_records - len(out)))

    def test_a_message_that_is_not_complete_is_traced_as_such(self):
        relay = self.folder / "relay"
        with Service(self.bus, "--trace") as service:
            with Relay(relay, str(self.bus), to_service=cut_message):
                self.assertEqual(run("send", "--bus", str(relay), "--forget", text=SEARCH)[0], DONE)
                self.assertEqual(json.loads(service.process.stdout.readline())["kind"], "response")
            code, _, err = service.stop()
            self.assertEqual((code, err), (DONE, b"the message is not complete\n"))


if __name__ == "__main__":
    unittest.main()
