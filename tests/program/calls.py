"""The driver calls of a run, each with the last line of the output at that time, which a host would see
if the call crashed. The scripted drivers record to standard output, so that their lines come between
those of the report. Also the tables of last lines in docs/report-format.md."""

import functools
import re
from dataclasses import dataclass, field, replace
from pathlib import Path
from typing import NamedTuple

from adapters import Adapter, write_tree
from clmodel import ClGpu, ClPlatform, cl_script_of
from harness import BUILD, TREE, Call, Host, read_call
from model import Gpu

RECORD_HERE = "record /dev/stdout\n"
PREFIX = re.compile(r"# \d{5}\.\S+\[tid=[0-9a-f]+\] ")
CALL = re.compile(r"\d+ (?:-|\d+) (?:egl|gl|cl)[A-Z]")


def without_calls(lines):
    return [line for line in lines if not CALL.match(line)]


class Made(NamedTuple):
    """A call, and the output before it."""

    call: Call
    last: str  # the last line, without the prefix of log lines
    printed: int  # the number of lines


def calls_of(lines):
    """The calls of a run, in order."""
    last, printed, found = "", 0, []
    for line in lines:
        if CALL.match(line):
            found.append(Made(read_call(line), last, printed))
        else:
            last, printed = PREFIX.sub("", line), printed + 1
    return found


class LastLines:
    """The tables of last lines and calls. They must have every call."""

    def __init__(self):
        text = (TREE / "docs" / "report-format.md").read_text(encoding="utf-8")
        self.rows = []
        for heading in ("OpenGL calls", "OpenCL calls"):
            section = text.split(f"\n#### {heading}\n")[1].split("\n#")[0]
            for line in section.split("The log changes")[0].splitlines():
                cells = [cell.strip() for cell in line.strip("|").split(" | ")]
                if line.startswith("| `") and len(cells) == 2:
                    pattern = re.escape(cells[0].strip("` ")).replace(re.escape("..."), ".*")
                    self.rows.append(
                        (pattern, re.findall(r"`((?:egl|gl|cl)[A-Z]\w+)`", cells[1])))

        self._row_of = functools.lru_cache(1000)(self._find_row)

    def _find_row(self, last):
        rows = [number for number, (pattern, _) in enumerate(self.rows)
                if re.fullmatch(pattern, last)]
        assert len(rows) == 1, f"{len(rows)} rows match {last!r}"
        return rows[0]

    def check(self, name, last):
        """Asserts that the row of this last line names the call. Returns the row's number."""
        row = self._row_of(last)
        names = self.rows[row][1]
        if name == "eglGetError":
            assert any(each.startswith("egl") for each in names), f"{name} after {last!r}"
        else:
            assert name in names, f"no row has {name} after {last!r}"
        return row


@dataclass
class FullMachine:
    """A machine with one GPU for OpenGL and one for OpenCL, both by scripted drivers that make the
    program call as many functions as possible: it asks for extensions one by one, and needs a
    surface for the context."""

    folder: Path
    gpu: Gpu = field(default_factory=lambda: Gpu(adapter=Adapter(0, "Card"), version="4.6 Scripted"))
    # Two batches fill the second that the measurement takes.
    opencl: list = field(default_factory=lambda: [ClPlatform([ClGpu(batch=600_000_000)])])

    def __post_init__(self):
        if not (self.folder / "root").exists():
            write_tree(self.folder / "root", [self.gpu.adapter])

    def host(self, name, gl_lines="", cl_lines=""):
        """A host for one run, and its arguments: the machine with these lines added to its
        scripts."""
        surface = 'display-string EGL_EXTENSIONS ""\n'
        scripts = {"gl": self.gpu.script() + surface + gl_lines,
                   "cl": cl_script_of(self.opencl) + cl_lines}
        files = {}
        for kind, text in scripts.items():
            files[kind] = self.folder / f"{kind}-{name}"
            files[kind].write_bytes(text.encode("utf-8", "surrogateescape"))
        host = replace(Host(self.folder), variables={
            "OCL_ICD_VENDORS": str(BUILD / "drivers" / "opencl"), "OCL_ICD_PLATFORM_SORT": "none",
            "ASSAY_SCRIPTED_OPENCL": str(files["cl"])})
        return host, {"script": files["gl"], "opencl": "empty", "root": self.folder / "root"}

    def run(self, name, gl_lines="", cl_lines="", **options):
        """Runs the program with the log, and with the calls between its lines."""
        host, found = self.host(name, RECORD_HERE + gl_lines, RECORD_HERE + cl_lines)
        return host.run("-verbose=1", **found, **options)

