# SPDX-License-Identifier: Apache-2.0
"""A quenx-cimd with adapters of its own, which can be killed, stopped, started anew and weighed."""
import json
import os
import pathlib
import re
import signal
import subprocess
import threading
import time

import flash
import tally
import wire
from tally import expect

CONFIGURATION = """[listen]
https_port = 0
http = true
http_port = 0
socket = "{folder}/socket"
[tls]
certificate = "{folder}/cert.pem"
key = "{folder}/key.pem"
generate = true
[auth]
method = "users"
users_file = "{folder}/users"
[limits]
connections = 200
connections_per_address = 60
answer_bytes = 16777216
header_seconds = 15
request_seconds = 10
idle_seconds = 20
enumerations = 100
enumerations_per_user = 50
enumeration_seconds = 4
[providers]
directory = "{build}/lib"
configuration = "{folder}/provider.conf"
[indications]
file = "{folder}/subscriptions.json"
per_second = 0
[adapters]
description = "{folder}/adapters.toml"
state = "{folder}/state"
[daemon]
lock_file = "{folder}/lock"
"""
REST_SECONDS = 5  # clients close what they have opened; this is for the enumerations that they leave


class Over(Exception):
    """The time is up."""


class Life:
    """From one start to its end."""

    def __init__(self, process, folder):
        self.process = process
        self.ended = threading.Event()  # set before the signal is sent
        self.log = folder / "log"
        self.socket = f"{folder}/socket"
        self.certificate = f"{folder}/cert.pem"
        limit = time.monotonic() + wire.PATIENCE
        while not (serving := re.search(r"Serving https://127.0.0.1:(\d+) http://127.0.0.1:(\d+)", self.said())):
            expect(process.poll() is None and time.monotonic() < limit, f"no start: {self.said()[-500:]}")
            time.sleep(0.05)
        self.https, self.http = map(int, serving.groups())

    def said(self):
        return self.log.read_text(errors="replace")


class Daemon:
    """One daemon after the other on the same state. A gate lets clients in, or keeps them out for a rest."""

    def __init__(self, name, build, folder, images, over):
        self.name = name
        self.folder = folder / name
        self.images = images  # file: content, by revision from 1 on
        self.updates = threading.Lock()  # held by who installs: one update runs at a time
        self.life = None
        self._build = build
        self._over = over
        self._gate = threading.Condition()
        self._working = 0
        self._is_open = False
        first = next(iter(images))
        self.flashes = {f"eth{n}": flash.Flash(self.folder / f"state/eth{n}", images[first]) for n in range(3)}
        self.folder.mkdir()
        (self.folder / "adapters.toml").write_text("".join(
            flash.ADAPTER.format(number=n, speed=flash.WRITE_SPEED, first=first) for n in range(3)))
        (self.folder / "provider.conf").write_text(f"FWFilePath={first.parent}\nReleaseClaimAfterCheck=1\n")
        (self.folder / "quenx-cimd.toml").write_text(CONFIGURATION.format(folder=self.folder, build=build))
        for user in ("admin", "guest", "turn"):
            self.set_password(user, user)

    def set_password(self, user, password):
        subprocess.run([self._build / "bin/quenx-cimd", "passwd", "--users", self.folder / "users", user], check=True,
                       input=password + "\n", text=True, stdout=subprocess.DEVNULL, timeout=wire.PATIENCE)

    def start(self):
        with open(self.folder / "log", "wb") as log:
            process = subprocess.Popen(
                [self._build / "bin/quenx-cimd", "--config", self.folder / "quenx-cimd.toml"], stdin=subprocess.DEVNULL,
                stdout=log, stderr=log, env={**os.environ, "QUENX_LOG": "stderr"})
        try:
            self.life = Life(process, self.folder)
        except tally.Wrong:
            process.kill()
            process.wait()
            raise

    def end(self, number):
        """Sends the signal and returns the exit status. Nobody is let in until open()."""
        with self._gate:
            self._is_open = False
            self.life.ended.set()
        self.life.process.send_signal(number)
        try:
            return self.life.process.wait(wire.PATIENCE)
        except subprocess.TimeoutExpired:
            self.life.process.kill()
            self.life.process.wait()
            raise tally.Wrong(f"does not end after {signal.Signals(number).name}") from None

    def command(self, life, way, *words):
        """Starts quenxctl as a client of that life."""
        server = {"HTTP": [f"http://127.0.0.1:{life.http}"], "the Unix socket": [f"unix:{life.socket}"],
                  "HTTPS": [f"https://127.0.0.1:{life.https}", "--cacert", life.certificate]}[way]
        return subprocess.Popen([self._build / "bin/quenxctl", "--json", "--server", *server, *words],
                                stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, stdin=subprocess.DEVNULL, text=True,
                                env={**os.environ, "QUENXCTL_USER": "admin", "QUENXCTL_PASSWORD": "admin"})

    @staticmethod
    def finish(command):
        """Its exit status, and what it said."""
        try:
            said = command.communicate(timeout=120)[0]
            return command.returncode, json.loads(said)
        finally:
            command.kill()
            command.wait()

    def listed(self, life, verb):
        status, said = self.finish(self.command(life, "the Unix socket", verb))
        expect(status == 0, f"quenxctl {verb}: {said}")
        return said[verb]

    def choose(self, random, adapter=None):
        """An adapter, and the file of an image that it does not have."""
        adapter = adapter or random.choice(list(self.flashes))
        held = self.flashes[adapter].content()
        return adapter, random.choice([file for file, image in self.images.items() if image != held])

    def revision_on(self, adapter):
        return list(self.images.values()).index(self.flashes[adapter].content()) + 1

    def open(self):
        with self._gate:
            self._is_open = True
            self._gate.notify_all()

    def close(self):
        """Lets nobody begin, waits until everybody has finished, and until what times out has done so."""
        with self._gate:
            self._is_open = False
            self._gate.wait_for(lambda: self._working == 0)
        time.sleep(REST_SECONDS)
        expect(self.listed(self.life, "jobs") == [], "jobs are left")

    def weigh(self):
        return tally.weigh(self.life.process.pid)

    def step(self, what, action):
        """Waits for the gate, and counts the outcomes that action(life) yields. Its failure is a loss, unless the
        daemon was ended meanwhile."""
        with self._gate:
            while not (self._is_open and not self.life.ended.is_set()) or self._over.is_set():
                if self._over.is_set():
                    raise Over
                self._gate.wait(0.5)
            self._working += 1
            life = self.life
        try:
            for outcome in action(life):
                tally.count(what, outcome)
        except Exception as fault:  # pylint: disable=broad-except
            if life.ended.is_set():
                tally.count(what, "cut off by a kill or a stop")
            else:
                tally.lose(f"{what} ({self.name})", fault)
        finally:
            with self._gate:
                self._working -= 1
                self._gate.notify_all()
