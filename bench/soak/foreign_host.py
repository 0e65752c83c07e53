# SPDX-License-Identifier: Apache-2.0
"""A process that loads the providers, updates an adapter and unloads them, again and again:

    foreign_host.py LIBRARIES FOLDER SEED

Prints a line in JSON for each round, until its standard input ends.
"""
import ctypes
import json
import os
import pathlib
import random
import select
import sys
import threading
import time

import flash
from tally import expect, weigh

PROVIDERS = ("libQuenx_SoftwareInventory.so", "libQuenx_SoftwareUpdate.so")
LIBC = ctypes.CDLL(None)  # its dlclose lets other threads of Python run
LIBC.dlclose.argtypes = [ctypes.c_void_p]


def is_mapped(library):
    try:
        LIBC.dlclose(ctypes.CDLL(library, mode=os.RTLD_NOW | os.RTLD_NOLOAD)._handle)
        return True
    except OSError:
        return False


def call_wrongly(starter, stop):
    while not stop.is_set():
        starter.startFlash(b"nonsense")
        time.sleep(0.002)


def one_round(libraries, image, uri, adapter):
    """Unloads at a random moment of the flash, often while others call."""
    paths = [libraries + each for each in random.sample(PROVIDERS, 2)]
    loaded = [ctypes.CDLL(path, mode=os.RTLD_NOW) for path in (*paths, libraries + "libFlashStarter.so")]
    starter = loaded.pop()
    expect(starter.startFlash(uri) == 1, "the update did not begin")
    time.sleep(random.uniform(0, 1.1 * flash.seconds_to_write(image)))
    stop = threading.Event()
    callers = [threading.Thread(target=call_wrongly, args=(starter, stop)) for _ in range(random.choice((0, 4)))]
    for caller in callers:
        caller.start()
    when = "in the flash" if adapter.is_being_written() else "beside the flash"
    for library in random.sample(loaded, 2):
        LIBC.dlclose(library._handle)
    stop.set()
    for caller in callers:
        caller.join()
    LIBC.dlclose(starter._handle)
    left = [path for path in paths if is_mapped(path)]
    expect(not left, f"still mapped: {left}")
    expect(adapter.content() == image, "the unloading did not wait for the flash")
    return when + (" and while others called" if callers else "")


def main(libraries, folder, seed):
    random.seed(seed)
    first = flash.make_image(random, 0)
    (folder / "first.rom").write_bytes(first)
    (folder / "adapters.toml").write_text(
        flash.ADAPTER.format(number=0, speed=flash.WRITE_SPEED, first=folder / "first.rom"))
    os.environ.update(QUENX_ADAPTERS=f"{folder}/adapters.toml", QUENX_ADAPTER_STATE=f"{folder}/state")
    adapter = flash.Flash(folder / "state/eth0", first)
    said = {"round": 0}
    while not select.select([sys.stdin], [], [], random.uniform(0.2, 1))[0]:
        said = {"round": said["round"] + 1, "outcome": None, "fault": None}
        image = flash.make_image(random, said["round"])
        (folder / "new.rom").write_bytes(image)
        try:
            said["outcome"] = one_round(libraries + "/", image, f"file://{folder}/new.rom".encode(), adapter)
        except Exception as fault:  # pylint: disable=broad-except
            said["fault"] = f"{type(fault).__name__}: {fault}"
        weight = weigh(os.getpid())
        for _ in range(50):  # a thread that has been joined takes a moment to go
            if weight[2] > 1:
                time.sleep(0.1)
                weight = weigh(os.getpid())
        print(json.dumps({**said, "weight": weight}), flush=True)


main(sys.argv[1], pathlib.Path(sys.argv[2]), sys.argv[3])
