"""A small HTTP client: ordinary requests, and bytes as one likes."""

import contextlib
import http.client
import json
import socket
import ssl
import urllib.parse

ENTRY = "/webapi/entry.cgi"
TIMEOUT = 60


def form(**parameters):
    return urllib.parse.urlencode(parameters)


class Reply:
    def __init__(self, status, headers, body):
        self.status = status
        self.headers = headers  # name and value, in the order they came
        self.body = body

    def header(self, name):
        values = [value for key, value in self.headers if key.lower() == name.lower()]
        return values[0] if values else None

    def document(self):
        """The one JSON document that the body must be."""
        return json.loads(self.body.decode("utf-8"), parse_constant=_refuse)

    def __repr__(self):
        return f"{self.status} {self.headers} {self.body[:300]!r}"


def _refuse(constant):
    raise ValueError(f"{constant} is no JSON")


class Client:
    timeout = TIMEOUT

    def __init__(self, host, port, authority=None):
        """With a file of certificates the client speaks TLS, and trusts these."""
        self.host = host
        self.port = port
        self._tls = ssl.create_default_context(cafile=authority) if authority else None

    def connection(self):
        if self._tls is None:
            return http.client.HTTPConnection(self.host, self.port, timeout=self.timeout)
        return http.client.HTTPSConnection(self.host, self.port, timeout=self.timeout,
                                           context=self._tls)

    def connect(self):
        """A connected socket."""
        plain = socket.create_connection((self.host, self.port), timeout=TIMEOUT)
        if self._tls is None:
            return plain
        return self._tls.wrap_socket(plain, server_hostname=self.host)

    def request(self, method, path, body=None, headers=None):
        connection = self.connection()
        try:
            # Who refuses a body answers before it has come, and takes no more of it.
            with contextlib.suppress(BrokenPipeError, ConnectionResetError):
                connection.request(method, path, body, {"Connection": "close", **(headers or {})})
            return _read(connection.getresponse())
        finally:
            connection.close()

    def get(self, query, headers=None):
        return self.request("GET", f"{ENTRY}?{query}", headers=headers)

    def post(self, body, query="", headers=None):
        kind = {"Content-Type": "application/x-www-form-urlencoded"}
        return self.request("POST", f"{ENTRY}?{query}" if query else ENTRY, body,
                            {**kind, **(headers or {})})

    def call(self, api, method, version=1, headers=None, **parameters):
        return self.post(form(api=api, version=version, method=method, **parameters),
                         headers=headers)

    def raw(self, data, half_close=False):
        """The reply to these bytes; None when the server just closes."""
        with self.connect() as connection:
            connection.sendall(data)
            if half_close:
                connection.shutdown(socket.SHUT_WR)
            response = http.client.HTTPResponse(connection)
            try:
                response.begin()
            except (http.client.BadStatusLine, ConnectionResetError):
                return None
            return _read(response)

    def raw_post(self, length_lines, body, half_close=False):
        """A POST whose header lines about its length are the caller's."""
        head = (f"POST {ENTRY} HTTP/1.1\r\nHost: {self.host}\r\nConnection: close\r\n"
                f"Content-Type: application/x-www-form-urlencoded\r\n{length_lines}\r\n")
        return self.raw(head.encode() + body, half_close)


def _read(response):
    return Reply(response.status, response.getheaders(), response.read())
