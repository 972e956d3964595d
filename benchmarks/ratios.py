#!/usr/bin/env python3
"""Runs the benchmark programs in one go and prints ratios of median times against their goals.

usage: ratios.py FOLDER-OF-THE-PROGRAMS [REPETITIONS]

The repetitions of a program's benchmarks are interleaved, so that a machine that is busy for a
while slows both sides of a ratio. Times are processor times. The status is 1 if a goal is missed.
"""

import json
import statistics
import subprocess
import sys
from pathlib import Path

# program, what is measured, what it is measured against, most the ratio may be (None: no goal)
RATIOS = [
    ("log_benchmark", "OffStatement", "LoadAndTest", 1.05),
    ("log_benchmark", "LoggerLine", "BareLine", 3.0),
    ("log_benchmark", "Statement", "BareLine", None),
    ("escape_benchmark", "Escape", "TableCopy", None),
    ("escape_benchmark", "EscapeCharacters", "TableCopy", None),
    ("escape_benchmark", "Unescape", "TableCopy", None),
]


def medians(program: Path, repetitions: int) -> dict[str, float]:
    """Nanoseconds of each benchmark of the program."""
    output = subprocess.run(
        [
            program,
            f"--benchmark_repetitions={repetitions}",
            "--benchmark_enable_random_interleaving=true",
            "--benchmark_min_time=0.02",
            "--benchmark_format=json",
        ],
        check=True,
        stdout=subprocess.PIPE,
    ).stdout
    times: dict[str, list[float]] = {}
    for run in json.loads(output)["benchmarks"]:
        if run["run_type"] == "iteration":
            times.setdefault(run["run_name"], []).append(run["cpu_time"])
    return {name: statistics.median(values) for name, values in times.items()}


def main() -> int:
    if len(sys.argv) not in (2, 3):
        print(__doc__, file=sys.stderr)
        return 2
    folder = Path(sys.argv[1])
    repetitions = int(sys.argv[2]) if len(sys.argv) == 3 else 21
    measured = {name: medians(folder / name, repetitions) for name in dict.fromkeys(r[0] for r in RATIOS)}
    missed = 0
    print(f"{'measured':<18}{'against':<13}{'ns':>12}{'ns':>12}{'ratio':>8}  goal")
    for program, name, base, goal in RATIOS:
        time, base_time = measured[program][name], measured[program][base]
        ratio = time / base_time
        verdict = "none"
        if goal is not None:
            met = ratio <= goal
            missed += not met
            verdict = f"{goal} {'met' if met else 'MISSED'}"
        print(f"{name:<18}{base:<13}{time:>12.2f}{base_time:>12.2f}{ratio:>8.2f}  {verdict}")
    return 1 if missed else 0


if __name__ == "__main__":
    sys.exit(main())
