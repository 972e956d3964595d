"""The parts of run_mutants on a small source."""
import shutil
import subprocess
import sys
from pathlib import Path

import pytest

HERE = Path(__file__).resolve().parent
sys.path.insert(0, str(HERE))
pytest.importorskip("clang.cindex", reason="python3-clang-14 is missing")
from mutants import clang, isolation, judged, schemata, sites  # noqa: E402
from mutants.survey import ProgramTests  # noqa: E402

SOURCE = """\
#include <cstdio>
#define SAY(text) do { std::puts(text); } while (false)
constexpr int kLimit = 3;
int Sum(int from, int to)
{
    int sum = 0;
    for (int i = from; i < to; ++i) // each
        sum += i;
    if (sum > kLimit &&
        from != 7)
        return sum - 1;
    SAY("small");
    return sum;
}
int main()
{
    std::printf("%d %d\\n", Sum(1, 5), Sum(0, 2));
    return __LINE__ == 18 ? 0 : 1;
}
"""


def found(tmp_path, text=SOURCE):
    path = tmp_path / "Sum.cpp"
    path.write_text(text)
    unit, cursors = clang.parse(path, ["-std=c++17"])
    result = sites.Finder("Sum.cpp", "all", path.read_bytes()).find(cursors)
    del unit
    return result


def test_each_kind_of_change_is_found(tmp_path):
    changes = {(each.kind, each.old, each.new) for each in found(tmp_path)}
    assert {("comparison", "<", "<="), ("comparison", "!=", "=="), ("arithmetic", "-", "+"),
            ("arithmetic", "+=", "-="), ("arithmetic", "++", "--"), ("logic", "&&", "||"),
            ("constant", "3", "4"), ("constant", "7", "6"), ("text", '"small"', '"sm_ll"'),
            ("statement", "sum += i ;", ";"), ("statement", 'SAY ( "small" ) ;', ";"),
            ("logic", "sum > kLimit && from != 7", "false")} <= changes


def test_a_macro_s_own_code_is_left_alone(tmp_path):
    assert not [each for each in found(tmp_path) if each.old in ("false", "std :: puts ( text ) ;")]


def program(tmp_path, numbered):
    """The program with these mutants, and how it is run with one of them on."""
    board = tmp_path / "board"
    (tmp_path / "mixed.cpp").write_bytes(schemata.Writer(SOURCE.encode(), numbered).write())
    subprocess.run(["c++", "-std=c++17", "-w", f'-DBOARD="{board}"', str(tmp_path / "mixed.cpp"),
                    str(HERE / "mutants" / "chooser.cpp"), "-o", str(tmp_path / "program")], check=True)

    def run(number):
        board.write_bytes(number.to_bytes(4, sys.byteorder) + bytes(1000))
        try:
            done = subprocess.run([str(tmp_path / "program")], capture_output=True, text=True, timeout=5,
                                  check=False)
            return done.stdout, done.returncode
        except subprocess.TimeoutExpired:
            return "hangs", None
        finally:
            run.reached = [place for place, byte in enumerate(board.read_bytes()[4:]) if byte]

    return run


def test_one_program_holds_all_mutants_and_keeps_its_lines(tmp_path):
    mutants = found(tmp_path)
    run = program(tmp_path, list(enumerate(mutants, 1)))
    assert run(0) == ("small\n9 1\n", 0)
    outputs = {(each.old, each.new): run(number) for number, each in enumerate(mutants, 1)}
    assert outputs["-", "+"][0] == "small\n11 1\n"
    assert outputs["<", "<="][0] == "small\n14 3\n"
    assert outputs["3", "4"][0] == "small\n9 1\n"
    assert outputs['SAY ( "small" ) ;', ";"][0] == "9 1\n"
    assert outputs['"small"', '"sm_ll"'][0] == "sm_ll\n9 1\n"


def test_a_run_tells_which_mutants_it_asked_for(tmp_path):
    mutants = found(tmp_path)
    numbered = list(enumerate(mutants, 1))
    run = program(tmp_path, numbered)
    run(0)
    names = {str(mutants[number - 1].old) for number in run.reached}
    assert {"<", "&&", '"small"'} <= names


def test_a_mutant_s_key_outlives_edits_elsewhere_and_comments(tmp_path):
    edited = "// first\n\n" + SOURCE.replace("// each", "/* every */").replace("int main", "int\nmain")
    assert {each.key for each in found(tmp_path)} == {each.key for each in found(tmp_path, edited)}


def test_a_judgement_is_found_again_and_needs_a_reason(tmp_path):
    mutant = found(tmp_path)[0]
    file = tmp_path / "judged.txt"
    file.write_text("# a comment\n\n" + judged.block(mutant, "nobody asks") + "\n")
    judgements = judged.Judgements(file)
    assert judgements.reason(mutant) == "nobody asks"
    assert judgements.unused([mutant]) == []
    assert judgements.unused([]) != []
    file.write_text(judged.block(mutant, ""))
    with pytest.raises(ValueError):
        judged.Judgements(file)


