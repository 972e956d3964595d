"""The schemas refuse what the documents of the host are not."""

import copy
import json
import os
import pathlib
import sys

import jsonschema
import pytest

sys.path.insert(0, str(pathlib.Path(__file__).parent))
import validate  # noqa: E402

# Members that a document may have or not.
OPTIONAL = {"number", "numbers", "flag", "cut", "series"}


def read(ending):
    files = sorted(pathlib.Path(os.environ["ASSAY_JSON"]).glob("*" + ending))
    assert files
    # The longest ones repeat themselves.
    return [path for path in files if path.stat().st_size < 100_000]


def objects(value, path=()):
    """Each object in a value, with the way to it."""
    if isinstance(value, dict):
        yield path
    items = value.items() if isinstance(value, dict) else enumerate(value)
    for key, item in items:
        if isinstance(item, (dict, list)):
            # One of a row of like things will do.
            if not (isinstance(key, int) and key > 1):
                yield from objects(item, path + (key,))


def find(value, path):
    for key in path:
        value = value[key]
    return value


def is_optional(path, key):
    if key in OPTIONAL:
        return "software" not in path and "series" not in path
    # Keys that the host doesn't know may come besides the known ones.
    return path and path[-1] == "keys" and key not in KNOWN


KNOWN = set()


def setup_module():
    definitions = validate.DOCUMENTS[2].schema["$defs"]["device"]["oneOf"]
    for device in definitions:
        KNOWN.update(device["properties"]["keys"]["required"])
    report = validate.DOCUMENTS[2].schema["properties"]["report"]["properties"]["keys"]
    KNOWN.update(report["required"])


def is_valid(validator, value):
    try:
        validator.validate(value)
    except jsonschema.ValidationError:
        return False
    return True


def check_strictness(validator, value):
    assert is_valid(validator, value)
    for path in objects(value):
        changed = copy.deepcopy(value)
        find(changed, path)["unheard"] = {}
        assert not is_valid(validator, changed), path
        for key in find(value, path):
            changed = copy.deepcopy(value)
            del find(changed, path)[key]
            assert is_valid(validator, changed) == bool(is_optional(path, key)), (path, key)
            changed = copy.deepcopy(value)
            find(changed, path)[key] = {"un": "heard"}
            assert not is_valid(validator, changed), (path, key)


def test_documents_have_all_their_members_and_no_others():
    # Each mutation validates the whole document again: a few of each schema will do.
    paths = read(".json")
    chosen = [path for path in paths if "NamesTheReasonForAMissingValue" in path.name][:2]
    chosen += [path for path in paths if "RestoresCutLines" in path.name][:1]
    chosen += [path for path in paths if "JsonSecondDocument.SaysWhatIsNotKnown" in path.name][:2]
    chosen += [path for path in paths if "JsonSeries.HasTheStatistics" in path.name][:1]
    documents = [json.loads(path.read_bytes()) for path in chosen]
    assert sorted(document["schema"] for document in documents) == [1, 1, 1, 2, 2, 2]
    for document in documents:
        check_strictness(validate.document_validator(document), document)


def test_the_schema_requires_the_keys_that_the_host_knows():
    seen = set()
    definitions = validate.DOCUMENTS[2].schema["$defs"]["device"]["oneOf"]
    required = {device["properties"]["kind"]["const"]: device["properties"]["keys"]["required"]
                for device in definitions}
    for path in read(".json"):
        for device in json.loads(path.read_bytes())["devices"]:
            keys = list(device["keys"])
            missing = {key for key in keys if device["keys"][key]["value"] is None}
            # A key that has no line is known, or it would not be there.
            assert keys[:len(required[device["kind"]])] == required[device["kind"]]
            assert missing <= set(required[device["kind"]])
            seen.add(device["kind"])
    assert seen == set(required)


def test_events_have_all_their_members_and_no_others():
    for path in read(".jsonl"):
        for line in path.read_text(encoding="utf-8").splitlines()[:6]:
            event = json.loads(line)
            check_strictness(validate.event_validator(event), event)


@pytest.mark.parametrize("schema", sorted(validate.SCHEMAS.glob("*.json")), ids=lambda p: p.name)
def test_schemas_are_schemas(schema):
    jsonschema.Draft202012Validator.check_schema(json.loads(schema.read_text()))


def test_bytes_come_back():
    samples = [bytes([first, second]) for first in range(256) for second in range(256)]
    samples += ["\uf77f\uf780\uf7ff\uf800".encode(), b"\xed\xa0\x80", b"\xf4\x90\x80\x80"]
    for sample in samples:
        text = validate.encode(sample)
        assert json.loads(json.dumps(text)).encode()
        assert validate.decode(text) == sample


def test_the_report_of_each_document_is_that_of_the_host():
    # The document that the unit tests make of all bytes in a row, decoded by other code than theirs.
    everything = bytes(range(256))
    reports = [
        validate.report_bytes(json.loads(path.read_bytes()))
        for path in read(".json")
        if "RestoresTheReportByteByByte" in path.name
    ]
    assert everything in reports
    assert b"# " + everything + b"\r\n\r\n" in reports


def test_no_constant_of_other_languages_is_json():
    for text in (b"NaN", b"[Infinity]", b"\xff", b"{"):
        with pytest.raises(ValueError):
            validate.validate_document(text)
