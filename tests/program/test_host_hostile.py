"""Children that misbehave in every way: assay-host ends, reports what happened, keeps its memory
bounded, and leaves no process behind. The unit tests of RunChild show that it ends in time."""

import os
import random
import re
import signal
import struct

import pytest

from harness import MEASURES_MEMORY, PROGRAM, text_of, until
from hosting import (CHILD, ERROR_STATUS, TIMEOUT, Cue, Watched, host_run, report_bytes, script_child,
                     texts)

MEBIBYTE = 1 << 20

# The maximum memory of assay-host, also for a child that reaches all limits.
MAX_KIB = 64 * 1024
REPORT = 'echo \'assayStart="x"\'; echo \'assayEnd="y"\''


# A child's time is up after this command.
TIME_IS_UP = 'touch "$ASSAY_TEST_CUE"'
# Afterwards, a child's time is up once it is stopped. Who looks for that is not in its group.
STOPS = """
setsid sh -c 'touch "$ASSAY_TEST_CUE.next"
until grep -q "^State:.T" /proc/$0/status; do sleep 0.05; done
touch "$ASSAY_TEST_CUE"' $$ &
until [ -e "$ASSAY_TEST_CUE.next" ]; do sleep 0.05; done
"""


@pytest.fixture(name="run_child")
def fixture_run_child(tmp_path_factory):
    """Runs a child, and checks that the run keeps within the maximum memory."""
    def run_child(program, *options, child=(), **more):
        arguments = ["run", "--assay", str(program), "--format", "json", "--timeout", str(TIMEOUT),
                     *options]
        if child:
            arguments += ["--", *map(str, child)]
        cue = Cue(tmp_path_factory.mktemp("cue"))
        run = host_run(*arguments, environment={**os.environ, **cue.variables}, **more)
        if MEASURES_MEMORY:
            assert run.peak_kib < MAX_KIB
        return run

    return run_child


def verdict_of(run):
    return run.document()["outcome"]["verdict"]


def check_hung(run):
    """The child was killed at its timeout, and none of its processes was left behind."""
    outcome = run.document()["outcome"]
    assert outcome["verdict"] == "hung"
    assert outcome["seconds"] >= TIMEOUT
    assert not outcome["leftBehind"]


def test_missing(tmp_path, run_child):
    run = run_child(tmp_path / "missing")
    assert verdict_of(run) == "never-started"
    assert f"there is no file {tmp_path / 'missing'}" in run.document()["outcome"]["reason"]


def test_directory(tmp_path, run_child):
    run = run_child(tmp_path)
    assert verdict_of(run) == "never-started"
    assert f"{tmp_path} is a directory" in run.document()["outcome"]["reason"]


def test_no_permission(tmp_path, run_child):
    file = tmp_path / "file"
    file.write_bytes(PROGRAM.read_bytes())
    file.chmod(0o644)
    run = run_child(file)
    assert verdict_of(run) == "never-started"
    assert "Permission denied" in run.document()["outcome"]["reason"]


def foreign_elf(folder):
    """This machine's program with the machine type of another one (EM_SPARC)."""
    data = bytearray(PROGRAM.read_bytes())
    assert data[:4] == b"\x7fELF"
    struct.pack_into("<H", data, 18, 2)
    (folder / "foreign").write_bytes(data)
    return folder / "foreign"


@pytest.mark.parametrize("content", [b"no program at all\n", b"", b"MZ\x90\x00", b"\x7fELF", None])
def test_foreign_executable(tmp_path, content, run_child):
    if content is None:
        file = foreign_elf(tmp_path)
    else:
        file = tmp_path / "file"
        file.write_bytes(content)
    file.chmod(0o755)
    run = run_child(file)
    assert verdict_of(run) == "never-started"
    assert str(file) in run.document()["outcome"]["reason"]


def test_missing_interpreter(tmp_path, run_child):
    file = tmp_path / "file"
    file.write_text("#!/no/such/interpreter\n")
    file.chmod(0o755)
    assert verdict_of(run_child(file)) == "never-started"


