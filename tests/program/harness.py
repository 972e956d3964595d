"""Runs the built program like a host: arguments in; standard output, standard error and exit status
out. Nothing here depends on how the program is implemented.

ASSAY_BUILD_DIR names the build folder; the default is build/linux.
"""

import os
import re
import signal
import subprocess
import time
from dataclasses import dataclass, field
from pathlib import Path

TREE = Path(__file__).resolve().parents[2]
BUILD = Path(os.environ.get("ASSAY_BUILD_DIR", TREE / "build" / "linux")).resolve()
PROGRAM = BUILD / "bin" / "assay"
# The same program, which takes the root of the file system from ASSAY_TEST_ROOT: the only way to give
# it adapters that this machine doesn't have.
PROGRAM_AT_ROOT = BUILD / "bin" / "assay-at-root"
SCRIPTED_EGL = BUILD / "drivers" / "egl"

# The sanitizers of the build, as ASSAY_SANITIZE names them; "" without.
SANITIZED_BY = os.environ.get("ASSAY_SANITIZE", "")
# Whether the programs are for another processor, and run by an emulator.
EMULATED = os.environ.get("ASSAY_EMULATED", "") == "ON"
# For events that must come, in seconds: no statement about speed. A machine may be very busy, and
# `assay-host torture` runs a program hundreds of times.
DEADLINE = 6000 if EMULATED else 600
# Whether the memory of a process is the program's: a sanitizer and an emulator have much of their own.
MEASURES_MEMORY = not SANITIZED_BY and not EMULATED
# A sanitizer must not handle crashes: a host must see their signals.
CRASHES = "handle_segv=0:handle_abort=0:handle_sigbus=0:handle_sigill=0:handle_sigfpe=0"
SANITIZERS = {
    "ASAN_OPTIONS": CRASHES,
    "TSAN_OPTIONS": f"{CRASHES}:report_signal_unsafe=0",
    "UBSAN_OPTIONS": "print_stacktrace=1",
    "LSAN_OPTIONS": f"print_suppressions=0:suppressions={TREE / 'tests' / 'lsan.supp'}",
}
# Every program that a test starts gets them, with or without an environment of its own.
for name, value in SANITIZERS.items():
    os.environ[name] = ":".join(filter(None, [os.environ.get(name), value]))


def libraries_of(program):
    """The files of the libraries that the loader loads with a program, by name."""
    listed = subprocess.run([program], env={**os.environ, "LD_TRACE_LOADED_OBJECTS": "1"}, check=True,
                            stdout=subprocess.PIPE, text=True).stdout
    return {Path(file).name: Path(file) for file in re.findall(r"=> (\S+) \(", listed)}


def until(condition, what):
    """Waits until the condition is true, and returns what it returned. It must come true."""
    deadline = time.monotonic() + DEADLINE
    while not (found := condition()):
        assert time.monotonic() < deadline, what
        time.sleep(0.01)
    return found


STAMP = re.compile(r'^(assayStart|assayEnd)="\d{4}-\d\d-\d\d_\d\d:\d\d:\d\d"$', re.MULTILINE)


def text_of(data):
    """Decodes bytes to text that keeps every byte."""
    return data.decode("utf-8", "surrogateescape")


@dataclass
class Run:
    """How a run ended and what it printed."""

    status: int  # negative: ended by that signal
    out: bytes
    err: bytes

    @property
    def report(self):
        """The report as text, with well-formed time stamps replaced by a fixed text."""
        return STAMP.sub(r'\1="STAMP"', text_of(self.out))

    @property
    def lines(self):
        return split_lines(self.report)

    @property
    def errors(self):
        return split_lines(text_of(self.err))

    @property
    def comments(self):
        """The comment lines of the report."""
        return [line for line in self.lines if line.startswith("#")]

    @property
    def facts(self):
        """The report without its comments, as a dictionary of keys and values with their quotes."""
        return dict(line.split("=", 1) for line in self.lines if not line.startswith("#"))


def split_lines(text):
    """The lines of a text. Every line must have its line end."""
    assert text == "" or text.endswith("\n"), f"no line end at the end of {text[-200:]!r}"
    return text.split("\n")[:-1]


@dataclass
class Call:
    """A line of a driver's record."""

    number: int
    device: int  # -1 for none
    name: str
    arguments: str


