# SPDX-License-Identifier: Apache-2.0
"""A page of `zsi view` without a browser: HTTP and WebSocket by hand, so that wrong bytes can be sent too."""
import base64
import json
import os
import re
import socket
import struct
import subprocess
import time


class Closed(Exception):
    """The server has ended the connection."""


class Page:
    """A WebSocket connection; `raw` may leave out what a browser would send."""

    def __init__(self, server, token=None, headers=None, timeout=60):
        self.socket = socket.create_connection(("127.0.0.1", server.port), timeout)
        self.pending = b""
        lines = {"Host": f"127.0.0.1:{server.port}", "Upgrade": "websocket", "Connection": "Upgrade",
                 "Sec-WebSocket-Version": "13", "Sec-WebSocket-Key": base64.b64encode(os.urandom(16)).decode()}
        lines.update(headers or {})
        target = f"/session?token={server.token if token is None else token}"
        self.socket.sendall((f"GET {target} HTTP/1.1\r\n"
                             + "".join(f"{k}: {v}\r\n" for k, v in lines.items()) + "\r\n").encode())
        head = b""
        while b"\r\n\r\n" not in head:
            head += self._some()
        head, self.pending = head.split(b"\r\n\r\n", 1)
        self.status = int(head.split()[1])
        self.frame = {"state": None}
        self.pixels, self.generation, self.samples, self.kind, self.size = None, 0, 0, 0, (0, 0)

    def _some(self):
        data = self.socket.recv(1 << 20)
        if not data:
            raise Closed
        return data

    def _take(self, count):
        while len(self.pending) < count:
            self.pending += self._some()
        taken, self.pending = self.pending[:count], self.pending[count:]
        return taken

    def send_bytes(self, payload, opcode=1):
        mask = os.urandom(4)
        size = len(payload)
        head = bytes([0x80 | opcode]) + (
            bytes([0x80 | size]) if size < 126 else
            bytes([0x80 | 126]) + struct.pack(">H", size) if size < 65536 else
            bytes([0x80 | 127]) + struct.pack(">Q", size))
        key = int.from_bytes((mask * (size // 4 + 1))[:size], "big")
        self.socket.sendall(head + mask + (int.from_bytes(payload, "big") ^ key).to_bytes(size, "big"))

    def send(self, **message):
        self.send_bytes(json.dumps(message).encode())

    def receive(self):
        """The next message: a dict, or bytes of a picture, which are taken into `pixels` and acknowledged."""
        while True:
            first, second = self._take(2)
            size = second & 127
            if size == 126:
                size, = struct.unpack(">H", self._take(2))
            elif size == 127:
                size, = struct.unpack(">Q", self._take(8))
            payload = self._take(size)
            if first & 15 == 8:
                raise Closed
            if first & 15 == 9:
                self.send_bytes(payload, 10)
            elif first & 15 == 1:
                message = json.loads(payload)
                if message["type"] == "frame":
                    self.frame = message
                return message
            elif first & 15 == 2:
                self._tile(payload)
                return payload

    def _tile(self, data):
        magic, generation, x, y, w, h, fw, fh, samples, kind, encoding, _, size = struct.unpack_from(
            "<IIHHHHHHIBBHI", data)
        assert magic == 0x4C49545A and size == len(data) - 32
        if kind > 1:
            return
        self.send(type="ack", generation=generation, bytes=len(data))
        if self.pixels is None or self.generation != generation or len(self.pixels) != fw * fh * 4:
            self.pixels, self.rows = bytearray(fw * fh * 4), set()
        self.generation, self.size, self.samples, self.kind = generation, (fw, fh), samples, kind
        assert x == 0 and w == fw and encoding == 0
        self.pixels[y * fw * 4:(y + h) * fw * 4] = data[32:]
        self.rows.update(range(y, y + h))

    def until(self, kind, **values):
        """The next message of a type with these values; an error that nobody asked for is one here."""
        while True:
            message = self.receive()
            if isinstance(message, bytes):
                continue
            if message["type"] == kind and all(message.get(k) == v for k, v in values.items()):
                return message
            if message["type"] == "error":
                raise AssertionError(message["message"])

    def receive_picture(self):
        """Kind and file of the next picture that came as one."""
        while True:
            message = self.receive()
            if isinstance(message, bytes) and message[28 - 4] > 1:
                return message[24], message[32:]

    def finished(self, after=0):
        """Waits until a generation above `after` is done and all of it is here; its pixels."""
        while True:
            frame = self.frame
            if (frame["state"] == "done" and frame["generation"] > after and self.pixels is not None
                    and self.generation == frame["generation"] and len(self.rows) == self.size[1]
                    and self.size == (frame["width"], frame["height"]) and self.samples == frame["samples"]):
                return bytes(self.pixels)
            message = self.receive()
            if isinstance(message, dict) and message["type"] == "error":
                raise AssertionError(message["message"])

    def close(self):
        self.socket.close()


class Server:
    """`zsi view` of a scene."""

    def __init__(self, zsi, scene, *options):
        self.process = subprocess.Popen([zsi, "view", str(scene), "--no-open", *options],
                                        stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True)
        line = self.process.stdout.readline()
        found = re.fullmatch(r"http://127\.0\.0\.1:(\d+)/\?token=([0-9a-f]{32})\n", line)
        if not found:
            raise AssertionError(f"no address: {line!r} {self.process.stderr.read()}")
        self.port, self.token = int(found[1]), found[2]

    def get(self, target, headers=None, method="GET"):
        """Status and body of one request."""
        lines = {"Host": f"127.0.0.1:{self.port}", "Connection": "close", **(headers or {})}
        with socket.create_connection(("127.0.0.1", self.port), 60) as connection:
            connection.sendall((f"{method} {target} HTTP/1.1\r\n"
                                + "".join(f"{k}: {v}\r\n" for k, v in lines.items()) + "\r\n").encode())
            data = b""
            while some := connection.recv(1 << 20):
                data += some
        head, _, body = data.partition(b"\r\n\r\n")
        return int(head.split()[1]), body

    def file(self, name, **query):
        text = "".join(f"&{k}={v}" for k, v in query.items())
        status, body = self.get(f"/{name}?token={self.token}{text}")
        assert status == 200, body
        return body

    def memory(self):
        """Bytes of the process in memory."""
        with open(f"/proc/{self.process.pid}/statm") as statm:
            return int(statm.read().split()[1]) * os.sysconf("SC_PAGE_SIZE")

    def kill(self):
        if self.process.poll() is None:
            self.process.kill()
        self.process.communicate()

    def end(self, signal):
        """Exit status and seconds that it took."""
        begin = time.monotonic()
        self.process.send_signal(signal)
        self.process.communicate(timeout=30)
        return self.process.returncode, time.monotonic() - begin
