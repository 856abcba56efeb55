# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""What the tests of this folder share: a copy of the project to run its scripts in, and a pretended NDK."""

import os
import shutil
import subprocess
from pathlib import Path

import pretended_ndk

ROOT = Path(__file__).resolve().parent.parent.parent
LEFT_OUT = {".deps", ".git", "build", "out"}


class Machine:
    """What the tests are given of this machine: tools, headers, a folder to work in."""

    def __init__(self, arguments):
        self.clang = arguments.clang
        self.tools = {"llvm-nm": arguments.nm, "llvm-readelf": arguments.readelf, "llvm-strip": arguments.strip,
                      "llvm-ar": arguments.ar, "llvm-ranlib": arguments.ranlib}
        self.jni = Path(arguments.jni)
        self.work = Path(arguments.work)

    @staticmethod
    def add_arguments(parser):
        for name in ("clang", "nm", "readelf", "strip", "ar", "ranlib", "jni", "work"):
            parser.add_argument(f"--{name}", required=True)

    def empty(self, name):
        folder = self.work / name
        shutil.rmtree(folder, ignore_errors=True)
        folder.mkdir(parents=True)
        return folder

    def ndk(self, name, **options):
        folder = self.empty(name)
        pretended_ndk.make(folder, self.clang, self.tools, self.jni, **options)
        return folder


def copy_of_the_project(folder):
    for entry in ROOT.iterdir():
        if entry.name in LEFT_OUT:
            continue
        copy = shutil.copytree if entry.is_dir() else shutil.copy
        copy(entry, folder / entry.name)
    return folder


def run(command, cwd, **environment):
    """Runs a command in an environment that names no NDK, device or cache but those given: status, output, errors."""
    variables = {name: value for name, value in os.environ.items()
                 if not name.startswith(("ANDROID_", "CMAKE_", "KYFACE_", "GTEST_"))}
    variables.update({name: str(value) for name, value in environment.items()})
    result = subprocess.run([str(part) for part in command], cwd=cwd, env=variables, stdin=subprocess.DEVNULL,
                            stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True, check=False)
    return result.returncode, result.stdout, result.stderr
