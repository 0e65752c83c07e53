#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""What telling of updates costs: how long after a job's end a listener hears of it, how much longer a flash takes with
100 listeners, and what quenx-cimd weighs after 10,000 indications.

    bench/indications.py [BUILD]   a folder with bin/ and lib/ (build/release if not given)

Daemon, listener and client are on this machine, on loopback; the adapters are simulated.
"""
import atexit
import http.server
import os
import pathlib
import random
import re
import statistics
import sys
import tempfile
import threading
import time
from datetime import datetime

ROOT = pathlib.Path(__file__).resolve().parent.parent
sys.path.insert(0, str(ROOT / "bench/soak"))
import daemon  # noqa: E402 pylint: disable=wrong-import-position
import flash  # noqa: E402 pylint: disable=wrong-import-position
import wire  # noqa: E402 pylint: disable=wrong-import-position

LISTENERS = 100
UPDATES = 20
MANY = 10_000
QUERY = "SELECT * FROM CIM_InstIndication WHERE SourceInstance ISA CIM_ConcreteJob"
ANSWER = b"""<?xml version="1.0" encoding="utf-8"?><CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="1" \
PROTOCOLVERSION="1.0"><SIMPLEEXPRSP><EXPMETHODRESPONSE NAME="ExportIndication"><IRETURNVALUE/></EXPMETHODRESPONSE>\
</SIMPLEEXPRSP></MESSAGE></CIM>"""


class Listener(http.server.ThreadingHTTPServer):
    """Takes everything, and notes when it came, where to, its number and its event."""

    daemon_threads = True
    request_queue_size = 256

    def __init__(self):
        super().__init__(("127.0.0.1", 0), Handler)
        self.heard = []
        threading.Thread(target=self.serve_forever, daemon=True).start()


class Handler(http.server.BaseHTTPRequestHandler):
    def do_POST(self):  # pylint: disable=invalid-name
        body = self.rfile.read(int(self.headers["Content-Length"])).decode()
        arrived = time.time()
        self.server.heard.append((arrived, self.path, body))  # before the next one can be sent
        self.send_response(200)
        for name, value in (("Content-Type", "application/xml"), ("CIMExport", "MethodResponse"),
                            ("Content-Length", len(ANSWER))):
            self.send_header(name, str(value))
        self.end_headers()
        self.wfile.write(ANSWER)

    def log_message(self, *_):
        pass


def value(body, name):
    return re.search(f'NAME="{name}"[^>]*><VALUE>([^<]*)', body).group(1)


def moment(text):
    """Seconds since the epoch of a CIM datetime (DSP0004 5.2.4)."""
    zone = int(text[21:])
    return datetime.strptime(text[:21] + f"{zone // 60:+03d}{abs(zone) % 60:02d}", "%Y%m%d%H%M%S.%f%z").timestamp()


def is_end(body):
    """Whether a job has completed: its state was another one before."""
    source, previous = (body[body.find(f'NAME="{name}"'):] for name in ("SourceInstance", "PreviousInstance"))
    state = re.compile(r"JobState(?:.|\n)*?VALUE(?:>|&gt;)(\d+)")
    return "InstModification" in body and state.search(source).group(1) == "7" != state.search(previous).group(1)


class Server:
    """A quenx-cimd whose jobs so many are told of."""

    def __init__(self, name, build, folder, images):
        self.daemon = daemon.Daemon(name, build, folder, images, threading.Event())
        self.daemon.start()
        self.life = self.daemon.life
        atexit.register(self.life.process.kill)
        self.listener = Listener()
        self._random = random.Random(1)

    def create(self, instance):
        connection = wire.connect(self.life, "HTTP")
        body = wire.request("CreateInstance", NewInstance=instance).replace(
            b'<NAMESPACE NAME="root"/><NAMESPACE NAME="cimv2"/>', b'<NAMESPACE NAME="interop"/>')
        status, answer = wire.post(connection, body)
        path = re.search(rb"<INSTANCENAME .*</INSTANCENAME>", answer)
        if status != 200 or path is None:
            sys.exit(answer.decode())
        return path.group().decode()

    @staticmethod
    def instance(name, **properties):
        return f'<INSTANCE CLASSNAME="{name}">' + "".join(
            f'<PROPERTY.REFERENCE NAME="{key}"><VALUE.REFERENCE>{text}</VALUE.REFERENCE></PROPERTY.REFERENCE>'
            if text[0] == "<" else f'<PROPERTY NAME="{key}" TYPE="string"><VALUE>{text}</VALUE></PROPERTY>'
            for key, text in properties.items()) + "</INSTANCE>"

    def subscribe(self, destinations, filters):
        """Each destination to each filter."""
        wanted = [self.create(self.instance("CIM_IndicationFilter", Name=f"f{i}", Query=QUERY,
                                            QueryLanguage="DMTF:CQL")) for i in range(filters)]
        for i in range(destinations):
            handler = self.create(self.instance("CIM_ListenerDestinationCIMXML", Name=f"d{i}",
                                                Destination=f"http://127.0.0.1:{self.listener.server_port}/{i}"))
            for each in wanted:
                self.create(self.instance("CIM_IndicationSubscription", Filter=each, Handler=handler))

    def update(self):
        """Carries out one, and returns how long its job ran, in seconds."""
        adapter, file = self.daemon.choose(self._random, "eth0")
        command = self.daemon.command(self.life, "the Unix socket", "install", "--target", adapter, "--force",
                                      str(file))
        status, said = self.daemon.finish(command)
        if status != 0:
            sys.exit(str(said))
        answer = wire.call(wire.connect(self.life, "HTTP"), "EnumerateInstances", of_class="Quenx_ConcreteJob")
        jobs = []
        for each in answer.iter("INSTANCE"):
            texts = {given.get("NAME"): given.findtext("VALUE") for given in each.iter("PROPERTY")}
            jobs.append(moment(texts["TimeOfLastStateChange"]) - moment(texts["StartTime"]))
        for path in wire.paths_in(answer):
            wire.call(wire.connect(self.life, "HTTP"), "DeleteInstance", InstanceName=path)
        return jobs[-1]


def latencies(server):
    """From the end of each job to its arrival at the last listener, in milliseconds."""
    ends = {}
    for arrived, _, body in server.listener.heard:
        if is_end(body):
            taken = (arrived - moment(value(body, "IndicationTime"))) * 1000
            job = value(body, "IndicationTime")
            ends[job] = max(taken, ends.get(job, 0))
    return list(ends.values())


def shown(name, numbers, unit):
    print(f"{name:58} {statistics.median(numbers):9.2f} {max(numbers):9.2f} {unit}", flush=True)


def weight(weighed):
    return "{:,} KiB of its own, {} descriptors, {} threads".format(*weighed)


def settle(server):
    """Until nothing has come for a while."""
    before = -1
    while before != (before := len(server.listener.heard)):
        time.sleep(0.5)


def main():
    build = pathlib.Path(sys.argv[1] if len(sys.argv) > 1 else ROOT / "build/release").resolve()
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        images = {}
        for revision in (1, 2):
            file = folder / f"revision-{revision}.rom"
            file.write_bytes(flash.make_image(random.Random(revision), revision))
            images[file] = file.read_bytes()
        quiet, one, hundred = (Server(each, build, folder, images) for each in ("quiet", "one", "hundred"))
        flash.WRITE_SPEED *= 10
        many = Server("many", build, folder, images)
        os.nice(19)  # listeners are on other machines, where they take no processor from a flash
        one.subscribe(1, 1)
        hundred.subscribe(LISTENERS, 1)
        many.subscribe(1, LISTENERS)
        runs = [[], [], []]
        for _ in range(UPDATES):
            for times, server in zip(runs, (quiet, one, hundred)):
                times.append(server.update() * 1000)
                settle(server)
        print(f"{'':58} {'median':>9} {'worst':>9}")
        shown("from a job's end to its listener", latencies(one), "ms")
        shown(f"from a job's end to the last of {LISTENERS} listeners", latencies(hundred), "ms")
        for times, text in zip(runs, ("nobody listening", "one listener", f"{LISTENERS} listeners")):
            shown("a job, from its start to its end, " + text, times, "ms")

        many.update()
        settle(many)
        before = many.daemon.weigh()
        begin = time.monotonic()
        while len(many.listener.heard) < MANY:
            many.update()
            settle(many)
        taken = time.monotonic() - begin
        numbers = [int(value(body, "SequenceNumber")) for _, _, body in many.listener.heard]
        if numbers != list(range(len(numbers))):
            sys.exit("they are not in order, or some are missing")
        print(f"{len(numbers)} indications in order without a gap, in {taken:.0f} s; "
              f"before: {weight(before)}; after: {weight(many.daemon.weigh())}")
        for each in (quiet, one, hundred, many):
            each.daemon.end(15)


main()
