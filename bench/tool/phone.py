# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Measures with bench_phone on a device's cores."""

import dataclasses
import os
import subprocess
import sys

from .counting import FLOOR, OWN
from .table import Table


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
        names += [f"{core.name} ns", f"{core.name} cycles", f"{core.name} instr"]
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


# Builds for Android, by the NDK that the environment names.
BUILD_ANDROID = """
source scripts/common.sh
source scripts/android.sh
need_ndk
scripts/setup.sh host
configure_android "$1" -DKYFACE_LIBYUV_SOURCES="$2"
cmake --build --preset "$1" --target bench_phone >&2
"""
PHONE_PROPERTIES = ["ro.product.manufacturer", "ro.product.model", "ro.soc.model", "ro.build.version.release"]


def _phone_name():
    """What the attached device calls itself."""
    values = []
    for name in PHONE_PROPERTIES:
        run = subprocess.run(["adb", "shell", f"getprop {name}"], stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, text=True,
                             check=False)
        values.append(run.stdout.strip())
    maker, product, chip, version = values
    return " ".join(word for word in (maker, product, f"({chip})" if chip else "", f"Android {version}") if word)


def measure(root, pattern, sizes, libyuv):
    """Measures on the attached device what the project at `root` has, and libyuv of the sources in a folder, if any; or
    shows through the runner that the program runs. Prints it."""
    through_runner = bool(os.environ.get("KYFACE_ANDROID_RUN"))
    refusals = []
    for abi, preset in (("arm64-v8a", "android-arm64"), ("x86_64", "android-x86_64")):
        check = subprocess.run(["scripts/device", "check", abi], cwd=root, stderr=subprocess.PIPE, text=True, check=False)
        if check.returncode == 0:
            break
        refusals.append(check.stderr.replace("device: ", "bench: ", 1).strip())
    else:
        sys.exit(refusals[0])
    sources = str(libyuv.resolve()) if libyuv else ""
    build = subprocess.run(["bash", "-c", BUILD_ANDROID, "bench", preset, sources], cwd=root, check=False)
    if build.returncode != 0:
        sys.exit(1)
    folder = root / "build" / preset
    command = ["scripts/device", "run", abi, folder, folder / "bin" / "bench_phone", "0" if through_runner else "20",
               pattern or ".", *sizes]
    run = subprocess.run(command, cwd=root, stdout=subprocess.PIPE, text=True, check=False)
    if run.returncode != 0:
        sys.exit(f"bench: bench_phone failed with status {run.returncode}")
    measured = parsed(run.stdout)
    if through_runner:
        print(f"bench_phone runs: {len(measured.results)} results; through KYFACE_ANDROID_RUN they are no measurements")
        return
    print(_phone_name())
    for core in measured.cores:
        print(core.title)
        if core.counters != "yes":
            print(f"  cycles and instructions are not counted there ({core.counters}); "
                  "`adb shell setprop security.perf_harden 0` may allow it")
    for size in sizes:
        print(f"\n{size}; per pixel\n\n{table(measured, size).plain()}")
