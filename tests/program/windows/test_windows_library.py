"""Hosts of the DLL under Wine: the examples, drivers that crash, hang and end their process, and a host
that is killed."""

import os
import re
import shutil
import signal
import subprocess
import sys

import pytest

from clmodel import ClGpu, ClPlatform
from conftest import BUILD, NO_OPENCL_PLATFORM, TREE, run_under_wine, scripted_opencl
from harness import text_of
from test_windows_crashes import DRIVER, ENDS, IDS
from test_windows_host import CHILD, Running

sys.path.insert(0, str(TREE / "tests" / "schema"))
pytest.importorskip("jsonschema", reason="python3-jsonschema isn't there")

from validate import validate_document  # noqa: E402

BIN = BUILD / "bin"
HOST = BIN / "library_host.exe"
# In seconds: more than a run needs, and the time for one that hangs.
TIMEOUT = 250
HANG_TIMEOUT = 20


def document_of(*arguments, timeout=TIMEOUT, host=HOST, **variables):
    run = run_under_wine(str(timeout), *map(str, arguments), program=host, **variables)
    assert (run.status, run.errors) == (0, [])
    return validate_document(run.out)


def answer(document, interface):
    usable = document["usable"][interface]
    return usable["answer"], usable["reason"], usable["device"]


@pytest.fixture(scope="module")
def prefix(own_prefix):
    """A Windows whose OpenCL.dll is the driver."""
    shutil.copy(DRIVER, own_prefix / "drive_c" / "windows" / "system32" / "opencl.dll")
    return {"WINEPREFIX": str(own_prefix), "WINEDLLOVERRIDES": "mscoree,mshtml=;opencl=n"}


@pytest.mark.parametrize("language", ["c", "cpp"])
def test_examples_decide_on_this_machine(language):
    """The child is the assay.exe beside the DLL."""
    run = run_under_wine(program=BIN / f"decide_{language}.exe", **NO_OPENCL_PLATFORM)
    assert run.status == 0
    assert run.lines[0].startswith("complete: ")
    assert re.match("OpenGL (hardware|software): ", run.lines[1])
    if language == "cpp":
        assert run.lines[2].startswith("OpenCL absent: ")


def test_complete():
    document = document_of(**NO_OPENCL_PLATFORM)
    assert document["outcome"]["verdict"] == "complete"
    assert answer(document, "opengl") in [("hardware", "trials-passed", "glgpu[0]"),
                                          ("software", "only-software", "glgpu[0]")]
    assert answer(document, "opencl")[0] == "absent"


@pytest.mark.parametrize("how, code, verdict", ENDS, ids=IDS)
def test_a_driver_that_ends_its_process(prefix, how, code, verdict):
    document = document_of(ASSAY_MISBEHAVE=how, **prefix)
    assert document["outcome"]["verdict"] == verdict
    assert document["usable"]["opengl"]["answer"] in ("hardware", "software")
    assert answer(document, "opencl") == (
        "broken", "crashed" if verdict == "crashed" else "ended", None)
    if verdict == "crashed":
        assert document["outcome"]["termination"] == f"code 0x{code:08X}"


def test_a_driver_that_hangs(prefix):
    document = document_of(timeout=HANG_TIMEOUT, ASSAY_MISBEHAVE="hang", **prefix)
    assert document["outcome"]["verdict"] == "hung"
    assert not document["outcome"]["leftBehind"]
    assert document["usable"]["opengl"]["answer"] in ("hardware", "software")
    assert answer(document, "opencl") == ("broken", "hung", None)


@pytest.mark.parametrize("rule, verdict, usable", [
    ("", "complete", ("hardware", "trials-passed", "clgpu[0]")),
    ("at clBuildProgram abort\n", "crashed", ("broken", "crashed", "clgpu[0]")),
    ("at clBuildProgram hang\n", "hung", ("broken", "hung", "clgpu[0]")),
], ids=["complete", "crash", "hang"])
def test_scripted_opencl_drivers(tmp_path, rule, verdict, usable):
    document = document_of(timeout=HANG_TIMEOUT if verdict == "hung" else TIMEOUT,
                           **scripted_opencl(tmp_path, [ClPlatform([ClGpu()])], rule))
    assert document["outcome"]["verdict"] == verdict
    assert answer(document, "opencl") == usable


def test_killed_host():
    """The job kills the child too."""
    with Running(command=[HOST, "600", CHILD], stdout=subprocess.DEVNULL) as running:
        running.until_child_has_begun()
        for number in running.numbers(of_host=True):
            os.kill(number, signal.SIGKILL)
        running.until_child_has_ended()


def test_is_moved_as_a_folder(tmp_path):
    """The DLL, with the program, in a folder that the build doesn't know."""
    folder = tmp_path / "a f\u00f6lder"
    folder.mkdir()
    for name in ("library_host.exe", "assay-host.dll"):
        shutil.copy(BIN / name, folder)
    document = document_of(host=folder / "library_host.exe", **NO_OPENCL_PLATFORM)
    assert document["outcome"]["verdict"] == "never-started"
    assert "a f\u00f6lder\\assay.exe" in document["outcome"]["reason"]
    shutil.copy(BIN / "assay.exe", folder)
    document = document_of(host=folder / "library_host.exe", **NO_OPENCL_PLATFORM)
    assert document["outcome"]["verdict"] == "complete"


def test_host_that_loads_and_unloads_it():
    """After a run the DLL stays, since threads of the run may be in it."""
    dll, child = BIN / "assay-host.dll", BIN / "test_child.exe"
    run = run_under_wine(dll, program=BIN / "loading_host.exe")
    assert run.lines == ["loaded", "unloaded"]
    run = run_under_wine(dll, child, program=BIN / "loading_host.exe")
    assert run.lines == ["loaded", "failed-tests", "stays"]


def test_error_of_an_option():
    run = run_under_wine("-1", program=HOST, **NO_OPENCL_PLATFORM)
    assert run.status == 1
    assert text_of(run.err).strip() == "library_host: a value is out of its range"
