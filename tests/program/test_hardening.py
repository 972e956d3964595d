"""The flags of the optimised build are in the programs."""

import re
import subprocess

import pytest

from harness import BUILD, PROGRAM
from hosting import HOST

CACHE = (BUILD / "CMakeCache.txt").read_text()

pytestmark = pytest.mark.skipif(
    not re.search("^CMAKE_BUILD_TYPE:.*=Release$", CACHE, re.MULTILINE)
    or not re.search("^ASSAY_SANITIZE:.*=$", CACHE, re.MULTILINE),
    reason="only an optimised build is hardened")


def readelf(option, program):
    return subprocess.run(["readelf", "--wide", option, program], check=True,
                          stdout=subprocess.PIPE).stdout.decode()


@pytest.mark.parametrize("program", [PROGRAM, HOST], ids=["assay", "assay-host"])
def test_hardening(program):
    assert re.search(r"FLAGS_1.*\bNOW\b", readelf("--dynamic", program))
    assert "GNU_RELRO" in readelf("--segments", program)
    assert re.search(r"^\s*Type:\s*DYN", readelf("--file-header", program), re.MULTILINE)
    symbols = readelf("--dyn-syms", program)
    assert "__stack_chk_fail@" in symbols
    assert re.search(r"__\w+_chk@", symbols)
