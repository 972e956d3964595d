"""`assay-host advise` and `assay-host state` with scripted drivers: what a host is told at its starts
while its drivers work, crash, hang and change, its processes are killed, and its folder fails."""

import os
import resource
import signal
import subprocess
import uuid
from datetime import datetime
from pathlib import Path

import pytest

from harness import PROGRAM, record_so_far, until
from hosting import HOST, host_run, host_run_until
from starts import (ABSENT, BROKEN, DAY, ERROR, HARDWARE, INTERRUPTED, SOFTWARE, UNKNOWN, Answer,
                    Starts, kill_all, processes_below, seal)
from validate import validate_advice


@pytest.fixture
def starts(host, tmp_path):
    return Starts(host, tmp_path)


def test_the_second_call_starts_no_child(starts):
    first = starts.advise()
    assert (first.status, first.opengl, first.tried, starts.children) == (HARDWARE, "hardware", True, 1)
    assert first.document["due"] == "first"
    assert first.document["opengl"]["device"]["name"] == "A renderer"
    second = starts.advise()
    assert (second.status, second.opengl, second.tried, starts.children) == (
        HARDWARE, "hardware", False, 1)
    assert second.document["opengl"]["source"] == "memory"
    assert second.document["identity"] == first.document["identity"]
    assert (first.err, second.err) == ("", "")
    assert seal(starts.content()) == starts.file().read_text()
    assert oct(starts.file().stat().st_mode & 0o777) == "0o600"


def test_64_concurrent_first_calls_start_one_child(starts):
    calls = [starts.start("--wait", "600") for _ in range(64)]
    answers = []
    for call in calls:
        with call:
            answers.append(starts.answer(call.finish()))
    assert {answer.status for answer in answers} == {HARDWARE}
    assert starts.children == 1
    assert sum(answer.tried for answer in answers) == 1


def test_a_call_during_an_attempt_answers_unknown(starts):
    starts.set_driver("at eglInitialize hang\n")
    with starts.start("--timeout", "0") as first:
        until(starts.has_open_attempt, "no attempt")
        until(lambda: starts.children == 1, "no child")
        second = starts.advise("--wait", "0")
        assert (second.status, second.opengl) == (UNKNOWN, "unknown")
        assert second.document["plan"] == "wait"
        assert second.document["opengl"]["reason"] == "other-instance"
        forgotten = starts.act("forget")
        assert (forgotten.status, forgotten.err) == (
            ERROR, b"assay-host: another process makes an attempt; call again\n")
        os.kill(first.process.pid, signal.SIGTERM)
        assert first.finish().status == INTERRUPTED
    assert starts.children == 1


def sleeps_of(pid):
    """How often the main thread of a process has waited."""
    status = Path(f"/proc/{pid}/status").read_text()
    return int(status.split("\nvoluntary_ctxt_switches:")[1].split()[0])


def test_an_interrupt_ends_the_wait_for_another_call(starts):
    starts.set_driver("at eglInitialize hang\n")
    with starts.start("--timeout", "0") as first:
        until(lambda: starts.has_open_attempt() and starts.children == 1, "no attempt")
        with starts.start("--wait", "1e9") as second:
            worker = until(second.worker, "it doesn't wait")
            before = sleeps_of(worker)
            until(lambda: sleeps_of(worker) > before + 2, "it doesn't sleep between its looks")
            second.process.send_signal(signal.SIGTERM)
            answer = starts.answer(second.finish())
        assert (answer.status, answer.document["opengl"]["reason"]) == (INTERRUPTED, "other-instance")
        first.process.send_signal(signal.SIGTERM)
        assert first.finish().status == INTERRUPTED
    assert starts.children == 1


