"""The zip of the Windows programs."""

import json
import os
import re
import shutil
import subprocess
import zipfile

import pefile
import pytest

from conftest import BUILD, NO_OPENCL_PLATFORM, TREE, run_under_wine
from harness import text_of
from links import dead_links


def pack(tmp_path, **variables):
    """Makes the zip and unpacks it. Returns its folder and the script's messages."""
    done = subprocess.run([TREE / "scripts" / "package", "windows", "--as-built"],
                          stderr=subprocess.PIPE, text=True, check=True,
                          env={**os.environ, **variables})
    with zipfile.ZipFile(TREE / done.stderr.splitlines()[-1]) as packed:
        packed.extractall(tmp_path)
    [inside] = tmp_path.iterdir()
    return inside, done.stderr


@pytest.fixture(scope="module")
def package(tmp_path_factory):
    """The folder of the unpacked zip."""
    if BUILD != TREE / "build" / "windows":
        pytest.skip("the zip is made of build/windows")
    return pack(tmp_path_factory.mktemp("unpacked"))[0]


def test_name_has_version_and_machine(package):
    assert re.fullmatch(r"assay-\d+\.\d+\.\d+-windows-x86_64", package.name)


def test_has_programs_documents_and_licences(package):
    assert {path.name for path in package.iterdir()} == {
        "assay.exe", "assay-host.exe", "assay-host.dll", "include", "lib", "examples", "README.md",
        "ARCHITECTURE.md", "CONTRIBUTING.md", "docs", "schema", "check.cmd", "check", "LICENSE", "CHANGELOG.md", "THIRD-PARTY-NOTICES.txt", "assay.spdx.json"}
    assert (package / "docs" / "report-format.md").stat().st_size > 0
    assert not list((package / "docs").rglob("*.scd"))
    assert {path.name for path in (package / "include").iterdir()} == {
        "assay_host.h", "assay_host.hpp"}
    assert {path.name for path in (package / "lib").iterdir()} == {
        "libassay-host.dll.a", "assay-host.def", "cmake"}
    assert {path.name for path in (package / "lib" / "cmake" / "assay-host").iterdir()} == {
        "assay-hostConfig.cmake", "assay-hostConfigVersion.cmake"}
    assert {path.name for path in (package / "examples").iterdir()} == {
        "decide.c", "decide.cpp", "decide.js", "decide.py", "desktop.cpp"}
    assert dead_links(package) == []


def build_example(package, folder, compiler, source, library, *options):
    """Builds a program with the files of the zip only. Returns its path, beside the DLL."""
    program = folder / f"{source}.exe"
    subprocess.run([f"x86_64-w64-mingw32-{compiler}-posix", *options, "-I", package / "include",
                    package / "examples" / source, library, "-o", program,
                    "-static", "-static-libgcc"], check=True)
    for name in ("assay-host.dll", "assay.exe"):
        shutil.copy(package / name, folder)
    return program


def check_decision(program, *arguments, first):
    run = run_under_wine(*arguments, program=program, **NO_OPENCL_PLATFORM)
    assert run.status == 0, text_of(run.err)
    assert run.lines[0].startswith(first)


@pytest.mark.parametrize("compiler, source, option", [
    ("gcc", "decide.c", "-std=c99"), ("g++", "decide.cpp", "-std=c++17")])
def test_examples_are_built_from_it_and_decide(package, tmp_path, compiler, source, option):
    program = build_example(package, tmp_path, compiler, source,
                            package / "lib" / "libassay-host.dll.a", option)
    check_decision(program, first="complete: ")
    check_decision(program, package / "check" / "test_child.exe", "abort", first="crashed: ")


def configure_consumer(package, build):
    """Configures a project of its own that uses the zip. Returns its exit status and messages."""
    done = subprocess.run([
        "cmake", "-G", "Ninja", "-S", TREE / "tests" / "consumer" / "windows", "-B", build,
        f"-DCMAKE_TOOLCHAIN_FILE={TREE / 'cmake' / 'mingw-w64-toolchain.cmake'}",
        f"-Dassay-host_DIR={package / 'lib' / 'cmake' / 'assay-host'}",
        f"-DEXAMPLES={package / 'examples'}"],
        stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False)
    return done.returncode, done.stdout


def test_a_cmake_project_finds_it(package, tmp_path):
    """Also if the folder was moved."""
    moved = shutil.copytree(package, tmp_path / "moved folder")
    status, messages = configure_consumer(moved, tmp_path / "build")
    assert status == 0, messages
    subprocess.run(["cmake", "--build", tmp_path / "build"], check=True)
    for language in ("c", "cpp"):
        program = tmp_path / "build" / f"decide-{language}.exe"
        check_decision(program, first="complete: ")
        check_decision(program, moved / "check" / "test_child.exe", "abort", first="crashed: ")


def test_a_cmake_project_refuses_another_version(package, tmp_path):
    moved = shutil.copytree(package, tmp_path / "moved", ignore=shutil.ignore_patterns("check"))
    version = moved / "lib" / "cmake" / "assay-host" / "assay-hostConfigVersion.cmake"
    text = version.read_text(encoding="utf-8")
    version.write_text(text.replace('"1.', '"2.'), encoding="utf-8")
    status, messages = configure_consumer(moved, tmp_path / "build")
    assert status != 0
    assert "assay-host" in messages


def test_list_of_exports_makes_an_import_library(package, tmp_path):
    library = tmp_path / "assay-host.lib"
    subprocess.run(["x86_64-w64-mingw32-dlltool", "-d", package / "lib" / "assay-host.def",
                    "-D", "assay-host.dll", "-l", library], check=True)
    program = build_example(package, tmp_path, "gcc", "decide.c", library)
    check_decision(program, first="complete: ")


