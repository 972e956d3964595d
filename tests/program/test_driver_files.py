"""The files that drivers load, in the log of the program and in the documents of its host: on the machine's
own drivers compared with what the dynamic loader tells, and with scripted ones that end the program."""

import ctypes.util
import os
import re
import shutil
import subprocess
from pathlib import Path

import pytest

from calls import PREFIX, FullMachine
from harness import BUILD, PROGRAM, PROGRAM_AT_ROOT, SCRIPTED_EGL, Host, record_so_far
from hosting import decode, host_run, host_run_until, validate_document, validate_events

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")

ASK = "-verbose=0x101"
SCRIPTED_GL = str(SCRIPTED_EGL.resolve() / "libEGL.so.1")
SCRIPTED_CL = str(BUILD / "drivers" / "opencl" / "libscripted_opencl.so")
# The program loads it for the names of adapters.
OWN = "libpciaccess.so"


def node_of(path):
    """What all names of a file have in common."""
    status = os.stat(path)
    return status.st_dev, status.st_ino


def files_of(run, interface):
    start = f"loaded for {interface}: "
    texts = [PREFIX.sub("", line) for line in run.comments]
    return [text[len(start):] for text in texts if text.startswith(start)]


def run_machine(folder, *options, gl="", cl=""):
    host, found = FullMachine(folder).host("run", gl, cl)
    return host.run(*options, **found)


def test_the_real_drivers_are_those_of_the_dynamic_loader(tmp_path):
    host = Host(tmp_path, {"LD_DEBUG": "files", "LD_DEBUG_OUTPUT": str(tmp_path / "loader"),
                           "RUSTICL_ENABLE": "llvmpipe", "RUSTICL_DEVICE_TYPE": "gpu"})
    run = host.run(ASK, egl="real", opencl="real")
    loaded, unloaded = set(), set()
    for file in tmp_path.glob("loader.*"):
        text = file.read_text(errors="replace")
        if f"initialize program: {PROGRAM}" not in text:
            continue
        rest = text[text.index("transferring control"):]
        loaded.update(re.findall(r"calling init: (/.*)$", rest, re.MULTILINE))
        unloaded.update(re.findall(r"file=(/.*) \[\d+\];  destroying link map", rest))
    if not loaded:
        pytest.skip("this machine's dynamic loader doesn't tell what it loads")
    expected = {node_of(path): path for path in loaded}
    listed = [path for kind in ("OpenGL", "OpenCL") for path in files_of(run, kind)]
    found = {node_of(path): path for path in listed}
    assert len(found) == len(listed)
    assert {found[node] for node in found.keys() - expected.keys()} == set()
    # A library that is gone when the call ends isn't seen.
    missing = {expected[node] for node in expected.keys() - found.keys()} - unloaded
    assert {path for path in missing if not Path(path).name.startswith(OWN)} == set()


def test_the_scripted_drivers_are_listed(tmp_path):
    run = run_machine(tmp_path, ASK)
    assert PREFIX.sub("", run.comments[0]) == "driver files are logged"
    assert SCRIPTED_GL in files_of(run, "OpenGL")
    assert SCRIPTED_CL in files_of(run, "OpenCL")
    assert not set(files_of(run, "OpenGL")) & set(files_of(run, "OpenCL"))
    own = [path for path in files_of(run, "OpenGL") + files_of(run, "OpenCL")
           if OWN in path or re.search(r"/lib(c|m)\.so", path)]
    assert own == []


def test_each_file_follows_the_call_that_loaded_it(tmp_path):
    host, found = FullMachine(tmp_path).host("run", "record /dev/stdout\n", "record /dev/stdout\n")
    lines = host.run(ASK, **found).lines
    at = {text: next(index for index, line in enumerate(lines) if text in line)
          for text in (SCRIPTED_GL, " eglQueryString", SCRIPTED_CL, " clGetDeviceIDs")}
    assert at[SCRIPTED_GL] < at[" eglQueryString"] < at[SCRIPTED_CL] < at[" clGetDeviceIDs"]


@pytest.mark.parametrize("end", ["crash", "abort", "_exit 42"])
@pytest.mark.parametrize("call", ["eglQueryDevicesEXT", "eglInitialize", "glLinkProgram"])
def test_an_opengl_driver_that_ends_the_program(tmp_path, call, end):
    run = run_machine(tmp_path, ASK, gl=f"at {call} {end}\n")
    assert run.status != 0
    assert SCRIPTED_GL in files_of(run, "OpenGL")
    assert files_of(run, "OpenCL") == []


@pytest.mark.parametrize("end", ["crash", "abort", "_exit 42"])
@pytest.mark.parametrize("call", ["clGetDeviceIDs", "clBuildProgram"])
def test_an_opencl_driver_that_ends_the_program(tmp_path, call, end):
    run = run_machine(tmp_path, ASK, cl=f"at {call} {end}\n")
    assert run.status != 0
    assert SCRIPTED_GL in files_of(run, "OpenGL")
    assert SCRIPTED_CL in files_of(run, "OpenCL")


def test_what_the_crashing_call_loaded_is_missing(tmp_path):
    """OpenCL's loader library loads the driver and calls it, in one call of the program's."""
    run = run_machine(tmp_path, ASK, cl="at clGetPlatformInfo crash\n")
    assert run.status != 0
    assert SCRIPTED_CL not in files_of(run, "OpenCL")
    assert any("libOpenCL.so" in path for path in files_of(run, "OpenCL"))


