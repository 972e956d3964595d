"""What a host is told of OpenGL and OpenCL on machines whose drivers fail in every way that can be
scripted: the member `usable` of the document, the rows of the text form and the exit status by
--need. The table of all of them is written to usable.md in the build folder."""

import ctypes.util
import os
from dataclasses import dataclass

import pytest

from calls import FullMachine
from harness import BUILD, EMULATED, PROGRAM, PROGRAM_AT_ROOT, record_so_far
from hosting import host_run_until
from validate import validate_document, validate_events

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")

NEEDED = {"hardware": 0, "software": 20, "broken": 21, "absent": 22, "unknown": 23}
# What leaves a host that needs both the least comes first.
WORST = ["broken", "absent", "unknown", "software", "hardware"]

GOOD_GL = ("hardware", "trials-passed", "glgpu[0]")
GOOD_CL = ("hardware", "trials-passed", "clgpu[0]")
BEFORE = ("unknown", "ended-before", None)


def crashed(device=None):
    return ("broken", "crashed", device)


def ended(device=None):
    return ("broken", "ended", device)


@dataclass
class Failure:
    gl: str = ""  # lines of the OpenGL driver's script
    cl: str = ""
    child: tuple = ()
    opengl: tuple = GOOD_GL
    opencl: tuple = GOOD_CL
    egl: str = "scripted"
    loader: str = "empty"
    program: object = PROGRAM_AT_ROOT


