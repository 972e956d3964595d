"""assay-host.exe under Wine: verdicts, formats, hostile children, every step."""

import json
import os
import random
import re
import signal
import subprocess
import sys
import tempfile
import zipfile
from pathlib import Path

import pytest

from clmodel import ClGpu, ClPlatform
from conftest import (
    BUILD, NO_OPENCL_PLATFORM, SECONDS, TREE, run_under_wine, scripted_opencl, wine_desktop)
from harness import text_of, until
from test_host_help import HELP

sys.path.insert(0, str(TREE / "tests" / "schema"))
pytest.importorskip("jsonschema", reason="python3-jsonschema isn't there")

from validate import report_bytes, validate_document, validate_events  # noqa: E402

HOST = BUILD / "bin" / "assay-host.exe"
CHILD = BUILD / "bin" / "test_child.exe"
REPORT = ["out", 'assayStart="x"', "out", 'assayEnd="y"']
# In seconds: more than a child needs, and the time for one that hangs.
TIMEOUT = 120
HANG_TIMEOUT = 10


@pytest.fixture(autouse=True, scope="module")
def desktop():
    """A desktop that a child started would be its descendant, and be killed with it."""
    with wine_desktop():
        yield


def host_run(*arguments, **variables):
    return run_under_wine(*arguments, program=HOST, **{**NO_OPENCL_PLATFORM, **variables})


def document_of(run):
    document = validate_document(run.out)
    assert run.status == document["outcome"]["status"]
    return document


def run_child(*words, timeout=TIMEOUT, program=CHILD):
    return document_of(host_run("run", "--assay", str(program), "--format", "json", "--timeout",
                                str(timeout), "--", *words))


def test_complete():
    document = document_of(host_run("run", "--format", "json"))
    assert document["outcome"]["verdict"] == "complete"
    kept = report_bytes(document).replace(b"\r\n", b"\n")
    stamps = re.compile(rb'="\d{4}-\d\d-\d\d_\d\d:\d\d:\d\d"')
    bare = run_under_wine(**NO_OPENCL_PLATFORM)
    assert stamps.sub(b"", kept) == stamps.sub(b"", bare.out)
    assert b"\r\n" in report_bytes(document)
    assert all(line["end"] == "\r\n" for line in document["lines"])


def test_text_and_events():
    run = host_run("run", "--raw")
    assert run.status == 0
    raw, table = text_of(run.out).split("\n\n", 1)
    assert raw.startswith('Tester="Pixmere"\n')
    assert "OpenGL device glgpu[0]: " in table
    events = validate_events(host_run("run", "--format", "jsonl").out)
    assert [events[0]["event"], events[-1]["event"]] == ["start", "end"]
    assert events[-1]["outcome"]["verdict"] == "complete"


@pytest.mark.parametrize("options, verdict", [
    (["-throwAfter=8"], "failed-tests"), (["-bogus"], "usage-error"), (["-exit=7"], "complete"),
    (["-exit=300"], "complete")])
def test_ends_of_assay(options, verdict):
    document = document_of(host_run("run", "--format", "json", "--", *options))
    assert document["outcome"]["verdict"] == verdict


def test_options_reach_assay_unchanged():
    texts = ["a\\", 'a"b', "\u00e9\u65e5\U0001F600", "%PATH%^", " ", "tab\tand \\\" both\\\\"]
    document = document_of(host_run("run", "--format", "json", "--", "-exit=5",
                                    *[f"-stdout={text}" for text in texts]))
    assert document["outcome"]["verdict"] == "complete"
    assert document["outcome"]["exitStatus"] == 5
    assert [line["text"] for line in document["lines"][:len(texts)]] == texts


def test_crash():
    document = run_child("out", "QGFOGLInitialized=1", "abort")
    assert document["outcome"]["verdict"] == "crashed"
    assert re.fullmatch("code 0x[0-9A-F]{8}", document["outcome"]["termination"])
    assert document["outcome"]["lastReportLine"] == "QGFOGLInitialized=1"


def test_hang():
    document = run_child("out", "a=1", "sleep", "600000", timeout=HANG_TIMEOUT)
    assert document["outcome"]["verdict"] == "hung"
    assert not document["outcome"]["leftBehind"]
    assert report_bytes(document).rstrip() == b"a=1"


def test_never_started(tmp_path):
    assert run_child(program="no-such.exe")["outcome"]["verdict"] == "never-started"
    assert run_child(program=str(tmp_path))["outcome"]["verdict"] == "never-started"
    foreign = tmp_path / "foreign.exe"
    foreign.write_text("no program\n")
    assert run_child(program=foreign)["outcome"]["verdict"] == "never-started"


