"""The kept changes: what their files say, and where in a tree they belong.

A change is found by the code that it names. Comments, blanks and line breaks don't count, nor does the
folder of a file that was moved, so that a change survives most edits of what surrounds it.
"""
import bisect
import re

PLATFORMS = {"linux", "win"}
KEYS = ("program", "filter", "effect", "platform", "texts", "each")

TOKEN = re.compile(r"""
    (?P<text>(?:u8|[uUL])?(?:R"(?P<mark>[^()\\\s]*)\(.*?\)(?P=mark)"|"(?:\\.|[^"\\\n])*"))
  | (?P<code>\d[\w'.]* | '(?:\\.|[^'\\\n])+' | \w+)
  | (?P<nothing>//[^\n]* | /\*.*?\*/ | \s+)
  | (?P<other>.)
""", re.X | re.S)


class Misfit(Exception):
    """A change that doesn't fit the tree."""


def tokens(text):
    """(token, offset, kind) of all that counts."""
    for match in TOKEN.finditer(text):
        if match.lastgroup != "nothing":
            yield match[0], match.start(), match.lastgroup


def place(text, old):
    """Where the whole lines with the code of `old` stand in `text`: (begin, end)."""
    wanted = [token for token, _, _ in tokens(old)]
    if not wanted:
        raise Misfit("a change must name code that is there")
    there = list(tokens(text))
    names = [token for token, _, _ in there]
    line_ends = [match.start() for match in re.finditer("\n", text)]
    lines = [bisect.bisect(line_ends, offset) for _, offset, _ in there]
    found = []
    for first in range(len(names) - len(wanted) + 1):
        last = first + len(wanted) - 1
        if (names[first:last + 1] == wanted
                and (first == 0 or lines[first - 1] < lines[first])
                and (last + 1 == len(names) or lines[last] < lines[last + 1])):
            found.append((there[first][1], there[last][1] + len(names[last])))
    if len(found) != 1:
        raise Misfit(f"found {len(found)} times: {old!r}")
    begin, end = found[0]
    return text.rfind("\n", 0, begin) + 1, text.find("\n", end) + 1 or len(text)


def platform_of(path):
    return next((part for part in path.split("/") if part in PLATFORMS), "")


class Tree:
    """The sources of the product. None is written here."""

    def __init__(self, root):
        self.root = root
        self.names = [str(file.relative_to(root)) for folder in ("host", "pmutil", "qgf")
                      for file in (root / folder).rglob("*") if file.is_file()]

    def find(self, path):
        """The file of that path, or the only one with its name and platform."""
        if path in self.names:
            return path
        base = path.rsplit("/", 1)[-1]
        found = [name for name in self.names if name.rsplit("/", 1)[-1] == base
                 and platform_of(name) == platform_of(path)]
        if len(found) != 1:
            raise Misfit(f"{path}: no such file, and {len(found)} of its name")
        return found[0]

    def read(self, path):
        return (self.root / path).read_text(encoding="utf-8")


class Change:
    """One change of a patch: its program, filter and so on, and `edit(tree)`, the new texts by path."""

    all_at_once = None

    def __init__(self, patch, name, keys, edit):
        self.patch, self.name = patch, name
        self.program, self.filter, self.effect = (keys[key] for key in ("program", "filter", "effect"))
        self.platform = keys.get("platform", "linux")
        self.edit = edit


class TextChange(Change):
    """One letter more in one literal. All those of one patch have the same `all_at_once(tree)`: texts in
    which the variable SWITCH chooses at run time, by `number`, which of them is made."""

    SWITCH = "ASSAY_NAMED_TEXT"

    def __init__(self, patch, name, keys, edit, number, all_at_once):
        super().__init__(patch, name, keys, edit)
        self.number = number
        self.all_at_once = all_at_once


