"""The state of `assay-host advise` under Wine: files of another user are ignored."""

import os

import pytest

from conftest import BUILD, NO_OPENCL_PLATFORM, run_under_wine

HOST = BUILD / "bin" / "assay-host.exe"
OTHER_USER = 12345
IGNORED = "is ignored: it belongs to another user."


def call(command, folder, *options):
    path = "Z:" + str(folder).replace("/", "\\")
    return run_under_wine(*command, "--state", path, *options, program=HOST, **NO_OPENCL_PLATFORM)


def advise(folder, *options):
    return call(["advise"], folder, *options)


@pytest.fixture(name="state")
def fixture_state(tmp_path):
    """A folder that remembers one attempt."""
    if os.geteuid() != 0:
        pytest.skip("only root can give a file to another user")
    folder = tmp_path / "state"
    run = advise(folder)
    assert b"Made: one attempt" in run.out
    assert b"Plan: no attempt" in advise(folder).out
    return folder


def test_ignores_a_file_of_another_user(state):
    (entry,) = state.glob("*.json")
    os.chown(entry, OTHER_USER, -1)
    run = advise(state, "--dry-run")
    assert [line for line in run.errors if IGNORED in line]
    assert b"Plan: one attempt" in run.out
    assert b"ignored: it belongs to another user" in call(["state", "list"], state).out


def test_keeps_nothing_in_a_folder_of_another_user(state):
    os.chown(state, OTHER_USER, -1)
    before = {file.name: file.read_bytes() for file in state.iterdir()}
    run = advise(state)
    assert run.errors == ["assay-host: The state can't be kept: it belongs to another user."]
    assert {file.name: file.read_bytes() for file in state.iterdir()} == before
