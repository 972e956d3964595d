"""Every OpenGL line of the report with the machine's own driver, compared with other sources.

SOURCES has the sources for each line of the report. A line without a row fails the test. Only the values
of the system's adapter lists for real hardware are left to the tests of those lists.
"""

import contextlib
import json
import os
import re
import shutil
import subprocess
import sys
from dataclasses import dataclass
from pathlib import Path

import pytest

import gl_peer
from harness import TREE

NEWEST_VERSION = "4.1"

# The value that no adapter list has for a software renderer.
UNKNOWN = '"?"'

# Replaces an answer that other tests compare, with recorded lists.
OF_THE_LISTS = object()


@dataclass
class Peers:
    """The answers of the other sources for one device."""

    egl: dict  # of gl_peer.py
    glx: object  # of glxinfo, or None if it has none for this driver
    devices: list  # of eglinfo, for each EGL device

    @property
    def hardware(self):
        return [device for device in self.devices if "EGL_MESA_device_software" not in device]


def version(text):
    found = re.match(r"(\d+)\.(\d+)", text)
    return f'"{min(f"{found[1]}.{found[2]}", NEWEST_VERSION)}"' if found else None


def extension_name(name):
    """GL_ARB_VERTEX_PROGRAM -> GL_ARB_vertex_program."""
    return re.sub(r"^(GL_[A-Z]+_)(.+)$", lambda found: found[1] + found[2].lower(), name)


# Extensions that became part of OpenGL unchanged: a driver may omit their names.
CORE_SINCE = {
    "GL_ARB_VERTEX_SHADER": "2.0", "GL_ARB_FRAGMENT_SHADER": "2.0",
    "GL_EXT_FRAMEBUFFER_OBJECT": "3.0", "GL_ARB_TEXTURE_RECTANGLE": "3.1",
    "GL_ARB_OCCLUSION_QUERY": "1.5", "GL_ARB_VERTEX_BUFFER_OBJECT": "1.5",
    "GL_ARB_TEXTURE_NON_POWER_OF_TWO": "2.0",
}


def offered(name, listed, version_text):
    core = name in CORE_SINCE and version_text[:3] >= CORE_SINCE[name]
    return str(int(extension_name(name) in listed or core))


NPOT = "GL_ARB_TEXTURE_NON_POWER_OF_TWO"


def egl_string(name):
    return lambda peers, _: f'"{peers.egl["strings"][name]}"'


def glx_string(name):
    return lambda peers, _: peers.glx and f'"{peers.glx["strings"][name]}"'


def egl_extension(peers, name):
    return offered(name, peers.egl["extensions"], peers.egl["strings"]["GL_VERSION"])


def glx_extension(peers, name):
    return peers.glx and offered(name, peers.glx["extensions"], peers.glx["strings"]["version"])


def limit(value):
    return None if value is None else str(value)


def glx_limit(peers, *names):
    """The first of these names that glxinfo prints."""
    values = [peers.glx["limits"][name] for name in names if name in peers.glx["limits"]] \
        if peers.glx else []
    return values[0] if values else None


def in_list(value):
    return None if value is None else f"[{value}]"


def adapter_id(file):
    """The id by sysfs for a device with a DRM node, and 0 for a software renderer."""
    def ask(peers, _):
        if peers.egl["software"]:
            return "0"
        node = peers.egl["node"]
        path = Path("/sys/class/drm") / Path(node or "none").name / "device" / file
        return str(int(path.read_text(encoding="ascii"), 16)) if path.exists() else OF_THE_LISTS
    return ask


def of_software(value):
    return lambda peers, _: value if peers.egl["software"] else OF_THE_LISTS


def number_in_documentation(_, name):
    text = (TREE / "docs" / "report-format.md").read_text(encoding="utf-8")
    found = re.search(rf"\| `QGF::OGL::{name}` \| (\d+) \|", text)
    return found and found[1]


def some_device(peers, _):
    return str(int(bool(peers.devices)))


EGL = "libEGL by itself"
GLX = "glxinfo"
EGLINFO = "eglinfo"
HEADERS = "Khronos' headers"
ADAPTERS = "the system's adapters"

