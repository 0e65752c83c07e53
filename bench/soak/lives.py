# SPDX-License-Identifier: Apache-2.0
"""How daemons and the foreign host live and end."""
import contextlib
import json
import pathlib
import select
import signal
import subprocess
import sys
import time

import clients
import flash
import tally
import wire
from tally import expect

KILLED = "SIGKILL to a daemon in an update"
STOPPED = "SIGTERM to a daemon in an update"
RELOADED = "SIGHUP to a daemon"
SERVED = "adapters after a start"
UPDATED = "updates of the struck adapter"
UNLOADED = "unloads by a foreign host"
# What a process may have more at rest than at first, in KiB: little once all has happened to it, since then only a leak
# goes on growing. The first floods make the C library keep memory for each of its arenas.
WARM = 16384
COLD = 32768


def expect_served(daemon):
    """What the daemon tells of each adapter has to be what the flash holds."""
    for adapter in daemon.listed(daemon.life, "adapters"):
        revision = daemon.revision_on(adapter["name"])
        expect(adapter["components"] == [{"type": "IMG_UEFI", "version": revision}], f"not {revision}: {adapter}")
        tally.count(SERVED, "served as the flash holds it")


def strike(daemon, random):
    """Ends the daemon at a random moment of an update, and judges every flash. Returns the adapter."""
    before = {name: each.content() for name, each in daemon.flashes.items()}
    adapter, file = daemon.choose(random)
    new = daemon.images[file]
    following = clients.begin(daemon, daemon.life, random.choice(wire.WAYS), adapter, file)
    # Every other time near the end, where the record changes.
    time.sleep(flash.seconds_to_write(new) * random.choice((random.uniform(0, 1.1), random.uniform(0.95, 1.05))))
    number = random.choice((signal.SIGKILL, signal.SIGKILL, signal.SIGKILL, signal.SIGTERM))
    status = daemon.end(number)
    told, said = daemon.finish(following)
    held = {name: each.content() for name, each in daemon.flashes.items()}
    expect(all(held[name] == before[name] for name in held if name != adapter), "another adapter has changed")
    expect(held[adapter] in (before[adapter], new), f"{adapter} has neither the old image nor the new one")
    expect(told == clients.UNKNOWN or (told == 0 and held[adapter] == new), f"quenxctl says: {said}")
    when = "in the flash" if daemon.flashes[adapter].writer() == daemon.life.process.pid else "beside the flash"
    if number == signal.SIGKILL:
        expect(status == -signal.SIGKILL, f"exit status {status}")
        tally.count(KILLED, f"{when}: {'new' if held[adapter] == new else 'old'} image, whole")
    else:
        expect(status == 0 and held[adapter] == new, f"{status}, {daemon.life.said()[-300:]}")
        tally.count(STOPPED, "update finished, exit status 0")
    return adapter


def live_often(daemon, random, over):
    """One life after the other, each of which ends in an update."""
    struck = None
    while not over.is_set():
        with tally.losing(KILLED):
            daemon.start()
            expect_served(daemon)
            for outcome in clients.update(daemon, daemon.life, "HTTP", random, struck):
                tally.count(UPDATED, outcome)
            scale = tally.Scale("a daemon that is killed", COLD)
            daemon.close()
            scale.put(daemon.weigh)
            daemon.open()
            over.wait(random.uniform(10, 30))
            daemon.close()
            scale.put(daemon.weigh)
            daemon.open()
            time.sleep(random.uniform(1, 3))
            with daemon.updates:
                struck = strike(daemon, random)
        if daemon.life and daemon.life.process.poll() is None:
            daemon.end(signal.SIGKILL)  # after a loss, so that the next life can begin
        over.wait(1)


def live_long(daemon, period, over):
    """One life, weighed now and then."""
    scale = tally.Scale("the daemon that lives on", WARM)
    while not over.is_set():
        daemon.open()
        over.wait(period)
        with tally.losing("the daemon that lives on"):
            daemon.close()
            scale.put(daemon.weigh)
    print(f"The daemon that lives on, at rest: {scale}")


def reload_and_log_in(daemon, life, random):
    """A new password counts from SIGHUP on."""
    reloaded = "Reloaded the certificate and key."
    times = life.said().count(reloaded)
    word = str(random.random())
    daemon.set_password("turn", word)
    life.process.send_signal(signal.SIGHUP)
    limit = time.monotonic() + wire.PATIENCE
    while life.said().count(reloaded) == times:
        expect(time.monotonic() < limit, "is not heeded")
        time.sleep(0.1)
    for password, wanted in ((word, 200), ("turn", 401)):
        with contextlib.closing(wire.connect(life, "HTTPS")) as connection:
            status = wire.post(connection, wire.request("EnumerateClassNames"), "turn", password)[0]
        expect(status == wanted, f"then a password is answered {status} instead of {wanted}")
    yield "new password counts"


def reload_often(daemons, random, over):
    while not over.wait(random.uniform(5, 15)):
        daemon = random.choice(daemons)
        daemon.step(RELOADED, lambda life, daemon=daemon: reload_and_log_in(daemon, life, random))


def host_often(build, folder, seed, over):
    """Watches a foreign host, each of whose rounds has to end in time."""
    scale = tally.Scale("the foreign host", WARM)
    program = pathlib.Path(__file__).with_name("foreign_host.py")
    with tally.losing(UNLOADED), open(folder / "log", "wb") as log, subprocess.Popen(
            [sys.executable, "-B", program, build / "lib", folder, seed], stdin=subprocess.PIPE, stdout=subprocess.PIPE,
            stderr=log) as process:
        try:
            while not over.is_set():
                expect(select.select([process.stdout], [], [], 120)[0], "a round hangs")
                line = process.stdout.readline()
                expect(line, f"the host has died: {(folder / 'log').read_text()[-500:]}")
                said = json.loads(line)
                expect(not said["fault"], said["fault"])
                tally.count(UNLOADED, said["outcome"])
                # Python itself grows at first.
                if said["round"] % 10 == 0:
                    scale.put(lambda: tuple(said["weight"]))
            process.stdin.close()
            expect(process.wait(120) == 0, f"exit status {process.returncode}")
        finally:
            process.kill()
    print(f"The foreign host, at rest: {scale}")
