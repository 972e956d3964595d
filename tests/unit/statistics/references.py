#!/usr/bin/env python3
"""Prints References.inc: samples with their summaries and rank tests, as exact fractions and scipy have
them. --check compares the file with that instead.

usage: references.py [--check]"""

import pathlib
import random
import statistics
import sys
from fractions import Fraction

try:
    import scipy
    from scipy.stats import mannwhitneyu
except ImportError:
    print("Skipped: scipy is not installed")
    sys.exit()

FILE = pathlib.Path(__file__).with_name("References.inc")
MAX_EXACT_PAIRS = 2500


def literals(values):
    return "{" + ", ".join(map(repr, values)) + "}"


def summary(sample):
    """The quartiles of the exact values, rounded once."""
    exact = [Fraction(value) for value in sample]
    low, middle, high = (exact * 3 if len(exact) == 1
                         else statistics.quantiles(exact, n=4, method="inclusive"))
    fence = Fraction(3, 2) * (high - low)
    return [float(value) for value in (min(exact), low, middle, high, max(exact), low - fence,
                                       high + fence)]


def rank_test(first, second):
    values = first + second
    exact = len(set(values)) == len(values) and len(first) * len(second) <= MAX_EXACT_PAIRS
    if len(set(values)) == 1:  # which has no variance
        return len(first) * len(second) / 2, 1.0, False
    found = mannwhitneyu(first, second, method="exact" if exact else "asymptotic")
    return float(found.statistic), float(found.pvalue), exact


def pairs():
    """Samples like those of measurements: without ties, rounded so that they have some, shifted, small,
    of very different sizes, all equal, beyond the limit of the exact distribution."""
    draw = random.Random(20261122)

    def sample(size, shift=0.0, digits=None):
        values = [8e11 * (1 + shift + 0.05 * draw.gauss(0, 1)) for _ in range(size)]
        return values if digits is None else [float(f"{value:.{digits}g}") for value in values]

    yield sample(1), sample(1)
    yield sample(2), sample(3)
    yield sample(4), sample(4, 0.5)
    yield sample(5), sample(5, 0.5)
    yield sample(9), sample(9, 0.05)
    yield sample(29), sample(29)
    yield sample(29), sample(29, 0.03)
    yield sample(50), sample(50, 0.02)
    yield sample(3), sample(200, 0.05)
    yield sample(50), sample(51, 0.02)
    yield sample(8, digits=1), sample(7, digits=1)
    yield sample(12, digits=2), sample(12, 0.05, digits=2)
    yield sample(40, digits=2), sample(70, 0.04, digits=2)
    yield [0.5, 0.5, 0.5], [0.5, 0.5]
    yield [1.0], [2.0]


def make():
    lines = [f"// Made by references.py with scipy {scipy.__version__}: two samples; minimum, quartiles,",
             "// maximum and fences of the first; U, p, and whether it is of the exact distribution."]
    for first, second in pairs():
        u, p, exact = rank_test(first, second)
        lines.append("{" + ",\n ".join([literals(first), literals(second), literals(summary(first)),
                                        f"{u!r}, {p!r}, {str(exact).lower()}"]) + "},")
    return "\n".join(lines) + "\n"


def tokens(text):
    """The numbers and words of the lines that are no comments."""
    code = "\n".join(line for line in text.splitlines() if not line.startswith("//"))
    return code.replace(",", " ").replace("{", " ").replace("}", " ").split()


def same(left, right):
    """Whether two tokens agree. Another version of scipy may differ in the last digits."""
    if left in ("true", "false"):
        return left == right
    return abs(float(left) - float(right)) <= 1e-12 * abs(float(left))


if sys.argv[1:] == ["--check"]:
    made, kept = tokens(make()), tokens(FILE.read_text())
    if len(made) != len(kept) or not all(map(same, made, kept)):
        sys.exit("References.inc differs: make it again")
else:
    print(make(), end="")
