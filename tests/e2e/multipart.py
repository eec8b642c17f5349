"""Bodies of uploads, of any size, and senders that break off in the middle."""

import hashlib
import http.client
import os

from client import ENTRY, Reply

BOUNDARY = "--------------------------e2e7f1c04d93"
TYPE = f"multipart/form-data; boundary={BOUNDARY}"
BLOCK = 1 << 20


class Content:
    """Bytes that nobody can guess, none of their blocks like another."""

    def __init__(self, size):
        self.size = size
        self._seed = os.urandom(BLOCK - 8)

    def __len__(self):
        return self.size

    def __iter__(self):
        for number in range((self.size + BLOCK - 1) // BLOCK):
            block = number.to_bytes(8, "big") + self._seed
            yield block[:min(BLOCK, self.size - number * BLOCK)]

    def sha256(self):
        return digest(self)


def digest(blocks):
    sum = hashlib.sha256()
    for block in blocks:
        sum.update(block)
    return sum.hexdigest()


def file_digest(path):
    with open(path, "rb") as file:
        return digest(iter(lambda: file.read(BLOCK), b""))


def body_digest(client, path):
    """The SHA-256 of what a GET brings, however much it is."""
    connection = client.connection()
    try:
        connection.request("GET", path)
        response = connection.getresponse()
        return digest(iter(lambda: response.read(BLOCK), b""))
    finally:
        connection.close()


class Form:
    """The parts of a body, in their order."""

    def __init__(self):
        self._pieces = []

    def field(self, name, text):
        return self._part(f'name="{name}"', "", str(text).encode())

    def file(self, name, filename, content):
        """The file's name goes out as it stands, quoted."""
        if isinstance(filename, str):
            filename = filename.encode()
        return self.raw_file(name, b'filename="%s"' % filename, content)

    def raw_file(self, name, filename_parameter, content):
        return self._part(f'name="{name}"; ', filename_parameter, content,
                          "Content-Type: application/octet-stream\r\n")

    def _part(self, parameters, more, content, lines=""):
        head = f"--{BOUNDARY}\r\nContent-Disposition: form-data; {parameters}".encode()
        more = more if isinstance(more, bytes) else more.encode()
        self._pieces += [head + more + b"\r\n" + lines.encode() + b"\r\n", content, b"\r\n"]
        return self

    def _all(self):
        return [*self._pieces, f"--{BOUNDARY}--\r\n".encode()]

    def __len__(self):
        return sum(len(piece) for piece in self._all())

    def __iter__(self):
        for piece in self._all():
            if isinstance(piece, bytes):
                yield piece
            else:
                yield from piece


def upload(client, query, form, headers=None):
    """The reply to a form; the query may be empty."""
    return client.request("POST", f"{ENTRY}?{query}" if query else ENTRY, iter(form), {
        "Content-Type": TYPE, "Content-Length": str(len(form)), **(headers or {})})


class Sender:
    """A POST whose body is sent step by step."""

    def __init__(self, client, query, length, headers=None):
        self.socket = client.connect()
        lines = {"Host": client.host, "Connection": "close", "Content-Type": TYPE,
                 "Content-Length": str(length), **(headers or {})}
        head = f"POST {ENTRY}?{query} HTTP/1.1\r\n"
        head += "".join(f"{name}: {value}\r\n" for name, value in lines.items())
        self.socket.sendall(head.encode() + b"\r\n")

    def send(self, data):
        self.socket.sendall(data)

    def reply(self):
        response = http.client.HTTPResponse(self.socket)
        response.begin()
        return Reply(response.status, response.getheaders(), response.read())

    def close(self):
        self.socket.close()
