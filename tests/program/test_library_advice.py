"""The advice of libassay-host with scripted drivers: hosts that share a folder with `assay-host advise`,
and one that is killed during an attempt."""

import json
import os
import signal
import subprocess
import sys
import uuid
from pathlib import Path

import pytest

from harness import BUILD, PROGRAM, SANITIZED_BY, until
from hosting import host_run, processes_with, script_child
from validate import validate_advice

LIBRARIES = sorted(BUILD.glob("lib*/**/libassay-host.so.0"))
HOST = Path(__file__).with_name("advice_host.py")

pytestmark = pytest.mark.skipif(bool(SANITIZED_BY),
                                reason="Python can't load a library with a sanitizer")

DRIVER = """device
string GL_VENDOR "A vendor"
string GL_RENDERER "A renderer"
version "2.1 Scripted"
extensions "GL_ARB_vertex_program GL_ARB_fragment_program GL_EXT_framebuffer_object"
"""


class Starts:
    """The starts of hosts, by the library and by the command, on a machine with a scripted driver."""

    def __init__(self, host, folder):
        self.folder = folder
        self.state = folder / "state"
        self.runs = folder / "runs"
        self.child = script_child(folder, f'echo >> "{self.runs}"\nexec "{PROGRAM}" "$@"')
        self.set_driver("")
        self.environment = host.environment(folder / "driver")

    def set_driver(self, rules):
        """Replaces what the driver does. Its files stay as they are."""
        (self.folder / "driver").write_text(DRIVER + rules)

    @property
    def children(self):
        return len(self.runs.read_text().splitlines()) if self.runs.exists() else 0

    def start(self, **variables):
        """A host with the library."""
        return subprocess.Popen([sys.executable, HOST, LIBRARIES[0], self.state, self.child],
                                env={**self.environment, **variables}, stdout=subprocess.PIPE)

    def finish(self, process):
        out, _ = process.communicate()
        assert process.returncode == 0
        return validate_advice(out)

    def by_library(self):
        return self.finish(self.start())

    def command(self, *options):
        return ["advise", "--state", str(self.state), "--assay", str(self.child), "--format", "json",
                *options]

    def by_command(self, *options):
        run = host_run(*self.command(*options), environment=self.environment)
        document = validate_advice(run.out)
        assert document["status"] == run.status
        return document

    def has_open_attempt(self):
        files = list(self.state.glob("*.json"))
        return bool(files) and json.loads(
            files[0].read_text())["content"]["attempts"][-1]["end"] == "open"


@pytest.fixture
def starts(host, tmp_path):
    return Starts(host, tmp_path)


def without_times(document):
    result = dict(document)
    del result["time"]
    for name in ("opengl", "opencl"):
        result[name] = {key: value for key, value in document[name].items() if key != "age"}
    return result


def answers(document):
    return [document["opengl"]["answer"], document["opencl"]["answer"]]


@pytest.mark.parametrize("rules, expected", [("", ["hardware", "absent"]),
                                             ("at glClear crash\n", ["broken", "unknown"]),
                                             ("at eglInitialize exit 0\n", ["broken", "unknown"])])
def test_the_command_knows_what_the_library_learnt(starts, rules, expected):
    starts.set_driver(rules)
    first = starts.by_library()
    assert answers(first) == expected
    assert (first["tried"], first["due"]) == (True, "first")
    command = starts.by_command()
    assert answers(command) == expected
    assert not command["tried"]
    assert without_times(starts.by_library()) == without_times(command)
    assert starts.children == 1


def test_the_library_knows_what_the_command_learnt(starts):
    starts.set_driver("at glClear crash\n")
    first = starts.by_command()
    assert first["opengl"]["answer"] == "broken"
    document = starts.by_library()
    assert document["opengl"]["answer"] == "broken"
    assert document["opengl"]["endReason"] == first["opengl"]["endReason"]
    assert (document["tried"], starts.children) == (False, 1)


def test_hosts_and_commands_at_once_start_one_child(starts):
    hosts = [starts.start() for _ in range(8)]
    commands = [subprocess.Popen([BUILD / "bin" / "assay-host", *starts.command("--wait", "1e9")],
                                 env=starts.environment, stdout=subprocess.PIPE) for _ in range(8)]
    documents = [starts.finish(process) for process in hosts + commands]
    assert {document["opengl"]["answer"] for document in documents} == {"hardware"}
    assert sum(document["tried"] for document in documents) == 1
    assert starts.children == 1


def test_a_host_that_is_killed_during_an_attempt(starts):
    starts.set_driver("at eglInitialize hang\n")
    mark = str(uuid.uuid4())
    with starts.start(ASSAY_TEST_MARK=mark) as process:
        until(lambda: starts.has_open_attempt() and starts.children == 1, "no attempt")
        os.kill(process.pid, signal.SIGKILL)
        process.wait()
        until(lambda: not processes_with(f"ASSAY_TEST_MARK={mark}".encode()), "a process is left")
    plan = starts.by_command("--dry-run")
    assert (plan["plan"], plan["due"]) == ("try", "unclear")
    assert plan["opengl"]["reason"] == "host-ended"
    starts.set_driver("")
    document = starts.by_library()
    assert (document["opengl"]["answer"], document["tried"]) == ("hardware", True)
    assert document["opengl"]["warning"] is None
