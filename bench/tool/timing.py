# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Times on this machine: all that does the same takes turns in one process, this project's operations, the peers that
are linked beside them, and OpenCV as Python has it."""

import ctypes
import dataclasses
import functools
import itertools
import random
import statistics
import time
import weakref

from .counting import NEWER_OPENCV, OPENCV, OWN, Key

# A pass makes the buffers anew, so that no figure hangs on where they happened to lie, which for a rotation is much of it.
# In a round of a pass everybody has a turn of as many calls as take about this long, in random order.
PASSES = 15
FEW_PASSES = 5  # where figures are many and only stand beside others
ROUNDS = 2
TURN_NANOSECONDS = 4_000_000


@dataclasses.dataclass
class Time:
    """How long a call takes."""

    traffic: float  # bytes per pixel
    milliseconds: float  # the median of all turns
    own_ratio: float  # this project's as a multiple, the median of all rounds; None where it has no such operation


@dataclasses.dataclass
class Contender:
    """One way of doing an operation."""

    operation: str
    library: str
    traffic: float
    # From a size to a function that makes a number of calls and returns the processor's nanoseconds.
    prepare: object


def linked(path, pattern):
    """The Contenders in the library of bench/time.cpp."""
    library = ctypes.CDLL(str(path))
    library.bench_name.restype = library.bench_library.restype = ctypes.c_char_p
    library.bench_traffic.restype = ctypes.c_double
    library.bench_prepare.restype = ctypes.c_void_p
    library.bench_release.argtypes = [ctypes.c_void_p]
    library.bench_run.argtypes, library.bench_run.restype = [ctypes.c_void_p, ctypes.c_int], ctypes.c_int64

    def prepare(index, size):
        call = library.bench_prepare(index, *size)
        run = functools.partial(library.bench_run, call)
        weakref.finalize(run, library.bench_release, call)
        return run

    return [Contender(library.bench_name(index).decode(), library.bench_library(index).decode(),
                      library.bench_traffic(index), functools.partial(prepare, index))
            for index in range(library.bench_choose(pattern.encode()))]


def in_python(contenders, opencv):
    """The Contenders by which the NewerOpencv does what the linked one does."""

    def prepare(operation, size):
        call = opencv.prepared(operation, size)

        def run(times):
            start = time.thread_time_ns()
            for _ in itertools.repeat(None, times):
                call()
            return time.thread_time_ns() - start

        return run

    return [Contender(each.operation, NEWER_OPENCV, each.traffic, functools.partial(prepare, each.operation))
            for each in contenders if each.library == OPENCV and opencv.prepared(each.operation, (16, 16))]


def measured(contenders, sizes, passes=PASSES):
    """{Key: Time} of pictures of these sizes, "1280x720"."""
    groups = {}
    for contender in contenders:
        groups.setdefault(contender.operation, []).append(contender)
    turns = {Key(each.operation, each.library, size): [] for size in sizes for each in contenders}
    order = random.Random(1)
    for _ in range(passes):
        for size, group in order.sample([*itertools.product(sizes, groups.values())], len(sizes) * len(groups)):
            _take_turns(group, size, turns, order)
    return {Key(each.operation, each.library, size): _time(each, size, turns) for size in sizes for each in contenders}


def _take_turns(group, size, turns, order):
    """A pass of what does the same: adds milliseconds of a call to `turns`."""
    prepared = []
    for contender in order.sample(group, len(group)):
        run = contender.prepare(tuple(map(int, size.split("x"))))
        run(1)
        calls = max(1, TURN_NANOSECONDS // max(1, run(1)))
        prepared.append((turns[Key(contender.operation, contender.library, size)], run, calls))
    for _ in range(ROUNDS):
        for taken, run, calls in order.sample(prepared, len(prepared)):
            taken.append(run(calls) / calls * 1e-6)


def _time(contender, size, turns):
    taken = turns[Key(contender.operation, contender.library, size)]
    own = turns.get(Key(contender.operation, OWN, size))
    ratio = statistics.median(mine / theirs for mine, theirs in zip(own, taken)) if own else None
    return Time(contender.traffic, statistics.median(taken), ratio)
