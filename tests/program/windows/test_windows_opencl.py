"""OpenCL under Wine: OpenCL.dll with the Linux drivers, a real one and the scripted one."""

import pytest

from clmodel import ClGpu, ClPlatform, cl_values_of
from conftest import OPENCL_GPU, gpu_of, run_under_wine, scripted_opencl
from model import check, predict

@pytest.fixture
def scripted(tmp_path):
    """Runs the program on scripted OpenCL platforms."""
    def run(platforms, *arguments, extra=""):
        return run_under_wine(*arguments, **scripted_opencl(tmp_path, platforms, extra))
    return run


def two_platforms():
    return [ClPlatform([ClGpu(name="First"), ClGpu(name="A processor", type="cpu")],
                       version="OpenCL 1.2 CUDA 8.0.0"),
            ClPlatform([ClGpu(name="Second", vendor_id=0x1002, integrated=True, batch=100_000_000,
                              kernel=1_000_000)])]


def test_whole_report_with_opencl():
    run = run_under_wine(**OPENCL_GPU)
    facts = run.facts
    if facts.get("NumCLGPUs") == "0":
        pytest.skip("no OpenCL driver here presents a GPU")
    assert run.status == 0
    assert facts["NumCLGPUs"] == "1"
    keys = [key.split(".", 1)[1] for key in facts if key.startswith("clgpu[0].")]
    assert keys == ["CLPlatformVersion", "CLDeviceVersion", "IsIntegratedCLGPU", "CLMemoryMB",
                    "CLName", "CLVendor", "CLVendorID", "CLDriverVersion", "CUDASupported",
                    "CLBandwidth", "CLCompute"]
    assert run.lines[-1] == 'assayEnd="STAMP"'


def test_no_opencl_library():
    """With OpenCL.dll overridden, Wine finds none: no OpenCL line at all."""
    run = run_under_wine(WINEDLLOVERRIDES="mscoree,mshtml,opencl=")
    assert run.status == 0
    assert not [line for line in run.lines if "CL" in line.split("=")[0] and "CLGPU" in line]
    assert run.lines[-1] == 'assayEnd="STAMP"'


@pytest.mark.parametrize("option, field", [("crashAfter", "crash_after"),
                                           ("throwAfter", "throw_after")])
def test_failure_at_every_step_of_two_scripted_devices(whole_run, scripted, option, field):
    platforms = two_platforms()
    gpu = gpu_of(whole_run)
    values = cl_values_of(platforms)
    first = predict([gpu], opencl=0).steps - 2
    steps = predict([gpu], opencl=values).steps
    assert steps - first == 26
    # The earlier steps are those of a machine without OpenCL.
    for step in range(first, steps + 1):
        check(scripted(platforms, f"-{option}={step}"),
              predict([gpu], opencl=values, **{field: step}))


@pytest.mark.parametrize("batch, bandwidth", [
    (200_000_000, "1.67772e+09"), (100_000_000, "3.35544e+09"), (0, "0")])
def test_bandwidth_of_scripted_counters(scripted, batch, bandwidth):
    run = scripted([ClPlatform([ClGpu(batch=batch)])])
    assert run.facts["clgpu[0].CLBandwidth"] == bandwidth


@pytest.mark.parametrize("call", ["clCreateContext", "clEnqueueCopyBuffer", "clBuildProgram"])
def test_crash_in_a_linux_driver_is_a_failing_call(scripted, call):
    """Wine survives a crash on the Linux side, and the call returns an error."""
    run = scripted([ClPlatform([ClGpu()])], extra=f"at {call} crash\n")
    assert run.status == 2
    assert run.errors == ["Failed requirement: ciErrNum == CL_SUCCESS",
                          "exception: Failed requirement: ciErrNum == CL_SUCCESS"]
    assert run.lines[-1] == 'assayEnd="STAMP"'


def test_driver_that_aborts_ends_the_child(scripted):
    run = scripted([ClPlatform([ClGpu()])], extra="at clBuildProgram abort\n")
    assert run.status not in (0, 2, 3, 4)
    assert run.lines[-1].startswith("clgpu[0].CLBandwidth=")
