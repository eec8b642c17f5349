"""An appliance for the relay's tests: it does what a plan says, and tells what came.

target.py CERTIFICATE KEY PLAN LOG listens on a free loopback port, whose number it
prints. PLAN is a JSON object that is read for every request: by the name of the API,
or "*" for any other, what to do with it, or a list whose items are used up one
request each, the last one staying. LOG gets a JSON object a line for every request.

What to do: "status", "headers" and "body" of the answer; "delay" seconds before it;
"chunked"; "sizeless" (the end of the connection is the end of the answer); "bytes" of
nonsense in place of the body; "drip" seconds between any two bytes; "cut" the answer
after so many bytes; "close" instead of an answer; "silent", no answer at all;
"early", an answer before the body is read, with "hold" for keeping the connection
open without reading it, or "drain" for reading it to the end; "meet", to answer only
when so many requests are waiting; "headerBytes" of header lines; "session", the only
one that is not answered with "refusal" in the header x-request-error; "goodbye", to
end the connection after the answer.
"""

import json
import socket
import ssl
import sys
import threading
import time
import urllib.parse
import zlib

lock = threading.Condition()
state = {"opened": 0, "used": {}, "met": {}, "inside": 0, "connections": 0}


class Connection:
    def __init__(self, stream, number):
        self.stream = stream
        self.number = number
        self.left = b""

    def more(self):
        piece = self.stream.recv(1 << 18)
        self.left += piece
        return len(piece) > 0

    def head(self):
        while b"\r\n\r\n" not in self.left:
            if not self.more():
                return None
        text, self.left = self.left.split(b"\r\n\r\n", 1)
        lines = text.decode("latin-1").split("\r\n")
        return lines[0], [line.split(": ", 1) for line in lines[1:]]

    def body(self, size, keep):
        """The sum of the body, how much of it came, and its text where it is kept."""
        total, sum_, text = 0, zlib.adler32(b""), b""
        while total < size:
            if not self.left and not self.more():
                break
            piece, self.left = self.left[: size - total], self.left[size - total:]
            total += len(piece)
            sum_ = zlib.adler32(piece, sum_)
            text += piece if keep else b""
        return sum_, total, text.decode("latin-1")


def member(headers, name, fallback=""):
    return next((value for key, value in headers if key.lower() == name.lower()), fallback)


def wanted(plan_file, api):
    with lock:
        with open(plan_file, encoding="utf-8") as plan:
            plans = json.load(plan)
        key = api if api in plans else "*"
        plan = plans.get(key, {})
        if isinstance(plan, list):
            used = state["used"].get(key, 0)
            state["used"][key] = used + 1
            plan = plan[min(used, len(plan) - 1)]
        return plan


def answer_of(api, plan):
    if "bytes" in plan:
        return None
    if "body" in plan:
        return plan["body"].encode()
    if api == "TALO.Relay":
        with lock:
            state["opened"] += 1
            return json.dumps({"success": True, "data": {"sid": f"session-{state['opened']}"}}).encode()
    return b'{"success":true}'


def send(stream, plan, body):
    size = plan["bytes"] if body is None else len(body)
    lines = [f"HTTP/1.1 {plan.get('status', 200)} said"]
    lines += [f"{name}: {value}" for name, value in plan.get("headers", {}).items()]
    if plan.get("chunked"):
        lines.append("Transfer-Encoding: chunked")
    elif not plan.get("sizeless"):
        lines.append(f"Content-Length: {size}")
    filled = 0
    while filled < plan.get("headerBytes", 0):
        lines.append("X-Filler: " + 1000 * "x")
        filled += 1000
    stream.sendall(("\r\n".join(lines) + "\r\n\r\n").encode())
    if body is None:
        piece = b"x" * (1 << 16)
        for _ in range(0, size, len(piece)):
            stream.sendall(piece)
    elif "drip" in plan:
        for byte in body:
            stream.sendall(bytes([byte]))
            time.sleep(plan["drip"])
    elif plan.get("chunked"):
        for at in range(0, len(body), 5):
            stream.sendall(b"%x\r\n%s\r\n" % (len(body[at:at + 5]), body[at:at + 5]))
        stream.sendall(b"0\r\n\r\n")
    else:
        stream.sendall(body[: plan.get("cut", len(body))])


def meet(plan, api):
    with lock:
        state["met"][api] = state["met"].get(api, 0) + 1
        lock.notify_all()
        lock.wait_for(lambda: state["met"][api] >= plan["meet"], 60)


def write(log_file, record):
    with lock, open(log_file, "a", encoding="utf-8") as log:
        log.write(json.dumps(record) + "\n")


def serve_one(connection, plan_file, log_file):
    """Whether the connection goes on."""
    head = connection.head()
    if head is None:
        return False
    with lock:
        state["inside"] += 1
    try:
        line, headers = head
        record = {"line": line, "headers": headers, "connection": connection.number,
                  "inside": state["inside"]}
        query = urllib.parse.urlsplit(line.split(" ")[1]).query
        size = int(member(headers, "Content-Length", "0"))
        form = member(headers, "Content-Type").startswith("application/x-www-form-urlencoded")
        api = dict(urllib.parse.parse_qsl(query)).get("api")
        plan = {}
        if api is None or not wanted(plan_file, api).get("early"):
            record["sum"], record["came"], record["body"] = connection.body(size, form)
        if api is None:
            api = dict(urllib.parse.parse_qsl(record["body"])).get("api", "")
        plan = wanted(plan_file, api)
        record["api"] = api
        write(log_file, record)
        if record.get("came", size) < size or plan.get("close"):
            return False
        if plan.get("silent"):
            return connection.more()
        if "meet" in plan:
            meet(plan, api)
        if member(headers, "Cookie") != f"id={plan.get('session')}" and "refusal" in plan:
            plan = {"headers": {"X-Request-Error": plan["refusal"]}, "body": "no"}
        time.sleep(plan.get("delay", 0))
        send(connection.stream, plan, answer_of(api, plan))
        if plan.get("hold"):
            time.sleep(60)
        while plan.get("drain") and connection.stream.recv(1 << 18):
            pass
        return not any(key in plan for key in ("sizeless", "cut", "early", "goodbye"))
    finally:
        with lock:
            state["inside"] -= 1


def serve(plain, context, plan_file, log_file):
    try:
        with context.wrap_socket(plain, server_side=True) as stream:
            with lock:
                state["connections"] += 1
                number = state["connections"]
            connection = Connection(stream, number)
            while serve_one(connection, plan_file, log_file):
                pass
    except OSError:
        plain.close()


def main():
    certificate, key, plan_file, log_file = sys.argv[1:5]
    context = ssl.SSLContext(ssl.PROTOCOL_TLS_SERVER)
    context.load_cert_chain(certificate, key)
    listener = socket.create_server(("127.0.0.1", 0), backlog=64)
    print(listener.getsockname()[1], flush=True)
    while True:
        plain, _ = listener.accept()
        plain.setsockopt(socket.IPPROTO_TCP, socket.TCP_NODELAY, 1)
        threading.Thread(target=serve, args=(plain, context, plan_file, log_file), daemon=True).start()


main()
