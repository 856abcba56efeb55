# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Tests of the changes that a campaign makes."""

import unittest

from mutants import mutants, only_for


def changes(text, kind=None):
    return {
        (mutant.before, mutant.after) for mutant in mutants("f.cpp", text) if kind is None or mutant.kind == kind
    }


class Mutants(unittest.TestCase):
    def test_each_kind(self):
        self.assertIn(("<", "<="), changes("  if (a < b) {", "comparison"))
        self.assertIn(("!=", "=="), changes("  if (a != b) {", "comparison"))
        self.assertIn(("+", "-"), changes("  x = a + b;", "sign"))
        self.assertIn(("-", "+"), changes("constexpr int k = -43;", "sign"))
        self.assertIn((">>", "<<"), changes("  x = a >> b;", "shift"))
        self.assertIn(("&&", "||"), changes("  if (a && b) {", "condition"))
        self.assertIn(("43", "44"), changes("constexpr int k = -43;", "constant"))
        self.assertIn(("0x80", "0x81"), changes("  f(0x80);", "constant"))
        self.assertIn(("0.299", "0.300"), changes("  x = 0.299f;", "constant"))
        self.assertIn(("0", "1"), changes("  x = p.c[0];", "channel"))
        self.assertIn(("a - b", "b - a"), changes("  x = a - b;", "operands"))
        self.assertIn(("(a, b)", "(b, a)"), changes("  x = f(a, b);", "operands"))
        self.assertIn(("vqrshrn_n", "vqshrn_n"), changes("  x = vqrshrn_n_s16(a, n);", "rounding"))
        self.assertIn(("vaddhn", "vraddhn"), changes("  x = vaddhn_u16(a, b);", "rounding"))
        self.assertIn(("width", "height"), changes("  f(a, width);", "dimension"))

    def test_statements(self):
        text = "{\n  a = b;\n  call(a,\n      b);\n  p->q(r);\n  return a;\n  int c = 1;\n}\n"
        self.assertEqual(changes(text, "statement"), {("a = b;", ";"), ("call(a,\n      b);", ";"), ("p->q(r);", ";")})

    def test_leaves_what_is_no_code(self):
        for text in (
            "// a < b + 1",
            "/* a < b\n + 1 */",
            's = "a < b + 1";',
            "#define A(x) f(x, 1) \\\n    + 2 < 3",
            "#include <a1>",
            "static_assert(sizeof(T) == 4);",
            '  asm("" : "+w"(v[1]));',
            '  asm volatile("" ::: "memory");',
            "std::vector<int> v;",
            "std::swap(a, b);",
            "c = std::max(a, b);",
        ):
            self.assertEqual(changes(text), set(), text)

    def test_branches(self):
        text = "a\n#if defined(__ARM_NEON)\nb\n#  ifdef X\nc\n#  endif\n#else\nd\n#endif\n#if !defined(__ARM_NEON)\ne\n#endif\nf"
        for arm, own in ((True, "bc"), (False, "de")):
            lines = dict(zip(text.split("\n"), only_for(arm, "f.cpp", text)))
            for name in "abcdef":
                self.assertEqual(lines[name], None if name in "af" else name in own, name)

        for arm in (True, False):
            for own in (True, False):
                name = "f_arm.h" if arm == own else "f_x86.h"
                self.assertEqual(only_for(arm, name, "a\n#if X\nb\n#endif"), [own] * 4)

    def test_applies_at_its_place(self):
        text = "f(1);\nint a = 1;  // 1\n"
        found = [mutant for mutant in mutants("f.cpp", text) if mutant.line == 2]
        self.assertEqual([mutant.applied(text) for mutant in found], ["f(1);\nint a = 2;  // 1\n"])

    def test_names_by_content(self):
        (first,) = (m for m in mutants("f.cpp", "int a = 1;\n") if m.kind == "constant")
        (later,) = (m for m in mutants("f.cpp", "\n\n  int a = 1;\n") if m.kind == "constant")
        self.assertEqual(first.key, later.key)

    def test_two_on_a_line_have_two_names(self):
        keys = [mutant.key for mutant in mutants("f.cpp", "  x = p[i + 1] + q[i + 1];\n")]
        self.assertEqual(len(keys), len(set(keys)))


if __name__ == "__main__":
    unittest.main()
