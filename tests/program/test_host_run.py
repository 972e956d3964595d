"""`assay-host run` with good and bad drivers: verdicts, formats, and the parts of an incomplete
report."""

import ctypes.util
import os
import pty
import re
import select
import signal

import pytest

from clmodel import ClGpu, ClPlatform
from harness import DEADLINE, EMULATED, PROGRAM, PROGRAM_AT_ROOT, STAMP, record_so_far, text_of, until
from hosting import (ERROR_STATUS, HOST, HOST_ON_CUE, TIMEOUT, Watched, decode, host_run,
                     host_run_until, read_to_the_end, report_bytes, run_assay, script_child, texts)
from model import KEYS, Gpu, predict
from test_command_line import STATUSES as EXITS
from test_opencl import Machine

FORMATS = ["text", "json", "jsonl"]


def stamped(data):
    return STAMP.sub(r'\1="STAMP"', text_of(data))


def scripted(rules="", gpu=None):
    return {"script": (gpu or Gpu()).script() + rules + "\n"}


def test_complete(host):
    run = run_assay(host, "--format", "json", machine=scripted())
    document = run.document()
    assert document["outcome"]["verdict"] == "complete"
    assert document["outcome"]["exitStatus"] == 0
    assert document["outcome"]["errorLines"] == []
    assert document["report"]["whole"]
    assert stamped(report_bytes(document)) == "".join(
        f"{line}\n" for line in predict([Gpu()]).lines)
    assert run.err == b""


@pytest.mark.parametrize("value, status", [("2", 2), ("3", 3), *EXITS])
def test_complete_with_the_requested_status(host, value, status):
    run = run_assay(host, "--format", "json", child=[f"-exit={value}"], machine=scripted())
    document = run.document()
    assert document["outcome"]["verdict"] == "complete"
    assert document["outcome"]["exitStatus"] == status


FAILURES = {
    "programmed throw": (["-throwAfter=8"], "", "exception: Programmed throw", True),
    "programmed crash": (["-crashAfter=3"], "", "exception: programmed failure", False),
    "requested status": (["-throwAfter=8", "-exit=2"], "", "exception: Programmed throw", True),
    "failing query": ([], "at glGetString(GL_VENDOR) error GL_INVALID_OPERATION",
                      "exception: Failed requirement: glStatus == GL_NO_ERROR", True),
    "driver exits": ([], "at glLinkProgram exit 42", "status 42", False),
}


@pytest.mark.parametrize("name", FAILURES)
def test_failed_tests(host, name):
    child, rules, reason, whole = FAILURES[name]
    run = run_assay(host, "--format", "json", child=child, machine=scripted(rules))
    document = run.document()
    assert document["outcome"]["verdict"] == "failed-tests"
    assert reason in document["outcome"]["reason"]
    assert document["report"]["whole"] == whole


@pytest.mark.parametrize("child", [["-bogus"], ["-help"], ["-comment=x", "foo"], ["--"]])
def test_usage_error(host, child):
    run = run_assay(host, "--format", "json", child=child)
    document = run.document()
    assert document["outcome"]["verdict"] == "usage-error"
    assert document["outcome"]["exitStatus"] == 3
    assert "Usage exception: usage" in document["outcome"]["errorLines"]


# The driver's action, and the reported termination and key.
CRASHES = {
    "crash in the shader compile": ("at glCompileShader crash",
                                    r"signal 11 \(.+\)", "CanCompileProgramGLSL"),
    "abort in the link": ("at glLinkProgram abort", r"signal 6 \(.+\)", "CanCompileProgramGLSL"),
    "bad instruction in the clear": ("at glClear signal 4", r"signal 4 \(.+\)", "GLFrameBufferOK"),
    "kill from outside": ("at glGetString(GL_RENDERER) signal 9", r"signal 9 \(.+\)", "GLRenderer"),
}


@pytest.mark.parametrize("name", CRASHES)
def test_crash(host, name):
    rules, termination, key = CRASHES[name]
    run = run_assay(host, "--format", "json", machine=scripted(rules))
    document = run.document()
    outcome = document["outcome"]
    assert outcome["verdict"] == "crashed"
    assert outcome["exitStatus"] is None
    assert re.fullmatch(termination, outcome["termination"])
    assert outcome["lastReportLine"].startswith(f"glgpu[0].{KEYS[KEYS.index(key) - 1]}=")
    assert outcome["lastLogLine"] is None
    assert document["report"]["next"] == f"glgpu[0].{key}"
    assert f"(glgpu[0].{key})." in outcome["reason"]
    whole = predict([Gpu()]).lines
    kept = stamped(report_bytes(document)).splitlines()
    assert kept == whole[:len(kept)]

    shown = run_assay(host, machine=scripted(rules))
    assert shown.status == run.status
    assert re.search(rf"Ended by +{termination}", shown.text)
    assert re.search(rf"Last report line +{re.escape(kept[-1])}", shown.text)


