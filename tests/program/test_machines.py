"""Machines: the real driver, many devices, none at all, a bare environment."""

import os
import re
import subprocess

import pytest

from adapters import Adapter, write_tree
from harness import PROGRAM, SANITIZED_BY, libraries_of
from model import KEYS, Gpu, check, predict, script_of


def test_real_driver(host):
    """The report of the machine's own EGL and OpenGL."""
    run = host.run(egl="real")
    assert run.lines[:2] == ['Tester="Pixmere"', 'assayStart="STAMP"']
    if run.facts["NumGLGPUs"] == "0":
        pytest.skip("this machine has no EGL device on which a context can be made")
    assert run.lines[2:5] == ["QGFCoreInitialized=1", "QGFOGLInitialized=1",
                              "OGLContextCreated=1"]
    assert run.lines[5].startswith("NumGLGPUs=")
    keys = [line.split("=")[0] for line in run.lines[6:]]
    assert keys[:15 * int(run.facts["NumGLGPUs"]):int(run.facts["NumGLGPUs"])] == [
        f"glgpu[0].{key}" for key in KEYS]
    assert re.fullmatch(r'"[1-4]\.[0-6]"', run.facts["glgpu[0].GLVersion"])
    assert int(run.facts["glgpu[0].GLRectTextureSize"]) >= 1024
    assert run.facts["glgpu[0].GLVendor"] != '""'
    assert run.facts["glgpu[0].GLRenderer"] != '""'
    assert run.facts["glgpu[0].CanCompileProgramGLSL"] == "1"
    assert run.facts["glgpu[0].GLFrameBufferOK"] == "1"
    assert run.lines[-1] == 'assayEnd="STAMP"'
    assert run.status == 0


def test_real_driver_is_the_same_twice(host):
    """A run doesn't depend on the previous one."""
    assert host.run(egl="real").report == host.run(egl="real").report


def test_real_driver_without_a_gpu(host):
    """Mesa's software renderer alone: one device that no adapter matches."""
    run = host.run("-verbose=1", egl="real")
    if "llvmpipe" not in run.facts.get("glgpu[0].GLRenderer", ""):
        pytest.skip("the first OpenGL device of this machine isn't Mesa's software renderer")
    assert run.facts["NumGLGPUs"] == "1"
    assert run.facts["glgpu[0].GLName"] == '""'
    assert run.facts["glgpu[0].GLVendorID"] == "0"
    assert run.facts["glgpu[0].GLRendererID"] == "0"
    assert run.facts["glgpu[0].GLDriver"] == '"?"'
    assert run.facts["glgpu[0].GLDriverVersion"] == '"?"'
    assert run.facts["glgpu[0].GLDriverDate"] == '"?"'
    assert any("no matching WMI or DXGI devices found" in line for line in run.comments)


def test_no_graphics_library_is_linked():
    listed = libraries_of(PROGRAM)
    assert "libc.so.6" in listed
    assert not re.search(r"lib(GL|EGL|GLX|GLES|OpenGL|OpenCL|gbm|vulkan)", " ".join(listed))


@pytest.mark.parametrize("opencl", ["absent", "empty"])
def test_no_egl_library(host, opencl):
    run = host.run(egl="absent", opencl=opencl)
    check(run, predict([], ogl=0, opencl=None if opencl == "absent" else 0))
    assert run.status == 0


def test_no_egl_library_is_logged(host):
    run = host.run("-verbose=1", egl="absent")
    assert any("QGF::OGL::Library::initialize() failed: " in line for line in run.comments)
    assert run.status == 0


def test_library_without_egl(host, tmp_path):
    """A library of that name without any EGL function."""
    folder = tmp_path / "wrong"
    folder.mkdir()
    for name in ("libEGL.so.1", "libEGL.so"):
        (folder / name).symlink_to(libraries_of(PROGRAM)["libm.so.6"])
    host.variables["LD_LIBRARY_PATH"] = \
        f"{folder}:{host.environment(egl='absent')['LD_LIBRARY_PATH']}"
    check(host.run(egl="absent"), predict([], ogl=0))


