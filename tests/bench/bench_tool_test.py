# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Tests what scripts/bench makes of its measurements. Takes the folder of the package `tool`."""

import json
import sys
import types
import unittest
from pathlib import Path

BENCH = Path(sys.argv.pop(1))
sys.path.insert(0, str(BENCH))

from tool import model, newer_opencv, phone, record, table, timing  # noqa: E402  (found through the line above)
from tool.counting import NEWER_OPENCV, OPENCV, OWN, PEERS, Block, CallCount, Count, Key  # noqa: E402
from tool.timing import Contender, Time  # noqa: E402

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
        times = {Key("gray", library, SIZE): Time(4, milliseconds, own_time / milliseconds)
                 for library, milliseconds in (("fastcv", own_time), ("libyuv", 1.2), ("opencv", 1.0))}
        known = {"gray": {"by": "Another", "instructions": 0.8, "A55": 1.0}}
        return table.Figures([SIZE, ODD_SIZE], counts, cycles, times, known, {"gray": {"instructions": goal}})

    def shortfalls(self, **changes):
        return [(row[1], row[-1]) for row in table.arm64_shortfall_table(self.figures(**changes)).rows]

    def host_shortfalls(self, figures):
        return [row[2:] for row in table.host_shortfall_table(figures).rows]

    def test_the_floor_is_that_of_the_same_traffic(self):
        self.assertEqual(self.figures().operations, ["gray"])
        self.assertEqual(self.figures().cost("instructions", "gray", table.FLOOR), 0.25)

    def test_the_best_peer_may_be_one_that_was_not_run(self):
        self.assertEqual(self.figures().best_peer("A55", "gray"), (1.0, "Another"))
        self.assertEqual(self.figures().best_peer("N1", "gray"), (0.5, "libyuv"))

    def test_nothing_falls_short_at_the_marks(self):
        self.assertEqual(self.shortfalls(odd=0.7 * 1.14), [])
        nothing = table.arm64_shortfall_table(self.figures())
        self.assertEqual((nothing.plain(), nothing.markdown()), ("none", "none"))
        self.assertEqual(self.host_shortfalls(self.figures(own_time=1.04)), [])

    def test_each_mark_that_is_passed_is_listed(self):
        self.assertEqual(self.shortfalls(own=0.72, odd=0.72), [("instr/px", "goal")])
        self.assertEqual(self.shortfalls(own=0.85, odd=0.85, goal=1), [("instr/px", "Another")])
        self.assertEqual(self.shortfalls(odd=0.7 * 1.16), [(f"instr/px at {ODD_SIZE}", f"at {SIZE}")])
        self.assertEqual(self.shortfalls(own_cycles=0.6), [("N1 cycles/px", "libyuv")])
        self.assertEqual(self.shortfalls(own_cycles=1.1), [("A55 cycles/px", "Another"), ("N1 cycles/px", "libyuv")])

    def test_any_peer_that_is_faster_on_this_machine_is_listed(self):
        self.assertEqual(self.host_shortfalls(self.figures(own_time=1.06)), [["1.060", "1.000", "1.06", "opencv"]])
        figures = self.figures()
        figures.times[Key("gray", NEWER_OPENCV, SIZE)] = Time(4, 0.5, 2.0)
        self.assertEqual(self.host_shortfalls(figures), [["1.000", "0.500", "2.00", NEWER_OPENCV]])

    def test_a_part_of_a_peers_time_can_be_the_goal(self):
        figures = self.figures(own_time=0.9)
        figures.goals["gray"]["times"] = {"opencv": 0.6, "libyuv": 0.8, NEWER_OPENCV: 0.1}
        self.assertEqual(self.host_shortfalls(figures), [["0.900", "0.600", "1.50", "goal: 0.6 of opencv"]])

    def all_operations(self):
        """Everything that is recorded, with every figure there can be, and wide ones."""
        operations = [name for name, record in json.loads((BENCH / "expected.json").read_text()).items() if SIZE in record]
        keys = [Key(name, library, size) for name in operations for library in [OWN, *PEERS] for size in (SIZE, ODD_SIZE)]
        known = {name: {"by": "Another", "instructions": 10, "A55": 100.123, "N1": 10} for name in operations}
        return table.Figures(
            [SIZE, ODD_SIZE], {key: count_of(100.123) for key in keys},
            {key: {"A55": 100.123, "N1": 100.123} for key in keys},
            {Key(name, library, SIZE): Time(4, 100.123, 10.12)
             for name in operations for library in [OWN, *PEERS, NEWER_OPENCV]}, known, known)

    def test_what_is_printed_fits_a_terminal(self):
        figures = self.all_operations()
        self.assertGreater(len(figures.operations), 100)
        for text in (table.terminal_table(figures), table.host_shortfall_table(figures).plain(),
                     table.arm64_shortfall_table(figures).plain(), table.arm64_planes_table(figures).plain(),
                     table.host_planes_table(figures, [SIZE]).plain()):
            self.assertLessEqual(max(map(len, text.splitlines())), 120)

    def test_everything_is_printed_when_asked_for_or_when_it_fits(self):
        figures = self.all_operations()
        width = max(map(len, table.terminal_table(figures, wide=True).splitlines()))
        self.assertGreater(width, 200)
        self.assertIn("libyuv", table.terminal_table(figures, wide=True))
        self.assertNotIn("libyuv", table.terminal_table(figures))
        timed = table.Figures([SIZE], {}, {}, figures.times, {}, {})
        self.assertIn("libyuv", table.terminal_table(timed))

    def test_two_passes_stand_beside_the_pairs_that_they_equal(self):
        costs = {"pairs-to-RGBA-90": 1.9, "pairs-to-RGBA-90-mirrored": 1.8, "pairs-to-NV21": 0.2, "gray": 0.7,
                 "two-passes-NV21-to-RGBA-90": 2.4}
        counts = {Key(name, OWN, SIZE): count_of(cost) for name, cost in costs.items()}
        result = table.arm64_planes_table(table.Figures([SIZE], counts, {}, {}, {}, {}))
        self.assertEqual(result.names, ["operation", "instr", "instr two passes"])
        self.assertEqual(result.rows, [["pairs-to-RGBA-90", "1.900", "2.400"], ["pairs-to-RGBA-90-mirrored", "1.800", ""],
                                       ["pairs-to-NV21", "0.200", ""]])

    def test_columns_without_figures_are_left_out(self):
        names = table.operations_table(self.figures(), ["gray"], table.instruction_columns).names
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


