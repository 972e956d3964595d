"""The help texts of `assay-host`, compared as a whole."""

import pytest

from hosting import host_run

HELP = {
    None: """\
Runs assay as a child process, survives its failures, and shows its report.
usage: assay-host run|torture|diff [option...]

Options:
  -h,--help               show this text
  --version               show the version

Subcommands:
  run                     run assay and show its report
  torture                 make assay fail at every step and check each outcome
  diff                    show the differences between two reports

"assay-host COMMAND --help" describes a command.
""",
    "run": """\
run assay and show its report
usage: assay-host run [option...] [-- child option...]

Options:
  -h,--help               show this text
  --assay PATH            program to run [beside assay-host, or on the PATH]
  --timeout SECONDS       kill the child after this time, 0: never [60]
  --format FORMAT         text, json or jsonl [text]
  --schema NUMBER         of json and jsonl, 1 or 2 [2]
  --need WHAT             opengl, opencl or both: exit by whether they work
  --identify              name this machine in json and jsonl
  --raw                   print the child's own lines first; only with text
  --output FILE           write to this file [standard output]

exit status: 0 complete, 1 failed tests, 2 usage error of the child,
  3 crashed, 4 hung and killed, 5 never started, 6 interrupted,
  10 error in the command line or the output;
  with --need: 0 hardware, 20 software, 21 broken, 22 absent, 23 unknown
""",
    "torture": """\
make assay fail at every step and check each outcome
usage: assay-host torture [option...] [-- child option...]

Options:
  -h,--help               show this text
  --assay PATH            program to run [beside assay-host, or on the PATH]
  --timeout SECONDS       kill the child after this time, 0: never [60]
  --kind KIND             crash, throw or both [both]

exit status: 0 as predicted, 1 different, 5 never started, 6 interrupted,
  10 error in the command line or the output
""",
    "diff": """\
show the differences between two reports
usage: assay-host diff [option...] A B

Positionals:
  A                       a report: json, jsonl, or as assay prints it
  B                       the other report

Options:
  -h,--help               show this text
  --tolerance FRACTION    of measurements, relative to the larger one [0.1]

exit status: 0 same, 1 different, 2 error
""",
}


@pytest.mark.parametrize("option", ["--help", "-h"])
@pytest.mark.parametrize("command", HELP, ids=str)
def test_help(command, option):
    run = host_run(*filter(None, [command]), option)
    assert (run.status, run.text, run.err) == (0, HELP[command], b"")


def test_help_wins_over_what_is_missing():
    run = host_run("diff", "--help", "only-one")
    assert (run.status, run.text, run.err) == (0, HELP["diff"], b"")