def test_another_program_than_assay(run_child):
    document = run_child("/bin/true").document()
    assert document["outcome"]["verdict"] == "failed-tests"
    assert document["lines"] == []


@pytest.mark.parametrize("line, form, size", [
    ("x", "json", 3_000_000_000), ("a=1", "json", 1_000_000_000),
    ("", "json", 1_000_000_000), ('a="', "json", 1_000_000_000), ("a=1", "jsonl", 200_000_000),
    ("x", "text", 200_000_000), ("a=1", "text", 200_000_000)])
def test_flood(tmp_path, line, form, size):
    """Gigabytes, in one line or in many: the memory is bounded, and the loss is reported."""
    flood = f"yes '{line}' | head -c {size}" if line != "x" else f"{CHILD} flood {size}"
    child = script_child(tmp_path, f"{flood}; {REPORT}")
    run = host_run("run", "--assay", str(child), "--format", form)
    assert run.status == 1 # the report's own lines came after the limit
    if MEASURES_MEMORY:
        assert run.peak_kib < MAX_KIB
    if form == "text":
        assert re.search(r"wrote too much output: \d{9} bytes were dropped", run.text)
        return
    outcome = run.document()["outcome"] if form == "json" else run.events()[-1]["outcome"]
    assert outcome["verdict"] == "failed-tests"
    assert outcome["lostOutputBytes"] > 0.9 * size


def test_a_long_log_costs_no_line_of_the_report(tmp_path, run_child):
    """The log that the host asks for is not part of the report, and doesn't count to its limit."""
    (tmp_path / "log").write_text(8 * (
        "# 00004.2026.11.21_10:49:36.366(+00.000)[tid=462f] " + MEBIBYTE * "x" + "\n"))
    run = run_child(script_child(tmp_path, f"cat {tmp_path}/log; {REPORT}"))
    assert verdict_of(run) == "complete"
    assert run.document()["outcome"]["lostOutputBytes"] == 0


def test_long_lines_cost_no_other_line(tmp_path, run_child):
    """What is cut from a line doesn't count to the limit of the report."""
    (tmp_path / "lines").write_text(8 * ("#" + MEBIBYTE * "x" + "\n"))
    run = run_child(script_child(tmp_path, f"cat {tmp_path}/lines; {REPORT}"))
    assert verdict_of(run) == "complete"
    assert run.document()["outcome"]["lostOutputBytes"] == 8 * (MEBIBYTE + 1 - 65536)


def test_flood_on_standard_error(tmp_path, run_child):
    child = script_child(tmp_path, f"{REPORT}; yes words | head -c 500000000 >&2")
    run = run_child(child)
    document = run.document()
    assert document["outcome"]["verdict"] == "complete"
    assert document["outcome"]["lostErrorBytes"] > 490_000_000
    assert len(document["outcome"]["errorLines"]) == 10000


@pytest.mark.parametrize("stream", ["", ">&2"])
def test_endless_flood(tmp_path, stream, run_child):
    check_hung(run_child(script_child(tmp_path, f"{TIME_IS_UP}; exec yes words {stream}")))


def test_binary_garbage(tmp_path, run_child):
    data = random.Random(1).randbytes(3 * MEBIBYTE)
    assert not data.endswith(b"\n")
    (tmp_path / "garbage").write_bytes(data)
    child = script_child(tmp_path, f"cat {tmp_path}/garbage; cat {tmp_path}/garbage >&2; {REPORT}")
    run = run_child(child)
    document = run.document()
    # The first line of the report is part of the garbage's last line.
    assert document["outcome"]["verdict"] == "failed-tests"
    assert report_bytes(document).startswith(data)
    assert texts(document)[-1] == 'assayEnd="y"'


def test_garbage_that_is_no_line(tmp_path, run_child):
    data = bytes(range(256)) * 64
    data = data.replace(b"\n", b"")
    (tmp_path / "garbage").write_bytes(data)
    run = run_child(script_child(tmp_path, f"{REPORT}; cat {tmp_path}/garbage"))
    document = run.document()
    assert document["outcome"]["verdict"] == "complete"
    assert report_bytes(document).endswith(data)


