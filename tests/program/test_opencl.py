"""The OpenCL half: the whole report with scripted and real drivers, failures at every step and in
every kind of driver call, bad answers, and objects that stay."""

import ctypes.util
import re
import shutil
import subprocess
from concurrent.futures import ThreadPoolExecutor
from pathlib import Path

import pytest

from adapters import Adapter, write_tree
from clmodel import CL_KEYS, ClGpu, ClPlatform, cl_script_of, cl_values_of
from harness import BUILD, PROGRAM, SANITIZED_BY, libraries_of
from model import Gpu, check, predict, script_of

WORKERS = 2
VENDORS = Path("/etc/OpenCL/vendors")

REQUIREMENT = ("Failed requirement: ciErrNum == CL_SUCCESS\n"
               "exception: Failed requirement: ciErrNum == CL_SUCCESS")
VERSION_REQUIREMENT = ("Failed requirement: status == CL_SUCCESS\n"
                       "exception: Failed requirement: status == CL_SUCCESS")
DRIVER_REQUIREMENT = "clGetDeviceInfo failed\nexception: clGetDeviceInfo failed"
NO_ROOM = "exception: std::bad_alloc"

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")


def platforms_of_two():
    """Two platforms with a GPU each, the first with CUDA and a CPU."""
    return [
        ClPlatform([ClGpu(name="First device"), ClGpu(name="A processor", type="cpu")],
                   version="OpenCL 1.2 CUDA 8.0.0"),
        ClPlatform([ClGpu(name="Second device", vendor_id=0x1002, integrated=True,
                          device_version="OpenCL 2.0 other", memory=1 << 20, batch=100_000_000,
                          kernel=1_000_000)]),
    ]


class Machine:
    """A machine with scripted drivers for both libraries."""

    def __init__(self, host, gl=1):
        self.host = host
        self.found = {"opencl": "empty"}
        self.gpus = [Gpu() for _ in range(gl)]
        if gl > 1:
            for index, gpu in enumerate(self.gpus):
                gpu.adapter = Adapter(index, f"Card {index}")
            write_tree(host.folder / "root", [gpu.adapter for gpu in self.gpus])
            self.found["root"] = host.folder / "root"
        gl_script = host.folder / "gl-script"
        gl_script.write_text(script_of(self.gpus) or "# nothing\n")
        self.found["script"] = gl_script
        self.checks = {} if gl else {"ogl": 0, "context": 0}
        self.platforms = platforms_of_two()

    def script(self, text):
        file = self.host.folder / "cl-script"
        file.write_bytes(text.encode("utf-8", "surrogateescape"))
        self.host.variables.update(OCL_ICD_VENDORS=str(BUILD / "drivers" / "opencl"),
                                   OCL_ICD_PLATFORM_SORT="none", ASSAY_SCRIPTED_OPENCL=str(file))
        return self

    def run(self, *arguments, extra="", **options):
        """Runs the program on the platforms, with extra script lines for the last device."""
        self.script(cl_script_of(self.platforms) + extra)
        return self.host.run(*arguments, **self.found, **options)

    def predict(self, **options):
        return predict(self.gpus, opencl=cl_values_of(self.platforms), **self.checks, **options)


@pytest.fixture
def machine(host):
    """A machine with two OpenCL GPUs and no OpenGL GPU."""
    return Machine(host, gl=0)


@pytest.fixture
def one(host):
    """A machine with one OpenCL GPU and no OpenGL GPU."""
    result = Machine(host, gl=0)
    result.platforms = [ClPlatform([ClGpu()])]
    return result


def test_whole_report(host):
    machine = Machine(host, gl=2)
    expected = machine.predict()
    check(machine.run(), expected)
    assert expected.steps == 9 + 2 * 35 + 1 + 2 * 12
    assert 'clgpu[0].CUDAVersion="8.0.0"' in expected.lines
    assert "clgpu[1].CLBandwidth=3.35544e+09" in expected.lines
    assert "clgpu[0].CLCompute=32" in expected.lines


@pytest.mark.parametrize("count", [1, 2, 9])
def test_many_devices(machine, count):
    machine.platforms = [ClPlatform([ClGpu(name=f"Device {index}", vendor_id=index)
                                     for index in range(count)])]
    check(machine.run(), machine.predict())


