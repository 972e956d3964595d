#!/usr/bin/env python3
"""Compares the report's CLBandwidth of each OpenCL GPU, which uses the device's counters, with the
same copy timed by the host's clock.

usage: compare_bandwidth.py [--build FOLDER] [--benchmarks FOLDER] [--scripted]

FOLDER: the build of the program (build/linux) and of the benchmarks (build/benchmarks). --scripted
uses the tests' scripted driver, whose commands take real time and whose counters are exact. The exit
status is 1 if a GPU differs by more than 5 %.
"""

import argparse
import json
import os
import re
import subprocess
import sys
import tempfile
from pathlib import Path

TREE = Path(__file__).resolve().parents[1]
TOLERANCE = 0.05


def reported(program, environment):
    """Bytes per second and name, by GPU."""
    report = subprocess.run([program], env=environment, stdout=subprocess.PIPE, check=False,
                            encoding="utf-8", errors="replace").stdout
    rates = dict(re.findall(r"^(clgpu\[\d+\])\.CLBandwidth=(\S+)$", report, re.MULTILINE))
    names = dict(re.findall(r'^(clgpu\[\d+\])\.CLName="(.*)"$', report, re.MULTILINE))
    return {tag: (float(rate), names[tag]) for tag, rate in rates.items()}


def measured(program, environment):
    """The best of five repetitions, by GPU; the report has the best batch."""
    output = subprocess.run(
        [program, "--benchmark_repetitions=5", "--benchmark_min_time=0.2",
         "--benchmark_format=json"],
        env=environment, stdout=subprocess.PIPE, check=True).stdout
    best = {}
    for run in json.loads(output)["benchmarks"]:
        if run["run_type"] == "iteration":
            tag = run["run_name"].split("/")[0]
            best[tag] = max(best.get(tag, 0.0), run["bytes_per_second"])
    return best


def main():
    parser = argparse.ArgumentParser(description=__doc__.split("\n", maxsplit=1)[0])
    parser.add_argument("--build", type=Path, default=TREE / "build" / "linux")
    parser.add_argument("--benchmarks", type=Path, default=TREE / "build" / "benchmarks")
    parser.add_argument("--scripted", action="store_true")
    options = parser.parse_args()

    environment = dict(os.environ)
    with tempfile.TemporaryDirectory() as folder:
        if options.scripted:
            script = Path(folder) / "script"
            script.write_text("device\nreal-time\ncopy-ns 1000000\n"
                              "device\nreal-time\ncopy-ns 2500000\n")
            environment.update(
                OCL_ICD_VENDORS=str(options.build.resolve() / "drivers" / "opencl"),
                ASSAY_SCRIPTED_OPENCL=str(script))
        by_counters = reported(options.build.resolve() / "bin" / "assay", environment)
        by_clock = measured(options.benchmarks.resolve() / "bin" / "cl_copy_benchmark", environment)

    if not by_counters:
        print("no OpenCL GPU with a CLBandwidth")
    worst = 0.0
    for tag, (rate, name) in by_counters.items():
        ratio = rate / by_clock[tag]
        worst = max(worst, abs(ratio - 1))
        print(f"{tag} {name}: counters {rate:.4g}, host clock {by_clock[tag]:.4g} bytes/s, "
              f"ratio {ratio:.3f} (goal: within 5 %)")
    return int(worst > TOLERANCE)


if __name__ == "__main__":
    sys.exit(main())
