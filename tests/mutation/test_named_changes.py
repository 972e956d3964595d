"""The kept changes fit the tree, and are found by the code that they name."""

import os
import subprocess
import sys
from pathlib import Path

import pytest

from named_changes import Misfit, Tree, apply_hunks, hunks, load, place

HERE = Path(__file__).resolve().parent
TEXT = """\
int f(int n) // counts
{
    return n + 1; // one more
}

int g(int n)
{
    return n + 2;
}
"""


def changed(text, diff, tmp_path, path="pmutil/all/f.cpp"):
    file = tmp_path / path
    file.parent.mkdir(parents=True)
    file.write_text(text)
    after = apply_hunks(Tree(tmp_path), list(hunks(diff)))
    assert list(after) == [path]
    return after[path]


def diff_of(*lines, path="pmutil/all/f.cpp"):
    return f"--- a/{path}\n+++ b/{path}\n@@\n" + "".join(f"{line}\n" for line in lines)


def test_every_kept_change_fits():
    command = [sys.executable, str(HERE / "apply_named"), "--check"]
    if "ASSAY_BUILD_DIR" in os.environ:
        command += ["--bin", os.environ["ASSAY_BUILD_DIR"] + "/bin"]
    done = subprocess.run(command, capture_output=True, text=True, check=False)
    assert done.returncode == 0, done.stdout + done.stderr


def test_whole_lines_are_replaced(tmp_path):
    text = changed(TEXT, diff_of("-    return n + 1;", "+    return n - 1;"), tmp_path)
    assert text == TEXT.replace("n + 1; // one more", "n - 1;")


@pytest.mark.parametrize("old", [
    "int g(int n)\n{\n    return n + 2;\n",
    "int g( int n ) { // another comment\nreturn n\n    + 2;\n",
    "int g(int n)\n{\n    /* none\n of these */ return n + 2;\n",
])
def test_blanks_line_ends_and_comments_do_not_count(old):
    begin, end = place(TEXT, old)
    assert TEXT[begin:end] == "int g(int n)\n{\n    return n + 2;\n"


@pytest.mark.parametrize("old", [
    "    return n + 3;\n",    # nowhere
    "{\n",                    # twice
    "n + 1;\n",               # not a whole line
    "    return n +\n",       # the same
    "    // one more\n",      # no code
])
def test_what_is_not_there_once_is_refused(old):
    with pytest.raises(Misfit):
        place(TEXT, old)


def test_texts_count_to_the_letter():
    text = 'call("a  b"); // c\ncall("// d");\n'
    assert place(text, 'call("a  b");\n') == (0, 19)
    assert place(text, 'call("// d");\n') == (19, len(text))
    with pytest.raises(Misfit):
        place(text, 'call("a b");\n')


def test_a_file_that_moved_is_found_by_its_name_and_platform(tmp_path):
    for folder in ("linux", "win"):
        file = tmp_path / "pmutil" / folder / "gpu" / "f.cpp"
        file.parent.mkdir(parents=True)
        file.write_text(TEXT)
    tree = Tree(tmp_path)
    assert tree.find("pmutil/sources/win/f.cpp") == "pmutil/win/gpu/f.cpp"
    with pytest.raises(Misfit):
        tree.find("pmutil/sources/all/f.cpp")


def test_each_text_is_a_change(tmp_path):
    (tmp_path / "host").mkdir()
    (tmp_path / "host" / "f.cpp").write_text('LOG("a" << g("b")).more(R"(c)");\nother("d");\nLOG(u"e");\n')

    def new_lines(regex):
        patch = tmp_path / "log.patch"
        patch.write_text(f"# program: p\n# filter: f\n# effect: e\n# texts: {regex}\n--- a/host/f.cpp\n"
                         "+++ b/host/f.cpp\n")
        tree = Tree(tmp_path)
        before = tree.read("host/f.cpp").splitlines()
        for change in load(patch, tree):
            after = change.edit(tree)["host/f.cpp"].splitlines()
            yield from (line for line in after if line not in before)

    assert list(new_lines(r"LOG\(")) == ['LOG("xa" << g("b")).more(R"(c)");',
                                         'LOG("a" << g("xb")).more(R"(c)");', 'LOG(u"xe");']
    assert list(new_lines("LOG")) == ['LOG("xa" << g("b")).more(R"(c)");',
                                      'LOG("a" << g("xb")).more(R"(c)");',
                                      'LOG("a" << g("b")).more(R"(xc)");', 'LOG(u"xe");']


def test_texts_can_be_changed_at_run_time(tmp_path):
    program = """\
#include <iostream>
#define NAME "n"
void print(const char* text) { std::cout << text; }
const char* const table[] = {"a", "b"};
int main() { print("c" NAME "d"); print(table[0]); print(table[1]); }
"""
    (tmp_path / "host").mkdir()
    (tmp_path / "host" / "f.cpp").write_text(program)
    patch = tmp_path / "log.patch"
    patch.write_text("# program: p\n# filter: f\n# effect: e\n# texts: print\\(|table\\[\\] = \\{\n"
                     "--- a/host/f.cpp\n+++ b/host/f.cpp\n")
    tree = Tree(tmp_path)
    changes = load(patch, tree)
    (tmp_path / "all.cpp").write_text(changes[0].all_at_once(tree)["host/f.cpp"])
    subprocess.run(["c++", "all.cpp", "-o", "all"], cwd=tmp_path, check=True)

    def printed(**variables):
        return subprocess.run([tmp_path / "all"], env=variables, capture_output=True, text=True,
                              check=True).stdout

    assert printed() == "cndab"
    assert [printed(**{change.SWITCH: str(change.number)}) for change in changes] == [
        "cndxab", "cndaxb", "xcndab", "cnxdab"]


def test_each_hunk_can_be_a_change(tmp_path):
    file = tmp_path / "pmutil" / "all" / "f.cpp"
    file.parent.mkdir(parents=True)
    file.write_text(TEXT)
    patch = tmp_path / "both.patch"
    diff = diff_of("-    return n + 1;", "+    return 1;", "@@", "-    return n + 2;", "+    return 2;")

    def results(head):
        patch.write_text(f"# program: p\n# filter: f\n# effect: e\n{head}{diff}")
        return [change.edit(Tree(tmp_path))["pmutil/all/f.cpp"] for change in load(patch, Tree(tmp_path))]

    one = TEXT.replace("n + 1; // one more", "1;")
    two = TEXT.replace("n + 2", "2")
    assert results("# each: hunk\n") == [one, two]
    assert results("") == [one.replace("n + 2", "2")]
