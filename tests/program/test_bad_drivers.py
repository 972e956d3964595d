"""Drivers that misbehave: what they say reaches the report as it is, and what they do costs a GPU
or the child, never the sense of the report."""

import signal
import time
from concurrent.futures import ThreadPoolExecutor

import pytest

from harness import ended_by
from model import Gpu, check, escaped, predict

MEBIBYTE = 1 << 20


@pytest.mark.parametrize("text", [
    "",
    'with "quotes" in it',
    '"',
    "two\nlines",
    "\n",
    "carriage\rreturn",
    "back\\slash and %s %n",
    "# no comment",
    "glgpu[7].GLVendor=\"forged\"",
    "caf\u00e9 \u4e2d\u6587",
    "\udcff\udcfe\udc80",
    "\x01\x1b[31m\x7f",
    " blanks around ",
], ids=repr)
def test_texts_are_raw(host, text):
    gpu = Gpu(vendor=text, renderer=text + "2", language=text)
    run = host.run(script=gpu.script())
    assert run.report == "".join(f"{line}\n" for line in predict([gpu]).lines)
    assert run.err == b""
    assert run.status == 0


def test_huge_texts(host):
    gpu = Gpu(vendor="v" * MEBIBYTE, renderer="r" * (3 * MEBIBYTE), language="l" * MEBIBYTE)
    script = "\n".join([
        "device", "software", f"version {escaped(gpu.version)}",
        f'string GL_VENDOR repeat {MEBIBYTE} "v"', f'string GL_RENDERER repeat {3 * MEBIBYTE} "r"',
        f'string GL_SHADING_LANGUAGE_VERSION repeat {MEBIBYTE} "l"',
        f'extensions "{" ".join(gpu.extensions)}"',
        f"integer GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB {gpu.rectangle}"]) + "\n"
    check(host.run(script=script), predict([gpu]))


def test_huge_extension_list(host):
    gpu = Gpu()
    script = gpu.script() + \
        f'extensions "{" ".join(gpu.extensions)} " + repeat 200000 "GL_TEST_extension "\n'
    check(host.run(script=script), predict([gpu]))


@pytest.mark.parametrize("name", ["GL_VENDOR", "GL_RENDERER", "GL_VERSION", "GL_EXTENSIONS",
                                  "GL_SHADING_LANGUAGE_VERSION"])
@pytest.mark.parametrize("version", ["2.1 Scripted", "4.6 Scripted"])
def test_null_texts(host, name, version):
    """At worst the GPU gets no further tests; the run comes to its end."""
    gpu = Gpu(version=version)
    run = host.run(script=gpu.script() + f"string {name} null\n")
    assert run.status in (0, 2)
    assert run.lines[-1] == 'assayEnd="STAMP"'
    assert (run.errors == []) == (run.status == 0)


@pytest.mark.parametrize("version", ["", "4", "four", "OpenGL ES 3.2", "-1.5", "99999999999.1",
                                     ".", "4.", "\udcff", "0.0"], ids=repr)
def test_versions_that_are_none(host, version):
    run = host.run(script=Gpu().script() + f"version {escaped(version)}\n")
    assert run.status in (0, 2)
    assert run.lines[-1] == 'assayEnd="STAMP"'


@pytest.mark.parametrize("values", ["0", "-1", "2147483647", "-2147483648"])
def test_extreme_integers(host, values):
    value = int(values)
    gpu = Gpu(rectangle=value % 2**32, instructions=value, integers=[value] * 9)
    script = Gpu(rectangle=value, instructions=value, integers=[value] * 9).script()
    check(host.run(script=script), predict([gpu]))


