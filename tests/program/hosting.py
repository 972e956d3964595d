"""Runs assay-host like its users, and validates its output against its schemas."""

import errno
import json
import os
import select
import signal
import subprocess
import sys
import tempfile
import time
import uuid
from dataclasses import dataclass, replace
from pathlib import Path

import pytest

from harness import BUILD, DEADLINE, PROGRAM, TREE, text_of, until

sys.path.insert(0, str(TREE / "tests" / "schema"))
pytest.importorskip("jsonschema", reason="python3-jsonschema isn't there")

from validate import decode, report_bytes, validate_document, validate_events  # noqa: E402

HOST = BUILD / "bin" / "assay-host"
# The same program with long times for all that must happen in time, and with a clock for the timeout
# that a Cue sets: the outcomes of its runs don't depend on the machine's speed.
HOST_ON_CUE = BUILD / "bin" / "assay-host-on-cue"
TIMEOUT = 1200 # seconds, which pass only by a cue
CHILD = BUILD / "bin" / "test_child"
WORKER = "assay-worker"

STATUSES = {"complete": 0, "failed-tests": 1, "usage-error": 2, "crashed": 3, "hung": 4,
            "never-started": 5, "interrupted": 6}
ERROR_STATUS = 10


@dataclass
class Hosted:
    """How assay-host ended, and its output."""

    status: int
    out: bytes
    err: bytes
    peak_kib: int  # its maximum memory, guardian and worker together

    @property
    def text(self):
        return text_of(self.out)

    def document(self):
        """The JSON document, after checking it against the schema and the exit status."""
        result = validate_document(self.out)
        assert self.status == result["outcome"]["status"]
        assert self.status == STATUSES[result["outcome"]["verdict"]]
        return result

    def events(self):
        result = validate_events(self.out)
        assert result[0]["event"] == "start"
        assert result[-1]["event"] == "end"
        assert self.status == result[-1]["outcome"]["status"]
        return result


def processes_with(mark):
    """The ids and states of the processes that have the mark in their environment."""
    found = []
    for folder in Path("/proc").iterdir():
        try:
            if folder.name.isdigit() and mark in (folder / "environ").read_bytes():
                found.append((int(folder.name), (folder / "stat").read_text().split()[2]))
        except OSError:
            pass
    return found


def name_of(pid):
    try:
        return Path(f"/proc/{pid}/comm").read_text().strip()
    except OSError:
        return ""


def peak_of(pid):
    """The maximum memory of a process in KiB; 0 if it has ended."""
    try:
        for line in Path(f"/proc/{pid}/status").read_text().splitlines():
            if line.startswith("VmHWM:"):
                return int(line.split()[1])
    except OSError:
        pass
    return 0


class Cue:
    """Lets the timeout of a run of HOST_ON_CUE pass. The child does so with `touch "$ASSAY_TEST_CUE"`,
    once all that it has to do before is done."""

    def __init__(self, folder, name="cue"):
        self.path = Path(folder) / name
        self.path.unlink(missing_ok=True)
        self.variables = {"ASSAY_TEST_CUE": str(self.path)}

    def give(self):
        self.path.touch()


