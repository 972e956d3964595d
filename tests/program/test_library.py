"""What libassay-host answers on machines whose drivers fail in every way that can be scripted: the same
as assay-host, whose table it shares."""

import ctypes.util
import json
import subprocess
import sys
from pathlib import Path

import pytest

from calls import FullMachine
from harness import BUILD, EMULATED, SANITIZED_BY
from test_usable import FAILURES
from hosting import validate_document

LIBRARIES = sorted(BUILD.glob("lib*/**/libassay-host.so.0"))
# The library has no clock for tests: the time of a child that hangs.
HANG_SECONDS = 3

HOST = Path(__file__).with_name("library_host.py")

pytestmark = [
    pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                       reason="this machine has no OpenCL loader library"),
    pytest.mark.skipif(EMULATED, reason="Python can't load a library for another processor"),
    pytest.mark.skipif(bool(SANITIZED_BY), reason="Python can't load a library with a sanitizer"),
]


@pytest.mark.parametrize("name", FAILURES)
def test_a_failure(tmp_path, name):
    failure = FAILURES[name]
    machine, found = FullMachine(tmp_path).host("run", failure.gl, failure.cl)
    found.update(egl=failure.egl, opencl=failure.loader)
    hosted = subprocess.run(
        [sys.executable, HOST, LIBRARIES[0], str(HANG_SECONDS), failure.program, *failure.child],
        env=machine.environment(**found), stdout=subprocess.PIPE, check=True)
    told = json.loads(hosted.stdout)
    assert told["error"] == "no error"
    assert tuple(told["usable"]["opengl"]) == failure.opengl
    assert tuple(told["usable"]["opencl"]) == failure.opencl
    assert told["left_behind"] == 0
    document = validate_document(told["document"].encode())
    assert document["outcome"]["verdict"] == told["verdict"]
    for interface in ("opengl", "opencl"):
        usable = document["usable"][interface]
        assert [usable["answer"], usable["reason"], usable["device"]] == told["usable"][interface]
