"""Fixtures of the program tests."""

import pytest

# Before their first import, or their assertions don't tell what differs.
pytest.register_assert_rewrite("calls", "clmodel", "harness", "hosting", "model", "sweep")

import harness  # noqa: E402


@pytest.fixture
def host(tmp_path):
    """Runs the program as a host does, with its scripts and records under tmp_path."""
    return harness.Host(tmp_path)


def pytest_collection_modifyitems(items):
    """Without the program nothing here can pass: say so once, instead of failing each test."""
    if not harness.PROGRAM.exists():
        raise pytest.UsageError(f"{harness.PROGRAM} isn't there: build first, or set ASSAY_BUILD_DIR")


CLOSING_LINES = []


@pytest.fixture(scope="session")
def closing_lines():
    """What a test has to say at the end, also if it passes."""
    return CLOSING_LINES


def pytest_terminal_summary(terminalreporter):
    for line in CLOSING_LINES:
        terminalreporter.write_line(line)
