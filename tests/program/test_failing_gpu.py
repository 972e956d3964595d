"""One GPU of two fails: it gets no further lines, and the other one's are complete."""

from concurrent.futures import ThreadPoolExecutor

import pytest

from adapters import Adapter, write_tree
from model import (GL_ERROR, KEYS, STEPS_BEFORE_TESTS, Gpu, check, per_gpu_tests, predict,
                   script_of)

WHOLE_BATTERY_LINES = 43

# Driver failures that make a key test fail. The other keys don't come from the driver.
DRIVER_FAILURES = {
    "GLVersion": ('version "1.1 Scripted"', "exception: Cannot determine OGL version"),
    "GLVendor": ("at glGetString(GL_VENDOR) on {device} error GL_INVALID_OPERATION", GL_ERROR),
    "GLRectTextureSize": ("integer GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB unknown", GL_ERROR),
    "GLRenderer": ("at glGetString(GL_RENDERER) on {device} throw \"driver's own\"",
                   "exception: driver's own"),
    "CanCompileProgramGLSL": ("at glCreateProgram on {device} throw int 7", "unknown exception"),
    "GLFrameBufferOK": ("at glClear on {device} throw int 7", "unknown exception"),
}


@pytest.fixture
def two(host, tmp_path):
    adapters = [Adapter(0, "First card"), Adapter(1, "Second card")]
    gpus = [Gpu(renderer="First", adapter=adapters[0]), Gpu(renderer="Second", adapter=adapters[1])]
    write_tree(tmp_path / "root", adapters)
    host.gpus = gpus
    return host


def assert_other_is_complete(run, failed):
    other = 1 - failed
    tags = [line.split(".")[0] for line in run.lines if line.startswith("glgpu[")]
    keys = [line.split("=")[0].split(".")[1] for line in run.lines
            if line.startswith(f"glgpu[{other}].")]
    assert keys[:len(KEYS)] == KEYS
    assert tags.count(f"glgpu[{other}]") == 15 + 21
    assert run.lines[-1] == 'assayEnd="STAMP"'
    assert run.status == 2


def test_programmed_failure_in_each_test(two, tmp_path):
    """Each of the fifteen key tests, on each of the two GPUs."""
    gpus = two.gpus
    two.run(script=script_of(gpus), root=tmp_path / "root")
    cases = [(key, failed) for key in range(len(KEYS)) for failed in range(2)]

    def run_case(case):
        key, failed = case
        step = STEPS_BEFORE_TESTS + 2 * key + failed
        return step, two.run(f"-throwAfter={step}", script=tmp_path / "script",
                             root=tmp_path / "root")

    with ThreadPoolExecutor(2) as workers:
        runs = list(workers.map(run_case, cases))
    for (key, failed), (step, run) in zip(cases, runs):
        check(run, predict(gpus, throw_after=step))
        assert run.errors == ["exception: Programmed throw"]
        assert_other_is_complete(run, failed)
        # The line precedes the step, so that the failing test's line is the GPU's last one.
        own = [line for line in run.lines if line.startswith(f"glgpu[{failed}].")]
        assert [line.split("=")[0].split(".")[1] for line in own] == KEYS[:key + 1]


@pytest.mark.parametrize("failed", [0, 1])
@pytest.mark.parametrize("key", DRIVER_FAILURES)
def test_driver_failure(two, tmp_path, key, failed):
    """A key whose query fails has no line."""
    line, error = DRIVER_FAILURES[key]
    gpus = two.gpus
    scripts = [gpu.script() for gpu in gpus]
    scripts[failed] += line.format(device=failed) + "\n"
    run = two.run(script="".join(scripts), root=tmp_path / "root")
    check(run, predict(gpus, failing={(failed, key): error}))
    assert_other_is_complete(run, failed)
    own = [line for line in run.lines if line.startswith(f"glgpu[{failed}].")]
    assert [line.split("=")[0].split(".")[1] for line in own] == KEYS[:KEYS.index(key)]


def test_all_gpus_fail(two, tmp_path):
    """The sequence continues after the last GPU failed."""
    scripts = [gpu.script() + "integer GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB unknown\n"
               for gpu in two.gpus]
    run = two.run(script="".join(scripts), root=tmp_path / "root")
    check(run, predict(two.gpus, failing={(failed, "GLRectTextureSize"): GL_ERROR
                                          for failed in range(2)}))
    assert run.lines[-1] == 'assayEnd="STAMP"'