def read_call(line):
    number, device, name, *arguments = line.split(" ", 3)
    return Call(int(number), -1 if device == "-" else int(device), name,
                arguments[0] if arguments else "")


def read_record(path):
    return [read_call(line) for line in Path(path).read_text(encoding="ascii").splitlines()]


def record_so_far(path):
    """The whole lines of the record of a run that has not ended, and may not have started."""
    try:
        text = Path(path).read_text(encoding="ascii")
    except FileNotFoundError:
        return []
    return [read_call(line) for line in text.splitlines(True) if line.endswith("\n")]


@dataclass
class Host:
    """Runs the program. Describes the machine that it finds, and the folder for its files."""

    folder: Path
    variables: dict = field(default_factory=dict)

    def record(self):
        return read_record(self.folder / "record")

    def has_called(self, name):
        """Whether the run, which need not have started, has made this call. For a fresh record."""
        return any(call.name == name for call in record_so_far(self.folder / "record"))

    def fresh_record(self):
        """Deletes the record, and returns a script line that makes the driver write a new one."""
        (self.folder / "record").unlink(missing_ok=True)
        return f"record {self.folder / 'record'}\n"

    def broken_libraries(self, name, *files):
        """A folder with libraries of these names that can't be loaded."""
        folder = self.folder / name
        folder.mkdir(exist_ok=True)
        for file in files:
            (folder / file).touch()
        return folder

    def environment(self, script=None, egl="scripted", opencl="absent", root=None):
        """The environment of the program.

        script: the text of an EGL script, or the path of a file that holds one.
        egl: "scripted", "absent", or "real" for the machine's own.
        opencl: "absent" (no loader), "empty" (a loader without platforms), or "real".
        root: the folder that replaces the root of the file system.
        """
        result = {"PATH": os.environ.get("PATH", "/usr/bin:/bin")}
        if egl == "real" or opencl == "real":
            result = dict(os.environ)
        result.update((name, os.environ[name]) for name in SANITIZERS)
        if egl == "real" or opencl == "real":
            # The machine's drivers keep memory to the end that the program can't free.
            result["ASAN_OPTIONS"] += ":detect_leaks=0"
        search = []
        if egl == "scripted":
            assert (SCRIPTED_EGL / "libEGL.so.1").exists()
            search.append(SCRIPTED_EGL)
        elif egl == "absent":
            search.append(self.broken_libraries("no-egl", "libEGL.so.1", "libEGL.so"))
        if opencl == "absent":
            search.append(
                self.broken_libraries("no-opencl", "libOpenCL.so.1", "libOpenCL.so"))
        elif opencl == "empty":
            result["OCL_ICD_VENDORS"] = str(self.folder / "no-vendors")
        if search:
            result["LD_LIBRARY_PATH"] = ":".join(str(folder) for folder in search)
        if isinstance(script, str):
            file = self.folder / "script"
            file.write_bytes(script.encode("utf-8", "surrogateescape"))
            script = file
        if script is not None:
            result["ASSAY_SCRIPTED_EGL"] = str(script)
        if root is not None:
            result["ASSAY_TEST_ROOT"] = str(root)
        result.update(self.variables)
        return result

    def run(self, *arguments, seconds=DEADLINE, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
            stderr=subprocess.PIPE, before=None, clear=False, **machine):
        """Runs the program to its end. `before` is called in the child; `clear` removes all variables
        except those that describe the machine."""
        program = PROGRAM if machine.get("root") is None else PROGRAM_AT_ROOT
        environment = self.environment(**machine)
        if clear:
            environment.pop("PATH")
        done = subprocess.run([program, *arguments], stdin=stdin, stdout=stdout, stderr=stderr,
                              env=environment, timeout=seconds, preexec_fn=before, check=False)
        return Run(done.returncode, done.stdout or b"", done.stderr or b"")

    def start(self, *arguments, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
              stderr=subprocess.PIPE, before=None, **machine):
        """Starts the program and returns its process. `before` is called in the child."""
        program = PROGRAM if machine.get("root") is None else PROGRAM_AT_ROOT
        return subprocess.Popen([program, *arguments], stdin=stdin, stdout=stdout, stderr=stderr,
                                env=self.environment(**machine), preexec_fn=before)


def ended_by(run, *signals):
    """Whether one of these signals ended the run."""
    return run.status in [-int(signal.Signals[each]) for each in signals]