FAILURES = {
    "none": Failure(),
    # OpenGL: the library, the display devices, the contexts
    "no EGL library": Failure(egl="absent", opengl=("absent", "no-library", None)),
    "no display device": Failure(gl="at eglQueryDevicesEXT claim 0\nat eglInitialize return 0\n",
                                 opengl=("absent", "no-device", None)),
    "no display": Failure(gl="at eglInitialize return 0\n",
                          opengl=("broken", "context-failed", None)),
    "no context": Failure(gl="at eglCreateContext error EGL_BAD_ALLOC\n",
                          opengl=("broken", "context-failed", None)),
    "no configuration": Failure(gl="at eglChooseConfig claim 0\n",
                                opengl=("broken", "context-failed", None)),
    "crash in the first call": Failure(gl="at eglInitialize crash\n", opengl=crashed(),
                                       opencl=BEFORE),
    "crash in the first context": Failure(gl="at 1 eglCreateContext crash\n", opengl=crashed(),
                                          opencl=BEFORE),
    "crash in the device's context": Failure(gl="at 2 eglCreateContext crash\n", opengl=crashed(),
                                             opencl=BEFORE),
    "hang in the first context": Failure(gl="at 1 eglCreateContext hang\n",
                                         opengl=("broken", "hung", None), opencl=BEFORE),
    # OpenGL: queries and trials
    "query fails before the trials": Failure(
        gl="at glGetString(GL_VENDOR) error GL_INVALID_OPERATION\n",
        opengl=("broken", "device-failed", "glgpu[0]")),
    "query fails after the trials": Failure(
        gl="at glGetIntegerv(GL_MAX_DRAW_BUFFERS) error GL_INVALID_OPERATION\n"),
    "exception in a query": Failure(gl='at glGetString(GL_RENDERER) throw "x"\n',
                                    opengl=("broken", "device-failed", "glgpu[0]")),
    "shader does not compile": Failure(gl='vertex-fails "no"\n',
                                       opengl=("broken", "shader-trial-failed", "glgpu[0]")),
    "program does not link": Failure(gl="link-fails\n",
                                     opengl=("broken", "shader-trial-failed", "glgpu[0]")),
    "framebuffer is not complete": Failure(
        gl="at glCheckFramebufferStatus return 0\n",
        opengl=("broken", "framebuffer-trial-failed", "glgpu[0]")),
    "crash in the compiler": Failure(gl="at glCompileShader crash\n", opengl=crashed("glgpu[0]"),
                                     opencl=BEFORE),
    "abort in the linker": Failure(gl="at glLinkProgram abort\n", opengl=crashed("glgpu[0]"),
                                   opencl=BEFORE),
    "hang in the clear": Failure(gl="at glClear hang\n", opengl=("broken", "hung", "glgpu[0]"),
                                 opencl=BEFORE),
    "driver exits": Failure(gl="at glLinkProgram exit 42\n", opengl=ended("glgpu[0]"),
                            opencl=BEFORE),
    "driver exits with 0": Failure(gl="at glLinkProgram _exit 0\n", opengl=ended("glgpu[0]"),
                                   opencl=BEFORE),
    # A driver that writes to the child's streams
    "words before lines of the report": Failure(gl='at eglMakeCurrent print 1 "x"\n',
                                                opengl=("unknown", "unreadable", None)),
    "words before the failure of the contexts": Failure(
        gl='at eglInitialize print 2 "x"\nat eglCreateContext error EGL_BAD_ALLOC\n',
        opengl=("broken", "context-failed", None)),
    "flood before the failure of the contexts": Failure(
        gl="at 1 eglInitialize flood 2 20000 100\nat eglCreateContext error EGL_BAD_ALLOC\n",
        opengl=("broken", "context-failed", None)),
    "flood in the linker": Failure(gl="at 1 glLinkProgram flood 1 100000 1000\n",
                                   opengl=("unknown", "unreadable", None), opencl=BEFORE),
    # A renderer that is none
    "software renderer": Failure(gl='string GL_RENDERER "llvmpipe (LLVM 15.0.6, 256 bits)"\n',
                                 opengl=("software", "only-software", "glgpu[0]")),
    "software that fails, too": Failure(
        gl='string GL_RENDERER "softpipe"\nfragment-fails\n',
        opengl=("broken", "shader-trial-failed", "glgpu[0]")),
    # OpenCL
    "no OpenCL loader": Failure(loader="absent", opencl=("absent", "no-library", None)),
    "no OpenCL device": Failure(cl="claim-devices 0\n", opencl=("absent", "no-device", None)),
    "crash in the platforms": Failure(cl="at clGetPlatformInfo crash\n", opencl=crashed()),
    "crash in the list of devices": Failure(cl="at clGetDeviceIDs crash\n", opencl=crashed()),
    "hang in the list of devices": Failure(cl="at clGetDeviceIDs hang\n",
                                           opencl=("broken", "hung", None)),
    "list of devices fails": Failure(cl="at clGetDeviceIDs error CL_OUT_OF_RESOURCES\n",
                                     opencl=ended()),
    "crash in the copy": Failure(cl="at clEnqueueCopyBuffer crash\n", opencl=crashed("clgpu[0]")),
    "abort in the compiler": Failure(cl="at clBuildProgram abort\n", opencl=crashed("clgpu[0]")),
    "hang in the kernel": Failure(cl="at clWaitForEvents hang\n",
                                  opencl=("broken", "hung", "clgpu[0]")),
    "no OpenCL context": Failure(cl="at clCreateContext error CL_OUT_OF_RESOURCES\n",
                                 opencl=("broken", "device-failed", "clgpu[0]")),
    "no OpenCL buffer": Failure(cl="at clCreateBuffer error CL_OUT_OF_RESOURCES\n",
                                opencl=("broken", "device-failed", "clgpu[0]")),
    "kernel does not compile": Failure(cl="at clBuildProgram error CL_BUILD_PROGRAM_FAILURE\n",
                                       opencl=("broken", "device-failed", "clgpu[0]")),
    "processor by PoCL": Failure(
        cl='text CL_DEVICE_VERSION "OpenCL 3.0 PoCL HSTR: cpu-x86_64-pc-linux-gnu-haswell"\n',
        opencl=("software", "only-software", "clgpu[0]")),
    "clock that stands still": Failure(cl="copy-ns 0\nkernel-ns 0\n"),
    # Both answers are there before these.
    "crash when a context is given back": Failure(gl="at 2 eglDestroyContext crash\n"),
    # The child's own
    "no child": Failure(program="/no/such/program", opengl=("unknown", "never-started", None),
                        opencl=("unknown", "never-started", None)),
    "bad command line": Failure(child=("-bogus",), opengl=("unknown", "usage-error", None),
                                opencl=("unknown", "usage-error", None)),
    "programmed crash at the start": Failure(child=("-crashAfter=1",), opengl=BEFORE,
                                             opencl=BEFORE),
    "programmed crash in OpenGL": Failure(child=("-crashAfter=5",), opengl=ended(), opencl=BEFORE),
    "programmed throw in OpenCL": Failure(child=("-throwAfter=42",), opencl=ended("clgpu[0]")),
}


