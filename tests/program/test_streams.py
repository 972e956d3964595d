"""Standard streams that fail: the run continues, and its status depends on the tests alone."""

import errno
import fcntl
import os
import pty
import resource
import signal
import subprocess
import sys
import tempfile
from pathlib import Path

import pytest

from harness import DEADLINE, PROGRAM, Run, ended_by
from model import Gpu, check, predict


@pytest.fixture
def one(host):
    host.gpu = Gpu()
    host.found = {"script": host.gpu.script()}
    return host


LOST = "DoStdout failed"
STOP = "at 1 glGetString(GL_RENDERER) signal 19\n"


def wait_until_stopped(child):
    """Waits until the driver stops the process by the rule STOP."""
    state = os.waitid(os.P_PID, child.pid, os.WEXITED | os.WSTOPPED | os.WNOWAIT)
    assert state.si_code == os.CLD_STOPPED


def rest_of(child):
    """Continues a stopped child, and returns its further standard error and its status."""
    child.send_signal(signal.SIGCONT)
    errors = child.stderr.read()
    child.stderr.close()
    return errors, child.wait(DEADLINE)


@pytest.mark.parametrize("options, status", [([], 0), (["-exit=7"], 7), (["-throwAfter=9"], 2)])
def test_full_device(one, options, status):
    expected = predict([one.gpu], throw_after=9 if status == 2 else -1)
    with open("/dev/full", "wb") as full:
        run = one.run(*options, stdout=full, **one.found)
    assert run.errors.count(LOST) == len(expected.lines)
    assert [line for line in run.errors if line != LOST] == expected.errors
    assert run.status == status


def test_full_device_with_log_lines(one):
    """Log lines are lost without a message."""
    with open("/dev/full", "wb") as full:
        run = one.run("-verbose=1", stdout=full, **one.found)
    assert run.errors == [LOST] * len(predict([one.gpu]).lines)
    assert run.status == 0


def test_text_options_to_a_full_device(one):
    with open("/dev/full", "wb") as full:
        run = one.run("-stdout=a", "-comment=b", "-stderr=c", "-bogus", stdout=full, **one.found)
    assert run.errors[:4] == [LOST, LOST, "c", "Usage exception: usage"]
    assert run.status == 3


def test_reader_that_has_gone(one):
    reader, writer = os.pipe()
    os.close(reader)
    try:
        run = one.run(stdout=writer, **one.found)
    finally:
        os.close(writer)
    assert run.errors == [LOST] * len(predict([one.gpu]).lines)
    assert run.status == 0


def test_reader_that_closes_in_the_middle(one):
    """The reader gets a beginning of the report; each later line is reported as lost."""
    expected = predict([one.gpu]).lines
    renderer = next(index for index, line in enumerate(expected) if ".GLRenderer=" in line)
    child = one.start(script=one.gpu.script() + STOP)
    wait_until_stopped(child)
    seen = b"".join(child.stdout.readline() for _ in range(renderer))
    child.stdout.close()
    errors, status = rest_of(child)
    run = Run(status, seen, errors)
    assert run.lines == expected[:renderer]
    assert run.errors == [LOST] * (len(expected) - renderer)
    assert run.status == 0


def test_output_that_fails_for_a_while(one):
    """Later lines are written again, and no lost line comes after them."""
    expected = predict([one.gpu]).lines
    renderer = next(index for index, line in enumerate(expected) if ".GLRenderer=" in line)
    # A full pipe in non-blocking mode.
    reader, writer = os.pipe()
    fcntl.fcntl(writer, fcntl.F_SETPIPE_SZ, 4096)
    os.set_blocking(writer, False)
    filled = 0
    try:
        while True:
            filled += os.write(writer, b"." * 4096)
    except BlockingIOError:
        pass
    child = one.start(script=one.gpu.script() + STOP, stdout=writer)
    os.close(writer)
    wait_until_stopped(child)
    while filled > 0:
        filled -= len(os.read(reader, filled))
    errors, status = rest_of(child)
    with open(reader, "rb") as rest:
        out = rest.read()
    run = Run(status, out, errors)
    assert run.lines == expected[renderer:]
    assert run.errors == [LOST] * renderer
    assert run.status == 0


