"""Fixtures of the program tests."""

import signal

import pytest

# Must precede the first import, or failed assertions don't show the values.
pytest.register_assert_rewrite("calls", "clmodel", "harness", "hosting", "model", "starts", "sweep")

import emulation  # noqa: E402
import harness  # noqa: E402


def pytest_configure():
    """Undoes what nohup and the background of a shell ignore: programs inherit it."""
    signal.pthread_sigmask(signal.SIG_SETMASK, [])
    for number in (signal.SIGHUP, signal.SIGQUIT, signal.SIGTERM, signal.SIGCHLD):
        signal.signal(number, signal.SIG_DFL)
    signal.signal(signal.SIGINT, signal.default_int_handler)


@pytest.fixture
def host(tmp_path):
    """Runs the program like a host, with its scripts and records under tmp_path."""
    return harness.Host(tmp_path)


def pytest_collection_modifyitems(items):
    """Reports a missing program once, instead of failing each test. Skips what can't be emulated."""
    if not harness.PROGRAM.exists():
        raise pytest.UsageError(
            f"{harness.PROGRAM} doesn't exist: build first, or set ASSAY_BUILD_DIR")
    for item in items if harness.EMULATED else []:
        reason = emulation.reason_of(item.path.stem.removeprefix("test_"), item.name)
        if reason:
            item.add_marker(pytest.mark.skip(reason=reason))


CLOSING_LINES = []


@pytest.fixture(scope="session")
def closing_lines():
    """Lines to print at the end, also if all tests pass."""
    return CLOSING_LINES


def pytest_terminal_summary(terminalreporter):
    for line in CLOSING_LINES:
        terminalreporter.write_line(line)
