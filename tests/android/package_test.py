# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""scripts/package for Android: two ABIs, by a pretended NDK, in copies of the project in two folders."""

import argparse
import hashlib
import json
import re
import shutil
import subprocess
import sys
import unittest
import zipfile

from machine import Machine, copy_of_the_project, run

ABIS = ["arm64-v8a", "x86_64"]
TRIPLES = {"arm64-v8a": "aarch64-linux-gnu", "x86_64": "x86_64-linux-gnu"}
MODULE = "prefab/modules/jni_kyface_api"


def package(project, *options, **environment):
    return run(["scripts/package", *options], project, **environment)


def hashes(folder):
    return {str(path.relative_to(folder)): hashlib.sha256(path.read_bytes()).hexdigest()
            for path in sorted(folder.rglob("*")) if path.is_file()}


def engine(path, abi, symbols=("ky_face_detect",)):
    """A library by the engine's name."""
    source = "".join(f"void {symbol}(void);\nvoid {symbol}(void) {{}}\n" for symbol in symbols)
    path.parent.mkdir(parents=True, exist_ok=True)
    subprocess.run([machine.clang, f"--target={TRIPLES[abi]}", "-fuse-ld=lld", "-nostdlib", "-shared", "-fPIC", "-x", "c",
                    "-", "-o", path, "-Wl,-soname,libkyface_api.so"], input=source, text=True, check=True)
    return path


def declared_by_the_engine(project):
    return sorted(set(re.findall(r"\b(ky_\w+)\(", (project / "kyface_api/include/kyface_api/kyface_api.h").read_text())))


class Refusals(unittest.TestCase):
    """What is said before anything is built."""

    @classmethod
    def setUpClass(cls):
        cls.project = copy_of_the_project(machine.empty("refusals"))
        cls.ndk = machine.ndk("ndk-refusals")

    def refused(self, sentence, *options, **environment):
        status, output, errors = package(self.project, *options, **environment)
        self.assertEqual((status, output, errors), (1, "", f"package: {sentence}\n"))

    def test_an_ndk_that_is_not_there(self):
        self.refused('ANDROID_NDK_HOME is "/no/such/ndk", and there is no such folder', ANDROID_NDK_HOME="/no/such/ndk")
        self.refused('ANDROID_NDK is "/no/such/ndk", and there is no such folder', ANDROID_NDK="/no/such/ndk")

    def test_a_folder_that_is_no_ndk(self):
        self.refused(f'ANDROID_NDK_HOME is "{self.project}", which is no Android NDK: '
                     "it has no build/cmake/android.toolchain.cmake", ANDROID_NDK_HOME=self.project)

    def test_half_an_ndk(self):
        half = machine.empty("half-an-ndk")
        (half / "build" / "cmake").mkdir(parents=True)
        (half / "build" / "cmake" / "android.toolchain.cmake").write_text("")
        self.refused(f"{half} is no whole Android NDK: it has no toolchains/llvm/prebuilt", ANDROID_NDK_HOME=half)

    def test_engines_that_do_not_fit(self):
        arm = engine(machine.work / "arm" / "libkyface_api.so", "arm64-v8a")
        folder = machine.empty("half-of-the-engines")
        engine(folder / "arm64-v8a" / "libkyface_api.so", "arm64-v8a")
        self.refused("--engine: one library cannot be that of arm64-v8a x86_64; give a folder with one for each, or --abi",
                     "--engine", arm, ANDROID_NDK_HOME=self.ndk)
        self.refused(f"--engine: {arm} is no library of x86_64", "--engine", arm, "--abi", "x86_64",
                     ANDROID_NDK_HOME=self.ndk)
        self.refused(f"--engine: there is no {folder}/x86_64/libkyface_api.so", "--engine", folder,
                     ANDROID_NDK_HOME=self.ndk)
        self.refused("there is no nowhere.so", "--engine", "nowhere.so", ANDROID_NDK_HOME=self.ndk)
        self.refused("--engine takes an Android NDK: set ANDROID_NDK_HOME to its folder", "--engine", arm)

    def test_a_folder_of_dlib_that_is_not_there(self):
        self.refused('KYFACE_DLIB_SOURCE is "/no/such/dlib", and there is no such folder', ANDROID_NDK_HOME=self.ndk,
                     KYFACE_DLIB_SOURCE="/no/such/dlib")

    def test_abis(self):
        self.refused("there is no ABI mips; the ABIs are arm64-v8a and x86_64", "--abi", "mips")
        self.refused("x86_64 takes an Android NDK: set ANDROID_NDK_HOME to its folder", "--abi", "x86_64")


