# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Makes a folder that the build and the scripts take for an Android NDK: its toolchain file, its tools by their names and
places, its system's headers as far as the project includes them, and its stand-ins for the system's libraries at API
level 24. Behind it are this machine's clang and the C libraries of Linux.

Without --runs what it links needs the libraries that Android has, and cannot be run; with it, it runs on Linux. Linked
with a C++ library it still cannot be run: the C library's stand-in then has the names of Linux's."""

import argparse
import os
import re
import shutil
import subprocess
import sys
from pathlib import Path

ROOT = Path(__file__).resolve().parent.parent.parent
TRIPLES = {"arm64-v8a": "aarch64-linux", "x86_64": "x86_64-linux"}
RELEASE = "27.1.12297006"

# What the build reads of the real one, and by the same names. A system version of 1 tells CMake that the toolchain file
# knows all that there is to know.
TOOLCHAIN = """\
set(CMAKE_SYSTEM_NAME Android)
set(CMAKE_SYSTEM_VERSION 1)
set(ANDROID TRUE)
if(NOT ANDROID_ABI)
  message(FATAL_ERROR "no ANDROID_ABI")
endif()
if(NOT ANDROID_PLATFORM STREQUAL "android-24" OR NOT ANDROID_STL STREQUAL "c++_static")
  message(FATAL_ERROR "built for ${ANDROID_PLATFORM} with ${ANDROID_STL}")
endif()
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES ANDROID_ABI ANDROID_PLATFORM ANDROID_STL)
if(ANDROID_ABI STREQUAL "arm64-v8a")
  set(CMAKE_SYSTEM_PROCESSOR aarch64)
else()
  set(CMAKE_SYSTEM_PROCESSOR x86_64)