def test_no_gpu_on_any_platform(machine):
    machine.platforms = [ClPlatform([ClGpu(type="cpu"), ClGpu(type="accelerator")]), ClPlatform()]
    run = machine.run()
    check(run, machine.predict())
    assert "NumCLGPUs=0" in run.lines


def test_driver_without_platforms(machine):
    machine.script("# nothing\n")
    check(machine.host.run(**machine.found), predict([], opencl=0, **machine.checks))


def test_library_without_opencls_entry_points(machine, tmp_path):
    """A library of that name without its functions: no OpenCL line at all."""
    folder = tmp_path / "wrong"
    folder.mkdir()
    for name in ("libOpenCL.so.1", "libOpenCL.so"):
        (folder / name).symlink_to(libraries_of(PROGRAM)["libm.so.6"])
    machine.script(cl_script_of(machine.platforms))
    path = machine.host.environment(**machine.found)["LD_LIBRARY_PATH"]
    machine.host.variables["LD_LIBRARY_PATH"] = f"{folder}:{path}"
    run = machine.host.run(**machine.found)
    check(run, predict([], **machine.checks))
    assert "CL" not in run.report.replace("GL", "")


# The entry points that the program calls.
CALLED = """
    clBuildProgram clCreateBuffer clCreateCommandQueue clCreateContext clCreateKernel
    clCreateProgramWithSource clEnqueueCopyBuffer clEnqueueNDRangeKernel clFinish clGetDeviceIDs
    clGetDeviceInfo clGetEventProfilingInfo clGetPlatformIDs clGetPlatformInfo
    clReleaseCommandQueue clReleaseContext clReleaseEvent clReleaseMemObject clSetKernelArg
    clWaitForEvents""".split()


def processor_of(file):
    """The number of the processor that an ELF file is for."""
    return file.read_bytes()[18:20]


def opencl_loader():
    """The loader library that the program finds: beside its C library, or by the system's list."""
    listed = subprocess.run(["ldconfig", "-p"], capture_output=True, text=True, check=True).stdout
    folders = {file.parent for file in libraries_of(PROGRAM).values()}
    files = [folder / "libOpenCL.so.1" for folder in folders]
    files += map(Path, re.findall(r"libOpenCL\.so\.1 .*=> (\S+)", listed))
    return next(file for file in files if file.exists() and processor_of(file) == processor_of(PROGRAM))


def loader_without(machine, folder, lacks):
    """Makes the program find a copy of the loader without the names for which `lacks` is true.
    Returns those names."""
    library = opencl_loader().read_bytes()
    names = {name.decode() for name in re.findall(rb"\0(cl[A-Z]\w+)(?=\0)", library)}
    missing = [name for name in names if lacks(name) and not name.startswith("clIcd")]
    for name in missing:
        # The first occurrence is in the table of exported names. The changed name doesn't match its
        # hash.
        library = library.replace(f"\0{name}\0".encode(), f"\0_{name[1:]}\0".encode(), 1)
    folder.mkdir()
    (folder / "libOpenCL.so.1").write_bytes(library)
    path = machine.host.environment(**machine.found).get("LD_LIBRARY_PATH", "")
    machine.host.variables["LD_LIBRARY_PATH"] = f"{folder}:{path}"
    return missing


def test_loader_without_uncalled_functions(one, tmp_path):
    """Functions that the program doesn't call may be missing."""
    missing = loader_without(one, tmp_path / "loader", lambda name: name not in CALLED)
    assert "clUnloadCompiler" in missing
    check(one.run(), one.predict())


@pytest.mark.parametrize("name", CALLED)
def test_loader_without_a_called_function(one, tmp_path, name):
    """OpenCL counts as missing, without any other effect."""
    assert loader_without(one, tmp_path / "loader", lambda each: each == name) == [name]
    check(one.run(), predict([], **one.checks))


@pytest.mark.parametrize("batch, batches, bandwidth", [
    (200_000_000, 5, "1.67772e+09"),
    (100_000_000, 10, "3.35544e+09"),
    (1_000_000_000, 1, "3.35544e+08"),
    (3_000_000_000, 1, "1.11848e+08"),
    (0, 10, "0"),
])
def test_bandwidth_of_scripted_counters(one, batch, batches, bandwidth):
    one.platforms[0].devices[0].batch = batch
    run = one.run(extra=one.host.fresh_record())
    assert run.facts["clgpu[0].CLBandwidth"] == bandwidth
    copies = [call for call in one.host.record() if call.name == "clEnqueueCopyBuffer"]
    assert len(copies) == 10 * batches
    check(run, one.predict())


