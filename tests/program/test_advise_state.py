"""`assay-host advise` with a state that is damaged or can't be written: no crash, and never hardware
that wasn't found. A sample of bytes is damaged, a larger one with ASSAY_LONG_TESTS=1; the unit tests
damage every byte."""

import os

import pytest

from namespaces import Namespace, why_no_namespace
from starts import BROKEN, HARDWARE, UNKNOWN, Starts

PLACES = 200 if os.environ.get("ASSAY_LONG_TESTS") else 20

NO_NAMESPACE = why_no_namespace()
needs_namespace = pytest.mark.skipif(NO_NAMESPACE is not None, reason=str(NO_NAMESPACE))


@pytest.fixture
def starts(host, tmp_path):
    return Starts(host, tmp_path)


@pytest.fixture
def namespace():
    with Namespace() as space:
        yield space


def places(size):
    """The bytes to damage: some of the first ones and of the others, and the last one."""
    return [*range(0, 60, 20), *range(60, size, size // PLACES), size - 1]


@pytest.mark.parametrize("driver", ["", "at eglInitialize crash\n"], ids=["works", "crashes"])
def test_a_damaged_file(starts, driver):
    """Knowledge that is lost is as if there had never been any."""
    starts.set_driver(driver)
    assert starts.advise().tried
    file = starts.file()
    text = file.read_bytes()
    damaged = [text[:size] for size in places(len(text))]
    damaged += [text[:at] + bytes([text[at] ^ flip]) + text[at + 1:]
                for at in places(len(text)) for flip in (1, 0xFF)]
    for each in damaged:
        file.write_bytes(each)
        plan = starts.advise("--dry-run")
        assert (plan.status, plan.document["plan"], plan.document["due"]) == (UNKNOWN, "try", "first")
        assert plan.err.endswith(" is ignored: it is damaged.\n")
    answer = starts.advise()
    assert (answer.status, answer.tried) == (BROKEN if driver else HARDWARE, True)
    assert starts.advise().err == ""
    assert starts.children == 2


@needs_namespace
def test_a_disk_that_is_full(starts, namespace):
    starts.state.mkdir(mode=0o700)
    namespace.mount("-t", "tmpfs", "-o", "size=256k", "none", starts.state)
    assert starts.advise(around=namespace.around).status == HARDWARE
    namespace.run("sh", "-c", f'head -c 1M /dev/zero > "{starts.state}/filler"', check=False)
    # The old knowledge isn't kept if it isn't true any more.
    starts.set_driver("at eglInitialize crash\n")
    answer = starts.advise("--fresh", around=namespace.around)
    assert (answer.status, answer.tried) == (BROKEN, True)
    assert "can't be kept: No space left on device" in answer.err
    assert starts.advise("--dry-run", around=namespace.around).status == UNKNOWN
    for _ in range(2):
        assert starts.advise(around=namespace.around).status == BROKEN
    namespace.run("rm", f"{starts.state}/filler")
    answer = starts.advise(around=namespace.around)
    assert (answer.status, answer.tried, answer.err) == (BROKEN, True, "")
    assert not starts.advise(around=namespace.around).tried


@needs_namespace
def test_a_file_system_that_cannot_be_written(starts, namespace):
    starts.state.mkdir(mode=0o700)
    namespace.mount("--bind", starts.state, starts.state)
    namespace.mount("-o", "remount,bind,ro", starts.state)
    for count in (1, 2):
        answer = starts.advise(around=namespace.around)
        assert (answer.status, answer.tried, starts.children) == (HARDWARE, True, count)
        assert answer.err.startswith("assay-host: The state can't be kept: Read-only file system")
    # What was learnt before can still be read.
    assert starts.advise().status == HARDWARE
    answer = starts.advise(around=namespace.around)
    assert (answer.status, answer.tried, answer.err) == (HARDWARE, False, "")
