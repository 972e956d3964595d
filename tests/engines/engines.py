"""Starts other projects' servers for a test. They listen on the loopback address and end with the test."""

import re
import shutil
import subprocess

import pytest

from harness import DEADLINE, TREE, until

INTEGRATIONS = TREE / "integrations"


def needed(*programs):
    """The paths of these programs; skips the test if one isn't installed."""
    found = [shutil.which(program, path="/usr/sbin:/usr/bin:/sbin:/bin") for program in programs]
    for program, path in zip(programs, found):
        if path is None:
            pytest.skip(f"{program} is not installed")
    return found if len(found) > 1 else found[0]


class Server:
    """A running server, which has its log in a file. As a context manager, ends with the block."""

    def __init__(self, log, *command, **options):
        self.log = log
        self.command = command
        self.options = options

    def __enter__(self):
        with self.log.open("wb") as log:
            self.process = subprocess.Popen(list(map(str, self.command)), stdin=subprocess.DEVNULL,
                                            stdout=log, stderr=log, **self.options)
        return self

    def __exit__(self, *_):
        self.process.terminate()
        try:
            self.process.wait(60)
        except subprocess.TimeoutExpired:
            self.process.kill()
            self.process.wait()

    def text(self):
        return self.log.read_text(encoding="utf-8", errors="replace")

    def wait_for(self, pattern):
        """Waits until the log has the pattern, and returns the match."""
        def find():
            found = re.search(pattern, self.text())
            assert found or self.process.poll() is None, self.text()
            return found
        return until(find, f"{self.command[0]} doesn't log {pattern}")


def outcome_of(*command, **options):
    """The exit status of a program and its output with its errors."""
    run = subprocess.run(list(map(str, command)), stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                         stderr=subprocess.STDOUT, check=False, timeout=DEADLINE, **options)
    return run.returncode, run.stdout.decode("utf-8", "replace")
