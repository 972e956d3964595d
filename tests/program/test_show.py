"""assay-host show: a stored run in every form. And the forms of one run agree, on every machine whose
drivers are scripted."""

import html
import json
import re
from html.parser import HTMLParser

import pytest

import test_usable
from hosting import ERROR_STATUS, decode, host_run, text_of
from test_usable import FAILURES
from validate import validate_document

pytestmark = test_usable.pytestmark

# What text and pages say of a run, by its verdict and by whether the report is whole.
RUNS = {
    ("complete", True): "all tests ran",
    ("failed-tests", True): "ended with a failure",
    ("failed-tests", False): "ended early",
    ("crashed", True): "crashed",
    ("crashed", False): "crashed",
    ("hung", False): "did not end",
    ("usage-error", False): "options rejected",
    ("never-started", False): "did not start",
}


def show(file, *options):
    return host_run("show", str(file), *options)


class Page(HTMLParser):
    """The terms of a page with their texts, and its parts by class."""

    def __init__(self, text):
        super().__init__()
        self.article = ""
        self.facts = []  # (device, term, text)
        self.spans = []  # (class, text)
        self.at = []
        self.term = ""
        self.text = ""
        self.feed(text)

    def handle_starttag(self, tag, attributes):
        named = dict(attributes)
        if tag == "article":
            self.article = named["id"]
        if tag in ("dt", "dd", "span", "h1"):
            self.text = ""
        if tag == "span" and "class" in named:
            self.spans.append(named["class"])

    def handle_data(self, data):
        self.text += data

    def handle_endtag(self, tag):
        if tag == "dt":
            self.term = self.text
        if tag == "dd":
            self.facts.append((self.article, self.term, self.text))
        if tag == "article":
            self.article = ""


def joined(text):
    """The text without its line breaks and columns."""
    return " ".join(text.split())


def sections(text):
    """The part of a text form that is about each device, and the rest under ""."""
    parts = re.split(r"^Open[GC]L device (\w+\[\d+\]).*\n-+\n", text, flags=re.M)
    found = dict(zip(parts[1::2], (part.split("\n\n")[0] for part in parts[2::2])))
    found[""] = text.rpartition("\nRun: ")[2]
    return {tag: joined(part) for tag, part in found.items()}


def metrics(text):
    """The samples of a Prometheus text: {(name, labels): value}."""
    found = {}
    for line in text.splitlines():
        if not line.startswith("#"):
            name, labels, value = re.fullmatch(r"(\w+)(?:\{(.*)\})? (\S+)", line).groups()
            found[name, labels or ""] = float(value)
    return found


@pytest.mark.parametrize("name", FAILURES)
def test_the_forms_agree(tmp_path, name):
    stored = tmp_path / "report.json"
    stored.write_bytes(test_usable.run(tmp_path, FAILURES[name], "--format", "json").out)
    document = validate_document(stored.read_bytes())
    assert show(stored, "--format", "json").out == stored.read_bytes()

    verdict = document["outcome"]["verdict"]
    answers = {api: (each["answer"], each["device"]) for api, each in document["usable"].items()}
    warnings = document["warnings"]

    text = sections("\n" + show(stored, "--output", str(tmp_path / "text")).text
                    + (tmp_path / "text").read_text(encoding="utf-8"))
    words = RUNS[verdict, document["report"]["whole"]]
    assert text[""].startswith(f"{words} ---")
    shown = show(stored, "--format", "html").text
    page = Page(shown)
    run = {term: fact for device, term, fact in page.facts if not device}
    assert run["Result"] == words
    for step in document["nextSteps"]:
        assert step in text[""]
        assert f"<li>{step}</li>" in html.unescape(shown)
    assert ("What to do" in text[""]) == ("What to do" in shown) == bool(document["nextSteps"])
    assert page.spans[:2] == [answers["opengl"][0], answers["opencl"][0]]
    samples = metrics(show(stored, "--format", "prometheus").text)
    assert samples["assay_run_verdict", f'verdict="{verdict}"'] == 1
    assert samples["assay_warnings", ""] == len(warnings)
    fact = json.loads(show(stored, "--format", "ansible").out)
    assert fact["verdict"] == verdict
    assert len(fact["warnings"]) == len(warnings)
    features = show(stored, "--format", "nfd").text
    assert f"/assay.verdict={verdict}\n" in features
    for api, (answer, device) in answers.items():
        label = {"opengl": "OpenGL", "opencl": "OpenCL"}[api]
        judged = f"{answer} ({device})" if device else answer
        assert f"{label} {judged}: " in text[""]
        assert joined(run[label]).startswith(f"{judged}: ")
        assert samples["assay_usable", f'api="{api}",answer="{answer}"'] == 1
        assert fact[api]["usable"] == answer
        assert f"/assay.{api}.usable={answer}\n" in features

    # Every fact of a device's card is in the text form, with the same words.
    cards = [(device, term, shown) for device, term, shown in page.facts if device]
    assert {device for device, *_ in cards} <= {device["tag"] for device in document["devices"]}
    for device, term, shown in cards:
        if term.startswith("GL_"):  # an extension, which the text form lists
            listed = {"yes": "Extensions", "no": "Extensions missing"}[shown]
            assert re.search(rf"{listed} [^:]*\b{term}\b", text[device])
        elif term in ("device failed before", "run ended before", "no readable line"):
            assert f"No answer {joined(shown)} ({term})" in text[device]
        else:
            assert f"{term} {joined(shown)}" in text[device]
    # Every answer of the document is in a card or is named as missing.
    for device in document["devices"]:
        known = sum(1 for key, answer in device["keys"].items() if answer["value"] is not None)
        assert sum(tag == device["tag"] and term not in ("device failed before", "run ended before",
                                                         "no readable line")
                   for tag, term, _ in cards) in range(known, known + 2)