# The line, the source, and a function of the peers and the name in the line that returns the value; None
# if the source doesn't know it, so that another one must.
SOURCES = [
    (r"QGFOGLInitialized", EGLINFO, some_device),
    (r"OGLContextCreated", EGL, lambda peers, _: str(int("failed" not in peers.egl))),
    (r"NumGLGPUs", EGLINFO, lambda peers, _: str(len(peers.hardware) or len(peers.devices))),

    (r"glgpu\[\d+\]\.GLVersion", EGL,
     lambda peers, _: version(peers.egl["strings"]["GL_VERSION"])),
    (r"glgpu\[\d+\]\.GLVersion", GLX,
     lambda peers, _: peers.glx and version(peers.glx["strings"]["version"])),
    (r"glgpu\[\d+\]\.GLVendor", EGL, egl_string("GL_VENDOR")),
    (r"glgpu\[\d+\]\.GLVendor", GLX, glx_string("vendor")),
    (r"glgpu\[\d+\]\.GLRenderer", EGL, egl_string("GL_RENDERER")),
    (r"glgpu\[\d+\]\.GLRenderer", GLX, glx_string("renderer")),
    (r"glgpu\[\d+\]\.GLRectTextureSize", EGL,
     lambda peers, _: limit(peers.egl["integers"]["GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB"])),
    (r"glgpu\[\d+\]\.GLRectTextureSize", GLX,
     lambda peers, _: glx_limit(peers, "GL_MAX_RECTANGLE_TEXTURE_SIZE",
                                "GL_MAX_RECTANGLE_TEXTURE_SIZE_NV")),
    (r"glgpu\[\d+\]\.HasGLNPOTSupport", EGL, lambda peers, _: egl_extension(peers, NPOT)),
    (r"glgpu\[\d+\]\.HasGLNPOTSupport", GLX, lambda peers, _: glx_extension(peers, NPOT)),
    (r"glgpu\[\d+\]\.CanCompileProgramGLSL", EGL,
     lambda peers, _: str(int(peers.egl["compiles"]))),
    (r"glgpu\[\d+\]\.GLFrameBufferOK", EGL, lambda peers, _: str(int(peers.egl["framebuffer"]))),

    (r"glgpu\[\d+\]\.GLVendorID", ADAPTERS, adapter_id("vendor")),
    (r"glgpu\[\d+\]\.GLRendererID", ADAPTERS, adapter_id("device")),
    (r"glgpu\[\d+\]\.IsIntegratedGLGPU", ADAPTERS, of_software("0")),
    (r"glgpu\[\d+\]\.GLMemoryMB", ADAPTERS, of_software("0")),
    (r"glgpu\[\d+\]\.GLName", ADAPTERS, of_software('""')),
    (r"glgpu\[\d+\]\.GLDriverVersion", ADAPTERS, of_software(UNKNOWN)),
    (r"glgpu\[\d+\]\.GLDriver", ADAPTERS, of_software(UNKNOWN)),
    (r"glgpu\[\d+\]\.GLDriverDate", ADAPTERS, of_software(UNKNOWN)),

    (r"gputag\.(GL_\w+)", HEADERS, lambda _, name: limit(gl_peer.constants().get(name))),
    (r"gputag\.QGF::OGL::(\w+)", "docs/report-format.md", number_in_documentation),

    (r"glgpu\[\d+\]\.glGetString\[GL_SHADING_LANGUAGE_VERSION\]", EGL,
     egl_string("GL_SHADING_LANGUAGE_VERSION")),
    (r"glgpu\[\d+\]\.glGetString\[GL_SHADING_LANGUAGE_VERSION\]", GLX,
     glx_string("shading language version")),
    (r"glgpu\[\d+\]\.glGetIntegerv\[(\w+)\]", EGL,
     lambda peers, name: in_list(peers.egl["integers"].get(name))),
    (r"glgpu\[\d+\]\.glGetIntegerv\[(\w+)\]", GLX,
     lambda peers, name: in_list(glx_limit(peers, name, f"{name}_ARB"))),
    (r"glgpu\[\d+\]\.glGetProgramivARB\[GL_FRAGMENT_PROGRAM_ARB\]\[(\w+)\]", EGL,
     lambda peers, name: in_list(peers.egl["program"].get(name))),
    (r"glgpu\[\d+\]\.glGetProgramivARB\[GL_FRAGMENT_PROGRAM_ARB\]\[(\w+)\]", GLX,
     lambda peers, name: in_list(glx_limit(peers, f"GL_ARB_fragment_program:{name}"))),
    (r"glgpu\[\d+\]\.extension\[QGF::OGL::(\w+)\]", EGL, egl_extension),
    (r"glgpu\[\d+\]\.extension\[QGF::OGL::(\w+)\]", GLX, glx_extension),
]

