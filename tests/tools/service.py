"""A development service for tests, and the records that they store in it."""

import json
import signal
import subprocess
import threading

from tools.command import TOOL, run

PATIENCE = 120  # seconds after which nothing will come any more
SEARCH = b'{"type": "recordingSearch"}'


def recording(number, more=""):
    return '{"type": "recording", "bodyId": "b", "recordingId": "vuka:rc.%d"%s}' % (number, more)


def recording_list(*records):
    return '{"type": "recordingList", "recording": [%s], "anchorIndex": 0, "isBottom": true, "isTop": true}' % ", ".join(records)


class Service:
    """A service that runs while the block does."""

    def __init__(self, bus, *arguments):
        self.bus = str(bus)
        self.process = subprocess.Popen(
            [*TOOL, "serve", "--bus", self.bus, *map(str, arguments)], stdout=subprocess.PIPE, stderr=subprocess.PIPE
        )
        self.watchdog = threading.Timer(PATIENCE, self.process.kill)
        self.watchdog.start()
        self.words = []

    def __enter__(self):
        for line in self.process.stderr:
            if line == b"listening on " + self.bus.encode() + b"\n":
                return self
            self.words.append(line.decode())
        self.__exit__()
        raise AssertionError("the service did not start: " + "".join(self.words))

    def __exit__(self, *_):
        self.process.kill()
        self.process.communicate()
        self.watchdog.cancel()

    def stop(self, number=signal.SIGTERM):
        """Gives its exit code, standard output and what stood on standard error behind the start."""
        self.process.send_signal(number)
        out, err = self.process.communicate(timeout=PATIENCE)
        return self.process.returncode, out, err

    def send(self, body):
        return run("send", "--bus", self.bus, text=body)

    def put(self, *records):
        return run("put", "--bus", self.bus, text="\n".join(records).encode())

    def remove(self, *records):
        return run("rm", "--bus", self.bus, text="\n".join(records).encode())

    def recordings(self):
        return json.loads(self.send(SEARCH)[1])["recording"]