def test_no_device(host):
    check(host.run(script="# EGL without a device\n"), predict([], ogl=0))


@pytest.mark.parametrize("count", [2, 9])
def test_many_devices(host, tmp_path, count):
    """Each with its own adapter's name, ids and memory, in the adapters' order."""
    adapters = [Adapter(index, f"Card number {index}", memory_mb=1024 * (index + 1),
                        device_id=0x7300 + index) for index in range(count)]
    gpus = [Gpu(renderer=f"Renderer {index}", rectangle=1000 + index, adapter=adapter)
            for index, adapter in enumerate(adapters)]
    write_tree(tmp_path / "root", adapters)
    check(host.run(script=script_of(gpus), root=tmp_path / "root"), predict(gpus))


def test_adapter_that_egl_does_not_know(host, tmp_path):
    """The second card has no context and isn't reported."""
    adapters = [Adapter(0, "Known"), Adapter(1, "Unknown")]
    gpus = [Gpu(adapter=adapters[0])]
    write_tree(tmp_path / "root", adapters)
    run = host.run("-verbose=1", script=script_of(gpus), root=tmp_path / "root")
    assert [line for line in run.lines if not line.startswith("# ")] == predict(gpus).lines
    assert any(line.endswith("QGF Device for DXGI Unknown not found") for line in run.comments)
    assert any(line.endswith("QGF Device for WMI Unknown not found") for line in run.comments)


def test_software_beside_a_card(host, tmp_path):
    """A software renderer isn't reported on a machine with a card."""
    adapter = Adapter(0, "Card")
    gpus = [Gpu(adapter=adapter), Gpu(renderer="software")]
    write_tree(tmp_path / "root", [adapter])
    check(host.run(script=script_of(gpus), root=tmp_path / "root"), predict(gpus[:1]))


def test_bare_environment(host):
    """No HOME, no DISPLAY, no PATH, only the paths of the libraries."""
    gpu = Gpu()
    check(host.run(script=gpu.script(), clear=True), predict([gpu]))


def test_bare_environment_with_the_real_driver(host):
    """Only the driver's messages on standard error may differ."""
    full = host.run(egl="real")
    host.variables.update(HOME="", DISPLAY="", XDG_RUNTIME_DIR="", WAYLAND_DISPLAY="")
    bare = host.run(egl="real")
    assert bare.report == full.report
    assert bare.status == full.status


def test_environment_is_not_read(host):
    """Variables that other programs read have no effect."""
    gpu = Gpu()
    host.variables.update(GPUAssay="1", ASSAY_VERBOSE="1", VERBOSE="1", AssayDebugFlags="GPUAssay=1",
                          LANG="de_DE.UTF-8", LC_ALL="de_DE.UTF-8", POSIXLY_CORRECT="1")
    check(host.run(script=gpu.script()), predict([gpu]))


def test_deleted_working_directory(host, tmp_path):
    gone = tmp_path / "gone"
    gone.mkdir()

    def leave():
        os.chdir(gone)
        os.rmdir(gone)

    gpu = Gpu()
    check(host.run(script=gpu.script(), before=leave), predict([gpu]))


@pytest.mark.skipif("undefined" in SANITIZED_BY,
                    reason="the undefined behaviour sanitizer needs a descriptor for its checks")
def test_no_file_descriptors_left(host):
    """A library that can't be opened counts as missing."""
    # One descriptor more than the streams: enough to load a library, not to open two files.
    run = subprocess.run(
        ["/bin/sh", "-c", 'ulimit -n 4; exec "$0"', str(PROGRAM)], capture_output=True,
        env=host.environment(egl="real"), timeout=60, check=False)
    assert run.returncode in (0, 2)
    assert b'\nassayEnd="' in run.stdout
