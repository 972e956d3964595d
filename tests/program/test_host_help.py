"""The help texts of `assay-host`, compared as a whole."""

import pytest

from hosting import host_run

HELP = {
    None: """\
Runs assay as a child process, survives its failures, and shows its report.
usage: assay-host COMMAND [option...]

Options:
  -h,--help               show this text
  --version               show the version

Subcommands:
  run                     run assay and show its report
  torture                 make assay fail at every step and check each outcome
  diff                    show the differences between two reports
  show                    show a stored report in any form
  explain                 explain the keys of a report
  check                   hold this machine, or stored reports, to requirements
  advise                  tell from memory, or by one attempt, what can be used
  state                   show or change what advise remembers
  bugreport               write an archive for a bug report

"assay-host COMMAND --help" describes a command.
""",
    "run": """\
run assay and show its report
usage: assay-host run [option...] [-- child option...]

Options:
  -h,--help               show this text
  --assay PATH            program to run [beside assay-host, or on the PATH]
  --timeout SECONDS       kill the child after this time, 0: never [60]
  --format FORMAT         [text], json, jsonl, html, prometheus, nfd, ansible
  --schema NUMBER         of json and jsonl, 1 or 2 [2]
  --need WHAT             opengl, opencl or both: exit by whether they work
  --identify              name this machine in json, jsonl and html
  --repeat NUMBER         run the child so often
  --for SECONDS           start further runs until this time has passed
  --raw                   print the child's own lines first; only with text
  --output FILE           write to this file [standard output]

exit status: 0 complete, 1 failed tests, 2 usage error of the child,
  3 crashed, 4 hung and killed, 5 never started, 6 interrupted,
  10 error in the command line or the output;
  with --need: 0 hardware, 20 software, 21 broken, 22 absent, 23 unknown;
  with --repeat or --for: that of the worst run
""",
    "bugreport": """\
write an archive for a bug report
usage: assay-host bugreport [option...] [-- child option...]

Options:
  -h,--help               show this text
  --assay PATH            program to run [beside assay-host, or on the PATH]
  --timeout SECONDS       kill the child after this time, 0: never [60]
  --output FILE           a new file [./assay-bugreport-TIME.zip]
  --yes                   write without asking

Lists what the archive has, and asks before it writes it.
exit status: 0 written, also if assay crashed or hung, 1 declined,
  6 interrupted, 10 error in the command line or the output
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
usage: assay-host diff [option...] A B...

Positionals:
  A                       a report: json, jsonl, or as assay prints it
  B                       the other report; of several, each is compared with A

Options:
  -h,--help               show this text
  --format FORMAT         [text], json, html
  --output FILE           write to this file [standard output]
  --tolerance FRACTION    of measurements, relative to the larger one [0.1]
  --identity              compare the machines' names and the times too
  --all                   each key that a run did not reach, and gputag lines

exit status: 0 same, 1 different, 2 error
""",
    "show": """\
show a stored report in any form
usage: assay-host show [option...] REPORT

Positionals:
  REPORT                  a report: json, jsonl, or as assay prints it

Options:
  -h,--help               show this text
  --format FORMAT         [text], json, html, prometheus, nfd, ansible
  --schema NUMBER         of json, 1 or 2 [2]
  --output FILE           write to this file [standard output]

exit status: 0 shown, 10 error
""",
    "explain": """\
explain the keys of a report
usage: assay-host explain [KEY...]

Positionals:
  KEY                     a key of the report, or its label

Options:
  -h,--help               show this text

Without a key: lists all.
exit status: 0 explained, 10 error
""",
    "check": """\
hold this machine, or stored reports, to requirements
usage: assay-host check [option...] [REPORT...] [-- child option...]

Positionals:
  REPORT                  a stored report to check instead of a run, as --from

Options:
  -h,--help               show this text
  --require TEXT          a requirement; may be repeated
  --requirements FILE     a file of them; may be repeated
  --from FILE             check a stored report, not a run; may be repeated
  --state FOLDER          check what advise remembers, without a run
  --max-age DAYS          what is older there isn't known any more [30]
  --baseline FILE         the report of a good machine, to be as
  --tolerance FRACTION    by which a measurement may be below it [0.1]
  --assay PATH            program to run [beside assay-host, or on the PATH]
  --timeout SECONDS       kill the child after this time, 0: never [60]

A requirement is a key, a relation and a value: 'GLVersion>=3.3',
  'all GLFrameBufferOK==1', 'opengl.devices>=2', 'opencl.usable==hardware'
exit status: 0 met, 7 not met, 1 to 6 as run if the run isn't complete,
  10 error in the command line, a file or the output
""",
    "advise": """\
tell from memory, or by one attempt, what can be used
usage: assay-host advise --state FOLDER [option...]

Options:
  -h,--help               show this text
  --state FOLDER          folder of what is remembered
  --assay PATH            program to run [beside assay-host, or on the PATH]
  --timeout SECONDS       kill the child after this time, 0: never [60]
  --format FORMAT         text, env or json [text]
  --need WHAT             opengl, opencl or both [opengl]
  --wait SECONDS          wait for the attempt of another process [10]
  --max-age DAYS          try again what is older than this [30]
  --fresh                 try again at any age
  --pause SECONDS         before the next attempt after a failure [60]
  --pause-growth FACTOR   each further pause is longer by this [60]
  --retries NUMBER        attempts after a first failure [2]
  --forgive DAYS          failures older than this don't count [7]
  --forgive-freeze DAYS   ends of the system older than this don't count [30]
  --keep-absent SECONDS   try again what is absent, after [600]
  --keep-unknown SECONDS  try again what is unknown, after [60]
  --unclear NUMBER        attempts in a row that may show nothing [3]
  --unclear-pause SECONDS before the next attempt after so many [600]
  --dry-run               show what the next call would do, without doing it

exit status: 0 hardware, 20 software, 21 broken, 22 absent, 23 unknown,
  6 interrupted, 10 error in the command line or the output
""",
    "state": """\
show or change what advise remembers
usage: assay-host state list|show|forget|set --state FOLDER [WORD...]

Positionals:
  ACTION                  list, show, forget or set
  WORD                    what to act on

Options:
  -h,--help               show this text
  --state FOLDER          folder of what is remembered

list: the entries, one for each state of the machine
show [ENTRY...]: all that is known
forget [ENTRY...]: without an entry, everything
set opengl=VALUE opencl=VALUE: hardware, software, absent, auto
exit status: 0 done, 10 error
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


@pytest.mark.parametrize("text", HELP.values(), ids=[str(command) for command in HELP])
def test_fits_the_width_of_a_terminal(text):
    assert max(map(len, text.splitlines())) <= 80
