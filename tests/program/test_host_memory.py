"""The maximum memory of assay-host, for a child that prints anything and for a file that isn't a
report."""

import os
import subprocess
import sys
import threading

import pytest

from harness import SANITIZED_BY
from hosting import HOST_ON_CUE, script_child

pytestmark = pytest.mark.skipif(bool(SANITIZED_BY), reason="a sanitizer has memory of its own")

MAX_KIB = 64 * 1024
SIZE = 6 << 20 # beyond the limit of bytes
COUNT = 60000  # beyond the limit of lines


def numbered(form):
    return b"".join(form % number for number in range(COUNT))


FLOODS = {
    "nothing": lambda: b"",
    "empty lines": lambda: b"\n" * SIZE,
    "tiny lines": lambda: b"a=1\n" * (SIZE // 4),
    "one line": lambda: b"x" * SIZE,
    "long lines": lambda: (b"K=" + b"x" * 65000 + b"\n") * 100,
    "open quotes": lambda: b'K="\n' * (SIZE // 4),
    "keys": lambda: numbered(b"Key%d" + b"y" * 100 + b"=1\n"),
    "short keys": lambda: numbered(b"K%d=1\n"),
    "devices": lambda: numbered(b"glgpu[%d]." + b"y" * 100 + b"=1\n"),
    "keys of devices": lambda: b"NumGLGPUs=256\nNumCLGPUs=256\n" + b"".join(
        b"clgpu[%d].K%d%s=1\n" % (number % 256, number, b"y" * 100) for number in range(COUNT)),
    "one device": lambda: numbered(b'glgpu[0].K%d="' + b"\x01" * 100 + b'"\n'),
    "controls": lambda: b"".join(
        b'K%d="%s"\n' % (number, b"\x01" * 60000) for number in range(100)),
    "controls without a key": lambda: (b"\x01" * 60000 + b"\n") * 100,
    "bytes": lambda: b"".join(b'K%d="%s"\n' % (number, b"\xff" * 60000) for number in range(100)),
    "lists": lambda: b"".join(
        b"K%d=[%s1]\n" % (number, b"1, " * 20000) for number in range(100)),
}


# Runs its other arguments, and writes the status and the maximum memory to the file. The system counts
# the memory of whoever starts a program as the program's, until it is executed; here that is little.
MEASURE = """
import os, sys
child = os.posix_spawn(sys.argv[2], sys.argv[2:], os.environ)
_, status, usage = os.wait4(child, 0)
with open(sys.argv[1], "w") as file:
    print(os.waitstatus_to_exitcode(status), usage.ru_maxrss, file=file)
"""


@pytest.fixture(name="peak_of")
def fixture_peak_of(tmp_path_factory):
    """Returns the status of assay-host, and the maximum memory in KiB of it or a child of it."""
    file = tmp_path_factory.mktemp("peak") / "peak"

    def peak_of(output, *arguments, standard_error=subprocess.DEVNULL):
        subprocess.run([sys.executable, "-I", "-S", "-c", MEASURE, file, HOST_ON_CUE,
                        *map(str, arguments)], stdin=subprocess.DEVNULL, stdout=output,
                       stderr=standard_error, check=True)
        status, peak = file.read_text(encoding="ascii").split()
        return int(status), int(peak)

    return peak_of


@pytest.mark.parametrize("name, stream", [
    *((name, "") for name in FLOODS), ("tiny lines", ">&2"), ("controls", ">&2")])
def test_flood(tmp_path, peak_of, name, stream):
    (tmp_path / "flood").write_bytes(FLOODS[name]())
    child = script_child(tmp_path, f"exec cat {tmp_path}/flood {stream}")
    peaks = {}
    for form in (["json"], ["jsonl"], ["text"], ["text", "--raw"]):
        result = tmp_path / form[-1]
        with result.open("wb") as output:
            status, peaks[form[-1]] = peak_of(output, "run", "--assay", child, "--timeout", "0",
                                              "--format", *form)
        assert status == 1
        if form[0] != "text":
            status, peaks[f"diff of {form[0]}"] = peak_of(subprocess.DEVNULL, "diff", result, result)
            assert status == 0
    assert max(peaks.values()) <= MAX_KIB, peaks


@pytest.fixture(name="report")
def fixture_report(tmp_path):
    (tmp_path / "report").write_text("a=1\n")
    return tmp_path / "report"


@pytest.mark.parametrize("path, text", [
    ("/dev/zero", b"lines too long, or too many, for a report"),
    ("/dev/null", b"neither a JSON document nor a report"), ("/", b"can't read: Is a directory")])
def test_difference_to_a_device_or_a_folder(report, peak_of, tmp_path, path, text):
    with (tmp_path / "errors").open("wb") as errors:
        status, peak = peak_of(subprocess.DEVNULL, "diff", report, path, standard_error=errors)
    assert status == 2
    assert peak <= MAX_KIB
    assert (tmp_path / "errors").read_bytes() == b"assay-host: " + path.encode() + b": " + text + b"\n"


@pytest.mark.parametrize("piece", [b"a=1\n", b"\0", b"{\n", b'{"a": "', b" ", b'{"a":1,'])
def test_endless_pipe(report, peak_of, tmp_path, piece):
    """Reading stops at the limits of a report."""
    os.mkfifo(tmp_path / "pipe")
    written = []

    def write():
        block = piece * (65536 // len(piece))
        with open(tmp_path / "pipe", "wb", buffering=0) as pipe:
            try:
                while True:
                    written.append(pipe.write(block))
            except BrokenPipeError:
                pass

    writer = threading.Thread(target=write)
    writer.start()
    try:
        with (tmp_path / "errors").open("wb") as errors:
            status, peak = peak_of(subprocess.DEVNULL, "diff", report, tmp_path / "pipe",
                                   standard_error=errors)
    finally:
        writer.join()
    assert status == 2
    assert b"for a report" in (tmp_path / "errors").read_bytes() or b"not valid JSON" in (
        tmp_path / "errors").read_bytes()
    assert sum(written) <= 65 << 20
    assert peak <= MAX_KIB