def test_crash_with_the_log_on(host):
    run = run_assay(host, "--format", "json", child=["-verbose=1"],
                    machine=scripted("at 2 eglCreateContext crash"))
    outcome = run.document()["outcome"]
    assert outcome["verdict"] == "crashed"
    assert "creating ContextOffscreen for {" in outcome["lastLogLine"]
    assert outcome["lastReportLine"] == "OGLContextCreated=1"


@pytest.mark.parametrize("rules, last", [
    ("at 1 eglCreateContext hang", "QGFOGLInitialized=1"),
    ("at glCompileShader hang", 'glgpu[0].GLDriverDate="?"'),
])
def test_hang(host, rules, last):
    call = rules.split()[-2]
    run = host_run_until(
        lambda: host.has_called(call), host.folder, "run", "--assay", str(PROGRAM), "--format", "json",
        environment=host.environment(opencl="absent", **scripted(host.fresh_record() + rules)))
    outcome = run.document()["outcome"]
    assert outcome["verdict"] == "hung"
    assert outcome["lastReportLine"] == last
    assert not outcome["leftBehind"]
    assert outcome["seconds"] >= TIMEOUT


needs_opencl = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                  reason="this machine has no OpenCL loader library")


def opencl_machine(host, rule):
    machine = Machine(host, gl=0)
    machine.platforms = [ClPlatform([ClGpu()])]
    script = "".join(platform.script() for platform in machine.platforms) + rule + "\n"
    machine.script(script)
    return machine.found


@needs_opencl
@pytest.mark.parametrize("rule, verdict, key", [
    ("at clBuildProgram abort", "crashed", "CLCompute"),
    ("at 3 clEnqueueCopyBuffer crash", "crashed", "CLBandwidth"),
    ("at clCreateContext hang", "hung", "CLBandwidth"),
    ("at clCreateBuffer error CL_OUT_OF_RESOURCES", "failed-tests", None),
])
def test_opencl_drivers(host, rule, verdict, key):
    record = host.folder / "cl-record"
    machine = opencl_machine(host, f"record {record}\n{rule}")
    hangs = rule.split()[-2] if rule.endswith("hang") else None
    run = host_run_until(
        lambda: hangs in [call.name for call in record_so_far(record)], host.folder, "run", "--assay",
        str(PROGRAM), "--format", "json", environment=host.environment(**machine))
    document = run.document()
    assert document["outcome"]["verdict"] == verdict
    if key is not None:
        assert document["report"]["next"] == f"clgpu[0].{key}"


@pytest.mark.parametrize("number", [signal.SIGINT, signal.SIGTERM, signal.SIGHUP])
@pytest.mark.parametrize("form", FORMATS)
def test_interrupt_keeps_the_report(host, form, number):
    environment = host.environment(opencl="absent",
                                   **scripted(host.fresh_record() + "at glLinkProgram hang"))
    with Watched("run", "--assay", PROGRAM, "--format", form,
                 environment=environment) as watched:
        until(lambda: host.has_called("glLinkProgram"), "the call isn't made")
        watched.process.send_signal(number)
        run = watched.finish()
    assert run.status == 6
    if form == "json":
        document = run.document()
        assert document["outcome"]["verdict"] == "interrupted"
        assert texts(document)[-1] == 'glgpu[0].GLDriverDate="?"'
    elif form == "jsonl":
        assert run.events()[-1]["outcome"]["verdict"] == "interrupted"
    else:
        assert "Run: interrupted" in run.text


def test_two_devices_of_each_kind(host):
    machine = Machine(host, gl=2)
    machine.script("".join(platform.script() for platform in machine.platforms))
    run = run_assay(host, "--format", "json", assay=PROGRAM_AT_ROOT, machine=machine.found)
    document = run.document()
    assert [device["tag"] for device in document["devices"]] == [
        "glgpu[0]", "glgpu[1]", "clgpu[0]", "clgpu[1]"]
    assert stamped(report_bytes(document)).splitlines() == machine.predict().lines
    shown = run_assay(host, assay=PROGRAM_AT_ROOT, machine=machine.found).text
    assert [line.split(" ")[2].rstrip(":") for line in shown.splitlines()
            if re.match("Open[GC]L device ", line)] == [
                "glgpu[0]", "glgpu[1]", "clgpu[0]", "clgpu[1]"]


