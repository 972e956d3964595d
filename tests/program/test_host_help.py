"""What `assay-host` says of its commands and options, to the letter."""

import pytest

from hosting import host_run

HELP = {
    None: """\
Runs assay as a child, survives whatever a driver does, says what came of it.
usage: assay-host run|torture|diff [option...]

Options:
  -h,--help               show this text
  --version               show the version

Subcommands:
  run                     run assay, survive it, and show what it found
  torture                 make assay fail at every step, and check each outcome
  diff                    tell what changed between two reports

"assay-host COMMAND --help" tells more of each.
""",
    "run": """\
run assay, survive it, and show what it found
usage: assay-host run [option...] [-- child option...]

Options:
  -h,--help               show this text
  --assay PATH            the program [beside assay-host, or on the PATH]
  --timeout SECONDS       kill it then, 0: never [60]
  --format FORMAT         text, json or jsonl [text]
  --raw                   the child's own lines first, as they come; with text
  --output FILE           write there [standard output]

exit status: 0 complete, 1 failed tests, 2 usage error of the child,
  3 crashed, 4 hung and killed, 5 never started, 6 interrupted,
  10 trouble with the command line or the output
""",
    "torture": """\
make assay fail at every step, and check each outcome
usage: assay-host torture [option...] [-- child option...]

Options:
  -h,--help               show this text
  --assay PATH            the program [beside assay-host, or on the PATH]
  --timeout SECONDS       kill it then, 0: never [60]
  --kind KIND             crash, throw or both [both]

exit status: 0 all as predicted, 1 not, 5 never started, 6 interrupted,
  10 trouble with the command line or the output
""",
    "diff": """\
tell what changed between two reports
usage: assay-host diff [option...] A B

Positionals:
  A                       a report: json, jsonl, or as assay prints it
  B                       the other one

Options:
  -h,--help               show this text
  --tolerance PART        for measured numbers, as a part [0.1]

exit status: 0 same, 1 different, 2 trouble
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
