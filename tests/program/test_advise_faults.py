"""`assay-host advise` with every way in which a driver can end a run: the answer is right, the next call
has it from memory, and the first one after another boot too. ASSAY_LONG_TESTS=1 crashes in every call,
otherwise in a sample in which every entry point occurs."""

import ctypes.util
import os
from concurrent.futures import ThreadPoolExecutor

import pytest

from faults import FAULTS, library_of
from harness import PROGRAM_AT_ROOT
from hosting import host_run
from sweep import WORKERS, Sweep
from validate import validate_advice

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")

ALL = bool(os.environ.get("ASSAY_LONG_TESTS"))


def why_wrong(sweep, pair):
    """Makes the calls around the fault. Returns what is wrong; None if they answer right."""
    opencl = library_of(pair.call.name) == "cl"
    rules = pair.fault.rules(pair.call)
    gl_lines, cl_lines = ("", rules) if opencl else (rules, "")
    host, machine = sweep.machine.host(pair.name, gl_lines=gl_lines, cl_lines=cl_lines)
    environment = host.environment(**machine)
    arguments = ["advise", "--state", str(sweep.folder / f"state-{pair.name}"), "--assay",
                 str(PROGRAM_AT_ROOT), "--format", "json", "--need", "opencl" if opencl else "opengl",
                 "--pause", "86400"]
    runs = [host_run(*arguments, environment=environment) for _ in range(2)]
    documents = [validate_advice(run.out) for run in runs]
    answers = [[document[kind]["answer"] for kind in ("opengl", "opencl")] for document in documents]
    # A crash while the drivers are unloaded comes after the report.
    whole = answers[0] == ["hardware", "hardware"]
    if not whole and answers[0] != (["hardware", "broken"] if opencl else ["broken", "unknown"]):
        return f"{pair}: {answers[0]}"
    if answers[1] != answers[0] or runs[1].status != runs[0].status:
        return f"{pair}: the second call answers {answers[1]}"
    if [document["tried"] for document in documents] != [True, False]:
        return f"{pair}: attempts"
    return None


@pytest.mark.parametrize("name", ["SIGSEGV", "abort", "_exit(0)"])
def test_a_fault_in_the_calls_of_a_run(tmp_path, name, closing_lines):
    sweep = Sweep(tmp_path)
    # The kinds differ only in how the child's end is read.
    pairs = sweep.pairs(FAULTS[name], ALL and name == "SIGSEGV")[0]
    with ThreadPoolExecutor(WORKERS) as workers:
        wrong = [each for each in workers.map(lambda pair: why_wrong(sweep, pair), pairs) if each]
    closing_lines.append(
        f"advise: {name}: {len(pairs)} of {len(sweep.calls)} calls, {len(wrong)} wrong")
    assert not wrong, "\n".join(wrong)
