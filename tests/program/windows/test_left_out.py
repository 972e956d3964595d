"""Which tests of Linux don't run under Wine, and why; each shows as skipped."""

import pytest

from conftest import TREE

# A program test of Linux and the ones that stand for it here, or why there are none.
COUNTERPARTS = {
    "test_command_line": "test_windows_command_line",
    "test_host_hostile": "test_windows_host",
    "test_host_run": "test_windows_host",
    "test_host_torture": "test_windows_host",
    "test_opencl": "test_windows_opencl",
    "test_steps": "test_windows",
    "test_verbose": "test_windows",
    "test_streams": "test_windows",
    "test_machines": "test_windows",
}
LEFT_OUT = {
    "program/test_adapters": "adapter trees are folders of the Linux kernel",
    "program/test_bad_drivers": "the scripted OpenGL driver is an EGL library",
    "program/test_failing_gpu": "the scripted OpenGL driver is an EGL library",
    "program/test_fault_sweep": "the scripted OpenGL driver is an EGL library",
    "program/test_last_line": "the scripted OpenGL driver is an EGL library",
    "program/test_opengl_peers": "the peer asks the driver through EGL",
    "unit/gpu": "how Linux tells of its adapters",
    "unit/pmutil": "the system's own calls; those of Windows have tests of their own",
    "unit/qgf": "EGL, and how Linux tells of its adapters",
}


def linux_only():
    program = [f"program/{file.stem}" for file in (TREE / "tests" / "program").glob("test_*.py")
               if file.stem not in COUNTERPARTS]
    unit = [f"unit/{folder.parent.name}" for folder in (TREE / "tests" / "unit").glob("*/linux")]
    return sorted(program + unit)


def test_counterparts_exist():
    here = TREE / "tests" / "program" / "windows"
    for counterpart in COUNTERPARTS.values():
        assert (here / f"{counterpart}.py").exists()


@pytest.mark.parametrize("name", linux_only())
def test_left_out(name):
    assert name in LEFT_OUT, "has no counterpart under Wine and no reason for it"
    pytest.skip(f"tests/{name} is left out: {LEFT_OUT[name]}")


def test_nothing_is_left_out_that_is_gone():
    assert set(LEFT_OUT) <= set(linux_only())
