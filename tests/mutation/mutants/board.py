"""The file by which a test's processes learn which mutant is on and say which ones they asked for."""
import mmap
import re
import struct

HEADER = 4
SET = re.compile(rb"\x01")


class Board:
    def __init__(self, path, size=None):
        if size is not None:
            path.write_bytes(bytes(HEADER + size))
        with open(path, "r+b") as file:
            self.bytes = mmap.mmap(file.fileno(), 0)

    def choose(self, number):
        self.bytes[:HEADER] = struct.pack("=i", number)

    def clear(self):
        self.bytes[HEADER:] = bytes(len(self.bytes) - HEADER)

    def reached(self):
        """The numbers of the mutants that were asked for since the last clear()."""
        return [match.start() for match in SET.finditer(self.bytes[HEADER:])]
