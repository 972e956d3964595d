"""Writes many mutants of a file into one source, of which a number chooses one at run time.

Lines keep their numbers, since the product reports some of them.
"""

DECLARED = b'extern "C" bool MutantIsOn(int number) noexcept;\n#line 1\n'


class Writer:
    """`mutants` is a list of (number, mutant), none of which is "alone"."""

    def __init__(self, source, mutants):
        self.source = source
        self.places = {}
        for number, mutant in mutants:
            self.places.setdefault((mutant.outer, mutant.form == "statement"), []).append((number, mutant))
        self.relaxed = dict(mutant.relaxed for _, mutant in mutants if mutant.relaxed)
        # From outside to inside; a statement holds the expression of the same extent.
        self.order = sorted(self.places, key=lambda place: (place[0][0], -place[0][1], not place[1]))

    def write(self):
        text = self.within(0, len(self.source))
        assert not self.order, f"places overlap: {self.order[0]}"
        return DECLARED + text

    def within(self, start, end):
        """The text from start to end with the next places that lie in it."""
        pieces, at = [], start
        while self.order and self.order[0][0][0] < end and self.order[0][0][1] <= end:
            place = self.order.pop(0)
            (first, last), statement = place
            pieces.append(self.plain(at, first))
            original = self.within(first, last)
            pieces.append(self.statement(original, place) if statement else self.expression(original, place))
            at = last
        pieces.append(self.plain(at, end))
        return b"".join(pieces)

    def plain(self, start, end):
        """The source itself, where what only the compiler had to know may be made at run time."""
        text = self.source[start:end]
        for at in sorted((at for at in self.relaxed if start <= at < end), reverse=True):
            text = text[:at - start] + self.relaxed[at] + text[at - start + len(b"constexpr"):]
        return text

    def statement(self, original, place):
        off = b" && ".join(b"!MutantIsOn(%d)" % number for number, _ in self.places[place])
        return b"{ if (" + off + b") { " + original + b" } }"

    def expression(self, original, place):
        text = b"(" + original + b")"
        if any(mutant.form == "condition" for _, mutant in self.places[place]):
            text = b"static_cast<bool>" + text
        for number, mutant in self.places[place]:
            text = b"(MutantIsOn(%d) ? (%s) : %s)" % (number, mutant.changed(self.source), text)
        return text
