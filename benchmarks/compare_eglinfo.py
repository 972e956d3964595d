#!/usr/bin/env python3
"""Compares the time of the program with that of `eglinfo -B` on the same driver, and prints the time
of each stage.

usage: compare_eglinfo.py [--build FOLDER] [--floor PROGRAM] [--runs N] [--json FILE]

All are run in turn, in an order that changes from round to round, since a program runs slower after
one that uses much of the cache; standard output and error are /dev/null. Values are medians in
milliseconds of wall time and of processor time, which varies less on a busy machine. Ratios are those
of each round: their medians and quartiles. OpenCL is hidden
from the program, since eglinfo doesn't query it. The program does more than eglinfo: it compiles
shaders and renders. eglinfo tries every platform that EGL supports. The exact comparison is with
egl_floor, a C program that makes only the program's calls (scripts/build benchmarks). Before it is
timed, both must make the same calls with the same arguments on the scripted driver.

The program's own time is its time on the scripted driver of the tests, which returns at once, minus
that of /bin/true. The stages are measured with programmed failures: a run that fails at a step ends
there. The status is 1 if a goal is missed.
"""

import argparse
import json
import os
import random
import shutil
import statistics
import subprocess
import sys
import tempfile
import time
from pathlib import Path

TREE = Path(__file__).resolve().parents[1]

GOAL_OWN_MS = 2.0
GOAL_FLOOR_RATIO = 1.05

# A step to fail at, and what the run has done up to there with one GPU. The work of a step is done
# before the step is counted.
STAGES = [
    (0, "process start, libraries, options"),
    (5, "the three checks: loads EGL, creates and destroys a context"),
    (6, "enumeration: adapters, a context on each device"),
    (19, "thirteen queries"),
    (20, "shaders: compile, link"),
    (21, "framebuffer: texture, clear"),
    (41, "the battery: twenty-one queries"),
    (-1, "the rest, and the exit"),
]


def time_once(command, environment):
    """Runs the command; returns its wall time and its processor time in milliseconds."""
    null = os.open(os.devnull, os.O_RDWR)
    try:
        start = time.perf_counter()
        child = os.posix_spawn(command[0], command, environment, file_actions=[
            (os.POSIX_SPAWN_DUP2, null, 0), (os.POSIX_SPAWN_DUP2, null, 1),
            (os.POSIX_SPAWN_DUP2, null, 2)])
        _, status, usage = os.wait4(child, 0)
        taken = time.perf_counter() - start
    finally:
        os.close(null)
    if os.WIFSIGNALED(status):
        sys.exit(f"{' '.join(command)} was ended by signal {os.WTERMSIG(status)}")
    return 1000 * taken, 1000 * (usage.ru_utime + usage.ru_stime)


def run_all(jobs, runs):
    """Runs each (command, environment) once per round, each round in another order. Returns the times
    of each, by round."""
    shuffle = random.Random(1).shuffle
    taken = [[] for _ in jobs]
    for number in range(2 + runs):
        order = list(range(len(jobs)))
        shuffle(order)
        for index in order:
            times = time_once(*jobs[index])
            if number >= 2:  # the first ones load the files into memory
                taken[index].append(times)
    return taken


def median(times):
    """Returns the median wall time and the median processor time."""
    return tuple(statistics.median(column) for column in zip(*times))


def ratios_of(times, others):
    """Returns the first quartile, the median and the third quartile of the rounds' ratios, of the wall
    times and of the processor times."""
    return tuple(statistics.quantiles([one / other for one, other in zip(*columns)], n=4,
                                      method="inclusive")
                 for columns in zip(zip(*times), zip(*others)))


def calls_of(program, environment, folder):
    """Runs the program on the scripted driver; returns its calls with their arguments."""
    record = folder / "record"
    script = folder / "recording-script"
    script.write_text(f"record {record}\ndevice\nsoftware\n")
    record.unlink(missing_ok=True)
    subprocess.run([program], check=True, stdout=subprocess.DEVNULL,
                   env=dict(environment, ASSAY_SCRIPTED_EGL=str(script)))
    return [line.split(" ", 2)[2] for line in record.read_text().splitlines()]


def check_same_calls(program, floor, environment, folder):
    ours = calls_of(program, environment, folder)
    theirs = calls_of(floor, environment, folder)
    if ours != theirs:
        number = next((i for i, (one, other) in enumerate(zip(ours, theirs)) if one != other),
                      min(len(ours), len(theirs)))
        sys.exit(f"the calls of egl_floor and of the program differ from call {number + 1} on:\n"
                 f"  program: {ours[number:number + 3]}\n  egl_floor: {theirs[number:number + 3]}")


