#!/usr/bin/env python3
"""Compares the time of `assay-host advise` from memory with that of a first call and of a run.

usage: compare_advise.py [--build FOLDER] [--runs N] [--real] [--json FILE]

The three, and the program with nothing to do, are run in turn, in an order that changes from round to
round, on the scripted OpenGL driver of the tests, or with --real on the machine's drivers. Values are
medians and quartiles in milliseconds of the wall time, the median of the processor time, and how often
the time from memory goes into the wall time of the same round. The goal is at most 5 ms from memory, and
no child; the status is 1 if it is missed.
"""

import argparse
import json
import os
import shutil
import statistics
import subprocess
import sys
from pathlib import Path

from scripted_runs import scripted_environment, time_in_turn, time_once

TREE = Path(__file__).resolve().parents[1]

GOAL_MS = 5.0
STATUSES = (0, 20, 21, 22)
MEMORY = "advise, from memory"


def starts_no_child(host, state, environment):
    """Whether the call answers from memory."""
    done = subprocess.run([host, "advise", "--state", state, "--format", "json"], env=environment,
                          stdout=subprocess.PIPE, check=False)
    return not json.loads(done.stdout)["tried"]


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--build", type=Path, default=TREE / "build" / "linux")
    parser.add_argument("--runs", type=int, default=100)
    parser.add_argument("--real", action="store_true")
    parser.add_argument("--json", type=Path)
    options = parser.parse_args()
    build = options.build.resolve()
    host = build / "bin" / "assay-host"
    environment = (dict(os.environ) if options.real
                   else scripted_environment(build, "compare_advise"))

    memory, first = build / "compare_advise.memory", build / "compare_advise.first"
    for folder in (memory, first):
        shutil.rmtree(folder, ignore_errors=True)
    commands = {
        MEMORY: [host, "advise", "--state", memory],
        "advise, first call": [host, "advise", "--state", first],
        "run": [host, "run"],
        "--version": [host, "--version"],
    }
    time_once(commands[MEMORY], environment, STATUSES)
    if not starts_no_child(host, memory, environment):
        sys.exit("the second call made an attempt")
    times = time_in_turn(commands, options.runs, environment, STATUSES,
                         lambda name: shutil.rmtree(first, ignore_errors=True))

    result = {"runs": options.runs, "real": options.real, "rows": {}}
    print(f"{'':24}{'median ms':>10}  {'quartiles':<16}{'processor ms':>13}{'ratio':>8}")
    for name, taken in times.items():
        walls = [each.wall for each in taken]
        low, median, high = statistics.quantiles(walls, n=4, method="inclusive")
        processor = statistics.median(each.processor for each in taken)
        ratio = statistics.median(wall / base.wall for wall, base in zip(walls, times[MEMORY]))
        result["rows"][name] = {"ms": median, "quartiles": [low, high], "processor": processor,
                                "ratio": ratio}
        print(f"{name:24}{median:10.2f}  {f'{low:.2f}..{high:.2f}':<16}{processor:13.2f}{ratio:8.2f}")
    met = result["rows"][MEMORY]["ms"] <= GOAL_MS
    print(f"goal of {GOAL_MS:.0f} ms from memory: {'met' if met else 'MISSED'}")
    if options.json:
        options.json.write_text(json.dumps(result, indent=2) + "\n")
    return 0 if met else 1


if __name__ == "__main__":
    sys.exit(main())