@pytest.mark.parametrize("line", [
    "integer GL_NUM_EXTENSIONS 2147483647",
    "integer GL_NUM_EXTENSIONS -1",
    "integer GL_NUM_EXTENSIONS 65536",
    "at glGetShaderiv(*,GL_INFO_LOG_LENGTH) return 2147483647\nvertex-fails \"x\"",
    "at glGetShaderiv(*,GL_INFO_LOG_LENGTH) return -2147483648\nvertex-fails \"x\"",
    "at glGetProgramiv(*,GL_INFO_LOG_LENGTH) return 2147483647\nlink-fails \"x\"",
    "at eglQueryDevicesEXT return 2147483647",
    "at eglQueryDevicesEXT return -1",
    "at eglChooseConfig return 0",
    "at eglGetError return 0",
    'client-extensions null',
    'client-extensions ""',
    'display-string EGL_EXTENSIONS null',
    'display-string EGL_EXTENSIONS ""',
    'device-string EGL_EXTENSIONS null',
    'drm null',
    'drm ""',
    'drm repeat 1048576 "/"',
    'drm "../../../../etc/passwd"',
    'name null',
    "egl-version 0 0",
    "egl-version 1 4",
    "default-device 7\nclient-extensions \"\"",
    "absent glGetString",
    "absent glGetError",
    "absent glGetIntegerv",
    "absent glGetStringi glGetProgramivARB",
    "absent eglQueryDevicesEXT eglGetPlatformDisplayEXT eglGetPlatformDisplay",
    "at glGetError return 1285",
    "at glGetError return 1286",
    "at 20+ glGetError return 1287",
    "at eglMakeCurrent return 0",
    "at 5+ eglMakeCurrent error EGL_CONTEXT_LOST",
    "at eglInitialize error EGL_NOT_INITIALIZED",
    "at eglBindAPI return 0",
], ids=str)
def test_nonsense_is_survived(host, line):
    """A driver that answers nonsense, in the number and size of things above all: the run comes to
    its end quickly, with whole lines."""
    for version in ("2.1 Scripted", "4.6 Scripted"):
        run = host.run(seconds=10, script=Gpu(version=version).script() + line + "\n")
        assert run.status in (0, 2)
        assert run.lines[-1] == 'assayEnd="STAMP"'


def calls_of(host, gpu):
    """The driver calls of an undisturbed run."""
    run = host.run(script=host.fresh_record() + gpu.script())
    assert run.status == 0
    return host.record()


def run_all(host, gpu, rules, seconds=20):
    """Runs the program once with each rule added to the script."""
    def run_with(job):
        index, rule = job
        file = host.folder / f"script-{index}"
        file.write_text(gpu.script() + rule + "\n")
        return host.run(script=file, seconds=seconds)

    with ThreadPoolExecutor(2) as workers:
        return list(workers.map(run_with, enumerate(rules)))


def assert_beginning(run, whole):
    assert run.lines == whole[:len(run.lines)]


def test_crash_at_every_call(host):
    """The child dies by the signal; what it printed is a beginning of the report."""
    gpu = Gpu()
    calls = calls_of(host, gpu)
    whole = predict([gpu]).lines
    runs = run_all(host, gpu, [f"at {call.number} any crash" for call in calls])
    printed = set()
    for run, call in zip(runs, calls):
        # What follows the last line has nothing left to spoil.
        assert ended_by(run, "SIGSEGV"), call
        assert_beginning(run, whole)
        printed.add(len(run.lines))
    assert len(printed) > 20


@pytest.mark.parametrize("action, signals", [
    ("abort", ["SIGABRT"]), ("signal 8", ["SIGFPE"]), ("signal 4", ["SIGILL"]),
    ("signal 7", ["SIGBUS"]), ("signal 9", ["SIGKILL"])])
def test_other_deaths(host, action, signals):
    gpu = Gpu()
    whole = predict([gpu]).lines
    for name in ("eglQueryString", "eglCreateContext", "glCompileShader", "glClear"):
        run = host.run(script=gpu.script() + f"at {name} {action}\n")
        assert ended_by(run, *signals)
        assert_beginning(run, whole)


def test_driver_that_exits(host):
    gpu = Gpu()
    for name in ("eglInitialize", "glGetString", "glLinkProgram"):
        run = host.run(script=gpu.script() + f"at {name} exit 42\n")
        assert run.status == 42
        assert_beginning(run, predict([gpu]).lines)


def test_error_at_every_call(host):
    """An error code costs the GPU at most: the report always comes to its end."""
    gpu = Gpu()
    calls = calls_of(host, gpu)
    runs = run_all(host, gpu, [
        f"at {call.number} any error " +
        ("EGL_BAD_ALLOC" if call.name.startswith("egl") else "GL_OUT_OF_MEMORY")
        for call in calls])
    for run, call in zip(runs, calls):
        assert run.status in (0, 2), call
        assert run.lines[-1] == 'assayEnd="STAMP"', call


def test_zero_at_every_call(host):
    """Nor does a null pointer, or a 0 that should be something else."""
    gpu = Gpu(version="4.6 Scripted")
    calls = calls_of(host, gpu)
    runs = run_all(host, gpu, [f"at {call.number} any return 0" for call in calls])
    for run, call in zip(runs, calls):
        assert run.status in (0, 2), call
        assert run.lines[-1] == 'assayEnd="STAMP"', call


