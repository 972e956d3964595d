"""The completions of the shells offer exactly the options of the programs' help texts."""

import os
import re
import shutil
import subprocess
from pathlib import Path

import pytest

from harness import PROGRAM, TREE
from hosting import HOST

COMMANDS = ["run", "torture", "diff", "show", "explain", "check", "advise", "state", "bugreport"]
FOLDER = TREE / "completions"
BASH_COMPLETION = Path("/usr/share/bash-completion/bash_completion")

# usage: bash -c BASH bash BASH_COMPLETION FILE FUNCTION WORD...
BASH = """
source "$1"
source "$2"
function="$3"
shift 3
COMP_WORDS=("$@")
COMP_CWORD=$(($# - 1))
COMP_LINE="$*"
COMP_POINT=${#COMP_LINE}
$function
printf '%s\\n' "${COMPREPLY[@]}"
"""


def output_of(*command):
    run = subprocess.run(list(map(str, command)), stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                         stderr=subprocess.STDOUT, check=False, timeout=120)
    return run.stdout.decode()


def host_options(*command):
    return set(re.findall(r"^  (?:-\w,)?(--[\w-]+)", output_of(HOST, *command, "--help"), re.MULTILINE))


def child_options():
    return set(re.findall(r"^    (-\w+=?)", output_of(PROGRAM, "-help"), re.MULTILINE))


def in_bash(*words):
    if not BASH_COMPLETION.exists():
        pytest.skip("bash-completion is not installed")
    function = {"assay": "_assay", "assay-host": "_assay_host"}[words[0]]
    return set(output_of("bash", "-c", BASH, "bash", BASH_COMPLETION, FOLDER / f"{words[0]}.bash",
                         function, *words).split())


def in_fish(line):
    if not shutil.which("fish"):
        pytest.skip("fish is not installed")
    sources = "; ".join(f"source {FOLDER}/{name}.fish" for name in ("assay", "assay-host"))
    lines = output_of("fish", "--no-config", "-c", f"{sources}; complete -C '{line}'").splitlines()
    return {each.split("\t")[0] for each in lines}


@pytest.mark.parametrize("command", COMMANDS)
def test_bash_knows_the_options_of_a_command(command):
    found = in_bash("assay-host", command, "--") - {"--"}
    assert found == host_options(command)


@pytest.mark.parametrize("command", COMMANDS)
def test_fish_knows_the_options_of_a_command(command):
    assert in_fish(f"assay-host {command} --") == host_options(command)


@pytest.mark.parametrize("command", COMMANDS)
def test_zsh_knows_the_options_of_a_command(command):
    text = (FOLDER / "_assay-host").read_text()
    child = re.search(r"local child=\((.*?)\n    \)", text, re.DOTALL).group(1)
    own = re.search(rf"^    {command}\)(.*?);;", text, re.DOTALL | re.MULTILINE).group(1)
    if "$child" in own:
        own += child
    assert set(re.findall(r"(--[\w-]+)", own)) == host_options(command)


def test_commands():
    wanted = {*COMMANDS, *host_options()}
    assert in_bash("assay-host", "") == wanted
    assert in_fish("assay-host ") | in_fish("assay-host --") == wanted
    assert in_bash("assay-host", "d") == {"diff"}


def test_values_of_options():
    for option, values in {"--format": "text json jsonl html prometheus nfd ansible",
                           "--schema": "1 2",
                           "--need": "opengl opencl both"}.items():
        assert in_bash("assay-host", "run", option, "") == set(values.split())
        assert in_fish(f"assay-host run {option} ") == set(values.split())
    assert in_bash("assay-host", "torture", "--kind", "") == {"crash", "throw", "both"}
    assert in_fish("assay-host torture --kind ") == {"crash", "throw", "both"}
    assert in_bash("assay-host", "advise", "--format", "") == {"text", "env", "json"}
    assert in_fish("assay-host advise --format ") == {"text", "env", "json"}
    assert in_bash("assay-host", "diff", "--format", "") == {"text", "json", "html"}
    assert in_fish("assay-host diff --format ") == {"text", "json", "html"}
    forms = {"text", "json", "html", "prometheus", "nfd", "ansible"}
    assert in_bash("assay-host", "show", "--format", "") == forms
    assert in_fish("assay-host show --format ") == forms
    actions = {"list", "show", "forget", "set"}
    assert in_bash("assay-host", "state", "") == actions
    assert in_fish("assay-host state ") == actions


def test_keys_to_explain(monkeypatch):
    """The program that is completed names them."""
    monkeypatch.setenv("PATH", f"{HOST.parent}:{os.environ['PATH']}")
    assert in_bash("assay-host", "explain", "GLMem") == {"GLMemoryMB"}
    assert in_fish("assay-host explain GLMem") == {"GLMemoryMB"}
    monkeypatch.setenv("PATH", os.environ["PATH"].partition(":")[2])
    assert in_fish("assay-host explain GLMem") == set()


def test_options_of_the_child():
    assert in_bash("assay", "-") == child_options()
    assert in_bash("assay-host", "run", "--raw", "--", "-") == child_options()
    assert in_fish("assay -") == child_options()
    text = (FOLDER / "_assay-host").read_text()
    options = re.search(r"local options=\((.*?)\n    \)", text, re.DOTALL).group(1)
    assert set(re.findall(r"'(-\w+=?)", options)) == child_options()


def test_options_without_effect():
    zsh, fish = ((FOLDER / name).read_text() for name in ("_assay-host", "assay.fish"))
    for option in ("timeout", "hang"):
        assert f"'-{option}=-[accepted and ignored]:" in zsh
        assert f'-a -{option}= -d "Accepted and ignored"\n' in fish


def test_zsh_accepts_the_file():
    if not shutil.which("zsh"):
        pytest.skip("zsh is not installed")
    assert output_of("zsh", "-n", FOLDER / "_assay-host") == ""
