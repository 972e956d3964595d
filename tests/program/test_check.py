"""assay-host check: holds a run or stored reports to requirements."""

import json

import pytest

from harness import EMULATED
from hosting import host_run

DRIVER = pytest.mark.skipif(EMULATED, reason="the machine's driver is for another processor")
START = pytest.mark.skipif(EMULATED, reason="the emulator loses the failure of a start")

WHOLE = """Tester="x"
assayStart="2026-01-01_00:00:00"
QGFCoreInitialized=1
QGFOGLInitialized=1
OGLContextCreated=1
NumGLGPUs=1
glgpu[0].GLVersion="4.1"
glgpu[0].GLMemoryMB={memory}
NumCLGPUs=0
assayEnd="2026-01-01_00:00:01"
"""


@pytest.fixture(name="stored")
def fixture_stored(tmp_path):
    def store(name, memory):
        path = tmp_path / name
        path.write_text(WHOLE.format(memory=memory), encoding="ascii")
        return str(path)
    return store


def requirements(*texts):
    return [word for text in texts for word in ("--require", text)]


@DRIVER
def test_run_that_meets_all():
    hosted = host_run("check", *requirements("NumGLGPUs>=1", "GLVersion>=3.3", "all GLFrameBufferOK==1"))
    assert (hosted.status, hosted.text, hosted.err) == (0, "met: all 3 requirements\n", b"")


@DRIVER
def test_run_that_misses_some():
    hosted = host_run("check", *requirements("GLVersion>=9", "NumGLGPUs>=1", "opengl.devices>=8"))
    assert (hosted.status, hosted.err) == (7, b"")
    assert hosted.text == "not met: GLVersion>=9: glgpu[0] 4.1\nnot met: opengl.devices>=8: 1\n"


def test_run_that_ends_early_has_its_own_status():
    hosted = host_run("check", *requirements("NumGLGPUs>=1"), "--", "-crashAfter=1")
    lines = hosted.text.splitlines()
    assert hosted.status == 1
    assert lines[0].startswith("failed-tests: The report stopped while starting (assayStart); ")
    assert lines[1:] == ["not met: NumGLGPUs>=1: not known (run ended before)"]


@START
def test_child_that_cannot_be_started():
    hosted = host_run("check", "--assay", "/nowhere/assay", *requirements("NumGLGPUs>=1"))
    assert hosted.status == 5
    assert hosted.text.startswith("never-started: ")


def test_stored_report(stored):
    path = stored("a", 1024)
    assert host_run("check", "--from", path, *requirements("GLMemoryMB>=1024")).text == "met: the requirement\n"
    hosted = host_run("check", "--from", path, *requirements("GLMemoryMB>=2048"))
    assert (hosted.status, hosted.text) == (7, "not met: GLMemoryMB>=2048: glgpu[0] 1024\n")


def test_each_of_several_reports_is_named(stored):
    good, bad = stored("good", 4096), stored("bad", 0)
    hosted = host_run("check", "--from", good, "--from", bad, *requirements("GLMemoryMB>=2048"))
    lines = hosted.text.splitlines()
    assert hosted.status == 7
    assert lines[0] == f"{good}: met: the requirement"
    assert lines[1].startswith(f"{bad}: not met: GLMemoryMB>=2048: glgpu[0] not known (")


@pytest.mark.parametrize("form", ["json", "jsonl"])
def test_stored_document_is_checked_as_its_run(form, tmp_path):
    path = tmp_path / form
    path.write_bytes(host_run("run", "--format", form).out)
    words = requirements("GLVersion>=9", "NumGLGPUs>=1", "opengl.devices>=8")
    stored, ran = host_run("check", "--from", str(path), *words), host_run("check", *words)
    assert (stored.status, stored.text) == (ran.status, ran.text)
    assert ran.status == 7


