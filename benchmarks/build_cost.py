#!/usr/bin/env python3
"""Measures the processor time of a clean Linux build of commits, and prints their slowest sources.

usage: build_cost.py [--top N] [--target TARGET] [--option CMAKE-OPTION] [--keep FOLDER] COMMIT...

Each commit is unpacked into a temporary folder and built there as a release with its tests, without
ccache. The values are seconds of user processor time, which depend much less on other load than wall
time: of the whole build, and of the compiler for each source. A source that is compiled several times
counts with their sum. From the second commit on, the difference to the first one follows.
"""

import argparse
import json
import os
import resource
import subprocess
import sys
import tempfile
from pathlib import Path

TREE = Path(__file__).resolve().parents[1]

# The variable that makes this script a compiler launcher; its value is the file for the times.
RECORD = "ASSAY_BUILD_COST_RECORD"


def launch(command):
    """Runs a compiler and appends its source and its processor time to the record."""
    status = subprocess.run(command, check=False).returncode
    used = resource.getrusage(resource.RUSAGE_CHILDREN)
    if "-c" in command:
        source = command[command.index("-c") + 1]
        output = command[command.index("-o") + 1] if "-o" in command else ""
        with open(os.environ[RECORD], "a", encoding="utf-8") as record:
            record.write(json.dumps([source, output, used.ru_utime]) + "\n")
    return status


def git(*words):
    return subprocess.run(["git", "-C", TREE, *words], check=True, text=True,
                          stdout=subprocess.PIPE).stdout.strip()


def build(commit, folder, target, options):
    """Returns the user seconds of the build, and of each source relative to the tree."""
    tree = folder / "tree"
    record = folder / "record"
    tree.mkdir(parents=True)
    archive = subprocess.Popen(["git", "-C", TREE, "archive", commit], stdout=subprocess.PIPE)
    subprocess.run(["tar", "-x", "-C", tree], stdin=archive.stdout, check=True)
    if archive.wait() != 0:
        sys.exit(f"git archive {commit} failed")
    launcher = f"{sys.executable};{Path(__file__).resolve()}"
    environment = dict(os.environ, **{RECORD: str(record)}, CCACHE_DISABLE="1")
    run = dict(check=True, env=environment, stdout=subprocess.DEVNULL)
    subprocess.run(["cmake", "-S", tree, "-B", folder / "build", "-G", "Ninja",
                    "-DCMAKE_BUILD_TYPE=Release", "-DASSAY_TESTS=ON",
                    f"-DCMAKE_C_COMPILER_LAUNCHER={launcher}",
                    f"-DCMAKE_CXX_COMPILER_LAUNCHER={launcher}", *options], **run)
    record.write_text("")  # without the compiler checks of CMake
    before = resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime
    subprocess.run(["cmake", "--build", folder / "build", "--target", target], **run)
    total = resource.getrusage(resource.RUSAGE_CHILDREN).ru_utime - before
    sources = {}
    for line in record.read_text().splitlines():
        source, output, seconds = json.loads(line)
        path = Path(source)
        name = str(path.relative_to(tree)) if path.is_relative_to(tree) else output
        sources[name] = sources.get(name, 0.0) + seconds
    return total, sources


def main():
    parser = argparse.ArgumentParser(description=__doc__.split("\n", maxsplit=1)[0])
    parser.add_argument("--top", type=int, default=20, help="sources to print, default 20")
    parser.add_argument("--target", default="all", help="what to build, default all")
    parser.add_argument("--keep", type=Path, help="build below this folder and keep it")
    parser.add_argument("--option", action="append", default=[], help="a further option of cmake")
    parser.add_argument("commits", nargs="+", metavar="COMMIT")
    options = parser.parse_args()

    with tempfile.TemporaryDirectory() as temporary:
        folder = options.keep or Path(temporary)
        built = []
        for commit in options.commits:
            name = git("rev-parse", "--short", commit)
            total, sources = build(commit, folder / name, options.target, options.option)
            built.append(total)
            difference = f"{total - built[0]:+9.1f}" if len(built) > 1 else ""
            print(f"{name}: {total:.1f} s in {len(sources)} sources {difference}")
            for source in sorted(sources, key=sources.get, reverse=True)[:options.top]:
                print(f"  {sources[source]:7.1f}  {source}")
            sys.stdout.flush()


if __name__ == "__main__":
    if RECORD in os.environ:
        sys.exit(launch(sys.argv[1:]))
    main()
