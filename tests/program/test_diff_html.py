"""The differences of stored runs as a page, in a browser."""

import pytest

import test_html
from calls import FullMachine
from clmodel import ClGpu, ClPlatform
from harness import PROGRAM_AT_ROOT
from hosting import host_run
from model import Gpu
from test_html import HOSTILE, a_window  # noqa: F401, the fixture "window"
from adapters import Adapter
from validate import validate_diff

pytestmark = test_html.pytestmark

# A name that a shell's user could give to a file, and that must not become part of the page.
HOSTILE_FILE = "<b>&\"'\u202e.json"


def two_cards(folder, driver, kernel, gl=""):
    """A card whose driver has this version, and two for OpenCL, whose kernel takes so long."""
    cards = [ClGpu(name="Large card", batch=600_000, memory=24 << 30, kernel=kernel),
             ClGpu(name="Small card", batch=2_400_000, memory=4 << 30, kernel=9_000_000)]
    gpu = Gpu(adapter=Adapter(0, "Card", driver_version=driver), version="4.6 Scripted")
    host, found = FullMachine(folder, gpu, [ClPlatform(cards)]).host("run", gl)
    return host_run("run", "--assay", str(PROGRAM_AT_ROOT), "--format", "json",
                    environment=host.environment(**found))


RUNS = {
    "good.json": lambda folder: test_html.healthy(folder, "json"),
    "crashed.json": lambda folder: test_html.crashed(folder, "json"),
    HOSTILE_FILE: lambda folder: test_html.hostile(folder, "json"),
    "before.json": lambda folder: two_cards(folder, "6.1.0", 2_000_000),
    "after.json": lambda folder: two_cards(folder, "6.6.0", 4_000_000, "link-fails\n"),
}
# The files of each page, and what it says first.
PAGES = {
    "same": (["good.json", "good.json"], "The reports do not differ."),
    "crashed": (["good.json", "crashed.json"],
                "OpenGL: hardware in the first report, broken in the second; "
                "OpenCL: hardware in the first report, unknown in the second."),
    "diff": (["before.json", "after.json"],
             "OpenGL: hardware in the first report, broken in the second."),
    "hostile": ([HOSTILE_FILE, "good.json"], ""),
    "many": (["good.json", "crashed.json", HOSTILE_FILE, "good.json"],
             "2 of 3 reports differ from the first one."),
}


@pytest.fixture(scope="module", name="stored")
def stored_runs(tmp_path_factory):
    """The folder with the files of the runs."""
    stored = tmp_path_factory.mktemp("stored")
    for number, (name, make) in enumerate(RUNS.items()):
        (stored / name).write_bytes(make(tmp_path_factory.mktemp(f"run-{number}")).out)
    return stored


@pytest.fixture(scope="module", name="pages")
def all_pages(stored):
    """The file of each page."""
    files = {}
    for name, (runs, _) in PAGES.items():
        made = host_run("diff", "--format", "html", "--output", f"{name}.html", *runs, cwd=stored)
        assert (made.status, made.out, made.err) == (int(name != "same"), b"", b"")
        files[name] = stored / f"{name}.html"
    return files


@pytest.mark.parametrize("name", PAGES)
def test_a_page_says_what_differs(window, pages, name):
    window.open(pages[name])
    heading = window.run("return document.querySelector('h1').innerText")
    assert heading.startswith(PAGES[name][1])
    assert window.run("return document.title") == f"assay: {heading}"
    advice = window.run("return [...document.querySelectorAll('h2, h3')]"
                        ".some(heading => heading.innerText === 'What to do')")
    assert advice == (name in ("crashed", "diff", "many"))


@pytest.mark.parametrize("name", PAGES)
def test_a_page_asks_for_nothing_and_complains_of_nothing(window, pages, name):
    window.open(pages[name])
    assert window.console() == []
    assert window.requests() == [pages[name].resolve().as_uri()]
    assert window.run("return document.images.length + document.querySelectorAll('b').length") == 0


@pytest.mark.parametrize("name", PAGES)
@pytest.mark.parametrize("width", [320, 1280, 3840])
def test_a_page_fits_its_window(window, pages, name, width):
    window.open(pages[name], width=width)
    window.run("for (const fold of document.querySelectorAll('details')) fold.open = true")
    assert window.run("return document.documentElement.scrollWidth") <= width


@pytest.mark.parametrize("name", PAGES)
@pytest.mark.parametrize("scheme", ["light", "dark"])
def test_a_page_is_accessible(window, pages, name, scheme):
    window.open(pages[name], scheme=scheme)
    window.run("for (const fold of document.querySelectorAll('details')) fold.open = true")
    assert window.violations() == []


@pytest.mark.parametrize("name", PAGES)
def test_the_document_is_in_the_page(window, stored, pages, name):
    """The same that --format json writes; the button copies it."""
    window.open(pages[name])
    document = window.run("return document.getElementById('json').textContent")
    written = host_run("diff", "--format", "json", *PAGES[name][0], cwd=stored)
    assert validate_diff(document.encode()) == validate_diff(written.out)
    window.run("navigator.clipboard.writeText = async text => { window.copied = text; };")
    window.run("document.getElementById('copy').click()")
    assert window.run("return window.copied") == document


def test_hostile_texts_are_shown(window, pages):
    window.open(pages["hostile"])
    cells = window.run("return [...document.querySelectorAll('td')].map(cell => cell.textContent)")
    shown = HOSTILE.replace("\x1b", "\\x1B").replace("\u202e", "\\u{202E}").replace("\u0085", "\\x85")
    assert sum(cell.startswith(shown[:60]) for cell in cells) > 10
    assert max(len(cell) for cell in cells) > 65536
    files = window.run("return [...document.querySelectorAll('header dd')].map(file => file.textContent)")
    assert files[0].startswith("<b>&\"'\\u{202E}.json: ")


def test_the_picture_in_the_documentation(window, pages, tmp_path):
    """As those of the pages of a run. ASSAY_NEW_PICTURES=1 takes it again."""
    window.open(pages["diff"], width=1000)
    # The time and the system are this machine's own.
    window.run("""
        for (const file of document.querySelectorAll("header dd"))
            if (file.textContent.includes(".json"))
                file.textContent = file.textContent.replace(/, .*/, "");""")
    test_html.check_picture(window, "diff", tmp_path)
