"""Verbosity adds comments and nothing else."""

import re

import pytest

from adapters import Adapter, write_tree
from model import GL_ERROR, Gpu, check, predict, script_of

PREFIX = re.compile(r"# \d{5}\.\d{4}\.\d\d\.\d\d_\d\d:\d\d:\d\d\.\d{3}\(\+\d\d\.\d{3}\)"
                    r"\[tid=[0-9a-f]+\] ")


@pytest.mark.parametrize("opencl", ["absent", "empty"])
@pytest.mark.parametrize("count", [0, 1, 2])
@pytest.mark.parametrize("verbosity", ["1", "2", "-1"])
def test_only_comments_are_added(host, tmp_path, verbosity, count, opencl):
    gpus = [Gpu() for _ in range(count)]
    found = {}
    if count == 2:
        for index, gpu in enumerate(gpus):
            gpu.adapter = Adapter(index, f"Card {index}")
        write_tree(tmp_path / "root", [gpu.adapter for gpu in gpus])
        found["root"] = tmp_path / "root"
    found.update(script=script_of(gpus), opencl=opencl)
    silent = host.run("-verbose=0", **found)
    verbose = host.run(f"-verbose={verbosity}", **found)
    assert silent.comments == []
    assert len(verbose.comments) > count
    assert "".join(f"{line}\n" for line in verbose.lines if not line.startswith("# ")) \
        == silent.report
    assert verbose.status == silent.status == 0
    assert verbose.err == silent.err == b""


def test_form_of_comments(host):
    """Each has its number, its time, and the thread's id."""
    run = host.run("-verbose=1", script=Gpu().script())
    for number, line in enumerate(run.comments):
        assert PREFIX.match(line), line
        assert line.startswith(f"# {number:05}.")
    assert "(+00.000)" in run.comments[0]
    assert len({re.search(r"\[tid=(\w+)\]", line)[1] for line in run.comments}) == 1


def test_last_resort_is_logged(host):
    run = host.run("-verbose=1", script=Gpu().script())
    assert any(line.endswith(
        "] successful context creation but no matching WMI or DXGI devices found")
        for line in run.comments)


def test_enumeration_is_logged_in_order(host):
    run = host.run("-verbose=1", script=Gpu().script())
    messages = [PREFIX.sub("", line) for line in run.comments]
    wanted = ["wmiNumDevices=", "dxgiNumDevices=", "qgfNumDevices=1", "qgfDeviceIndex=0",
              "creating ContextOffscreen for ", "qgfDevice[0]=", "qgfNumContexts=1"]
    positions = [next(index for index, line in enumerate(messages) if line.startswith(text))
                 for text in wanted]
    assert positions == sorted(positions)


def test_failures_are_logged(host):
    gpu = Gpu()
    script = gpu.script() + "integer GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB unknown\n"
    silent = host.run(script=script)
    check(silent, predict([gpu], failing={(0, "GLRectTextureSize"): GL_ERROR}))
    verbose = host.run("-verbose=1", script=script)
    assert verbose.err == silent.err
    messages = [PREFIX.sub("", line) for line in verbose.comments]
    assert "GPUImplHardware::DoGLGetIntegerv(34040): glGetError() returns 1280" in messages
    assert "Testing terminated for glgpu[0]" in messages


def test_failed_checks_are_logged(host):
    run = host.run("-verbose=1", script="# no device\n")
    messages = [PREFIX.sub("", line) for line in run.comments]
    assert any(line.startswith("QGF::OGL::Library::initialize() failed: ") for line in messages)
    assert any(line.startswith("Cannot create default ContextOffscreen: ") for line in messages)
    assert "qgfNumDevices=0" in messages
    assert "qgfNumContexts=0" in messages
    assert not any("no matching WMI or DXGI" in line for line in messages)
