"""The tables of last lines in docs/report-format.md: for every driver call of the program, on any
machine and also after a failure, the row of the last line names the call; and every entry of the tables
occurs."""

import ctypes.util
from concurrent.futures import ThreadPoolExecutor

import pytest

from calls import FullMachine, LastLines, calls_of
from faults import ERRORS, library_of

WORKERS = 2

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")

# Script lines that make the program take another path than usual.
MACHINES = {
    "extensions in one text": "version \"2.1 Scripted\"",
    "no extensions in one text": "version \"2.1 Scripted\"\nstring GL_EXTENSIONS null",
    "no extension by its number": "at glGetStringi return 0",
    "default display": 'client-extensions ""',
    "surfaceless platform": 'client-extensions "EGL_MESA_platform_surfaceless"',
    "no surface": 'display-string EGL_EXTENSIONS "EGL_KHR_surfaceless_context"',
    "neither surface nor configuration":
        'display-string EGL_EXTENSIONS "EGL_KHR_no_config_context EGL_KHR_surfaceless_context"',
    "no vertex shader": 'vertex-fails "x"',
    "no program": 'link-fails "x"',
}

# The loader's name for what reaches the driver as clIcdGetPlatformIDsKHR.
UNSEEN = {"clGetPlatformIDs"}


def test_every_call(tmp_path):
    machine = FullMachine(tmp_path)
    table = LastLines()
    seen = set()

    def learn(run):
        assert run.status in (0, 2)
        rows = [(made.call, table.check(made.call.name, made.last)) for made in calls_of(run.lines)]
        seen.update((row, call.name) for call, row in rows)
        return rows

    plain = machine.run("plain")
    assert plain.status == 0
    first = {}
    for call, row in learn(plain):
        first.setdefault((row, call.name), call)

    def run_disturbed(job):
        number, (call, action) = job
        rule = f"at {call.number} any {action}\n"
        opencl = library_of(call.name) == "cl"
        return machine.run(number, cl_lines=rule if opencl else "", gl_lines="" if opencl else rule)

    jobs = [(call, f"error {ERRORS[library_of(call.name)]}") for call in first.values()]
    # A platform that can't be created at all.
    jobs += [(call, 'throw "thrown"') for call in first.values() if library_of(call.name) == "egl"]
    with ThreadPoolExecutor(WORKERS) as workers:
        for run in workers.map(run_disturbed, enumerate(jobs)):
            learn(run)
    for name, lines in MACHINES.items():
        learn(machine.run(name.replace(" ", "-"), gl_lines=lines + "\n"))

    listed = {(row, name) for row, (_, names) in enumerate(table.rows) for name in names}
    assert {each for each in listed - seen if each[1] not in UNSEEN} == set()


def test_a_call_without_a_row_fails():
    """The check of the tables rejects wrong calls and lines."""
    table = LastLines()
    table.check("glGetStringi", "NumGLGPUs=1")
    table.check("eglGetError", "NumGLGPUs=1")
    for name, last in [("glFinish", "NumGLGPUs=1"), ("glGetString", "NumGLGPU=1"),
                       ("eglGetError", "NumCLGPUs=1")]:
        with pytest.raises(AssertionError):
            table.check(name, last)
