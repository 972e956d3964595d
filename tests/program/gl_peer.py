"""Asks the machine's EGL and OpenGL, without any code of the program under test, what the report
should have for each device, and prints it as JSON. A program of its own, so that a crash of the driver
doesn't end the tests.

The numbers of constants come from Khronos' headers.
"""

import ctypes as c
import functools
import json
import re
import sys
from pathlib import Path

GL_HEADERS = ["/usr/include/GL/gl.h", "/usr/include/GL/glext.h"]
EGL_HEADERS = ["/usr/include/EGL/egl.h", "/usr/include/EGL/eglext.h"]

STRINGS = ["GL_VENDOR", "GL_RENDERER", "GL_VERSION", "GL_SHADING_LANGUAGE_VERSION"]
INTEGERS = [
    "GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB", "GL_MAX_TEXTURE_UNITS",
    "GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS", "GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS",
    "GL_MAX_TEXTURE_IMAGE_UNITS", "GL_MAX_DRAW_BUFFERS", "GL_MAX_VERTEX_UNIFORM_COMPONENTS",
    "GL_MAX_FRAGMENT_UNIFORM_COMPONENTS", "GL_MAX_VARYING_FLOATS", "GL_MAX_VERTEX_ATTRIBS",
]
PROGRAM_INTEGERS = ["GL_MAX_PROGRAM_INSTRUCTIONS_ARB"]

# Shaders that use the built-in variables of the fixed-function pipeline, and a texture.
VERTEX = b"""
void main() { gl_TexCoord[0] = gl_MultiTexCoord0; gl_Position = ftransform(); }
"""
FRAGMENT = b"""
uniform sampler2D picture;
void main() { gl_FragColor = texture2D(picture, gl_TexCoord[0].st); }
"""

Handle = c.c_void_p


@functools.lru_cache
def constants():
    """The constants of the headers that are plain numbers."""
    found = {}
    for header in GL_HEADERS + EGL_HEADERS:
        for name, value in re.findall(r"^#define +((?:GL|EGL)_\w+)\s+(0x[0-9A-Fa-f]+|\d+)\s*$",
                                      Path(header).read_text(encoding="ascii"), re.MULTILINE):
            found[name] = int(value, 0)
    return found


def headers_are_there():
    return all(Path(header).exists() for header in GL_HEADERS + EGL_HEADERS)


def number(name):
    return constants()[name]


class Failed(Exception):
    """No context can be created on a device."""


class EGL:
    def __init__(self):
        self.egl = c.CDLL("libEGL.so.1")
        self.egl.eglGetProcAddress.restype = Handle

    def function(self, name, result, *arguments):
        address = self.egl.eglGetProcAddress(name.encode())
        if not address:
            raise Failed(f"{name} isn't there")
        return c.CFUNCTYPE(result, *arguments)(address)

    def call(self, name, result, *arguments):
        """Arguments are pairs of type and value."""
        return self.function(name, result, *[kind for kind, _ in arguments])(
            *[value for _, value in arguments])

    def words(self, display, name):
        text = self.call("eglQueryString", c.c_char_p, (Handle, display), (c.c_int, number(name)))
        return (text or b"").decode().split()

    def devices(self):
        count = c.c_int(0)
        handles = (Handle * 64)()
        self.call("eglQueryDevicesEXT", c.c_uint, (c.c_int, 64), (Handle, c.addressof(handles)),
                  (Handle, c.addressof(count)))
        return handles[:count.value]

    def device_text(self, device, name):
        text = self.call("eglQueryDeviceStringEXT", c.c_char_p, (Handle, device),
                         (c.c_int, number(name)))
        return (text or b"").decode()

    def make_current(self, device):
        """Makes a context current, without attributes, so that it is a compatibility context."""
        display = self.call("eglGetPlatformDisplayEXT", Handle,
                            (c.c_uint, number("EGL_PLATFORM_DEVICE_EXT")), (Handle, device),
                            (Handle, None))
        if not self.call("eglInitialize", c.c_uint, (Handle, display), (Handle, None),
                         (Handle, None)):
            raise Failed("eglInitialize")
        self.call("eglBindAPI", c.c_uint, (c.c_uint, number("EGL_OPENGL_API")))
        wanted = (c.c_int * 5)(number("EGL_SURFACE_TYPE"), number("EGL_PBUFFER_BIT"),
                               number("EGL_RENDERABLE_TYPE"), number("EGL_OPENGL_BIT"),
                               number("EGL_NONE"))
        config, count = Handle(), c.c_int(0)
        self.call("eglChooseConfig", c.c_uint, (Handle, display), (Handle, c.addressof(wanted)),
                  (Handle, c.addressof(config)), (c.c_int, 1), (Handle, c.addressof(count)))
        if count.value == 0:
            raise Failed("eglChooseConfig")
        size = (c.c_int * 5)(number("EGL_WIDTH"), 16, number("EGL_HEIGHT"), 16, number("EGL_NONE"))
        surface = self.call("eglCreatePbufferSurface", Handle, (Handle, display), (Handle, config),
                            (Handle, c.addressof(size)))
        context = self.call("eglCreateContext", Handle, (Handle, display), (Handle, config),
                            (Handle, None), (Handle, None))
        if not self.call("eglMakeCurrent", c.c_uint, (Handle, display), (Handle, surface),
                         (Handle, surface), (Handle, context)):
            raise Failed("eglMakeCurrent")