# The unit tests for the user's machine have GoogleTest.
LINKED = {"boost1.74", "googletest", "g++-mingw-w64-x86-64-posix", "gcc-mingw-w64-x86-64-posix",
          "mingw-w64-x86-64-dev"}
CODE_OF_HEADERS = {"libboost1.74-dev", "libcli11-dev", "libfmt-dev", "nlohmann-json3-dev"}


def test_names_what_is_linked_in(package):
    notices = (package / "THIRD-PARTY-NOTICES.txt").read_text(encoding="utf-8")
    sbom = json.loads((package / "assay.spdx.json").read_text(encoding="utf-8"))
    packages = {each["SPDXID"]: each for each in sbom["packages"]}
    related = {packages[each["relatedSpdxElement"]]["name"]: each["relationshipType"]
               for each in sbom["relationships"]}
    assert {name for name, kind in related.items() if kind == "STATIC_LINK"} == LINKED
    assert {name for name, kind in related.items() if kind == "CONTAINS"} == CODE_OF_HEADERS
    assert "DYNAMIC_LINK" not in related.values()
    for each in packages.values():
        if each["name"] in LINKED | CODE_OF_HEADERS:
            assert f"{each['name']} {each['versionInfo']}: {each['licenseConcluded']}\n" in notices


def test_runs_in_an_empty_prefix(package, tmp_path):
    run = run_under_wine("-exit=5", program=package / "assay.exe",
                         WINEPREFIX=str(tmp_path / "prefix"), **NO_OPENCL_PLATFORM)
    assert run.status == 5
    assert run.lines[-1] == 'assayEnd="STAMP"'


def test_has_no_symbols_and_debug_sections(package):
    programs = sorted(package.rglob("*.exe"))
    assert len(programs) > 2
    for program in [*programs, package / "assay-host.dll"]:
        image = pefile.PE(str(program), fast_load=True)
        # A name of more than 8 characters, such as ".debug_info", is a reference: "/4".
        names = [section.Name.rstrip(b"\0") for section in image.sections]
        assert b".text" in names
        assert not [name for name in names if name.startswith((b"/", b".debug"))]
        assert image.FILE_HEADER.NumberOfSymbols == 0


def test_check_script(package):
    """The quick part of the script passes, and all unit tests are included for the whole of it."""
    run = run_under_wine("/c", "check.cmd", "quick", program="cmd.exe", cwd=package,
                         **NO_OPENCL_PLATFORM)
    assert run.status == 0, text_of(run.out)
    assert run.lines[-1] == "All checks passed."
    assert len(run.lines) == 11
    assert all(line.startswith("ok    ") for line in run.lines[:-1])
    script = (package / "check.cmd").read_bytes()
    assert b"\n" not in script.replace(b"\r\n", b""), "Windows' own line ends"
    units = {path.name for path in (TREE / "tests" / "unit").iterdir()} - {"support"}
    assert {f"{unit}_tests.exe" for unit in units} | {"test_child.exe", "test_module.dll",
                                                          "decide_c.exe"} == {
        path.name for path in (package / "check").iterdir()}


def test_check_script_names_what_fails(package, tmp_path):
    broken = tmp_path / "broken"
    shutil.copytree(package, broken)
    (broken / "assay-host.dll").write_bytes(b"no library")
    child = broken / "check" / "test_child.exe"
    units = sorted((broken / "check").glob("*_tests.exe"))
    for program in [broken / "assay.exe", *units]:
        shutil.copy(child, program)
    run = run_under_wine("/c", "check.cmd", program="cmd.exe", cwd=broken, **NO_OPENCL_PLATFORM)
    assert run.status == 1
    assert "FAIL  assay prints a whole report: status 1 instead of 0" in run.lines
    assert "ok    assay-host starts" in run.lines
    assert [line for line in run.lines if "by the DLL" in line][0].startswith("FAIL  ")
    assert [line for line in run.lines if "unit tests" in line] == [
        f"FAIL  unit tests: {unit.name}: status 98 instead of 0" for unit in units]


def test_signature(package, tmp_path_factory):
    """With a certificate every program is signed; without one the script reports it."""
    folder = tmp_path_factory.mktemp("certificate")
    key, certificate, both, password = [folder / name for name in
                                        ("key.pem", "certificate.pem", "both.p12", "password")]
    password.write_text("secret")
    subprocess.run(["openssl", "req", "-x509", "-newkey", "rsa:2048", "-nodes", "-days", "2",
                    "-subj", "/CN=test", "-addext", "extendedKeyUsage=codeSigning", "-keyout", key,
                    "-out", certificate], stderr=subprocess.DEVNULL, check=True)
    subprocess.run(["openssl", "pkcs12", "-export", "-inkey", key, "-in", certificate, "-out", both,
                    "-passout", f"file:{password}"], check=True)
    signed, messages = pack(tmp_path_factory.mktemp("signed"), ASSAY_SIGN_CERTIFICATE=str(both),
                        ASSAY_SIGN_PASSWORD_FILE=str(password))
    assert "Not signed" not in messages
    for program in [*signed.rglob("*.exe"), signed / "assay-host.dll"]:
        subprocess.run(["osslsigncode", "verify", "-CAfile", certificate, "-in", program],
                       stdout=subprocess.DEVNULL, check=True)
    _, messages = pack(tmp_path_factory.mktemp("unsigned"))
    assert "Not signed: ASSAY_SIGN_CERTIFICATE names no certificate" in messages
    unsigned = subprocess.run(["osslsigncode", "verify", "-in", package / "assay.exe"],
                              stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, check=False)
    assert unsigned.returncode != 0
