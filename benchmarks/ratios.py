#!/usr/bin/env python3
"""Runs the benchmark programs and compares their times with the goals.

usage: ratios.py [--only PROGRAM] [--json FILE] FOLDER-OF-THE-PROGRAMS [REPETITIONS]

The repetitions of a program's benchmarks are interleaved, so that load on the machine slows both sides
of a comparison, and each is compared with the baseline's repetition of the same number. Printed are the
medians of both, the median of the ratios or differences with their quartiles, and the goal, which the
median must meet. Times are processor times of the measuring thread, except for benchmarks with several
threads or processes: those are wall times, and reliable only on an idle machine.

The status is 1 if a goal is missed without a known reason. A known reason is printed with the goal.
"""

import argparse
import json
import statistics
import subprocess
import sys
from pathlib import Path
from typing import NamedTuple, Optional

PROCESSOR, WALL = "cpu_time", "real_time"


class Ratio(NamedTuple):
    """A benchmark's time divided by its baseline's."""

    program: str
    name: str
    base: str
    goal: Optional[float]  # None: no goal
    clock: str = PROCESSOR
    reason: str = ""  # why the goal may be missed

    def compare(self, time: float, base: float) -> float:
        return time / base

    def show(self, value: float) -> str:
        return f"{value:.2f}"


class Difference(NamedTuple):
    """A benchmark's time less its baseline's, in nanoseconds; shown in milliseconds."""

    program: str
    name: str
    base: str
    goal: Optional[float]
    clock: str = PROCESSOR
    reason: str = ""

    def compare(self, time: float, base: float) -> float:
        return time - base

    def show(self, value: float) -> str:
        return f"{value / 1e6:.2f}ms"


LAUNCH_REASON = (
    "a launch makes a thread, three pipes and a process descriptor, and wakes its client at each of"
    " four states; the row below has a floor with the first three"
)

COMPARISONS = [
    Ratio("log_benchmark", "OffStatement", "LoadAndTest", 1.05),
    Ratio("log_benchmark", "LoggerLine", "BareLine", 3.0),
    Ratio("log_benchmark", "Statement", "BareLine", None),
    Ratio("escape_benchmark", "Escape", "TableCopy", None),
    Ratio("escape_benchmark", "EscapeCharacters", "TableCopy", None),
    Ratio("escape_benchmark", "Unescape", "TableCopy", None),
    Ratio("fmt_benchmark", "FormatInt", "SnprintfInt", 1.0),
    Ratio("fmt_benchmark", "FormatInt", "FmtlibInt", None),
    Ratio("fmt_benchmark", "FormatText", "SnprintfText", 1.0),
    Ratio("fmt_benchmark", "FormatText", "FmtlibText", None),
    Ratio("channel_benchmark", "BufferRead", "MemcpyOut", 1.1),
    Ratio("channel_benchmark", "BufferWrite", "MemcpyIn", 1.1),
    Ratio("channel_benchmark", "PipeReadAll", "PipeBareReads", 1.05),
    Ratio("launch_benchmark", "LaunchAndWait", "BareSpawn", 1.2, WALL, LAUNCH_REASON),
    Ratio("launch_benchmark", "LaunchAndWait", "ThreadSpawn", 1.2, WALL),
    Ratio("launch_resident_benchmark", "LaunchAndWait", "BareSpawn", 1.2, WALL, LAUNCH_REASON),
    Ratio("launch_resident_benchmark", "LaunchAndWait", "ThreadSpawn", 1.2, WALL),
    Ratio("launch_benchmark", "PumpTask", "PumpBareReads", 1.05, WALL),
    Ratio("launch_benchmark", "PumpTask", "PumpBareReadsOfAWidePipe", 1.05, WALL),
    Difference("adapter_benchmark", "EnumerateEightCards", "ReadTheirFiles", 400_000),
    Difference("identity_benchmark", "CollectIdentity", "StatTheirFiles", 5_000_000),
]


def measure(program: Path, repetitions: int) -> dict[str, list[dict[str, float]]]:
    """Returns each benchmark's repetitions, with the nanoseconds of both clocks."""
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
    runs: dict[str, dict[int, dict[str, float]]] = {}
    for run in json.loads(output)["benchmarks"]:
        if run["run_type"] != "iteration":
            continue
        if run.get("error_occurred"):
            raise RuntimeError(f"{run['run_name']}: {run['error_message']}")
        name = run["run_name"].removesuffix("/real_time")
        times = {clock: run[clock] for clock in (PROCESSOR, WALL)}
        runs.setdefault(name, {})[run["repetition_index"]] = times
    return {name: [each[index] for index in sorted(each)] for name, each in runs.items()}


def compare(row, measured) -> dict:
    """Returns the row's figures: both medians, and the median and quartiles of the comparisons."""
    times, bases = ([run[row.clock] for run in measured[row.program][name]]
                    for name in (row.name, row.base))
    values = [row.compare(time, base) for time, base in zip(times, bases)]
    low, median, high = statistics.quantiles(values, n=4, method="inclusive")
    if row.goal is None:
        verdict = "none"
    elif median <= row.goal:
        verdict = "met"
    else:
        verdict = "missed, for a reason" if row.reason else "MISSED"
    return {
        "program": row.program, "name": row.name, "base": row.base, "clock": row.clock,
        "ns": statistics.median(times), "base_ns": statistics.median(bases),
        "quartiles": [low, median, high], "goal": row.goal, "verdict": verdict,
        "reason": row.reason,
    }


def print_row(row, figures: dict):
    low, median, high = (row.show(value) for value in figures["quartiles"])
    goal = "" if row.goal is None else row.show(row.goal)
    print(f"{row.name:<20}{row.base:<25}{figures['ns']:>13.1f}{figures['base_ns']:>13.1f}"
          f"{median:>9}  {low + '..' + high:<16}{goal:>7} {figures['verdict']}")


def main() -> int:
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--only", action="append", help="a program; default: all", metavar="PROGRAM")
    parser.add_argument("--json", type=Path)
    parser.add_argument("folder", type=Path, help="has the benchmark programs")
    parser.add_argument("repetitions", type=int, nargs="?", default=21)
    options = parser.parse_args()
    if options.repetitions < 2:
        parser.error("quartiles need two repetitions at least")
    rows = [row for row in COMPARISONS if not options.only or row.program in options.only]
    programs = dict.fromkeys(row.program for row in rows)
    measured = {name: measure(options.folder / name, options.repetitions) for name in programs}

    print(f"medians and quartiles of {options.repetitions} repetitions")
    print(f"{'measured':<20}{'against':<25}{'ns':>13}{'ns':>13}{'':>9}  {'quartiles':<16}{'goal':>7}")
    results = [compare(row, measured) for row in rows]
    for row, figures in zip(rows, results):
        print_row(row, figures)
    for reason in dict.fromkeys(r["reason"] for r in results if r["verdict"].startswith("missed")):
        print(f"the reason: {reason}")
    if options.json:
        options.json.write_text(json.dumps(results, indent=2) + "\n")
    return 1 if any(figures["verdict"] == "MISSED" for figures in results) else 0


if __name__ == "__main__":
    sys.exit(main())
