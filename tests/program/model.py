"""The model of a report, computed from the table of tests and steps alone.

Gpu objects describe the machine. They become a driver script (and, for more than one, a tree of adapter
files), and the report must show their values.
"""

from dataclasses import dataclass, field

from clmodel import CL_KEYS, cl_test, escaped, quoted

# The constants of the battery, and their codes.
BATTERY_INTEGERS = [
    ("GL_MAX_TEXTURE_UNITS", 34018),
    ("GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS", 35661),
    ("GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS", 35660),
    ("GL_MAX_TEXTURE_IMAGE_UNITS", 34930),
    ("GL_MAX_DRAW_BUFFERS", 34852),
    ("GL_MAX_VERTEX_UNIFORM_COMPONENTS", 35658),
    ("GL_MAX_FRAGMENT_UNIFORM_COMPONENTS", 35657),
    ("GL_MAX_VARYING_FLOATS", 35659),
    ("GL_MAX_VERTEX_ATTRIBS", 34921),
]

# The name in the report, its number there, the extension, and the core version that includes it.
BATTERY_EXTENSIONS = [
    ("GL_ARB_VERTEX_PROGRAM", 69, "GL_ARB_vertex_program", None),
    ("GL_ARB_FRAGMENT_PROGRAM", 27, "GL_ARB_fragment_program", None),
    ("GL_ARB_VERTEX_SHADER", 70, "GL_ARB_vertex_shader", "2.0"),
    ("GL_ARB_FRAGMENT_SHADER", 28, "GL_ARB_fragment_shader", "2.0"),
    ("GL_EXT_FRAMEBUFFER_OBJECT", 81, "GL_EXT_framebuffer_object", "3.0"),
    ("GL_ARB_TEXTURE_RECTANGLE", 58, "GL_ARB_texture_rectangle", "3.1"),
    ("GL_ARB_TEXTURE_FLOAT", 53, "GL_ARB_texture_float", None),
    ("GL_ARB_OCCLUSION_QUERY", 37, "GL_ARB_occlusion_query", "1.5"),
    ("GL_ARB_VERTEX_BUFFER_OBJECT", 68, "GL_ARB_vertex_buffer_object", "1.5"),
    ("GL_ARB_SHADER_TEXTURE_LOD", 47, "GL_ARB_shader_texture_lod", None),
]

NPOT = "GL_ARB_texture_non_power_of_two"

# The fifteen key tests in the order in which they run.
KEYS = [
    "GLVersion", "IsIntegratedGLGPU", "GLMemoryMB", "GLName", "GLVendor", "GLVendorID",
    "GLDriverVersion", "GLRectTextureSize", "GLRenderer", "GLRendererID", "HasGLNPOTSupport",
    "GLDriver", "GLDriverDate", "CanCompileProgramGLSL", "GLFrameBufferOK",
]


@dataclass
class Gpu:
    """One device, with the answers of the driver and of the system."""

    vendor: str = "A vendor"
    renderer: str = "A renderer"
    version: str = "2.1 Scripted"
    language: str = "1.20"
    rectangle: int = 8192
    instructions: int = 16000
    integers: list = field(default_factory=lambda: [8, 192, 32, 31, 7, 4096, 4095, 124, 16])
    extensions: list = field(default_factory=lambda: [
        "GL_ARB_vertex_program", "GL_ARB_fragment_program", "GL_ARB_vertex_shader",
        "GL_ARB_fragment_shader", "GL_EXT_framebuffer_object", "GL_ARB_framebuffer_object", NPOT])
    # None: no adapter matches.
    adapter: "object" = None

    def offers(self, extension, core_since):
        return extension in self.extensions or (
            core_since is not None and self.version[:3] >= core_since)

    def values(self):
        """The values of the fifteen keys, as the report shows them, if no test fails."""
        adapter = self.adapter
        return dict(zip(KEYS, [
            quoted(min(self.version[:3], NEWEST_VERSION)),
            "0" if adapter is None else str(int(adapter.integrated)),
            "0" if adapter is None else str(adapter.memory_mb),
            quoted("" if adapter is None else adapter.name),
            quoted(self.vendor),
            "0" if adapter is None else str(adapter.vendor_id),
            quoted("?" if adapter is None else adapter.driver_version),
            str(self.rectangle),
            quoted(self.renderer),
            "0" if adapter is None else str(adapter.device_id),
            str(int(self.offers(NPOT, "2.0"))),
            quoted("?" if adapter is None else adapter.driver),
            quoted("?" if adapter is None else adapter.driver_date),
            "1",
            "1",
        ]))

    def script(self):
        lines = ["device"]
        if self.adapter is None:
            # Keeps the program from looking for the adapter on the machine that runs the tests.
            lines.append("software")
        else:
            lines.append(f'drm "/dev/dri/{self.adapter.card}"')
            lines.append("integer GL_TEXTURE_FREE_MEMORY_ATI 1024 1024 0 0")
        lines += [
            f"string GL_VENDOR {escaped(self.vendor)}",
            f"string GL_RENDERER {escaped(self.renderer)}",
            f"version {escaped(self.version)}",
            f"string GL_SHADING_LANGUAGE_VERSION {escaped(self.language)}",
            f'extensions "{" ".join(self.extensions)}"',
            f"integer GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB {self.rectangle}",
            f"program-integer GL_MAX_PROGRAM_INSTRUCTIONS_ARB {self.instructions}",
        ]
        lines += [f"integer {code} {value}"
                  for (_, code), value in zip(BATTERY_INTEGERS, self.integers)]
        return "\n".join(lines) + "\n"


def script_of(gpus):
    return "".join(gpu.script() for gpu in gpus)