@pytest.mark.parametrize("verbose", ["-257", "-256", "-1", "0", "1", "2", "255", "512"])
def test_the_log_has_no_files_unless_asked(tmp_path, verbose):
    run = run_machine(tmp_path, f"-verbose={verbose}")
    assert "loaded for" not in run.report
    assert "driver files" not in run.report


def test_the_report_is_the_same_with_the_files(tmp_path):
    plain = run_machine(tmp_path, "-verbose=1")
    asked = run_machine(tmp_path, ASK)
    assert asked.status == plain.status
    assert asked.err == plain.err

    def texts_of(run):
        return [re.sub(r"seconds?=\S+|duration=\S+|totalSeconds=\S+|BW=\S+|result=\S+|tamp.*|"
                       r"assay(Start|End)=.*|Bandwidth=.*|Compute=.*|of 100.*", "",
                       PREFIX.sub("", line)) for line in run.lines]

    kept = [text for text in texts_of(asked)
            if not text.startswith(("loaded for ", "driver files are logged"))]
    assert kept == texts_of(plain)


def host(folder, gl="", cl="", form="json", options=(), until=None):
    """Runs the program by its host. `until`: the library and the call that must have been made before the
    time is up."""
    records = {"gl": folder / "gl-record", "cl": folder / "cl-record"}
    machine, found = FullMachine(folder).host("run", f"record {records['gl']}\n" + gl,
                                              f"record {records['cl']}\n" + cl)
    arguments = ["run", "--assay", str(PROGRAM_AT_ROOT), "--format", form, *options]
    environment = machine.environment(**found)
    if until is None:
        return host_run(*arguments, environment=environment)
    library, call = until
    return host_run_until(
        lambda: any(made.name == call for made in record_so_far(records[library])), folder,
        *arguments, environment=environment)


def paths_of(document, interface=None):
    assert document["drivers"]["known"]
    return [os.fsdecode(decode(file["path"])) for file in document["drivers"]["files"]
            if interface in (None, file["interface"])]


def test_the_document_has_versions_and_build_ids(tmp_path):
    readelf = shutil.which("readelf")
    if readelf is None:
        pytest.skip("this machine has no readelf")
    machine = Host(tmp_path, {"RUSTICL_ENABLE": "llvmpipe", "RUSTICL_DEVICE_TYPE": "gpu"})
    hosted = host_run("run", "--assay", str(PROGRAM), "--format", "json",
                      environment=machine.environment(egl="real", opencl="real"))
    document = validate_document(hosted.out)
    paths = paths_of(document)
    assert paths
    assert [path for path in paths if os.path.realpath(path) != path] == []
    assert [path for path in paths if re.search(r"/lib(c|m|pthread|stdc\+\+)\.so", path)] == []
    for path, file in zip(paths, document["drivers"]["files"]):
        version = re.search(r"\.so\.([0-9.]+)$", path)
        if version and "-" not in Path(path).name:
            assert file["version"]["value"] == version[1]
        notes = subprocess.run([readelf, "-n", path], stdout=subprocess.PIPE, check=True).stdout
        build = re.search(rb"Build ID: ([0-9a-f]+)", notes)
        assert file["buildId"].get("value") == (build[1].decode() if build else None)


def test_the_document_has_the_scripted_drivers(tmp_path):
    document = validate_document(host(tmp_path).out)
    assert SCRIPTED_GL in paths_of(document, "OpenGL")
    assert SCRIPTED_CL in paths_of(document, "OpenCL")
    # They are no part of the report, the warnings and the causes.
    assert {line["kind"] for line in document["lines"]} == {"value"}
    assert "loaded for" not in str(document["warnings"]) + str(document["outcome"])


@pytest.mark.parametrize("end", ["crash", "abort", "_exit 42"])
@pytest.mark.parametrize("call", ["eglInitialize", "glLinkProgram"])
def test_the_document_of_a_driver_that_ends_the_child(tmp_path, call, end):
    document = validate_document(host(tmp_path, gl=f"at {call} {end}\n").out)
    assert document["outcome"]["verdict"] == ("failed-tests" if end == "_exit 42" else "crashed")
    assert SCRIPTED_GL in paths_of(document, "OpenGL")
    assert paths_of(document, "OpenCL") == []
    assert "loaded for" not in (document["outcome"]["lastLogLine"] or "")


def test_the_document_of_a_driver_that_hangs(tmp_path):
    hosted = host(tmp_path, gl="at glLinkProgram hang\n", until=("gl", "glLinkProgram"))
    document = validate_document(hosted.out)
    assert document["outcome"]["verdict"] == "hung"
    assert SCRIPTED_GL in paths_of(document, "OpenGL")


def test_the_other_forms(tmp_path):
    events = validate_events(host(tmp_path, form="jsonl").out)
    assert SCRIPTED_GL in paths_of(events[-1], "OpenGL")
    first = validate_document(host(tmp_path, options=("--schema", "1")).out)
    assert "drivers" not in first
    assert b"loaded for" not in host(tmp_path, form="text").out


def test_a_child_without_a_list(tmp_path):
    asked = validate_document(host(tmp_path, options=("--", "-verbose=0")).out)
    assert asked["drivers"] == {"known": False, "reason": "the child did not log them"}
    own = validate_document(host(tmp_path, options=("--", "-verbose=0x101")).out)
    assert SCRIPTED_GL in paths_of(own, "OpenGL")
    first = validate_document(host(tmp_path, options=("--", "-verbose=1")).out)
    assert first["drivers"] == {"known": False, "reason": "the child did not log them"}
    missing = host_run("run", "--assay", str(tmp_path / "none"), "--format", "json")
    assert validate_document(missing.out)["drivers"] == \
        {"known": False, "reason": "the child was not started"}
