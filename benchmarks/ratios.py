#!/usr/bin/env python3
"""Runs the benchmark programs and prints ratios and differences of median times with their goals.

usage: ratios.py FOLDER-OF-THE-PROGRAMS [REPETITIONS]

The repetitions of a program's benchmarks are interleaved, so that load on the machine slows both sides
of a ratio. Times are processor times of the measuring thread, except for benchmarks with several
threads or processes: those are wall times, and reliable only on an idle machine. The status is 1 if a
goal is missed.
"""

import json
import statistics
import subprocess
import sys
from pathlib import Path

# program, benchmark, baseline, maximum ratio (None: no goal)
RATIOS = [
    ("log_benchmark", "OffStatement", "LoadAndTest", 1.05),
    ("log_benchmark", "LoggerLine", "BareLine", 3.0),
    ("log_benchmark", "Statement", "BareLine", None),
    ("escape_benchmark", "Escape", "TableCopy", None),
    ("escape_benchmark", "EscapeCharacters", "TableCopy", None),
    ("escape_benchmark", "Unescape", "TableCopy", None),
    ("fmt_benchmark", "FormatInt", "SnprintfInt", 1.0),
    ("fmt_benchmark", "FormatInt", "FmtlibInt", None),
    ("fmt_benchmark", "FormatText", "SnprintfText", 1.0),
    ("fmt_benchmark", "FormatText", "FmtlibText", None),
    ("channel_benchmark", "BufferRead", "MemcpyOut", 1.1),
    ("channel_benchmark", "BufferWrite", "MemcpyIn", 1.1),
    ("channel_benchmark", "PipeReadAll/real_time", "PipeBareReads/real_time", 1.05),
]

# The same with wall times.
CLOCK_RATIOS = [
    ("launch_benchmark", "LaunchAndWait/real_time", "BareSpawn/real_time", 1.5),
    ("launch_resident_benchmark", "LaunchAndWait/real_time", "BareSpawn/real_time", 1.5),
    ("launch_benchmark", "PumpTask/real_time", "PumpBareReads/real_time", 1 / 0.95),
    ("launch_benchmark", "PumpTask/real_time", "PumpBareReadsOfAWidePipe/real_time", 1 / 0.95),
]

# program, benchmark, baseline, maximum difference in nanoseconds
DIFFERENCES = [
    ("adapter_benchmark", "EnumerateEightCards", "ReadTheirFiles", 5_000_000),
]


def medians(program: Path, repetitions: int) -> dict[str, dict[str, float]]:
    """Returns the nanoseconds of each benchmark of the program, as cpu_time and as real_time."""
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
    runs: dict[str, list[dict]] = {}
    for run in json.loads(output)["benchmarks"]:
        if run["run_type"] == "iteration":
            if run.get("error_occurred"):
                raise RuntimeError(f"{run['run_name']}: {run['error_message']}")
            runs.setdefault(run["run_name"], []).append(run)
    return {
        name: {clock: statistics.median(run[clock] for run in each) for clock in ("cpu_time", "real_time")}
        for name, each in runs.items()
    }


def main() -> int:
    if len(sys.argv) not in (2, 3):
        print(__doc__, file=sys.stderr)
        return 2
    folder = Path(sys.argv[1])
    repetitions = int(sys.argv[2]) if len(sys.argv) == 3 else 21
    programs = dict.fromkeys(row[0] for row in RATIOS + CLOCK_RATIOS + DIFFERENCES)
    measured = {name: medians(folder / name, repetitions) for name in programs}
    missed = 0
    print(f"{'measured':<24}{'against':<35}{'ns':>14}{'ns':>14}{'ratio':>8}  goal")
    rows = [(*row, "cpu_time") for row in RATIOS] + [(*row, "real_time") for row in CLOCK_RATIOS]
    for program, name, base, goal, clock in rows:
        time, base_time = measured[program][name][clock], measured[program][base][clock]
        ratio = time / base_time
        verdict = "none"
        if goal is not None:
            met = ratio <= goal
            missed += not met
            verdict = f"{goal:.4g} {'met' if met else 'MISSED'}"
        print(f"{name:<24}{base:<35}{time:>14.2f}{base_time:>14.2f}{ratio:>8.2f}  {verdict}")
    print(f"{'measured':<21}{'against':<17}{'ns':>12}{'ns':>12}{'difference':>14}  goal")
    for program, name, base, goal in DIFFERENCES:
        time, base_time = measured[program][name]["cpu_time"], measured[program][base]["cpu_time"]
        met = time - base_time <= goal
        missed += not met
        print(f"{name:<21}{base:<17}{time:>12.0f}{base_time:>12.0f}{time - base_time:>14.0f}  "
              f"{goal} {'met' if met else 'MISSED'}")
    return 1 if missed else 0


if __name__ == "__main__":
    sys.exit(main())