def stage_jobs(program, environment):
    return [([program, f"-crashAfter={step}"], environment) for step, _ in STAGES]


def show(times, text):
    print("".join(f"{time:9.2f}" for time in times) + "  " + text)


def show_ratios(ratios, text):
    show((ratios[0][1], ratios[1][1]), text)
    show((ratios[0][0], ratios[1][0]), "  first quartile")
    show((ratios[0][2], ratios[1][2]), "  third quartile")


def print_stages(title, cumulative):
    print(title)
    before = (0.0, 0.0)
    for (_, name), now in zip(STAGES, cumulative):
        show((now[0] - before[0], now[1] - before[1]), name)
        before = now
    show(cumulative[-1], "total")


def main():
    parser = argparse.ArgumentParser(description=__doc__.split("\n", maxsplit=1)[0])
    parser.add_argument("--build", type=Path, default=TREE / "build" / "linux")
    parser.add_argument("--floor", type=Path,
                        default=TREE / "build" / "benchmarks" / "bin" / "egl_floor")
    parser.add_argument("--runs", type=int, default=20)
    parser.add_argument("--json", type=Path)
    options = parser.parse_args()

    program = str(options.build.resolve() / "bin" / "assay")
    eglinfo = shutil.which("eglinfo")
    true = shutil.which("true")
    results = {"runs": options.runs}
    met = True

    with tempfile.TemporaryDirectory() as folder:
        hidden = Path(folder) / "no-opencl"
        hidden.mkdir()
        for name in ("libOpenCL.so.1", "libOpenCL.so"):
            (hidden / name).touch()
        script = Path(folder) / "script"
        script.write_text("device\nsoftware\n")
        real = dict(os.environ, LD_LIBRARY_PATH=str(hidden))
        scripted = dict(
            real, LD_LIBRARY_PATH=f"{options.build.resolve() / 'drivers' / 'egl'}:{hidden}",
            ASSAY_SCRIPTED_EGL=str(script))

        floor = str(options.floor.resolve()) if options.floor.exists() else None
        if floor is not None:
            check_same_calls(program, floor, scripted, Path(folder))
        jobs = [([program], real), ([true], real)]
        if floor is not None:
            jobs.append(([floor], real))
        if eglinfo is not None:
            jobs.append(([eglinfo, "-B"], dict(os.environ)))
        all_times = run_all(jobs, options.runs)
        whole, nothing, *others = map(median, all_times)
        bare = others[:1] if floor is not None else []
        peer = others[len(bare):]
        print(f"medians of {options.runs} rounds, in milliseconds\n\n     wall  processor")
        show(whole, "assay on this machine's driver")
        results.update(assay_ms=whole, true_ms=nothing)
        if bare:
            ratios = ratios_of(all_times[0], all_times[2])
            met = met and ratios[0][1] <= GOAL_FLOOR_RATIO and ratios[1][1] <= GOAL_FLOOR_RATIO
            show(bare[0], "egl_floor: the same calls from C")
            show_ratios(ratios, f"assay / egl_floor (goal: at most {GOAL_FLOOR_RATIO:g})")
            results.update(floor_ms=bare[0], floor_ratios=ratios)
        else:
            print("egl_floor isn't built (scripts/build benchmarks)")
        if peer:
            ratios = ratios_of(all_times[0], all_times[-1])
            show(peer[0], "eglinfo -B on the same driver")
            show_ratios(ratios, "assay / eglinfo, which does less")
            results.update(eglinfo_ms=peer[0], ratios=ratios)
        else:
            print("eglinfo isn't installed (package mesa-utils-bin)")
        show(nothing, "/bin/true\n")

        stages = [median(times) for times in run_all(stage_jobs(program, real), options.runs)]
        print_stages("On this machine's driver, stage by stage:", stages)
        results["stages_ms"] = stages

        jobs = stage_jobs(program, scripted) + [([true], scripted)]
        *stages, nothing = map(median, run_all(jobs, options.runs))
        own = (stages[-1][0] - nothing[0], stages[-1][1] - nothing[1])
        met = met and own[0] < GOAL_OWN_MS
        print()
        print_stages("On a driver that returns at once:", stages)
        show(nothing, "/bin/true")
        show(own, f"assay's own time (goal: under {GOAL_OWN_MS:g})")
        results.update(scripted_stages_ms=stages, own_ms=own)

    if options.json is not None:
        options.json.write_text(json.dumps(results, indent=2) + "\n")
    print(f"\ngoals: {'met' if met else 'MISSED'}")
    return 0 if met else 1


if __name__ == "__main__":
    sys.exit(main())
