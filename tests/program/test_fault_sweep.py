"""Every OpenGL, EGL and OpenCL call of a full run, with every fault that a driver can have there,
without and with assay-host. ASSAY_LONG_TESTS=1 tests all calls, otherwise a sample in which every fault
and every entry point occurs.

If a fault ends the run: the output up to the call is that of an undisturbed run, the documented table
has the call in the row of the last line, and the run ends as the fault does; for assay-host this is the
verdict, the reason and the status, and the library that the call belongs to is broken and no other.

If the run continues after a fault: the output up to the call is that of an undisturbed run; after it
there are only keys that are due, in order, with values of the right form; a text is a prefix of the
given one; the report is whole, or standard error has the reason; the status agrees with standard error.
The documented table has all further calls too. Under assay-host the report and the exit status are the
same, and what can be used is what the report shows.

The table of what can be used after each fault is written to usable-faults.md in the build folder.

No process of a run is left in any case."""

import ctypes.util
import json
import os
import re
import traceback
from collections import Counter
from concurrent.futures import ThreadPoolExecutor

import pytest

from calls import LastLines, PREFIX, calls_of, without_calls
from clmodel import cl_values_of
from faults import FAULTS, RESULTS, library_of
from harness import BUILD, STAMP, Run, ended_by, split_lines, text_of
from hosting import STATUSES, report_bytes
from model import check, predict
from sweep import WORKERS, Sweep, normal

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")

ALL = bool(os.environ.get("ASSAY_LONG_TESTS"))
# Hanging runs only wait, so that there may be many.
HANGING = 64

# The limits of assay-host.
MAX_LINE_BYTES = 65536
MAX_LINES = 24576
# The compared part of a line: the prefix of a log line may vary in its length.
MAX_COMPARED = MAX_LINE_BYTES - 100

UNKNOWN = '"?"'

FORMS = {"text": r'".*"', "list": r"\[-?\d+\]", "number": r"-?(\d+(\.\d+)?(e[+-]\d+)?|inf|nan)"}
ENDS = {"SIGSEGV": "crashed", "SIGABRT": "crashed", "hang": "hung"}
SIGNALS = {"SIGSEGV": "signal 11 ", "SIGABRT": "signal 6 ", "hang": "signal 9 "}


@pytest.fixture(scope="module")
def sweep(tmp_path_factory):
    return Sweep(tmp_path_factory.mktemp("sweep"))


@pytest.fixture(scope="module")
def table():
    return LastLines()


# For each run under assay-host: the fault, the entry point, and the answers with their reasons.
ROWS = []


@pytest.fixture(scope="module", autouse=True)
def usable_table():
    yield
    if os.access(BUILD, os.W_OK):
        rows = [f"| {fault} | {name} | {' '.join(gl)} | {' '.join(cl)} | {count} |\n"
                for (fault, name, gl, cl), count in sorted(Counter(ROWS).items())]
        (BUILD / "usable-faults.md").write_text(
            "| fault | in a call of | OpenGL | OpenCL | runs |\n|---|---|---|---|---|\n" + "".join(rows),
            encoding="utf-8")


def values(lines):
    return [tuple(line.split("=", 1)) for line in lines if "=" in line and not line.startswith("#")]


def form(value):
    return next((name for name, pattern in FORMS.items() if re.fullmatch(pattern, value, re.DOTALL)),
                "none")


def is_part(part, whole):
    """Whether the other list has all the items in the same order."""
    rest = iter(whole)
    return all(each in rest for each in part)


def check_end(table, pair, run):
    """Checks a run that the fault ended."""
    ends = pair.fault.ends
    if ends == "_exit":
        assert run.status == 0
    else:
        assert ended_by(run, "SIGKILL" if ends == "hang" else ends)
    calls = calls_of(run.lines)
    assert (calls[-1].call.number, calls[-1].call.name) == (pair.call.number, pair.call.name)
    table.check(pair.call.name, calls[-1].last)
    assert normal(without_calls(run.lines)) == pair.before


def check_going_on(sweep, table, pair, run):
    """Checks a run that ended by itself."""
    assert run.status in (0, 2)
    lines = normal(without_calls(run.lines))
    own = lines[:len(pair.before)] + lines[len(pair.before) + len(pair.fault.prints):]
    assert lines[:len(pair.before)] == pair.before
    assert lines[len(pair.before):][:len(pair.fault.prints)] == pair.fault.prints
    for made in calls_of(run.lines):
        if made.last not in pair.fault.prints:
            table.check(made.call.name, made.last)

    due = dict(values(sweep.whole))
    found = values(own)
    assert is_part([key for key, _ in found], list(due))
    for key, value in found:
        assert form(value) == form(due[key]), key
        if pair.fault.text is not None and form(value) == "text" and value not in (due[key], UNKNOWN):
            assert pair.fault.text.startswith(value[1:-1]), key
    if run.status == 2:
        assert run.errors != []
    else:
        assert own[-1] == 'assayEnd="STAMP"'
    if pair.fault.prints or pair.fault.leaves:
        assert (run.status, run.errors, own) == (0, [], sweep.whole)


