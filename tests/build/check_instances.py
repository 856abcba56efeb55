# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Compiles every conceivable instance of the image library's front-ends: those that are listed must compile, each of the
others must fail with the message that says that it does not exist."""

import argparse
import re
import subprocess
import sys
import tempfile
from itertools import product
from pathlib import Path

TYPES = ["unsigned char", "float"]
MESSAGE = re.compile(r"HPC::fastcv::\w+ has no such instance")

HEAD = '#include "fastcv/fastcv.h"\nnamespace HPC::fastcv {\nconstexpr EcoEnv_t kOther = static_cast<EcoEnv_t>(1);\n'


def run(command, text):
    with tempfile.TemporaryDirectory() as folder:
        source = Path(folder) / "instances.cpp"
        source.write_text(text)
        return subprocess.run([*command, source], stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False)


def listed(command, macro):
    """The argument lists that a macro of the header gives, as tuples of text."""
    result = run([*command, "-E", "-P"], f'#include "fastcv/fastcv.h"\n{macro}(LISTED)\n')
    if result.returncode != 0:
        sys.exit(result.stdout)
    return {tuple(part.strip() for part in found.split(",")) for found in re.findall(r"LISTED\(([^)]*)\)", result.stdout)}


def cases(command):
    """(instance, whether it exists), for all of them."""
    names = {name: value for value, name in enumerators(command)}
    conversions = {(names[name], kind, int(a), int(b)) for name, kind, a, b in listed(command, "FASTCV_CVT_COLOR_INSTANCES")}
    # The next value too, which is no conversion.
    for conversion, kind, a, b in product(range(max(names.values()) + 2), TYPES, (1, 3, 4), (1, 3, 4)):
        yield (f"cvtColor<static_cast<ColorCvtType>({conversion}), {kind}, {a}, {kind}, {b}, ECO_ENV_ARM>",
               (conversion, kind, a, b) in conversions)
    # What exists, but for an element type or the environment.
    for conversion, kind, a, b in sorted(conversions):
        other = TYPES[kind == TYPES[0]]
        yield f"cvtColor<static_cast<ColorCvtType>({conversion}), {kind}, {a}, {other}, {b}, ECO_ENV_ARM>", False
        yield f"cvtColor<static_cast<ColorCvtType>({conversion}), {kind}, {a}, {kind}, {b}, kOther>", False

    packed = {(kind, int(a)) for kind, a in listed(command, "FASTCV_PACKED_INSTANCES")}
    for kind, kind_dst, a, b in product(TYPES, TYPES, (1, 2, 3, 4), (1, 2, 3, 4)):
        exists = kind == kind_dst and a == b and (kind, a) in packed
        yield f"crop<{kind}, {a}, {kind_dst}, {b}, {a}, ECO_ENV_ARM>", exists
        if kind == kind_dst:
            yield f"rotate<{kind}, {a}, {b}, {a}, ECO_ENV_ARM>", exists
    for kind, a in sorted(packed):
        yield f"crop<{kind}, {a}, {kind}, {a}, {a}, kOther>", False
        yield f"rotate<{kind}, {a}, {a}, {a}, kOther>", False

    layouts = {name for (name,) in listed(command, "FASTCV_YUV420_INSTANCES")}
    for name, kind in product(("YUV420_NV21", "YUV420_NV12", "YUV420_I420"), TYPES):
        yield f"rotate_YUV420<{name}, {kind}, ECO_ENV_ARM>", kind == TYPES[0] and name in layouts


def enumerators(command):
    text = run([*command, "-E", "-P"], '#include "fastcv/fastcv.h"\n').stdout
    return [(int(value), name) for name, value in re.findall(r"\b(CVT_\w+) = (\d+)", text)]


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("--include", required=True)
    parser.add_argument("compiler", nargs="+", help="the compiler and its options")
    arguments = parser.parse_args()
    command = [*arguments.compiler, "-std=c++20", "-I", arguments.include]

    wanted = list(cases(command))
    # One line an instance, so that the compiler's line numbers tell which it refuses.
    lines = [f"auto instance{i} = &{instance};" for i, (instance, _) in enumerate(wanted)]
    result = run([*command, "-fsyntax-only", "-fmax-errors=0" if is_gcc(command) else "-ferror-limit=0",
                  *([] if is_gcc(command) else ["-ftemplate-backtrace-limit=0"])],
                 HEAD + "\n".join(lines) + "\n}\n")
    first = HEAD.count("\n") + 1
    refused = {int(line) - first for line in
               re.findall(r"instances\.cpp:(\d+):\d+:.*(?:required from here|requested here)", result.stdout)}
    errors = re.findall(r"^.*\berror: .*$", result.stdout, re.MULTILINE)
    foreign = [error for error in errors if not MESSAGE.search(error)]
    absent = {i for i, (_, exists) in enumerate(wanted) if not exists}

    for i in sorted(absent - refused):
        print(f"compiles, and should not: {wanted[i][0]}")
    for i in sorted(refused - absent):
        print(f"does not compile: {wanted[i][0]}")
    print(*foreign, sep="\n", end="\n" if foreign else "")
    print(f"{len(wanted) - len(absent)} instances exist, {len(refused)} are refused with {len(errors)} messages")
    return 0 if refused == absent and not foreign and len(errors) == len(absent) else 1


def is_gcc(command):
    version = subprocess.run([command[0], "--version"], stdout=subprocess.PIPE, text=True, check=True).stdout
    return "clang" not in version


if __name__ == "__main__":
    sys.exit(main())
