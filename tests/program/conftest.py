"""Fixtures of the program tests."""

import pytest

# Before their first import, or their assertions don't tell what differs.
pytest.register_assert_rewrite("harness", "model", "clmodel")

import harness  # noqa: E402


@pytest.fixture
def host(tmp_path):
    """Runs the program as a host does, with its scripts and records under tmp_path."""
    return harness.Host(tmp_path)


def pytest_collection_modifyitems(items):
    """Without the program nothing here can pass: say so once, instead of failing each test."""
    if not harness.PROGRAM.exists():
        raise pytest.UsageError(f"{harness.PROGRAM} isn't there: build first, or set ASSAY_BUILD_DIR")
