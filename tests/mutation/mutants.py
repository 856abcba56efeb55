# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Small changes to C++ and Java sources, one at a time, each of which some test should notice."""

import re
from bisect import bisect_right
from dataclasses import dataclass
from itertools import accumulate, chain


@dataclass(frozen=True)
class Mutant:
    """One change: `before`, at an offset of a file, becomes `after`."""

    path: str  # relative to the project's root
    offset: int
    line: int  # from 1
    kind: str
    before: str
    after: str
    context: str  # the line as it stands, without indentation
    column: int  # in the context
    copy: int  # how many lines before read the same

    @property
    def key(self):
        """Names the change by content, so that it is found again when lines before it come or go."""
        copy = f" ({self.copy + 1})" if self.copy else ""
        return f"{self.path}: {self.context}{copy} @{self.column} {self.kind}: {self.before} -> {self.after}"

    def applied(self, text):
        end = self.offset + len(self.before)
        assert text[self.offset : end] == self.before
        return text[: self.offset] + self.after + text[end:]


# What is no code: comments, strings, characters, and directives with their continued lines.
NO_CODE = re.compile(
    r"""//[^\n]*|/\*.*?\*/|R"\((?:.*?)\)"|"(?:\\.|[^"\\\n])*"|'(?:\\.|[^'\\\n])'|^[ \t]*\#(?:\\\n|[^\n])*""",
    re.DOTALL | re.MULTILINE,
)
# Code of which no test can see a change: what only the compiler reads, what keeps it from a choice, and what is printed
# for people.
UNSEEN = re.compile(
    r"\basm(?: volatile)?\(.*?\);|static_assert\s*\(.*?;|\[\[.*?\]\]|^\s*(?:import|package|using|namespace)\b[^\n]*|^FASTCV_\w+\([^)]*\)",
    re.DOTALL | re.MULTILINE,
)


def blanked(text):
    """The text with all that is not to be changed blanked out, offsets kept."""

    def blank(match):
        return re.sub(r"[^\n]", " ", match.group())

    return UNSEEN.sub(blank, NO_CODE.sub(blank, text))


ARM = re.compile(r"defined\(__(?:ARM_NEON|aarch64__|x86_64__)\)")


def only_for(arm, path, text):
    """For each line whether it is compiled: True in a branch of the processor's own, False in the other's, else None.

    A header that is named after a processor is one branch.
    """
    named = re.search(r"_(arm|x86)\.h$", path)
    lines, branches = [], [(named.group(1) == "arm") == arm if named else None]
    for line in text.split("\n"):
        directive = re.match(r"\s*#\s*(if|ifdef|ifndef|else|elif|endif)\b(.*)", line)
        kind = directive.group(1) if directive else ""
        if kind.startswith("if"):
            about = ARM.search(directive.group(2))
            # Whether the branch that begins is the processor's.
            negated = about is not None and "!" in directive.group(2)[: about.start()]
            branches.append(None if about is None else (("x86" in about.group()) != arm) != negated)
        elif kind in ("else", "elif") and branches[-1] is not None:
            branches[-1] = not branches[-1]
        elif kind == "endif":
            branches.pop()
        lines.append(False if False in branches else True if True in branches else None)
    return lines


# The project's format puts blanks around binary operators and none into template arguments, so a sign with a blank on
# each side is an operator.
SWAPPED_OPERATORS = {
    "comparison": {"<": "<=", "<=": "<", ">": ">=", ">=": ">", "==": "!=", "!=": "=="},
    "sign": {"+": "-", "-": "+", "+=": "-=", "-=": "+="},
    "shift": {"<<": ">>", ">>": "<<", "<<=": ">>=", ">>=": "<<="},
    "condition": {"&&": "||", "||": "&&"},
}

# A rounding form of an intrinsic or of the vocabulary, and the form that rounds otherwise.
ROUNDING = [
    ("vrshrn_n", "vshrn_n"),
    ("vrshr_n", "vshr_n"),
    ("vrshrq_n", "vshrq_n"),
    ("vqrshrn_n", "vqshrn_n"),
    ("vqrshrun_n", "vqshrun_n"),
    ("vqrshrun_high_n", "vqshrun_high_n"),
    ("vrshrn_high_n", "vshrn_high_n"),
    ("vraddhn", "vaddhn"),
    ("vraddhn_high", "vaddhn_high"),
    ("vqrdmulh", "vqdmulh"),
    ("vcvtnq", "vcvtq"),
    ("vcvtaq", "vcvtq"),
    ("vrndnq", "vrndq"),
]

# A dimension or stride in the place of another.
DIMENSIONS = [
    ("width", "height"),
    ("inWidthStride", "outWidthStride"),
    ("inStride", "outStride"),
    ("srcStride", "dstStride"),
    ("rowStride", "pixelStride"),
    ("left", "top"),
    ("right", "bottom"),
    ("x", "y"),
    ("w", "h"),
]


