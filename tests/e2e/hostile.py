"""Appliances that behave badly: small TLS servers that open sessions like any other,
and then answer calls in their own way."""

import json
import socket
import ssl
import threading
import time

from client import ENTRY
from webserver import HOST

SESSION = "s" + "A" * 43
OPENED = json.dumps({"data": {"sid": SESSION}, "success": True}).encode()


def whole_reply(body, status="200 OK", lines=""):
    return (f"HTTP/1.1 {status}\r\nContent-Type: text/html\r\nConnection: close\r\n{lines}"
            f"Content-Length: {len(body)}\r\n\r\n").encode() + body


class Target:
    """Serves until it is closed. `answer` gets the connection of each call that does not
    open a session; without `opens` it gets those too, without `speaks` it gets the bare
    connection before there is any TLS, without `takes` as soon as the head is there."""

    def __init__(self, pem, answer, opens=True, speaks=True, takes=True):
        self.answer = answer
        self.opens = opens
        self.speaks = speaks
        self.takes = takes
        self.requests = []  # head and body of each
        self.sent = 0
        self.closing = threading.Event()
        self._context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
        self._context.load_cert_chain(pem)
        self._listener = socket.create_server((HOST, 0))
        self.port = self._listener.getsockname()[1]
        self.url = f"https://{HOST}:{self.port}{ENTRY}"
        threading.Thread(target=self._accept, daemon=True).start()

    def _accept(self):
        while True:
            try:
                plain, _ = self._listener.accept()
            except OSError:
                return
            threading.Thread(target=self._serve, args=(plain,), daemon=True).start()

    def _serve(self, plain):
        try:
            if not self.speaks:
                self.answer(self, plain)
                return
            with self._context.wrap_socket(plain, server_side=True) as connection:
                request = self._read(connection)
                while request:
                    self.requests.append(request)
                    if not (self.opens and b"TALO.Relay" in request[1]):
                        self.answer(self, connection)
                        return
                    connection.sendall(whole_reply(OPENED).replace(b"Connection: close\r\n", b""))
                    request = self._read(connection)
        except OSError:
            pass  # the other side went away
        finally:
            plain.close()

    def _read(self, connection):
        data = b""
        while b"\r\n\r\n" not in data:
            block = connection.recv(65536)
            if not block:
                return None
            data += block
        head, _, body = data.partition(b"\r\n\r\n")
        length = 0
        for line in head.split(b"\r\n")[1:]:
            name, _, value = line.partition(b":")
            if name.strip().lower() == b"content-length":
                length = int(value)
        while len(body) < length and (self.takes or length < 65536):
            block = connection.recv(65536)
            if not block:
                return None
            body += block
        return head, body

    def close(self):
        self.closing.set()
        # A thread that waits in accept() does not hear of a mere close.
        self._listener.shutdown(socket.SHUT_RDWR)
        self._listener.close()


# Ways to answer


def nothing(target, connection):
    target.closing.wait(60)


def reply(body, **options):
    return lambda target, connection: connection.sendall(whole_reply(body, **options))


def raw(data):
    return lambda target, connection: connection.sendall(data)


def one_byte_a_second(target, connection):
    for byte in whole_reply(b'{"success":true}'):
        connection.sendall(bytes([byte]))
        if target.closing.wait(1):
            return


def slow_body(target, connection):
    """Complete after two seconds."""
    data = whole_reply(b"{ }\n")
    connection.sendall(data[:-4])
    for byte in data[-4:]:
        time.sleep(0.5)
        connection.sendall(bytes([byte]))


def endless(head):
    """A gibibyte, in whatever way the head announces it."""
    def send(target, connection):
        connection.sendall(head)
        for _ in range(1 << 14):
            connection.sendall(b" " * (1 << 16))
            target.sent += 1 << 16
    return send


GIBIBYTE = {
    "announced": endless(b"HTTP/1.1 200 OK\r\nContent-Length: 1073741824\r\n\r\n"),
    "until it closes": endless(b"HTTP/1.1 200 OK\r\nConnection: close\r\n\r\n"),
    "as one header line": endless(b"HTTP/1.1 200 OK\r\nX-Long: "),
}
