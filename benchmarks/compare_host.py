#!/usr/bin/env python3
"""Compares the time of a supervised run with that of the child alone, and measures the host's memory.

usage: compare_host.py [--build FOLDER] [--runs N] [--real] [--json FILE]

`assay-host run` and `assay` are run in turn, in an order that changes from round to round, on the
scripted OpenGL driver of the tests, which returns at once, or with --real on the machine's driver.
Values are medians: wall time in milliseconds, the difference to the child alone in the same round with
its quartiles, and the peak memory of the host without its child in MiB. The goals are less than 20 ms
longer than the child alone, and less than 10 MiB; the status is 1 if one is missed.
"""

import argparse
import fcntl
import json
import os
import statistics
import subprocess
import sys
import time
from pathlib import Path

from scripted_runs import scripted_environment, time_in_turn, time_once

TREE = Path(__file__).resolve().parents[1]

GOAL_MS = 20.0
GOAL_MIB = 10.0

F_SETPIPE_SZ = 1031  # in module fcntl only from Python 3.10 on

FORMATS = ["text", "json", "jsonl"]


def read_kib(path, name):
    """Returns the number of KiB in the line `name` of a file of /proc; 0 if it can't be read."""
    try:
        for line in Path(path).read_text().splitlines():
            if line.startswith(name):
                return int(line.split()[1])
    except OSError:
        pass
    return 0


def own_memory(pid):
    """Returns the memory of assay-host in KiB: the peak of its worker and the guardian's share."""
    try:
        children = Path(f"/proc/{pid}/task/{pid}/children").read_text().split()
        workers = [child for child in children
                   if Path(f"/proc/{child}/comm").read_text() == "assay-worker\n"]
    except OSError:
        return 0
    if not workers:
        return read_kib(f"/proc/{pid}/status", "VmHWM:")
    return (read_kib(f"/proc/{workers[0]}/status", "VmHWM:") +
            read_kib(f"/proc/{pid}/smaps_rollup", "Pss:"))


def peak_of(command, environment):
    """Returns the peak memory of the process itself in MiB. Reads its output slowly, so that it still
    exists while its last bytes are unread."""
    read, write = os.pipe()
    fcntl.fcntl(write, F_SETPIPE_SZ, 4096)
    process = subprocess.Popen(command, env=environment, stdin=subprocess.DEVNULL, stdout=write,
                               stderr=subprocess.DEVNULL)
    os.close(write)
    peak = 0
    try:
        while process.poll() is None:
            peak = max(peak, own_memory(process.pid))
            os.set_blocking(read, False)
            time.sleep(0.002)
            try:
                os.read(read, 256)
            except BlockingIOError:
                pass
    finally:
        os.close(read)
        process.wait()
    return peak / 1024


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--build", type=Path, default=TREE / "build" / "linux")
    parser.add_argument("--runs", type=int, default=100)
    parser.add_argument("--real", action="store_true")
    parser.add_argument("--json", type=Path)
    options = parser.parse_args()
    build = options.build.resolve()
    assay, host = build / "bin" / "assay", build / "bin" / "assay-host"
    environment = (dict(os.environ) if options.real
                   else scripted_environment(build, "compare_host", "software\n"))

    commands = {"assay alone": [assay]}
    for form in FORMATS:
        commands[f"supervised, {form}"] = [host, "run", "--format", form]
    for command in commands.values():
        time_once(command, environment)
    taken = time_in_turn(commands, options.runs, environment)
    times = {name: [each.wall for each in runs] for name, runs in taken.items()}
    peaks = {name: statistics.median(peak_of(command, environment) for _ in range(5))
             for name, command in commands.items()}

    alone = times["assay alone"]
    result = {"runs": options.runs, "real": options.real, "rows": {}}
    met = True
    print(f"{'':24}{'median ms':>10}{'more ms':>9}  {'quartiles':<14}{'peak MiB':>10}")
    for name in commands:
        median = statistics.median(times[name])
        differences = [one - other for one, other in zip(times[name], alone)]
        low, difference, high = statistics.quantiles(differences, n=4, method="inclusive")
        result["rows"][name] = {"ms": median, "difference": difference, "peak": peaks[name],
                                "quartiles": [low, high]}
        peak = f"{peaks[name]:.2f}" if peaks[name] > 1 else "-"  # ended before it was measured
        print(f"{name:24}{median:10.2f}{difference:9.2f}  {f'{low:.2f}..{high:.2f}':<14}{peak:>10}")
        if name != "assay alone":
            met = met and difference < GOAL_MS and peaks[name] < GOAL_MIB
    print(f"goals: less than {GOAL_MS:g} ms more than the child alone, less than {GOAL_MIB:g} MiB: "
          f"{'met' if met else 'MISSED'}")
    if options.json:
        options.json.write_text(json.dumps(result, indent=2) + "\n")
    return 0 if met else 1


if __name__ == "__main__":
    sys.exit(main())
