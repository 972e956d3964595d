#!/usr/bin/env python3
"""Prints how often scipy's test calls pairs of samples different at the level of 1 %, with the bounds
for 10000 pairs beyond which one of a thousand simulations lies. ChangeTestTest.cpp has these numbers."""

import numpy
from scipy.stats import binom, mannwhitneyu

LEVEL = 0.01
PAIRS = 200000
MORE = 0.001


def draw(generator, shape, shift):
    return 1 + shift + 0.05 * generator.standard_normal(shape)


def skewed(generator, shape, shift):
    """With ties, and with every tenth value up to twice as large."""
    values = draw(generator, shape, shift)
    return numpy.round(values * (1 + (generator.random(shape) < 0.1) * generator.random(shape)), 2)


def rate(size, make, shift, method):
    generator = numpy.random.default_rng(20261122)
    before, after = make(generator, (PAIRS, size), 0), make(generator, (PAIRS, size), shift)
    return float(numpy.mean(mannwhitneyu(before, after, axis=1, method=method).pvalue <= LEVEL))


for name, *case in [("same", 9, draw, 0, "exact"), ("same, ties", 29, skewed, 0, "asymptotic"),
                    ("shifted by 1.5 sigma", 9, draw, 0.075, "exact"),
                    ("shifted by 0.5 sigma, ties", 29, skewed, 0.025, "asymptotic")]:
    found = rate(*case)
    low, high = binom.ppf([MORE / 2, 1 - MORE / 2], 10000, found)
    print(f"{name}: {found:.5f}, {low:.0f} to {high:.0f} of 10000")