class Package(unittest.TestCase):
    """Built without optimisation: what is looked at does not depend on it."""

    @classmethod
    def setUpClass(cls):
        cls.ndk = machine.ndk("ndk", compile_options="-O0 -g1 -Qunused-arguments")
        cls.project, cls.elsewhere = (copy_of_the_project(machine.empty(name)) for name in ("one", "another/folder"))
        cls.engines = machine.empty("engines")
        for abi in ABIS:
            engine(cls.engines / abi / "libkyface_api.so", abi, declared_by_the_engine(cls.project))
        # Both ABIs, each linked against its engine.
        cls.listing = cls.package_of(cls.project, "both", "--engine", cls.engines)
        (cls.aar,) = (machine.work / "both").glob("*.aar")
        for project, name in ((cls.project, "here"), (cls.elsewhere, "elsewhere")):
            cls.package_of(project, name, "--abi", "arm64-v8a", "--without-engine")

    @classmethod
    def package_of(cls, project, name, *options):
        """Packages, takes what was made elsewhere, and returns what was said."""
        status, listing, errors = package(project, *options, ANDROID_NDK_HOME=cls.ndk)
        if status != 0:
            raise AssertionError(errors)
        shutil.rmtree(machine.work / name, ignore_errors=True)
        (project / "out" / "package").rename(machine.work / name)
        return listing

    def test_has_the_same_bytes_from_two_folders(self):
        here, elsewhere = (hashes(machine.work / name) for name in ("here", "elsewhere"))
        self.assertEqual(here, elsewhere)
        self.assertEqual(sorted(here), ["faceapi-1.0.0-javadoc.jar", "faceapi-1.0.0-sources.jar", "faceapi-1.0.0.aar",
                                        "faceapi-1.0.0.pom", "symbols/arm64-v8a/libjni_kyface_api.so"])

    def test_names_no_folder_of_this_machine(self):
        for name in ("both", "here"):
            for path in (machine.work / name).rglob("*.so"):
                self.assertNotIn(str(machine.work).encode(), path.read_bytes(), path)
        self.assertEqual(len(list((machine.work / "both").rglob("*.so"))), 2)

    def test_holds_exactly_its_entries(self):
        expected = ["AndroidManifest.xml", "LICENSE", "NOTICE.txt", "R.txt", "README.txt", "classes.jar", "proguard.txt",
                    "prefab/prefab.json", f"{MODULE}/module.json", f"{MODULE}/include/fastcv/fastcv.h"]
        for abi in ABIS:
            expected += [f"jni/{abi}/libjni_kyface_api.so", f"{MODULE}/libs/android.{abi}/abi.json",
                         f"{MODULE}/libs/android.{abi}/libjni_kyface_api.so"]
        with zipfile.ZipFile(self.aar) as archive:
            names = archive.namelist()
            self.assertEqual(sorted(expected), sorted(names))
            self.assertEqual(self.listing.split(), names)
            for abi in ABIS:
                description = json.loads(archive.read(f"{MODULE}/libs/android.{abi}/abi.json"))
                self.assertEqual(description, {"abi": abi, "api": 24, "ndk": 27, "stl": "none", "static": False})
                library = archive.read(f"jni/{abi}/libjni_kyface_api.so")
                self.assertEqual(library, archive.read(f"{MODULE}/libs/android.{abi}/libjni_kyface_api.so"))
        self.assertEqual(self.aar.name, "faceapi-1.0.0.aar")

    def test_its_libraries_are_aligned_for_large_pages(self):
        with zipfile.ZipFile(self.aar) as archive:
            for abi, kind in zip(ABIS, ("AArch64", "X86-64")):
                library = machine.empty(f"packaged-{abi}") / "libjni_kyface_api.so"
                library.write_bytes(archive.read(f"jni/{abi}/libjni_kyface_api.so"))
                headers = subprocess.run([machine.tools["llvm-readelf"], "-hlW", library], stdout=subprocess.PIPE,
                                         text=True, check=True).stdout
                self.assertRegex(headers, f"Machine: .*{kind}")
                loads = [line.split() for line in headers.splitlines() if line.strip().startswith("LOAD")]
                self.assertGreater(len(loads), 1)
                self.assertEqual({int(load[-1], 16) for load in loads}, {16384})

    def test_links_against_the_engine_that_it_is_given(self):
        # One without the functions is no engine, and what was linked before is not packaged in its place.
        empty = engine(machine.empty("no-engine") / "libkyface_api.so", "x86_64")
        status, _, errors = package(self.project, "--engine", empty, "--abi", "x86_64", ANDROID_NDK_HOME=self.ndk)
        self.assertNotEqual(status, 0)
        self.assertIn("undefined symbol: ky_face_create_detector", errors)
        self.assertEqual(list((self.project / "out" / "package").glob("*.aar")), [])

    def test_a_build_folder_remembers_its_ndk(self):
        project = self.elsewhere
        configure = ["cmake", "--preset", "android-arm64"]
        status, _, errors = run(configure, project)
        self.assertEqual(status, 0, errors)
        other = machine.ndk("ndk-other")
        status, _, errors = run(configure, project, ANDROID_NDK_HOME=other)
        self.assertNotEqual(status, 0)
        self.assertIn("another one is named", " ".join(errors.split()))
        # The scripts begin anew.
        (project / "scripts" / "configure").write_text(
            "source scripts/common.sh\nsource scripts/android.sh\nuse_ndk \"$(named_ndk)\"\n"
            "configure_android android-arm64\n")
        status, _, errors = run(["bash", "scripts/configure"], project, ANDROID_NDK_HOME=other)
        self.assertEqual(status, 0, errors)
        self.assertIn(f"KYFACE_NDK:PATH={other}\n", (project / "build/android-arm64/CMakeCache.txt").read_text())
        status, _, errors = run([*configure, "--fresh"], project)
        self.assertNotEqual(status, 0)
        self.assertIn("Set ANDROID_NDK_HOME (or ANDROID_NDK) to the folder of an Android NDK.", " ".join(errors.split()))


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__)
    Machine.add_arguments(parser)
    known, rest = parser.parse_known_args()
    machine = Machine(known)
    unittest.main(argv=[sys.argv[0], *rest])
