"""Runs the Windows program under Wine, like a host.

The tests share the model of reports with the Linux tests. Wine provides the machine: WMI and DXGI, WGL
on Mesa, OpenCL.dll on the Linux drivers.
"""

import contextlib
import os
import subprocess
import sys
from pathlib import Path

import pytest

TREE = Path(__file__).resolve().parents[3]
sys.path.insert(0, str(TREE / "tests" / "program"))
pytest.register_assert_rewrite("harness", "model", "clmodel")

import harness  # noqa: E402
from clmodel import cl_script_of  # noqa: E402
from model import BATTERY_EXTENSIONS, BATTERY_INTEGERS, Gpu  # noqa: E402

BUILD = Path(os.environ.get("ASSAY_BUILD_DIR", TREE / "build" / "windows")).resolve()
PROGRAM = BUILD / "bin" / "assay.exe"
SECONDS = 300  # longer than any run on a busy machine

# Mesa's OpenCL driver on the processor, presented as a GPU.
OPENCL_GPU = {"RUSTICL_ENABLE": "llvmpipe", "RUSTICL_DEVICE_TYPE": "gpu"}
NO_OPENCL_PLATFORM = {"OCL_ICD_VENDORS": "/nonexistent"}

# Wine passes OpenCL calls on to Linux drivers, so that the scripted one is that of the Linux build.
SCRIPTED_OPENCL = BUILD.parent / "linux" / "drivers" / "opencl"


def run_under_wine(*arguments, stdout=subprocess.PIPE, program=PROGRAM, cwd=None, **variables):
    """Runs the program to its end. Converts line ends to newlines."""
    done = subprocess.run([TREE / "scripts" / "run-under-wine", program, *arguments],
                          stdin=subprocess.DEVNULL, stdout=stdout, stderr=subprocess.PIPE,
                          env={**os.environ, **variables}, timeout=SECONDS, check=False, cwd=cwd)
    errors = [line for line in done.stderr.split(b"\n") if not is_noise(line)]
    return harness.Run(done.returncode, (done.stdout or b"").replace(b"\r\n", b"\n"),
                       b"\n".join(errors).replace(b"\r\n", b"\n"))


def is_noise(line):
    """Whether the line is a message of the virtual display or of Wine itself."""
    return line.startswith((b"X connection", b"Authorization required", b"wine:", b"MESA"))


@contextlib.contextmanager
def wine_desktop(**variables):
    """Keeps Wine's desktop process alive. It takes seconds to start, and if a program under test started
    it, it would hold the test's streams open and outlive the program."""
    wine = TREE / "scripts" / "run-under-wine"
    options = {"stdin": subprocess.DEVNULL, "stdout": subprocess.DEVNULL,
               "stderr": subprocess.DEVNULL, "env": {**os.environ, **variables}}
    with subprocess.Popen([wine, "C:\\windows\\system32\\notepad.exe"], **options) as window:
        try:
            # The program creates a window, so that it waits for the desktop.
            subprocess.run([wine, PROGRAM], timeout=SECONDS, check=False,
                           **{**options, "env": {**options["env"], **NO_OPENCL_PLATFORM}})
            yield
        finally:
            window.kill()


@pytest.fixture(scope="module")
def own_prefix(tmp_path_factory):
    """The folder of a Wine prefix that a test may change, with its desktop running."""
    folder = tmp_path_factory.mktemp("prefix") / "wine"
    variables = {"WINEPREFIX": str(folder)}
    wine = TREE / "scripts" / "run-under-wine"
    subprocess.run([wine, "wineboot", "--init"], stdin=subprocess.DEVNULL,
                   stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL,
                   env={**os.environ, **variables}, timeout=300, check=True)
    with wine_desktop(**variables):
        yield folder
    subprocess.run(["wineserver", "-k"], env={**os.environ, **variables}, check=False)


def scripted_opencl(folder, platforms, extra=""):
    """The variables of a run on scripted platforms. Writes the script into the folder."""
    if not SCRIPTED_OPENCL.exists():
        pytest.skip(f"the scripted OpenCL driver isn't built: {SCRIPTED_OPENCL}")
    script = folder / "script"
    script.write_text(cl_script_of(platforms) + extra)
    return {"OCL_ICD_VENDORS": str(SCRIPTED_OPENCL), "OCL_ICD_PLATFORM_SORT": "none",
            "ASSAY_SCRIPTED_OPENCL": str(script)}


def gpu_of(run):
    """The device of a report, for the prediction of other runs."""
    facts = run.facts

    def text(key):
        return facts[f"glgpu[0].{key}"].strip('"')

    def number(query):
        return int(facts[f"glgpu[0].{query}"].strip("[]"))

    return Gpu(
        vendor=text("GLVendor"), renderer=text("GLRenderer"), version=text("GLVersion"),
        language=text("glGetString[GL_SHADING_LANGUAGE_VERSION]"),
        rectangle=int(facts["glgpu[0].GLRectTextureSize"]),
        instructions=number("glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB]"
                            "[GL_MAX_PROGRAM_INSTRUCTIONS_ARB]"),
        integers=[number(f"glGetIntegerv[{name}]") for name, _ in BATTERY_INTEGERS],
        extensions=["GL_ARB_texture_non_power_of_two"] + [
            extension for name, _, extension, _ in BATTERY_EXTENSIONS
            if facts[f"glgpu[0].extension[QGF::OGL::{name}]"] == "1"])


@pytest.fixture(scope="session")
def whole_run():
    """A run without options and without an OpenCL platform."""
    return run_under_wine(**NO_OPENCL_PLATFORM)


def pytest_collection_modifyitems():
    if not PROGRAM.exists():
        raise pytest.UsageError(f"{PROGRAM} doesn't exist: build first, or set ASSAY_BUILD_DIR")
