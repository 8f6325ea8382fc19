# SPDX-License-Identifier: Apache-2.0
"""A cable between browser and server that can be pulled out."""
import re
import socket
import threading


class Relay:
    """Listens on a port of its own; the server is told its own in what browsers send first."""

    def __init__(self, port):
        self.server_port, self.port, self.is_in = port, None, True
        self.sockets, self.lock = [], threading.Lock()
        self.listener = socket.create_server(("127.0.0.1", 0))
        self.port = self.listener.getsockname()[1]
        threading.Thread(target=self._accept, daemon=True).start()

    def _accept(self):
        while True:
            try:
                client, _ = self.listener.accept()
            except OSError:
                return
            if not self.is_in:
                client.close()
                continue
            server = socket.create_connection(("127.0.0.1", self.server_port))
            with self.lock:
                self.sockets += [client, server]
            threading.Thread(target=self._pump, args=(client, server, True), daemon=True).start()
            threading.Thread(target=self._pump, args=(server, client, False), daemon=True).start()

    def _pump(self, source, goal, is_request):
        own, other = f"127.0.0.1:{self.port}".encode(), f"127.0.0.1:{self.server_port}".encode()
        try:
            while data := source.recv(1 << 16):
                if is_request and data.startswith(b"GET "):
                    data = re.sub(rb"\b" + re.escape(own), other, data)
                goal.sendall(data)
            goal.shutdown(socket.SHUT_WR)
        except OSError:
            pass

    def pull_out(self):
        self.is_in = False
        with self.lock:
            for end in self.sockets:
                try:
                    end.shutdown(socket.SHUT_RDWR)
                except OSError:
                    pass
                end.close()
            self.sockets.clear()

    def put_in(self):
        self.is_in = True

    def close(self):
        self.listener.close()
        self.pull_out()
