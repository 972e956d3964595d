"""The command line under Wine: the same as on Linux."""

import pytest

from conftest import NO_OPENCL_PLATFORM, gpu_of, run_under_wine
from model import check, predict
from test_command_line import MALFORMED, STATUSES, TEXTS, THRESHOLDS, USAGE

# Other characters depend on the code page of the process.


def is_ascii(argument):
    return argument.isascii()


@pytest.mark.parametrize("argument", filter(is_ascii, MALFORMED), ids=repr)
def test_malformed(argument):
    run = run_under_wine(argument)
    assert (run.status, run.errors, run.out) == (3, USAGE, b"")


@pytest.mark.parametrize("value, line", [row for row in TEXTS if is_ascii(row[0])])
def test_text_options(value, line):
    run = run_under_wine(f"-stdout={value}", f"-comment={value}", f"-stderr={value}", "-help")
    assert run.lines == [line, f"# {line}"]
    assert run.errors == [line, *USAGE]


def test_text_options_print_in_order():
    run = run_under_wine("-stdout=a=b", "-comment=c", "-stderr=d", "-bogus")
    assert run.lines == ["a=b", "# c"]
    assert run.errors == ["d", *USAGE]


def is_zero(value):
    try:
        return int(value, 0) == 0
    except ValueError:
        return True


@pytest.mark.parametrize("value, status", STATUSES)
def test_exit_status(value, status):
    """A Linux parent of Wine sees the low 8 bits of the status, and 1 instead of 0 for a nonzero one."""
    if status == 0 and not is_zero(value):
        status = 1
    assert run_under_wine(f"-exit={value}", **NO_OPENCL_PLATFORM).status == status


def test_failure_replaces_the_requested_status():
    assert run_under_wine("-exit=7", "-throwAfter=10", **NO_OPENCL_PLATFORM).status == 2


@pytest.mark.parametrize("value, threshold", THRESHOLDS)
def test_thresholds(whole_run, value, threshold):
    gpu = gpu_of(whole_run)
    check(run_under_wine(f"-crashAfter={value}", **NO_OPENCL_PLATFORM),
          predict([gpu], opencl=0, crash_after=threshold))
    check(run_under_wine(f"-throwAfter={value}", **NO_OPENCL_PLATFORM),
          predict([gpu], opencl=0, throw_after=threshold))