@pytest.mark.parametrize("copy, batches, bandwidth", [
    (20_000_000, 6, "1.67772e+09"),
    (50_000_000, 3, "6.71089e+08"),
    (15_625_000, 7, "2.14748e+09"),
])
def test_bandwidth_of_even_copies(one, copy, batches, bandwidth):
    """The sum of ten durations in doubles may be just less than expected."""
    run = one.run(extra=f"copy-ns {copy}\n" + one.host.fresh_record())
    assert run.facts["clgpu[0].CLBandwidth"] == bandwidth
    copies = [call for call in one.host.record() if call.name == "clEnqueueCopyBuffer"]
    assert len(copies) == 10 * batches


@pytest.mark.parametrize("kernel, score", [(250_000_000, "32"), (1_000, "8e+06"), (0, "0")])
def test_compute_of_scripted_counters(one, kernel, score):
    one.platforms[0].devices[0].kernel = kernel
    run = one.run()
    assert run.facts["clgpu[0].CLCompute"] == score
    check(run, one.predict())


@pytest.mark.parametrize("verbosity", [0, 1, -1])
def test_logging_does_not_change_the_driver_calls(one, verbosity):
    one.run(extra=one.host.fresh_record())
    silent = one.host.record()
    one.run(f"-verbose={verbosity}", extra=one.host.fresh_record())
    assert one.host.record() == silent


def test_kernel_text_and_arguments(one):
    one.run(extra=one.host.fresh_record())
    calls = {call.name: call.arguments for call in one.host.record()}
    gap = r"\x09" * 7 + "  "
    text = gap.join([
        "__kernel void justIterate( __global float* v, unsigned int len ){",
        "int gid = get_global_id(0);", "if(gid>=len) return;", "float data = v[gid];",
        "float variant = (float)(gid % 3);", "for ( int i = 0 ; i < 4096; i++){",
        "data = data  *  1.2f * variant ;", "}", "v [ gid ] = data ;", "}"])
    assert calls["clCreateProgramWithSource"] == f'context2 1 "{text}" null'
    assert calls["clBuildProgram"] == "program1 0 null null null null"
    assert calls["clCreateKernel"] == 'program1 "justIterate"'
    assert calls["clEnqueueNDRangeKernel"] == "queue2 kernel1 1 null 1048576 64 0 null"


def test_objects_that_stay(one):
    """Events of all batches except the last, and program, kernel and event of the kernel's run."""
    one.run(extra=one.host.fresh_record())
    names = [call.name for call in one.host.record()]
    counts = {name: names.count(name) for name in set(names)}
    assert counts["clCreateContext"] == counts["clReleaseContext"] == 2
    assert counts["clCreateCommandQueue"] == counts["clReleaseCommandQueue"] == 2
    assert counts["clCreateBuffer"] == counts["clReleaseMemObject"] == 3
    assert counts["clEnqueueCopyBuffer"] == 50
    assert counts["clEnqueueNDRangeKernel"] == 1
    assert counts["clReleaseEvent"] == 10
    assert counts["clCreateProgramWithSource"] == counts["clCreateKernel"] == 1
    assert "clReleaseProgram" not in counts
    assert "clReleaseKernel" not in counts


@pytest.mark.parametrize("option", ["crashAfter", "throwAfter"])
def test_failure_at_every_step(host, option):
    """Two OpenGL and two OpenCL GPUs."""
    machine = Machine(host, gl=2)
    machine.script(cl_script_of(machine.platforms))
    field = {"crashAfter": "crash_after", "throwAfter": "throw_after"}[option]
    steps = machine.predict().steps

    def run_to(step):
        return host.run(f"-{option}={step}", **machine.found)

    with ThreadPoolExecutor(WORKERS) as workers:
        runs = list(workers.map(run_to, range(steps + 1)))
    for step, run in enumerate(runs):
        check(run, machine.predict(**{field: step}))
    assert [run.status for run in runs] == [2] * steps + [0]


