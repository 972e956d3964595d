"""The end of assay-host: with readers that don't read, by signals, at limits, and by its own sudden end.
In every case the child and its descendants end before it, or immediately after it."""

import contextlib
import os
import pty
import random
import resource
import signal
import subprocess
import sys
import termios
import time
from pathlib import Path

import pytest

from harness import EMULATED, SANITIZED_BY, until
from hosting import (CHILD, ERROR_STATUS, HOST_ON_CUE, TIMEOUT, Cue, Watched, host_run,
                     processes_with, script_child, texts)

INTERRUPTED = 6
LONG = bool(os.environ.get("ASSAY_LONG_TESTS"))

# A grandchild in a session of its own. Under emulation nobody could end it: emulation.py has the reason.
GRANDCHILD = "" if EMULATED else """setsid sh -c "trap '' INT TERM HUP; while :; do sleep 1; done" &"""

# Prints many lines, then hangs.
CHATTERBOX = f"""
i=0
while [ $i -lt 2000 ]; do
    echo "key$i=$i aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa"
    echo "an error $i aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa" >&2
    i=$((i + 1))
done
trap '' INT TERM HUP
{GRANDCHILD}
touch "$READY"
while :; do sleep 1; done
"""


class Scene:
    """A child that prints and hangs, and a pipe that only a test reads."""

    def __init__(self, folder):
        self.folder = folder
        self.ready = folder / "ready"
        self.child = script_child(folder, CHATTERBOX)
        self.cue = Cue(folder)
        self.read, self.write = os.pipe()

    def watch(self, *options, unread=False, **more):
        """Starts the run. `unread`: after a signal the host has no patience with its readers."""
        environment = {**os.environ, "READY": str(self.ready), **self.cue.variables}
        if unread:
            environment["ASSAY_TEST_UNREAD"] = "1"
        more.setdefault("stdout", self.write)
        more.setdefault("stderr", subprocess.DEVNULL)
        return Watched("run", "--assay", self.child, "--timeout", str(TIMEOUT), *options,
                       environment=environment, **more)

    def await_ready(self):
        until(self.ready.exists, "the child isn't ready")

    def end_the_child(self, watched):
        """Lets the timeout pass once the child is ready, and waits until the host has ended it."""
        self.await_ready()
        self.cue.give()
        await_none(watched)

    def fill(self):
        """Fills the pipe, so that the next write to it blocks."""
        os.set_blocking(self.write, False)
        with contextlib.suppress(BlockingIOError):
            while True:
                os.write(self.write, bytes(65536))
        os.set_blocking(self.write, True)

    def close(self):
        for end in ("read", "write"):
            self.close_end(end)

    def close_end(self, end):
        if getattr(self, end) is not None:
            os.close(getattr(self, end))
            setattr(self, end, None)

    def rest(self):
        """Reads the pipe to its end."""
        self.close_end("write")
        data = b""
        while piece := os.read(self.read, 65536):
            data += piece
        return data


@pytest.fixture
def scene(tmp_path):
    found = Scene(tmp_path)
    yield found
    found.close()


def children_of(watched):
    """The processes that the host started, without the host's own."""
    own = {watched.process.pid, watched.worker()}
    return [number for number, _ in processes_with(watched.mark) if number not in own]


def await_none(watched):
    """Waits until no such process is left. Checks twice: a process that starts another one and ends
    may hide both from a single check."""
    for _ in range(2):
        until(lambda: not children_of(watched), "something is left")


# Readers.

def blocked(scene, name):
    """The options and streams of a run whose output is blocked."""
    if name == "json lines":
        return ["--format", "jsonl"], {}
    if name == "raw":
        return ["--raw"], {}
    if name == "raw standard error":
        return ["--raw"], {"stdout": subprocess.DEVNULL, "stderr": scene.write}
    if name == "unread fifo":
        os.mkfifo(scene.folder / "fifo")
        return ["--output", scene.folder / "fifo"], {"stdout": subprocess.DEVNULL}
    assert name == "pipe that doesn't block"
    os.set_blocking(scene.write, False)
    return ["--format", "jsonl"], {}


BLOCKED = ["json lines", "raw", "raw standard error", "unread fifo", "pipe that doesn't block"]


