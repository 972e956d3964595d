"""assay-host.exe torture under Wine: a failure at every step."""

import re

from clmodel import ClGpu, ClPlatform
from conftest import BUILD, NO_OPENCL_PLATFORM, run_under_wine, scripted_opencl
from harness import text_of

HOST = BUILD / "bin" / "assay-host.exe"


def test_torture():
    run = run_under_wine("torture", program=HOST, **NO_OPENCL_PLATFORM)
    assert run.status == 0, text_of(run.out)
    assert re.search(r"92 runs, each as predicted", text_of(run.out))


def test_torture_with_opencl(tmp_path):
    run = run_under_wine("torture", "--kind", "crash", program=HOST,
                         **scripted_opencl(tmp_path, [ClPlatform([ClGpu()])]))
    assert run.status == 0, text_of(run.out)
    assert text_of(run.out).startswith("1 OpenGL and 1 OpenCL devices, ")
