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
    (tmp_path / "host" / "f.cpp").write_text('LOG("a" << 1 << R"(b)");\nother("c");\nLOG(u"d");\n')
    patch = tmp_path / "log.patch"
    patch.write_text("# program: p\n# filter: f\n# effect: e\n# texts: LOG\\(\n--- a/host/f.cpp\n"
                     "+++ b/host/f.cpp\n")
    tree = Tree(tmp_path)
    changes = load(patch, tree)
    assert [change.edit(tree)["host/f.cpp"].splitlines() for change in changes] == [
        ['LOG("xa" << 1 << R"(b)");', 'other("c");', 'LOG(u"d");'],
        ['LOG("a" << 1 << R"(xb)");', 'other("c");', 'LOG(u"d");'],
        ['LOG("a" << 1 << R"(b)");', 'other("c");', 'LOG(u"xd");']]
