"""Runs tests where they can harm nothing: as the second process of namespaces of its own.

usage: inside.py JOB    (below unshare; JOB is a JSON file)

The file systems are read-only but for fresh ones on /tmp, /dev/shm and the board's folder. The last
line on standard output is the result, as JSON.
"""
import json
import os
import re
import resource
import select
import signal
import subprocess
import sys
import time
import traceback
from pathlib import Path

sys.path.insert(0, str(Path(__file__).resolve().parent.parent))
from mutants.board import Board  # noqa: E402

# A test that goes on for so long after its usual time is taken to hang.
PATIENCE = 30
PATIENCE_TIMES = 10
# The usual time of what wasn't surveyed yet; None is its place among the known times.
SURVEYED = {None: 60}
MEMORY = 12 << 30
# Some tests write behind the 32-bit sizes, into files with holes.
FILE = 64 << 30
# A case that fails once and then passes, or fails without the mutant too, says nothing; after so many of them the mutant is let go.
UNSTEADY = 3
EVENT = re.compile(rb"\[ (RUN     | FAILED ) +\] ([\w/]+\.[\w/]+)")


def mount(*arguments, must=True):
    done = subprocess.run(["mount", *arguments], capture_output=True, text=True, check=False)
    if must and done.returncode != 0:
        sys.exit(f"mount {' '.join(arguments)}: {done.stderr}")


def close_off(board):
    """Leaves nothing of the machine that could be changed."""
    places = [line.split()[1] for line in Path("/proc/self/mounts").read_text().splitlines()]
    for place in dict.fromkeys(places):
        if place != "/proc" and not place.startswith("/dev/pts"):
            mount("-o", "remount,bind,ro", place, must=place == "/")
    # What these hold is the machine's memory.
    for place, size in (("/tmp", "2g"), ("/dev/shm", "256m"), (str(board.parent), "64m")):
        mount("-t", "tmpfs", "-o", f"size={size}", "tmpfs", place)
    Path("/proc/self/oom_score_adj").write_text("900")
    resource.setrlimit(resource.RLIMIT_FSIZE, (FILE, FILE))
    resource.setrlimit(resource.RLIMIT_AS, (MEMORY, MEMORY))
    for signal_number in (signal.SIGHUP, signal.SIGINT, signal.SIGTERM, signal.SIGPIPE, signal.SIGCHLD):
        signal.signal(signal_number, signal.SIG_DFL)
    os.environ.update(HOME="/tmp/home", TMPDIR="/tmp", PYTHONDONTWRITEBYTECODE="1")
    os.makedirs("/tmp/home")


class Failure:
    """A case, or "" where none had started, and what became of it."""

    def __init__(self, case, how):
        self.case, self.how = case, how


class Watch:
    """Follows a run of several cases; `seconds` says how long each takes at other times."""

    def __init__(self, command, seconds, environment=None):
        self.seconds = seconds
        self.running, self.failed, self.began = "", "", time.monotonic()
        self.child = subprocess.Popen(command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                      stderr=subprocess.STDOUT, start_new_session=True, cwd="/tmp",
                                      env={**os.environ, **(environment or {})})

    def follow(self, note):
        """The Failure, or None. `note` is called with what was printed, and at least each half second."""
        while True:
            ready, _, _ = select.select([self.child.stdout], [], [], 0.5)
            data = os.read(self.child.stdout.fileno(), 1 << 16) if ready else None
            if data:
                note(data)
            elif data == b"" or self.child.poll() is not None:
                break
            else:
                note(b"")
            limit = PATIENCE + PATIENCE_TIMES * self.seconds.get(self.running, self.seconds.get(None, 1))
            if time.monotonic() - self.began > limit:
                self.stop()
                return Failure(self.running, "hangs")
        status = self.end()
        note(b"")
        if self.failed:
            return Failure(self.failed, "fails")
        return Failure(self.running, f"status {status}") if status != 0 else None

    def end(self):
        """The status; a program that closed its output and goes on hangs."""
        try:
            return self.child.wait(PATIENCE)
        except subprocess.TimeoutExpired:
            self.stop()
            return "hangs"

    def stop(self):
        os.killpg(self.child.pid, signal.SIGKILL)
        self.child.wait()


class GoogleTest:
    def __init__(self, path, seconds):
        self.path, self.seconds = path, seconds

    def run(self, cases):
        Path("/tmp/flags").write_text(f"--gtest_filter={':'.join(cases)}\n--gtest_fail_fast\n--gtest_color=no\n")
        watch = Watch([self.path, "--gtest_flagfile=/tmp/flags"], self.seconds)
        rest = b""

        def note(data):
            nonlocal rest
            *lines, rest = (rest + data).split(b"\n")
            rest = rest[-4096:]
            for line in lines:
                for match in EVENT.finditer(line):
                    case = match.group(2).decode()
                    if match.group(1) == b"RUN     ":
                        watch.running, watch.began = case, time.monotonic()
                    else:
                        watch.failed = watch.failed or case

        return watch.follow(note)


