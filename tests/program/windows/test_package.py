"""The zip for people who don't build."""

import re
import subprocess
import zipfile

import pytest

from conftest import BUILD, NO_OPENCL_PLATFORM, TREE, run_under_wine


@pytest.fixture(scope="module")
def package(tmp_path_factory):
    """The unpacked zip's one folder."""
    if BUILD != TREE / "build" / "windows":
        pytest.skip("the zip is made of build/windows")
    done = subprocess.run([TREE / "scripts" / "package", "windows", "--as-built"],
                          stderr=subprocess.PIPE, text=True, check=True)
    folder = tmp_path_factory.mktemp("unpacked")
    with zipfile.ZipFile(TREE / done.stderr.splitlines()[-1]) as packed:
        packed.extractall(folder)
    [inside] = folder.iterdir()
    return inside


def test_name_tells_version_and_machine(package):
    assert re.fullmatch(r"assay-\d+\.\d+\.\d+-windows-x86_64", package.name)


def test_holds_programs_and_what_to_read(package):
    assert {path.name for path in package.iterdir()} == {
        "assay.exe", "assay-host.exe", "README.md", "docs", "schema", "licences"}
    assert (package / "docs" / "report-format.md").stat().st_size > 0
    for name in ["Boost", "GCC-runtime", "MinGW-w64", "CLI11", "fmt", "nlohmann-json"]:
        assert (package / "licences" / f"{name}.txt").stat().st_size > 0


def test_runs_in_an_empty_prefix(package, tmp_path):
    run = run_under_wine("-exit=5", program=package / "assay.exe",
                         WINEPREFIX=str(tmp_path / "prefix"), **NO_OPENCL_PLATFORM)
    assert run.status == 5
    assert run.lines[-1] == 'assayEnd="STAMP"'


@pytest.mark.parametrize("program", ["assay.exe", "assay-host.exe"])
def test_imports_system_libraries_only(package, program):
    dump = subprocess.run(["x86_64-w64-mingw32-objdump", "-p", package / program],
                          stdout=subprocess.PIPE, check=True, text=True).stdout
    names = {name.lower() for name in re.findall(r"DLL Name: (\S+)", dump)}
    assert names
    assert not names & {"opengl32.dll", "opencl.dll"}
    assert not [name for name in names if name.startswith(("libgcc", "libstdc++", "libwinpthread"))]
