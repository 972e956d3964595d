"""What assay-host says of a command line that it doesn't take. Of the texts that the command line's library
makes, only the parts that name the option and its values are compared."""

import pytest

from harness import EMULATED
from hosting import host_run

NO_NUMBER = '"{}" is not a number of at least 0'

# The words, the exit status, and how the message begins and ends.
ROWS = [
    ("run bogus", 10, "", "bogus"),
    ("run --nope", 10, "", "--nope"),
    ("run --timeout", 10, "--timeout: ", "SECONDS missing"),
    ("run --timeout nan", 10, "--timeout: ", NO_NUMBER.format("nan")),
    ("run --timeout inf", 10, "--timeout: ", NO_NUMBER.format("inf")),
    ("run --timeout -1", 10, "--timeout: ", NO_NUMBER.format("-1")),
    ("run --timeout -0.001", 10, "--timeout: ", NO_NUMBER.format("-0.001")),
    ("run --timeout 1x", 10, "--timeout: ", NO_NUMBER.format("1x")),
    ("run --assay=", 10, "--assay: ", "PATH missing"),
    ("run --output=", 10, "--output: ", "FILE missing"),
    ("run --format xml", 10, "--format: xml ", "{text,json,jsonl,html,prometheus,nfd,ansible}"),
    ("run --raw --format json", 10, "--raw: ", "only with --format text"),
    ("run --raw --format jsonl", 10, "--raw: ", "only with --format text"),
    ("run --raw --format nfd", 10, "--raw: ", "only with --format text"),
    ("run --repeat 0", 10, "--repeat: ", "0 not in range 1 to 100000"),
    ("run --repeat 100001", 10, "--repeat: ", "100001 not in range 1 to 100000"),
    ("run --repeat x", 10, "--repeat: ", ""),
    ("run --for 0", 10, "--for: ", "must be more than 0"),
    ("run --for -1", 10, "--for: ", NO_NUMBER.format("-1")),
    ("run --repeat 2 --format jsonl", 10, "--repeat: ", "not with --format jsonl, which has one run"),
    ("run --for 2 --format jsonl", 10, "--for: ", "not with --format jsonl, which has one run"),
    ("run --repeat 2 --format json --schema 1", 10, "--repeat: ", "not with --schema 1, which has one run"),
    ("run --schema 2 --format prometheus", 10, "--schema: ", "only with --format json or jsonl"),
    ("run --schema 3 --format json", 10, "--schema: 3 ", "{1,2}"),
    ("run --schema 1", 10, "--schema: ", "only with --format json or jsonl"),
    ("run --schema 2 --format text", 10, "--schema: ", "only with --format json or jsonl"),
    ("run --identify", 10, "--identify: ", "only with --format json, jsonl or html"),
    ("run --identify --format ansible", 10, "--identify: ", "only with --format json, jsonl or html"),
    ("run --identify --format json --schema 1", 10, "--identify: ",
     "not with --schema 1, which names no machine"),
    ("run --identify --format jsonl --schema 1", 10, "--identify: ",
     "not with --schema 1, which names no machine"),
    ("run --need x", 10, "--need: x ", "{opengl,opencl,both}"),
    ("torture --kind x", 10, "--kind: x ", "{crash,throw,both}"),
    ("torture -- -crashAfter=3", 10, "-crashAfter=3: ", "torture sets this itself"),
    ("torture -- -exit=1 -throwAfter=1", 10, "-throwAfter=1: ", "torture sets this itself"),
    ("diff", 2, "A ", ""),
    ("diff a", 2, "B ", ""),
    ("diff a b --", 2, "", "--"),
    ("diff --tolerance x a b", 2, "--tolerance: ", NO_NUMBER.format("x")),
    ("check", 10, "--require, --requirements or --baseline ", ""),
    ("check --require NumGLGPUs>=1 --tolerance 1", 10, "--tolerance: ", "only with --baseline"),
    ("check --require=", 10, "--require: ", "TEXT missing"),
    ("check --require NumGLGPUs>=1 --from x --timeout 3", 10, "--timeout: ", "only without --from"),
    ("check --require NumGLGPUs>=1 --from x --assay y", 10, "--assay: ", "only without --from"),
    ("check --require NumGLGPUs>=1 --from x -- -verbose=1", 10, "-verbose=1: ",
     "only without --from"),
    ("check --require NumGLGPUs>=1 --from x --state y", 10, "--state: ", "only without --from"),
    ("check --require NumGLGPUs>=1 x --state y", 10, "--state: ", "only without --from"),
    ("check --require NumGLGPUs>=1 --state y --timeout 3", 10, "--timeout: ", "only without --state"),
    ("check --baseline x --state y", 10, "--baseline: ", "only without --state"),
    ("check --require NumGLGPUs>=1 --state y -- -verbose=1", 10, "-verbose=1: ", "only without --state"),
    ("check --require NumGLGPUs>=1 --max-age 3", 10, "--max-age: ", "only with --state"),
    ("check --require NumGLGPUs>=1 --state=", 10, "--state: ", "FOLDER missing"),
    ("diff --tolerance -1 a b", 2, "--tolerance: ", NO_NUMBER.format("-1")),
]


@pytest.mark.parametrize("words, status, begin, end", ROWS, ids=[row[0] for row in ROWS])
def test_the_message_names_what_is_wrong(words, status, begin, end):
    run = host_run(*words.split())
    assert (run.status, run.out) == (status, b"")
    message, hint, rest = run.err.decode().split("\n")
    assert message.startswith("assay-host: " + begin)
    assert message.endswith(end)
    assert (hint, rest) == ('Run "assay-host --help" for the usage.', "")


@pytest.mark.skipif(EMULATED, reason="the emulator loses the failure of a start")
@pytest.mark.parametrize("words", ["--timeout 0", "--timeout 1e-9", "--timeout 0.5"])
def test_numbers_that_are_taken(words):
    """The child that isn't there is the only failure."""
    run = host_run("run", *words.split(), "--assay", "/no/such/program")
    assert run.status == 5
    assert b"is not a number" not in run.err
