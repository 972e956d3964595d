"""Fixtures of the tests with other projects' servers and tools."""

import sys
from pathlib import Path

import pytest

sys.path.insert(0, str(Path(__file__).resolve().parents[1] / "program"))
pytest.register_assert_rewrite("engines", "harness", "hosting", "model", "clmodel")

import harness  # noqa: E402


@pytest.fixture
def host(tmp_path):
    """Runs the programs on a machine with scripted drivers, whose files are under tmp_path."""
    return harness.Host(tmp_path)
