"""sorn send, put and rm against a development service."""

import json
import signal
import subprocess
import tempfile
import threading
import unittest
from pathlib import Path

from tools.command import DONE, SOME_REFUSED, TOOL, WRONG_USAGE, run
from tools.service import PATIENCE, SEARCH, Service, recording, recording_list


class WithService(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.bus = str(Path(folder.name, "bus"))
        self.nowhere = str(Path(folder.name, "nowhere"))
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
    def watching(self, *arguments):
        tool = subprocess.Popen([*TOOL, "send", "--bus", self.bus, "--watch", *arguments], stdin=subprocess.PIPE,
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

    def test_without_a_service_or_a_file(self):
        code, out, err = run("put", "--bus", self.nowhere, text=recording(1).encode())
        self.assertEqual((code, out), (SOME_REFUSED, b""))
        self.assertNotEqual(err, b"")
        self.assertEqual(run("rm", "/nowhere/in.jsonl")[0], WRONG_USAGE)


if __name__ == "__main__":
    unittest.main()