def check_hosted(table, pair, bare, hosted):
    """Checks that assay-host reports the run as it was without it."""
    # Other tests validate the document against the schema, which would take most of the time here.
    document = json.loads(hosted.out)
    outcome = document["outcome"]
    lines = without_calls(bare.lines)
    wanted = [line[:MAX_COMPARED] for line in normal(lines)]
    kept = STAMP.sub(r'\1="STAMP"', text_of(report_bytes(document)))
    assert [line[:MAX_COMPARED] for line in normal(split_lines(kept))] == wanted[:MAX_LINES]
    assert not outcome["leftBehind"]
    assert (outcome["lostOutputBytes"] > 0) == (
        len(lines) > MAX_LINES or any(len(line) > MAX_LINE_BYTES for line in lines))

    ends = next((name for name in SIGNALS if name != "hang" and ended_by(bare, name)), None)
    ends = pair.fault.ends if pair.fault.ends in ENDS else ends
    whole = 'assayEnd="STAMP"' in wanted[:MAX_LINES]
    if ends is None:
        assert outcome["exitStatus"] == bare.status
        assert outcome["verdict"] == ("complete" if whole and bare.status == 0 else "failed-tests")
        if not pair.fault.prints:
            assert outcome["errorLines"] == bare.errors
    else:
        assert outcome["verdict"] == ENDS[ends]
        assert outcome["termination"].startswith(SIGNALS[ends])
    if ends is not None or pair.fault.ends == "_exit":
        last = outcome["lastLogLine"] or outcome["lastReportLine"]
        table.check(pair.call.name, PREFIX.sub("", last))
    check_usable(pair, document, dict(values(wanted)), bare.errors)
    assert document["report"]["whole"] == whole
    assert hosted.err == b""
    assert hosted.status == STATUSES[outcome["verdict"]]


NO_CONTEXT = "ContextOffscreen exception caught and ignored."
# The calls that list display devices.
LISTING = {"eglQueryDevicesEXT", "eglGetPlatformDisplayEXT", "eglInitialize"}


def usable_opengl(pair, keys, errors):
    """What can be used of OpenGL by a whole report: its device passed its trials or not, or there is none."""
    if keys.get("NumGLGPUs", "0") == "0":
        return "absent" if pair.call.name in LISTING and NO_CONTEXT not in errors else "broken"
    trials = [keys.get(f"glgpu[0].{key}") for key in ("CanCompileProgramGLSL", "GLFrameBufferOK")]
    return "hardware" if trials == ["1", "1"] else "broken"


def usable_opencl(keys):
    if keys.get("NumCLGPUs", "0") == "0":
        return "absent"
    return "hardware" if "clgpu[0].CLCompute" in keys else "broken"


def usable_of(pair, whole, keys, errors):
    """What can be used after a run with the fault: OpenGL and OpenCL."""
    if whole:
        return usable_opengl(pair, keys, errors), usable_opencl(keys)
    # After a flood the child goes on, and the rest of its report is dropped.
    stopped = "unknown" if pair.fault.name == "flood" else "broken"
    return ("hardware", stopped) if library_of(pair.call.name) == "cl" else (stopped, "unknown")


def check_usable(pair, document, keys, errors):
    answers = [document["usable"][name] for name in ("opengl", "opencl")]
    ROWS.append((pair.fault.name, pair.call.name,
                 *((answer["answer"], answer["reason"]) for answer in answers)))
    assert tuple(answer["answer"] for answer in answers) == usable_of(
        pair, document["report"]["whole"], keys, errors)


def run_pair(sweep, table, pair):
    """Returns None if the runs of the pair are right, otherwise the first error."""
    try:
        bare = sweep.bare(pair)
        if pair.fault.ends is not None:
            check_end(table, pair, bare)
        elif pair.by_loader and ended_by(bare, "SIGSEGV", "SIGABRT"):
            assert normal(without_calls(bare.lines)) == pair.before
        else:
            check_going_on(sweep, table, pair, bare)
        check_hosted(table, pair, bare, sweep.hosted(pair))
    except Exception as error:  # continue with the other pairs
        place = traceback.extract_tb(error.__traceback__)[-1]
        return f"{pair}: {place.name}:{place.lineno}: {place.line}: {str(error)[:500]}"
    return None


def test_the_undisturbed_run(sweep):
    """The run that the others are compared with has the predicted report."""
    machine = sweep.machine
    report = "".join(f"{line}\n" for line in sweep.whole if not line.startswith("#"))
    check(Run(0, report.encode(), b""),
          predict([machine.gpu], opencl=cl_values_of(machine.opencl)))


@pytest.mark.parametrize("fault", FAULTS.values(), ids=FAULTS)
def test_fault_in_every_call(sweep, table, fault, closing_lines):
    pairs, left_out = sweep.pairs(fault, ALL)
    with ThreadPoolExecutor(HANGING if fault.ends == "hang" else WORKERS) as workers:
        failures = [failure for failure in workers.map(
            lambda pair: run_pair(sweep, table, pair), pairs) if failure]
    reasons = ", ".join(f"{count} calls: {reason}" for reason, count in left_out.items())
    closing_lines.append(
        f"fault sweep: {fault.name}: {len(pairs)} of {len(sweep.calls)} calls, without and with "
        f"assay-host, {len(failures)} wrong" + (f"; not applicable to {reasons}" if reasons else ""))
    assert not failures, "\n".join(failures)


def test_the_sample_has_every_fault_and_every_entry_point(sweep):
    names = {made.call.name for made in sweep.calls}
    sampled = [pair for fault in FAULTS.values() for pair in sweep.pairs(fault, False)[0]]
    assert {pair.call.name for pair in sampled} == names
    assert {pair.fault.name for pair in sampled} == set(FAULTS)
    assert set().union(*RESULTS.values()) == names
