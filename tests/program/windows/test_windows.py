"""The Windows program under Wine: its report, a failure at every step, and missing pieces."""

import re
import subprocess

import pytest

from conftest import NO_OPENCL_PLATFORM, PROGRAM, gpu_of, run_under_wine
from model import KEYS, check, predict


def test_report(whole_run):
    """Wine's display device has a name of its own, so that no adapter matches it, and the last resort
    reports one device without name, ids or driver."""
    assert whole_run.status == 0
    assert whole_run.errors == []
    facts = whole_run.facts
    assert facts["QGFCoreInitialized"] == facts["QGFOGLInitialized"] == "1"
    assert facts["OGLContextCreated"] == facts["NumGLGPUs"] == "1"
    assert facts["glgpu[0].CanCompileProgramGLSL"] == facts["glgpu[0].GLFrameBufferOK"] == "1"
    assert [key for key in facts if re.match(r"glgpu\[0\]\.[^.\[]+$", key)] == [
        f"glgpu[0].{key}" for key in KEYS]
    check(whole_run, predict([gpu_of(whole_run)], opencl=0))


def test_line_ends_are_those_of_text_mode():
    done = subprocess.run([PROGRAM.parents[3] / "scripts" / "run-under-wine", PROGRAM,
                           "-stdout=x", "-comment=y", "-bogus"],
                          stdout=subprocess.PIPE, stderr=subprocess.PIPE, check=False)
    assert done.stdout == b"x\r\n# y\r\n"
    assert b"Usage exception: usage\r\nusage: \r\n" in done.stderr
    assert done.returncode == 3


def test_log_shows_the_real_adapters():
    run = run_under_wine("-verbose=1", **NO_OPENCL_PLATFORM)
    text = "\n".join(run.comments)
    assert "wmiNumDevices=1" in text
    assert re.search(r"adapter\[0\]\{ VendorID=\d+ DeviceId=\d+ .* Description=.+\}", text)
    assert re.search(r"output\[0\]\{ DesktopCoordinates=\{ left=0 top=0 .* AttachedToDesktop=1 ",
                     text)
    assert "adapter[0] displays: 1" in text
    assert "dxgiNumDevices=1" in text
    assert "successful context creation but no matching WMI or DXGI devices found" in text
    assert [line for line in run.lines if not line.startswith("# ")] == run_under_wine(
        **NO_OPENCL_PLATFORM).lines


@pytest.mark.parametrize("option, field", [("crashAfter", "crash_after"),
                                           ("throwAfter", "throw_after")])
def test_failure_at_every_step(whole_run, option, field):
    gpu = gpu_of(whole_run)
    steps = predict([gpu], opencl=0).steps
    assert steps == 45

    def run_to(step):
        return run_under_wine(f"-{option}={step}", **NO_OPENCL_PLATFORM)

    runs = [run_to(step) for step in range(steps + 1)]
    for step, run in enumerate(runs):
        check(run, predict([gpu], opencl=0, **{field: step}))
    assert [run.status for run in runs] == [2] * steps + [0]


def test_no_display():
    """Without a window there is no context, and no adapter drives a display: the report has zeros."""
    run = run_under_wine(DISPLAY=":4711", **NO_OPENCL_PLATFORM)
    assert run.status == 0
    assert run.lines == predict([], opencl=0, context=0).lines
    assert run.errors == ["CreateDXGIFactory", "CreateGXGIFactory failed",
                          "ContextOffscreen exception caught and ignored."]


def test_no_wmi():
    """Without the service's library the list is empty, the log has the reason, and the run continues."""
    run = run_under_wine("-verbose=1", WINEDLLOVERRIDES="mscoree,mshtml,wbemprox=",
                         **NO_OPENCL_PLATFORM)
    assert run.status == 0
    text = "\n".join(run.comments)
    assert "WMIData::GetAllDevices() exception: CoCreateInstance" in text
    assert "wmiNumDevices=0" in text
    assert "dxgiNumDevices=1" in text


def test_reader_that_has_gone(whole_run):
    """A pipe without a reader loses the lines; the run continues."""
    command = (f"'{PROGRAM.parents[3]}/scripts/run-under-wine' '{PROGRAM}'; "
               f"echo status $? >&2")
    done = subprocess.run(["bash", "-c", f"({command}) | (exec 0<&-; sleep 1)"],
                          stdout=subprocess.PIPE, stderr=subprocess.PIPE, check=False)
    errors = done.stderr.decode().replace("\r\n", "\n").splitlines()
    assert errors.count("DoStdout failed") == len(
        [line for line in whole_run.lines if not line.startswith("#")])
    assert "status 0" in errors