@pytest.mark.parametrize("name", BLOCKED)
def test_reader_that_does_not_read(scene, name):
    """The child is still killed at its timeout, and one signal ends the wait for the reader."""
    options, streams = blocked(scene, name)
    with scene.watch(*options, unread=True, **streams) as watched:
        scene.end_the_child(watched)
        assert watched.process.poll() is None # it still waits for the reader
        watched.process.send_signal(signal.SIGTERM)
        assert watched.finish().status == INTERRUPTED


@pytest.mark.parametrize("name", BLOCKED)
def test_signal_before_the_timeout(scene, name):
    options, streams = blocked(scene, name)
    with scene.watch(*options, unread=True, **streams) as watched:
        scene.await_ready()
        watched.process.send_signal(signal.SIGTERM)
        assert watched.finish().status == INTERRUPTED # without waiting for the reader


# The command, its stream that isn't read, what the child does at its end, and the file that the host
# has written before its last output.
LAST_OUTPUTS = {
    "advise": ("advise --state state", "stdout", "", "state/*.json"),
    "bugreport": ("bugreport --yes --output archive", "stdout", "", "archive"),
    "error": ("bugreport --yes --output archive", "stderr", "touch archive", "archive"),
}


@pytest.mark.parametrize("name", LAST_OUTPUTS)
def test_last_output_that_is_not_read(scene, name):
    """The run is over; a signal ends the host at once."""
    command, stream, last, written = LAST_OUTPUTS[name]
    child = script_child(scene.folder, f"touch there; until [ -e go ]; do sleep 0.01; done; {last}")
    with Watched(*command.split(), "--assay", child, "--timeout", "0", cwd=scene.folder,
                 **{"stdout": subprocess.DEVNULL, stream: scene.write}) as watched:
        until((scene.folder / "there").exists, "the child doesn't start")
        scene.fill()
        (scene.folder / "go").touch()
        until(lambda: [file for file in scene.folder.glob(written) if b'"open"' not in file.read_bytes()],
              "the run doesn't end")
        await_none(watched)

        def is_ended():
            watched.process.send_signal(signal.SIGTERM)
            return watched.process.poll() is not None

        until(is_ended, "the host doesn't end")
        assert watched.process.returncode == INTERRUPTED


def test_late_reader_gets_everything(scene):
    with scene.watch("--format", "jsonl") as watched:
        scene.end_the_child(watched)
        data = scene.rest()
        assert watched.finish().status == 4
    lines = data.decode().splitlines()
    assert len(lines) == 1 + 2000 + 2000 + 1
    assert '"verdict":"hung"' in lines[-1]


def test_fifo_that_is_read_late(scene):
    fifo = scene.folder / "fifo"
    os.mkfifo(fifo)
    with scene.watch("--output", fifo, stdout=subprocess.DEVNULL) as watched:
        scene.end_the_child(watched)
        assert b"Run: did not end" in fifo.read_bytes()
        assert watched.finish().status == 4


def test_stopped_terminal(scene):
    """As after Ctrl-S: the terminal doesn't accept the progress line."""
    control, terminal = pty.openpty()
    try:
        with scene.watch(unread=True, stdout=subprocess.DEVNULL, stderr=terminal) as watched:
            termios.tcflow(terminal, termios.TCOOFF)
            scene.end_the_child(watched)
            watched.process.send_signal(signal.SIGTERM)
            assert watched.finish().status in (4, INTERRUPTED) # it may not have shown any progress
    finally:
        os.close(terminal)
        os.close(control)


def test_output_file_of_an_abandoned_run(scene):
    """Standard error blocks the writer, and the temporary file is deleted."""
    file = scene.folder / "result"
    with scene.watch("--raw", "--output", file, unread=True, stdout=subprocess.DEVNULL,
                     stderr=scene.write) as watched:
        scene.end_the_child(watched)
        watched.process.send_signal(signal.SIGINT)
        assert watched.finish().status == INTERRUPTED
    assert {each.name for each in scene.folder.iterdir()} == {"child", "cue", "ready"}


# Signals.

STKFLT = 16 # Python may have no name for it
ENDING_BY_DEFAULT = [signal.SIGHUP, signal.SIGINT, signal.SIGQUIT, signal.SIGUSR1, signal.SIGUSR2,
                     signal.SIGALRM, signal.SIGTERM, STKFLT, signal.SIGXCPU, signal.SIGVTALRM,
                     signal.SIGPROF, signal.SIGIO, signal.SIGPWR, signal.SIGRTMIN, signal.SIGRTMAX]


