"""The HTML form of a run, in a browser."""

import base64
import ctypes.util
import hashlib
import json
import os
import re

import pytest

import test_series
from browser import browser
from calls import FullMachine
from clmodel import ClGpu, ClPlatform, cl_script_of
from harness import PROGRAM_AT_ROOT, TREE, text_of
from hosting import host_run, script_child
from validate import validate_document

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")

HOSTILE = "</script></style><img src=x onerror=alert(1)><script>alert(2)</script>\"'&amp;\x1b[31m\u202e\u0085"


@pytest.fixture(scope="module", name="window")
def a_window():
    with browser() as window:
        yield window


def run(folder, *options, gl="", cl="", child=(), cards=None):
    machine = FullMachine(folder) if cards is None else FullMachine(folder, opencl=[ClPlatform(cards)])
    host, found = machine.host("run", gl, cl)
    arguments = ["--", *child] if child else []
    return host_run("run", "--assay", str(PROGRAM_AT_ROOT), *options, *arguments,
                    environment=host.environment(**found))


def healthy(folder, form="html"):
    return run(folder, "--format", form)


def crashed(folder, form="html"):
    return run(folder, "--format", form, gl="at glLinkProgram crash\n")


def two_cards(folder):
    """For OpenCL, with other speeds."""
    # A measurement of the second takes four batches.
    cards = [ClGpu(name="Large card", batch=600_000, memory=24 << 30, kernel=2_000_000),
             ClGpu(name="Small card", batch=2_400_000, memory=4 << 30, kernel=9_000_000)]
    return run(folder, "--format", "html", cards=cards)


def trial_failed(folder):
    return run(folder, "--format", "html", gl="at glCheckFramebufferStatus return 36054\n")


def never_started(folder):
    return host_run("run", "--assay", str(folder / "nothing"), "--format", "html")


def series(folder):
    """Of OpenCL alone, with an outlier and a crash."""
    runs = test_series.noisy(12, 1)
    runs[5] = test_series.gpu(2_000_000_000)
    runs[8] = cl_script_of([ClPlatform([test_series.gpu()])]) + "at clEnqueueNDRangeKernel crash\n"
    machine = test_series.Machine(folder)
    machine.set_runs(runs)
    return machine.run("--repeat", "12", "--format", "html")


def hostile_series(folder):
    return hostile(folder, "html", 0, "--repeat", "3")


def hostile(folder, form="html", length=0, *options):
    """Each text of a whole report with what could do harm, and so much more of it; the name has 64 KiB."""
    (folder / "plain").mkdir()
    lines = run(folder / "plain", "--raw").text.split("\n\n")[0].splitlines()
    long = HOSTILE + "x" * 65536
    value = HOSTILE + "y" * length
    text = "".join(re.sub(r'="(?!\d{4}-\d\d-\d\d_).*"$', lambda _: f'="{value}"', line) + "\n"
                   for line in lines)
    text = text.replace(f'GLName="{value}"', f'GLName="{long}"')
    assert text.count(HOSTILE) > 10 and long in text
    (folder / "text").write_text(text, encoding="utf-8")
    (folder / "errors").write_text(long + "\n" + HOSTILE, encoding="utf-8")
    child = script_child(folder, f'cat "{folder}/text"; cat "{folder}/errors" >&2')
    return host_run("run", "--assay", str(child), "--format", form, *options)


def long(folder):
    """Each text with 64 KiB."""
    return hostile(folder, length=65536)


PAGES = {"healthy": healthy, "crashed": crashed, "two-cards": two_cards, "trial-failed": trial_failed,
         "never-started": never_started, "hostile": hostile, "long": long,
         "series": series, "hostile-series": hostile_series}
HEADLINES = {
    "healthy": "OpenGL works on graphics hardware.",
    "crashed": "assay crashed with signal 11 (Segmentation fault)",
    "two-cards": "OpenGL works on graphics hardware.",
    "trial-failed": "OpenGL does not work: glgpu[0]: no complete framebuffer object could be created",
    "never-started": "assay could not be started",
    "hostile": "OpenGL works on graphics hardware.",
    "long": "OpenGL works on graphics hardware.",
    "series": "assay crashed with signal 11 (Segmentation fault)",
    "hostile-series": "OpenGL works on graphics hardware.",
}