class ProgramTests:
    """The tests of pytest, which its plugin orders."""

    def __init__(self, job, seconds):
        self.job, self.seconds = job, seconds

    def run(self, cases, survey=False):
        """The Failure, or None; with `survey`, what the plugin says of each test."""
        progress, order = Path("/tmp/progress"), Path("/tmp/order")
        progress.write_text("")
        # Reading the others takes longer than most tests.
        wanted = {case.split("::")[0] for case in cases or ()}
        files = [file for file in self.job["program_tests"]
                 if cases is None or os.path.relpath(file, self.job["tree"]) in wanted]
        order.write_text(json.dumps({"cases": cases, "survey": survey, "board": self.job["board"],
                                     "slowest": self.job.get("slowest"), "progress": str(progress)}))
        command = ["/usr/bin/python3", "-m", "pytest", "-q", "-p", "no:cacheprovider", "-p",
                   "mutants.pytest_plugin", "--rootdir", self.job["tree"], "--tb=no",
                   *([] if survey else ["-x"]), *files]
        watch = Watch(command, self.seconds, {
            "MUTATION_JOB": str(order), "ASSAY_BUILD_DIR": self.job["build"],
            "PYTHONPATH": str(Path(__file__).resolve().parent.parent)})
        at, results = 0, []

        def note(_):
            nonlocal at
            text = progress.read_text()
            whole = text[at:text.rfind("\n") + 1]
            at += len(whole)
            for line in whole.splitlines():
                said = json.loads(line)
                watch.began = time.monotonic()
                watch.running = said.get("starts", "")
                if "ends" in said:
                    results.append(said)
                    if not said["passed"]:
                        watch.failed = watch.failed or said["ends"]

        failure = watch.follow(note)
        return results if survey else failure


def survey(job, board):
    """For each case: whether it passes alone, how long it takes and which mutants it asks for."""
    result = {}
    for program, cases in job["programs"].items():
        result[program] = {}
        for case in cases:
            board.clear()
            start = time.monotonic()
            failure = GoogleTest(program, SURVEYED).run([case])
            result[program][case] = {"passed": failure is None, "seconds": time.monotonic() - start,
                                     "reached": board.reached()}
    if job["program_tests"]:
        found = ProgramTests(job, SURVEYED).run(None, survey=True)
        result["program"] = {each.pop("ends"): each for each in found}
    return result


def fails_anyway(job, board, tests, case):
    """Whether a case fails without the mutant too. A mutant that was built alone, number 0, is on always."""
    if job["number"] == 0:
        return False
    board.choose(0)
    try:
        return tests.run([case]) is not None
    finally:
        board.choose(job["number"])


def attempt(job, board):
    """Whether the tests catch a mutant. `steps` are (program, {case: seconds}) in order."""
    board.choose(job["number"])
    unsteady = []
    for program, seconds in job["steps"]:
        tests = ProgramTests(job, seconds) if program == "program" else GoogleTest(program, seconds)
        cases = [case for case in seconds if case not in unsteady]
        while cases:
            failure = tests.run(cases)
            if failure is None:
                break
            again = failure.how == "hangs" or not failure.case or tests.run([failure.case]) is not None
            if again and not (failure.case and fails_anyway(job, board, tests, failure.case)):
                return {"verdict": "killed", "by": failure.case or Path(program).name, "how": failure.how}
            unsteady.append(failure.case)
            if len(unsteady) == UNSTEADY:
                return {"verdict": "survived", "unsteady": unsteady}
            cases.remove(failure.case)
    return {"verdict": "survived", "unsteady": unsteady}


def work(job):
    board_path = Path(job["board"])
    close_off(board_path)
    board = Board(board_path, job["size"])
    return (survey if job["what"] == "survey" else attempt)(job, board)


def main():
    job = json.loads(Path(sys.argv[1]).read_text())
    # The first process only waits for what it inherits.
    worker = os.fork()
    if worker == 0:
        status = 1
        try:
            result = work(job)
            print("\n" + json.dumps(result), flush=True)
            status = 0
        except BaseException:  # pylint: disable=broad-except
            traceback.print_exc()
        finally:
            os._exit(status)
    while True:
        ended, status = os.wait()
        if ended == worker:
            os._exit(os.waitstatus_to_exitcode(status) & 127)


if __name__ == "__main__":
    main()
