"""The questions of docs/fleet.md to stored documents, by jq."""

import re

import pytest

from clmodel import ClGpu
from engines import needed, outcome_of
from harness import BUILD, TREE
from hosting import run_assay
from model import Gpu

CRASHES = "at glCompileShader crash\n"
CARDS = {
    "good": ([ClGpu(), ClGpu()], ""),
    "slow": ([ClGpu(), ClGpu(batch=400_000_000)], ""),
    "crashed": ([ClGpu(), ClGpu()], CRASHES),
    "shaders": ([ClGpu(driver_version="391.0")], 'fragment-fails "x"\n'),
}
ANSWERS = [
    ["crashed.json crashed: assay crashed with signal 11 (Segmentation fault) while compiling shaders "
     "(glgpu[0].CanCompileProgramGLSL)."],
    ["crashed.json assay crashed in OpenGL, while compiling shaders (glgpu[0].CanCompileProgramGLSL). "
     "The run ended before OpenCL was tried.",
     "shaders.json OpenGL does not work: glgpu[0]: a realistic pair of shaders does not compile and link: "
     "*. OpenCL works on graphics hardware."],
    ["4 390.77", "1 391.0"],
    ["crashed.json not known", "good.json 2", "shaders.json 1", "slow.json 2"],
    ["slow.json clgpu[1] 838861000"],
    ["4 no-adapter", "1 shader-trial-failed"],
]


@pytest.fixture(name="folder", scope="module")
def fixture_folder(tmp_path_factory):
    from harness import Host

    folder = tmp_path_factory.mktemp("documents")
    scripts = tmp_path_factory.mktemp("scripts")
    for name, (cards, rules) in CARDS.items():
        (scripts / "opencl").write_text("".join(card.script() for card in cards), encoding="ascii")
        host = Host(scripts, {"OCL_ICD_VENDORS": str(BUILD / "drivers" / "opencl"),
                              "ASSAY_SCRIPTED_OPENCL": str(scripts / "opencl")})
        run_assay(host, "--format", "json", "--output", str(folder / f"{name}.json"),
                  machine={"script": Gpu().script() + rules, "opencl": "empty"})
    return folder


def commands():
    text = (TREE / "docs" / "fleet.md").read_text(encoding="utf-8")
    blocks = re.findall(r"^```sh\n(.*?)^```$", text, re.DOTALL | re.MULTILINE)
    return [line for line in "".join(blocks).splitlines() if line.startswith("jq ")]


def test_each_command_has_an_answer():
    assert len(commands()) == len(ANSWERS)


@pytest.mark.parametrize("command, answer", zip(commands(), ANSWERS), ids=map(str, range(len(ANSWERS))))
def test_answers(folder, command, answer):
    needed("jq")
    status, text = outcome_of("bash", "-c", command, cwd=folder)
    lines = [line.strip() for line in text.splitlines()]
    pattern = [re.escape(line).replace(r"\*", ".*") for line in answer]
    assert status == 0
    assert len(lines) == len(answer), text
    for line, wanted in zip(lines, pattern):
        assert re.fullmatch(wanted, line), (line, wanted)