@pytest.mark.parametrize("thrown", ['throw "thrown by the driver"', "throw int 5"])
def test_exception_at_every_call(host, thrown):
    """An exception through the driver's C interface ends a test, the run or, where the language
    allows no other way out, the child: by SIGABRT and with the report cut between two lines."""
    gpu = Gpu()
    calls = calls_of(host, gpu)
    whole = predict([gpu]).lines
    runs = run_all(host, gpu, [f"at {call.number} any {thrown}" for call in calls])
    for run, call in zip(runs, calls):
        if run.status == -signal.SIGABRT:
            assert_beginning(run, whole)
        else:
            assert run.status in (0, 2), call
            assert run.lines[0] == whole[0]


@pytest.mark.parametrize("name", ["eglInitialize", "eglCreateContext", "glGetString",
                                  "glCompileShader", "glLinkProgram", "glClear",
                                  "eglDestroyContext"])
def test_hang(host, name):
    """Only the child hangs: the host reads what there is and ends it."""
    gpu = Gpu()
    whole = predict([gpu]).lines
    child = host.start(script=host.fresh_record() + gpu.script() + f"at {name} hang\n")
    try:
        deadline = time.monotonic() + 20
        while not any(call.name == name for call in host.record_so_far()):
            assert time.monotonic() < deadline
            time.sleep(0.01)
        assert child.poll() is None
        child.terminate()
        out, err = child.communicate(timeout=10)
    finally:
        child.kill()
        child.wait()
    assert child.returncode == -signal.SIGTERM
    assert err == b""
    lines = out.decode().split("\n")
    assert lines[-1] == ""
    assert len(lines) - 1 < len(whole)


def test_driver_that_prints(host):
    """A driver's own words on standard error pass by; on standard output they come between lines."""
    gpu = Gpu()
    run = host.run(script=gpu.script() + 'at 1 eglInitialize print 2 "libEGL warning: x\\n"\n'
                   'at glLinkProgram print 1 "driver: y\\n"\n')
    assert run.errors == ["libEGL warning: x"]
    assert [line for line in run.lines if line != "driver: y"] == predict([gpu]).lines
    assert run.lines.count("driver: y") == 1


def test_what_is_made_is_freed(host):
    """Every object of an undisturbed run is given back, and no context stays current."""
    calls = calls_of(host, Gpu())
    count = {}
    for call in calls:
        count[call.name] = count.get(call.name, 0) + 1
    for made, freed in [("eglCreateContext", "eglDestroyContext"),
                        ("glCreateShader", "glDeleteShader"),
                        ("glCreateProgram", "glDeleteProgram"),
                        ("glGenTextures", "glDeleteTextures"),
                        ("glGenFramebuffers", "glDeleteFramebuffers")]:
        assert count.get(made, 0) > 0
        assert count[made] == count.get(freed, 0), made
    current = [call.arguments.split()[-1] for call in calls if call.name == "eglMakeCurrent"]
    assert current[-1] == "none"
    assert all(call.device >= 0 for call in calls if call.name.startswith("gl"))


def test_shaders_as_the_driver_gets_them(host):
    """13 and 76 strings, each read to its end."""
    sources = [call.arguments for call in calls_of(host, Gpu()) if call.name == "glShaderSource"]
    assert len(sources) == 2
    vertex, fragment = sources
    assert vertex.split(" ")[1:3] == ["13", "null"]
    assert fragment.split(" ")[1:3] == ["76", "null"]
    assert vertex.count('"') == 2 * 13
    assert fragment.count('"') == 2 * 76
    assert vertex.split(" null ", 1)[1].startswith(
        '"void V_Sampler(void){}" "void V_Trackmatte(void){}" '
        '"void V_Blend(void){gl_TexCoord[1] = gl_MultiTexCoord1;}"')
    assert '"uniform float sample_scale; "' in fragment
    assert ('"sum_wt += weight[6];tex_coord = gl_TexCoord[0].st + sample_scale * '
            'offset_y[7] * duvdy;"') in fragment


def test_framebuffer_calls(host):
    """The clear is what is told: opaque white far out of range, colours only, 32 by 32."""
    calls = calls_of(host, Gpu())
    assert [call.arguments for call in calls if call.name == "glClearColor"] == ["255 255 255 255"]
    assert [call.arguments for call in calls if call.name == "glClear"] == ["0x4000"]
    sizes = [call.arguments.split()[3:5] for call in calls if call.name == "glTexImage2D"]
    assert sizes == [["32", "32"]]
