#!/usr/bin/env python3
"""Compares a run by libassay-host with a bare start of the same child, in one process.

usage: compare_library.py [--build FOLDER] [--runs N] [--resident MIB] [--json FILE]

The child is the test child, which prints a report of two lines. The bare start is posix_spawn with a
pipe, read to its end, and a wait. Both run alternately; the values are medians in milliseconds, and the
growth of the host's own memory (RssAnon) by the first run and by all runs in MiB. --resident makes the
host that large first. The goals are at most 3 ms and 2 MiB.
"""

import argparse
import ctypes
import json
import os
import statistics
import sys
import time
from pathlib import Path

TREE = Path(__file__).resolve().parents[1]

GOAL_MS = 3.0
GOAL_MIB = 2.0
WORDS = ["out", 'assayStart="x"', "out", 'assayEnd="y"']


def find_library(build):
    found = sorted(build.glob("lib*/**/libassay-host.so.0"))
    if not found:
        sys.exit(f"no libassay-host.so.0 in {build}")
    return ctypes.CDLL(str(found[0]))


class Library:
    def __init__(self, build, child):
        self.calls = find_library(build)
        self.calls.assay_host_options_new.restype = ctypes.c_void_p
        self.options = ctypes.c_void_p(self.calls.assay_host_options_new())
        self.calls.assay_host_options_set_program(self.options, os.fsencode(child))
        for word in WORDS:
            self.calls.assay_host_options_add_argument(self.options, word.encode())

    def run(self):
        result = ctypes.c_void_p()
        error = self.calls.assay_host_run(self.options, None, ctypes.byref(result))
        verdict = self.calls.assay_host_result_verdict(result)
        self.calls.assay_host_result_free(result)
        if error or verdict:
            sys.exit(f"a run failed: error {error}, verdict {verdict}")


def spawn_bare(child):
    read, write = os.pipe()
    pid = os.posix_spawn(child, [child, "-verbose=0x101", *WORDS], os.environ, file_actions=[
        (os.POSIX_SPAWN_DUP2, write, 1), (os.POSIX_SPAWN_CLOSE, read)])
    os.close(write)
    while os.read(read, 65536):
        pass
    os.close(read)
    if os.waitpid(pid, 0)[1] != 0:
        sys.exit("a bare start failed")


def own_mib():
    for line in Path("/proc/self/status").read_text().splitlines():
        if line.startswith("RssAnon:"):
            return int(line.split()[1]) / 1024
    return 0.0


def time_once(action):
    start = time.perf_counter()
    action()
    return 1000 * (time.perf_counter() - start)


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--build", type=Path, default=TREE / "build" / "linux")
    parser.add_argument("--runs", type=int, default=200)
    parser.add_argument("--resident", type=int, default=0)
    parser.add_argument("--json", type=Path)
    options = parser.parse_args()
    build = options.build.resolve()
    child = str(build / "bin" / "test_child")
    resident = bytearray(b"x") * (options.resident << 20)
    library = Library(build, child)
    spawn_bare(child)

    before = own_mib()
    library.run()
    first = own_mib() - before
    bare, runs = [], []
    for _ in range(options.runs):
        bare.append(time_once(lambda: spawn_bare(child)))
        runs.append(time_once(library.run))
    grown = own_mib() - before
    difference = statistics.median(runs) - statistics.median(bare)
    met = difference <= GOAL_MS and max(first, grown) <= GOAL_MIB
    print(f"bare start {statistics.median(bare):.2f} ms, by the library {statistics.median(runs):.2f} ms: "
          f"{difference:.2f} ms more")
    print(f"memory: {first:.2f} MiB by the first run, {grown:.2f} MiB by {options.runs + 1} runs")
    print(f"goals: at most {GOAL_MS:g} ms and {GOAL_MIB:g} MiB: {'met' if met else 'MISSED'}")
    if options.json:
        options.json.write_text(json.dumps({
            "runs": options.runs, "resident_mib": len(resident) >> 20, "difference_ms": difference,
            "first_mib": first, "grown_mib": grown, "met": met}, indent=2) + "\n")
    return 0 if met else 1


if __name__ == "__main__":
    sys.exit(main())
