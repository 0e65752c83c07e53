#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Draws first-update.svg: what a terminal shows of a first update, by the real program on a simulated adapter.

    docs/pictures/record.py PROGRAMS           draws it anew; PROGRAMS is the folder with quenxctl
    docs/pictures/record.py --check PROGRAMS   fails if the program shows something else by now
"""
import fcntl
import html
import os
import pathlib
import pty
import re
import struct
import subprocess
import sys
import tempfile
import termios

PICTURE = pathlib.Path(__file__).resolve().parent / "first-update.svg"
IMAGE = "/usr/lib/ipxe/qemu/efi-virtio.rom"
ADAPTERS = f"""[[adapter]]
name = "eth0"
pci_address = "0000:03:00.0"
pci_id = "1af4:1041"
mac = "52:54:00:10:00:00"
description = "Quenx QX-10"
flash_file = "{IMAGE}"
write_speed = 500_000
"""
COMMANDS = ("quenxctl", "quenxctl check --target eth0 new.rom", "quenxctl install --target eth0 new.rom",
            "quenxctl install --target eth0 new.rom")
COLUMNS, ROWS = 84, 30
CHARACTER, LINE, MARGIN = 8.4, 19, 14


def newer(image):
    """The same firmware with the next revision in each of its parts (PCI Firmware 3.x, 5.1.2)."""
    start = 0
    while True:
        header = start + int.from_bytes(image[start + 24:start + 26], "little")
        end = start + 512 * int.from_bytes(image[header + 16:header + 18], "little")
        image[header + 18] += 1
        if image[header + 20] == 0:  # for PCs, with a sum over all bytes
            image[end - 1] = (image[end - 1] - 1) % 256
        if image[header + 21] & 0x80:
            return image
        start = end


def shown(command, folder, programs):
    """The lines that are left on the terminal."""
    leader, follower = pty.openpty()
    fcntl.ioctl(follower, termios.TIOCSWINSZ, struct.pack("HHHH", ROWS, COLUMNS, 0, 0))
    environment = {"PATH": f"{programs}:/usr/bin:/bin", "TERM": "xterm", "LC_ALL": "C.UTF-8", "QUENX_HISTORY": "off"}
    settings = ["--adapters", "adapters.toml", "--config", "provider.conf", "--policy", "policy.toml"]
    with subprocess.Popen([*command.split(), *settings], stdin=follower, stdout=follower, stderr=follower, cwd=folder,
                          env=environment) as program:
        os.close(follower)
        said = b""
        while True:
            try:
                said += os.read(leader, 65536)
            except OSError:  # the program has closed it
                break
        program.wait()
    os.close(leader)
    lines = [line.split("\r")[-1] for line in said.decode().replace("\r\n", "\n").split("\n")]
    return [re.sub(r"\x1b\[[0-9;]*[A-Za-z]", "", line).rstrip() for line in lines]


def record(programs):
    with tempfile.TemporaryDirectory() as folder:
        files = {"adapters.toml": ADAPTERS.encode(), "provider.conf": b"", "policy.toml": b"# None.\n",
                 "new.rom": bytes(newer(bytearray(pathlib.Path(IMAGE).read_bytes())))}
        for name, content in files.items():
            (pathlib.Path(folder) / name).write_bytes(content)
        lines = []
        for command in COMMANDS:
            lines += ["$ " + command, *shown(command, folder, programs)]
        return lines


def drawn(lines):
    width, height = COLUMNS * CHARACTER + 2 * MARGIN, len(lines) * LINE + 2 * MARGIN
    texts = []
    for number, line in enumerate(lines):
        kind = ' fill="#7ee787"' if line.startswith("$ ") else ""
        texts.append(f'<text x="{MARGIN}" y="{MARGIN + (number + 0.75) * LINE:g}" xml:space="preserve"{kind}>'
                     f'{html.escape(line)}</text>')
    return "\n".join([
        f'<svg xmlns="http://www.w3.org/2000/svg" width="{width:g}" height="{height:g}" '
        f'viewBox="0 0 {width:g} {height:g}" font-family="ui-monospace, Menlo, Consolas, monospace" font-size="14">',
        "<title>A first update on a terminal</title>",
        '<rect width="100%" height="100%" rx="8" fill="#0d1117"/>', '<g fill="#e6edf3">', *texts, "</g>", "</svg>", ""])


def main():
    *options, programs = sys.argv[1:]
    picture = drawn(record(pathlib.Path(programs).resolve()))
    if options != ["--check"]:
        PICTURE.write_text(picture)
    elif picture != PICTURE.read_text():
        sys.exit(f"quenxctl shows something else than {PICTURE.name}; draw it anew with docs/pictures/record.py")


main()
