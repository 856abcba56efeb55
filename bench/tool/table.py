# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""The tables that scripts/bench prints and writes."""

import dataclasses

from .counting import FLOOR, LIBYUV, NEWER_OPENCV, OWN, PEERS, Key
from .model import CORES

NO_ROWS = "none"
# What a terminal has room for.
TERMINAL_WIDTH = 120

# What an operation may cost more at another size.
TAIL_FACTOR = 1.15
# Goals and the figures of others are written with two digits, some with more.
ROUNDING_FACTOR = 1.01
# What timings of one code may differ by.
TIMING_FACTOR = 1.05

# A camera's planes, and what they replace.
PLANES = ("pairs-", "planes-", "two-passes-")


@dataclasses.dataclass
class Figures:
    """All that was measured, and what it is compared with. Figures are per pixel."""

    sizes: list  # at the first everything is measured, at the others this project's own operations
    counts: dict  # counting.Count by counting.Key
    cycles: dict  # {core: cycles} by Key
    times: dict  # timing.Time by Key
    known: dict  # {operation: {"by": library, "instructions" or core: figure}} of libraries that no package brings
    goals: dict  # {operation: {"instructions" or core: figure, "times": {peer: part of its time on this machine}}}

    def __post_init__(self):
        measured = {**self.counts, **self.times}
        self.operations = list(dict.fromkeys(key.operation for key in measured if key.library != FLOOR))
        self.planes = [operation for operation in self.operations if operation.startswith(PLANES)]
        # A floor belongs to all operations of a traffic.
        floors = {figure.traffic: key.operation for key, figure in measured.items() if key.library == FLOOR}
        self._floor_of = {key.operation: floors.get(figure.traffic) for key, figure in measured.items()}

    def _key(self, operation, library, size):
        return Key(self._floor_of[operation] if library == FLOOR else operation, library, size or self.sizes[0])

    def cost(self, what, operation, library, size=None):
        """Instructions, or the cycles of a core; None where there is no figure."""
        key = self._key(operation, library, size)
        if what in CORES:
            return self.cycles.get(key, {}).get(what)
        return self.counts[key].per_pixel if key in self.counts else None

    def time(self, operation, library, size=None):
        """The Time, or None."""
        return self.times.get(self._key(operation, library, size))

    def milliseconds(self, operation, library, size=None):
        time = self.time(operation, library, size)
        return time.milliseconds if time else None

    def best_known(self, what, operation):
        return self.known.get(operation, {}).get(what) if self.counts else None

    def goal(self, what, operation):
        return self.goals.get(operation, {}).get(what) if self.counts else None

    def best_peer(self, what, operation):
        """(figure, library) of the peer that needs least, or None."""
        costs = [(self.cost(what, operation, library), library) for library in PEERS]
        costs.append((self.best_known(what, operation), self.known.get(operation, {}).get("by")))
        return min((cost for cost in costs if cost[0] is not None), default=None)

    def better_time(self, operation):
        """(milliseconds, library, this project's time as a multiple) of the fastest peer on this machine, or None."""
        times = [(self.time(operation, library), library) for library in [*PEERS, NEWER_OPENCV]]
        return min(((time.milliseconds, library, time.own_ratio) for time, library in times if time), default=None)


@dataclasses.dataclass
class Table:
    """Columns of names and cells, as text; those without any figure are left out. Without rows it is "none"."""

    names: list
    rows: list

    def __post_init__(self):
        filled = [index for index in range(len(self.names)) if any(row[index] for row in self.rows)]
        self.names = [self.names[index] for index in filled]
        self.rows = [[row[index] for index in filled] for row in self.rows]

    def markdown(self):
        if not self.rows:
            return NO_ROWS
        lines = [self.names, ["---"] + ["--:"] * (len(self.names) - 1), *self.rows]
        return "\n".join("| " + " | ".join(line) + " |" for line in lines)

    def plain(self):
        """Columns as wide as their figures; the names above them word by word, but for the first."""
        if not self.rows:
            return NO_ROWS
        heads = [self.names[:1], *(name.split() for name in self.names[1:])]
        height = max(len(words) for words in heads)
        lines = [[([""] * (height - len(words)) + words)[line] for words in heads] for line in range(height)]
        lines += self.rows
        widths = [max(len(line[index]) for line in lines) for index in range(len(self.names))]

        def line_of(cells):
            cells = [cell.rjust(width) if index else cell.ljust(width)
                     for index, (cell, width) in enumerate(zip(cells, widths))]
            return "  ".join(cells).rstrip()

        text = [line_of(line) for line in lines]
        text.insert(height, "-" * max(len(line) for line in text))
        return "\n".join(text)