def load(path, tree):
    """The changes of one file. Raises Misfit if it can't be read or names files that aren't there."""
    head, _, diff = path.read_text(encoding="utf-8").partition("--- ")
    keys = dict(re.findall(rf"^# ({'|'.join(KEYS)}): (.+)$", head, re.M))
    missing = {"program", "filter", "effect"} - set(keys)
    if missing:
        raise Misfit(f"{path.name}: no {', '.join(sorted(missing))}")
    if "texts" in keys:
        paths = re.findall(r"^\+\+\+ b/(.+)$", path.read_text(encoding="utf-8"), re.M)
        return list(text_changes(path.stem, keys, paths, tree))
    found = [hunk for file in re.split(r"^--- ", diff, flags=re.M) for hunk in hunks(file)]
    if not found:
        raise Misfit(f"{path.name}: changes nothing")
    if "each" in keys:
        return [Change(path.stem, f"{path.stem} {number}", keys,
                       lambda tree, hunk=hunk: apply_hunks(tree, [hunk]))
                for number, hunk in enumerate(found, 1)]
    return [Change(path.stem, path.stem, keys, lambda tree: apply_hunks(tree, found))]


def hunks(file):
    """(path, old text, new text) of each hunk of one file's diff."""
    head, *bodies = re.split(r"^@@.*\n", file, flags=re.M)
    for body in bodies:
        path = re.search(r"^\+\+\+ b/(.+)$", head, re.M).group(1)
        lines = [line for line in body.splitlines(keepends=True) if line[0] in " +-"]
        yield (path, "".join(line[1:] for line in lines if line[0] != "+"),
               "".join(line[1:] for line in lines if line[0] != "-"))


def apply_hunks(tree, found):
    result = {}
    for path, old, new in found:
        path = tree.find(path)
        text = result.get(path) or tree.read(path)
        begin, end = place(text, old)
        result[path] = text[:begin] + new + text[end:]
    return result


def texts_behind(text, last):
    """(literal, offset) of each up to the bracket that closes `last`, or to the end of the statement."""
    in_bracket = last in "([{"
    depth = 1
    for token, offset, kind in tokens(text):
        if token in ("(", "[", "{"):
            depth += 1
        elif token in (")", "]", "}"):
            depth -= 1
        if depth == 0 if in_bracket else token == ";":
            return
        if kind == "text":
            yield token, offset


def text_changes(name, keys, paths, tree):
    """One change for each literal behind each place that matches `texts`."""
    found = []
    for path in map(tree.find, paths):
        text = tree.read(path)
        for start in re.finditer(keys["texts"], text):
            found += [(path, start.end() + offset, token)
                      for token, offset in texts_behind(text[start.end():], start[0][-1])]
    if not found:
        raise Misfit(f"{name}: no text")

    def all_at_once(tree):
        return {path: switched(tree.read(path), {offset: number for number, (there, offset, _)
                                                 in enumerate(found) if there == path})
                for path, _, _ in found}

    for number, (path, offset, token) in enumerate(found):
        base, line = path.rsplit("/", 1)[-1], tree.read(path).count("\n", 0, offset) + 1

        def edit(tree, path=path, offset=offset, token=token):
            text = tree.read(path)
            return {path: text[:offset] + lengthened(token) + text[offset + len(token):]}

        yield TextChange(name, f"{name} {base}:{line} {token}", keys, edit, number, all_at_once)


def lengthened(literal):
    at = re.match(r'\w*?R"[^(]*\(|\w*"', literal).end()
    return literal[:at] + "x" + literal[at:]


def switched(text, numbers):
    """The text in which each literal at one of the offsets can be lengthened at run time."""
    runs = []  # of literals that the compiler joins, and macros behind them
    in_run = False
    for token in tokens(text):
        if in_run and (token[2] == "text" or re.fullmatch(r"[A-Z]\w*", token[0])):
            runs[-1].append(token)
        else:
            in_run = token[2] == "text"
            if in_run:
                runs.append([token])
    for run in reversed(runs):
        begin, end = run[0][1], run[-1][1] + len(run[-1][0])
        choices = [(numbers[offset], " ".join(lengthened(token) if there == offset else token
                                              for token, there, _ in run))
                   for _, offset, _ in run if offset in numbers]
        if choices:
            text = (text[:begin] + "(" + "".join(f"::NamedText({number}) ? {choice} : "
                                                 for number, choice in choices)
                    + text[begin:end] + ")" + text[end:])
    return f"""#include <cstdlib>
static bool NamedText(int number)
{{
    static const char* const chosen = std::getenv("{TextChange.SWITCH}");
    return chosen != nullptr && std::atoi(chosen) == number;
}}
{text}"""
