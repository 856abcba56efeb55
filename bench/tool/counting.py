# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Instructions of the arm64 build, exact: its programs under the emulator's counting plugin."""

import collections
import dataclasses
import re
import subprocess
import sys
import tempfile
from pathlib import Path

# Whose operations they are: this project's; the peers'; OpenCV's as Python has it, which is only timed; and a plain copy.
OWN = "fastcv"
LIBYUV, OPENCV = PEERS = ["libyuv", "opencv"]
NEWER_OPENCV = "newer opencv"
FLOOR = "memcpy"

# Where the peers' own libraries are that Debian keeps in folders of their own.
EXTRA_LIBRARY_PATH = "/usr/lib/aarch64-linux-gnu/blas:/usr/lib/aarch64-linux-gnu/lapack"


@dataclasses.dataclass(frozen=True)
class Key:
    """What was measured."""

    operation: str
    library: str
    size: str


@dataclasses.dataclass
class Count:
    """What an operation needs, the preparation left out."""

    traffic: float  # bytes per pixel
    pixels: int
    instructions: int
    blocks: dict  # executions by block id

    @property
    def per_pixel(self):
        return self.instructions / self.pixels


@dataclasses.dataclass(frozen=True)
class Block:
    """A stretch of code that the emulator ran as a whole."""

    address: int
    words: tuple  # the instructions, as the plugin wrote them


@dataclasses.dataclass
class Counts:
    counts: dict  # Count by Key
    blocks: dict  # Block by id


@dataclasses.dataclass
class CallCount:
    """What a call of a native method or of the open engine needs."""

    machine_calls: int  # calls into the virtual machine
    instructions: float  # of a native method, of the shared library alone


def tools(build):
    """What the counts of the folder `build` depend on beside the sources: {tool: major version}."""
    (compiler,) = build.glob("CMakeFiles/*/CMakeCXXCompiler.cmake")
    clang = re.search(r'CMAKE_CXX_COMPILER_VERSION "(\d+)', compiler.read_text())
    emulator = subprocess.run(["qemu-aarch64", "--version"], stdout=subprocess.PIPE, text=True, check=True).stdout
    return {"clang": clang[1], "qemu": re.search(r"version (\d+)", emulator)[1]}


def count(build, root, own, pattern, sizes, repeats=1):
    """Runs bench_count of the folder `build` and returns the Counts of the operations matching `pattern`."""
    arguments = ["bench_count", "own" if own else "all", str(repeats), pattern, *sizes]
    lines, laps, blocks = _run(build, root, arguments)
    counts = {}
    for index, line in enumerate(lines):
        operation, library, size, traffic, pixels = line.split("\t")
        instructions, executions = _difference(laps, index)
        counts[Key(operation, library, size)] = Count(float(traffic), int(pixels), instructions, executions)
    return Counts(counts, blocks)


def count_bridge(build, root, repeats=20):
    """Runs bench_bridge of the folder `build` and returns {call: CallCount}."""
    lines, laps, blocks = _run(build, root, ["bench_bridge", str(repeats)])
    begin, end = (int(address, 16) for address in lines[0].split("\t"))
    counts = {}
    for index, line in enumerate(lines[1:]):
        name, machine_calls, calls = line.split("\t")
        _, executions = _difference(laps, index)
        own = sum(
            len(blocks[block].words) * number
            for block, number in executions.items()
            if begin <= blocks[block].address < end
        )
        counts[name] = CallCount(int(machine_calls), own / int(calls))
    return counts


def count_engine(build, root):
    """Runs bench_engine of the folder `build` and returns {call: CallCount}, its instructions those of all libraries."""
    lines, laps, _ = _run(build, root, ["bench_engine", "count", "1"])
    counts = {}
    for index, line in enumerate(lines):
        name, calls = line.split("\t")
        counts[name] = CallCount(0, _difference(laps, index)[0] / int(calls))
    return counts


def _run(build, root, arguments):
    """Runs a program of `build` under the plugin: the lines it prints, its laps, its blocks by id."""
    options = subprocess.run(["qemu-aarch64", "-h"], stdout=subprocess.PIPE, text=True, check=False).stdout
    if "-plugin" not in options:
        sys.exit("bench: this machine's qemu-aarch64 takes no plugins (Debian 13's does not), so nothing can be counted")
    with tempfile.NamedTemporaryFile(suffix=".laps") as laps_file:
        command = ["qemu-aarch64", "-cpu", "cortex-a76", "-L", str(root)]
        command += ["-E", f"LD_LIBRARY_PATH={EXTRA_LIBRARY_PATH}"]
        command += ["-plugin", f"{build}/lib/libcount.so,out={laps_file.name}"]
        command += [f"{build}/bin/{arguments[0]}", *arguments[1:]]
        run = subprocess.run(command, stdout=subprocess.PIPE, text=True, check=False)
        if run.returncode != 0:
            sys.exit(f"bench: {arguments[0]} failed with status {run.returncode}")
        return run.stdout.splitlines(), *_read_laps(Path(laps_file.name))


def _difference(laps, index):
    """Instructions and executions by block of what was measured as the `index`th. It has three laps: what went before,
    one without a call, and one with all calls."""
    empty, full = laps[3 * index + 1], laps[3 * index + 2]
    executions = collections.Counter(full[1])
    executions.subtract(empty[1])
    return full[0] - empty[0], {block: number for block, number in executions.items() if number > 0}


def _read_laps(path):
    laps = []
    blocks = {}
    with path.open() as lines:
        for line in lines:
            kind, *rest = line.split()
            if kind == "lap":
                laps.append((int(rest[0]), {}))
            elif kind == "block":
                laps[-1][1][int(rest[0])] = int(rest[1])
            else:
                blocks[int(rest[0])] = Block(int(rest[1], 16), tuple(rest[2:]))
    return laps, blocks
