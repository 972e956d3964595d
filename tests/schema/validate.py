#!/usr/bin/env python3
"""Validates JSON that the host made against the schemas that it ships.

usage: validate.py FILE-OR-FOLDER...

A .json file is a document, a .jsonl file has one event a line. A folder stands for what is in it,
and must hold something.
"""

import json
import pathlib
import sys

import jsonschema

SCHEMAS = pathlib.Path(__file__).resolve().parents[2] / "host" / "schema"


def _validator(name):
    schemas = {path.name: json.loads(path.read_text()) for path in SCHEMAS.glob("*.json")}
    schema = schemas[name]
    resolver = jsonschema.RefResolver.from_schema(schema, store=schemas)
    return jsonschema.Draft202012Validator(schema, resolver=resolver)


def _no_constant(name):
    raise ValueError(f"{name} is no JSON")


def _load(text):
    return json.loads(text, parse_constant=_no_constant)


# By the schema's number.
DOCUMENTS = {number: _validator(f"assay-report-{number}.schema.json") for number in (1, 2)}
EVENTS = {number: _validator(f"assay-events-{number}.schema.json") for number in (1, 2)}


ADVICE = _validator("assay-advice-1.schema.json")
DIFF = _validator("assay-diff-1.schema.json")


def validate_advice(data):
    """The advice in these bytes; raises for what is no JSON, or not of its schema."""
    advice = _load(data.decode("utf-8"))
    ADVICE.validate(advice)
    return advice


def validate_diff(data):
    """The differences in these bytes; raises as validate_advice does."""
    diff = _load(data.decode("utf-8"))
    DIFF.validate(diff)
    return diff


def document_validator(document):
    """The validator of the schema that the document names; raises KeyError for any other."""
    return DOCUMENTS[document["schema"]]


def event_validator(event):
    """The validator of an event that stands alone. Those of lines are the same in both schemas."""
    return EVENTS[event.get("schema", 2 if "usable" in event else 1)]


def validate_document(data):
    """The document in these bytes; raises for what is no JSON, or not of its schema."""
    document = _load(data.decode("utf-8"))
    document_validator(document).validate(document)
    return document


def validate_events(data):
    """The events in these bytes, one a line; raises as validate_document does. The first one names
    the schema of all, if it is the start."""
    events = [_load(line) for line in data.decode("utf-8").split("\n") if line]
    number = events[0].get("schema") if events else None
    for event in events:
        (EVENTS[number] if number else event_validator(event)).validate(event)
    return events


def encode(data):
    """Any bytes as the string that a document has for them."""
    text = data.decode("utf-8", "surrogateescape")
    return "".join(
        chr(0xF700 + ord(character) - 0xDC00)
        if 0xDC80 <= ord(character) <= 0xDCFF
        else "".join(chr(0xF700 + byte) for byte in character.encode())
        if 0xF780 <= ord(character) <= 0xF7FF
        else character
        for character in text
    )


def decode(text):
    """The bytes that a string of a document stands for."""
    return b"".join(
        bytes([ord(character) - 0xF700])
        if 0xF780 <= ord(character) <= 0xF7FF
        else character.encode()
        for character in text
    )


def report_bytes(document):
    """The report of a document as it came, byte by byte."""
    return b"".join(decode(line["text"]) + line["end"].encode() for line in document["lines"])


def main(arguments):
    files = []
    for argument in map(pathlib.Path, arguments):
        found = sorted(argument.glob("*.json*")) if argument.is_dir() else [argument]
        if not found:
            sys.exit(f"{argument}: nothing to validate")
        files += found
    failed = 0
    for path in files:
        validate = validate_events if path.suffix == ".jsonl" else validate_document
        try:
            validate(path.read_bytes())
        except (ValueError, jsonschema.ValidationError) as failure:
            failed += 1
            print(f"{path}: {failure}", file=sys.stderr)
    print(f"{len(files)} files, {failed} not valid")
    return failed > 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