endif()
set(CMAKE_ANDROID_ARCH_ABI ${ANDROID_ABI})
get_filename_component(ANDROID_NDK "${CMAKE_CURRENT_LIST_DIR}/../.." ABSOLUTE)
set(ANDROID_TOOLCHAIN_ROOT ${ANDROID_NDK}/toolchains/llvm/prebuilt/linux-x86_64)
set(triple ${CMAKE_SYSTEM_PROCESSOR}-linux)
set(CMAKE_C_COMPILER ${ANDROID_TOOLCHAIN_ROOT}/bin/clang)
set(CMAKE_CXX_COMPILER ${ANDROID_TOOLCHAIN_ROOT}/bin/clang++)
set(CMAKE_C_COMPILER_TARGET ${triple}-gnu)
set(CMAKE_CXX_COMPILER_TARGET ${triple}-gnu)
set(CMAKE_STRIP ${ANDROID_TOOLCHAIN_ROOT}/bin/llvm-strip)
set(sysroot ${ANDROID_TOOLCHAIN_ROOT}/sysroot/usr)
set(flags "-g -DANDROID -D__ANDROID__ -D__ANDROID_API__=24 -fdata-sections -ffunction-sections -funwind-tables \\
-fstack-protector-strong -no-canonical-prefixes -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2 -Wformat -Werror=format-security \\
-isystem ${sysroot}/include")
if(CMAKE_SYSTEM_PROCESSOR STREQUAL "aarch64")
  string(APPEND flags " @guard@")
endif()
set(CMAKE_C_FLAGS_INIT ${flags})
set(CMAKE_CXX_FLAGS_INIT ${flags})
set(link "-fuse-ld=lld -Wl,--build-id=sha1 -Wl,--fatal-warnings -Wl,--no-undefined-version -Qunused-arguments \\
-L${sysroot}/lib/${triple}-android/24 -Wl,--no-undefined @link@")
set(CMAKE_SHARED_LINKER_FLAGS_INIT ${link})
set(CMAKE_MODULE_LINKER_FLAGS_INIT ${link})
set(CMAKE_EXE_LINKER_FLAGS_INIT "${link} @link_exe@")
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
list(APPEND CMAKE_FIND_ROOT_PATH ${ANDROID_TOOLCHAIN_ROOT}/sysroot)
"""


def write(path, text, executable=False):
    path.parent.mkdir(parents=True, exist_ok=True)
    path.write_text(text)
    if executable:
        path.chmod(0o755)


def listed_imports():
    """{library: symbols}, of the list of imports."""
    libraries, symbols = {}, None
    for line in (ROOT / "android" / "imports.txt").read_text().splitlines():
        heading = re.match(r"# (lib\w+)(:|$)", line)
        if heading:
            symbols = libraries.setdefault(heading.group(1), [])
        elif line and not line.startswith("#"):
            symbols.append(line)
    return libraries


def headers(include, jni):
    """Android's headers. Its jni.h has the tables of functions under names of its own."""
    text = (jni / "jni.h").read_text().replace("JNINativeInterface_", "JNINativeInterface")
    text = text.replace("JNIInvokeInterface_", "JNIInvokeInterface").replace("JNIEnv_", "_JNIEnv")
    write(include / "jni.h", text.replace("JavaVM_", "_JavaVM"))
    shutil.copy(jni / "linux" / "jni_md.h", include)
    for name in ("log.h", "bitmap.h"):
        write(include / "android" / name, (ROOT / "platform" / "include" / "android" / name).read_text())
    write(include / "android" / "api-level.h", "#pragma once\n")
    # The real one declares the report of an assertion.
    write(include / "assert.h", "#include_next <assert.h>\n#ifndef KY_ASSERT2\n#define KY_ASSERT2\n"
          + (ROOT / "platform" / "include" / "assert2.h").read_text().replace("#pragma once", "") + "#endif\n")


def stub(compiler, triple, folder, name, symbols, more=()):
    source = "".join(f"void {symbol}(void);\nvoid {symbol}(void) {{}}\n" for symbol in symbols)
    subprocess.run([compiler, f"--target={triple}-gnu", "-fuse-ld=lld", "-nostdlib", "-shared", "-fno-builtin", "-w",
                    "-fPIC", "-x", "c", "-", "-o", folder / f"{name}.so", f"-Wl,-soname,{name}.so", *more],
                   input=source, text=True, check=True)


def names_of_the_c_library(compiler, nm, triple):
    """{library: symbols}, of all that a C++ library for Linux may ask of C's."""
    loader = {"aarch64-linux": "ld-linux-aarch64.so.1", "x86_64-linux": "ld-linux-x86-64.so.2"}[triple]

    def symbols(file):
        path = subprocess.run([compiler, f"--target={triple}-gnu", f"--print-file-name={file}"], stdout=subprocess.PIPE,
                              text=True, check=True).stdout.strip()
        lines = subprocess.run([nm, "-D", "--defined-only", "--format=just-symbols", path], stdout=subprocess.PIPE,
                               text=True, check=True).stdout.split()
        # The versions have names with dots in them.
        return {name for name in (line.split("@")[0] for line in lines) if name.isidentifier()}

    return {"libc": sorted(symbols("libc.so.6") | symbols(loader)), "libm": sorted(symbols("libm.so.6")), "libdl": []}


def standing(compiler, triple, folder, include, name, source):
    """A library of Android's that works on Linux."""
    subprocess.run([f"{compiler}++", f"--target={triple}-gnu", "-fuse-ld=lld", "-shared", "-fPIC", "-isystem", include,
                    "-I", ROOT / "platform" / "include", source, "-o", folder / f"{name}.so",
                    f"-Wl,-soname,{name}.so"], check=True)


def make(ndk, clang, tools, jni, runs=False, cplusplus=False, compile_options="", abis=tuple(TRIPLES)):
    """`tools` maps the NDK's names of llvm's tools to this machine's. With `cplusplus` what is linked has a C++ library in
    it, Linux's."""
    # Where it is installed it finds its linker.
    clang = Path(shutil.which(clang)).resolve()
    prebuilt = ndk / "toolchains" / "llvm" / "prebuilt" / "linux-x86_64"
    # Android's own C++ library is linked into everything, and the C library's parts are few.
    link = "-static-libstdc++ -static-libgcc" if runs else "-nodefaultlibs -lc -lm -Wl,--as-needed"
    if cplusplus:
        link += " -Wl,--start-group -l:libstdc++.a -l:libgcc_eh.a -l:libgcc.a -Wl,--end-group"
    text = TOOLCHAIN.replace("@link@", link).replace("@link_exe@", "" if runs else "-nostartfiles -Wl,-e,main")
    # On Android the stack's guard is in the thread's own block, on Linux it is a variable.
    guard = "" if runs else "-mstack-protector-guard=sysreg -mstack-protector-guard-reg=sp_el0 " \
        "-mstack-protector-guard-offset=40"
    text = text.replace("@guard@", guard)
    write(ndk / "build" / "cmake" / "android.toolchain.cmake", text)
    write(ndk / "source.properties", f"Pkg.Desc = Android NDK\nPkg.Revision = {RELEASE}\n")
    write(prebuilt / "bin" / "clang", f'#!/bin/sh\nexec {clang} "$@" {compile_options}\n', executable=True)
    write(prebuilt / "bin" / "clang++", f'#!/bin/sh\nexec {clang} --driver-mode=g++ "$@" {compile_options}\n',
          executable=True)
    for name, tool in tools.items():
        write(prebuilt / "bin" / name, f'#!/bin/sh\nexec {shutil.which(tool)} "$@"\n', executable=True)
    include = prebuilt / "sysroot" / "usr" / "include"
    headers(include, jni)
    compiler = prebuilt / "bin" / "clang"
    for triple in (TRIPLES[abi] for abi in abis):
        folder = prebuilt / "sysroot" / "usr" / "lib" / f"{triple}-android" / "24"
        folder.mkdir(parents=True, exist_ok=True)
        if runs:
            standing(compiler, triple, folder, include, "liblog", ROOT / "platform" / "log.cpp")
            standing(compiler, triple, folder, include, "libjnigraphics", ROOT / "platform" / "bitmap.cpp")
        else:
            libraries = listed_imports()
            if cplusplus:
                for name, more in names_of_the_c_library(compiler, prebuilt / "bin" / "llvm-nm", triple).items():
                    libraries[name] = sorted({*libraries.get(name, []), *more})
            for name, symbols in libraries.items():
                stub(compiler, triple, folder, name, symbols)


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("ndk", type=Path)
    parser.add_argument("--clang", default="clang-19")
    parser.add_argument("--jni", type=Path, default=Path("/usr/lib/jvm/default-java/include"))
    parser.add_argument("--runs", action="store_true")
    arguments = parser.parse_args()
    suffix = re.sub(r"^.*clang", "", arguments.clang)
    tools = {name: f"{name}{suffix}" for name in ("llvm-strip", "llvm-nm", "llvm-readelf", "llvm-ar", "llvm-ranlib")}
    make(arguments.ndk, arguments.clang, tools, arguments.jni, arguments.runs)
    return 0


if __name__ == "__main__":
    sys.exit(main())
