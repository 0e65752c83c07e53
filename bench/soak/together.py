#!/usr/bin/env -S python3 -B
# SPDX-License-Identifier: Apache-2.0
"""Daemons, clients, floods, kills and unloads, all at once and for long. Prints a table; fails when anything was lost.

    bench/soak/together.py [--seconds N] [--seed TEXT] [--build FOLDER]

The build has to have quenx-cimd, quenxctl, the providers and FlashStarter. A copy of it is what runs, so it may be built
again meanwhile. A seed repeats what is chosen, but not how processes and threads meet. Nothing is touched but a
temporary folder and loopback.
"""
import argparse
import os
import pathlib
import random
import shutil
import signal
import sys
import tempfile
import threading
import time

import clients
import daemon
import flash
import floods
import lives
import tally
import wire

SHOWN_EVERY = 600  # seconds
NEEDED = [f"{what} over {way}" for what in ("reading requests", "updates", "checks") for way in wire.WAYS] + [
    lives.SERVED, lives.UPDATED, lives.RELOADED, lives.UNLOADED, lives.KILLED, lives.STOPPED, *floods.FLOODS]


def arguments():
    parser = argparse.ArgumentParser(description=__doc__.split("\n", 1)[0])
    parser.add_argument("--seconds", type=int, default=3600)
    parser.add_argument("--seed", default=str(time.time_ns()))
    parser.add_argument("--build", type=pathlib.Path, default=pathlib.Path(__file__).parents[2] / "build/release")
    return parser.parse_args()


def guarded(name, work):
    """A thread that ends with the time. An error of the soak's own is a loss, too: what was meant to run did not."""
    def run():
        with tally.losing(name):
            try:
                work()
            except daemon.Over:
                pass

    return threading.Thread(target=run)


def copy_of(build, folder):
    shutil.copytree(build / "lib", folder / "lib")
    (folder / "bin").mkdir()
    for program in ("quenx-cimd", "quenxctl"):
        shutil.copy(build / "bin" / program, folder / "bin")
    return folder


def threads_for(options, folder, over):
    def dice(name):
        return random.Random(f"{options.seed} {name}")

    build = copy_of(options.build, folder / "build")
    images = {folder / f"images/{n}.rom": flash.make_image(dice(f"image {n}"), n) for n in range(1, 7)}
    for name in ("images", "host"):
        (folder / name).mkdir()
    for file, image in images.items():
        file.write_bytes(image)
    steady, killed = both = [daemon.Daemon(name, build, folder, images, over) for name in ("steady", "killed")]
    steady.start()
    work = {
        "lives": lambda: lives.live_often(killed, dice("lives"), over),
        "rests": lambda: lives.live_long(steady, max(150, options.seconds / 12), over),
        "reloads": lambda: lives.reload_often(both, dice("reloads"), over),
        "host": lambda: lives.host_often(build, folder / "host", options.seed, over),
        "floods": lambda: floods.flood_often(both, dice("floods")),
    }
    for each in both:
        work[f"updates {each.name}"] = lambda each=each: clients.update_often(each, dice(f"updates {each.name}"))
        for name in (f"reader 1 {each.name}", f"reader 2 {each.name}"):
            work[name] = lambda each=each, name=name: clients.read_often(each, dice(name))
    return both, [guarded(name, each) for name, each in work.items()]


def main():
    options = arguments()
    print(f"{options.seconds} seconds, --seed {options.seed}", flush=True)
    kept = {name: os.environ[name] for name in ("PATH", "TMPDIR") if name in os.environ}
    os.environ.clear()
    os.environ.update(kept, LC_ALL="C.UTF-8")
    over = threading.Event()
    with tempfile.TemporaryDirectory(prefix="quenx-soak-") as folder:
        both, threads = threads_for(options, pathlib.Path(folder), over)
        for thread in threads:
            thread.start()
        end = time.monotonic() + options.seconds
        while (left := end - time.monotonic()) > 0:
            time.sleep(min(left, SHOWN_EVERY))
            if left > SHOWN_EVERY:
                tally.show()
        over.set()
        for thread in threads:
            thread.join()
        for each in both:
            with tally.losing(each.name):
                if each.life.process.poll() is None:
                    tally.expect(each.end(signal.SIGTERM) == 0, "does not stop with exit status 0")
    return tally.report(NEEDED)


sys.exit(main())