class GL:
    """The current context."""

    def __init__(self, egl):
        self.call = egl.call

    def errors(self):
        """Clears all errors, and returns whether there were any."""
        found = False
        while self.call("glGetError", c.c_uint) != 0:
            found = True
        return found

    def text(self, name):
        return (self.call("glGetString", c.c_char_p, (c.c_uint, number(name))) or b"").decode()

    def integer(self, name):
        """The value; None if OpenGL raises an error."""
        values = (c.c_int * 16)(*[-1] * 16)
        self.errors()
        self.call("glGetIntegerv", None, (c.c_uint, number(name)), (Handle, c.addressof(values)))
        return None if self.errors() else values[0]

    def program_integer(self, name):
        values = (c.c_int * 16)(*[-1] * 16)
        self.errors()
        self.call("glGetProgramivARB", None, (c.c_uint, number("GL_FRAGMENT_PROGRAM_ARB")),
                  (c.c_uint, number(name)), (Handle, c.addressof(values)))
        return None if self.errors() else values[0]

    def compiles(self):
        program = self.call("glCreateProgram", c.c_uint)
        for kind, source in (("GL_VERTEX_SHADER", VERTEX), ("GL_FRAGMENT_SHADER", FRAGMENT)):
            shader = self.call("glCreateShader", c.c_uint, (c.c_uint, number(kind)))
            text = c.c_char_p(source)
            self.call("glShaderSource", None, (c.c_uint, shader), (c.c_int, 1),
                      (Handle, c.addressof(text)), (Handle, None))
            self.call("glCompileShader", None, (c.c_uint, shader))
            self.call("glAttachShader", None, (c.c_uint, program), (c.c_uint, shader))
        self.call("glLinkProgram", None, (c.c_uint, program))
        linked = c.c_int(0)
        self.call("glGetProgramiv", None, (c.c_uint, program),
                  (c.c_uint, number("GL_LINK_STATUS")), (Handle, c.addressof(linked)))
        return linked.value != 0

    def draws_to_texture(self):
        """Clears a texture through a framebuffer, and reads the colour back. Returns whether it is the
        expected one."""
        self.errors()
        flat = number("GL_TEXTURE_2D")
        target = number("GL_FRAMEBUFFER")
        texture, buffer = c.c_uint(0), c.c_uint(0)
        self.call("glGenTextures", None, (c.c_int, 1), (Handle, c.addressof(texture)))
        self.call("glBindTexture", None, (c.c_uint, flat), (c.c_uint, texture.value))
        self.call("glTexImage2D", None, (c.c_uint, flat), (c.c_int, 0),
                  (c.c_int, number("GL_RGBA8")), (c.c_int, 8), (c.c_int, 8), (c.c_int, 0),
                  (c.c_uint, number("GL_RGBA")), (c.c_uint, number("GL_UNSIGNED_BYTE")),
                  (Handle, None))
        self.call("glGenFramebuffers", None, (c.c_int, 1), (Handle, c.addressof(buffer)))
        self.call("glBindFramebuffer", None, (c.c_uint, target), (c.c_uint, buffer.value))
        self.call("glFramebufferTexture2D", None, (c.c_uint, target),
                  (c.c_uint, number("GL_COLOR_ATTACHMENT0")), (c.c_uint, flat),
                  (c.c_uint, texture.value), (c.c_int, 0))
        status = self.call("glCheckFramebufferStatus", c.c_uint, (c.c_uint, target))
        self.call("glClearColor", None, *[(c.c_float, part) for part in (1.0, 0.0, 1.0, 1.0)])
        self.call("glClear", None, (c.c_uint, number("GL_COLOR_BUFFER_BIT")))
        pixel = (c.c_ubyte * 4)()
        self.call("glReadPixels", None, (c.c_int, 3), (c.c_int, 3), (c.c_int, 1), (c.c_int, 1),
                  (c.c_uint, number("GL_RGBA")), (c.c_uint, number("GL_UNSIGNED_BYTE")),
                  (Handle, c.addressof(pixel)))
        return (status == number("GL_FRAMEBUFFER_COMPLETE") and list(pixel) == [255, 0, 255, 255]
                and not self.errors())

    def facts(self):
        return {
            "strings": {name: self.text(name) for name in STRINGS},
            "integers": {name: self.integer(name) for name in INTEGERS},
            "program": {name: self.program_integer(name) for name in PROGRAM_INTEGERS},
            "extensions": self.text("GL_EXTENSIONS").split(),
            "compiles": self.compiles(),
            "framebuffer": self.draws_to_texture(),
        }


def main():
    egl = EGL()
    result = []
    for device in egl.devices():
        extensions = egl.device_text(device, "EGL_EXTENSIONS").split()
        entry = {"software": "EGL_MESA_device_software" in extensions, "node": None}
        if "EGL_EXT_device_drm" in extensions and not entry["software"]:
            entry["node"] = egl.device_text(device, "EGL_DRM_DEVICE_FILE_EXT") or None
        try:
            egl.make_current(device)
            entry.update(GL(egl).facts())
        except Failed as failure:
            entry["failed"] = str(failure)
        result.append(entry)
    json.dump(result, sys.stdout)


if __name__ == "__main__":
    main()