# A driver call that fails on the second of two devices: the script line, the key whose test fails, and
# the lines on standard error.
FAILING_CALLS = [
    ("at clGetDeviceInfo(1,CL_DEVICE_PLATFORM) error CL_INVALID_DEVICE", "CLPlatformVersion",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_PLATFORM) failed: CL_INVALID_DEVICE (-33)"),
    ("at clGetDeviceInfo(1,CL_DEVICE_VERSION) error CL_OUT_OF_HOST_MEMORY", "CLDeviceVersion",
     VERSION_REQUIREMENT),
    ("at 2 clGetDeviceInfo(1,CL_DEVICE_VERSION) error CL_OUT_OF_HOST_MEMORY", "CLDeviceVersion",
     VERSION_REQUIREMENT),
    ("at clGetDeviceInfo(1,CL_DEVICE_GLOBAL_MEM_SIZE) error CL_INVALID_VALUE", "CLMemoryMB",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_GLOBAL_MEM_SIZE) failed: "
     "CL_INVALID_VALUE (-30)"),
    ("at clGetDeviceInfo(1,CL_DEVICE_NAME) error -7777", "CLName",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_NAME) failed: unknown status (-7777)"),
    ("at clGetDeviceInfo(1,CL_DEVICE_VENDOR) error CL_INVALID_VALUE", "CLVendor",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_VENDOR) failed: CL_INVALID_VALUE (-30)"),
    ("at clGetDeviceInfo(1,CL_DEVICE_VENDOR_ID) error CL_INVALID_VALUE", "CLVendorID",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_VENDOR_ID) failed: CL_INVALID_VALUE (-30)"),
    ("at clGetDeviceInfo(1,CL_DRIVER_VERSION) error CL_INVALID_VALUE", "CLDriverVersion",
     DRIVER_REQUIREMENT),
    ("at 2 clGetDeviceInfo(1,CL_DRIVER_VERSION) error CL_INVALID_VALUE", "CLDriverVersion",
     DRIVER_REQUIREMENT),
    ("at clGetDeviceInfo(1,CL_DEVICE_NAME) throw \"driver's own\"", "CLName",
     "exception: driver's own"),
    ("at clGetDeviceInfo(1,CL_DEVICE_NAME) throw int 7", "CLName", "unknown exception"),
    ("at 1 clCreateContext on 1 error CL_OUT_OF_RESOURCES", "CLBandwidth",
     "QGF::LogicalException: clCreateContext failed: CL_OUT_OF_RESOURCES (-5)"),
    ("at 1 clCreateContext on 1 return 0", "CLBandwidth",
     "QGF::LogicalException: clCreateContext: the driver returns no context"),
    ("at 1 clCreateCommandQueue on 1 error CL_OUT_OF_RESOURCES", "CLBandwidth",
     "QGF::LogicalException: clCreateCommandQueue failed: CL_OUT_OF_RESOURCES (-5)"),
    ("at 1 clCreateCommandQueue on 1 return 0", "CLBandwidth",
     "QGF::LogicalException: clCreateCommandQueue: the driver returns no queue"),
    ("at 1 clCreateBuffer on 1 error CL_MEM_OBJECT_ALLOCATION_FAILURE", "CLBandwidth",
     REQUIREMENT),
    ("at 2 clCreateBuffer on 1 error CL_MEM_OBJECT_ALLOCATION_FAILURE", "CLBandwidth",
     REQUIREMENT),
    ("at 17 clEnqueueCopyBuffer on 1 error CL_OUT_OF_RESOURCES", "CLBandwidth", REQUIREMENT),
    ("at 2 clCreateContext on 1 error CL_OUT_OF_RESOURCES", "CLCompute",
     "QGF::LogicalException: clCreateContext failed: CL_OUT_OF_RESOURCES (-5)"),
    ("at clCreateProgramWithSource on 1 error CL_OUT_OF_HOST_MEMORY", "CLCompute", REQUIREMENT),
    ("at clBuildProgram on 1 error CL_BUILD_PROGRAM_FAILURE", "CLCompute", REQUIREMENT),
    ("at clCreateKernel on 1 error CL_INVALID_KERNEL_NAME", "CLCompute", REQUIREMENT),
    ("at 3 clCreateBuffer on 1 error CL_OUT_OF_RESOURCES", "CLCompute", REQUIREMENT),
    ("at 1 clSetKernelArg on 1 error CL_INVALID_ARG_SIZE", "CLCompute", REQUIREMENT),
    ("at 2 clSetKernelArg on 1 error CL_INVALID_ARG_SIZE", "CLCompute", REQUIREMENT),
    ("at clEnqueueNDRangeKernel on 1 error CL_INVALID_WORK_GROUP_SIZE", "CLCompute", REQUIREMENT),
    ("at clWaitForEvents on 1 error CL_INVALID_EVENT", "CLCompute", REQUIREMENT),
]


