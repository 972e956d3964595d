#!/usr/bin/env python3
"""Loads the metrics of simulated machines into Prometheus, and measures the two queries of a fleet: which
machines got slower by 20 % since yesterday, and which lost a device.

usage: query_fleet.py [--build FOLDER] [--machines N] [--runs N]

The metrics are those of runs of `assay-host` on the scripted drivers of the tests: three cards, each healthy,
slower, without one of its devices, with a driver that crashes and with one that rejects shaders. Each machine
has those of one card, with its own noise on the measurements. `promtool tsdb create-blocks-from openmetrics`
loads two scrapes of yesterday and two of today; the faults are today's. Values are medians of the wall time
of a query and of the server's processor time, in milliseconds. The status is 1 if the wall time is a second
or more, or if a query doesn't find exactly the machines with the fault. Needs the packages prometheus,
prometheus-node-exporter and python3-jsonschema.
"""

import argparse
import collections
import os
import random
import re
import statistics
import sys
import tempfile
import time
from pathlib import Path

TREE = Path(__file__).resolve().parents[1]
sys.path += [str(TREE / "tests" / "program"), str(TREE / "tests" / "engines")]

DAY = 86400
FAULTS = {"slower": 0.01, "lost": 0.01, "crashed": 0.005, "shaders": 0.005}
QUERIES = {
    "slower": "assay_copy_bytes_per_second < 0.8 * assay_copy_bytes_per_second offset 1d",
    "lost": "assay_devices < assay_devices offset 1d",
}


def make_templates(folder):
    """The metrics of each card in each state, as lists of (name and labels, value)."""
    from clmodel import ClGpu
    from harness import BUILD, Host
    from hosting import run_assay
    from model import Gpu

    def series(cards, rules):
        (folder / "opencl").write_text("".join(card.script() for card in cards), encoding="ascii")
        host = Host(folder, {"OCL_ICD_VENDORS": str(BUILD / "drivers" / "opencl"),
                             "ASSAY_SCRIPTED_OPENCL": str(folder / "opencl")})
        text = run_assay(host, "--format", "prometheus",
                         machine={"script": Gpu().script() + rules, "opencl": "empty"}).text
        return [tuple(line.rsplit(" ", 1)) for line in text.splitlines() if line[0] != "#"]

    templates = {}
    for card, batch in enumerate((100_000_000, 200_000_000, 400_000_000)):
        healthy = [ClGpu(name=f"Card {card}", batch=batch) for _ in range(2)]
        slow = [healthy[0], ClGpu(name=f"Card {card}", batch=batch * 14 // 10)]
        templates[card, "healthy"] = series(healthy, "")
        templates[card, "slower"] = series(slow, "")
        templates[card, "lost"] = series(healthy[:1], "")
        templates[card, "crashed"] = series(healthy, "at glCompileShader crash\n")
        templates[card, "shaders"] = series(healthy, 'fragment-fails "x"\n')
    return templates


def write_metrics(file, templates, machines, today):
    """Writes the scrapes of all machines. Returns the faults of the machines by number."""
    chance = random.Random(1)
    faults = collections.defaultdict(set)
    count = 0
    for machine in range(machines):
        card, dice, state = machine % 3, chance.random(), "healthy"
        for fault, share in FAULTS.items():
            if 0 <= dice < share:
                state = fault
                faults[fault].add(f"m{machine:05}")
            dice -= share
        for moment, found in ((today - DAY, "healthy"), (today, state)):
            for name, value in templates[card, found]:
                if "per_second" in name or "score" in name:
                    value = f"{float(value) * chance.uniform(0.97, 1.03):.6g}"
                labelled = re.sub(r"^(\w+)\{?", rf'\1{{instance="m{machine:05}",', name)
                labelled = labelled if name.endswith("}") else labelled.replace(",", "}")
                for second in (moment - 60, moment):
                    file.write(f"{labelled} {value} {second}\n")
                    count += 1
    file.write("# EOF\n")
    return faults, count


def processor_seconds(process):
    """The processor time that the process has used."""
    fields = Path(f"/proc/{process.pid}/stat").read_text().rsplit(")", 1)[1].split()
    return (int(fields[11]) + int(fields[12])) / os.sysconf("SC_CLK_TCK")


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--machines", type=int, default=10000)
    parser.add_argument("--runs", type=int, default=7)
    options = parser.parse_args()
    from engines import needed, outcome_of
    from test_prometheus import Prometheus

    is_good = True
    today = (int(time.time()) - DAY) // 7200 * 7200 + 3600
    with tempfile.TemporaryDirectory(dir="/var/tmp") as name:
        folder = Path(name)
        templates = make_templates(folder)
        with (folder / "metrics").open("w", encoding="utf-8") as file:
            faults, samples = write_metrics(file, templates, options.machines, today)
        per_machine = len(templates[0, "healthy"])
        status, text = outcome_of(needed("promtool"), "tsdb", "create-blocks-from", "openmetrics",
                                  folder / "metrics", folder / "data")
        assert status == 0, text
        (folder / "metrics").unlink()
        print(f"{options.machines} machines, {per_machine} series each, {samples} samples")
        with Prometheus(folder) as prometheus:
            for fault, query in QUERIES.items():
                times, work = [], []
                for _ in range(options.runs):
                    used = processor_seconds(prometheus.server.process)
                    begin = time.monotonic()
                    result = prometheus.get("query", query=query, time=today)["result"]
                    times.append(time.monotonic() - begin)
                    work.append(processor_seconds(prometheus.server.process) - used)
                found = {each["metric"]["instance"] for each in result}
                is_right = found == faults[fault]
                median = statistics.median(times)
                is_good = is_good and is_right and median < 1
                print(f"{fault}: {len(found)} machines, {'as' if is_right else 'NOT AS'} simulated; "
                      f"{median * 1000:.0f} ms ({min(times) * 1000:.0f} to {max(times) * 1000:.0f}), "
                      f"of the processor {statistics.median(work) * 1000:.0f} ms: {query}")
    return 0 if is_good else 1


if __name__ == "__main__":
    if "--build" in sys.argv:
        at = sys.argv.index("--build")
        os.environ["ASSAY_BUILD_DIR"] = sys.argv[at + 1]
        del sys.argv[at:at + 2]
    sys.exit(main())