@pytest.mark.parametrize("options", [[], ["-verbose=1"]])
def test_partial_write_to_a_pipe(one, options):
    """The next line begins on a line of its own."""
    capacity = 4096
    one.gpu.vendor = "v" * (2 * capacity)
    reader, writer = os.pipe()
    assert fcntl.fcntl(writer, fcntl.F_SETPIPE_SZ, capacity) == capacity
    os.set_blocking(writer, False)
    child = one.start(*options, script=one.gpu.script() + STOP, stdout=writer)
    os.close(writer)
    wait_until_stopped(child)
    out = os.read(reader, capacity)
    errors, status = rest_of(child)
    with open(reader, "rb") as rest:
        out += rest.read()
    whole = predict([one.gpu]).lines
    facts = [line for line in Run(0, out, b"").lines if not line.startswith("#")]
    cut = next(index for index, line in enumerate(whole) if ".GLVendor=" in line)
    assert facts[:cut] == whole[:cut]
    assert facts[cut] != whole[cut] and whole[cut].startswith(facts[cut])
    assert facts[cut + 1:] == whole[cut + 1:]
    assert Run(status, b"", errors).errors == [LOST]
    assert status == 0


@pytest.mark.parametrize("options", [[], ["-verbose=1"]])
def test_partial_write_to_a_full_disk(one, options):
    """Wherever the line is cut, at its first byte or its last, the next one begins on its own line."""
    whole = predict([one.gpu]).lines
    first = len(Run(0, one.run(*options, **one.found).out, b"").out.split(b"\n")[0])
    after = next(index for index, line in enumerate(whole) if ".GLRenderer=" in line)
    for limit in [*range(first - 1, first + 4), *range(120, 340, 23)]:
        with tempfile.TemporaryFile() as file:
            child = one.start(*options, script=one.gpu.script() + STOP, stdout=file,
                              before=lambda: resource.setrlimit(
                                  resource.RLIMIT_FSIZE, (limit, resource.RLIM_INFINITY)))
            wait_until_stopped(child)
            resource.prlimit(child.pid, resource.RLIMIT_FSIZE,
                             (resource.RLIM_INFINITY, resource.RLIM_INFINITY))
            errors, status = rest_of(child)
            file.seek(0)
            out = file.read()
        lines = Run(status, out, errors).lines
        facts = [line for line in lines if line and not line.startswith("#")]
        assert "" not in lines, limit
        assert facts[-len(whole[after:]):] == whole[after:], limit
        assert (out[limit - 1:limit] == b"\n") != (out[limit:limit + 1] == b"\n"), limit
        assert status == 0


def closed(*descriptors):
    def close():
        for descriptor in descriptors:
            os.close(descriptor)
    return close


def test_closed_stdout(one):
    """No file that the run opens gets the number of the closed stream."""
    script = one.fresh_record() + one.gpu.script()
    run = one.run(script=script, stdout=None, before=closed(1))
    assert run.errors == [LOST] * len(predict([one.gpu]).lines)
    assert run.status == 0
    assert all(call.name.startswith(("egl", "gl")) for call in one.record())


def test_closed_stdin(one):
    check(one.run(stdin=None, before=closed(0), **one.found), predict([one.gpu]))


def test_closed_stderr(one):
    run = one.run("-stderr=x", "-throwAfter=9", stderr=None, before=closed(2), **one.found)
    expected = predict([one.gpu], throw_after=9)
    assert run.lines == expected.lines
    assert run.status == 2


def test_all_streams_closed(one):
    script = one.fresh_record() + one.gpu.script()
    run = one.run("-exit=9", script=script, stdin=None, stdout=None, stderr=None,
                  before=closed(0, 1, 2))
    assert run.status == 9
    assert len(one.record()) > 50


def test_full_stderr(one):
    with open("/dev/full", "wb") as full:
        run = one.run("-stderr=x", "-throwAfter=9", stderr=full, **one.found)
    assert run.lines == predict([one.gpu], throw_after=9).lines
    assert run.status == 2
    with open("/dev/full", "wb") as full:
        assert one.run("-bogus", stderr=full, **one.found).status == 3


def test_both_streams_full(one):
    with open("/dev/full", "wb") as full:
        assert one.run("-exit=4", stdout=full, stderr=full, **one.found).status == 4


def test_every_line_is_flushed_on_its_own(one):
    """A host receives each line before the next test begins."""
    script = one.gpu.script() + "at glGetString(GL_VENDOR) hang\n"
    child = one.start(script=script)
    try:
        lines = []
        expected = predict([one.gpu]).lines
        for line in expected:
            if ".GLVendor=" in line:
                break
            lines.append(child.stdout.readline().decode().rstrip("\n"))
        assert len(lines) == 10
        assert lines[-1] == expected[9]
        assert child.poll() is None
    finally:
        child.kill()
        child.communicate()
    assert child.returncode == -9


