"""assay-host explain."""

import fcntl
import os
import pty
import struct
import termios

import pytest

from harness import TREE
from hosting import ERROR_STATUS, host_run, read_to_the_end, run_assay, text_of


def explain(*keys):
    return host_run("explain", *keys)


def joined(text):
    return " ".join(text.split())


def test_all_keys_are_listed_and_explained():
    listed = explain()
    assert (listed.status, listed.err) == (0, b"")
    keys = [line.split(" (")[0] for line in listed.text.splitlines()]
    assert len(keys) == len(set(keys)) > 50
    assert {"GLMemoryMB (Memory)", "glGetIntegerv[GL_MAX_DRAW_BUFFERS] (Draw buffers)",
            "assayEnd"} < set(listed.text.splitlines())
    explained = explain(*keys)
    assert explained.status == 0
    titles = [part.splitlines()[0].split(": ")[0] for part in explained.text.split("\n\n")]
    assert titles == keys


def test_every_key_of_a_real_report_is_known(host):
    lines = run_assay(host, "--raw").text.split("\n\n")[0].splitlines()
    keys = sorted({line.split("=")[0] for line in lines if "=" in line})
    assert len(keys) > 50
    assert explain(*(key for key in keys if not key.startswith("gputag.GL_FRAGMENT_PROGRAM_ARB"))).status == 0


@pytest.mark.parametrize("name, titles", [
    ("GLMemoryMB", ["GLMemoryMB: Memory"]),
    ("glmemorymb", ["GLMemoryMB: Memory"]),
    ("glgpu[7].GLMemoryMB", ["GLMemoryMB: Memory"]),
    ("memory", ["GLMemoryMB: Memory", "CLMemoryMB: Memory"]),
    ("GL_MAX_DRAW_BUFFERS", ["glGetIntegerv[GL_MAX_DRAW_BUFFERS]: Draw buffers"]),
    ("gputag.GL_MAX_DRAW_BUFFERS", ["glGetIntegerv[GL_MAX_DRAW_BUFFERS]: Draw buffers"]),
    ("GL_ARB_vertex_shader", ["extension[QGF::OGL::GL_ARB_VERTEX_SHADER]: GL_ARB_vertex_shader"]),
    ("gputag.QGF::OGL::GL_ARB_VERTEX_SHADER",
     ["extension[QGF::OGL::GL_ARB_VERTEX_SHADER]: GL_ARB_vertex_shader"]),
    ("assayEnd", ["assayEnd"]),
])
def test_a_name(name, titles):
    parts = explain(name).text.split("\n\n")
    assert [part.splitlines()[0] for part in parts] == titles
    for part in parts:
        assert [line.split()[0] for line in part.splitlines()[1:] if line[2] != " "] in (
            ["Meaning", "Unit", "Source"], ["Meaning", "Source"])


def test_a_paragraph():
    assert explain("GLVersion").text == """\
GLVersion: OpenGL version
  Meaning  The newest version of OpenGL that the context offers, from 1.2 to
           4.1. A driver with a newer one is reported as 4.1, so 4.1 means 4.1
           or later.
  Source   glGetString(GL_VERSION)
"""
    assert explain("GLMemoryMB").text == """\
GLMemoryMB: Memory
  Meaning  The device's memory, the largest figure of all sources. For an
           integrated device a part of the machine's memory is counted. 0 means
           that no source has it, as with a software renderer.
  Unit     MiB
  Source   the system's adapter lists, and a query of AMD's and NVIDIA's drivers
"""


def test_a_paragraph_fits_the_terminal():
    control, terminal = pty.openpty()
    fcntl.ioctl(terminal, termios.TIOCSWINSZ, struct.pack("HHHH", 24, 50, 0, 0))
    assert host_run("explain", "GLVersion", stdout=terminal).status == 0
    os.close(terminal)
    shown = read_to_the_end(control).decode()
    os.close(control)
    assert joined(shown) == joined(explain("GLVersion").text)
    assert max(map(len, shown.splitlines())) in range(45, 51)


@pytest.mark.parametrize("name, message", [
    ("GLMemory", '"GLMemory" is no key of a report; did you mean "GLMemoryMB"?'),
    ("clgpu[0].CLBandwith", '"clgpu[0].CLBandwith" is no key of a report; did you mean "CLBandwidth"?'),
    ("price of the card", '"price of the card" is no key of a report; "assay-host explain" lists them'),
    ("\x1b[31m", '"\\x1B[31m" is no key of a report; "assay-host explain" lists them'),
    ("", '"" is no key of a report; "assay-host explain" lists them'),
    ("x:", '"x:" is no key of a report; "assay-host explain" lists them'),
    ("GLMemoryM", '"GLMemoryM" is no key of a report; did you mean "GLMemoryMB"?'),
    ("GL_MAX_DRAW_BUFFER", '"GL_MAX_DRAW_BUFFER" is no key of a report; did you mean "GL_MAX_DRAW_BUFFERS"?'),
    ("Compute scores", '"Compute scores" is no key of a report; did you mean "Compute score"?'),
])
def test_what_is_no_key(name, message):
    run = explain("GLName", name)
    assert (run.status, run.out) == (ERROR_STATUS, b"")
    assert text_of(run.err) == f"assay-host: {message}\n"


def test_the_page_has_the_same_words(host):
    page = joined(run_assay(host, "--format", "html").text)
    for key in ("GLMemoryMB", "GLVersion", "CanCompileProgramGLSL", "GL_MAX_DRAW_BUFFERS"):
        meaning = joined(explain(key).text.split("Meaning")[1].split("  Source")[0].split("  Unit")[0])
        assert meaning.replace("'", "&#39;").replace('"', "&quot;") in page


def test_the_documented_keys_are_explained():
    text = (TREE / "docs" / "report-format.md").read_text(encoding="utf-8")
    rows = [line.split("|")[2].strip(" `") for line in text.splitlines()
            if line.startswith("| ") and line.count("|") >= 5 and line.split("|")[1].strip().isdigit()]
    keys = [row for row in rows if row not in ("", "none") and " " not in row and "=" not in row]
    assert len(keys) > 40
    assert explain(*keys).status == 0