def test_a_crash_is_remembered_and_tried_again_after_a_pause(starts):
    starts.set_driver("at 1 eglCreateContext crash\n")
    first = starts.advise()
    assert (first.status, first.opengl, first.opencl) == (BROKEN, "broken", "unknown")
    part = first.document["opengl"]
    assert (part["reason"], part["end"], part["failures"]) == ("crashed", "crashed", 1)
    assert "signal 11" in part["endReason"]
    assert part["lastLine"] == "QGFOGLInitialized=1"
    assert part["nextAttempt"] is not None
    second = starts.advise()
    assert (second.status, second.tried, starts.children) == (BROKEN, False, 1)
    # The pause passes.
    third = starts.advise("--pause", "0")
    assert (third.status, third.tried, third.document["due"]) == (BROKEN, True, "after-failure")
    fourth = starts.advise("--pause", "0")
    assert (fourth.tried, fourth.document["opengl"]["failures"]) == (True, 3)
    # Three failures are enough, at any pause.
    assert not starts.advise("--pause", "0").tried
    assert not starts.advise("--pause", "0", "--fresh").tried
    assert starts.children == 3
    # The failures are forgiven.
    starts.set_driver("")
    def age(content):
        for attempt in content["attempts"]:
            attempt["ended"] -= 8 * DAY

    starts.rewrite(age)
    last = starts.advise()
    assert (last.status, last.tried, last.document["due"]) == (HARDWARE, True, "forgiven")
    assert last.document["opengl"]["warning"] is None


def test_a_success_after_a_failure_has_a_warning(starts):
    starts.set_driver("at eglInitialize crash\n")
    assert starts.advise().status == BROKEN
    starts.set_driver("")
    answer = starts.advise("--pause", "0")
    assert (answer.status, answer.opengl) == (HARDWARE, "hardware")
    assert answer.document["opengl"]["warning"] == "An earlier attempt with OpenGL failed."
    assert starts.advise().document["opengl"]["warning"] is not None


def test_a_hang_is_remembered(starts, tmp_path):
    starts.set_driver(f"record {tmp_path / 'record'}\nat eglCreateContext hang\n")
    run = host_run_until(
        lambda: any(call.name == "eglCreateContext" for call in record_so_far(tmp_path / "record")),
        tmp_path, *starts.arguments(), environment=starts.environment)
    answer = starts.answer(run)
    assert (answer.status, answer.document["opengl"]["end"]) == (BROKEN, "hung")
    assert starts.advise().status == BROKEN
    assert starts.children == 1


@pytest.mark.parametrize("number", [signal.SIGTERM, signal.SIGHUP, signal.SIGINT])
def test_a_stopped_host_blames_nobody(starts, number):
    starts.set_driver("at eglInitialize hang\n")
    with starts.start("--timeout", "0") as call:
        until(lambda: starts.has_open_attempt() and starts.children == 1, "no attempt")
        os.kill(call.process.pid, number)
        answer = starts.answer(call.finish())
    assert (answer.status, answer.opengl) == (INTERRUPTED, "unknown")
    assert starts.content()["attempts"][-1]["end"] == "host-stopped"
    starts.set_driver("")
    again = starts.advise()
    assert (again.status, again.tried) == (HARDWARE, True)
    assert again.document["opengl"]["warning"] is None


def test_a_host_that_was_killed_with_everything_is_weak_evidence(starts):
    starts.set_driver("at eglInitialize hang\n")
    with starts.start("--timeout", "0") as call:
        kill_all(call, starts)
    assert starts.has_open_attempt()
    plan = starts.advise("--dry-run")
    assert (plan.status, plan.document["plan"], plan.document["due"]) == (UNKNOWN, "try", "unclear")
    assert plan.document["opengl"]["reason"] == "host-ended"
    starts.set_driver("")
    answer = starts.advise()
    assert (answer.status, answer.tried, starts.children) == (HARDWARE, True, 2)
    assert answer.document["opengl"]["warning"] is None


