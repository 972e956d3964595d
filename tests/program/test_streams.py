"""Standard streams that fail: the run goes on, and its status is what the tests earned."""

import fcntl
import os
import time

import pytest

from harness import Run
from model import Gpu, check, predict


@pytest.fixture
def one(host):
    host.gpu = Gpu()
    host.found = {"script": host.gpu.script()}
    return host


LOST = "DoStdout failed"
GL_RENDERER = 0x1F01


@pytest.mark.parametrize("options, status", [([], 0), (["-exit=7"], 7), (["-throwAfter=9"], 2)])
def test_full_device(one, options, status):
    expected = predict([one.gpu], throw_after=9 if status == 2 else -1)
    with open("/dev/full", "wb") as full:
        run = one.run(*options, stdout=full, **one.found)
    assert run.errors.count(LOST) == len(expected.lines)
    assert [line for line in run.errors if line != LOST] == expected.errors
    assert run.status == status


def test_full_device_with_log_lines(one):
    """Log lines are lost without a word."""
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


def test_reader_that_goes_in_the_middle(one):
    """What the reader took is a beginning of the report; each later line is told as lost."""
    expected = predict([one.gpu]).lines
    vendor = next(index for index, line in enumerate(expected) if ".GLVendor=" in line)
    # Time for the reader to go.
    script = one.gpu.script() + "at glGetString(GL_VENDOR) sleep 500\n"
    child = one.start(script=script)
    seen = b"".join(child.stdout.readline() for _ in range(vendor))
    child.stdout.close()
    errors = child.stderr.read()
    child.stderr.close()
    run = Run(child.wait(30), seen, errors)
    assert run.lines == expected[:vendor]
    assert run.errors == [LOST] * (len(expected) - vendor)
    assert run.status == 0


def test_output_that_fails_for_a_while(one):
    """A later line is tried afresh, and no lost line turns up behind it."""
    expected = predict([one.gpu]).lines
    renderer = next(index for index, line in enumerate(expected) if ".GLRenderer=" in line)
    script = one.fresh_record() + one.gpu.script() + "at glGetString(GL_RENDERER) sleep 800\n"
    # A pipe that is full and doesn't let the writer wait.
    reader, writer = os.pipe()
    fcntl.fcntl(writer, fcntl.F_SETPIPE_SZ, 4096)
    os.set_blocking(writer, False)
    filled = 0
    try:
        while True:
            filled += os.write(writer, b"." * 4096)
    except BlockingIOError:
        pass
    child = one.start(script=script, stdout=writer)
    os.close(writer)
    deadline = time.monotonic() + 20
    while f"glGetString 0x{GL_RENDERER:X}" not in [
            f"{call.name} {call.arguments}" for call in one.record_so_far()]:
        assert time.monotonic() < deadline
        time.sleep(0.02)
    while filled > 0:
        filled -= len(os.read(reader, filled))
    with open(reader, "rb") as rest:
        out = rest.read()
    errors = child.stderr.read()
    child.stderr.close()
    run = Run(child.wait(30), out, errors)
    assert run.lines == expected[renderer:]
    assert run.errors == [LOST] * renderer
    assert run.status == 0


def closed(*descriptors):
    def close():
        for descriptor in descriptors:
            os.close(descriptor)
    return close


def test_closed_stdout(one):
    """Nothing that the run opens takes the place of the closed stream."""
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
    """A host sees each line before the next probe begins."""
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