@pytest.mark.parametrize("text", ["\udcff\udcfe\udc80", 'a "quoted" word', "two\nlines", "",
                                  "\x00".replace("\x00", "\x01") + "\x1b[31m", "caf\u00e9", "\uf780",
                                  "\r", "x" * 30000], ids=lambda text: repr(text)[:30])
def test_any_bytes_of_a_driver(host, text):
    """The document is valid, and decodes to the exact bytes of the child."""
    gpu = Gpu(vendor=text, renderer=text + "2", language=text)
    run = run_assay(host, "--format", "json", machine={"script": gpu.script()})
    document = run.document()
    assert stamped(report_bytes(document)) == "".join(
        f"{line}\n" for line in predict([gpu]).lines)
    lines = run_assay(host, "--format", "jsonl", machine={"script": gpu.script()}).events()
    kept = b"".join(decode(event["text"]) + event["end"].encode()
                    for event in lines if event["event"] == "line")
    assert stamped(kept) == stamped(report_bytes(document))
    shown = run_assay(host, machine={"script": gpu.script()})
    assert shown.status == 0
    shown.out.decode("utf-8")
    assert b"\x1b" not in shown.out


@pytest.mark.parametrize("schema", ["1", "2"])
def test_events_have_the_lines_of_the_document(tmp_path, schema):
    """Of every kind, one too long to be kept whole, and one without its end."""
    child = script_child(tmp_path, """
        printf 'GLName=1\\r\\n# a comment\\nno value\\nkey="two\\nlines"\\n'
        head -c 70000 /dev/zero | tr '\\0' x
        printf '\\nlast=1'
        echo aside >&2""")
    arguments = ["run", "--assay", child, "--schema", schema, "--format"]
    lines = host_run(*arguments, "json").document()["lines"]
    assert [line["kind"] for line in lines] == ["value", "comment", "raw", "value", "raw", "value"]
    run = host_run(*arguments, "jsonl")
    events = run.events()
    assert events[0]["schema"] == int(schema)
    assert [{name: event[name] for name in ("kind", "text", "end", "cut") if name in event}
            for event in events if event["event"] == "line"] == lines
    assert [(event["key"], event["value"]) for event in events if event.get("kind") == "value"] == [
        ("GLName", "1"), ("key", "two\nlines"), ("last", "1")]
    assert [event["text"] for event in events if event["event"] == "error"] == ["aside"]
    assert run.err == b""


def test_events_come_as_they_happen(host):
    """The lines of a child that hangs are already written."""
    environment = host.environment(opencl="absent", **scripted("at glLinkProgram hang"))
    with Watched("run", "--assay", PROGRAM, "--format", "jsonl",
                 environment=environment) as watched:
        seen = b""
        while b"GLDriverDate" not in seen:
            assert select.select([watched.process.stdout], [], [], DEADLINE)[0]
            seen += os.read(watched.process.stdout.fileno(), 65536)
        assert b'"event":"end"' not in seen
        watched.process.send_signal(signal.SIGTERM)
        watched.finish()


def test_raw_lines_come_first(host):
    run = run_assay(host, "--raw", child=["-stdout=in front", "-stderr=aside"], machine=scripted())
    raw, table = run.text.split("\n\n", 1)
    assert stamped(raw.encode() + b"\n").splitlines() == ["in front", *predict([Gpu()]).lines]
    assert table.startswith("Warnings\n")
    assert "Run: all tests ran" in table
    assert run.err == b"aside\n"


def test_assay_beside_the_host_is_the_default(host):
    run = host_run("run", "--format", "json",
                   environment=host.environment(opencl="absent", **scripted()))
    assert run.document()["command"] == [str(PROGRAM)]


@pytest.mark.skipif(EMULATED, reason="the emulator loses the failure of a start")
def test_assay_on_the_path_is_the_next(host, tmp_path):
    alone = tmp_path / "elsewhere"
    alone.mkdir()
    (alone / "assay-host").write_bytes(HOST_ON_CUE.read_bytes())
    (alone / "assay-host").chmod(0o755)
    environment = host.environment(opencl="absent", **scripted())
    environment["PATH"] = f"{PROGRAM.parent}:{environment['PATH']}"
    run = host_run("run", "--format", "json", environment=environment, program=alone / "assay-host")
    assert run.document()["command"] == [str(PROGRAM)]
    environment["PATH"] = str(tmp_path)
    run = host_run("run", "--format", "json", environment=environment, program=alone / "assay-host")
    assert run.document()["outcome"]["verdict"] == "never-started"
    assert str(alone / "assay") in run.document()["outcome"]["reason"]


