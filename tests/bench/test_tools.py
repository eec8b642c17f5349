"""What the benchmark's tools make of measured numbers."""

import pathlib
import sys
import unittest
import xml.etree.ElementTree

PROJECT = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(PROJECT / "bench/http"))

import document  # noqa: E402
import fit  # noqa: E402
import plot  # noqa: E402
import run_compare  # noqa: E402
import table  # noqa: E402

SIZES = (1, 10, 100, 1000, 10000)

# What the benchmark program prints.
PRINTED = """Medians of one interleaved run; the last columns are the ratio and the difference.

A whole process
  bare C++ program with the JSON library          400.00 us    1.00       +0.00 us
  entry.cgi answering ping                        500.00 us    1.25     +100.00 us

Elements
  1 element                                         9.50 us    1.00       +0.00 us
"""


def cost(fixed, slope, exponent):
    return [(size, fixed + slope * size ** exponent) for size in SIZES]


class Growth(unittest.TestCase):
    def test_finds_the_exponent_above_a_fixed_cost(self):
        for exponent in (0.5, 1.0, 1.5, 2.0):
            with self.subTest(exponent=exponent):
                growth = fit.grow(cost(0.003, 2e-5, exponent))
                self.assertAlmostEqual(growth.exponent, exponent, delta=0.02)

    def test_finds_the_exponent_in_spite_of_noise(self):
        noise = (1.04, 0.97, 1.03, 0.96, 1.02)
        points = [(size, value * factor)
                  for (size, value), factor in zip(cost(0.002, 1e-5, 1.0), noise)]
        self.assertAlmostEqual(fit.grow(points).exponent, 1.0, delta=0.08)

    def test_calls_a_straight_line_linear_and_a_square_worse(self):
        self.assertTrue(fit.grow(cost(0.003, 1e-4, 1.0)).is_linear_or_better())
        self.assertFalse(fit.grow(cost(0.003, 1e-6, 2.0)).is_linear_or_better())

    def test_calls_it_worse_where_only_the_largest_size_shows_it(self):
        points = [(1, 0.003), (10, 0.003), (100, 0.003), (1000, 0.0031), (10000, 0.013)]
        self.assertFalse(fit.grow(points).is_linear_or_better())

    def test_calls_flat_what_does_not_grow_by_half(self):
        self.assertTrue(fit.grow([(1, 0.003), (100, 0.0031), (10000, 0.0044)]).flat)
        self.assertFalse(fit.grow([(1, 0.003), (100, 0.0031), (10000, 0.0046)]).flat)

    def test_tells_what_a_unit_adds(self):
        self.assertAlmostEqual(fit.grow(cost(0.003, 2e-5, 1.0)).per_unit, 2e-5)


class Compare(unittest.TestCase):
    def test_reads_what_the_benchmark_program_prints(self):
        self.assertEqual(run_compare.rows_of(PRINTED), {
            ("A whole process", "bare C++ program with the JSON library"): 400.0,
            ("A whole process", "entry.cgi answering ping"): 500.0,
            ("Elements", "1 element"): 9.5})

    def test_prints_the_ratio_of_the_medians(self):
        lines = list(run_compare.table("before", [("Elements", "one", [4, 2, 3], [1, 6, 2])]))
        self.assertEqual(lines[-1].split(), ["one", "3.00", "2.00", "0.667"])

    def test_shows_a_row_that_only_one_side_has(self):
        lines = list(run_compare.table("before", [("Elements", "new", [], [5])]))
        self.assertEqual(lines[-1].split(), ["new", "-", "5.00", "-"])


class Document(unittest.TestCase):
    def test_has_one_place_for_each_result(self):
        text = document.DOCUMENT.read_text()
        for name in ("peers", "growth"):
            self.assertIn("\nresult\n", document.replace_between(text, name, "result"))

    def test_replaces_what_is_between_the_markers_and_nothing_else(self):
        text = "a\n<!-- x -->\nold\n\\1 old\n<!-- end of x -->\nb\n"
        self.assertEqual(document.replace_between(text, "x", r"new \1"),
                         "a\n<!-- x -->\nnew \\1\n<!-- end of x -->\nb\n")

    def test_refuses_a_document_without_the_markers(self):
        with self.assertRaises(SystemExit):
            document.replace_between("nothing", "x", "new")


class Tables(unittest.TestCase):
    def test_writes_durations_in_the_unit_that_fits(self):
        for value, text in ((2.5, "2.50 s"), (0.0123, "12.3 ms"), (4.56e-4, "456 µs"),
                            (7.8e-9, "7.80 ns"), (1.0, "1.00 s")):
            with self.subTest(value=value):
                self.assertEqual(table.seconds(value), text)

    def test_lines_up_columns(self):
        lines = table.markdown(["a", "n"], [["long", "1"], ["b", "1,000"]]).splitlines()
        self.assertEqual(lines, ["| a    |     n |", "|------|------:|", "| long |     1 |",
                                 "| b    | 1,000 |"])


class Plots(unittest.TestCase):
    def numbers(self, picture, tag, attribute):
        root = xml.etree.ElementTree.fromstring(picture)
        name = f"{{http://www.w3.org/2000/svg}}{tag}"
        return [element.get(attribute) for element in root.iter(name)]

    def test_makes_bars_as_long_as_their_values(self):
        picture = plot.bars("t", [("g", [("one", [100]), ("two <&>", [25])])], ["l"], "u")
        widths = [float(width) for width in self.numbers(picture, "rect", "width")[2:]]
        self.assertEqual(widths[0], 4 * widths[1])

    def test_says_so_where_nothing_was_measured(self):
        self.assertIn("not measured",
                      plot.bars("t", [("g", [("one", [1]), ("two", [None])])], ["l"], "u"))

    def test_draws_equal_ratios_as_equal_distances(self):
        line = [(1, 0.001), (10, 0.01), (100, 0.1)]
        picture = plot.panels("t", [("p", "n", [("s", line)])])
        across = [float(x) for x in self.numbers(picture, "circle", "cx")]
        up = [float(y) for y in self.numbers(picture, "circle", "cy")]
        self.assertAlmostEqual(across[1] - across[0], across[2] - across[1], delta=0.2)
        self.assertAlmostEqual(up[0] - up[1], up[1] - up[2], delta=0.2)


if __name__ == "__main__":
    unittest.main()