def test_grandchild_with_the_pipe():
    """It is ended with the child, long before it ends itself."""
    document = run_child(*REPORT, "spawn", "770000")
    assert document["outcome"]["verdict"] == "complete"
    assert not document["outcome"]["leftBehind"]
    left = subprocess.run(["pgrep", "-f", "test_child.exe sleep 770000"], stdout=subprocess.PIPE,
                          check=False)
    assert left.stdout == b""


def test_flood():
    document = run_child(*REPORT, "flood", "300000000")
    assert document["outcome"]["verdict"] == "complete"
    assert document["outcome"]["lostOutputBytes"] > 280_000_000


def test_closed_streams_and_end_of_input():
    assert run_child(*REPORT, "close", "sleep", "300")["outcome"]["verdict"] == "complete"
    assert run_child("echo", *REPORT)["outcome"]["verdict"] == "complete"


def test_program_with_blanks_in_its_path(tmp_path):
    folder = tmp_path / "a folder"
    folder.mkdir()
    (folder / "a child.exe").write_bytes(CHILD.read_bytes())
    assert run_child(*REPORT, program=folder / "a child.exe")["outcome"]["verdict"] == "complete"


def test_output_file(tmp_path):
    file = tmp_path / "r\u00e9sultat.json"
    for _ in range(2):
        run = host_run("run", "--assay", str(CHILD), "--format", "json", "--output", str(file), "--",
                       *REPORT)
        assert (run.status, run.out) == (0, b"")
        assert validate_document(file.read_bytes())["outcome"]["verdict"] == "complete"
        assert [each.name for each in tmp_path.iterdir()] == [file.name]
    run = host_run("run", "--assay", str(CHILD), "--output", str(tmp_path / "no" / "file"), "--",
                   *REPORT)
    assert run.status == 10
    assert run.errors[0].startswith("assay-host: cannot write ")


class Running:
    """A running host, assay-host.exe or the program of `command`, with a child that has a unique
    argument, and makes a file first."""

    def __init__(self, *words, options=(), command=(), **streams):
        self.word = str(random.randrange(10**8, 2 * 10**9)) # how long the child sleeps
        command = command or [HOST, "run", *options, "--assay", CHILD, "--"]
        self.name = Path(command[0]).name.encode()
        self.folder = tempfile.TemporaryDirectory()
        self.begun = Path(self.folder.name, "begun")
        self.process = subprocess.Popen(
            [TREE / "scripts" / "run-under-wine", *command, "touch", f"Z:{self.begun}",
             *words, "sleep", self.word],
            stdin=subprocess.DEVNULL, stderr=subprocess.DEVNULL,
            env={**os.environ, **NO_OPENCL_PLATFORM}, **streams)

    def numbers(self, of_host):
        """The ids of the Windows processes: those whose executable is Wine's loader."""
        found = []
        for folder in Path("/proc").iterdir():
            try:
                command = (folder / "cmdline").read_bytes() if folder.name.isdigit() else b""
                if self.word.encode() in command and "wine" in os.readlink(folder / "exe"):
                    if (self.name in command) == of_host:
                        found.append(int(folder.name))
            except OSError:
                pass
        return found

    def until_child_has_begun(self):
        """Before that, its process may not be known to Wine's server, which then can't end it."""
        until(self.begun.exists, "the child has begun")

    def until_child_has_ended(self):
        until(lambda: not self.numbers(of_host=False), "the child has ended")

    def __enter__(self):
        return self

    def __exit__(self, *_):
        for number in self.numbers(of_host=True) + self.numbers(of_host=False):
            os.kill(number, signal.SIGKILL)
        self.process.kill()
        self.process.wait()
        self.folder.cleanup()


def test_reader_that_does_not_read():
    """The child is still killed in time."""
    read, write = os.pipe()
    options = ["--format", "jsonl", "--timeout", str(HANG_TIMEOUT)]
    with Running("flood", "300000", options=options, stdout=write) as running:
        os.close(write)
        until(lambda: running.numbers(of_host=False), "the child is there")
        running.until_child_has_ended()
        assert running.process.poll() is None # it still waits for the reader
        with os.fdopen(read, "rb") as reader:
            data = reader.read()
        assert running.process.wait(SECONDS) == 4
    assert b'"verdict":"hung"' in data


def test_killed_host():
    """The job kills the child too."""
    with Running(options=["--timeout", "600"], stdout=subprocess.DEVNULL) as running:
        running.until_child_has_begun()
        for number in running.numbers(of_host=True):
            os.kill(number, signal.SIGKILL)
        running.until_child_has_ended()


def test_version():
    for command in ([], ["run"]):
        assert host_run(*command, "--version").out.startswith(b"assay-host ")
    assert host_run("bogus").status == 10


