"""Picks and orders the program tests as MUTATION_JOB says, and reports each as it starts and ends."""
import json
import os
import signal
import time
from pathlib import Path

import pytest

from mutants.board import Board

JOB = json.loads(Path(os.environ["MUTATION_JOB"]).read_text())
PASSED = {}


class TooSlow(Exception):
    """Ends a test that takes longer than the slowest that is used."""


def give_up(*_):
    raise TooSlow(f"longer than {JOB['slowest']} s")


def say(**words):
    with open(JOB["progress"], "a") as file:
        file.write(json.dumps(words) + "\n")


def pytest_collection_modifyitems(items):
    if JOB["cases"] is None:
        return
    order = {name: index for index, name in enumerate(JOB["cases"])}
    items[:] = sorted((item for item in items if item.nodeid in order), key=lambda item: order[item.nodeid])


@pytest.hookimpl(hookwrapper=True)
def pytest_runtest_call():
    if JOB["slowest"] is None:
        yield
        return
    signal.signal(signal.SIGALRM, give_up)
    signal.setitimer(signal.ITIMER_REAL, JOB["slowest"])
    yield
    signal.setitimer(signal.ITIMER_REAL, 0)


@pytest.hookimpl(hookwrapper=True)
def pytest_runtest_protocol(item):
    board = Board(Path(JOB["board"])) if JOB["survey"] else None
    if board:
        board.clear()
    say(starts=item.nodeid)
    start = time.monotonic()
    yield
    say(ends=item.nodeid, passed=PASSED.get(item.nodeid, False), seconds=time.monotonic() - start,
        reached=board.reached() if board else [])


def pytest_runtest_logreport(report):
    PASSED[report.nodeid] = PASSED.get(report.nodeid, True) and not report.failed