class Watched:
    """A running assay-host. A child has no timeout unless the arguments have one. As a context manager,
    asserts at the end that no process of it is left."""

    def __init__(self, *arguments, environment=None, stdin=subprocess.DEVNULL,
                 stdout=subprocess.PIPE, stderr=subprocess.PIPE, program=HOST_ON_CUE, **options):
        self.mark = f"ASSAY_TEST_MARK={uuid.uuid4()}".encode()
        name, value = self.mark.decode().split("=")
        runs_children = program == HOST_ON_CUE and arguments[0] in ("run", "torture")
        if runs_children and "--timeout" not in arguments:
            arguments = [arguments[0], "--timeout", "0", *arguments[1:]]
        self.process = subprocess.Popen(
            [program, *arguments], stdin=stdin, stdout=stdout, stderr=stderr,
            env={**(os.environ if environment is None else environment), name: value}, **options)
        self.peak_kib = 0

    def __enter__(self):
        return self

    def __exit__(self, *_):
        left = self.end_what_is_left()
        self.process.kill()
        self.process.wait()
        assert left == 0

    def end_what_is_left(self):
        """Kills all processes that are left, and waits for their end. Returns their number."""
        left = processes_with(self.mark)
        for number, _ in left:
            try:
                os.kill(number, signal.SIGKILL)
            except ProcessLookupError:
                pass
        while left and processes_with(self.mark):
            time.sleep(0.01)
        return len(left)

    def wait(self):
        """Waits for the end of the process itself, even if others hold its streams open."""
        descriptor = os.pidfd_open(self.process.pid)
        try:
            assert select.select([descriptor], [], [], DEADLINE)[0], "the process doesn't end"
        finally:
            os.close(descriptor)
        self.process.wait()

    def worker(self):
        """The id of the worker process; None if there is none yet, or not any more."""
        pid = self.process.pid
        try:
            children = Path(f"/proc/{pid}/task/{pid}/children").read_text().split()
        except OSError:
            return None
        names = {int(child): name_of(child) for child in children}
        return next((child for child, name in names.items() if name == WORKER), None)

    def look(self):
        worker = self.worker()
        peak = peak_of(self.process.pid) + (peak_of(worker) if worker else 0)
        self.peak_kib = max(self.peak_kib, peak)

    def finish(self):
        deadline = time.monotonic() + DEADLINE
        while True:
            self.look()
            try:
                out, err = self.process.communicate(timeout=0.02)
                break
            except subprocess.TimeoutExpired:
                assert time.monotonic() < deadline, "assay-host doesn't end"
        return Hosted(self.process.returncode, out or b"", err or b"", self.peak_kib)


def host_run(*arguments, **options):
    """Runs assay-host to its end."""
    with Watched(*arguments, **options) as watched:
        return watched.finish()


def host_run_until(condition, folder, *arguments, environment, child=()):
    """Runs assay-host; its timeout passes when the condition is true. The folder is for the cue."""
    cue = Cue(folder)
    # Nothing reads from a pipe until the condition is true.
    with tempfile.TemporaryFile() as out, \
            Watched(*arguments, "--timeout", str(TIMEOUT), *child, stdout=out,
                    environment={**environment, **cue.variables}) as watched:
        until(lambda: watched.process.poll() is not None or condition(), "the timeout doesn't pass")
        cue.give()
        hosted = watched.finish()
        out.seek(0)
        return replace(hosted, out=out.read())


def run_assay(host, *options, child=(), assay=None, machine=None, **more):
    """Runs `assay-host run` on a machine as Host.environment describes it."""
    machine = dict(machine or {})
    machine.setdefault("opencl", "absent")
    arguments = ["run", "--assay", str(assay or PROGRAM), *options]
    if child:
        arguments += ["--", *child]
    return host_run(*arguments, environment=host.environment(**machine), **more)


def script_child(folder, text, name="child"):
    """Writes an executable shell script that replaces the child."""
    file = folder / name
    file.write_text("#!/bin/sh\n" + text + "\n")
    file.chmod(0o755)
    return file


def texts(document, kind="value"):
    return [text_of(decode(line["text"])) for line in document["lines"] if line["kind"] == kind]


def read_to_the_end(control):
    """Reads what was written to a pseudo-terminal whose other side is closed. It comes in pieces, and
    its end is an error."""
    data = b""
    try:
        while piece := os.read(control, 65536):
            data += piece
    except OSError as error:
        assert error.errno == errno.EIO
    return data


__all__ = ["CHILD", "Cue", "ERROR_STATUS", "HOST", "HOST_ON_CUE", "Hosted", "STATUSES", "TIMEOUT",
           "WORKER", "Watched", "decode", "host_run", "host_run_until", "json", "processes_with",
           "read_to_the_end", "report_bytes", "run_assay", "script_child", "texts"]