@pytest.mark.parametrize("line, key, errors", FAILING_CALLS)
def test_failing_call_ends_the_tests_of_one_gpu(machine, line, key, errors):
    machine.platforms[0].devices.pop()
    run = machine.run(extra=line + "\n")
    check(run, machine.predict(cl_failing={(1, key): errors}))
    own = [each.split(".")[1].split("=")[0] for each in run.lines if each.startswith("clgpu[1].")]
    assert key not in own
    others = [each for each in run.lines if each.startswith("clgpu[0].")]
    assert len(others) == len(CL_KEYS)


@pytest.mark.parametrize("line", [
    "at clGetDeviceInfo(*,CL_DEVICE_HOST_UNIFIED_MEMORY) error CL_INVALID_VALUE",
    "at clFinish error CL_OUT_OF_RESOURCES",
    "at clReleaseEvent error CL_INVALID_EVENT",
    "at clReleaseMemObject error CL_INVALID_MEM_OBJECT",
    "at clReleaseCommandQueue error CL_INVALID_COMMAND_QUEUE",
    "at clReleaseContext error CL_INVALID_CONTEXT",
    'at clReleaseEvent throw "x"',
    'at clReleaseMemObject throw "x"',
    'at clReleaseCommandQueue throw "x"',
    "at clReleaseContext throw int 5",
])
def test_failures_that_are_not_reported(one, line):
    check(one.run(extra=line + "\n"), one.predict())


def test_failed_profiling_reports_0(one):
    run = one.run(extra="at clGetEventProfilingInfo error CL_PROFILING_INFO_NOT_AVAILABLE\n")
    assert run.facts["clgpu[0].CLBandwidth"] == "0"
    assert run.facts["clgpu[0].CLCompute"] == "0"
    assert run.errors == []
    assert run.status == 0


# A bad answer of the only device: the script line, the key, and the lines on standard error.
BAD_ANSWERS = [
    ("claim CL_DEVICE_NAME -1", "CLName", NO_ROOM),
    ("claim CL_DEVICE_VENDOR -1", "CLVendor", NO_ROOM),
    ("claim CL_DRIVER_VERSION -1", "CLDriverVersion", NO_ROOM),
    ("claim CL_DEVICE_VERSION -1", "CLDeviceVersion", NO_ROOM),
    # More than an address space can hold.
    pytest.param("claim CL_DRIVER_VERSION 0x4000000000000", "CLDriverVersion", NO_ROOM,
                 marks=pytest.mark.skipif(SANITIZED_BY != "",
                                          reason="the sanitizer's allocator ends the process")),
    # Not even the terminating zero byte.
    ("claim CL_DEVICE_VERSION 0", "CLDeviceVersion", NO_ROOM),
    ("bytes CL_DEVICE_GLOBAL_MEM_SIZE \"abc\"", "CLMemoryMB",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_GLOBAL_MEM_SIZE): the driver returns 3 "
     "bytes instead of 8"),
    ("claim CL_DEVICE_VENDOR_ID 0x10000000000", "CLVendorID",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_VENDOR_ID): the driver returns "
     "1099511627776 bytes instead of 4"),
    ("ulong CL_DEVICE_PLATFORM 0", "CLPlatformVersion",
     "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_PLATFORM): the driver returns no platform"),
]


@pytest.mark.parametrize("line, key, errors", BAD_ANSWERS)
def test_bad_answer_ends_the_tests_of_the_gpu(one, line, key, errors):
    check(one.run(extra=line + "\n"), one.predict(cl_failing={(0, key): errors}))


