#!/usr/bin/env python3
"""Compares the time of the program without its two measurements with that of `clinfo` on the same
OpenCL driver, and prints the time of each stage of the OpenCL part.

usage: compare_clinfo.py [--build FOLDER] [--runs N] [--own] [--json FILE]

Values are medians of wall time and of processor time in milliseconds. OpenGL is hidden from the
program, since clinfo doesn't query it. The OpenCL GPU is Mesa's software device presented as a GPU, or
with --own the machine's. The run is made to fail at the step before the first measurement. The
program's own time is that of the stages on the scripted driver of the tests, which returns at once; the
compute measurement's is mostly spent on filling its buffer with a million numbers of the C library's
generator.
"""

import argparse
import json
import os
import shutil
import tempfile
from pathlib import Path

from compare_eglinfo import TREE, medians, show

GOAL_OWN_MS = 2.0

# A step to fail at, and what the run has done up to there since the stage before.
STAGES = [
    (6, "everything before OpenCL"),
    (7, "loads the library, lists platforms and devices"),
    (17, "ten queries"),
    (18, "bandwidth measurement"),
    (19, "compute measurement"),
]
STEP_BEFORE_MEASUREMENTS = 17


def without_opengl(folder):
    hidden = Path(folder) / "no-opengl"
    hidden.mkdir()
    for name in ("libEGL.so.1", "libEGL.so"):
        (hidden / name).touch()
    return dict(os.environ, LD_LIBRARY_PATH=str(hidden))


def main():
    parser = argparse.ArgumentParser(description=__doc__.split("\n", maxsplit=1)[0])
    parser.add_argument("--build", type=Path, default=TREE / "build" / "linux")
    parser.add_argument("--runs", type=int, default=20)
    parser.add_argument("--own", action="store_true")
    parser.add_argument("--json", type=Path)
    options = parser.parse_args()

    program = str(options.build.resolve() / "bin" / "assay")
    clinfo = shutil.which("clinfo")
    results = {"runs": options.runs}
    with tempfile.TemporaryDirectory() as folder:
        real = without_opengl(folder)
        if not options.own:
            real.update(OCL_ICD_VENDORS="/etc/OpenCL/vendors/rusticl.icd",
                        RUSTICL_ENABLE="llvmpipe", RUSTICL_DEVICE_TYPE="gpu")
        scripted = dict(real, ASSAY_SCRIPTED_OPENCL="",
                        OCL_ICD_VENDORS=str(options.build.resolve() / "drivers" / "opencl"))

        print(f"medians of {options.runs} runs, in milliseconds\n\n     wall  processor")
        jobs = [([program, f"-crashAfter={STEP_BEFORE_MEASUREMENTS}"], real)]
        if clinfo is not None:
            jobs.append(([clinfo], real))
        whole, *peer = medians(jobs, options.runs)
        show(whole, "assay without the two measurements")
        results["assay_ms"] = whole
        if peer:
            ratios = (whole[0] / peer[0][0], whole[1] / peer[0][1])
            show(peer[0], "clinfo on the same driver")
            show(ratios, "assay / clinfo (goal: at most 1)")
            results.update(clinfo_ms=peer[0], ratios=ratios)
        else:
            print("clinfo isn't installed")

        print("\nOn a driver that returns at once:")
        stages = medians([([program, f"-crashAfter={step}"], scripted) for step, _ in STAGES],
                         options.runs)
        before = stages[0]
        for (_, name), now in zip(STAGES[1:], stages[1:]):
            show((now[0] - before[0], now[1] - before[1]), name)
            before = now
        own = (stages[2][0] - stages[0][0], stages[2][1] - stages[0][1])
        show(own, f"without the measurements (goal: under {GOAL_OWN_MS:g})")
        results.update(scripted_stages_ms=stages, own_ms=own)

    if options.json is not None:
        options.json.write_text(json.dumps(results, indent=2) + "\n")


if __name__ == "__main__":
    main()
