"""One request by SCGI, as a web server would send it."""

import socket

TIMEOUT = 60


def header_block(variables):
    """The length of the body comes first, whatever it is."""
    length = variables.get("CONTENT_LENGTH", "0")
    pairs = {"CONTENT_LENGTH": length, "SCGI": "1", **variables}
    words = b"".join(f"{name}\0{value}\0".encode("utf-8", "surrogateescape")
                     for name, value in pairs.items())
    return b"%d:%s," % (len(words), words)


def exchange(path, data, ends=False):
    """All that comes back for these bytes. The other side hears that no more will come only
    if it `ends`: a web server whose client has sent all of its body says nothing."""
    with socket.socket(socket.AF_UNIX) as connection:
        connection.settimeout(TIMEOUT)
        connection.connect(str(path))
        reply = b""
        try:
            connection.sendall(data)
            if ends:
                connection.shutdown(socket.SHUT_WR)
            while block := connection.recv(65536):
                reply += block
        except (BrokenPipeError, ConnectionResetError):
            pass  # the other side has said what it had to say
        return reply


def request(path, variables, body=b"", ends=False):
    return exchange(path, header_block(variables) + body, ends)