@pytest.mark.parametrize("command", HELP, ids=str)
def test_help(command):
    run = host_run(*filter(None, [command]), "--help")
    assert (run.status, text_of(run.out), run.errors) == (0, HELP[command], [])


@pytest.mark.parametrize("rule, verdict, key", [
    ("at clCreateContext hang", "hung", "CLBandwidth"),
    ("at clBuildProgram hang", "hung", "CLCompute"),
    ("at clBuildProgram abort", "crashed", "CLCompute"),
    ("at clCreateBuffer error CL_OUT_OF_RESOURCES", "failed-tests", None),
])
def test_opencl_drivers(tmp_path, rule, verdict, key):
    timeout = 2 * HANG_TIMEOUT if verdict == "hung" else TIMEOUT
    run = run_under_wine("run", "--format", "json", "--timeout", str(timeout), program=HOST,
                         **scripted_opencl(tmp_path, [ClPlatform([ClGpu()])], rule + "\n"))
    document = document_of(run)
    assert document["outcome"]["verdict"] == verdict
    if key is not None:
        assert document["report"]["next"] == f"clgpu[0].{key}"


def test_check_of_a_stored_report(tmp_path):
    report = tmp_path / "report"
    report.write_bytes(b'Tester="x"\r\nNumGLGPUs=1\r\nglgpu[0].GLMemoryMB=1024\r\nassayEnd="y"\r\n')
    run = host_run("check", "--from", str(report), "--require", "GLMemoryMB>=1024")
    assert (run.status, text_of(run.out)) == (0, "met: the requirement\n")
    run = host_run("check", "--from", str(report), "--require", "GLMemoryMB>=2048")
    assert (run.status, text_of(run.out)) == (7, "not met: GLMemoryMB>=2048: glgpu[0] 1024\n")


def test_forms_of_a_stored_report(tmp_path):
    run = host_run("run", "--format", "json")
    report = tmp_path / "report.json"
    report.write_bytes(run.out)
    assert host_run("show", str(report), "--format", "json").out == run.out
    assert "OpenGL device glgpu[0]: " in text_of(host_run("show", str(report)).out)
    page = tmp_path / "page.html"
    assert host_run("show", str(report), "--format", "html", "--output", str(page)).status == 0
    assert page.read_bytes().startswith(b"<!DOCTYPE html>")
    assert b"OpenGL device glgpu[0]" in page.read_bytes()
    shown = text_of(host_run("show", str(report), "--format", "prometheus").out)
    assert 'assay_run_verdict{verdict="complete"} 1\n' in shown


def test_archive_of_a_bug_report(tmp_path):
    path = tmp_path / "report.zip"
    run = host_run("bugreport", "--output", str(path), "--yes")
    assert run.status == 0
    with zipfile.ZipFile(path) as archive:
        assert archive.testzip() is None
        files = {name.split("/")[1]: archive.read(name).decode() for name in archive.namelist()}
    assert validate_document(files["report.json"].encode())["outcome"]["verdict"] == "complete"
    assert "wmiNumDevices=" in files["adapters.txt"]
    assert "event log" in files["kernel.txt"]
    assert "event log" in files["README.txt"].split("\nMissing:\n")[1]
    refused = host_run("bugreport", "--output", str(path), "--yes")
    assert refused.status == 10
    assert text_of(refused.err).startswith("assay-host: cannot write ")


def test_diff(tmp_path):
    before, after, page = (tmp_path / name for name in ("before.json", "after.json", "page.html"))
    before.write_bytes(host_run("run", "--format", "json").out)
    after.write_bytes(host_run("run", "--format", "json", "--", "-crashAfter=5").out)
    assert host_run("diff", str(before), str(before)).out == b""
    run = host_run("diff", str(before), str(after), "--format", "html", "--output", str(page))
    assert run.status == 1
    document = json.loads(host_run("diff", str(before), str(after), "--format", "json").out)
    headline = document["comparisons"][0]["headline"]
    assert f"<h1>{headline}</h1>" in page.read_text(encoding="utf-8")
    lines = text_of(host_run("diff", str(before), str(after)).out).splitlines()
    assert len(lines) == len(document["comparisons"][0]["differences"])
    assert lines[0].startswith("verdict: complete -> ")


def test_explain():
    run = host_run("explain", "GLMemoryMB")
    assert run.status == 0
    assert text_of(run.out).startswith("GLMemoryMB: Memory\n")
    assert host_run("explain", "GLMemory").status == 10


def test_check_of_a_run():
    run = host_run("check", "--assay", str(CHILD), "--require", "opengl.devices>=1", "--", *REPORT)
    assert run.status == 7
    assert text_of(run.out) == "not met: opengl.devices>=1: not known (no readable line)\n"