def test_child_that_ignores_signals(tmp_path, run_child):
    check_hung(run_child(script_child(
        tmp_path, f"trap '' TERM INT HUP; {TIME_IS_UP}; while :; do sleep 0.1; done")))


def test_child_that_ignores_the_end_of_its_input(tmp_path, run_child):
    run = run_child(script_child(
        tmp_path, f"cat; {REPORT}; {TIME_IS_UP}; while :; do sleep 0.1; done"))
    check_hung(run)
    assert texts(run.document())[-1] == 'assayEnd="y"' # its input was at its end


def test_own_input_is_not_the_childs(tmp_path, run_child):
    read, write = os.pipe()
    try:
        run = run_child(script_child(tmp_path, f"cat; {REPORT}"), stdin=read)
        assert verdict_of(run) == "complete"
    finally:
        os.close(read)
        os.close(write)


LEFT_BEHIND = {
    "with the pipe": "sleep 1000 &",
    "in a session of its own": "setsid sleep 1000 &",
    "two levels down": "(setsid sh -c 'sleep 1000 & sleep 1000 &' &)",
    "without the pipe": "setsid sleep 1000 >/dev/null 2>&1 </dev/null &",
    "ignoring signals": "sh -c \"trap '' TERM; while :; do sleep 1; done\" &",
    "many": "for i in 1 2 3 4 5 6 7 8 9 10 11 12 13 14 15 16; do sleep 1000 & done",
}


@pytest.mark.parametrize("name", LEFT_BEHIND)
def test_grandchild(tmp_path, name, run_child):
    """The run doesn't wait for it. Watched asserts that none is left."""
    run = run_child(script_child(tmp_path, f"{REPORT}; {LEFT_BEHIND[name]}"))
    assert verdict_of(run) == "complete"
    assert not run.document()["outcome"]["leftBehind"]


def test_grandchild_that_floods(tmp_path, run_child):
    run = run_child(script_child(tmp_path, f"{REPORT}; yes words &"))
    assert verdict_of(run) == "complete"
    assert not run.document()["outcome"]["leftBehind"]


def test_grandchild_of_a_child_that_hangs(tmp_path, run_child):
    check_hung(run_child(script_child(
        tmp_path, f"setsid sleep 1000000 & {TIME_IS_UP}; sleep 1000000")))


def test_closed_streams(tmp_path, run_child):
    run = run_child(script_child(tmp_path, f"{REPORT}; exec >&- 2>&-; sleep 0.3"))
    assert verdict_of(run) == "complete"
    check_hung(run_child(script_child(
        tmp_path, f"{REPORT}; exec >&- 2>&-; {TIME_IS_UP}; sleep 1000000")))


def test_stopped_child(tmp_path, run_child):
    check_hung(run_child(script_child(tmp_path, f"{STOPS} kill -STOP $$")))


@pytest.mark.parametrize("name", ["KILL", "TERM", "HUP", "INT", "QUIT", "ABRT", "USR1"])
def test_child_that_kills_its_group(tmp_path, name, run_child):
    document = run_child(script_child(
        tmp_path, f"sleep 1000000 & kill -{name} 0; sleep 1000000")).document()
    assert document["outcome"]["verdict"] == "crashed"
    number = signal.Signals["SIG" + name].value
    assert document["outcome"]["termination"].startswith(f"signal {number} ")


@pytest.mark.parametrize("name", ["STOP", "TSTP", "TTIN"])
def test_child_that_stops_its_group(tmp_path, name, run_child):
    check_hung(run_child(script_child(
        tmp_path, f"{STOPS} sleep 1000000 & kill -{name} 0; sleep 1000000")))


