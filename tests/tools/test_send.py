"""sorn send, put and rm against a development service."""

import json
import select
import signal
import subprocess
import tempfile
import threading
import time
import unittest
from pathlib import Path

from tools.command import DONE, SOME_REFUSED, TOOL, WRONG_USAGE, run
from tools.relay import Relay, cut_message
from tools.service import PATIENCE, SEARCH, Service, recording, recording_list


class WithService(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.bus = str(Path(folder.name, "bus"))
        self.nowhere = str(Path(folder.name, "nowhere"))
        self.relay = str(Path(folder.name, "relay"))
        self.service = Service(self.bus)
        self.service.__enter__()
        self.addCleanup(self.service.__exit__)

    def kinds(self, err):
        return [json.loads(line)["kind"] for line in err.splitlines()]


class Send(WithService):
    def test_waits_for_one_response(self):
        self.service.put(recording(1))
        for arguments in ([], ["--wait"]):
            code, out, err = run("send", "--bus", self.bus, *arguments, text=SEARCH)
            self.assertEqual((code, json.loads(out), err), (DONE, json.loads(recording_list(recording(1))), b""))

    def test_shows_an_error_and_fails(self):
        code, out, err = run("send", "--bus", self.bus, text=b'{"type": "audioOutputSettingsGet", "bodyId": "b"}')
        self.assertEqual((code, json.loads(out)["type"], err), (SOME_REFUSED, "error", b""))

    def test_forgets(self):
        self.assertEqual(run("send", "--bus", self.bus, "--forget", text=SEARCH), (DONE, b"", b""))

    def test_refused_requests(self):
        self.assertEqual(run("send", "--bus", self.bus, text=b"[]"), (SOME_REFUSED, b"", b"JSON must start with '{'.\n"))
        self.assertEqual(run("send", "--bus", self.bus, "/nowhere/in.json")[0], WRONG_USAGE)
        self.assertEqual(run("send", "--wait", "--watch", text=SEARCH)[0], WRONG_USAGE)

    def test_without_a_service(self):
        self.assertEqual(run("send", "--bus", self.nowhere, text=SEARCH), (SOME_REFUSED, b"", b"no response\n"))
        for way in ("--forget", "--watch"):
            self.assertEqual(run("send", "--bus", self.nowhere, way, text=SEARCH), (SOME_REFUSED, b"", b"the request could not be sent\n"))

    def test_trace(self):
        code, out, err = run("send", "--bus", self.bus, "--trace", text=SEARCH)
        self.assertEqual((code, self.kinds(err)), (DONE, ["request", "response"]))
        self.assertEqual(json.loads(err.splitlines()[1])["body"], json.loads(out))
        self.assertEqual(self.kinds(run("send", "--bus", self.bus, "--forget", "--trace", text=SEARCH)[2]), ["request"])

    def test_the_environment_tells_the_bus(self):
        done = subprocess.run([*TOOL, "send"], input=SEARCH, capture_output=True, env={"SORN_BUS": self.bus}, timeout=PATIENCE)
        self.assertEqual((done.returncode, json.loads(done.stdout)), (DONE, json.loads(recording_list())))


class Watch(WithService):
    def watching(self, *arguments, bus=None):
        tool = subprocess.Popen([*TOOL, "send", "--bus", bus or self.bus, "--watch", *arguments], stdin=subprocess.PIPE,
                                stdout=subprocess.PIPE, stderr=subprocess.PIPE)
        watchdog = threading.Timer(PATIENCE, tool.kill)
        watchdog.start()
        self.addCleanup(watchdog.cancel)
        tool.stdin.write(SEARCH)
        tool.stdin.close()
        tool.stdin = None
        return tool

    def test_shows_each_change_until_it_is_interrupted(self):
        for number in (signal.SIGINT, signal.SIGTERM):
            tool = self.watching("--trace")
            self.assertEqual(json.loads(tool.stdout.readline())["recording"], [])
            self.service.put(recording(1))
            self.assertEqual(len(json.loads(tool.stdout.readline())["recording"]), 1)
            self.service.remove(recording(1))
            self.assertEqual(json.loads(tool.stdout.readline())["recording"], [])
            tool.send_signal(number)
            out, err = tool.communicate(timeout=PATIENCE)
            self.assertEqual((tool.returncode, out), (DONE, b""))
            self.assertEqual(self.kinds(err), ["request", "response", "response", "response", "cancel"])

    def test_signals_end_it_when_nobody_reads_the_output(self):
        large = ', "title": "%s"' % ("x" * 300_000)  # several times what a pipe holds
        for number in (signal.SIGINT, signal.SIGTERM):
            tool = self.watching()
            tool.stdout.readline()
            self.service.put(recording(1, large))
            select.select([tool.stdout], [], [], PATIENCE)
            time.sleep(0.2)  # the pipe is full by now
            tool.send_signal(number)
            self.assertEqual(tool.wait(PATIENCE), SOME_REFUSED)
            out, err = tool.communicate()
            self.assertLess(len(out), 300_000)
            self.assertEqual(err, b"the output could not be written\n")
            self.service.remove('{"type": "recording", "recordingId": "vuka:rc.1"}')

    def test_signals_end_it_when_nobody_reads_the_trace(self):
        tool = self.watching("--trace")
        tool.stdout.readline()
        self.service.put(recording(1, ', "title": "%s"' % ("x" * 300_000)))
        time.sleep(0.5)
        tool.send_signal(signal.SIGTERM)
        self.assertIn(tool.wait(PATIENCE), (DONE, SOME_REFUSED), "the cancel may come before the response is shown")
        err = tool.communicate()[1]
        self.assertLess(len(err), 300_000)
        self.assertEqual(self.kinds(b"\n".join(err.splitlines()[:2])), ["request", "response"])

    def test_a_message_that_is_not_complete_is_traced_as_such(self):
        with Relay(self.relay, self.bus, to_client=cut_message):
            tool = self.watching("--trace", bus=self.relay)
            self.assertEqual(self.kinds(tool.stderr.readline()), ["request"])
            self.assertEqual(tool.stderr.readline(), b"the message is not complete\n")
            tool.kill()
            tool.communicate()

    def test_ends_with_the_connection(self):
        tool = self.watching()
        tool.stdout.readline()
        self.service.process.kill()
        out, err = tool.communicate(timeout=PATIENCE)
        self.assertEqual((tool.returncode, out, err), (SOME_REFUSED, b"", b"the connection is lost\n"))

    def test_ends_with_the_last_response(self):
        tool = subprocess.run([*TOOL, "send", "--bus", self.bus, "--watch"], input=b'{"type": "audioOutputSettingsGet", "bodyId": "b"}',
                              capture_output=True, timeout=PATIENCE)
        self.assertEqual((tool.returncode, json.loads(tool.stdout)["type"], tool.stderr), (DONE, "error", b""))


class PutAndRemove(WithService):
    def test_lines_are_refused_one_by_one(self):
        lines = "\n".join([recording(1), "[]", "", '{"a": 1}', '{"type": "recording"}', recording(2)])
        code, out, err = run("put", "--bus", self.bus, text=lines.encode())
        self.assertEqual((code, out), (SOME_REFUSED, b""))
        words = err.decode().splitlines()
        self.assertEqual([line.partition(":")[0] for line in words], ["line 2", "line 4", "line 5"])
        self.assertEqual(words[1], "line 4: the record has no type")
        self.assertEqual(len(self.service.recordings()), 2)

    def test_trace(self):
        code, _, err = run("rm", "--bus", self.bus, "--trace", text=recording(1).encode())
        self.assertEqual((code, self.kinds(err)), (DONE, ["request", "response"]))
        self.assertEqual(json.loads(err.splitlines()[0])["headers"], {"Action": "remove"})

    def test_answers_with_other_numbers_are_not_waited_for(self):
        def renumber(piece):
            return piece.replace(b"RpcId: 1\r\n", b"RpcId: 9\r\n")

        with Relay(self.relay, self.bus, to_client=renumber, repeat=0.5):
            lines = recording(1) + "\n" + recording(2)
            done = subprocess.run([*TOOL, "put", "--bus", self.relay], input=lines.encode(), capture_output=True, timeout=PATIENCE)
        self.assertEqual((done.returncode, done.stderr), (SOME_REFUSED, b"line 1: timed out; the rest was not sent\n"))
        self.assertEqual(len(self.service.recordings()), 1)

    def test_a_lost_connection_is_told_once(self):
        tool = subprocess.Popen([*TOOL, "put", "--bus", self.bus], stdin=subprocess.PIPE, stdout=subprocess.PIPE, stderr=subprocess.PIPE)
        self.addCleanup(tool.kill)
        tool.stdin.write(recording(1).encode() + b"\n")
        tool.stdin.flush()
        while not self.service.recordings():
            time.sleep(0.05)
        self.service.process.kill()
        self.service.process.wait()
        _, err = tool.communicate(b"\n".join([recording(2).encode()] * 3000), timeout=PATIENCE)
        self.assertEqual(tool.returncode, SOME_REFUSED)
        self.assertRegex(err, b"^line 2: [^\n]*; the rest was not sent\n$")

    def test_words_show_control_characters_and_are_short(self):
        code, _, err = run("rm", "--bus", self.bus, text='{"type": "recording", "a\x1b[31m\x7f\x9b": "b"}'.encode())
        self.assertEqual((code, err), (SOME_REFUSED, b"line 1: recording has no field 'a\\u001B[31m\\u007F\\u009B'\n"))
        code, _, err = run("rm", "--bus", self.bus, text=b'{"type": "recording", "%s": "b"}' % (b"x" * 5000))
        self.assertEqual((code, err), (SOME_REFUSED, b"line 1: recording has no field '" + b"x" * (1000 - 24) + b"...\n"))

    def test_input_that_cannot_be_read(self):
        code, _, err = run("put", "--bus", self.bus, "/tmp")
        self.assertEqual((code, err), (SOME_REFUSED, b"the input: Is a directory\n"))

    def test_without_a_service_or_a_file(self):
        code, out, err = run("put", "--bus", self.nowhere, text=recording(1).encode())
        self.assertEqual((code, out), (SOME_REFUSED, b""))
        self.assertNotEqual(err, b"")
        self.assertEqual(run("rm", "/nowhere/in.jsonl")[0], WRONG_USAGE)


if __name__ == "__main__":
    unittest.main()
