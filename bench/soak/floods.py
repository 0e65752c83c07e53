# SPDX-License-Identifier: Apache-2.0
"""What strangers do to a daemon. Each flood sees to it that the daemon ends it, and yields what came of each try."""
import contextlib
import itertools
import re
import socket
import threading
import time

import wire
from tally import expect

CLOSED = "closed by the daemon"


def _stranger(port, number, buffer=0):
    """A connection from one of five addresses that the clients do not have."""
    connection = socket.socket()
    connection.settimeout(wire.PATIENCE)
    if buffer:
        # Both: with the large packets of loopback the daemon's side would take megabytes into its own buffer.
        connection.setsockopt(socket.SOL_SOCKET, socket.SO_RCVBUF, buffer)
        connection.setsockopt(socket.IPPROTO_TCP, socket.TCP_MAXSEG, 536)
    connection.bind((f"127.0.0.{10 + number % 5}", 0))
    connection.connect(("127.0.0.1", port))
    return connection


def _rest(connection):
    """All that still comes until the daemon closes, which it has to do."""
    received = b""
    with contextlib.suppress(ConnectionError):
        while piece := connection.recv(65536):
            received += piece
    return received


def _status(answer):
    found = re.match(rb"HTTP/1\.1 (\d+) ", answer)
    return int(found.group(1)) if found else 0


def idle_connections(life, random):
    with contextlib.ExitStack() as stack:
        port = random.choice((life.http, life.https))
        silent = [stack.enter_context(_stranger(port, number)) for number in range(300)]
        for connection in silent:
            expect(not _status(_rest(connection)), "a silent connection was answered")
            yield CLOSED


def slow_headers(life, random):
    with contextlib.ExitStack() as stack:
        slow = [stack.enter_context(_stranger(life.http, number)) for number in range(30)]
        limit = time.monotonic() + wire.PATIENCE
        for byte in itertools.cycle(b"X: y\r\n"):
            for connection in list(slow):
                try:
                    connection.sendall(bytes([byte]))
                except OSError:
                    slow.remove(connection)
                    yield CLOSED
            if not slow:
                return
            expect(time.monotonic() < limit, f"{len(slow)} slow connections stay open")
            time.sleep(random.uniform(0.1, 0.4))


def garbage_for_tls(life, random):
    for number in range(60):
        with _stranger(life.https, number) as connection:
            with contextlib.suppress(OSError):
                begin = random.choice((b"", b"\x16\x03\x01", b"\x16\x03\x01\x02\x00\x01"))
                connection.sendall(begin + random.randbytes(random.randrange(400)))
                if number % 20:
                    connection.shutdown(socket.SHUT_WR)
            expect(_status(_rest(connection)) in (0, 400), "garbage got through")
        yield CLOSED


def wrong_passwords(life, random):
    answers = []

    def guess(user, word):
        with contextlib.suppress(OSError), contextlib.closing(
                wire.connect(life, "HTTP", "127.0.0.20")) as connection:
            answers.append(wire.post(connection, b"", user, word)[0])

    guessers = [threading.Thread(target=guess, args=(user, str(random.random()))) for user in
                ("admin", "guest", "nobody") * 4]
    for guesser in guessers:
        guesser.start()
    for guesser in guessers:
        guesser.join()
    expect(len(answers) == len(guessers) and set(answers) <= {401, 503}, f"wrong passwords were answered {answers}")
    yield from (f"answered {status}" for status in answers)


def _mutated(body, random):
    changed = bytearray(body)
    for _ in range(random.randint(1, 8)):
        place = random.randrange(len(changed))
        changed[place:place + random.randrange(2)] = random.randbytes(random.randrange(2))
    return bytes(changed)


def hostile_xml(life, random):
    good = wire.request("EnumerateInstances", "CIM_ManagedElement")
    bomb = b"".join(b'<!ENTITY %c "%s">' % (97 + n, b"&%c;" % (96 + n) * 10 if n else b"ha") for n in range(10))
    broken = (b"<a>" * 100_000, b"<!DOCTYPE CIM [" + bomb + b"]><CIM>&j;</CIM>", good[:random.randrange(1, len(good))],
              b"<CIM " + b'a="b" ' * 50_000, random.randbytes(1000), b"\0" * 1000, b"")
    for body in (*broken, *(_mutated(good, random) for _ in range(40))):
        with contextlib.closing(wire.connect(life, "HTTP", "127.0.0.21")) as connection:
            status, answer = wire.post(connection, body, "guest", "guest")
        allowed = (400,) if body in broken else (200, 400, 501)
        expect(status in allowed, f"{body[:300]!r} was answered {status} {answer[:300]!r}")
        yield f"answered {status}"


def unread_answers(life, random):
    body = wire.request("EnumerateClasses", DeepInheritance="TRUE", LocalOnly="FALSE", IncludeQualifiers="TRUE",
                        IncludeClassOrigin="TRUE")
    head = {**wire.headers_for("guest", "guest"), "Content-Length": str(len(body))}
    lines = ["POST /cimom HTTP/1.1", *(f"{name}: {value}" for name, value in head.items()), "", ""]
    with contextlib.ExitStack() as stack:
        readers = [stack.enter_context(_stranger(life.http, number, 4096)) for number in range(40)]
        for reader in readers:
            reader.sendall("\r\n".join(lines).encode() + body)
        time.sleep(random.uniform(14, 17))
        for reader in readers:
            answer = _rest(reader)
            expect((status := _status(answer)) in (0, 200, 503), f"answered {status}")
            if status == 200:
                length = re.search(rb"Content-Length: (\d+)", answer).group(1)
                expect(len(answer) < int(length), "an answer was kept for longer than allowed")
            yield {0: CLOSED, 200: "cut off by the daemon", 503: "answered 503"}[status]


FLOODS = {"flood of " + flood.__name__.replace("_", " "): flood
          for flood in (idle_connections, slow_headers, garbage_for_tls, wrong_passwords, hostile_xml, unread_answers)}


def flood_often(daemons, random):
    for (name, flood), daemon in itertools.cycle(itertools.product(FLOODS.items(), daemons)):
        daemon.step(name, lambda life, flood=flood: flood(life, random))
        time.sleep(random.uniform(0.5, 2))