def test_a_second_freeze_is_broken(starts):
    starts.set_driver("at eglInitialize hang\n")
    with starts.start("--timeout", "0") as call:
        kill_all(call, starts)

    def reboot(content):
        content["attempts"][-1]["host"]["boot"] = str(uuid.uuid4())

    starts.rewrite(reboot)
    plan = starts.advise("--dry-run")
    assert (plan.document["due"], plan.document["opengl"]["reason"]) == (
        "after-system-end", "system-ended")
    starts.runs.unlink()
    with starts.start("--timeout", "0") as call:
        kill_all(call, starts)
    starts.rewrite(reboot)
    answer = starts.advise()
    assert (answer.status, answer.opengl, answer.opencl) == (BROKEN, "broken", "broken")
    assert answer.document["opengl"]["reason"] == "system-ended"
    assert (answer.tried, starts.children) == (False, 1)
    assert starts.act("forget").status == 0
    starts.set_driver("")
    assert starts.advise().status == HARDWARE


def test_a_child_that_another_process_killed_is_weak_evidence(starts):
    starts.set_driver("at eglInitialize hang\n")
    with starts.start("--timeout", "0") as call:
        until(lambda: starts.children == 1 and len(processes_below(call.process.pid)) == 3,
              "no child")
        os.kill(processes_below(call.process.pid)[-1], signal.SIGTERM)
        answer = starts.answer(call.finish())
    assert (answer.status, answer.document["opengl"]["reason"]) == (UNKNOWN, "killed")
    starts.set_driver("")
    assert starts.advise().status == HARDWARE


def test_a_child_that_cannot_be_started_says_nothing(starts):
    starts.child.rename(starts.folder / "away")
    for _ in range(4):
        answer = starts.advise()
        assert (answer.status, answer.opengl) == (UNKNOWN, "unknown")
        assert answer.document["opengl"]["reason"] == "never-started"
    assert len(starts.content()["attempts"]) == 1
    (starts.folder / "away").rename(starts.child)
    assert starts.advise().status == HARDWARE


def test_ages(starts):
    starts.advise()

    def age_by(days):
        def change(content):
            for attempt in content["attempts"]:
                attempt["started"] -= days * DAY
                attempt["ended"] -= days * DAY
        starts.rewrite(change)

    assert not starts.advise("--max-age", "1").tried
    age_by(2)
    answer = starts.advise("--max-age", "3")
    assert not answer.tried
    assert answer.document["opengl"]["age"] >= 2 * DAY
    answer = starts.advise("--max-age", "1")
    assert (answer.tried, answer.document["due"]) == (True, "old")
    answer = starts.advise("--fresh")
    assert (answer.tried, answer.document["due"]) == (True, "requested")
    # A clock that was set by years, forth and back.
    for days in (3650, -3650):
        age_by(days)
        answer = starts.advise()
        assert (answer.status, answer.tried, answer.document["due"]) == (HARDWARE, True, "old")
        assert not starts.advise().tried


def seconds_to_the_next(starts, interface, *options):
    """How long after an attempt the next one for an interface is due."""
    part = starts.advise("--dry-run", *options).document[interface]
    if part["nextAttempt"] is None:
        return 0
    times = [datetime.fromisoformat(part[name].replace("Z", "+00:00"))
             for name in ("time", "nextAttempt")]
    return (times[1] - times[0]).total_seconds()


def test_each_time_of_the_policy_can_be_set(starts):
    starts.advise()
    for option, interface, default, unit in (("--max-age", "opengl", 30 * DAY, DAY),
                                             ("--keep-absent", "opencl", 600, 1)):
        assert seconds_to_the_next(starts, interface) == default + 1
        assert seconds_to_the_next(starts, interface, option, "1000") == 1000 * unit + 1
    starts.act("forget")
    starts.set_driver("at eglInitialize crash\n")
    starts.advise()
    assert seconds_to_the_next(starts, "opengl") == 60
    assert seconds_to_the_next(starts, "opengl", "--pause", "1000") == 1000
    starts.advise("--pause", "0")
    assert seconds_to_the_next(starts, "opengl") == 3600
    assert seconds_to_the_next(starts, "opengl", "--pause-growth", "2") == 120
    assert seconds_to_the_next(starts, "opengl", "--pause-growth", "1000", "--forgive", "0.5") == DAY / 2
    assert seconds_to_the_next(starts, "opengl", "--retries", "1") == 7 * DAY + 1
    assert seconds_to_the_next(starts, "opengl", "--retries", "1", "--forgive", "2") == 2 * DAY + 1