def _text(figure):
    return "" if figure is None else f"{figure:.3f}"


def _cost_columns(figures, what, unit):
    """[(name, cell of an operation)] of the instructions, or of a core's cycles."""

    def of(library, size=None):
        return lambda operation: _text(figures.cost(what, operation, library, size))

    columns = [(f"{unit} {OWN}", of(OWN))]
    columns += [(f"{unit} at {size}", of(OWN, size)) for size in figures.sizes[1:]]
    columns += [(f"{unit} {peer}", of(peer)) for peer in PEERS]
    columns.append((f"{unit} best known", lambda operation: _text(figures.best_known(what, operation))))
    columns.append((f"{unit} {FLOOR}", of(FLOOR)))
    columns.append((f"{unit} goal", lambda operation: _text(figures.goal(what, operation))))
    return columns


def instruction_columns(figures):
    return _cost_columns(figures, "instructions", "instr")


def cycle_columns(figures):
    return [column for core in CORES for column in _cost_columns(figures, core, core)]


def host_columns(figures):
    columns = [
        (f"ms {library}", lambda operation, of=library: _text(figures.milliseconds(operation, of)))
        for library in [OWN, *PEERS, NEWER_OPENCV, FLOOR]
    ]
    columns.append(_times_the_better_peer(figures))
    return columns


def _times_the_better_peer(figures):
    def cell(operation):
        peer = figures.better_time(operation)
        return f"{peer[2]:.2f}" if peer and peer[2] is not None else ""

    return "times the better peer", cell


def summary_columns(figures):
    """Of the peers the best alone, which a terminal has room for."""

    def best(what):
        return lambda operation: _text((figures.best_peer(what, operation) or [None])[0])

    columns = []
    for what, unit in [("instructions", "instr"), *((core, core) for core in CORES)]:
        columns.append((f"{unit} {OWN}", lambda operation, what=what: _text(figures.cost(what, operation, OWN))))
        columns.append((f"{unit} best peer", best(what)))
    columns.insert(2, ("instr goal", lambda operation: _text(figures.goal("instructions", operation))))
    columns.append((f"ms {OWN}", lambda operation: _text(figures.milliseconds(operation, OWN))))
    columns.append(("ms best peer", lambda operation: _text((figures.better_time(operation) or [None])[0])))
    columns.append(_times_the_better_peer(figures))
    return columns


LEGEND = "instr: instructions per pixel; A55, N1: model cycles per pixel; ms: milliseconds on this machine"


def operations_table(figures, operations, *column_groups):
    """The operations, with the columns that the groups give; LEGEND says what they are."""
    columns = [("operation", lambda operation: operation)]
    for group in column_groups:
        columns += group(figures)
    return Table([name for name, _ in columns], [[cell(operation) for _, cell in columns] for operation in operations])


def terminal_table(figures, wide=False):
    """All that there is of the operations as text: every column when asked for, or where a terminal has room for them."""
    whole = operations_table(figures, figures.operations, instruction_columns, cycle_columns, host_columns).plain()
    if wide or max(map(len, whole.splitlines())) <= TERMINAL_WIDTH:
        return whole
    return operations_table(figures, figures.operations, summary_columns).plain()


SHORTFALL_NAMES = ["operation", "unit", OWN, "to compare with", "times", "whose"]


