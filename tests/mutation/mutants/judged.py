"""The list of mutants that a person found to change nothing that anybody could tell.

A block of lines each, blocks apart by an empty line:

    file: Buffer.cpp
    in: Buffer::Reserve
    code: WORDS BEFORE [[ THE OLD CODE ]] WORDS AFTER
    becomes: THE NEW CODE
    because: the reason

`code` is compared without regard to blanks and comments; neither folders nor line numbers count, so
that a judgement holds until the code around the place changes. A file may say "*" for `becomes`: what
holds for each change of the place.
"""
FIELDS = ("file", "in", "code", "becomes")


class Judgements:
    def __init__(self, path):
        self.reasons, self.used = {}, set()
        for number, block in enumerate(path.read_text().split("\n\n")):
            lines = [line for line in block.splitlines() if line and not line.startswith("#")]
            if not lines:
                continue
            fields = dict(line.split(": ", 1) if ": " in line else (line.rstrip(":"), "") for line in lines)
            if set(fields) != {*FIELDS, "because"} or not fields["because"]:
                raise ValueError(f"{path}: block {number + 1} lacks or repeats a field: {lines[0]}")
            self.reasons[tuple(fields[name] for name in FIELDS)] = fields["because"]

    def reason(self, mutant):
        """Why the mutant is equivalent, or None."""
        for key in (mutant.key, (*mutant.key[:3], "*")):
            if key in self.reasons:
                self.used.add(key)
                return self.reasons[key]
        return None

    def unused(self, mutants):
        """The judgements that fit none of these mutants."""
        keys = {mutant.key for mutant in mutants} | {(*mutant.key[:3], "*") for mutant in mutants}
        return [key for key in self.reasons if key not in keys]


def block(mutant, reason="?"):
    """The text of a judgement."""
    values = [f"{name}: {value}" for name, value in zip(FIELDS, mutant.key)]
    return "\n".join([*values, f"because: {reason}"])