# Lines that aren't about OpenGL: the tester, the time, the start of the program's own library, and
# OpenCL, which test_opencl.py compares with clinfo.
NOT_OPENGL = re.compile(r"Tester|assayStart|assayEnd|QGFCoreInitialized|NumCLGPUs|clgpu\[\d+\]\..*")


def answers(key, peers):
    """The values of a key by source: {source: value}."""
    result = {}
    for pattern, source, ask in SOURCES:
        found = re.fullmatch(pattern, key)
        if found:
            value = ask(peers, found[1] if found.re.groups else None)
            if value is not None:
                result[source] = value
    return result


def differences(facts, peers):
    """The errors in the report: a line for each value and source that differ, and for each line without
    a source.

    facts: the report's lines as a dictionary. peers: by the index of the device."""
    result = []
    for key, value in facts.items():
        if NOT_OPENGL.fullmatch(key):
            continue
        found = re.match(r"glgpu\[(\d+)\]", key)
        known = answers(key, peers[int(found[1]) if found else 0])
        if not known:
            result.append(f"{key}: no source")
        result += [f"{key}={value}, but {source} has {other}"
                   for source, other in known.items() if other not in (value, OF_THE_LISTS)]
    return result


def ask_egl(environment):
    if not gl_peer.headers_are_there():
        pytest.skip("Khronos' headers aren't installed")
    done = subprocess.run([sys.executable, gl_peer.__file__], capture_output=True, text=True,
                          env=environment, timeout=120, check=False)
    if done.returncode != 0:
        pytest.skip(f"EGL shows no devices here: {done.stderr.splitlines()[-1:]}")
    return json.loads(done.stdout)


def ask_eglinfo(environment):
    """The extensions of each EGL device."""
    if shutil.which("eglinfo") is None:
        pytest.skip("eglinfo isn't installed")
    text = subprocess.run(["eglinfo"], capture_output=True, text=True, env=environment, timeout=120,
                          check=False).stdout
    return [part.split("Platform Device")[0] for part in re.split(r"^Device #\d+:", text,
                                                                  flags=re.MULTILINE)[1:]]


@contextlib.contextmanager
def display():
    """Starts an X server, and yields the name of its display, or None if there is no Xvfb."""
    if shutil.which("Xvfb") is None:
        yield None
        return
    out, into = os.pipe()
    with subprocess.Popen(["Xvfb", "-displayfd", str(into), "-screen", "0", "640x480x24",
                           "-nolisten", "tcp"], pass_fds=[into], stdin=subprocess.DEVNULL,
                          stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL) as server:
        os.close(into)
        try:
            with os.fdopen(out) as pipe:
                name = pipe.readline().strip()
            yield f":{name}" if name else None
        finally:
            server.terminate()


def ask_glxinfo(environment):
    """The answers of glxinfo for the compatibility context; None if it doesn't work here."""
    if shutil.which("glxinfo") is None:
        return None
    with display() as name:
        if name is None:
            return None
        done = subprocess.run(["glxinfo", "-l", "-s"], capture_output=True, text=True, timeout=120,
                              env={**environment, "DISPLAY": name}, check=False)
    if done.returncode != 0:
        return None
    return read_glxinfo(done.stdout)