CASES = """\
#include <gtest/gtest.h>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <unistd.h>
extern "C" bool MutantIsOn(int number) noexcept;
TEST(All, Passes) { EXPECT_FALSE(MutantIsOn(1)); }
TEST(All, Crashes) { if (MutantIsOn(2)) std::abort(); }
TEST(All, KillsAll) { if (MutantIsOn(3)) kill(-1, SIGKILL); }
TEST(All, FailsAnyway) { EXPECT_TRUE(MutantIsOn(8)); }
TEST(All, Writes) { if (MutantIsOn(4)) { EXPECT_EQ(std::fopen("FOLDER/left", "w"), nullptr); EXPECT_NE(std::fopen("/tmp/left", "w"), nullptr); } }
class OfValues : public testing::TestWithParam<int> {};
TEST_P(OfValues, Fails) { EXPECT_FALSE(MutantIsOn(GetParam())); }
INSTANTIATE_TEST_SUITE_P(Some, OfValues, testing::Values(6, 7));
"""


@pytest.fixture(scope="module")
def cases(tmp_path_factory):
    """A job over a small GoogleTest program, outside of /tmp, which the tests can't see."""
    if subprocess.run([*isolation.COMMAND[:-2], "true"], capture_output=True, check=False).returncode != 0:
        pytest.skip("no namespaces may be made here")
    folder = Path("/var/tmp") / f"mutants-test-{tmp_path_factory.mktemp('x').parent.name}"
    (folder / "board").mkdir(parents=True, exist_ok=True)
    board = folder / "board" / "board"
    (folder / "cases.cpp").write_text(CASES.replace("FOLDER", str(folder)))
    subprocess.run(["c++", "-std=c++17", f'-DBOARD="{board}"', str(folder / "cases.cpp"),
                    str(HERE / "mutants" / "chooser.cpp"), "-lgtest_main", "-lgtest", "-lpthread",
                    "-o", str(folder / "cases")], check=True)
    yield folder, {"board": str(board), "size": 100, "tree": "", "build": "", "program_tests": []}
    shutil.rmtree(folder)


ALL = {"All.Passes": 0.1, "All.Crashes": 0.1, "All.KillsAll": 0.1, "All.Writes": 0.1,
       "Some/OfValues.Fails/0": 0.1, "Some/OfValues.Fails/1": 0.1}


def attempt(cases, number):
    folder, job = cases
    steps = [(str(folder / "cases"), ALL)]
    return isolation.run({**job, "what": "attempt", "number": number, "steps": steps}, folder, 100)[0]


def test_a_mutant_is_killed_by_a_failure_or_a_crash_and_survives_without(cases):
    assert attempt(cases, 1) == {"verdict": "killed", "by": "All.Passes", "how": "fails"}
    assert attempt(cases, 2) == {"verdict": "killed", "by": "All.Crashes", "how": "status -6"}
    assert attempt(cases, 7) == {"verdict": "killed", "by": "Some/OfValues.Fails/1", "how": "fails"}
    assert attempt(cases, 5) == {"verdict": "survived", "unsteady": []}


def test_a_case_that_fails_without_the_mutant_catches_nothing(cases):
    folder, job = cases
    steps = [(str(folder / "cases"), {"All.FailsAnyway": 0.1, "All.Passes": 0.1})]

    def verdict(number):
        return isolation.run({**job, "what": "attempt", "number": number, "steps": steps}, folder, 100)[0]

    assert verdict(5) == {"verdict": "survived", "unsteady": ["All.FailsAnyway"]}
    assert verdict(1) == {"verdict": "killed", "by": "All.Passes", "how": "fails"}


def test_a_mutant_that_kills_all_it_finds_ends_only_its_own_tests(cases):
    assert attempt(cases, 3) is None


def test_a_mutant_can_leave_nothing_behind(cases):
    assert attempt(cases, 4)["verdict"] == "survived"
    assert not (cases[0] / "left").exists()
    assert not Path("/tmp/left").exists()


PROGRAM_CASES = """\
import signal
def test_ends():
    pass
def test_never_ends():
    while True:
        signal.pause()
def test_ends_too():
    pass
"""


def test_the_survey_breaks_off_program_tests_that_take_too_long(cases):
    folder, job = cases
    file = folder / "test_some.py"
    file.write_text(PROGRAM_CASES)
    # Long enough for those that end, whatever else the machine does.
    result, output = isolation.run({**job, "what": "survey", "programs": {}, "tree": str(folder), "slowest": 5,
                                    "program_tests": [str(file)]}, folder, 100)
    assert result is not None, output
    assert {name: each["passed"] for name, each in result["program"].items()} == {
        "test_some.py::test_ends": True, "test_some.py::test_never_ends": False,
        "test_some.py::test_ends_too": True}


def test_program_tests_are_left_out_by_the_name_of_their_file(tmp_path):
    folder = tmp_path / "tests" / "program"
    folder.mkdir(parents=True)
    for name in ("test_one.py", "test_two.py", "harness.py"):
        (folder / name).touch()
    assert ProgramTests(["test_two.py"], None).files(tmp_path) == [str(folder / "test_one.py")]
    with pytest.raises(SystemExit, match="test_three.py"):
        ProgramTests(["test_three.py"], None).files(tmp_path)


def test_the_survey_says_which_case_asks_for_which_mutant(cases):
    folder, job = cases
    program = str(folder / "cases")
    result, _ = isolation.run({**job, "what": "survey", "programs": {program: list(ALL)}}, folder, 100)
    assert {case: each["reached"] for case, each in result[program].items()} == {
        "All.Passes": [1], "All.Crashes": [2], "All.KillsAll": [3], "All.Writes": [4],
        "Some/OfValues.Fails/0": [6], "Some/OfValues.Fails/1": [7]}
    assert all(each["passed"] for each in result[program].values())
