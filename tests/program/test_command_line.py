"""The command line: options take effect from left to right, and every error prints the usage."""

import pytest

from model import Gpu, check, predict

USAGE = [
    "Usage exception: usage",
    "usage: ",
    "    -help {show this message}",
    "    -crashAfter=N {GPUAssayTester should crash after N steps}",
    "    -throwAfter=N {GPUAssayTester should throw after N steps}",
    "    -app=SomeApp {specify name of host app}",
    "    -stdout=line_of_stdout {puts the line to stdout as-is}",
    "    -stderr=line_of_stderr {puts the line to stderr as-is}",
    "    -exit=N {app should exit with N}",
    "    -verbose=N {verbosity level}",
    "    -timeout=N {Mac only, SIGALRM kills assay after N seconds, if not finished}",
    "    -comment=line_of_comment {outputs '# line_of_comment'}",
    "    -hang=N {before exit, sleep for N milliseconds}",
]

MALFORMED = [
    "", "-", "--", "=", "-=", "-=x", "foo", "help", "--help", "-Help", "-help=1", "-h", "-?",
    "-crashAfter", "-throwAfter", "-app", "-stdout", "-stderr", "-exit", "-verbose", "-timeout",
    "-comment", "-hang", "-crashafter=1", "-CRASHAFTER=1", "--crashAfter=1", "-crashAfter =1",
    " -crashAfter=1", "-stdout =x", "/exit=1", "-foo", "-foo=bar", "-foo=", "crashAfter=1",
    "-\"stdout\"=x", "-stdout\n=x", "-\xff=1", "-exit:1", "–exit=1",
]

# The value of a text option, and the text that it prints.
TEXTS = [
    ("x", "x"),
    ("", ""),
    ('"a b"', "a b"),
    ('"', '"'),
    ('""', ""),
    ('"""', '"'),
    ('""""', '""'),
    ('""x""', '"x"'),
    ('"x', '"x'),
    ('x"', 'x"'),
    ("'x'", "'x'"),
    ("a=b", "a=b"),
    ("=", "="),
    ('"a"=b"', 'a"=b'),
    (r"a\nb\"", r"a\nb\""),
    (" x ", " x "),
    ("%s%n%d", "%s%n%d"),
    ("\u00e9\u4e2d", "\u00e9\u4e2d"),
    ("\udcff\udc80", "\udcff\udc80"),
]

# The value of "-exit=", and the exit status.
STATUSES = [
    ("0", 0),
    ("7", 7),
    ("255", 255),
    ("256", 0),
    ("-1", 255),
    ("0x10", 16),
    ("010", 8),
    ("08", 0),
    ("+5", 5),
    (" 5", 5),
    ("\t\n5", 5),
    ("5abc", 5),
    ("abc", 0),
    ("", 0),
    ('"9"', 9),
    ('""', 0),
    ("0x", 0),
    ("1e3", 1),
    # Clamped to 2147483647 or to -2147483648 before the system keeps the low byte.
    ("2147483647", 255),
    ("2147483648", 255),
    ("4294967295", 255),
    ("4294967296", 255),
    ("4294967299", 255),
    ("9223372036854775808", 255),
    ("99999999999999999999999", 255),
    ("-2147483648", 0),
    ("-2147483649", 0),
    ("-4294967293", 0),
    ("-99999999999999999999999", 0),
]

# The value of "-crashAfter=" and "-throwAfter=", and the step.
THRESHOLDS = [
    ("0", 0), ("abc", 0), ("", 0), ("5", 5), ("0x0c", 12), ("014", 12), ("-1", -1),
    ("4294967295", 2**31 - 1), ("-5", -5), ("2 and more", 2),
]


@pytest.fixture
def one(host):
    """A machine with one GPU, the same for all runs of a test."""
    host.gpu = Gpu()
    host.found = {"script": host.gpu.script()}
    return host


@pytest.mark.parametrize("argument", MALFORMED, ids=repr)
def test_malformed(one, argument):
    run = one.run(argument, **one.found)
    assert run.status == 3
    assert run.errors == USAGE
    assert run.out == b""