def test_each_time_after_what_is_unclear_can_be_set(starts):
    starts.advise()

    def end_all(end, reason):
        def change(content):
            attempt = content["attempts"][-1]
            for part in ("opengl", "opencl"):
                attempt[part].update(answer="unknown", reason=reason)
            content["attempts"] = [{**attempt, "end": end} for _ in range(3)]
        starts.rewrite(change)

    end_all("ended", "ended-early")
    assert seconds_to_the_next(starts, "opengl") == 61
    assert seconds_to_the_next(starts, "opengl", "--keep-unknown", "1000") == 1001
    end_all("killed", "killed")
    assert seconds_to_the_next(starts, "opengl") == 600
    assert seconds_to_the_next(starts, "opengl", "--unclear-pause", "1000") == 1000
    assert seconds_to_the_next(starts, "opengl", "--unclear", "4") == 0
    end_all("system-ended", "")
    assert seconds_to_the_next(starts, "opengl") == 30 * DAY + 1
    assert seconds_to_the_next(starts, "opengl", "--forgive-freeze", "1") == DAY + 1


def test_a_clock_that_was_set_never_makes_a_wrong_hardware(starts):
    starts.advise()

    def set_clock(content):
        for attempt in content["attempts"]:
            attempt["ended"] += 20 * 365 * DAY

    starts.rewrite(set_clock)
    starts.set_driver("at eglInitialize crash\n")
    assert starts.advise("--dry-run").status == UNKNOWN
    assert starts.advise().status == BROKEN
    assert starts.advise().status == BROKEN


def test_need(starts):
    assert starts.advise("--need", "opencl").status == ABSENT
    assert starts.advise("--need", "both").status == ABSENT
    assert starts.advise().status == HARDWARE
    assert starts.children == 1


def test_the_users_choice(starts):
    assert starts.act("set", "opengl=software").status == 0
    chosen = starts.advise()
    assert (chosen.status, chosen.opengl, starts.children) == (SOFTWARE, "software", 0)
    part = chosen.document["opengl"]
    assert (part["source"], part["reason"], part["learnt"]) == ("choice", "chosen", "unknown")
    assert starts.advise("--need", "opencl").status == ABSENT
    assert starts.advise().document["opengl"]["learnt"] == "hardware"
    assert b"choice: opengl=software since " in starts.act("list").out
    assert starts.act("set", "opengl=auto").status == 0
    assert starts.advise().status == HARDWARE
    assert b"choice:" not in starts.act("list").out
    (starts.state / "choice.json").write_text("x")
    listed = starts.act("list")
    assert (listed.status, listed.err) == (0, b"assay-host: The user's choice is ignored: it is damaged.\n")
    assert starts.act("set", "opengl=absent", "opencl=hardware").status == 0
    assert starts.advise("--need", "opencl").status == HARDWARE
    assert starts.act("forget").status == 0
    assert list(starts.state.iterdir()) in ([], [starts.state / "lock"])
    for words in (["opengl=broken"], ["opengl"], ["opengl=software", "vulkan=auto"]):
        run = starts.act("set", *words)
        assert (run.status, run.err.decode()) == (
            ERROR, f'assay-host: "{words[-1]}" is not opengl= or opencl= with hardware, software, '
                   "absent or auto\n")
    assert starts.advise().status == HARDWARE


