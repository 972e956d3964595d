"""The documents about what is linked in follow the build: by the linker's map, and by readelf."""

import json
import re
import shutil
import subprocess
import sys

import pytest

from harness import BUILD, PROGRAM
from hardening import readelf
from hosting import HOST, TREE

SCRIPTS = TREE / "scripts" / "packages"
CACHE = (BUILD / "CMakeCache.txt").read_text()
LIBRARY = next(BUILD.rglob("libassay-host.so.0.*"), None)
ARCHIVE = next(BUILD.rglob("libassay-host.a"), None)
CONTAINED = ("STATIC_LINK", "CONTAINS")

pytestmark = [
    pytest.mark.skipif(not re.search("^ASSAY_LINK_MAPS:.*=ON$", CACHE, re.MULTILINE)
                       or not re.search("^ASSAY_SANITIZE:.*=$", CACHE, re.MULTILINE),
                       reason="only the builds of packages have maps (ASSAY_LINK_MAPS)"),
    pytest.mark.skipif(not shutil.which("dpkg-query"), reason="this is no Debian system"),
]


def third_party(kind, *files):
    return subprocess.run([SCRIPTS / "third-party", kind, "tried", BUILD, *files], check=True,
                          stdout=subprocess.PIPE).stdout.decode()


def packages_of(file):
    """How each package gets into the file, by the SBOM: {name: relationship}."""
    sbom = json.loads(third_party("sbom", file))
    names = {each["SPDXID"]: each["name"] for each in sbom["packages"]}
    related = {names[each["spdxElementId" if each["relationshipType"].endswith("_OF")
                           else "relatedSpdxElement"]]: each["relationshipType"]
               for each in sbom["relationships"] if each["relationshipType"] != "DESCRIBES"}
    assert len(related) == len(sbom["packages"]) - 1
    return related


def needed_boost(file):
    return set(re.findall(r"\(NEEDED\).*\[libboost_(\w+)\.so", readelf("--dynamic", file)))


@pytest.mark.parametrize("file", [PROGRAM, HOST, LIBRARY], ids=["assay", "assay-host", "libassay-host"])
def test_boost_is_linked_as_in_the_file(file):
    packages = packages_of(file)
    found = {kind: {match.group(1) for name in packages if packages[name] == kind
                    and (match := re.match(r"libboost-(\w+)1", name))}
             for kind in ("STATIC_LINK", "DYNAMIC_LINK")}
    assert found["DYNAMIC_LINK"] == needed_boost(file)
    static = file != LIBRARY and "ASSAY_STATIC_BOOST:BOOL=ON" in CACHE
    assert found["STATIC_LINK"] == ({"thread", "filesystem"} if static else set())
    assert found["STATIC_LINK"] or found["DYNAMIC_LINK"]
    assert packages["libstdc++6"] == "DYNAMIC_LINK"


def test_headers_with_code_are_contained_where_they_are_used():
    child, host = packages_of(PROGRAM), packages_of(HOST)
    for name in ("nlohmann-json3-dev", "libcli11-dev", "libfmt-dev"):
        assert name not in child
        assert host[name] == "CONTAINS"
    assert child["opencl-c-headers"] == "BUILD_DEPENDENCY_OF"
    assert "opencl-c-headers" not in host


def test_a_static_library_contains_what_it_was_compiled_with():
    packages = packages_of(ARCHIVE)
    assert packages["libboost1.74-dev"] == "CONTAINS"
    assert not {"STATIC_LINK", "DYNAMIC_LINK"} & set(packages.values())


def test_notices_are_of_what_is_contained():
    notices = third_party("notices", PROGRAM, HOST)
    packages = packages_of(PROGRAM) | packages_of(HOST)
    named = set(re.findall(r"^([\w.+-]+) \S+: [A-Z]\S+-\d\S*(?: WITH \S+)?$|^([\w.+-]+) \S+: MIT$", notices,
                           re.MULTILINE))
    assert {first or second for first, second in named} == {
        name for name, kind in packages.items() if kind in CONTAINED}
    assert "Boost Software License - Version 1.0" in notices


def test_a_file_that_was_not_built_here_is_refused():
    done = subprocess.run([SCRIPTS / "third-party", "sbom", "tried", BUILD, "/bin/true"], check=False,
                          stdout=subprocess.PIPE, stderr=subprocess.PIPE)
    assert done.returncode == 1
    assert b"the build has no 'true'" in done.stderr


def test_a_package_whose_licence_is_not_known_is_refused(monkeypatch):
    monkeypatch.syspath_prepend(SCRIPTS)
    monkeypatch.setattr(sys, "dont_write_bytecode", True)
    from distribution import Package  # pylint: disable=import-outside-toplevel,import-error
    with pytest.raises(LookupError, match="the licence of the package libnew-dev isn't known"):
        _ = Package("libnew-dev", "1", "amd64").licence
