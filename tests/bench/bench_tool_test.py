# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Tests what scripts/bench makes of its measurements. Takes the folder of the package `tool`."""

import sys
import unittest

sys.path.insert(0, sys.argv.pop(1))

from tool import model, phone, record, table  # noqa: E402  (found through the line above)
from tool.counting import Block, CallCount, Count, Key, Time  # noqa: E402

SIZE, ODD_SIZE = "1280x720", "1278x718"
PIXELS = 1000


def count_of(per_pixel, traffic=4):
    return Count(traffic, PIXELS, per_pixel * PIXELS, {})


class Record(unittest.TestCase):
    RECORDED = {"gray": {SIZE: 0.7, ODD_SIZE: 0.71}, "track": {"call": 100}}

    def complaints(self, gray=0.7, track=100):
        return record.complaints(self.RECORDED, {"gray": {SIZE: gray, ODD_SIZE: 0.71}, "track": {"call": track}})

    def test_what_is_as_recorded_or_better_passes(self):
        self.assertEqual(self.complaints(), [])
        self.assertEqual(self.complaints(gray=0.3, track=1), [])

    def test_up_to_two_percent_more_pass(self):
        self.assertEqual(self.complaints(gray=0.7 * 1.019), [])
        self.assertEqual(self.complaints(track=101.9), [])

    def test_over_two_percent_more_fail(self):
        (line,) = self.complaints(gray=0.7 * 1.021)
        self.assertRegex(line, r"^gray, 1280x720: .*\+2\.1 %")
        (line,) = self.complaints(track=102.1)
        self.assertRegex(line, r"^track, call: .*\+2\.1 %")

    def test_every_size_is_compared(self):
        slow = {"gray": {SIZE: 0.7, ODD_SIZE: 0.8}, "track": {"call": 100}}
        (line,) = record.complaints(self.RECORDED, slow)
        self.assertIn(ODD_SIZE, line)

    def test_what_is_missing_on_either_side_fails(self):
        (line,) = record.complaints(self.RECORDED, {"gray": {SIZE: 0.7, ODD_SIZE: 0.71}})
        self.assertIn("not measured", line)
        (line,) = record.complaints(self.RECORDED, {**self.RECORDED, "new": {SIZE: 1}})
        self.assertIn("none recorded", line)
        (line,) = record.complaints(self.RECORDED, {**self.RECORDED, "gray": {SIZE: 0.7}})
        self.assertIn("not measured", line)

    def test_counts_of_other_tools_are_not_compared(self):
        recorded = {"clang": "19", "qemu": "7"}
        self.assertIsNone(record.difference(recorded, dict(recorded)))
        for here in ({"clang": "16", "qemu": "7"}, {"clang": "19", "qemu": "10"}):
            self.assertIn("clang 19 and qemu 7", record.difference(recorded, here))
            self.assertIn(f"clang {here['clang']} and qemu {here['qemu']}", record.difference(recorded, here))

    def test_figures_are_per_pixel_and_per_call(self):
        counts = {Key("gray", "fastcv", SIZE): count_of(0.7), Key("gray", "fastcv", ODD_SIZE): count_of(0.75)}
        kept = record.figures(counts, {"track": CallCount(machine_calls=4, instructions=130)})
        self.assertEqual(kept, {"gray": {SIZE: 0.7, ODD_SIZE: 0.75}, "track": {"call": 130}})


class HotStretches(unittest.TestCase):
    BEFORE, HEAD, REST, AFTER = "before", "head", "rest", "after"

    def stretches(self, executions):
        """Of a loop whose head begins in the block before it and whose rest is on the next page."""
        blocks = {
            1: Block(0x0ff0, (self.BEFORE, self.HEAD, self.HEAD, self.HEAD)),
            2: Block(0x0ff4, (self.HEAD, self.HEAD, self.HEAD)),
            3: Block(0x1000, (self.REST, self.REST)),
            4: Block(0x1008, (self.AFTER,)),
        }
        instructions = sum(len(blocks[block].words) * times for block, times in executions.items())
        return model._hot_stretches(Count(4, PIXELS, instructions, executions), blocks)

    def test_a_loop_that_a_page_cuts_is_one_stretch(self):
        self.assertEqual(self.stretches({1: 1, 2: 999, 3: 1000, 4: 1}), [((self.HEAD,) * 3 + (self.REST,) * 2, 1000)])

    def test_neighbours_that_run_less_often_are_not_part_of_it(self):
        hot = self.stretches({2: 1000, 3: 500})
        self.assertEqual(hot, [((self.HEAD,) * 3, 1000), ((self.REST,) * 2, 500)])