def _swapped_operators(code):
    for kind, operators in SWAPPED_OPERATORS.items():
        for operator, other in operators.items():
            for match in re.finditer(rf"(?<=[\w)\]] ){re.escape(operator)}(?= )", code):
                yield kind, match.start(), operator, other


def _constants(code):
    for match in re.finditer(r"(?<![\w.\[])(\d+)(?=[uUlL]*(?![\w.]))|(?<=\[)(\d+)(?=\])", code):
        value = match.group()
        in_brackets = match.group(2) is not None
        before = code[max(0, match.start() - 7) : match.start()]
        kind = "channel" if in_brackets and re.search(r"\b(?:c|val|x)\[$", before) else "constant"
        step = -1 if kind == "channel" and int(value) > 1 else 1
        yield kind, match.start(), value, str(int(value) + step)
    for match in re.finditer(r"(?<![\w.])0x[0-9a-fA-F]+", code):
        yield "constant", match.start(), match.group(), hex(int(match.group(), 16) + 1)
    for match in re.finditer(r"(?<![\w.])\d+\.\d*(?=[fF]?(?![\w.]))", code):
        value = match.group() + ("0" if match.group().endswith(".") else "")
        decimals = len(value.split(".")[1])
        yield "constant", match.start(), match.group(), f"{float(value) + 10.0 ** -decimals:.{decimals}f}"
    for match in re.finditer(r"(?<=[=(,?:] )-(?=\d)|(?<=\()-(?=\d)", code):
        yield "sign", match.start(), "-", "+"


SIMPLE = r"[A-Za-z_]\w*(?:\[\w+\]|\.\w+)*"


def _swapped_operands(code):
    for match in re.finditer(rf"(?<![\w.\])])({SIMPLE}) ([-/%]) ({SIMPLE})(?![\w.(\[])", code):
        left, operator, right = match.groups()
        if left != right:
            yield "operands", match.start(), match.group(), f"{right} {operator} {left}"
    for match in re.finditer(rf"(?<=[a-z0-9_])\(({SIMPLE}), ({SIMPLE})\)(?! \{{| const|:| noexcept)", code):
        left, right = match.groups()
        # Which comes first makes no difference to these.
        if left != right and not re.search(r"\b(?:max|min|swap)$", code[: match.start()]):
            yield "operands", match.start(), match.group(), f"({right}, {left})"


def _dropped_statements(code):
    statement = re.compile(
        r"^[ \t]+((?!return\b|delete\b|throw\b|else\b|case\b|break\b|using\b)"
        r"(?:\*?[A-Za-z_][\w.:\[\]>-]*(?: [-+*/|&^]?=| <<=| >>=) [^;{}]+|[A-Za-z_][\w.:>-]*\([^;{}]*\));)[ \t]*$",
        re.MULTILINE,
    )
    for match in statement.finditer(code):
        # Where a statement begins, not an argument on a line of its own.
        if code[: match.start()].rstrip()[-1:] not in (";", "{", "}", ":", ")"):
            continue
        if "=" in match.group(1).split("(")[0] or not re.match(r"[A-Z]\w*\(", match.group(1)):
            yield "statement", match.start(1), match.group(1), ";"


def _rounding(code):
    for pair in ROUNDING:
        for name, other in (pair, pair[::-1]):
            for match in re.finditer(rf"(?<!\w){name}(?=_[suf](?:8|16|32|64)\b|_[suf](?:8|16|32|64)\()", code):
                yield "rounding", match.start(), name, other


def _dimensions(code):
    for pair in DIMENSIONS:
        for name, other in (pair, pair[::-1]):
            # An argument or operand; not a declaration, whose name follows a type.
            for match in re.finditer(rf"(?<=[(,\[*+<>=-] ){name}(?=[ ,;)\]])|(?<=[(\[]){name}(?=[ ,;)\]])", code):
                yield "dimension", match.start(), name, other


def mutants(path, text):
    """All changes to a file, in the order of the file."""
    code = blanked(text)
    lines = text.split("\n")
    starts = [0, *accumulate(len(line) + 1 for line in lines)]
    stripped = [line.strip() for line in lines]
    found = set()
    for kind, offset, before, after in chain(
        _swapped_operators(code),
        _constants(code),
        _swapped_operands(code),
        _dropped_statements(code),
        _rounding(code),
        _dimensions(code),
    ):
        index = bisect_right(starts, offset) - 1
        context = stripped[index]
        column = offset - starts[index] - lines[index].find(context)
        # What is blank in `code`, a comment within a statement, is taken along.
        before = text[offset : offset + len(before)]
        copy = stripped[:index].count(context)
        found.add(Mutant(path, offset, index + 1, kind, before, after, context, column, copy))
    return sorted(found, key=lambda mutant: (mutant.offset, mutant.kind, mutant.after))