def test_arguments_that_are_not_utf_8(one):
    run = one.run(b"\xff\xfe", b"-\x80\x81=1", **one.found)
    assert (run.status, run.errors, run.out) == (3, USAGE, b"")


def test_very_long_arguments(one):
    long = "x" * 100_000
    run = one.run(f"-{long}=1", long, **one.found)
    assert (run.status, run.errors, run.out) == (3, USAGE, b"")
    run = one.run(f"-stdout={long}", "-exit=5", **one.found)
    assert run.status == 5
    assert run.lines[0] == long


def test_many_arguments(one):
    run = one.run(*[f"-stdout={index}" for index in range(5000)], **one.found)
    assert run.lines[:5000] == [str(index) for index in range(5000)]
    assert run.lines[5000:] == predict([one.gpu]).lines
    assert run.status == 0


def test_effects_of_valid_options_come_before_the_usage_text(one):
    """The options to the left and to the right of the bad one take effect, in order."""
    run = one.run("-stdout=left", "-stderr=first", "-bogus", "-comment=right", "-stderr=second",
                  "-stdout=last", "-exit=7", "-crashAfter=0", **one.found)
    assert run.lines == ["left", "# right", "last"]
    assert run.errors == ["first", "second", *USAGE]
    assert run.status == 3


def test_help_ends_the_parsing(one):
    run = one.run("-stdout=seen", "-help", "-stdout=unseen", "-bogus", "-stderr=unseen",
                  **one.found)
    assert run.lines == ["seen"]
    assert run.errors == USAGE
    assert run.status == 3


def test_bad_option_before_help(one):
    run = one.run("-bogus", "-help", **one.found)
    assert (run.status, run.errors, run.out) == (3, USAGE, b"")


def test_no_driver_call_for_a_bad_command_line(one):
    run = one.run("-bogus", script=one.fresh_record() + one.gpu.script())
    assert run.status == 3
    assert not (one.folder / "record").exists() or one.record() == []


@pytest.mark.parametrize("value, line", TEXTS)
def test_text_options(one, value, line):
    run = one.run(f"-stdout={value}", f"-comment={value}", f"-stderr={value}", "-help",
                  **one.found)
    assert run.lines == [line, f"# {line}"]
    assert run.errors == [line, *USAGE]


def test_line_ends_inside_a_text(one):
    run = one.run("-stdout=a\nb", "-comment=c\nd", "-help", **one.found)
    assert run.out == b"a\nb\n# c\nd\n"


def test_texts_come_before_the_report_and_in_order(one):
    run = one.run("-stdout=1", "-comment=2", "-stdout=3", "-stderr=4", "-stderr=5", **one.found)
    assert run.lines == ["1", "# 2", "3", *predict([one.gpu]).lines]
    assert run.errors == ["4", "5"]
    assert run.status == 0


@pytest.mark.parametrize("value, status", STATUSES)
def test_exit_status(one, value, status):
    check(one.run(f"-exit={value}", **one.found), predict([one.gpu], exit_status=status))


@pytest.mark.parametrize("value, threshold", THRESHOLDS)
def test_thresholds(one, value, threshold):
    check(one.run(f"-crashAfter={value}", **one.found),
          predict([one.gpu], crash_after=threshold))
    check(one.run(f"-throwAfter={value}", **one.found),
          predict([one.gpu], throw_after=threshold))


def test_later_values_replace_earlier_ones(one):
    check(one.run("-exit=3", "-crashAfter=0", "-exit=4", "-crashAfter=-1", **one.found),
          predict([one.gpu], exit_status=4))


@pytest.mark.parametrize("options", [["-timeout=3"], ["-hang=2000000000"], ["-timeout=0"],
                                     ["-timeout=-1", "-hang=-1"], ["-app=Foo"], ["-app="]])
def test_options_without_a_visible_effect(one, options):
    check(one.run(*options, **one.found), predict([one.gpu]))


def test_status_3_replaces_the_requested_status(one):
    assert one.run("-exit=7", "-bogus", **one.found).status == 3


def test_status_2_replaces_the_requested_status(one):
    assert one.run("-exit=7", "-throwAfter=10", **one.found).status == 2