def test_state_for_support(starts):
    starts.state.mkdir(mode=0o700)
    assert starts.act("list").text.splitlines()[1:] == []
    starts.set_driver("at eglInitialize crash\n")
    starts.advise()
    name = starts.file().stem
    row = starts.act("list").text.splitlines()[1]
    assert row.split()[0] == name[:8]
    assert row.split()[2:5] == ["1", "broken", "unknown"]
    shown = starts.act("show", name[:8])
    assert shown.status == 0
    assert f"entry {name}\n" in shown.text
    assert "signal 11" in shown.text
    assert shown.text == starts.act("show").text
    for action in ("show", "forget"):
        for word, count in (("none", 0), ("", 1)):
            run = starts.act(action, word)
            assert (run.status, run.out, run.err.decode()) == (
                ERROR, b"", f'assay-host: {count} entries begin with "{word}"\n')
    other = name[:-1] + ("0" if name[-1] != "0" else "1")
    starts.file().with_stem(other).write_text("x")
    for action in ("show", "forget"):
        run = starts.act(action, name[:-1])
        assert (run.status, run.err.decode()) == (
            ERROR, f'assay-host: 2 entries begin with "{name[:-1]}"\n')
    assert starts.act("forget", other).status == 0
    assert starts.act("show", name).text == shown.text
    assert starts.act("forget", name).status == 0
    assert starts.file() is None
    starts.set_driver("")
    assert starts.advise().status == HARDWARE


def test_state_that_cannot_be_changed(starts):
    starts.state = Path("/proc/none")
    for words in (["set", "opengl=software"], ["forget"]):
        run = starts.act(*words)
        assert (run.status, run.err) == (
            ERROR, b"assay-host: cannot change the state: No such file or directory\n")


@pytest.mark.parametrize("action", ["list", "show"])
def test_state_that_cannot_be_read(starts, action):
    starts.state = starts.state / "none"
    run = starts.act(action)
    assert (run.status, run.out, run.err.decode()) == (
        ERROR, b"", f"assay-host: {starts.state}: No such file or directory\n")
    assert not starts.state.exists()


def test_dry_run_changes_nothing(starts):
    answer = starts.advise("--dry-run")
    assert (answer.status, answer.document["plan"], answer.document["due"]) == (
        UNKNOWN, "try", "first")
    assert not starts.state.exists()
    starts.advise()
    before = {path: path.read_bytes() for path in starts.state.iterdir()}
    assert starts.advise("--dry-run").document["plan"] == "answer"
    assert starts.advise("--dry-run", "--fresh").document["plan"] == "try"
    assert {path: path.read_bytes() for path in starts.state.iterdir()} == before
    assert starts.children == 1


def test_forms(starts):
    document = starts.advise().document
    arguments = [each for each in starts.arguments() if each not in ("--format", "json")]
    text = host_run(*arguments, environment=starts.environment)
    assert (text.status, text.err) == (HARDWARE, b"")
    assert text.text.startswith("OpenGL: hardware\n")
    run = host_run(*arguments, "--format", "env", environment=starts.environment)
    shown = subprocess.run(
        ["sh", "-c", f'eval "$1"; set | grep "^ASSAY_OPEN"', "sh", run.text], check=True,
        env={"PATH": os.environ["PATH"]}, stdout=subprocess.PIPE).stdout.decode()
    variables = dict(line.split("=", 1) for line in shown.splitlines())
    for prefix, name in (("ASSAY_OPENGL", "opengl"), ("ASSAY_OPENCL", "opencl")):
        part = document[name]
        assert variables[prefix] == f"'{part['answer']}'"
        assert variables[prefix + "_REASON"] == f"'{part['reason']}'"
        assert variables[prefix + "_TEXT"] == f"'{part['text']}'"
        assert variables[prefix + "_CHANGE"].startswith("'The next attempt is due at ")


