# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Looks at the built shared library: what it exports, what it needs and imports, how it is laid out."""

import argparse
import re
import subprocess
import sys
from pathlib import Path

JNI_PREFIX = "Java_com_vantrel_faceapi_"
PAGE = 16384
NEEDED = {"liblog.so", "libjnigraphics.so", "libkyface_api.so"}
NAMES = {False: "libjni_kyface_api.so", True: "libkyface_api.so"}
# What the compiler and the C library bring along: on Linux, and on Android.
LINUX = re.compile(r"lib(c|m|stdc\+\+|gcc_s)\.so\.\d+|ld-linux-[\w-]+\.so\.\d+")
ANDROID = re.compile(r"lib(c|m|dl)\.so")
# The open engine has its C++ library in it.
LINUX_ENGINE = re.compile(r"lib(c|m)\.so\.\d+|ld-linux-[\w-]+\.so\.\d+")
# The functions of the face engine, which the app brings along.
ENGINE_PREFIX = "ky_"


def output(*command):
    return subprocess.run(command, stdout=subprocess.PIPE, text=True, check=True).stdout


def dynamic_symbols(arguments, library, *options):
    lines = output(arguments.nm, "-D", *options, library).splitlines()
    return {line.split()[-1].split("@")[0] for line in lines if line.strip()}


def needed_libraries(dynamic):
    return set(re.findall(r"\(NEEDED\).*\[(.*)\]", dynamic))


def intended(arguments):
    """The exported functions: what intended_exports.cpp refers to, and the native methods of the Java classes."""
    names = {line.split()[-1] for line in output(arguments.nm, "-u", arguments.intended).splitlines()}
    java = {f"{JNI_PREFIX}{Path(source).stem}_{name}" for source in arguments.java
            for name in re.findall(r"\bnative\s+[\w\[\]]+\s+(\w+)\(", Path(source).read_text())}
    return {name for name in names if name.startswith("_Z")} | java | {"JNI_OnLoad"}


def check_exports(arguments):
    exported = dynamic_symbols(arguments, arguments.library, "--defined-only")
    wanted = intended(arguments)
    print(f"{len(exported)} exported, {len(wanted)} intended")
    if len(wanted) < 100:
        yield f"only {len(wanted)} names were found to compare with"
    for name in sorted(exported - wanted):
        yield f"exported, and should not be: {name}"
    for name in sorted(wanted - exported):
        yield f"not exported: {name}"


def check_needed(arguments):
    dynamic = output(arguments.readelf, "-d", arguments.library)
    needed = needed_libraries(dynamic)
    platform = ANDROID if arguments.android else LINUX_ENGINE if arguments.engine else LINUX
    wanted = set() if arguments.engine else NEEDED
    print("needs " + ", ".join(sorted(needed)))
    for name in sorted(wanted - needed):
        yield f"does not need {name}"
    for name in sorted(needed - wanted):
        if not platform.fullmatch(name):
            yield f"needs {name}"
    if re.findall(r"\(SONAME\).*\[(.*)\]", dynamic) != [NAMES[arguments.engine]]:
        yield f"has another name than {NAMES[arguments.engine]}"
    for path in re.findall(r"\((?:RPATH|RUNPATH)\).*\[(.*)\]", dynamic):
        if arguments.android or path != "$ORIGIN":
            yield f"looks for libraries in {path}"


def check_imports(arguments):
    """Weak imports are left out: they may be missing."""
    imported = dynamic_symbols(arguments, arguments.library, "--undefined-only", "--no-weak")
    listed = Path(arguments.imports).read_text().splitlines() if arguments.imports else []
    known = {line for line in listed if line and not line.startswith("#")}
    if arguments.system:
        for name in needed_libraries(output(arguments.readelf, "-d", arguments.library)):
            stub = Path(arguments.system) / name
            if stub.exists():
                known |= dynamic_symbols(arguments, stub, "--defined-only")
    print(f"{len(imported)} imported")
    if not imported:
        yield "no imports were found"
    for name in sorted(imported - known):
        if not name.startswith(ENGINE_PREFIX):
            yield f"imports what Android may lack: {name}"


def check_layout(arguments):
    dynamic = output(arguments.readelf, "-d", arguments.library)
    headers = output(arguments.readelf, "-l", "-W", arguments.library)
    segments = [(kind, [int(x, 16) for x in numbers.split()], flags.replace(" ", ""), int(align, 16)) for
                kind, numbers, flags, align in
                re.findall(r"^ *([A-Z_]+) +((?:0x[0-9a-f]+ +){5})([RWE ]+?) +(0x[0-9a-f]+)$", headers, re.MULTILINE)]
    loads = [segment for segment in segments if segment[0] == "LOAD"]
    print("\n".join(f"{kind} {flags} align {align:#x}" for kind, _, flags, align in segments))
    if not loads:
        yield "no segments were found"
    for _, (offset, address, *_), flags, align in loads:
        if align % PAGE != 0 or (address - offset) % PAGE != 0:
            yield f"a segment is not aligned to {PAGE} bytes"
        if "W" in flags and "E" in flags:
            yield "a segment is writable and executable"
    if not any(kind == "GNU_RELRO" for kind, *_ in segments):
        yield "relocations are not made read-only"
    if not any(kind == "GNU_STACK" and "E" not in flags for kind, _, flags, _ in segments):
        yield "the stack may be executable"
    if "TEXTREL" in dynamic:
        yield "has text relocations"
    if "BIND_NOW" not in dynamic and not re.search(r"\(FLAGS_1\).*\bNOW\b", dynamic):
        yield "does not bind everything when it is loaded"


CHECKS = {"exports": check_exports, "needed": check_needed, "imports": check_imports, "layout": check_layout}


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("check", choices=CHECKS)
    parser.add_argument("library")
    parser.add_argument("--nm", required=True)
    parser.add_argument("--readelf", required=True)
    parser.add_argument("--intended", help="the object of intended_exports.cpp")
    parser.add_argument("--java", nargs="+", help="the sources of the Java classes")
    parser.add_argument("--android", action="store_true", help="the library is one for Android")
    parser.add_argument("--engine", action="store_true", help="the library is the open engine, libkyface_api.so")
    parser.add_argument("--imports", help="the list of what the library may import")
    parser.add_argument("--system", help="the folder of an NDK's stand-ins for the system's libraries, whose symbols may "
                                         "be imported too")
    arguments = parser.parse_args()
    findings = list(CHECKS[arguments.check](arguments))
    print(*findings, sep="\n", end="\n" if findings else "")
    return 1 if findings else 0


if __name__ == "__main__":
    sys.exit(main())
