"""assay-host diff: its forms agree, and say of every answer of two runs whether it differs."""

import json
import re
from html.parser import HTMLParser

import pytest

import test_usable
from hosting import decode, host_run, text_of
from test_usable import FAILURES
from validate import validate_diff

pytestmark = test_usable.pytestmark

# What the page calls the groups of the document.
TITLES = {"The run": "run", "What can be used": "usable", "Trials": "trials", "Devices": "devices",
          "Facts": "facts", "Measurements": "measurements", "Name and time": "identity",
          "Other lines": "others"}
MEASURED = ("CLBandwidth", "CLCompute")


class Page(HTMLParser):
    """The rows of a page of differences, and its list of what is the same."""

    def __init__(self, text):
        super().__init__()
        self.rows = []  # (group, [texts])
        self.same = {}
        self.group = self.term = self.text = ""
        self.table = None
        self.feed(text)

    def handle_starttag(self, tag, attributes):
        if tag in ("h1", "h2", "h3", "th", "td", "dt", "dd", "caption"):
            self.text = ""
        if tag == "main":
            self.same = {}  # not the terms of the header
        if tag == "table":
            self.table = dict(attributes).get("class")
        if tag == "tr" and self.table == "diff":
            self.rows.append((self.group, []))

    def handle_data(self, data):
        self.text += data

    def handle_endtag(self, tag):
        if tag == "h1":
            self.headline = self.text
        if tag == "h2":
            self.group = TITLES.get(self.text, "")
        if tag in ("th", "td") and self.table == "diff":
            self.rows[-1][1].append(self.text)
        if tag == "dt":
            self.term = self.text
        if tag == "dd":
            self.same[self.term] = self.text


def answers(document):
    """The values of a document, by device and key."""
    found = {}
    for line in document["lines"]:
        if line["kind"] == "value":
            device, key, value = re.fullmatch(r"(?:([gc]lgpu\[\d+\])\.)?(.*?)=(.*)", line["text"]).groups()
            found[device or "", key] = value
    return found


def differs(key, before, after):
    if key not in MEASURED:
        return before != after
    before, after = float(before), float(after)
    return abs(before - after) > 0.1 * max(before, after)


@pytest.fixture(scope="module", name="good")
def good_run(tmp_path_factory):
    folder = tmp_path_factory.mktemp("good")
    (folder / "good.json").write_bytes(
        test_usable.run(folder, FAILURES["none"], "--format", "json").out)
    return folder / "good.json"


@pytest.mark.parametrize("name", FAILURES)
def test_the_forms_agree(good, tmp_path, name):
    other = tmp_path / "other.json"
    other.write_bytes(test_usable.run(tmp_path, FAILURES[name], "--format", "json").out)
    text = host_run("diff", good, other)
    made = {form: host_run("diff", "--format", form, good, other) for form in ("json", "html")}
    assert {each.status for each in made.values()} == {text.status}
    comparison, = validate_diff(made["json"].out)["comparisons"]
    differences = comparison["differences"]
    assert comparison["same"] == (text.status == 0) == (differences == [])

    # A line of the text form, and a row of the page, for each difference, in one order.
    page = Page(made["html"].text)
    rows = [(group, row) for group, row in page.rows if row[0] != "What"]
    assert page.headline == comparison["headline"]
    assert len(text.text.splitlines()) == len(rows) == len(differences)
    for line, (group, row), difference in zip(text.text.splitlines(), rows, differences):
        assert group == difference["group"]
        note = f" ({difference['note']})" if difference["note"] else ""
        device = difference["deviceBefore"] or difference["deviceAfter"]
        label = difference["label"] + (f" {device}" if device else "")
        assert row == [label, difference["before"]["text"], difference["after"]["text"] + note]
        if difference["key"] is None:
            assert line.startswith(f"{device} ")
            continue
        values = [difference[side]["value"] for side in ("before", "after")]
        if group == "others":
            which = "second" if values[0] is None else "first"
            whole = decode(next(filter(None, values))).decode()
            assert line == f"other line, only in the {which} report: {whole}"
            continue
        # A key that no report should have lacks nothing where it is missing.
        shown = [re.escape(decode(value).decode()) if value is not None
                 else "missing" if difference[side]["text"] == "not in the report" else r"missing \(.*\)"
                 for side, value in zip(("before", "after"), values)]
        key = f"{device}.{difference['key']}" if device else difference["key"]
        assert re.fullmatch(rf'{re.escape(key)}: "?{shown[0]}"? -> "?{shown[1]}"?{re.escape(note)}', line)

    # Every answer of the two documents is the same, differs, or wasn't reached by one run.
    before, after = (answers(json.loads(file.read_bytes())) for file in (good, other))
    differing = {(each["deviceBefore"] or each["deviceAfter"] or "", each["key"]) for each in differences}
    only = sum(int(count) for each in differences for count in re.findall(r"(\d+) answers? only", each["note"] or ""))
    lost = {each["deviceBefore"] or each["deviceAfter"] for each in differences if each["key"] is None}
    ignored = ("assayStart", "assayEnd")
    unmatched = 0
    for place in before.keys() | after.keys():
        if place[1] in ignored or place[1].startswith("gputag.") or place[0] in lost:
            continue
        if place in before and place in after:
            assert (place in differing) == differs(place[1], before[place], after[place])
        elif place not in differing:
            unmatched += 1
    assert unmatched == only
    assert len(page.same) == sum(
        place in after and place not in differing and place[1] not in ignored
        and not place[1].startswith("gputag.") for place in before)


def test_it_writes_a_file(good, tmp_path):
    page = tmp_path / "page.html"
    written = host_run("diff", "--format", "html", "--output", str(page), good, good)
    assert (written.status, written.out) == (0, b"")
    assert page.read_bytes() == host_run("diff", "--format", "html", good, good).out
    assert host_run("diff", "--format", "html", "--output", "/dev/stdout", good, good).out == page.read_bytes()
    lines = host_run("diff", "--output", str(tmp_path / "lines"), good, good)
    assert (lines.status, lines.out, (tmp_path / "lines").read_bytes()) == (0, b"", b"")


@pytest.mark.parametrize("form", ["text", "json", "html"])
def test_no_file_is_left_of_nothing(good, tmp_path, form):
    """If no report can be compared with the first one."""
    output = tmp_path / "output"
    for files in ([good, tmp_path / "missing"], [tmp_path / "missing", good]):
        run = host_run("diff", "--format", form, "--output", str(output), *files)
        assert (run.status, run.out) == (2, b"")
        assert text_of(run.err) == f"assay-host: {tmp_path / 'missing'}: can't open: No such file or directory\n"
        assert list(tmp_path.iterdir()) == []


def test_some_files_cannot_be_read(good, tmp_path):
    run = host_run("diff", "--format", "json", good, tmp_path / "missing", good)
    assert run.status == 2
    diff = validate_diff(run.out)
    assert (diff["before"], [each["after"] for each in diff["comparisons"]]) == (str(good), [str(good)])


def test_each_line_names_its_file_once(tmp_path):
    """Also where the text is longer than the blocks that are written."""
    files = []
    for name in ("first", "second", "third"):
        files.append(tmp_path / name)
        lines = "".join(f"a line of {name} {number}\n" for number in range(2000))
        files[-1].write_text(f'assayStart="x"\n{lines}assayEnd="y"\n', encoding="ascii")
    single = [host_run("diff", files[0], other).text for other in files[1:]]
    assert all(len(text) > 2 * 65536 for text in single)
    assert host_run("diff", *files).text.splitlines() == [
        f"{other}: {line}" for other, text in zip(files[1:], single) for line in text.splitlines()]