def test_a_clock_that_stands_still_has_a_bound_by_another(tmp_path):
    """Its size depends on this machine."""
    stored = tmp_path / "report.json"
    stored.write_bytes(test_usable.run(tmp_path, FAILURES["clock that stands still"],
                                       "--format", "json").out)
    document = validate_document(stored.read_bytes())
    bounds = document["outcome"]["lowerBounds"]
    assert [bound["key"] for bound in bounds] == ["clgpu[0].CLBandwidth"]
    keys = next(device["keys"] for device in document["devices"] if device["tag"] == "clgpu[0]")
    assert not keys["CLBandwidth"]["known"]
    assert "number" not in keys["CLBandwidth"]
    words = "not known (the device's clock reported no elapsed time: 0; at least "
    assert words in joined(show(stored).text)
    page = show(stored, "--format", "html").text
    assert words in html.unescape(page)
    assert "Copy bandwidth (more is better)" not in page
    prometheus = show(stored, "--format", "prometheus").text
    assert "bytes_per_second{" not in prometheus
    assert host_run("check", "--from", str(stored), "--require", "CLBandwidth>=0").status == 7


def test_events_and_a_plain_report(tmp_path):
    failure = FAILURES["none"]
    events = tmp_path / "report.jsonl"
    events.write_bytes(test_usable.run(tmp_path, failure, "--format", "jsonl").out)
    document = validate_document(show(events, "--format", "json").out)
    assert document["outcome"]["verdict"] == "complete"
    plain = tmp_path / "report.txt"
    plain.write_bytes(b"".join((decode(line["text"]) + b"\n") for line in document["lines"]))
    shown = show(plain)
    assert shown.status == 0
    assert "how assay ended was not stored" in joined(shown.text)
    first = validate_document(show(plain, "--format", "json", "--schema", "1").out)
    assert [line["text"] for line in first["lines"]] == [line["text"] for line in document["lines"]]
    assert show(plain, "--format", "html").status == 0
    refused = show(plain, "--format", "json")
    assert (refused.status, refused.out) == (ERROR_STATUS, b"")
    assert text_of(refused.err) == (f"assay-host: {plain}: it does not say when and where the run was; "
                                    "use --schema 1, or another format\n")


@pytest.mark.parametrize("content, message", [
    (None, "can't open: No such file or directory"),
    ("", "neither a JSON document nor a report"),
    ("{}", 'the document: "schema" is missing'),
    ('{"schema": 3}', 'the document: "schema" is 3, and only 1 and 2 can be read'),
    ('{"schema": 2, "lines": []}', 'the document: "outcome" is missing'),
])
def test_what_is_no_report(tmp_path, content, message):
    file = tmp_path / "file"
    if content is not None:
        file.write_text(content)
    shown = show(file)
    assert (shown.status, shown.out) == (ERROR_STATUS, b"")
    assert text_of(shown.err) == f"assay-host: {file}: {message}\n"


def test_it_writes_a_file(tmp_path):
    stored = tmp_path / "report.json"
    stored.write_bytes(test_usable.run(tmp_path, FAILURES["none"], "--format", "json").out)
    page = tmp_path / "page.html"
    written = show(stored, "--format", "html", "--output", str(page))
    assert (written.status, written.out) == (0, b"")
    assert page.read_bytes() == show(stored, "--format", "html").out
    # A file has lines of its own width.
    shown = tmp_path / "shown"
    assert show(stored, "--output", str(shown)).status == 0
    assert max(map(len, shown.read_text(encoding="utf-8").splitlines())) in range(90, 101)
    assert max(map(len, show(stored).text.splitlines())) in range(70, 81)
    written = tmp_path / "written"
    test_usable.run(tmp_path, FAILURES["none"], "--output", str(written))
    assert max(map(len, written.read_text(encoding="utf-8").splitlines())) in range(90, 101)
    assert show(stored, "--format", "html", "--output", "/dev/stdout").out == page.read_bytes()
    failed = show(stored, "--output", str(tmp_path / "no" / "page"))
    assert failed.status == ERROR_STATUS
    assert text_of(failed.err).startswith("assay-host: cannot write ")
