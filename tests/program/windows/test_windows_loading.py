"""The programs and the DLL load libraries only from the system's folder."""

import os
import shutil
import subprocess

import pefile
import pytest

from conftest import BUILD, NO_OPENCL_PLATFORM, PROGRAM, TREE, run_under_wine

PLANTED = BUILD / "drivers" / "planted" / "planted.dll"
NAMES = ["OpenCL.dll", "opengl32.dll", "dxgi.dll"]
LOADED = "planted library loaded"
# Wine's own libraries come last, as Windows has no such choice.
NATIVE_FIRST = "mscoree,mshtml=;opencl,opengl32,dxgi=n,b"

# Libraries that Windows maps at its start and loads from there, never by a search
# (HKLM\SYSTEM\CurrentControlSet\Control\Session Manager\KnownDLLs of Windows 10 and 11), and those
# mapped into every process before any search.
KNOWN = {"advapi32.dll", "combase.dll", "gdi32.dll", "kernel32.dll", "msvcrt.dll", "ole32.dll",
         "oleaut32.dll", "rpcrt4.dll", "sechost.dll", "shell32.dll", "shlwapi.dll", "user32.dll",
         "ws2_32.dll", "ntdll.dll"}


def imports_of(program):
    image = pefile.PE(str(program))
    names = {entry.dll.decode().lower() for entry in image.DIRECTORY_ENTRY_IMPORT}
    delayed = getattr(image, "DIRECTORY_ENTRY_DELAY_IMPORT", [])
    return names | {entry.dll.decode().lower() for entry in delayed}


@pytest.mark.parametrize("program", ["assay.exe", "assay-host.exe", "assay-host.dll"])
def test_imports_nothing_that_could_be_planted(program):
    names = imports_of(BUILD / "bin" / program)
    assert "kernel32.dll" in names
    assert names - KNOWN == set()


def plant(folder):
    for name in NAMES:
        shutil.copy(PLANTED, folder / name)


def test_planted_library_prints_its_message(tmp_path):
    """A planted library prints the message that the tests below look for when it is loaded."""
    plant(tmp_path)
    for name in NAMES:
        done = subprocess.run([TREE / "scripts" / "run-under-wine", "rundll32.exe",
                               str(tmp_path / name) + ",Nothing"], stdin=subprocess.DEVNULL,
                              stdout=subprocess.PIPE, stderr=subprocess.PIPE, timeout=120,
                              env={**os.environ, "WINEDLLOVERRIDES": NATIVE_FIRST}, check=False)
        assert LOADED in done.stderr.decode()


def check_whole_run(run):
    assert LOADED not in run.errors
    assert run.facts["OGLContextCreated"] == "1"
    assert run.lines[-1] == 'assayEnd="STAMP"'


def test_program_folder_is_not_searched(tmp_path):
    plant(tmp_path)
    program = tmp_path / "assay.exe"
    shutil.copy(PROGRAM, program)
    check_whole_run(run_under_wine(program=program, WINEDLLOVERRIDES=NATIVE_FIRST,
                                   **NO_OPENCL_PLATFORM))


@pytest.mark.parametrize("place", ["current", "path"])
def test_nothing_else_is_searched_for_what_the_system_lacks(own_prefix, tmp_path, place):
    """These places would be searched after the system's folder, for a library that it lacks."""
    plant(tmp_path)
    (own_prefix / "drive_c" / "windows" / "system32" / "opencl.dll").unlink(missing_ok=True)
    run = run_under_wine(cwd=tmp_path if place == "current" else None,
                         WINEPATH=str(tmp_path) if place == "path" else "",
                         WINEPREFIX=str(own_prefix), WINEDLLOVERRIDES="mscoree,mshtml=;opencl=n")
    check_whole_run(run)
    assert "NumCLGPUs" not in run.facts


def test_no_opengl_library():
    """Without opengl32.dll, and so without Wine's dxgi.dll, the program reports no OpenGL."""
    run = run_under_wine(WINEDLLOVERRIDES="mscoree,mshtml,opengl32,dxgi=", **NO_OPENCL_PLATFORM)
    assert run.status == 0
    assert run.facts["QGFOGLInitialized"] == "0"
    assert run.facts["NumGLGPUs"] == "0"
    assert run.lines[-1] == 'assayEnd="STAMP"'
