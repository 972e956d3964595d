"""What docs/report-format.md tells a host of the last line behind a crash: each driver call that the
program makes crashes in turn, and the output must end as the document says; each word of its tables
is used."""

import ctypes.util
import dataclasses
import re
from concurrent.futures import ThreadPoolExecutor

import pytest

from adapters import Adapter, write_tree
from clmodel import ClGpu, ClPlatform, cl_script_of
from harness import BUILD, TREE, ended_by
from model import Gpu

WORKERS = 2
PREFIX = re.compile(r"# \d{5}\.\S+\[tid=[0-9a-f]+\] ")


def table(heading):
    """The rows below a heading: the pattern of a last line, and the calls that it stands for."""
    text = (TREE / "docs" / "report-format.md").read_text(encoding="utf-8")
    section = text.split(f"\n#### {heading}\n")[1].split("\n#")[0].split("The log changes")[0]
    rows = []
    for line in section.splitlines():
        cells = [cell.strip() for cell in line.strip("|").split(" | ")]
        if line.startswith("| `") and len(cells) == 2:
            pattern = re.escape(cells[0].strip("` ")).replace(re.escape("..."), ".*")
            rows.append((pattern, re.findall(r"`((?:egl|gl|cl)[A-Z]\w+)`", cells[1])))
    return rows


def crash_everywhere(run_with, calls, rows, unseen=()):
    """Crashes in each call. `unseen`: names in the rows that don't reach the scripted driver."""
    with ThreadPoolExecutor(WORKERS) as workers:
        runs = list(workers.map(
            lambda call: run_with(call.number, f"at {call.number} any crash\n"), calls))
    seen = set()
    for run, call in zip(runs, calls):
        assert ended_by(run, "SIGSEGV"), call
        last = PREFIX.sub("", run.lines[-1])
        rows_of_line = [row for row, (pattern, _) in enumerate(rows)
                        if re.fullmatch(pattern, last)]
        assert len(rows_of_line) == 1, f"{last!r} has no row of its own"
        row = rows_of_line[0]
        assert call.name in rows[row][1], f"{call.name} isn't told behind {last!r}"
        seen.add((row, call.name))
    told = {(row, name) for row, (_, names) in enumerate(rows) for name in names
            if name not in unseen}
    assert told == seen


def test_opengl_calls(host):
    gpu = Gpu(adapter=Adapter(0, "Card"))
    write_tree(host.folder / "root", [gpu.adapter])

    def run_with(number, line):
        file = host.folder / f"script-{number}"
        file.write_text(gpu.script() + line)
        return host.run("-verbose=1", script=file, root=host.folder / "root")

    assert run_with("whole", host.fresh_record()).status == 0
    crash_everywhere(run_with, host.record(), table("OpenGL calls"))


@pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                    reason="this machine has no OpenCL loader library")
def test_opencl_calls(host):
    # A batch of a second, so that there is one only.
    script = cl_script_of([ClPlatform([ClGpu(batch=1_000_000_000)])])
    host.variables.update(OCL_ICD_VENDORS=str(BUILD / "drivers" / "opencl"),
                          OCL_ICD_PLATFORM_SORT="none")
    gl_script = host.folder / "gl-script"
    gl_script.write_text("# nothing\n")

    def run_with(number, line):
        file = host.folder / f"script-{number}"
        file.write_text(script + line)
        own = dataclasses.replace(
            host, variables={**host.variables, "ASSAY_SCRIPTED_OPENCL": str(file)})
        return own.run("-verbose=1", script=gl_script, opencl="empty")

    assert run_with("whole", host.fresh_record()).status == 0
    crash_everywhere(run_with, host.record(), table("OpenCL calls"), unseen=["clGetPlatformIDs"])