def test_file_of_requirements(tmp_path, stored):
    rules = tmp_path / "rules.json"
    rules.write_text(json.dumps({"require": ["GLMemoryMB>=2048", "GLVersion>=4"]}), encoding="ascii")
    hosted = host_run("check", "--from", stored("a", 1024), "--requirements", str(rules),
                      *requirements("NumCLGPUs>=1"))
    assert hosted.text == ("not met: NumCLGPUs>=1: 0\n"
                           "not met: GLMemoryMB>=2048: glgpu[0] 1024\n")


def test_reports_are_held_to_a_baseline(stored):
    good, less, same = stored("good", 4096), stored("less", 2048), stored("same", 4096)
    hosted = host_run("check", "--baseline", good, less, same)
    assert (hosted.status, hosted.err) == (7, b"")
    assert hosted.text == (f"{less}: not as the baseline: glgpu[0].GLMemoryMB: 4096 -> 2048\n"
                           f"{same}: met: the baseline\n")
    both = host_run("check", "--baseline", good, "--require", "GLVersion>=4", "--from", same)
    assert (both.status, both.text) == (0, "met: the requirement and the baseline\n")


def test_run_is_held_to_a_baseline(tmp_path):
    """Another run of this machine: times and measurements differ."""
    path = tmp_path / "baseline"
    path.write_bytes(host_run("run", "--format", "json", "--identify").out)
    hosted = host_run("check", "--baseline", str(path), "--tolerance", "1")
    assert (hosted.status, hosted.text) == (0, "met: the baseline\n")


def test_unreadable_file_does_not_hide_the_others(stored):
    good, bad = stored("good", 4096), stored("bad", 1)
    hosted = host_run("check", "--require", "GLMemoryMB>=2048", "/nowhere/x", good, bad)
    assert (hosted.status, hosted.err) == (
        10, b"assay-host: /nowhere/x: can't open: No such file or directory\n")
    assert hosted.text == (f"{good}: met: the requirement\n"
                           f"{bad}: not met: GLMemoryMB>=2048: glgpu[0] 1\n")


def test_document_is_checked_by_how_its_run_ended(tmp_path):
    path = tmp_path / "document"
    ran = host_run("run", "--format", "json", "--", "-crashAfter=4")
    path.write_bytes(ran.out)
    hosted = host_run("check", "--require", "opengl.usable==hardware", str(path))
    usable = json.loads(ran.out)["usable"]["opengl"]
    assert hosted.text == (f"not met: opengl.usable==hardware: {usable['answer']} ({usable['text']})\n")


def test_difference_of_identity_is_shown_if_asked(tmp_path):
    document = json.loads(host_run("run", "--format", "json", "--identify").out)
    files = []
    for name, time in (("one", "2026-11-22T01:26:02Z"), ("two", "2026-11-23T01:26:02Z")):
        document["environment"].update(time=time, host={"known": True, "value": name})
        files.append(tmp_path / name)
        files[-1].write_text(json.dumps(document), encoding="utf-8")
    assert host_run("diff", *files).text == ""
    hosted = host_run("diff", "--identity", *files)
    assert (hosted.status, hosted.text) == (
        1, "host: one -> two\ntime: 2026-11-22T01:26:02Z -> 2026-11-23T01:26:02Z\n")


@pytest.mark.parametrize("words, message", [
    (["--require", "GLMemoryMb>=1"],
     'assay-host: "GLMemoryMb>=1": there is no key "GLMemoryMb"; did you mean GLMemoryMB?\n'),
    (["--requirements", "/nowhere/rules"], "assay-host: /nowhere/rules: cannot be opened\n"),
    (["--from", "/nowhere/report", "--require", "NumGLGPUs>=1"],
     "assay-host: /nowhere/report: can't open: No such file or directory\n"),
])
def test_errors(words, message):
    hosted = host_run("check", *words)
    assert (hosted.status, hosted.out, hosted.err.decode()) == (10, b"", message)