def read_glxinfo(text):
    result = {"strings": {}, "limits": {}, "extensions": []}
    section, extension = None, ""
    for line in text.splitlines():
        if (found := re.fullmatch(r"OpenGL ((?:\w+ )*\w+) string: (.*)", line)) is not None:
            result["strings"][found[1].removesuffix(" string")] = found[2]
        elif (found := re.fullmatch(r"(OpenGL .*):", line)) is not None:
            section = found[1]
        elif section == "OpenGL extensions" and line.startswith("    "):
            result["extensions"].append(line.strip())
        elif section == "OpenGL limits":
            if (found := re.fullmatch(r"  (\S+):", line)) is not None:
                extension = found[1]
            elif (found := re.fullmatch(r"    (GL_\w+) = (.+)", line)) is not None:
                result["limits"].setdefault(found[1], found[2])
                result["limits"][f"{extension}:{found[1]}"] = found[2]
    return result


@pytest.fixture
def machine(host):
    """The facts of a run, and the peers of each OpenGL device."""
    run = host.run(egl="real")
    assert run.status == 0
    environment = host.environment(egl="real")
    usable = [device for device in ask_egl(environment) if "failed" not in device]
    usable = [device for device in usable if not device["software"]] or usable
    count = int(run.facts["NumGLGPUs"])
    if count == 0 and not usable:
        pytest.skip("this machine has no EGL device on which a context can be made")
    assert count == len(usable)
    devices, glx = ask_eglinfo(environment), ask_glxinfo(environment)
    peers = []
    for index in range(count):
        # The order is that of the adapter lists, so that devices are matched by name.
        own = [run.facts[f"glgpu[{index}].{key}"] for key in ("GLVendor", "GLRenderer")]
        at = next((at for at, device in enumerate(usable) if own == [
            f'"{device["strings"][name]}"' for name in ("GL_VENDOR", "GL_RENDERER")]), 0)
        egl = usable.pop(at)
        same = glx and glx["strings"].get("renderer") == egl["strings"]["GL_RENDERER"]
        peers.append(Peers(egl, glx if same else None, devices))
    return run.facts, peers


def test_every_opengl_line(machine):
    facts, peers = machine
    assert differences(facts, peers) == []
    # All three checks, fifteen keys, and 43 lines of constants and extensions were compared.
    compared = [key for key in facts if not NOT_OPENGL.fullmatch(key)]
    assert len(compared) == 3 + 15 * len(peers) + 22 + 21 * len(peers)


def test_glxinfo_is_compared_too(machine):
    """It uses the same driver through GLX, and prints all values that come from OpenGL alone."""
    facts, peers = machine
    if peers[0].glx is None:
        pytest.skip("glxinfo shows no such driver here (no Xvfb, or no GLX)")
    silent = [key for key in facts if re.match(r"glgpu\[0\]", key)
              and GLX not in answers(key, peers[0]) and ADAPTERS not in answers(key, peers[0])]
    assert silent == ["glgpu[0].CanCompileProgramGLSL", "glgpu[0].GLFrameBufferOK"]


def test_a_wrong_value_is_noticed(machine):
    """A wrong value in any of the lines is an error."""
    facts, peers = machine
    for key, value in facts.items():
        if not NOT_OPENGL.fullmatch(key) and OF_THE_LISTS not in answers(key, peers[0]).values():
            errors = differences({**facts, key: value[:-1] + "7" + value[-1]}, peers)
            assert errors and all(line.startswith(f"{key}=") for line in errors), key


def test_a_line_without_a_source_is_noticed(machine):
    facts, peers = machine
    assert differences({**facts, "glgpu[0].GLNewKey": "1"}, peers) == [
        "glgpu[0].GLNewKey: no source"]
    assert differences({**facts, "glgpu[0].glGetIntegerv[GL_NEW]": "[1]"}, peers) == [
        "glgpu[0].glGetIntegerv[GL_NEW]: no source"]
    assert differences({**facts, "gputag.GL_NEW": "1"}, peers) == ["gputag.GL_NEW: no source"]
