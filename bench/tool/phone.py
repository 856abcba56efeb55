# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""What bench_phone measured on a device's cores, as a table."""

import dataclasses

from .table import FLOOR, OWN, Table


@dataclasses.dataclass
class Core:
    """A core that was run on."""

    name: str  # small, big, or only
    number: str
    kilohertz: int  # 0 where the system does not tell
    counters: str = ""  # "yes", or why nothing is counted

    @property
    def title(self):
        speed = f", {self.kilohertz / 1e6:.2f} GHz" if self.kilohertz else ""
        return f"{self.name} core (number {self.number}{speed})"


@dataclasses.dataclass
class Measured:
    cores: list
    results: dict  # (operation, library, size, core's number): (ns, cycles, instructions) per pixel, None if not counted
    traffic: dict  # bytes per pixel, by operation


def parsed(text):
    """What the program printed."""
    cores, results, traffic = [], {}, {}
    for line in text.splitlines():
        kind, *columns = line.split("\t")
        if kind == "core":
            cores.append(Core(columns[0], columns[1], int(columns[2])))
        elif kind == "counters":
            cores[-1].counters = columns[0]
        elif kind == "result":
            operation, library, size, bytes_per_pixel, core, *figures = columns
            results[operation, library, size, core] = tuple(None if each == "-" else float(each) for each in figures)
            traffic[operation] = bytes_per_pixel
    if not cores or not results:
        raise ValueError("the benchmark has printed no results")
    return Measured(cores, results, traffic)


def table(measured, size):
    """A row for each operation: on each core nanoseconds, cycles and instructions per pixel, and the peers' time."""
    peers = sorted({library for _, library, _, _ in measured.results} - {OWN, FLOOR})
    floors = {measured.traffic[operation]: operation
              for operation, library, _, _ in measured.results if library == FLOOR}
    names = ["operation"]
    for core in measured.cores:
        names += [f"{core.name} ns", f"{core.name} cycles", f"{core.name} instructions"]
        names += [f"{core.name} {peer} ns" for peer in [*peers, FLOOR]]

    def cells(operation, core):
        own = measured.results.get((operation, OWN, size, core.number), (None, None, None))
        others = [measured.results.get((operation, peer, size, core.number), (None,))[0] for peer in peers]
        floor = floors.get(measured.traffic[operation])
        others.append(measured.results.get((floor, FLOOR, size, core.number), (None,))[0])
        return ["" if figure is None else f"{figure:.3f}" for figure in (*own, *others)]

    operations = dict.fromkeys(operation for operation, library, _, _ in measured.results if library == OWN)
    rows = [[operation, *(cell for core in measured.cores for cell in cells(operation, core))] for operation in operations]
    return Table(names, rows)
