# SPDX-License-Identifier: Apache-2.0
"""What was tried, how often and with which outcome; what a process weighs; and what was lost."""
import collections
import contextlib
import os
import pathlib
import re
import sys
import threading
import time

_lock = threading.Lock()
_outcomes = collections.defaultdict(collections.Counter)
_losses = []


class Wrong(Exception):
    """Something came out otherwise than it has to."""


def expect(holds, text):
    if not holds:
        raise Wrong(text)


def count(what, outcome, number=1):
    with _lock:
        _outcomes[what][outcome] += number


def lose(what, fault):
    count(what, "lost")
    text = f"{what}: {type(fault).__name__}: {fault}".replace("\n", " ")
    with _lock:
        _losses.append(text)
    print(f"{time.strftime('%H:%M:%S')} LOSS: {text}", file=sys.stderr, flush=True)


@contextlib.contextmanager
def losing(what):
    """What goes wrong inside is a loss, and the soak goes on."""
    try:
        yield
    except Exception as fault:  # pylint: disable=broad-except
        lose(what, fault)


def weigh(process_id):
    """Memory of its own in KiB, descriptors, threads. Pages of files are left out: they come and go by themselves."""
    proc = pathlib.Path(f"/proc/{process_id}")
    memory = int(re.search(r"^Anonymous:\s+(\d+)", (proc / "smaps_rollup").read_text(), re.M).group(1))
    return memory, len(os.listdir(proc / "fd")), len(os.listdir(proc / "task"))


class Scale:
    """Compares each weight of a process at rest with its first."""

    def __init__(self, what, most_growth):
        self._what = what
        self._most_growth = most_growth  # KiB of memory; not one descriptor, not one thread
        self._first = self._last = None

    def put(self, weigh_now):
        """A busy machine takes its time to come to rest."""
        self._last = weigh_now()
        self._first = self._first or self._last
        most = (self._first[0] + self._most_growth, *self._first[1:])
        limit = time.monotonic() + 60
        while any(now > bound for now, bound in zip(self._last, most)):
            expect(time.monotonic() < limit, f"at rest {self}")
            time.sleep(1)
            self._last = weigh_now()
        count(f"at rest: {self._what}", "as light as at first")

    def __str__(self):
        return "; ".join(f"{when} {memory} KiB, {descriptors} descriptors, {threads} threads" for when, (
            memory, descriptors, threads) in (("first", self._first), ("last", self._last)))


def show():
    with _lock:
        rows = [(what, outcomes.total(), ", ".join(f"{number} {text}" for text, number in outcomes.most_common()))
                for what, outcomes in sorted(_outcomes.items())]
        rows.append(("losses", len(_losses), "; ".join(_losses[:10]).replace("|", "/") or "none"))
    print("\n| what | tried | outcomes |\n|---|---|---|")
    for what, number, text in rows:
        print(f"| {what} | {number} | {text} |", flush=True)


def report(needed):
    """Prints the table, and returns the exit status. What never came to pass was not shown, which is a loss, too."""
    with _lock:
        missing = [what for what in needed if what not in _outcomes]
    for what in missing:
        lose(what, Wrong("never came to pass"))
    show()
    return 1 if _losses else 0