class Tables(unittest.TestCase):
    def figures(self, own=0.7, odd=0.7, goal=0.7, own_cycles=0.5, own_time=1.0):
        counts = {
            Key("gray", "fastcv", SIZE): count_of(own),
            Key("gray", "fastcv", ODD_SIZE): count_of(odd),
            Key("gray", "libyuv", SIZE): count_of(0.9),
            Key("floor4", "memcpy", SIZE): count_of(0.25),
        }
        cycles = {
            Key("gray", "fastcv", SIZE): {"A55": own_cycles, "N1": own_cycles},
            Key("gray", "libyuv", SIZE): {"A55": 2.0, "N1": 0.5},
        }
        times = {Key("gray", "fastcv", SIZE): Time(4, own_time), Key("gray", "libyuv", SIZE): Time(4, 1.2),
                 Key("gray", "opencv", SIZE): Time(4, 1.0)}
        known = {"gray": {"by": "Another", "instructions": 0.8, "A55": 1.0}}
        return table.Figures([SIZE, ODD_SIZE], counts, cycles, times, known, {"gray": {"instructions": goal}})

    def shortfalls(self, **changes):
        return [(row[1], row[-1]) for row in table.shortfall_table(self.figures(**changes)).rows]

    def test_the_floor_is_that_of_the_same_traffic(self):
        self.assertEqual(self.figures().operations, ["gray"])
        self.assertEqual(self.figures().cost("instructions", "gray", table.FLOOR), 0.25)

    def test_the_best_peer_may_be_one_that_was_not_run(self):
        self.assertEqual(self.figures().best_peer("A55", "gray"), (1.0, "Another"))
        self.assertEqual(self.figures().best_peer("N1", "gray"), (0.5, "libyuv"))

    def test_nothing_falls_short_at_the_marks(self):
        self.assertEqual(self.shortfalls(odd=0.7 * 1.14, own_time=1.49), [])
        nothing = table.shortfall_table(self.figures())
        self.assertEqual((nothing.plain(), nothing.markdown()), ("none", "none"))

    def test_each_mark_that_is_passed_is_listed(self):
        self.assertEqual(self.shortfalls(own=0.72, odd=0.72), [("instr/px", "goal")])
        self.assertEqual(self.shortfalls(odd=0.7 * 1.16), [(f"instr/px at {ODD_SIZE}", f"at {SIZE}")])
        self.assertEqual(self.shortfalls(own_cycles=0.6), [("N1 cycles/px", "libyuv")])
        self.assertEqual(self.shortfalls(own_cycles=1.1), [("A55 cycles/px", "Another"), ("N1 cycles/px", "libyuv")])
        self.assertEqual(self.shortfalls(own_time=1.51), [("host ms", "opencv")])

    def test_columns_without_figures_are_left_out(self):
        names = table.operations_table(self.figures(), table.instruction_columns).names
        self.assertIn("instr libyuv", names)
        self.assertNotIn("instr opencv", names)

    def test_plain_columns_are_as_wide_as_what_is_in_them(self):
        text = table.Table(["operation", "instr of", "empty"], [["gray", "0.7", ""], ["a long name", "12.25", ""]]).plain()
        self.assertEqual(text.splitlines(), [
            "             instr",
            "operation       of",
            "------------------",
            "gray           0.7",
            "a long name  12.25",
        ])

    def test_a_small_call_is_compared_with_the_pixels_of_a_large_one(self):
        key = Key("gray", "fastcv", "10x10")
        small = table.Figures(["10x10"], {key: count_of(1.7)}, {key: {"A55": 2, "N1": 1}}, {}, {}, {})
        (row,) = table.small_call_table(small, "10x10", self.figures()).rows
        self.assertEqual(row, ["gray", "170", "100", "200", "100"])


class Phone(unittest.TestCase):
    TEXT = ("core\tsmall\t0\t1800000\ncounters\tyes\n"
            "result\tgray\tfastcv\t8x8\t4\t0\t0.5\t0.9\t0.7\n"
            "result\tgray\tlibyuv\t8x8\t4\t0\t0.6\t1\t0.8\n"
            "result\tfloor4.000000\tmemcpy\t8x8\t4\t0\t0.25\t-\t-\n"
            "core\tbig\t7\t0\ncounters\tPermission denied\n"
            "result\tgray\tfastcv\t8x8\t4\t7\t0.125\t-\t-\n")

    def test_every_core_has_its_columns(self):
        result = phone.table(phone.parsed(self.TEXT), "8x8")
        self.assertEqual(result.names, ["operation", "small ns", "small cycles", "small instructions", "small libyuv ns",
                                        "small memcpy ns", "big ns"])
        self.assertEqual(result.rows, [["gray", "0.500", "0.900", "0.700", "0.600", "0.250", "0.125"]])

    def test_cores_say_what_they_are(self):
        small, big = phone.parsed(self.TEXT).cores
        self.assertEqual(small.title, "small core (number 0, 1.80 GHz)")
        self.assertEqual((big.title, big.counters), ("big core (number 7)", "Permission denied"))

    def test_no_results_are_an_error(self):
        with self.assertRaises(ValueError):
            phone.parsed("core\tonly\t0\t0\n")


if __name__ == "__main__":
    unittest.main()
