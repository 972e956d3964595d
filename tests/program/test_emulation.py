"""The list of tests that are left out under emulation has only tests that exist, each once."""

import re
from pathlib import Path

import pytest

from emulation import LEFT_OUT, reason_of

NAMES = [name for names in LEFT_OUT.values() for name in names]


@pytest.mark.parametrize("name", NAMES)
def test_is_there(name):
    file, _, test = name.partition("::")
    text = (Path(__file__).parent / f"test_{file}.py").read_text(encoding="utf-8")
    function = test.split("[")[0]
    assert not test or re.search(rf"^def {function}\(", text, re.MULTILINE)


def test_is_named_once():
    assert len(set(NAMES)) == len(NAMES)


def test_the_list_is_for_files_tests_and_parameters():
    reason, names = next(iter(LEFT_OUT.items()))
    file, _, test = names[0].partition("::")
    assert reason_of(file, test) == reason
    assert reason_of(file, f"{test}[a-b]") == reason
    assert reason_of(file, f"{test}_too") is None
    assert reason_of("opengl_peers", "test_any") == "the machine's drivers are for another processor"
