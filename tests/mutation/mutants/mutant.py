"""One change to the product, and how it is told from all others when lines move."""
import hashlib
import re
from dataclasses import dataclass
from pathlib import PurePath

WORDS = re.compile(rb"//[^\n]*|/\*.*?\*/|\"(?:[^\"\\\n]|\\.)*\"|'(?:[^'\\\n]|\\.)*'|[A-Za-z_]\w*|[0-9][\w.]*"
                   rb"|<<=|>>=|->|::|<<|>>|<=|>=|==|!=|&&|\|\||\+\+|--|[-+*/%&|^]=|\S", re.S)
# How many words of the code before and after the change belong to its key.
AROUND = 10


def words(code):
    """The code's words, without comments, joined by single blanks."""
    found = [word for word in WORDS.findall(code) if not word.startswith((b"//", b"/*"))]
    return b" ".join(found).decode("utf-8", "surrogateescape")


@dataclass
class Mutant:
    """`start` to `end` becomes `new`. `outer` is what must be written twice to have both in one
    program: as an expression, as a statement, or not at all ("alone")."""

    path: str  # relative to the tree
    module: str
    line: int
    kind: str
    start: int
    end: int
    old: str
    new: str
    form: str
    outer: tuple
    relaxed: tuple  # (place of a "constexpr", what may stand there instead), or empty
    function: str
    before: str
    after: str

    @property
    def key(self):
        """What a judgement is filed under: neither folders nor line numbers are part of it."""
        return (PurePath(self.path).name, self.function, f"{self.before} [[ {self.old} ]] {self.after}",
                self.new)

    @property
    def name(self):
        """A short name that is the same in each run over the same code."""
        return hashlib.sha256("\0".join(self.key).encode("utf-8", "surrogateescape")).hexdigest()[:10]

    def __str__(self):
        new = self.new if self.new.strip() else "nothing"
        return f"{self.path}:{self.line} {self.function}: {self.kind}: {self.old}  ->  {new}"

    def changed(self, source):
        """The outer part of the source as this mutant has it, on one line."""
        start, end = self.outer
        new = self.new.encode("utf-8", "surrogateescape")
        return one_line(source[start:self.start] + new + source[self.end:end])


def one_line(code):
    """The code without comments and line ends: a copy must not move the lines that follow."""
    def shorten(match):
        word = match.group()
        return b" " if word.startswith((b"//", b"/*")) else word
    return WORDS.sub(shorten, code).replace(b"\\\n", b" ").replace(b"\n", b" ")


def context(source, start, end):
    """(before, after): the nearest words around a change."""
    before = words(source[max(0, source.rfind(b"\n", 0, max(0, start - 600)) + 1):start]).split(" ")
    after = words(source[end:end + 600]).split(" ")
    return " ".join(before[-AROUND:]), " ".join(after[:AROUND])