@pytest.fixture(scope="module", name="pages")
def all_pages(tmp_path_factory):
    """The file of each page."""
    files = {}
    for name, make in PAGES.items():
        folder = tmp_path_factory.mktemp(name)
        files[name] = folder / "page.html"
        files[name].write_bytes(make(folder).out)
    return files


@pytest.mark.parametrize("name", PAGES)
def test_a_page_says_what_happened(window, pages, name):
    window.open(pages[name])
    heading = window.run("return document.querySelector('h1').innerText")
    assert heading.startswith(HEADLINES[name])
    assert window.run("return document.querySelectorAll('h1').length") == 1
    assert window.run("return document.documentElement.lang") == "en"
    advice = window.run("return [...document.querySelectorAll('h2')].some(h => h.innerText === 'What to do')")
    assert advice == (name not in ("healthy", "two-cards", "hostile", "long", "hostile-series"))


@pytest.mark.parametrize("name", PAGES)
def test_a_page_asks_for_nothing_and_complains_of_nothing(window, pages, name):
    window.open(pages[name])
    assert window.console() == []
    assert window.requests() == [pages[name].resolve().as_uri()]
    # The alert of a script that ran would block this call.
    assert window.run("return document.images.length") == 0


@pytest.mark.parametrize("name", PAGES)
@pytest.mark.parametrize("width", [320, 1280, 3840])
def test_a_page_fits_its_window(window, pages, name, width):
    window.open(pages[name], width=width)
    assert window.run("return document.documentElement.scrollWidth") <= width


@pytest.mark.parametrize("name", PAGES)
@pytest.mark.parametrize("scheme", ["light", "dark"])
def test_a_page_is_accessible(window, pages, name, scheme):
    window.open(pages[name], scheme=scheme)
    window.run("for (const fold of document.querySelectorAll('details')) fold.open = true")
    assert window.violations() == []


def test_the_colours_follow_the_scheme(window, pages):
    colours = {}
    for scheme in ("light", "dark"):
        window.open(pages["healthy"], scheme=scheme)
        colours[scheme] = window.run("return getComputedStyle(document.body).backgroundColor")
    assert colours == {"light": "rgb(255, 255, 255)", "dark": "rgb(13, 17, 23)"}


def test_the_document_is_copied(window, pages):
    window.open(pages["healthy"])
    document = window.run("return document.getElementById('json').textContent")
    validate_document(document.encode())
    window.run("""window.copied = null;
                  navigator.clipboard.writeText = async text => { window.copied = text; };""")
    window.run("document.getElementById('copy').click()")
    assert window.run("return window.copied") == document
    assert window.run("return document.getElementById('copied').innerText") == "Copied."


def test_a_browser_that_forbids_copying(window, pages):
    window.open(pages["healthy"])
    window.run("navigator.clipboard.writeText = async () => { throw new Error('no'); };")
    window.run("document.getElementById('copy').click()")
    assert window.run("return document.getElementById('copied').innerText") == "The browser did not allow it."


def test_a_page_without_scripts(window, pages):
    """All of it can be read; the button, which would do nothing, isn't there."""
    window.open(pages["crashed"])
    outline = window.outline()
    window.command("Emulation.setScriptExecutionDisabled", value=True)
    try:
        window.open(pages["crashed"])
        snapshot = window.command("DOMSnapshot.captureSnapshot", computedStyles=["display"])
        assert [line for line in outline if line.strip().startswith("article")]
        texts = snapshot["strings"]
        assert any(text.startswith(HEADLINES["crashed"]) for text in texts)
        shown = {snapshot["documents"][0]["nodes"]["nodeName"][index]
                 for index in snapshot["documents"][0]["layout"]["nodeIndex"]}
        assert "BUTTON" not in {texts[name] for name in shown}
        assert "H1" in {texts[name] for name in shown}
    finally:
        window.command("Emulation.setScriptExecutionDisabled", value=False)


def test_the_policy_names_the_script(pages):
    page = pages["healthy"].read_text(encoding="utf-8")
    script = re.search(r"<script>(.*?)</script>", page, re.DOTALL).group(1)
    digest = base64.b64encode(hashlib.sha256(script.encode()).digest()).decode()
    assert f"script-src &#39;sha256-{digest}&#39;" in page