@pytest.mark.parametrize("number", ENDING_BY_DEFAULT, ids=str)
def test_signal_that_ends(scene, number):
    with scene.watch("--format", "json", stdout=subprocess.PIPE) as watched:
        scene.await_ready()
        watched.process.send_signal(number)
        run = watched.finish()
        assert run.document()["outcome"]["verdict"] == "interrupted"
        assert texts(run.document())[0].startswith("key0=")


def watch_waiting(folder, *words, **more):
    """Runs a child that writes its report once there is the file "go"."""
    return Watched("run", "--assay", CHILD, "--", *words, "await", folder / "go", "out",
                   'assayStart="x"', "out", 'assayEnd="y"', **more)


@pytest.mark.parametrize("number", [signal.SIGPIPE, signal.SIGXFSZ, signal.SIGCHLD, signal.SIGURG,
                                    signal.SIGWINCH, signal.SIGCONT, signal.SIGTTIN, signal.SIGTTOU],
                         ids=str)
def test_signal_that_does_not(number, tmp_path):
    with watch_waiting(tmp_path) as watched:
        worker = until(watched.worker, "no worker")
        for _ in range(5):
            watched.process.send_signal(number)
            os.kill(worker, number)
            time.sleep(0.02)
        (tmp_path / "go").touch()
        assert watched.finish().status == 0


@pytest.mark.parametrize("number", [signal.SIGINT, signal.SIGTERM, signal.SIGHUP], ids=str)
@pytest.mark.parametrize("pause", [0, 0.001, 0.01, 0.1])
def test_repeated_signals(scene, number, pause):
    """Only the first two have an effect, and none ends the host before its child."""
    with scene.watch() as watched:
        scene.await_ready()
        while watched.process.poll() is None:
            watched.process.send_signal(number)
            time.sleep(pause)
        assert children_of(watched) == [] # immediately
        assert watched.process.returncode == INTERRUPTED


def test_ignored_hangup_stays_ignored(tmp_path):
    with watch_waiting(tmp_path, preexec_fn=lambda: signal.signal(
            signal.SIGHUP, signal.SIG_IGN)) as watched:
        worker = until(watched.worker, "no worker")
        watched.process.send_signal(signal.SIGHUP)
        os.kill(worker, signal.SIGHUP)
        (tmp_path / "go").touch()
        assert watched.finish().status == 0


# The other commands that run a child.
OTHERS = ["torture", "check --require NumGLGPUs>=1", "advise --state state", "bugreport --yes"]


def watch_other(scene, command, **more):
    return Watched(*command.split(), "--assay", scene.child, "--timeout", "0", cwd=scene.folder,
                   environment={**os.environ, "READY": str(scene.ready)}, **more)


@pytest.mark.parametrize("command", OTHERS)
def test_other_commands_are_interrupted(scene, command):
    with watch_other(scene, command) as watched:
        scene.await_ready()
        watched.process.send_signal(signal.SIGINT)
        watched.process.send_signal(signal.SIGTERM)
        assert watched.finish().status == INTERRUPTED


def test_suspended_and_continued(tmp_path):
    """As by Ctrl-Z and fg: the whole run stops and continues, including grandchildren."""
    with watch_waiting(tmp_path, "spawn", "6000000") as watched:
        until(lambda: watched.worker() and any(map(is_sleeper, children_of(watched))), "no grandchild")
        everybody = [watched.process.pid, watched.worker(), *children_of(watched)]
        watched.process.send_signal(signal.SIGTSTP)
        until(lambda: all(state_of(each) == "T" for each in everybody), "not stopped")
        watched.process.send_signal(signal.SIGCONT)
        (tmp_path / "go").touch()
        assert watched.finish().status == 0


def is_sleeper(pid):
    """Whether it is the grandchild, and runs its program: until then its parent can't be stopped."""
    with contextlib.suppress(OSError):
        return b"sleep" in Path(f"/proc/{pid}/cmdline").read_bytes().split(b"\0")
    return False


def state_of(pid):
    with open(f"/proc/{pid}/stat", encoding="utf-8", errors="replace") as stat:
        return stat.read().rpartition(")")[2].split()[0]


# Inherited state.

def whole(*options, **more):
    return host_run("run", "--assay", CHILD, *options, "--", "out", 'assayStart="x"', "out",
                    'assayEnd="y"', **more)


