"""How a cost grows: the curve fixed + slope · n^exponent that fits the measured points."""

# Growth over the whole range that is less than this is called none.
FLAT = 1.5
# What a measured exponent may be above 1 for the growth to count as linear.
LINEAR = 1.1


class Growth:
    def __init__(self, exponent, per_unit, flat):
        self.exponent = exponent
        self.per_unit = per_unit  # of the largest, above the smallest
        self.flat = flat

    def is_linear_or_better(self):
        return self.flat or self.exponent <= LINEAR

    def words(self):
        if self.flat:
            return "flat"
        verdict = "linear or better" if self.is_linear_or_better() else "worse than linear"
        return f"exponent {self.exponent:.2f}: {verdict}"


def _least_squares(points, exponent):
    """(error, fixed, slope) with neither negative; each point counts by its ratio."""
    terms = [(n ** exponent / cost, 1 / cost) for n, cost in points]
    xx = sum(x * x for x, _ in terms)
    xw = sum(x * w for x, w in terms)
    ww = sum(w * w for _, w in terms)
    x1, w1 = sum(x for x, _ in terms), sum(w for _, w in terms)
    determinant = xx * ww - xw * xw
    candidates = [(0.0, x1 / xx), (w1 / ww, 0.0)]
    if determinant > 1e-12 * xx * ww:
        candidates.append(((w1 * xx - x1 * xw) / determinant, (x1 * ww - w1 * xw) / determinant))
    return min((sum((fixed * w + slope * x - 1) ** 2 for x, w in terms), fixed, slope)
               for fixed, slope in candidates if fixed >= 0 and slope >= 0)


def grow(points):
    """Of (n, cost) pairs, n ascending."""
    (first, least), (last, most) = points[0], points[-1]
    per_unit = (most - least) / (last - first)
    if most < FLAT * least:
        return Growth(0.0, per_unit, True)
    exponents = [step / 100 for step in range(5, 301)]
    best = min(exponents, key=lambda exponent: _least_squares(points, exponent)[0])
    return Growth(best, per_unit, False)