def test_whole_battery_of_one_gpu():
    """43 lines, 22 of them gputag lines, and 20 steps."""
    tests = per_gpu_tests(Gpu.values)[len(KEYS):]
    output = [line for test in tests for line in test("glgpu[0]", Gpu())]
    lines = [line for line in output if line is not None]
    assert len(lines) == WHOLE_BATTERY_LINES
    assert sum(line.startswith("gputag.") for line in lines) == 22
    assert output.count(None) == 20


@pytest.mark.parametrize("failed", [0, 1])
def test_context_that_cannot_be_created(two, tmp_path, failed):
    """A device without a context isn't listed: the other one is alone, with the first tag."""
    rule = f"at eglCreateContext on {failed} error EGL_BAD_ALLOC\n"
    run = two.run(script=script_of(two.gpus) + rule, root=tmp_path / "root")
    expected = predict([two.gpus[1 - failed]], context=failed)
    expected.errors = ["ContextOffscreen exception caught and ignored."]
    check(run, expected)


@pytest.mark.parametrize("thrown", ['throw "from C++"', "throw int 3"])
def test_exception_out_of_context_creation(two, tmp_path, thrown):
    rule = f"at eglCreateContext on 0 {thrown}\n"
    run = two.run(script=script_of(two.gpus) + rule, root=tmp_path / "root")
    expected = predict([two.gpus[1]], context=0)
    expected.errors = ["ContextOffscreen exception caught and ignored."]
    check(run, expected)


def test_no_context_on_any_device(two, tmp_path):
    rule = "at eglCreateContext error EGL_BAD_ALLOC\n"
    run = two.run(script=script_of(two.gpus) + rule, root=tmp_path / "root")
    expected = predict([], context=0)
    expected.errors = ["ContextOffscreen exception caught and ignored."] * 2
    check(run, expected)


@pytest.mark.parametrize("line, key", [
    ('vertex-fails "no such thing"', "CanCompileProgramGLSL"),
    ('fragment-fails "no such thing"', "CanCompileProgramGLSL"),
    ('link-fails "no such thing"', "CanCompileProgramGLSL"),
    ("vertex-fails", "CanCompileProgramGLSL"),
    ("at glCreateProgram return 0", "CanCompileProgramGLSL"),
    ("at glCreateShader return 0", "CanCompileProgramGLSL"),
    ("at glClearColor on 0 error GL_INVALID_OPERATION", "GLFrameBufferOK"),
    ("at glClear on 0 error GL_INVALID_FRAMEBUFFER_OPERATION", "GLFrameBufferOK"),
    ("absent glGenFramebuffers", "GLFrameBufferOK"),
    ('at glClear throw "what a driver throws"', "GLFrameBufferOK"),
    ('at glLinkProgram throw "what a driver throws"', "CanCompileProgramGLSL"),
])
def test_trials_that_fail(host, line, key):
    """A failed compilation or framebuffer is reported as 0, without a message."""
    gpu = Gpu()
    run = host.run(script=gpu.script() + line + "\n")
    expected = predict([gpu])
    expected.lines = [f"glgpu[0].{key}=0" if each == f"glgpu[0].{key}=1" else each
                      for each in expected.lines]
    check(run, expected)


def test_texture_without_memory(host):
    """The framebuffer fails, and the log has the reason. The error doesn't affect the next query."""
    gpu = Gpu()
    script = gpu.script() + "at glTexImage2D error GL_OUT_OF_MEMORY\n"
    expected = predict([gpu])
    expected.lines = [f"{each[:-1]}0" if "GLFrameBufferOK" in each else each
                      for each in expected.lines]
    check(host.run(script=script), expected)
    assert any(line.endswith("] DoGLFramebufferOK: The framebuffer is not complete: "
                             "GL_FRAMEBUFFER_INCOMPLETE_ATTACHMENT, after OpenGL error 0x0505")
               for line in host.run("-verbose=1", script=script).comments)


def test_compile_log_is_in_the_log(host):
    gpu = Gpu()
    run = host.run("-verbose=1", script=gpu.script() + 'fragment-fails "line 3: no such thing"\n')
    assert run.status == 0
    assert any("DoCompileProgramGLSL: " in line and "line 3: no such thing" in line
               for line in run.comments)