@pytest.mark.parametrize("line, key, value", [
    ('bytes CL_DEVICE_NAME "unterminated"', "CLName", '"unterminated"'),
    ('bytes CL_DRIVER_VERSION "unterminated"', "CLDriverVersion", '"unterminated"'),
    ('text CL_DEVICE_NAME "cut\\x00here"', "CLName", '"cut"'),
    ('bytes CL_DEVICE_NAME ""', "CLName", '""'),
    ('bytes CL_DRIVER_VERSION ""', "CLDriverVersion", '""'),
    ('text CL_DEVICE_NAME "a \\"quoted\\" name"', "CLName", '"a "quoted" name"'),
    ('text CL_DEVICE_VENDOR "\\xFF\\xFE"', "CLVendor", '"\udcff\udcfe"'),
    ('text CL_DEVICE_NAME repeat 3000000 "x"', "CLName", '"' + "x" * 3000000 + '"'),
    ('text CL_DEVICE_VERSION repeat 3000000 "x"', "CLDeviceVersion", '"' + "x" * 3000000 + '"'),
    ('text CL_DRIVER_VERSION repeat 3000000 "x"', "CLDriverVersion", '"' + "x" * 3000000 + '"'),
    ("claim CL_DRIVER_VERSION 3000000", "CLDriverVersion", '"390.77"'),
    ("ulong CL_DEVICE_GLOBAL_MEM_SIZE 1048575", "CLMemoryMB", "0"),
    ("uint CL_DEVICE_VENDOR_ID 0xFFFFFFFF", "CLVendorID", "4294967295"),
], ids=lambda text: text[:60])
def test_odd_answer_is_reported_unchanged(one, line, key, value):
    run = one.run(extra=line + "\n")
    assert run.facts[f"clgpu[0].{key}"] == value
    assert run.errors == []
    assert run.status == 0


def test_line_end_in_a_name_is_reported_raw(one):
    run = one.run(extra='text CL_DEVICE_NAME "two\\nlines"\n')
    assert '\nclgpu[0].CLName="two\nlines"\n' in run.report
    assert run.status == 0


def test_null_device_fails(one):
    """The other device of the platform is complete."""
    run = one.run(extra="device null\n")
    values = cl_values_of(one.platforms)
    check(run, predict(
        [], opencl=values * 2, **one.checks,
        cl_failing={(1, "CLPlatformVersion"):
                    "QGF::LogicalException: clGetDeviceInfo(CL_DEVICE_PLATFORM) failed: "
                    "CL_INVALID_DEVICE (-33)"}))


def test_platform_that_fails_ends_the_run(one):
    run = one.run(extra="at clGetDeviceIDs error CL_OUT_OF_HOST_MEMORY\n")
    assert run.errors == ["QGF::LogicalException: clGetDeviceIDs failed: "
                          "CL_OUT_OF_HOST_MEMORY (-6)"]
    assert run.status == 2
    assert run.lines == predict([], **one.checks).lines[:-1]


def test_devices_beyond_reason_end_the_run(one):
    run = one.run(extra="claim-devices 0xFFFFFFFF\n")
    assert run.errors == ["QGF::LogicalException: clGetDeviceIDs: the driver reports a list of "
                          "4294967295 entries"]
    assert run.status == 2


def test_platforms_that_cannot_be_listed(one):
    """The loader drops the driver, which then counts as absent."""
    check(one.run(extra="at clIcdGetPlatformIDsKHR error CL_OUT_OF_HOST_MEMORY\n"),
          predict([], opencl=0, **one.checks))


def test_driver_that_exits_ends_the_run(one):
    run = one.run(extra="at clBuildProgram exit 41\n")
    assert run.status == 41
    assert run.lines[-1].startswith("clgpu[0].CLBandwidth=")


def use_vendor(host, name, **variables):
    """Makes the loader find only this one of the machine's drivers."""
    file = VENDORS / name
    if not file.exists():
        pytest.skip(f"this machine has no {file}")
    host.variables.update(OCL_ICD_VENDORS=str(file), **variables)


def use_mesa_as_gpu(host):
    use_vendor(host, "rusticl.icd", RUSTICL_ENABLE="llvmpipe", RUSTICL_DEVICE_TYPE="gpu")


def test_processors_are_never_listed(host):
    """PoCL offers only the processor."""
    use_vendor(host, "pocl.icd")
    peer = subprocess.run(["clinfo", "-l"], capture_output=True, check=False,
                          env=host.environment(opencl="real"))
    if peer.returncode != 0:
        pytest.skip(f"PoCL doesn't work here: clinfo ends with {peer.returncode}")
    run = host.run(script="# no OpenGL\n", opencl="real")
    check(run, predict([], opencl=0, ogl=0, context=0))