def test_every_line_is_one_write(one):
    """A packet pipe keeps writes apart: a crash between two of them leaves no partial line."""
    reader, writer = os.pipe2(os.O_DIRECT)
    fcntl.fcntl(writer, fcntl.F_SETPIPE_SZ, 1 << 20)  # a page for each packet
    try:
        run = one.run("-stdout=one", "-comment=two", "-stderr=three", "-verbose=1",
                      stdout=writer, stderr=writer, **one.found)
        os.close(writer)
        writer = None
        packets = list(iter(lambda: os.read(reader, 1 << 16), b""))
    finally:
        os.close(reader)
        if writer is not None:
            os.close(writer)
    assert run.status == 0
    assert {b"one\n", b"# two\n", b"three\n"} <= set(packets)
    assert [packet for packet in packets if packet.count(b"\n") != 1 or packet[-1:] != b"\n"] == []
    assert len(packets) > len(predict([one.gpu]).lines)  # log lines too


def test_file_size_limit(one):
    """The file is filled to the last byte; each line beyond the limit is reported as lost."""
    limit = 500
    whole = b"".join(line.encode() + b"\n" for line in predict([one.gpu]).lines)
    with tempfile.TemporaryFile() as file:
        run = one.run("-exit=7", stdout=file, **one.found, before=lambda: resource.setrlimit(
            resource.RLIMIT_FSIZE, (limit, resource.RLIM_INFINITY)))
        file.seek(0)
        out = file.read()
    assert len(out) == limit
    stamped = Run(run.status, out, run.err).report.encode()
    assert whole.startswith(stamped)
    assert run.errors == [LOST] * whole[len(stamped):].count(b"\n")
    assert run.status == 7


# Runs its arguments as a background job of a terminal that stops jobs that write in the background.
BACKGROUND = """
import fcntl, os, subprocess, sys, termios
fcntl.ioctl(0, termios.TIOCSCTTY, 0)
settings = termios.tcgetattr(0)
settings[1] &= ~termios.OPOST
settings[3] |= termios.TOSTOP
termios.tcsetattr(0, termios.TCSANOW, settings)
assert os.tcgetpgrp(0) == os.getpgrp()
job = subprocess.Popen(sys.argv[1:], stderr=subprocess.PIPE, preexec_fn=os.setpgrp)
state = os.waitid(os.P_PID, job.pid, os.WEXITED | os.WSTOPPED | os.WNOWAIT)
if state.si_code == os.CLD_STOPPED:
    job.kill()
    sys.exit("stopped by signal %d" % state.si_status)
sys.stderr.buffer.write(job.stderr.read())
sys.exit(job.wait())
"""


def test_background_of_a_terminal(one):
    """A terminal that stops jobs that write in the background doesn't stop this one."""
    main, terminal = pty.openpty()
    leader = subprocess.Popen([sys.executable, "-c", BACKGROUND, PROGRAM, "-exit=7"],
                              stdin=terminal, stdout=terminal, stderr=subprocess.PIPE,
                              env=one.environment(**one.found), start_new_session=True)
    os.close(terminal)
    out = b""
    try:
        while piece := os.read(main, 4096):
            out += piece
    except OSError as error:  # the terminal is closed
        assert error.errno == errno.EIO
    errors = leader.communicate(timeout=DEADLINE)[1]
    os.close(main)
    check(Run(leader.returncode, out, errors), predict([one.gpu], exit_status=7))


def test_signals_blocked_and_ignored_on_entry(one):
    """A signal that a driver raises is a crash, even if it was ignored at the start."""
    def ignore():
        signal.signal(signal.SIGBUS, signal.SIG_IGN)
        signal.pthread_sigmask(signal.SIG_BLOCK, signal.valid_signals())

    script = one.gpu.script() + "at glGetString(GL_VENDOR) signal 7\n"
    run = one.run(script=script, before=ignore)
    assert ended_by(run, "SIGBUS")
    whole = predict([one.gpu]).lines
    assert run.lines == whole[:len(run.lines)]


def test_core_limit(one):
    """The soft limit is 1, at which the kernel neither dumps nor starts a crash reporter."""
    hard = resource.getrlimit(resource.RLIMIT_CORE)[1]
    child = one.start(script=one.gpu.script() + "at glGetString(GL_VENDOR) hang\n",
                      before=lambda: resource.setrlimit(resource.RLIMIT_CORE, (hard, hard)))
    try:
        assert child.stdout.readline()
        limits = Path(f"/proc/{child.pid}/limits").read_text(encoding="ascii")
    finally:
        child.kill()
        child.communicate()
    line = next(line for line in limits.splitlines() if line.startswith("Max core file size"))
    assert line.split()[4] == "1"
