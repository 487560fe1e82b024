"""Stands between a client and a service on the bus and changes what they say."""

import contextlib
import socket
import struct
import threading


def cut_message(piece):
    """Keeps five bytes of the message that the last signal of the piece brings: its array of bytes ends the signal's body."""
    begin = piece.index(b"ORPC/2 ")
    start = piece.rindex(b"l\x04", 0, begin)  # little endian, a signal
    body, array = (struct.unpack_from("<I", piece, at)[0] for at in (start + 4, begin - 4))
    assert len(piece) == begin + array
    return piece[: start + 4] + struct.pack("<I", body - array + 5) + piece[start + 8 : begin - 4] + struct.pack("<I", 5) + piece[begin : begin + 5]


class Relay:
    """Changes the pieces of the stream that bring messages in either direction, while the block runs."""

    def __init__(self, bus, service, to_service=None, to_client=None, repeat=None):
        self.service = service
        self.to_service, self.to_client = to_service, to_client
        self.repeat = repeat  # seconds after which the client is told each answer again
        self.done = threading.Event()
        self.sockets = [socket.socket(socket.AF_UNIX)]
        self.sockets[0].bind(str(bus))
        self.sockets[0].listen()
        self.threads = [threading.Thread(target=self.accept)]

    def __enter__(self):
        self.threads[0].start()
        return self

    def __exit__(self, *_):
        self.done.set()
        for each in self.sockets:
            with contextlib.suppress(OSError):
                each.shutdown(socket.SHUT_RDWR)
        for thread in self.threads:
            thread.join()
        for each in self.sockets:
            each.close()

    def accept(self):
        with contextlib.suppress(OSError):
            while True:
                client = self.sockets[0].accept()[0]
                service = socket.socket(socket.AF_UNIX)
                self.sockets += [client, service]
                service.connect(self.service)
                self.start(self.pump, client, service, self.to_service, None)
                self.start(self.pump, service, client, self.to_client, self.repeat)

    def start(self, *arguments):
        self.threads.append(threading.Thread(target=arguments[0], args=arguments[1:]))
        self.threads[-1].start()

    def pump(self, source, sink, change, repeat):
        with contextlib.suppress(OSError):
            while piece := source.recv(1 << 20):
                is_message = b"ORPC/2 " in piece
                if is_message and change is not None:
                    piece = change(piece)
                sink.sendall(piece)
                while is_message and repeat is not None and not self.done.wait(repeat):
                    sink.sendall(piece)
            sink.shutdown(socket.SHUT_RDWR)
