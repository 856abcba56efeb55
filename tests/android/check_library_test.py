# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""The checks of libraries that are packaged, over small libraries of both ABIs: each finds what it is there for."""

import argparse
import subprocess
import sys
import unittest

from machine import Machine, ROOT, run
from pretended_ndk import TRIPLES

SOUND = ["-Wl,-z,max-page-size=16384", "-Wl,-z,relro", "-Wl,-z,now", "-Wl,-soname,libjni_kyface_api.so"]
SOURCE = """\
int __android_log_print(int priority, const char* tag, const char* format, ...);
int AndroidBitmap_getInfo(void*, void*, void*);
int ky_face_detect(void);
int probe(void);
int probe(void) { return __android_log_print(6, "", "") + AndroidBitmap_getInfo(0, 0, 0) + ky_face_detect(); }
"""


class Checks(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.system = machine.empty("system")
        for abi in TRIPLES:
            (cls.system / abi).mkdir()
            for name, symbol in (("log", "__android_log_print"), ("jnigraphics", "AndroidBitmap_getInfo"),
                                 ("kyface_api", "ky_face_detect"), ("c", "malloc"), ("m", "erf")):
                cls.link(abi, cls.system / abi / f"lib{name}.so", f"void {symbol}(void) {{}}", f"-Wl,-soname,lib{name}.so")

    @staticmethod
    def link(abi, library, source, *options):
        subprocess.run([machine.clang, f"--target={TRIPLES[abi]}-gnu", "-fuse-ld=lld", "-nostdlib", "-shared", "-fPIC",
                        "-fno-builtin", "-w", "-x", "c", "-", "-o", library, *options], input=source, text=True, check=True)

    def library(self, abi, *options, source="", without=()):
        """A library whose needs are those of the packaged one."""
        library = machine.empty("checked") / "libjni_kyface_api.so"
        sound = [option for option in SOUND if option not in without]
        self.link(abi, library, SOURCE + source, "-L", self.system / abi, "-llog", "-ljnigraphics", "-lkyface_api", *sound,
                  *options)
        return library

    def findings(self, check, library, *options):
        status, output, errors = run(
            [sys.executable, ROOT / "tests/build/check_library.py", check, library, "--nm", machine.tools["llvm-nm"],
             "--readelf", machine.tools["llvm-readelf"], "--android", "--imports", ROOT / "android/imports.txt",
             *options], machine.work)
        self.assertEqual(errors, "")
        lines = output.splitlines()
        # The first line of what is needed tells all of it; those behind it are findings.
        found = [line for line in lines[1 if check == "needed" else 0:] if "align " not in line
                 and not line.endswith(" imported")]
        self.assertEqual(status, 1 if found else 0)
        return found

    def test_nothing_is_found_in_a_sound_library(self):
        for abi in TRIPLES:
            library = self.library(abi)
            for check in ("layout", "needed", "imports"):
                self.assertEqual(self.findings(check, library), [])

    def test_small_pages(self):
        for abi in TRIPLES:
            library = self.library(abi, "-Wl,-z,max-page-size=4096", without=SOUND[:1])
            self.assertEqual(set(self.findings("layout", library)), {"a segment is not aligned to 16384 bytes"})

    def test_lazy_binding(self):
        for abi in TRIPLES:
            self.assertEqual(self.findings("layout", self.library(abi, "-Wl,-z,lazy", without=SOUND[2:3])),
                             ["does not bind everything when it is loaded"])

    def test_imports_of_later_levels(self):
        later = "void* aligned_alloc(unsigned long, unsigned long); void* later(void) { return aligned_alloc(64, 64); }"
        weak = later.replace("aligned_alloc(unsigned", "__attribute__((weak)) aligned_alloc(unsigned")
        for abi in TRIPLES:
            self.assertEqual(self.findings("imports", self.library(abi, source=later)),
                             ["imports what Android may lack: aligned_alloc"])
            self.assertEqual(self.findings("imports", self.library(abi, source=weak)), [])

    def test_imports_that_an_ndk_knows(self):
        rare = "double erf(double); double rare(double x) { return erf(x); }"
        for abi in TRIPLES:
            library = self.library(abi, "-lm", source=rare)
            self.assertEqual(self.findings("imports", library), ["imports what Android may lack: erf"])
            self.assertEqual(self.findings("imports", library, "--system", self.system / abi), [])
            # A library that is there and is not needed provides nothing.
            library = self.library(abi, source=rare)
            self.assertEqual(self.findings("imports", library, "--system", self.system / abi),
                             ["imports what Android may lack: erf"])

    def test_needs(self):
        for abi in TRIPLES:
            self.assertEqual(self.findings("needed", self.library(abi, "-lc")), [])
            self.assertEqual(self.findings("needed", self.library(abi, "-Wl,-rpath,/opt/engine")),
                             ["looks for libraries in /opt/engine"])
            self.assertEqual(self.findings("needed", self.library(abi, "-Wl,-soname,other.so", without=SOUND[3:])),
                             ["has another name than libjni_kyface_api.so"])

    def test_the_engine_needs_the_system_alone(self):
        for abi in TRIPLES:
            engine = machine.empty("engine") / "libkyface_api.so"
            source = "int erf(void);\nint ky_face_detect(void) { return erf(); }"
            options = ["-L", self.system / abi, *SOUND[:3], "-Wl,-soname,libkyface_api.so", "-lm"]
            self.link(abi, engine, source, *options)
            for check in ("layout", "needed"):
                self.assertEqual(self.findings(check, engine, "--engine"), [])
            self.link(abi, engine, source, *options, "-llog")
            self.assertEqual(self.findings("needed", engine, "--engine"), ["needs liblog.so"])
            self.assertEqual(set(self.findings("needed", self.library(abi), "--engine")), {
                "needs libjnigraphics.so", "needs libkyface_api.so", "needs liblog.so",
                "has another name than libkyface_api.so"})


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__)
    Machine.add_arguments(parser)
    known, rest = parser.parse_known_args()
    machine = Machine(known)
    unittest.main(argv=[sys.argv[0], *rest])