def arm64_shortfall_table(figures):
    """Where the operations miss a goal, a peer is ahead, or a tail costs too much."""
    rows = []

    def compare(operation, unit, own, mark, whose, factor=ROUNDING_FACTOR):
        if own is not None and mark is not None and own > mark * factor:
            rows.append([operation, unit, f"{own:.3f}", f"{mark:.3f}", f"{own / mark:.2f}", whose])

    for operation in figures.operations:
        for what in ["instructions", *CORES]:
            own = figures.cost(what, operation, OWN)
            unit = f"{what} cycles/px" if what in CORES else "instr/px"
            compare(operation, unit, own, figures.goal(what, operation), "goal")
            peer = figures.best_peer(what, operation)
            if peer:
                compare(operation, unit, own, *peer)
            for size in figures.sizes[1:]:
                compare(operation, f"{unit} at {size}", figures.cost(what, operation, OWN, size), own,
                        f"at {figures.sizes[0]}", TAIL_FACTOR)
    return Table(SHORTFALL_NAMES, rows)


def host_shortfall_table(figures):
    """Where a peer is ahead on this machine, or not as far behind as it is meant to be."""
    rows = []

    def compare(operation, mark, times, whose, factor):
        if times is not None and times > factor:
            own = figures.milliseconds(operation, OWN)
            rows.append([operation, "ms", f"{own:.3f}", f"{mark:.3f}", f"{times:.2f}", whose])

    for operation in figures.operations:
        peer = figures.better_time(operation)
        if peer:
            compare(operation, peer[0], peer[2], peer[1], TIMING_FACTOR)
        for library, part in figures.goals.get(operation, {}).get("times", {}).items():
            time = figures.time(operation, library)
            if time:
                compare(operation, part * time.milliseconds, time.own_ratio / part, f"goal: {part} of {library}",
                        ROUNDING_FACTOR)
    return Table(SHORTFALL_NAMES, rows)


def _planes_table(figures, columns):
    """A camera's planes; `columns` are (name, figure of an operation), of which "two passes" are those of a packed frame
    that come to the same as chroma in pairs."""

    def cell(name, figure):
        def of(operation):
            if "two passes" in name:
                operation = operation.replace("pairs-to-RGBA-", "two-passes-NV21-to-RGBA-")
                if not operation.startswith("two-passes") or operation not in figures.planes:
                    return ""
            return _text(figure(operation))

        return of

    views = [operation for operation in figures.planes if not operation.startswith("two-passes")]
    return operations_table(figures, views, lambda _: [(name, cell(name, figure)) for name, figure in columns])


def arm64_planes_table(figures):
    def cost(what, library):
        return lambda operation: figures.cost(what, operation, library)

    columns = [("instr", cost("instructions", OWN)),
               ("instr goal", lambda operation: figures.goal("instructions", operation)),
               ("instr two passes", cost("instructions", OWN)), (f"instr {LIBYUV}", cost("instructions", LIBYUV))]
    for core in CORES:
        columns += [(core, cost(core, OWN)), (f"{core} {LIBYUV}", cost(core, LIBYUV))]
    return _planes_table(figures, columns)


def host_planes_table(figures, sizes):
    def time(library, size):
        return lambda operation: figures.milliseconds(operation, library, size)

    columns = [(f"{size} {name}".strip(), time(library, size))
               for size in sizes for name, library in (("", OWN), ("two passes", OWN), (LIBYUV, LIBYUV))]
    return _planes_table(figures, columns)


def small_call_table(small, size, figures):
    """What a call costs for a picture of `size`, of the Figures `small`: in all, and beyond its pixels."""
    width, height = map(int, size.split("x"))
    pixels = width * height
    rows = []
    for operation in small.operations:
        each = small.cost("instructions", operation, OWN)
        beyond = pixels * (each - figures.cost("instructions", operation, OWN))
        rows.append([operation, f"{pixels * each:.0f}", f"{beyond:.0f}"]
                    + [f"{pixels * small.cost(core, operation, OWN):.0f}" for core in CORES])
    return Table([f"a call for {width} x {height}", "instructions", "of them beyond the pixels"]
                 + [f"{core} cycles" for core in CORES], rows)


def bridge_table(counts):
    """What a call of a native method needs, of counting.CallCount by name."""
    names = ["native method", "instructions in the library", "calls into the virtual machine"]
    return Table(names, [[name, f"{count.instructions:.0f}", str(count.machine_calls)] for name, count in counts.items()])


def packing_table(lines):
    """How long packing a camera's planes takes: (layout, filling, sample by sample), in milliseconds."""
    return Table(["camera planes", "CameraFrame.fill, ms", "sample by sample, ms"], [list(line) for line in lines])