def clinfo_devices(host, **machine):
    """The answers of clinfo for each GPU, in the loader's order."""
    if shutil.which("clinfo") is None:
        pytest.skip("clinfo isn't installed")
    done = subprocess.run(["clinfo", "--raw"], capture_output=True, text=True, check=False,
                          env=host.environment(**machine), timeout=120)
    platforms, devices = {}, {}
    for line in done.stdout.splitlines():
        found = re.match(r"\[(.+?)/(\*|\d+)\]\s+(CL_\w+) +(.*)$", line)
        if found:
            platform, device, name, value = found.groups()
            devices.setdefault((platform, device), {}).setdefault(name, value)
        elif (found := re.match(r"\s+(CL_PLATFORM_\w+) +(.*)$", line)) is not None:
            if found[1] == "CL_PLATFORM_NAME":
                platforms["current"] = {}
            platforms["current"][found[1]] = found[2]
            if found[1] == "CL_PLATFORM_ICD_SUFFIX_KHR":
                platforms[found[2]] = platforms["current"]
    return [{**platforms[platform], **facts} for (platform, device), facts in devices.items()
            if device != "*" and "CL_DEVICE_TYPE_GPU" in facts.get("CL_DEVICE_TYPE", "")]


def values_by_clinfo(device):
    """The expected values of a device, except the measurements."""
    version = device["CL_PLATFORM_VERSION"].removeprefix("OpenCL ")
    version, _, cuda = version.partition(" CUDA ")
    values = {
        "CLPlatformVersion": f'"{version}"',
        "CLDeviceVersion": f'"{device["CL_DEVICE_VERSION"].removeprefix("OpenCL ")}"',
        "IsIntegratedCLGPU": str(int(device["CL_DEVICE_HOST_UNIFIED_MEMORY"] == "CL_TRUE")),
        "CLMemoryMB": str(int(device["CL_DEVICE_GLOBAL_MEM_SIZE"]) >> 20),
        "CLName": f'"{device["CL_DEVICE_NAME"]}"',
        "CLVendor": f'"{device["CL_DEVICE_VENDOR"]}"',
        "CLVendorID": str(int(device["CL_DEVICE_VENDOR_ID"], 0)),
        "CLDriverVersion": f'"{device["CL_DRIVER_VERSION"]}"',
        "CUDASupported": str(int(cuda != "")),
        "CUDAVersion": f'"{cuda}"',
    }
    return values if cuda else {key: values[key] for key in values if key != "CUDAVersion"}


def assert_agrees_with_clinfo(run, devices):
    facts = run.facts
    assert facts["NumCLGPUs"] == str(len(devices))
    for index, device in enumerate(devices):
        tag = f"clgpu[{index}]."
        own = {key.removeprefix(tag): value for key, value in facts.items() if key.startswith(tag)}
        del own["CLBandwidth"], own["CLCompute"]
        assert own == values_by_clinfo(device)


@pytest.mark.skipif(SANITIZED_BY == "thread",
                    reason="Mesa's OpenCL compiler doesn't end under the thread sanitizer")
def test_mesa_as_gpu(host):
    """The whole report with a real driver, compared with clinfo. Mesa's software device has no
    reliable counters, so that the two measurements are only checked to be positive."""
    use_mesa_as_gpu(host)
    run = host.run(script=Gpu().script(), opencl="real")
    assert run.status == 0
    assert run.errors == []
    keys = [line.split("=")[0] for line in run.lines if line.startswith("clgpu[0].")]
    assert keys == [f"clgpu[0].{key}" for key in CL_KEYS if key != "CUDAVersion"]
    assert float(run.facts["clgpu[0].CLBandwidth"]) > 0
    assert float(run.facts["clgpu[0].CLCompute"]) > 0
    assert run.lines[-1] == 'assayEnd="STAMP"'
    devices = clinfo_devices(host, script=Gpu().script(), opencl="real")
    assert len(devices) == 1
    assert_agrees_with_clinfo(run, devices)


def test_drivers_of_this_machine(host):
    """The report has the same GPUs and values as clinfo."""
    devices = clinfo_devices(host, egl="real", opencl="real")
    if not devices:
        pytest.skip("no OpenCL driver of this machine shows a GPU")
    run = host.run(egl="real", opencl="real")
    assert run.status == 0
    assert_agrees_with_clinfo(run, devices)
    assert run.lines[-1] == 'assayEnd="STAMP"'
