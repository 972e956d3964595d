"""Runs with one fault in one driver call, for every call of a full run: without and with assay-host."""

import contextlib
import os
import re
import threading
from collections import Counter
from dataclasses import dataclass, field

from calls import RECORD_HERE, FullMachine, PREFIX, calls_of, without_calls
from faults import FAULTS, Fault, library_of
from harness import PROGRAM_AT_ROOT, Call, Run, until
from hosting import TIMEOUT, Cue, Hosted, Watched

WORKERS = max(2, os.cpu_count() or 1)
# A sample has one in this many pairs of an entry point and a fault.
ONE_IN = 2

DURATION = re.compile(r"duration=\S+")


@dataclass
class Pair:
    """A call of the undisturbed run, and a fault for it."""

    call: Call
    fault: Fault
    before: list = field(repr=False)  # the lines printed before the call
    by_loader: bool  # the OpenCL loader makes the call, and doesn't check the answer

    @property
    def name(self):
        fault = re.sub(r"\W+", "-", self.fault.name)
        return f"{library_of(self.call.name)}-{self.call.number}-{fault}"

    def __str__(self):
        return f"{self.fault.name} in call {self.call.number}, {self.call.name}"


def normal(lines):
    """Removes from the lines what differs from run to run."""
    return [DURATION.sub("duration=", PREFIX.sub("# ", line)) for line in lines]


def sample(pairs, shift):
    """Selects some of a fault's pairs: for every entry point, or one in ONE_IN of them, one call. The
    fault's number `shift` determines which."""
    by_name = {}
    for pair in pairs:
        by_name.setdefault(pair.call.name, []).append(pair)
    step = ONE_IN if len(by_name) > 2 * ONE_IN else 1
    return [of_name[(7 * shift + index) % len(of_name)]
            for index, of_name in enumerate(by_name.values()) if (index + shift) % step == 0]


class Sweep:
    """The undisturbed run, and runs with faults. Several threads may make runs."""

    def __init__(self, folder):
        self.folder = folder
        self.machine = FullMachine(folder)
        plain = self.machine.run("plain")
        assert (plain.status, plain.errors) == (0, [])
        self.whole = normal(without_calls(plain.lines))
        self.calls = calls_of(plain.lines)
        self._starting = threading.Semaphore(WORKERS)

    def pairs(self, fault, all_of_them):
        """The fault's pairs, and the number of calls to which it doesn't apply, by reason."""
        found, left_out = [], Counter()
        # The loader makes the OpenCL calls before the program's own first one.
        first = next(made.call.number for made in self.calls if made.call.name == "clGetDeviceIDs")
        for made in self.calls:
            reason = fault.why_not(made.call)
            by_loader = library_of(made.call.name) == "cl" and made.call.number < first
            if reason:
                left_out[reason] += 1
            else:
                found.append(Pair(made.call, fault, self.whole[:made.printed], by_loader))
        shift = list(FAULTS).index(fault.name)
        return (found if all_of_them else sample(found, shift)), left_out

    def _watch(self, pair, way, *arguments, record, out, err, variables=None, **more):
        opencl = library_of(pair.call.name) == "cl"
        rules = pair.fault.rules(pair.call)
        gl_lines, cl_lines = ("", rules) if opencl else (rules, "")
        host, found = self.machine.host(f"{pair.name}-{way}", gl_lines=record["gl"] + gl_lines,
                                        cl_lines=record["cl"] + cl_lines)
        environment = {**host.environment(**found), **(variables or {})}
        if pair.by_loader:
            # An exception through the loader leaves its directory open, and the loader allocates as
            # much memory as the driver claims to need.
            environment["ASAN_OPTIONS"] += ":detect_leaks=0:allocator_may_return_null=1"
            environment["TSAN_OPTIONS"] += ":allocator_may_return_null=1"
        return Watched(*arguments, environment=environment, stdout=out, stderr=err, **more)

    def _wait_until_called(self, pair, record, process):
        """Waits until the call is the last one in the record: the fault has begun."""
        start = f"{pair.call.number} ".encode()

        def has_begun():
            lines = record.read_bytes().splitlines() if record.exists() else []
            if lines and lines[-1].startswith(start) and pair.call.name.encode() in lines[-1]:
                return True
            assert process.poll() is None, "the program ended although the driver hangs"
            return False

        until(has_begun, "the call isn't made")

    def bare(self, pair):
        """Runs the program by itself, with its calls between its lines."""
        files = [self.folder / f"{pair.name}-{stream}" for stream in ("out", "err")]
        with open(files[0], "ab") as out, open(files[1], "ab") as err, self._watch(
                pair, "bare", "-verbose=1", program=PROGRAM_AT_ROOT, out=out, err=err,
                record={"gl": RECORD_HERE, "cl": RECORD_HERE}) as watched:
            if pair.fault.ends == "hang":
                self._wait_until_called(pair, files[0], watched.process)
                watched.process.kill()
            watched.wait()
            if pair.fault.leaves:
                # Without assay-host nothing else ends them.
                assert watched.end_what_is_left() == pair.fault.leaves
        run = Run(watched.process.returncode, *(file.read_bytes() for file in files))
        for file in files:
            file.unlink()
        return run

    def hosted(self, pair):
        """Runs the same under assay-host."""
        record = {library: self.folder / f"{pair.name}-{library}-record"
                  for library in ("gl", "cl")}
        files = [self.folder / f"{pair.name}-host-{stream}" for stream in ("out", "err")]
        hangs = pair.fault.ends == "hang"
        cue = Cue(self.folder, f"{pair.name}-cue")
        with contextlib.ExitStack() as stack:
            out, err = (stack.enter_context(open(file, "wb")) for file in files)
            # Limits the runs that are on the way to the call, not those that hang in it.
            with self._starting:
                watched = stack.enter_context(self._watch(
                    pair, "hosted", "run", "--assay", str(PROGRAM_AT_ROOT), "--format", "json",
                    "--timeout", str(TIMEOUT), "--", "-verbose=1", out=out, err=err,
                    variables=cue.variables,
                    record={library: f"record {file}\n" for library, file in record.items()}))
                if hangs:
                    library = "cl" if library_of(pair.call.name) == "cl" else "gl"
                    self._wait_until_called(pair, record[library], watched.process)
                    cue.give()
            watched.wait()
        run = Hosted(watched.process.returncode, *(file.read_bytes() for file in files),
                     peak_kib=watched.peak_kib)
        for file in [*files, *record.values(), cue.path]:
            file.unlink(missing_ok=True)
        return run