def hangs(failure, records):
    """Whether the child has made the call in which it hangs."""
    for library, record in records.items():
        rule = getattr(failure, library).split()
        if rule[-1:] == ["hang"]:
            times = int(rule[1]) if rule[1].isdigit() else 1
            return sum(call.name == rule[-2] for call in record_so_far(record)) >= times
    return False


def run(folder, failure, *options):
    records = {"gl": folder / "gl-record", "cl": folder / "cl-record"}
    lines = {}
    for library, record in records.items():
        record.unlink(missing_ok=True)
        lines[library] = f"record {record}\n" + getattr(failure, library)
    host, found = FullMachine(folder).host("run", lines["gl"], lines["cl"])
    found.update(egl=failure.egl, opencl=failure.loader)
    child = ["--", *failure.child] if failure.child else []
    return host_run_until(lambda: hangs(failure, records), folder, "run", "--assay",
                          str(failure.program), *options, environment=host.environment(**found),
                          child=child)


def answer_of(usable, name):
    return (usable[name]["answer"], usable[name]["reason"], usable[name]["device"])


ROWS = {}


@pytest.fixture(scope="module", autouse=True)
def table():
    yield
    head = "| failure | OpenGL | OpenCL |\n|---|---|---|\n"
    rows = [f"| {name} | {' '.join(filter(None, gl))} | {' '.join(filter(None, cl))} |\n"
            for name, (gl, cl) in ROWS.items()]
    if not os.access(BUILD, os.W_OK):
        return
    (BUILD / "usable.md").write_text(head + "".join(rows), encoding="utf-8")


NO_CHILD = pytest.param("no child", marks=pytest.mark.skipif(
    EMULATED, reason="the emulator loses the failure of a start"))


@pytest.mark.parametrize("name", [NO_CHILD if name == "no child" else name for name in FAILURES])
def test_a_failure(tmp_path, name):
    failure = FAILURES[name]
    hosted = run(tmp_path, failure, "--format", "json", "--need", "both")
    usable = validate_document(hosted.out)["usable"]
    ROWS[name] = (answer_of(usable, "opengl"), answer_of(usable, "opencl"))
    assert ROWS[name] == (failure.opengl, failure.opencl)
    worst = min(usable["opengl"]["answer"], usable["opencl"]["answer"], key=WORST.index)
    assert hosted.status == NEEDED[worst]


@pytest.mark.parametrize("name", ["none", "software renderer", "crash in the copy",
                                  "no OpenCL loader", NO_CHILD])
def test_each_form_and_each_need(tmp_path, name):
    failure = FAILURES[name]
    for need, answer in (("opengl", failure.opengl), ("opencl", failure.opencl)):
        events = run(tmp_path, failure, "--format", "jsonl", "--need", need)
        last = validate_events(events.out)[-1]
        assert answer_of(last["usable"], need) == answer
        assert events.status == NEEDED[answer[0]]
        shown = run(tmp_path, failure, "--need", need)
        label = {"opengl": "OpenGL", "opencl": "OpenCL"}[need]
        device = f" ({answer[2]})" if answer[2] else ""
        assert any(line.split()[:1] == [label] and f" {answer[0]}{device}: " in line
                   for line in shown.text.splitlines())
        assert shown.status == NEEDED[answer[0]]


