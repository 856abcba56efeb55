"""The table that scripts/bench prints."""

from .counting import Key
from .model import CORES

OWN = "fastcv"
PEERS = ["libyuv", "opencv"]


FLOOR = "memcpy"


def table(sizes, counts, cycles, times, markdown=False):
    """Everything about the first size, and of this project's operations the instructions at the others too. `counts`
    and `cycles` are as counting and model return them, `times` holds counting.Time. Columns without a figure are left
    out."""
    size = sizes[0]
    measured = {**times, **counts}
    operations = list(dict.fromkeys(key.operation for key in measured if key.library != FLOOR))
    # A floor belongs to all operations of a traffic.
    floors = {figure.traffic: key.operation for key, figure in measured.items() if key.library == FLOOR}
    floor_of = {key.operation: floors.get(figure.traffic, "") for key, figure in measured.items()}

    def instructions(operation, library, at=size):
        count = counts.get(Key(operation, library, at))
        return f"{count.per_pixel:.3f}" if count else ""

    def model(operation, library, core):
        figures = cycles.get(Key(operation, library, size))
        return f"{figures[core]:.3f}" if figures else ""

    def milliseconds(operation, library):
        time = times.get(Key(operation, library, size))
        return f"{time.milliseconds:.3f}" if time else ""

    columns = [("operation", lambda operation: operation)]
    for library in [OWN, *PEERS]:
        columns.append((f"instr/px {library}", lambda operation, of=library: instructions(operation, of)))
        if library == OWN:
            for other in sizes[1:]:
                columns.append((f"at {other}", lambda operation, at=other: instructions(operation, OWN, at)))
    columns.append((f"instr/px {FLOOR}", lambda operation: instructions(floor_of[operation], FLOOR)))
    for core in CORES:
        for library in [OWN, *PEERS]:
            columns.append(
                (f"{core} cycles/px {library}", lambda operation, of=library, on=core: model(operation, of, on))
            )
    for library in [OWN, *PEERS]:
        columns.append((f"host ms {library}", lambda operation, of=library: milliseconds(operation, of)))
    columns.append((f"host ms {FLOOR}", lambda operation: milliseconds(floor_of[operation], FLOOR)))

    names = [name for name, _ in columns]
    rows = [[cell(operation) for _, cell in columns] for operation in operations]
    filled = [index for index in range(len(names)) if any(row[index] for row in rows)]
    names = [names[index] for index in filled]
    rows = [[row[index] for index in filled] for row in rows]
    return _markdown(names, rows) if markdown else _plain(names, rows)


def _markdown(names, rows):
    lines = [names, ["---"] + ["--:"] * (len(names) - 1), *rows]
    return "\n".join("| " + " | ".join(line) + " |" for line in lines)


def _plain(names, rows):
    """Columns as wide as their figures; the names above them word by word."""
    heads = [name.split() for name in names]
    height = max(len(words) for words in heads)
    lines = [[([""] * (height - len(words)) + words)[line] for words in heads] for line in range(height)] + rows
    widths = [max(len(line[index]) for line in lines) for index in range(len(names))]

    def line_of(cells):
        return "  ".join(
            cell.rjust(width) if index else cell.ljust(width) for index, (cell, width) in enumerate(zip(cells, widths))
        ).rstrip()

    text = [line_of(line) for line in lines]
    text.insert(height, "-" * max(len(line) for line in text))
    return "\n".join(text)
