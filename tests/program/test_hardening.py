"""The flags of the optimised build are in the programs and in the shared library."""

import re

import pytest

from hardening import not_hardened
from harness import BUILD, PROGRAM
from hosting import HOST

CACHE = (BUILD / "CMakeCache.txt").read_text()
LIBRARY = next(BUILD.rglob("libassay-host.so.0"), None)

pytestmark = pytest.mark.skipif(
    not re.search("^CMAKE_BUILD_TYPE:.*=Release$", CACHE, re.MULTILINE)
    or not re.search("^ASSAY_SANITIZE:.*=$", CACHE, re.MULTILINE),
    reason="only an optimised build is hardened")


@pytest.mark.parametrize("file", [PROGRAM, HOST, LIBRARY], ids=["assay", "assay-host", "libassay-host"])
def test_hardening(file):
    assert not_hardened(file) == []