@pytest.mark.parametrize("command", ["run", "torture"])
def test_ignored_ends_of_children(command, host):
    environment = host.environment(script="# nothing\n", opencl="absent")
    run = host_run(command, environment=environment,
                   preexec_fn=lambda: signal.signal(signal.SIGCHLD, signal.SIG_IGN))
    assert run.status == 0, run.text


def test_blocked_signals(scene):
    with scene.watch(unread=True, preexec_fn=lambda: signal.pthread_sigmask(
            signal.SIG_BLOCK, signal.valid_signals())) as watched:
        scene.await_ready()
        watched.process.send_signal(signal.SIGTERM)
        assert watched.finish().status == INTERRUPTED


def test_child_inherits_no_signal_state():
    def disturb():
        for number in (signal.SIGTERM, signal.SIGHUP, signal.SIGCHLD, signal.SIGPIPE):
            signal.signal(number, signal.SIG_IGN)
        signal.pthread_sigmask(signal.SIG_BLOCK, signal.valid_signals())

    def state(**more):
        run = host_run("run", "--raw", "--assay", CHILD, "--", "state", **more)
        return run.text.split("\n\n")[0]

    assert state(preexec_fn=disturb) == state()


@pytest.mark.parametrize("closed", [(0,), (1,), (2,), (0, 1), (0, 2), (1, 2), (0, 1, 2)], ids=str)
def test_closed_streams(tmp_path, closed):
    file = tmp_path / "result"
    run = whole("--output", file, preexec_fn=lambda: [os.close(stream) for stream in closed],
                stdin=None, stdout=None, stderr=None)
    assert run.status == 0
    assert "Run: all tests ran" in file.read_text()


def test_orphans_of_an_earlier_program(tmp_path):
    """Children that the process had before it became assay-host are left alone."""
    script = script_child(tmp_path, "sleep 1000 >&- 2>&- & echo $! > "
                                    f'{tmp_path}/pid; exec {HOST_ON_CUE} "$@"', "wrapper")
    with Watched("run", "--assay", CHILD, "--", "out", "a=1", program=script) as watched:
        watched.finish()
        other = int((tmp_path / "pid").read_text())
        os.kill(other, 0)
        os.kill(other, signal.SIGKILL)
        until(lambda: other not in dict(processes_with(watched.mark)), "it doesn't end")


# Limits.

def limit(kind, value):
    return lambda: resource.setrlimit(kind, (value, value))


@pytest.mark.parametrize("form", ["text", "json", "jsonl"])
def test_file_that_may_not_grow(tmp_path, form):
    """SIGXFSZ has its default action when the host starts, as usual."""
    with open(tmp_path / "out", "wb") as out:
        run = whole("--format", form, stdout=out,
                    preexec_fn=limit(resource.RLIMIT_FSIZE, 100), restore_signals=True)
    assert run.status == ERROR_STATUS
    assert b"cannot write to standard output: File too large" in run.err
    run = whole("--format", form, "--output", tmp_path / "result",
                preexec_fn=limit(resource.RLIMIT_FSIZE, 100), restore_signals=True)
    assert run.status == ERROR_STATUS
    assert b"File too large" in run.err
    assert [each.name for each in tmp_path.iterdir()] == ["out"]


@pytest.mark.parametrize("arguments", [["--help"], ["diff", "a", "b"], ["torture"]], ids=str)
def test_other_commands_with_a_file_that_may_not_grow(tmp_path, arguments, host):
    (tmp_path / "a").write_text('assayStart="x"\nKey=1\n')
    (tmp_path / "b").write_text('assayStart="x"\nKey=2\n')
    environment = host.environment(script="# nothing\n", opencl="absent")
    with open(tmp_path / "out", "wb") as out:
        run = host_run(*arguments, stdout=out, cwd=tmp_path, environment=environment,
                       preexec_fn=limit(resource.RLIMIT_FSIZE, 5), restore_signals=True)
    assert run.status == (2 if arguments[0] == "diff" else ERROR_STATUS)
    assert b"cannot write to standard output: File too large" in run.err


# Runs its arguments in the background of the terminal that is its standard input.
BACKGROUND = """
import fcntl, os, sys, termios
os.setsid()
fcntl.ioctl(0, termios.TIOCSCTTY, 0)
attributes = termios.tcgetattr(0)
attributes[3] |= termios.TOSTOP
termios.tcsetattr(0, termios.TCSANOW, attributes)
job = os.fork()
if job == 0:
    os.setpgid(0, 0)
    os.execv(sys.argv[1], sys.argv[1:])
os.waitpid(job, os.WUNTRACED)
"""


