# SPDX-License-Identifier: Apache-2.0
"""Firmware images, and the verdict on a simulated adapter's flash (docs/image-format.md has the layouts)."""
import pathlib
import struct
import zlib

from tally import expect

WRITE_SPEED = 60_000  # bytes per second
ADAPTER = """[[adapter]]
name = "eth{number}"
pci_address = "0000:0{number}:00.0"
pci_id = "1af4:1041"
mac = "52:54:00:10:00:0{number}"
write_speed = {speed}
flash_file = "{first}"
"""


def make_image(random, revision):
    """IMG_UEFI of that revision, with contents that no other image has."""
    units = random.randint(100, 180)
    head = struct.pack("<HHIHH12xH2x4sHHHHB3sHHBB6x", 0xAA55, units, 0x0EF1, 11, 0x8664, 0x1C, b"PCIR", 0x1AF4, 0x1041,
                       0, 28, 3, b"\0\0\2", units, revision, 3, 0x80)
    return head + random.randbytes(512 * units - len(head))


def seconds_to_write(image):
    return len(image) / WRITE_SPEED


class Flash:
    """One adapter's folder in the state directory."""

    def __init__(self, folder, at_first):
        self._folder = pathlib.Path(folder)
        self._at_first = at_first

    def writer(self):
        """The process that writes, or was killed while it did; None for no process."""
        lock = self._folder / "flash.lock"
        return int(lock.read_text() or 0) or None if lock.exists() else None

    def is_being_written(self):
        return pathlib.Path(f"/proc/{self.writer()}").exists()

    def content(self):
        """What the adapter boots. The record and the bank that it names have to be whole."""
        if not (self._folder / "state").exists():
            return self._at_first
        record = None
        # Once more when the record has changed meanwhile: the bank may be written again then.
        while record != (record := (self._folder / "state").read_bytes()):
            expect(len(record) == 44 and record[:8] == b"QXFLASH1", f"the record is torn: {record.hex()}")
            expect(zlib.crc32(record[:40]) == struct.unpack_from("<I", record, 40)[0], "the record has a wrong sum")
            bank = (self._folder / f"bank-{record[12]}.rom").read_bytes()
        sums = struct.unpack_from("<II", record, 16 + 8 * record[12])
        expect((len(bank), zlib.crc32(bank)) == sums, f"bank {record[12]} is torn")
        return bank