@pytest.mark.parametrize("scheme", ["light", "dark"])
def test_a_page_on_paper(window, pages, scheme):
    """Dark on white whatever the screen's scheme, with all that is folded, and without the button."""
    window.open(pages["crashed"], scheme=scheme, media="print")
    colours = window.run("const style = getComputedStyle(document.body);"
                         "return [style.backgroundColor, style.color]")
    assert colours == ["rgb(255, 255, 255)", "rgb(0, 0, 0)"]
    assert window.run("return getComputedStyle(document.getElementById('copy')).display") == "none"
    visible = ("return [...document.querySelectorAll('details')]"
               ".map(fold => fold.lastElementChild.checkVisibility())")
    assert set(window.run(visible)) == {True}
    assert window.violations() == []
    window.open(pages["crashed"], scheme=scheme)
    assert set(window.run(visible)) == {False}


def test_hostile_texts_are_shown(window, pages):
    """As they are, but for what a reader couldn't see."""
    window.open(pages["hostile"])
    shown = HOSTILE.replace("\x1b", "\\x1B").replace("\u202e", "\\u{202E}").replace("\u0085", "\\x85")
    facts = window.run("return [...document.querySelectorAll('dd')].map(fact => fact.textContent)")
    assert sum(HOSTILE[:30] in fact for fact in facts) > 10
    assert len([fact for fact in facts if fact.startswith(shown[:60])]) > 10
    assert max(len(fact) for fact in facts) > 65536
    window.open(pages["long"])
    assert window.run("return [...document.querySelectorAll('dd')]"
                      ".filter(fact => fact.textContent.length > 65000).length") > 10


def test_a_page_agrees_with_the_document(window, tmp_path):
    """The facts of one machine, in both forms."""
    page = tmp_path / "page.html"
    page.write_bytes(healthy(tmp_path).out)
    window.open(page)
    inside = json.loads(window.run("return document.getElementById('json').textContent"))
    other = validate_document(run(tmp_path, "--format", "json").out)
    stamps = re.compile(r"\d{4}-\d\d-\d\d_")
    lines = [[line["text"] for line in document["lines"] if not stamps.search(line["text"])]
             for document in (inside, other)]
    measured = ("CLBandwidth", "CLCompute")
    kept = [[line for line in text if not any(key in line for key in measured)] for text in lines]
    assert kept[0] == kept[1]
    assert inside["usable"] == other["usable"]


def test_only_text_takes_raw(tmp_path):
    hosted = host_run("run", "--assay", str(tmp_path / "nothing"), "--format", "html", "--raw")
    assert hosted.status == 10
    assert "--raw: only with --format text" in text_of(hosted.err)


# What the documentation shows.
PICTURES = TREE / "docs" / "pictures"


def check_picture(window, name, folder):
    """Compares the page in the window with its picture: the landmarks, headings and terms are those that
    were there when it was taken. ASSAY_NEW_PICTURES=1 takes it again."""
    outline = "\n".join(window.outline()) + "\n"
    # What is this machine's own is left out of a picture.
    window.run("""
        for (const term of document.querySelectorAll("dt"))
            if (["Command", "System", "Build", "Kernel", "Architecture"].includes(term.textContent)) {
                term.nextElementSibling.remove();
                term.remove();
            }""")
    if os.environ.get("ASSAY_NEW_PICTURES"):
        PICTURES.mkdir(exist_ok=True)
        window.picture(PICTURES / f"{name}.png")
        (PICTURES / f"{name}.txt").write_text(outline, encoding="utf-8")
    assert outline == (PICTURES / f"{name}.txt").read_text(encoding="utf-8")
    picture = folder / "picture.png"
    window.picture(picture)
    size = [int.from_bytes((file.read_bytes())[16:24][start:start + 4], "big")
            for file in (picture, PICTURES / f"{name}.png") for start in (0, 4)]
    # The fonts of a machine may make a page a little longer.
    assert size[0] == size[2] == 1000
    assert abs(size[1] - size[3]) < size[3] / 4


@pytest.mark.parametrize("name", ["healthy", "crashed", "two-cards"])
def test_the_pictures_in_the_documentation(window, pages, name, tmp_path):
    window.open(pages[name], width=1000)
    check_picture(window, name, tmp_path)
