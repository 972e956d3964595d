"""The starts of a host that calls `assay-host advise`, on a machine with a scripted OpenGL driver."""

import json
import os
import signal
import uuid
from dataclasses import dataclass
from pathlib import Path

from harness import PROGRAM, until
from hosting import HOST_ON_CUE, Watched, host_run, processes_with, script_child
from validate import validate_advice

HARDWARE, SOFTWARE, BROKEN, ABSENT, UNKNOWN = 0, 20, 21, 22, 23
INTERRUPTED, ERROR = 6, 10
DAY = 24 * 3600

GOOD = """device
string GL_VENDOR "A vendor"
string GL_RENDERER "A renderer"
version "2.1 Scripted"
extensions "GL_ARB_vertex_program GL_ARB_fragment_program GL_EXT_framebuffer_object"
"""


def seal(content, number=1):
    """The text of a state file, made independently of the program."""
    body = json.dumps({"content": content}, indent=2, ensure_ascii=False)[len("{\n"):] + "\n"
    checksum = uuid.uuid5(uuid.UUID(int=0), f"{number}\n{body}")
    return f'{{\n  "format": {number},\n  "checksum": "{checksum}",\n{body}'


@dataclass
class Answer:
    """What one call answered."""

    status: int
    document: dict
    err: str

    @property
    def opengl(self):
        return self.document["opengl"]["answer"]

    @property
    def opencl(self):
        return self.document["opencl"]["answer"]

    @property
    def tried(self):
        return self.document["tried"]


class Starts:
    """The starts of a host on a machine with a scripted OpenGL driver. Counts the children."""

    def __init__(self, host, folder):
        self.folder = folder
        self.state = folder / "state"
        self.runs = folder / "runs"
        self.child = script_child(
            folder, f'echo >> "{self.runs}"\nexec "{PROGRAM}" "$@"')
        self.set_driver("")
        # Made once: each making changes the times of files that belong to the identity.
        self.base = host.environment(folder / "driver")
        self.variables = {}

    def set_driver(self, rules):
        """Replaces what the driver does. Its files stay as they are."""
        (self.folder / "driver").write_text(GOOD + rules)

    @property
    def environment(self):
        return {**self.base, **self.variables}

    @property
    def children(self):
        return len(self.runs.read_text().splitlines()) if self.runs.exists() else 0

    def arguments(self, *options):
        return ["advise", "--state", str(self.state), "--assay", str(self.child), "--format", "json",
                *options]

    def answer(self, run):
        return Answer(run.status, validate_advice(run.out), run.err.decode())

    def advise(self, *options, around=(), **more):
        """One call. `around` is a command that runs the program."""
        words = [*around, HOST_ON_CUE, *self.arguments(*options)]
        run = host_run(*words[1:], program=words[0], environment=self.environment, **more)
        answer = self.answer(run)
        if answer.status != INTERRUPTED:
            assert answer.status == answer.document["status"]
        return answer

    def start(self, *options, around=()):
        words = [*around, HOST_ON_CUE, *self.arguments(*options)]
        return Watched(*words[1:], program=words[0], environment=self.environment)

    def act(self, *arguments):
        return host_run("state", *arguments, "--state", str(self.state),
                        environment=self.environment)

    def file(self):
        """The state file of the only identity."""
        files = [path for path in self.state.glob("*.json") if path.name != "choice.json"]
        return files[0] if len(files) == 1 else None

    def content(self):
        file = self.file()
        return json.loads(file.read_text())["content"] if file else None

    def rewrite(self, change):
        """Changes the content of the state file."""
        content = self.content()
        change(content)
        self.file().write_text(seal(content))

    def has_open_attempt(self):
        content = self.content()
        return content is not None and content["attempts"][-1]["end"] == "open"


def processes_below(pid):
    """The process and its descendants."""
    children = []
    for task in Path(f"/proc/{pid}/task").glob("*/children"):
        children += [int(word) for word in task.read_text().split()]
    return [pid, *(each for child in children for each in processes_below(child))]


def kill_all(call, starts):
    """Kills the guardian, the worker and the child at once, as a session's end can do."""
    until(lambda: starts.has_open_attempt() and starts.children == 1 and
          len(processes_below(call.process.pid)) == 3, "no child")
    processes = processes_below(call.process.pid)
    for pid in processes:
        os.kill(pid, signal.SIGSTOP)
    for pid in reversed(processes):
        os.kill(pid, signal.SIGKILL)
    call.wait()
    until(lambda: not processes_with(call.mark), "a process is left")