# The report has no newer version.
NEWEST_VERSION = "4.1"

# The messages of a test in which OpenGL raised an error.
GL_ERROR = "\n".join(["Failed requirement: glStatus == GL_NO_ERROR",
                      "exception: Failed requirement: glStatus == GL_NO_ERROR"])

# Steps before the first per-GPU test: the start, the stamp, three checks, the enumeration.
STEPS_BEFORE_TESTS = 7


class Programmed(Exception):
    """A programmed failure of a step."""


class Steps:
    """Counts steps and fails as programmed."""

    def __init__(self, crash_after, throw_after):
        self.crash_after = crash_after % 2**32
        self.throw_after = throw_after
        self.taken = 0

    def take(self):
        step, self.taken = self.taken, self.taken + 1
        if step >= self.crash_after:
            raise Programmed("programmed failure")
        if step == self.throw_after:
            raise Programmed("Programmed throw")


@dataclass
class Prediction:
    lines: list
    errors: list
    status: int
    steps: int  # the number of steps taken, including the failing one


class Failing(Exception):
    """A test that the driver makes fail, with its lines on standard error."""


def per_gpu_tests(gpu_values):
    """The tests that run on each GPU, in order. Each yields lines, and None for a step."""

    def key_test(key):
        def run(tag, gpu):
            value = gpu_values(gpu)[key]
            if isinstance(value, Failing):
                raise value
            yield f"{tag}.{key}={value}"
            yield None
        return run

    def text_test(tag, gpu):
        yield "gputag.GL_SHADING_LANGUAGE_VERSION=35724"
        yield f'{tag}.glGetString[GL_SHADING_LANGUAGE_VERSION]="{gpu.language}"'

    def program_test(tag, gpu):
        yield "gputag.GL_FRAGMENT_PROGRAM_ARB=34820"
        yield "gputag.GL_MAX_PROGRAM_INSTRUCTIONS_ARB=34977"
        yield (f"{tag}.glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB]"
               f"[GL_MAX_PROGRAM_INSTRUCTIONS_ARB]=[{gpu.instructions}]")
        yield None

    def integer_test(index):
        name, code = BATTERY_INTEGERS[index]

        def run(tag, gpu):
            yield f"gputag.{name}={code}"
            yield f"{tag}.glGetIntegerv[{name}]=[{gpu.integers[index]}]"
            yield None
        return run

    def extension_test(index):
        name, number, extension, core_since = BATTERY_EXTENSIONS[index]

        def run(tag, gpu):
            yield f"gputag.QGF::OGL::{name}={number}"
            offered = int(gpu.offers(extension, core_since))
            yield f"{tag}.extension[QGF::OGL::{name}]={offered}"
            yield None
        return run

    return ([key_test(key) for key in KEYS] + [text_test, program_test]
            + [integer_test(index) for index in range(len(BATTERY_INTEGERS))]
            + [extension_test(index) for index in range(len(BATTERY_EXTENSIONS))])


def predict(gpus, crash_after=-1, throw_after=-1, exit_status=0, opencl=None, core=1, ogl=1,
            context=None, failing=(), cl_failing=()):
    """Predicts a run.

    gpus: the GPUs that the enumeration finds, in its order.
    opencl: None without a loader, 0 for no OpenCL GPU, otherwise the values of each one's keys.
    context: whether a first context can be created; by default, whether there is a GPU.
    failing: {(index of the GPU, key): lines on standard error} for tests that the driver makes fail.
    cl_failing: the same for the OpenCL GPUs.
    """
    failing = dict(failing)
    steps = Steps(crash_after, throw_after)
    lines, errors = [], []
    failures = 0

    def values_of(gpu):
        values = gpu.values()
        for (index, key), text in failing.items():
            if gpus[index] is gpu:
                values[key] = Failing(text)
        return values

    def line_and_step(line):
        lines.append(line)
        steps.take()

    def run_test(entries, test):
        nonlocal failures
        for entry in list(entries):
            try:
                for line in test(*entry):
                    if line is None:
                        steps.take()
                    else:
                        lines.append(line)
            except Programmed as exception:
                errors.append(f"exception: {exception}")
            except Failing as exception:
                errors.extend(str(exception).split("\n"))
            else:
                continue
            failures += 1
            entries.remove(entry)

    def whole_run():
        steps.take()
        line_and_step('Tester="Pixmere"')
        line_and_step('assayStart="STAMP"')
        line_and_step(f"QGFCoreInitialized={core}")
        line_and_step(f"QGFOGLInitialized={ogl}")
        line_and_step(f"OGLContextCreated={int(bool(gpus)) if context is None else context}")
        line_and_step(f"NumGLGPUs={len(gpus)}")
        entries = [(f"glgpu[{index}]", gpu) for index, gpu in enumerate(gpus)]
        for test in per_gpu_tests(values_of):
            run_test(entries, test)
        if opencl is not None:
            found = [dict(values) for values in opencl or []]
            for (index, key), text in dict(cl_failing).items():
                found[index][key] = Failing(text)
            line_and_step(f"NumCLGPUs={len(found)}")
            entries = [(f"clgpu[{index}]", values) for index, values in enumerate(found)]
            for key in CL_KEYS:
                run_test(entries, cl_test(key))
        line_and_step('assayEnd="STAMP"')
        steps.take()

    try:
        whole_run()
        status = 2 if failures else exit_status % 256
    except Programmed as exception:
        errors.append(f"exception: {exception}")
        status = 2
    return Prediction(lines, errors, status, steps.taken)


def check(run, expected):
    """Asserts that a run is as predicted."""
    assert run.lines == expected.lines
    assert run.errors == expected.errors
    assert run.status == expected.status
