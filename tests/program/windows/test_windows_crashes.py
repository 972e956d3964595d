"""A driver that ends assay.exe in various ways: without and with assay-host.exe.

The driver is a real OpenCL.dll in the system's folder of a separate prefix.
"""

import json
import shutil

import pytest

from conftest import BUILD, run_under_wine

DRIVER = BUILD / "drivers" / "opencl" / "OpenCL.dll"
HOST = BUILD / "bin" / "assay-host.exe"

# The driver's action, the exit code of the process, and the host's verdict.
ENDS = [
    ("access-violation", 0xC0000005, "crashed"),
    ("abort", 0xC0000409, "crashed"),
    ("assert", 0xC0000409, "crashed"),
    ("terminate", 0xC0000409, "crashed"),
    ("fast-fail", 0xC0000409, "crashed"),
    ("stack-overflow", 0xC00000FD, "crashed"),
    ("exit", 0, "failed-tests"),
]
IDS = [how for how, _, _ in ENDS]


@pytest.fixture(scope="module")
def prefix(own_prefix):
    """A Windows whose OpenCL.dll is the driver."""
    shutil.copy(DRIVER, own_prefix / "drive_c" / "windows" / "system32" / "opencl.dll")
    return {"WINEPREFIX": str(own_prefix), "WINEDLLOVERRIDES": "mscoree,mshtml=;opencl=n"}


def test_driver_is_the_one_asked(prefix):
    run = run_under_wine(**prefix)
    assert run.status == 2
    assert run.errors == [
        "QGF::LogicalException: clGetPlatformIDs failed: CL_OUT_OF_HOST_MEMORY (-6)"]


@pytest.mark.parametrize("how, code, _", ENDS, ids=IDS)
def test_bare(prefix, how, code, _):
    """A Linux parent sees the low 8 bits of the code."""
    run = run_under_wine(ASSAY_MISBEHAVE=how, **prefix)
    assert run.status == code & 0xFF
    assert run.lines[-1].startswith("glgpu[0].")


@pytest.mark.parametrize("how, code, verdict", ENDS, ids=IDS)
def test_judged(prefix, how, code, verdict):
    run = run_under_wine("run", "--format", "json", "--timeout", "200", program=HOST,
                         ASSAY_MISBEHAVE=how, **prefix)
    outcome = json.loads(run.out)["outcome"]
    assert outcome["verdict"] == verdict
    assert outcome["lastReportLine"].startswith("glgpu[0].")
    if verdict == "crashed":
        assert outcome["termination"] == f"code 0x{code:08X}"


def test_hang(prefix):
    run = run_under_wine("run", "--format", "json", "--timeout", "20", program=HOST,
                         ASSAY_MISBEHAVE="hang", **prefix)
    outcome = json.loads(run.out)["outcome"]
    assert outcome["verdict"] == "hung"
    assert outcome["lastReportLine"].startswith("glgpu[0].")