class Timing(unittest.TestCase):
    def test_figures_are_medians_and_those_of_pairs(self):
        turns = []

        def contender(library, milliseconds):
            """One that slows down with every pass, as on a machine that becomes busy."""
            passes = []

            def prepare(size):
                self.assertEqual(size, (64, 48))
                passes.append(size)

                def run(calls):
                    turns.append(library)
                    return int(calls * milliseconds * len(passes) * 1e6)

                return run

            return Contender("gray", library, 4, prepare)

        times = timing.measured([contender(OWN, 3), contender(OPENCV, 2)], ["64x48"])
        middle = (timing.PASSES + 1) // 2
        self.assertEqual(times[Key("gray", OWN, "64x48")], Time(4, 3.0 * middle, 1.0))
        self.assertEqual(times[Key("gray", OPENCV, "64x48")], Time(4, 2.0 * middle, 1.5))
        self.assertEqual(turns.count(OWN), turns.count(OPENCV))

    def test_what_has_no_counterpart_has_no_ratio(self):
        times = timing.measured([Contender("floor", "memcpy", 4, lambda size: lambda calls: calls * 10**9)], ["1x1"])
        self.assertEqual(times, {Key("floor", "memcpy", "1x1"): Time(4, 1000.0, None)})


class NewerOpencv(unittest.TestCase):
    """Over a stand-in that tells what is called."""

    def called(self, name):
        calls = []

        def function(name):
            return lambda *arguments: calls.append((name, *arguments))

        codes = ["COLOR_BGR2HSV", "COLOR_HSV2BGR", "COLOR_BGRA2RGBA", "COLOR_YUV2RGBA_NV21", "COLOR_BGR2YUV_I420",
                 "COLOR_YUV2GRAY_420", "ROTATE_90_CLOCKWISE", "ROTATE_180", "ROTATE_90_COUNTERCLOCKWISE"]
        stand_in = types.SimpleNamespace(cvtColor=function("cvtColor"), rotate=function("rotate"),
                                         copyTo=function("copyTo"), **{code: code for code in codes})
        opencv = object.__new__(newer_opencv.NewerOpencv)
        opencv._cv2 = stand_in
        opencv._numpy = types.SimpleNamespace(shares_memory=lambda result, destination: True)
        opencv._picture = lambda width, height, channels, sample: f"{width}x{height} {sample}x{channels}"
        return calls[0] if opencv.prepared(name, (8, 4)) else None

    def test_names_tell_what_is_called(self):
        for name, call in {
            "BGR-to-HSV-f32": ("cvtColor", "8x4 f32x3", "COLOR_BGR2HSV", "8x4 f32x3", 3),
            "BGRA-to-HSV": ("cvtColor", "8x4 u8x4", "COLOR_BGR2HSV", "8x4 u8x3", 3),
            "HSV-to-BGRA": ("cvtColor", "8x4 u8x3", "COLOR_HSV2BGR", "8x4 u8x4", 4),
            "BGRA-to-RGBA": ("cvtColor", "8x4 u8x4", "COLOR_BGRA2RGBA", "8x4 u8x4", 4),
            "NV21-to-RGBA": ("cvtColor", "8x6 u8x1", "COLOR_YUV2RGBA_NV21", "8x4 u8x4", 4),
            "BGR-to-I420": ("cvtColor", "8x4 u8x3", "COLOR_BGR2YUV_I420", "8x6 u8x1", 0),
            "YUV-to-GRAY": ("cvtColor", "8x6 u8x1", "COLOR_YUV2GRAY_420", "8x4 u8x1", 1),
            "rotate90-u8x3": ("rotate", "8x4 u8x3", "ROTATE_90_CLOCKWISE", "4x8 u8x3"),
            "rotate180-f32x1": ("rotate", "8x4 f32x1", "ROTATE_180", "8x4 f32x1"),
        }.items():
            self.assertEqual(self.called(name), call, name)

    def test_what_python_has_not_is_left_out(self):
        for name in ("BGR-to-NV21", "pairs-to-RGBA", "crop-scaled-u8x1", "rotate90-NV21", "calcLuminance_BGRA"):
            self.assertIsNone(self.called(name), name)


class Phone(unittest.TestCase):
    TEXT = ("core\tsmall\t0\t1800000\ncounters\tyes\n"
            "result\tgray\tfastcv\t8x8\t4\t0\t0.5\t0.9\t0.7\n"
            "result\tgray\tlibyuv\t8x8\t4\t0\t0.6\t1\t0.8\n"
            "result\tfloor4.000000\tmemcpy\t8x8\t4\t0\t0.25\t-\t-\n"
            "core\tbig\t7\t0\ncounters\tPermission denied\n"
            "result\tgray\tfastcv\t8x8\t4\t7\t0.125\t-\t-\n")

    def test_every_core_has_its_columns(self):
        result = phone.table(phone.parsed(self.TEXT), "8x8")
        self.assertEqual(result.names, ["operation", "small ns", "small cycles", "small instr", "small libyuv ns",
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