# The key of a failure, and what the log says of it.
CAUSES = {
    "no EGL library": ("QGFOGLInitialized", "libEGL.so.1 can't be opened"),
    "no context": ("OGLContextCreated", "EGL_BAD_ALLOC (0x3003)"),
    "shader does not compile": ("glgpu[0].CanCompileProgramGLSL", "no"),
    "framebuffer is not complete": ("glgpu[0].GLFrameBufferOK", "The framebuffer is not complete"),
    "query fails before the trials": ("glgpu[0].GLVendor", "glGetError() returns 1282"),
    "query fails after the trials": ("glgpu[0].glGetIntegerv[GL_MAX_DRAW_BUFFERS]",
                                     "glGetError() returns 1282"),
    "exception in a query": ("glgpu[0].GLRenderer", "x"),
    "no OpenCL context": ("clgpu[0].CLBandwidth", "clCreateContext failed: CL_OUT_OF_RESOURCES (-5)"),
    "kernel does not compile": ("clgpu[0].CLCompute", "Failed requirement: ciErrNum == CL_SUCCESS"),
}


@pytest.mark.parametrize("name", CAUSES)
def test_the_cause_reaches_the_reader(tmp_path, name):
    key, text = CAUSES[name]
    hosted = run(tmp_path, FAILURES[name], "--format", "json")
    document = validate_document(hosted.out)
    assert [cause for cause in document["outcome"]["causes"]
            if cause["key"] == key and text in cause["text"]]
    assert [warning for warning in document["warnings"]
            if warning["cause"] is not None and text in warning["cause"]]
    # The log is no part of the report.
    assert {line["kind"] for line in document["lines"]} == {"value"}
    shown = " ".join(run(tmp_path, FAILURES[name]).text.split())
    assert text in shown
    # One who asks for the log, or for none, gets that. The answers are the same.
    loud = Failure(**{**FAILURES[name].__dict__, "child": ("-verbose=1",)})
    asked = validate_document(run(tmp_path, loud, "--format", "json").out)
    assert {line["kind"] for line in asked["lines"]} == {"value", "comment"}
    assert asked["outcome"]["causes"] == document["outcome"]["causes"]
    assert asked["usable"] == document["usable"]
    silent = Failure(**{**FAILURES[name].__dict__, "child": ("-verbose=0",)})
    document = validate_document(run(tmp_path, silent, "--format", "json").out)
    assert document["outcome"]["causes"] == []


def test_the_first_schema(tmp_path):
    hosted = run(tmp_path, FAILURES["none"], "--format", "json", "--schema", "1")
    document = validate_document(hosted.out)
    assert document["schema"] == 1
    assert "usable" not in document
    events = validate_events(run(tmp_path, FAILURES["none"], "--format", "jsonl", "--schema", "1").out)
    assert events[0]["schema"] == 1
    assert "usable" not in events[-1]


def test_the_machine_is_named_on_request(tmp_path):
    for options, known in (([], False), (["--identify"], True)):
        hosted = run(tmp_path, FAILURES["no child"], "--format", "json", *options)
        environment = validate_document(hosted.out)["environment"]
        assert environment["host"]["known"] == known
        assert environment["kernel"]["known"]


def test_the_childs_version(tmp_path):
    """Read from its file, also of a child that can't run to its end."""
    for name, program in (("crash in the copy", PROGRAM), ("no child", "/no/such/program")):
        failure = Failure(**{**FAILURES[name].__dict__, "program": program})
        versions = validate_document(run(tmp_path, failure, "--format", "json").out)["versions"]
        if program == PROGRAM:
            assert versions["assay"] == versions["assay-host"]
        else:
            assert versions["assay"] == {"known": False, "reason": "its file can't be read"}