def test_arguments_reach_the_child_unchanged(run_child):
    words = ["", "a b", '"', "'", "\\", "-x=--", "*", "caf\u00e9", "\udcff", "--", "--help"]
    run = run_child(CHILD, child=["args", *words])
    shown = [bytes.fromhex(line) for line in text_of(report_bytes(run.document())).splitlines()]
    assert shown == [os.fsencode(word) for word in words]


# The host's own output.

@pytest.mark.parametrize("form", ["text", "json", "jsonl"])
def test_output_that_is_full(form):
    with open("/dev/full", "wb") as full:
        run = host_run("run", "--assay", CHILD, "--format", form, "--", "out", "a=1", stdout=full)
    assert run.status == ERROR_STATUS
    assert b"cannot write to standard output: No space left on device" in run.err


@pytest.mark.parametrize("form", ["text", "json", "jsonl"])
def test_reader_that_has_gone(form):
    read, write = os.pipe()
    os.close(read)
    run = host_run("run", "--assay", CHILD, "--format", form, "--", "out", "a=1", stdout=write)
    os.close(write)
    assert run.status == ERROR_STATUS
    assert b"cannot write to standard output: Broken pipe" in run.err


def test_closed_standard_output():
    run = host_run("run", "--assay", CHILD, "--", "out", "a=1", stdout=None,
                   preexec_fn=lambda: os.close(1))
    assert run.status == ERROR_STATUS
    assert b"cannot write to standard output" in run.err


def test_reader_that_leaves_ends_the_run(tmp_path):
    """Without a reader the run has no purpose, and its child, which goes on, is killed."""
    read, write = os.pipe()
    with Watched("run", "--assay", CHILD, "--raw", "--", "out", "a=1", "await",
                 tmp_path / "go", "out", "b=1", "sleep", "6000000", stdout=write) as watched:
        os.close(write)
        assert os.read(read, 100) == b"a=1\n"
        os.close(read)
        (tmp_path / "go").touch()
        run = watched.finish()
    assert run.status == ERROR_STATUS


def test_output_file(tmp_path, run_child):
    file = tmp_path / "result.json"
    run = run_child(CHILD, "--output", file, child=["out", "a=1"])
    assert run.out == b""
    assert b'"a=1"' in file.read_bytes()
    assert [each.name for each in tmp_path.iterdir()] == ["result.json"]


def test_output_file_is_replaced_in_one_piece(tmp_path):
    file = tmp_path / "result"
    file.write_text("before")
    file.chmod(0o640)
    link = tmp_path / "link"
    link.symlink_to(file)
    go = tmp_path / "go"

    def others():
        return [each for each in tmp_path.iterdir() if each not in (file, link, go)]

    with Watched("run", "--assay", CHILD, "--format", "jsonl", "--output", link, "--", "out", "a=1",
                 "await", go) as watched:
        other = until(others, "no other file")[0]
        # Already written, in case the host is killed.
        until(lambda: b"a=1" in other.read_bytes(), "it isn't written")
        assert others() == [other]
        assert file.read_text() == "before"
        go.touch()
        watched.finish()
    go.unlink()
    assert b"a=1" in file.read_bytes()
    assert file.stat().st_mode & 0o777 == 0o640
    assert link.is_symlink()
    assert sorted(each.name for each in tmp_path.iterdir()) == ["link", "result"]


def test_output_through_a_link_that_leads_nowhere(tmp_path, run_child):
    """The file is created where the link leads, as by a shell's redirection; the link stays."""
    (tmp_path / "folder").mkdir()
    (tmp_path / "folder" / "next").symlink_to("../end")
    (tmp_path / "link").symlink_to("folder/next")
    run_child(CHILD, "--output", tmp_path / "link", child=["out", "a=1"])
    assert (tmp_path / "link").is_symlink()
    assert (tmp_path / "folder" / "next").is_symlink()
    assert b'"a=1"' in (tmp_path / "end").read_bytes()
    assert sorted(each.name for each in tmp_path.iterdir()) == ["end", "folder", "link"]


