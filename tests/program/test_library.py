"""What libassay-host answers on machines whose drivers fail in every way that can be scripted: the same
as assay-host, whose table it shares."""

import ctypes.util
import json
import os
import shutil
import subprocess
import sys
from pathlib import Path

import pytest

from calls import FullMachine
from harness import BUILD, EMULATED, SANITIZED_BY, TREE
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


NODE_MODULES = TREE / "build" / "node" / "node_modules"
NODE = pytest.param("js", marks=pytest.mark.skipif(
    shutil.which("node") is None or not (NODE_MODULES / "koffi").exists(),
    reason="node or its package koffi isn't there"))


@pytest.fixture(params=["c", "cpp", "py", NODE])
def example(request):
    """The command that runs an example host."""
    name = request.param
    return {"c": [BUILD / "bin" / "decide_c"], "cpp": [BUILD / "bin" / "decide_cpp"],
            "py": [sys.executable, TREE / "examples" / "decide.py"],
            "js": ["node", TREE / "examples" / "decide.js"]}[name]


def run_example(command, environment, *program):
    run = subprocess.run(
        [*command, *program], stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True,
        env={**environment, "ASSAY_HOST_LIBRARY": str(LIBRARIES[0]), "NODE_PATH": str(NODE_MODULES)})
    assert run.returncode == 0, run.stderr
    return run.stdout


@pytest.mark.parametrize("name", ["none", "no context", "no EGL library", "no OpenCL device"])
def test_the_examples(tmp_path, example, name):
    """They show the memory of the OpenGL device, whichever devices there are."""
    failure = FAILURES[name]
    machine, found = FullMachine(tmp_path).host("run", failure.gl, failure.cl)
    found.update(egl=failure.egl, opencl=failure.loader)
    shown = run_example(example, machine.environment(**found), failure.program)
    assert f"OpenGL {failure.opengl[0]}: " in shown
    assert ("MiB" in shown) == (failure.opengl[2] is not None and example[-1].suffix != ".js")


def test_the_examples_read_a_value_of_another_kind(example):
    """As a later assay may write one."""
    lines = ['assayStart="x"', "NumGLGPUs=1", 'glgpu[0].GLMemoryMB="plenty"']
    program = [BUILD / "bin" / "test_child", *(word for line in lines for word in ("out", line))]
    shown = run_example(example, os.environ, *program)
    assert "OpenGL " in shown
    assert "MiB" not in shown
