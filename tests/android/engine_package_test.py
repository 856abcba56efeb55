# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""The open engine's archive for Android: two ABIs, by a pretended NDK, in copies of the project in two folders."""

import argparse
import re
import subprocess
import sys
import unittest
import zipfile

from machine import ROOT, Machine, copy_of_the_project, run

MACHINES = {"arm64-v8a": "AArch64", "x86_64": "X86-64"}
ARCHIVE = "out/package/faceapi-engine-1.0.0.aar"
DLIB = ROOT / ".deps" / "dlib"


@unittest.skipUnless(DLIB.exists(), "there are no sources of dlib: scripts/setup.sh dlib brings them")
class EnginePackage(unittest.TestCase):
    """Built without optimisation: what is looked at does not depend on it."""

    @classmethod
    def setUpClass(cls):
        ndk = machine.ndk("ndk", cplusplus=True, compile_options="-O0 -g0 -Qunused-arguments")
        cls.project, cls.elsewhere = (copy_of_the_project(machine.empty(name)) for name in ("one", "another/folder"))
        for project, options in ((cls.project, []), (cls.elsewhere, ["--abi", "arm64-v8a"])):
            status, _, errors = run(["scripts/package", *options], project, ANDROID_NDK_HOME=ndk, KYFACE_DLIB_SOURCE=DLIB)
            if status != 0:
                raise AssertionError(errors)
        cls.libraries = {}
        with zipfile.ZipFile(cls.project / ARCHIVE) as archive:
            cls.names = archive.namelist()
            for abi in MACHINES:
                library = machine.empty(f"packaged-{abi}") / "libkyface_api.so"
                library.write_bytes(archive.read(f"jni/{abi}/libkyface_api.so"))
                cls.libraries[abi] = library

    def read(self, abi, *options):
        return subprocess.run([machine.tools["llvm-readelf"], *options, self.libraries[abi]], stdout=subprocess.PIPE,
                              text=True, check=True).stdout

    def test_holds_exactly_its_entries(self):
        self.assertEqual(sorted(self.names), sorted([
            "AndroidManifest.xml", "LICENSE", "NOTICE.txt", "R.txt", "README.txt", "classes.jar",
            *(f"jni/{abi}/libkyface_api.so" for abi in MACHINES)]))

    def test_has_the_same_bytes_from_two_folders(self):
        with zipfile.ZipFile(self.project / ARCHIVE) as one, zipfile.ZipFile(self.elsewhere / ARCHIVE) as other:
            self.assertEqual(set(one.namelist()) - set(other.namelist()), {"jni/x86_64/libkyface_api.so"})
            for name in other.namelist():
                self.assertEqual(one.read(name), other.read(name), name)

    def test_names_no_folder_of_this_machine(self):
        for abi, library in self.libraries.items():
            content = library.read_bytes()
            self.assertNotIn(str(machine.work).encode(), content, abi)
            self.assertNotIn(str(DLIB).encode(), content, abi)

    def test_needs_the_c_library_alone(self):
        for abi in MACHINES:
            dynamic = self.read(abi, "-d")
            needed = set(re.findall(r"\(NEEDED\).*\[(.*)\]", dynamic))
            self.assertIn("libc.so", needed)
            self.assertLessEqual(needed, {"libc.so", "libm.so", "libdl.so"})
            self.assertIn("[libkyface_api.so]", dynamic)
            self.assertNotIn("RUNPATH", dynamic)

    def test_exports_the_engines_functions_alone(self):
        headers = (ROOT / "kyface_api/include/kyface_api/kyface_api.h", ROOT / "engine/include/engine/ky_engine.h")
        declared = {name for header in headers for name in re.findall(r"\b(ky_(?:face|verify)_\w+)\(", header.read_text())}
        for abi, library in self.libraries.items():
            lines = subprocess.run([machine.tools["llvm-nm"], "-D", "--defined-only", "--format=just-symbols", library],
                                   stdout=subprocess.PIPE, text=True, check=True).stdout.split()
            exported = {line.split("@")[0] for line in lines}
            self.assertLessEqual(declared - exported, set(), abi)
            self.assertEqual({name for name in exported if not name.startswith("ky_")}, set(), abi)

    def test_is_aligned_for_large_pages(self):
        for abi, kind in MACHINES.items():
            headers = self.read(abi, "-hlW")
            self.assertRegex(headers, f"Machine: .*{kind}")
            loads = [line.split() for line in headers.splitlines() if line.strip().startswith("LOAD")]
            self.assertGreater(len(loads), 1)
            self.assertEqual({int(load[-1], 16) for load in loads}, {16384})


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__)
    Machine.add_arguments(parser)
    known, rest = parser.parse_known_args()
    machine = Machine(known)
    unittest.main(argv=[sys.argv[0], *rest])