def test_output_on_a_loop_of_links(tmp_path):
    (tmp_path / "a").symlink_to("b")
    (tmp_path / "b").symlink_to("a")
    run = host_run("run", "--assay", CHILD, "--output", tmp_path / "a", "--", "out", "a=1")
    assert run.status == ERROR_STATUS
    assert b"Too many levels of symbolic links" in run.err
    assert (tmp_path / "a").is_symlink()
    assert sorted(each.name for each in tmp_path.iterdir()) == ["a", "b"]


def test_output_on_standard_output_by_its_name():
    run = host_run("run", "--assay", CHILD, "--output", "/dev/stdout", "--format", "json", "--",
                   "out", "a=1")
    assert b'"a=1"' in run.out


@pytest.mark.parametrize("arguments, name", [
    (["run", "--output", ""], "--output"),
    (["run", "--assay", ""], "--assay"), (["torture", "--assay", ""], "--assay"),
    (["diff", "", "b"], "A"), (["diff", "a", ""], "B")])
def test_empty_names_are_usage_errors(arguments, name):
    run = host_run(*arguments)
    assert run.status == (2 if arguments[0] == "diff" else ERROR_STATUS)
    assert text_of(run.err).startswith(f"assay-host: {name}: must not be empty")
    assert run.out == b""


RAW = "\x1b[31m\x07\n\u202e\udcff"
SHOWN = "\\x1B[31m\\x07\\n\\u{202E}\\xFF"


@pytest.mark.parametrize("arguments", [
    ["run", RAW], ["run", f"--{RAW}"], ["run", "--timeout", RAW], ["run", "--format", RAW],
    ["diff", RAW, RAW], ["diff", "a", "b", "--tolerance", RAW],
    ["run", "--output", f"/{RAW}/x"], ["torture", "--kind", RAW],
    ["torture", "--", f"-crashAfter={RAW}"], ["torture", "--assay", f"/{RAW}"],
    ["run", "--assay", f"/{RAW}", "--", RAW]])
def test_control_bytes_of_arguments_are_shown_escaped(arguments):
    run = host_run(*arguments)
    assert run.status not in (0, 1)
    printed = run.out + run.err
    assert SHOWN.encode() in printed
    assert not re.search(rb"[\x00-\x09\x0b-\x1f\x7f\xff]|\xe2\x80\xae", printed)


@pytest.mark.parametrize("path, text", [
    ("missing/result", "No such file or directory"), (".", "Is a directory"),
    ("file/result", "Not a directory")])
def test_output_that_cannot_be(tmp_path, path, text):
    (tmp_path / "file").touch()
    run = host_run("run", "--assay", CHILD, "--output", tmp_path / path, "--", "out", "a=1")
    assert run.status == ERROR_STATUS
    assert text_of(run.err).startswith(f"assay-host: cannot write {tmp_path / path}: ")
    assert text in text_of(run.err)
    assert [each.name for each in tmp_path.iterdir()] == ["file"]


def test_output_on_a_device():
    run = host_run("run", "--assay", CHILD, "--output", "/dev/full", "--", "out", "a=1")
    assert run.status == ERROR_STATUS
    assert b"cannot write /dev/full: No space left on device" in run.err
    assert not os.path.isfile("/dev/full")
    assert host_run("run", "--assay", CHILD, "--output", "/dev/null", "--", "out",
                    'assayStart="x"', "out", 'assayEnd="y"').status == 0
    assert not os.path.isfile("/dev/null")


def test_output_on_a_full_disk(tmp_path):
    """The limit on a file's size replaces the full disk."""
    import resource

    def limit():
        signal.signal(signal.SIGXFSZ, signal.SIG_IGN)
        resource.setrlimit(resource.RLIMIT_FSIZE, (100, 100))

    file = tmp_path / "result"
    file.write_text("before")
    run = host_run("run", "--assay", CHILD, "--output", file, "--", "out", "a=1", preexec_fn=limit)
    assert run.status == ERROR_STATUS
    assert b"File too large" in run.err
    assert file.read_text() == "before"
    assert [each.name for each in tmp_path.iterdir()] == ["result"]