# Where the run hangs, and the progress that is shown then.
PROGRESS = {
    "trial": ("at glLinkProgram hang",
              rb"\r\d+\.\d s, \d+ steps, compiling shaders \(glgpu\[0\]\.CanCompileProgramGLSL\)"),
    "end": ("", rb"\r\d+\.\d s, \d+ steps, at the end"),
}


@pytest.mark.parametrize("name", PROGRESS)
def test_progress_only_on_a_terminal(host, tmp_path, name):
    rules, text = PROGRESS[name]
    environment = host.environment(opencl="absent", **scripted(rules))
    progress = re.compile(text)
    child = script_child(tmp_path, f'{PROGRAM} "$@"; exec sleep 1000000')
    control, terminal = pty.openpty()
    with Watched("run", "--assay", child, environment=environment,
                 stderr=terminal) as watched:
        os.close(terminal)
        shown = b""
        while not progress.search(shown):
            assert select.select([control], [], [], DEADLINE)[0]
            shown += os.read(control, 65536)
        watched.process.send_signal(signal.SIGTERM)
        watched.finish()
    shown += read_to_the_end(control)
    os.close(control)
    assert shown.endswith(b" \r")
    assert b"\n" not in shown
    # Long enough for progress lines.
    assert run_assay(host, machine=scripted("at glLinkProgram sleep 300")).err == b""


@pytest.mark.parametrize("command", [[], ["run"], ["torture"], ["diff"]])
def test_help_fits_a_screen(command):
    for option in ("--help", "-h"):
        run = host_run(*command, option)
        assert run.status == 0
        lines = run.text.splitlines()
        assert 5 < len(lines) <= 24
        assert max(map(len, lines)) <= 80
        assert run.err == b""


@pytest.mark.parametrize("command", [[], ["run"], ["torture"], ["diff"]],
                         ids=lambda command: " ".join(command) or "none")
def test_version(command):
    run = host_run(*command, "--version", program=HOST)
    assert (run.status, run.err) == (0, b"")
    assert re.fullmatch(r"assay-host \d+\.\d+\.\d+\n", run.text)


@pytest.mark.parametrize("command, status", [
    ([], ERROR_STATUS), (["bogus"], ERROR_STATUS), (["run", "bogus"], ERROR_STATUS),
    (["run", "--timeout", "nan"], ERROR_STATUS), (["run", "--timeout", "-1"], ERROR_STATUS),
    (["run", "--timeout", ""], ERROR_STATUS), (["run", "--timeout", "1x"], ERROR_STATUS),
    (["run", "--format", "xml"], ERROR_STATUS), (["run", "--raw", "--format", "json"], ERROR_STATUS),
    (["torture", "--kind", "x"], ERROR_STATUS), (["torture", "--", "-crashAfter=3"], ERROR_STATUS),
    (["diff"], 2), (["diff", "a"], 2), (["diff", "a", "b", ""], 2),
    (["diff", "--tolerance", "-1", "a", "b"], 2), (["diff", "a", "b", "--", "x"], 2),
], ids=str)
def test_bad_command_lines(command, status):
    run = host_run(*command, program=HOST)
    assert run.status == status
    assert run.out == b""
    assert run.err.startswith(b"assay-host: ")


def test_diff_over_the_forms(host, tmp_path):
    files = {}
    for form in ("json", "jsonl"):
        files[form] = tmp_path / form
        assert run_assay(host, "--format", form, "--output", files[form],
                         machine=scripted()).status == 0
    files["raw"] = tmp_path / "raw"
    files["raw"].write_bytes(host.run(script=Gpu().script()).out)
    other = tmp_path / "other"
    other.write_bytes(host.run(script=Gpu(vendor="Another").script()).out)
    for one in files.values():
        for two in files.values():
            assert host_run("diff", one, two).status == 0
        run = host_run("diff", one, other)
        assert run.status == 1
        assert "Another" in run.text
    many = host_run("diff", files["raw"], other, files["json"], files["jsonl"])
    lines = many.text.splitlines()
    assert many.status == 1
    assert lines and all(line.startswith(f"{other}: ") for line in lines)
    unreadable = host_run("diff", files["raw"], tmp_path / "missing", other)
    assert (unreadable.status, unreadable.text) == (2, many.text)
    assert unreadable.err.startswith(f"assay-host: {tmp_path / 'missing'}: ".encode())
    missing = host_run("diff", files["raw"], tmp_path / "missing")
    assert missing.status == 2
    assert b"missing" in missing.err
