"""The tests of Linux that don't run under Wine, shown as skipped with the reasons."""

import pytest

from conftest import TREE

# The program tests of Linux with their counterparts here, and those without one by reason.
COUNTERPARTS = {
    "test_bugreport": "test_windows_host",
    "test_check": "test_windows_host",
    "test_diff": "test_windows_host",
    "test_explain": "test_windows_host",
    "test_command_line": "test_windows_command_line",
    "test_host_end": "test_windows_host",
    "test_host_help": "test_windows_host",
    "test_host_hostile": "test_windows_host",
    "test_host_run": "test_windows_host",
    "test_host_usage_errors": "test_windows_host",
    "test_host_torture": "test_windows_torture",
    "test_library": "test_windows_library",
    "test_opencl": "test_windows_opencl",
    "test_show": "test_windows_host",
    "test_steps": "test_windows",
    "test_third_party": "test_package",
    "test_verbose": "test_windows",
    "test_streams": "test_windows",
    "test_machines": "test_windows",
}
LEFT_OUT = {
    "the scripted OpenGL driver is an EGL library, and the peer uses EGL": {
        "program/test_advise", "program/test_advise_changes", "program/test_advise_faults",
        "program/test_advise_state", "program/test_bad_drivers",
        "program/test_check_state", "program/test_desktop", "program/test_diff_html",
        "program/test_driver_files", "program/test_failing_gpu", "program/test_fault_sweep", "program/test_html", "program/test_last_line", "program/test_library_advice",
        "program/test_opengl_peers", "program/test_usable"},
    "Linux's own adapters and EGL": {
        "program/test_adapters", "program/test_record_adapters", "unit/gpu", "unit/qgf"},
    "the system's own calls; those of Windows have tests of their own": {
        "unit/bugreport", "unit/identity", "unit/launch", "unit/library", "unit/pmutil",
        "unit/supervise"},
    "the modes and links of files, which Windows has in another way": {"unit/memory"},
    "Linux's own files, shells and terminals": {
        "program/test_completions", "program/test_hardening", "program/test_series", "unit/facts",
        "unit/output"},
    "texts that are the same on every system": {"program/test_links", "unit/report"},
    "what the emulation of another processor leaves out": {"program/test_emulation"},
    "there is no Python and no Node for Windows here": {"examples/decide.py", "examples/decide.js"},
    "the peak memory of a host is measured by getrusage": {"program/test_host_memory"},
}


def linux_only():
    program = {f"program/{file.stem}" for file in (TREE / "tests" / "program").glob("test_*.py")
               if file.stem not in COUNTERPARTS}
    unit = {f"unit/{file.parents[1].name}"
            for file in (TREE / "tests" / "unit").glob("*/linux/*Test.cpp")}
    examples = {f"examples/{file.name}" for file in (TREE / "examples").iterdir()
                if file.suffix in (".py", ".js")}
    return program | unit | examples


def test_counterparts_exist():
    here = TREE / "tests" / "program" / "windows"
    for counterpart in COUNTERPARTS.values():
        assert (here / f"{counterpart}.py").exists()


@pytest.mark.parametrize("reason", LEFT_OUT)
def test_left_out(reason):
    pytest.skip(f"left out: {', '.join(sorted(LEFT_OUT[reason]))}: {reason}")


def test_each_test_runs_here_or_has_its_reason():
    named = [name for names in LEFT_OUT.values() for name in names]
    assert sorted(named) == sorted(linux_only())