def test_background_of_a_terminal(tmp_path):
    """With the terminal's tostop, a write from the background stops a process by default."""
    file = tmp_path / "result"
    control, terminal = pty.openpty()
    try:
        with Watched("-c", BACKGROUND, HOST_ON_CUE, "run", "--raw", "--assay", CHILD, "--output",
                     file, "--", "err", "aside", "sleep", "300", "out", 'assayStart="x"', "out",
                     'assayEnd="y"', program=sys.executable, stdin=terminal, stdout=terminal,
                     stderr=terminal) as watched:
            watched.finish()
            assert "Run: all tests ran" in file.read_text()
    finally:
        os.close(terminal)
        os.close(control)


def test_processor_time_that_is_used_up(tmp_path):
    """At the soft limit of processor time, the host gets SIGXCPU."""
    child = script_child(tmp_path, f"{GRANDCHILD}\nwhile :; do echo 'a=\"'; done")
    with Watched("run", "--assay", child, stdout=subprocess.DEVNULL,
                 preexec_fn=lambda: resource.setrlimit(resource.RLIMIT_CPU, (1, 600))) as watched:
        assert watched.finish().status in (3, INTERRUPTED) # the child may reach the limit first


# A sudden end of the host.

def kill_host(watched):
    watched.process.kill()


def kill_group(watched):
    os.killpg(watched.process.pid, signal.SIGKILL)


def kill_worker(watched):
    worker = watched.worker()
    os.kill(worker if worker is not None else watched.process.pid, signal.SIGKILL)


def kill_by_name(watched):
    """Kills by name, like killall."""
    for number, _ in processes_with(watched.mark):
        try:
            with open(f"/proc/{number}/comm", encoding="utf-8") as name:
                if name.read().strip() == HOST_ON_CUE.name[:15]:
                    os.kill(number, signal.SIGKILL)
        except (FileNotFoundError, ProcessLookupError):
            pass


def quit_worker(watched):
    os.kill(watched.worker() or watched.process.pid, signal.SIGSEGV)


ENDS = [kill_host, kill_group, kill_worker, kill_by_name, quit_worker]


@pytest.mark.parametrize("end", ENDS, ids=lambda end: end.__name__)
def test_sudden_end(scene, end):
    with scene.watch(start_new_session=True) as watched:
        scene.await_ready()
        end(watched)
        watched.wait()
        until(lambda: processes_with(watched.mark) == [], "something is left")
        expected = signal.SIGSEGV if end is quit_worker else signal.SIGKILL
        assert watched.process.returncode == -expected


@pytest.mark.parametrize("command", OTHERS)
def test_sudden_end_of_other_commands(scene, command):
    with watch_other(scene, command, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL) as watched:
        scene.await_ready()
        watched.process.kill()
        watched.wait()
        until(lambda: processes_with(watched.mark) == [], "something is left")


@pytest.mark.skipif(os.getsid(0) == os.getsid(1), reason="the kernel continues a suspended worker "
                    "whose guardian has ended only if process 1 is of another session")
def test_end_while_suspended(scene):
    with scene.watch() as watched:
        scene.await_ready()
        worker = watched.worker()
        watched.process.send_signal(signal.SIGTSTP)
        until(lambda: state_of(watched.process.pid) == "T" and state_of(worker) == "T", "not stopped")
        watched.process.kill()
        until(lambda: processes_with(watched.mark) == [], "something is left")


def test_sudden_end_again_and_again(tmp_path):
    """A sudden end at any moment of a run leaves no process."""
    child = script_child(tmp_path, "setsid sh -c 'setsid sleep 1000 & sleep 1000' & sleep 0.02\n"
                                   "setsid sleep 1000 & echo a=1; sleep 1000")
    rounds = 1000 if LONG else 40
    chance = random.Random(rounds)
    for number in range(rounds):
        command = "torture" if number % 5 == 4 else "run"
        with Watched(command, "--assay", child, stdout=subprocess.DEVNULL,
                     stderr=subprocess.DEVNULL, start_new_session=True) as watched:
            time.sleep(chance.uniform(0, 0.12 if not SANITIZED_BY else 0.5))
            chance.choice(ENDS)(watched)
            watched.wait()
            for _ in range(2):
                until(lambda: processes_with(watched.mark) == [], f"left in round {number}")
