"""Drivers that misbehave: their texts reach the report unchanged, and their failures end the tests of
one GPU or the child, but never garble the report."""

import resource

import pytest

from clmodel import escaped
from harness import ended_by
from model import Gpu, check, predict

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
    """At worst the GPU fails; the run completes."""
    gpu = Gpu(version=version)
    run = host.run(script=gpu.script() + f"string {name} null\n")
    assert run.status in (0, 2)
    assert run.lines[-1] == 'assayEnd="STAMP"'
    assert (run.errors == []) == (run.status == 0)


@pytest.mark.parametrize("version", ["", "4", "four", "OpenGL ES 3.2", "-1.5", "99999999999.1",
                                     ".", "4.", "\udcff", "0.0"], ids=repr)
def test_malformed_versions(host, version):
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
def test_absurd_answers(host, line):
    """Absurd answers of a driver, above all in counts and sizes: the run completes with whole lines,
    and needs little processor time."""
    for version in ("2.1 Scripted", "4.6 Scripted"):
        run = host.run(script=Gpu(version=version).script() + line + "\n",
                       before=lambda: resource.setrlimit(resource.RLIMIT_CPU, (20, 20)))
        assert run.status in (0, 2)
        assert run.lines[-1] == 'assayEnd="STAMP"'


def calls_of(host, gpu):
    """The driver calls of an undisturbed run."""
    run = host.run(script=host.fresh_record() + gpu.script())
    assert run.status == 0
    return host.record()


@pytest.mark.parametrize("action, signals", [
    ("abort", ["SIGABRT"]), ("signal 8", ["SIGFPE"]), ("signal 4", ["SIGILL"]),
    ("signal 7", ["SIGBUS"]), ("signal 9", ["SIGKILL"])])
def test_other_signals(host, action, signals):
    gpu = Gpu()
    whole = predict([gpu]).lines
    for name in ("eglQueryString", "eglCreateContext", "glCompileShader", "glClear"):
        run = host.run(script=gpu.script() + f"at {name} {action}\n")
        assert ended_by(run, *signals)
        assert run.lines == whole[:len(run.lines)]


def test_driver_that_exits(host):
    gpu = Gpu()
    for name in ("eglInitialize", "glGetString", "glLinkProgram"):
        run = host.run(script=gpu.script() + f"at {name} exit 42\n")
        assert run.status == 42
        assert run.lines == predict([gpu]).lines[:len(run.lines)]


def test_driver_that_prints(host):
    """A driver's messages on standard error are kept; on standard output they are between lines."""
    gpu = Gpu()
    run = host.run(script=gpu.script() + 'at 1 eglInitialize print 2 "libEGL warning: x\\n"\n'
                   'at glLinkProgram print 1 "driver: y\\n"\n')
    assert run.errors == ["libEGL warning: x"]
    assert [line for line in run.lines if line != "driver: y"] == predict([gpu]).lines
    assert run.lines.count("driver: y") == 1


def test_objects_are_released(host):
    """Every object of an undisturbed run is released, and no context stays current."""
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


def test_shader_sources(host):
    """The driver receives 13 and 76 strings, each ended by a zero."""
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
    """The clear: white with components of 255, only the colour buffer, 32 by 32."""
    calls = calls_of(host, Gpu())
    assert [call.arguments for call in calls if call.name == "glClearColor"] == ["255 255 255 255"]
    assert [call.arguments for call in calls if call.name == "glClear"] == ["0x4000"]
    sizes = [call.arguments.split()[3:5] for call in calls if call.name == "glTexImage2D"]
    assert sizes == [["32", "32"]]