def test_errors_of_the_command_line(starts):
    for arguments in (["advise"], ["advise", "--state", ""], ["state", "list"],
                      ["state", "--state", "x"], ["state", "drop", "--state", "x"],
                      ["state", "list", "word", "--state", "x"], ["state", "set", "--state", "x"],
                      ["advise", "--state", "x", "--need", "none"],
                      ["advise", "--state", "x", "--", "-verbose=1"],
                      ["advise", "--state", "x", "--retries", "-1"],
                      ["advise", "--state", "x", "--retries", "1001"],
                      ["advise", "--state", "x", "--unclear", "0"],
                      ["advise", "--state", "x", "--pause-growth", "0"],
                      ["advise", "--state", "x", "--pause-growth", "1.5"],
                      ["advise", "--state", "x", "--keep-absent", "-1"],
                      ["advise", "--state", "x", "--keep-unknown", "soon"],
                      ["advise", "--state", "x", "--forgive-freeze", "nan"],
                      ["advise", "--state", "x", "--unclear-pause", ""],
                      ["advise", "--state", "x", "--wait", "inf"]):
        run = host_run(*arguments, environment=starts.environment)
        assert (run.status, run.out) == (ERROR, b""), arguments
        assert run.err.startswith(b"assay-host: "), arguments


@pytest.mark.parametrize("folder", ["/proc", "/proc/none/none"])
def test_a_folder_that_cannot_be_written(starts, folder):
    starts.state = Path(folder)
    for count in (1, 2):
        answer = starts.advise()
        assert (answer.status, answer.tried, starts.children) == (HARDWARE, True, count)
        assert len(answer.document["messages"]) == 1
        assert answer.err.startswith("assay-host: The state can't be kept: ")


def test_a_full_disk(starts):
    """The limit of file sizes stands in for it: every write fails."""
    starts.child = PROGRAM
    starts.state.mkdir(mode=0o700)

    def limit():
        resource.setrlimit(resource.RLIMIT_FSIZE, (0, resource.RLIM_INFINITY))

    def call(*options):
        done = subprocess.run([HOST, *starts.arguments(*options)], env=starts.environment,
                              stdout=subprocess.PIPE, stderr=subprocess.PIPE, preexec_fn=limit,
                              check=False)
        return Answer(done.returncode, validate_advice(done.stdout), done.stderr.decode())

    for _ in range(2):
        answer = call()
        assert (answer.status, answer.tried) == (HARDWARE, True)
        assert "can't be kept: File too large" in answer.err
    assert [path.name for path in starts.state.iterdir()] == ["lock"]
    # What was true before the disk was full isn't kept after the driver broke.
    assert starts.advise().status == HARDWARE
    starts.set_driver("at eglInitialize crash\n")
    assert call("--fresh").status == BROKEN
    assert starts.advise("--dry-run").status == UNKNOWN


def test_a_folder_with_many_entries(starts):
    starts.state.mkdir(mode=0o700)
    for number in range(10000):
        (starts.state / f"{uuid.UUID(int=number)}.json").touch(mode=0o600)
    assert starts.advise().status == HARDWARE
    assert not starts.advise().tried
    assert len(list(starts.state.glob("*.json"))) == 32
    assert len(starts.act("list").text.splitlines()) == 33


def test_files_of_others_are_not_followed(starts):
    starts.advise()
    file = starts.file()
    elsewhere = starts.folder / "elsewhere.json"
    file.rename(elsewhere)
    text = elsewhere.read_bytes()
    file.symlink_to(elsewhere)
    answer = starts.advise()
    assert answer.tried
    assert answer.err.endswith("is ignored: it is a link.\n")
    assert not file.is_symlink()
    assert elsewhere.read_bytes() == text
    file.chmod(0o666)
    answer = starts.advise()
    assert answer.tried
    assert answer.err.endswith("is ignored: other users can change it.\n")
    assert not starts.advise().tried


def test_a_damaged_and_a_newer_file(starts):
    starts.advise()
    file = starts.file()
    content = starts.content()
    file.write_text(file.read_text().replace('"hardware"', '"software"'))
    answer = starts.advise()
    assert (answer.status, answer.tried) == (HARDWARE, True)
    assert answer.err.endswith("is ignored: it is damaged.\n")
    assert not starts.advise().tried
    newer = seal({**content, "more": 1}, 2)
    file.write_text(newer)
    answer = starts.advise()
    assert answer.tried
    assert len(answer.document["messages"]) == 2
    assert file.read_text() == newer
    assert starts.act("forget").status == 0
    assert starts.advise().tried
    assert not starts.advise().tried
