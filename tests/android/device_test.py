# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Running programs of an Android build: scripts/device, scripts/test and .ci/run against a pretended adb, which takes a
folder of this machine for the device's, and against a pretended runner."""

import argparse
import os
import shutil
import sys
import unittest
from pathlib import Path

from machine import ROOT, run

TEMPORARY = "/data/local/tmp"

# It notes what it is asked, runs the device's commands by this machine's shell, and can lose the device: FAKE/lose holds a
# word, at the first command with it in it the device is gone.
ADB = r"""#!/bin/bash
fake=@fake@
printf '%s\n' "$*" >>"$fake/calls"
if [ "$1" = devices ]; then
  printf 'List of devices attached\n'
  cat "$fake/devices"
  printf '\n'
  exit
fi
if [ -e "$fake/lose" ] && [[ "$*" == *"$(cat "$fake/lose")"* ]]; then
  touch "$fake/lost"
  [ "$1" != shell ] || printf 'the first half\n'
fi
if [ -e "$fake/lost" ]; then
  echo "error: device 'one' not found" >&2
  exit 1
fi
case $1 in
  shell)
    [ "$(readlink /proc/self/fd/0)" = /dev/null ] || echo "standard input is open" >&2
    cd "$fake/root" && PATH=$fake/device-bin:$PATH exec sh -c "${2//\/data\/local\/tmp/$fake\/root\/data\/local\/tmp}"
    ;;
  push) exec cp -r "$2" "$fake/root$3" ;;
  *) exit 64 ;;
esac
"""

GETPROP = """#!/bin/sh
case $1 in
  ro.product.cpu.abilist) printf '%s\\r\\n' "$(cat @fake@/abis)" ;;
  ro.build.version.sdk) cat @fake@/level ;;
  ro.product.manufacturer) echo Maker ;;
  ro.product.model) echo Phone ;;
  ro.soc.model) echo Chip ;;
  ro.build.version.release) echo 14 ;;
esac
"""

RUNNER = """#!/bin/sh
echo "runner: $*"
echo "libraries: $LD_LIBRARY_PATH"
[ "$1" = option ] && shift
shift
exec "$@"
"""


def write(path, text):
    path.parent.mkdir(parents=True, exist_ok=True)
    path.write_text(text)
    path.chmod(0o755)


class WithDevice(unittest.TestCase):
    def setUp(self):
        shutil.rmtree(work, ignore_errors=True)
        self.fake = work / "fake"
        (self.fake / "root/data/local/tmp").mkdir(parents=True)
        write(work / "bin" / "adb", ADB.replace("@fake@", str(self.fake)))
        write(self.fake / "device-bin" / "getprop", GETPROP.replace("@fake@", str(self.fake)))
        self.attach("one\tdevice")
        self.says("abis", "arm64-v8a,armeabi-v7a")
        self.says("level", "34")
        self.build = work / "build"
        write(self.build / "CMakeCache.txt", "CMAKE_STRIP:FILEPATH=/bin/false\n")
        for library in ("lib/libjni_kyface_api.so", "stand_ins/libkyface_api.so", "stand_ins/libjnigraphics.so"):
            write(self.build / library, library)

    def says(self, name, text):
        (self.fake / name).write_text(text + "\n")

    def attach(self, *devices):
        (self.fake / "devices").write_text("".join(f"{device}\n" for device in devices))

    def calls(self, beginning=""):
        return [call for call in (self.fake / "calls").read_text().splitlines() if call.startswith(beginning)]

    def left(self):
        return sorted(path.name for path in (self.fake / "root/data/local/tmp").iterdir())


class Device(WithDevice):
    """scripts/device."""

    def device(self, *arguments, **environment):
        path = f"{work / 'bin'}:{os.environ['PATH']}"
        return run([ROOT / "scripts/device", *arguments], work, **{"PATH": path, **environment})

    def program(self, text, name="probe_test"):
        write(self.build / "bin" / name, f"#!/bin/sh\n{text}\n")
        return self.build / "bin" / name

    def run_program(self, text, *arguments, **environment):
        return self.device("run", "arm64-v8a", self.build, self.program(text), *arguments, **environment)

    # ---- one program

    def test_brings_back_output_and_success(self):
        status, output, errors = self.run_program('echo "to output: $1"; echo to errors >&2; printf "no newline"', "it's $HOME *")
        self.assertEqual((status, output, errors), (0, "to output: it's $HOME *\nno newline\n", "to errors\n"))
        self.assertEqual(self.left(), [])

    def test_brings_the_program_and_its_libraries(self):
        status, output, _ = self.run_program('pwd; echo "$LD_LIBRARY_PATH"; echo "$TMPDIR"; find . -type f | sort; '
                                             "cat lib/libkyface_api.so")
        here, libraries, temporary, *files, engine = output.splitlines()
        self.assertEqual(status, 0)
        self.assertRegex(here, rf"{TEMPORARY}/kyface\.[0-9.]+$")
        self.assertEqual([libraries, temporary], [f"{here}/lib", here])
        self.assertEqual(files, ["./bin/probe_test", "./lib/libjni_kyface_api.so", "./lib/libjnigraphics.so",
                                 "./lib/libkyface_api.so"])
        self.assertEqual(engine, "stand_ins/libkyface_api.so")
        self.assertEqual(len(self.calls("push")), 1)
        self.assertEqual(self.left(), [])

    def test_an_engine_of_the_build_goes_before_its_stand_in(self):
        write(self.build / "lib/libkyface_api.so", "the engine")
        self.assertEqual(self.run_program("cat lib/libkyface_api.so")[1], "the engine\n")

    def test_brings_back_failures(self):
        for text, expected in (("exit 7", 7), ("kill -ABRT $$", 134), ("exit 125", 125)):
            status, _, errors = self.run_program(f"echo said; {text}")
            self.assertEqual(status, expected)
            self.assertNotIn("lost", errors)
            self.assertEqual(self.left(), [])

    def test_brings_what_arguments_name(self):
        corpus = ROOT / "fuzz" / "corpus" / "geometry"
        status, output, _ = self.run_program('ls "$1" | wc -l; echo "$1" "$2"', corpus, "/etc")
        count, names = output.splitlines()
        self.assertEqual(status, 0)
        self.assertEqual(int(count), len(list(corpus.iterdir())))
        self.assertRegex(names, rf"{TEMPORARY}/kyface\.[0-9.]+/project/fuzz/corpus/geometry /etc$")

    def test_variables_of_googletest_reach_the_program(self):
        output = self.run_program('echo "$GTEST_FILTER"', GTEST_FILTER="A.*:B.'*'", OTHER="no")[1]
        self.assertEqual(output, "A.*:B.'*'\n")
        self.assertNotIn("OTHER", "".join(self.calls()))

    def test_a_lost_device(self):
        self.says("lose", "./bin/")
        status, output, errors = self.run_program("exit 0")
        self.assertEqual((status, output), (125, "the first half\n"))
        self.assertIn("device: the device was lost while it ran probe_test\n", errors)
        self.assertRegex(errors, rf"device: {TEMPORARY}/kyface\.[0-9.]+ is left on the device\n$")

    def test_a_device_that_is_lost_before(self):
        self.says("lose", "push")
        status, output, errors = self.run_program("exit 0")
        self.assertEqual((status, output), (1, ""))
        self.assertIn("device: the device does not take what is to be run\n", errors)
        self.says("lose", "mkdir")
        (self.fake / "lost").unlink()
        self.assertRegex(self.run_program("exit 0")[2], rf"device: the device cannot make {TEMPORARY}/kyface")

    # ---- many programs

    def test_a_session_pushes_once(self):
        first = self.program("cat ../lib/libkyface_api.so 2>/dev/null || cat lib/libkyface_api.so", "first_test")
        second = self.program('ls "$1"', "second_test")
        status, folder, _ = self.device("push", "arm64-v8a", self.build)
        folder = folder.strip()
        self.assertEqual(status, 0)
        self.assertEqual([f"{TEMPORARY}/{name}" for name in self.left()], [folder])
        for program, argument in ((first, "x"), (second, ROOT / "fuzz/corpus/metrics")):
            status, output, _ = self.device("run", "arm64-v8a", self.build, program, argument,
                                            KYFACE_DEVICE_FOLDER=folder)
            self.assertEqual(status, 0)
        self.assertEqual(output.split(), sorted(path.name for path in (ROOT / "fuzz/corpus/metrics").iterdir()))
        self.assertEqual(len(self.calls("push")), 1)
        self.assertEqual(self.device("remove", folder)[0], 0)
        self.assertEqual(self.left(), [])
        self.assertEqual(self.device("remove", "/data")[::2], (1, "device: /data is no folder of this script\n"))

    def test_a_push_that_fails_leaves_nothing(self):
        self.program("true")
        self.says("lose", "chmod")
        self.assertEqual(self.device("push", "arm64-v8a", self.build)[:2], (1, ""))
        (self.fake / "lost").unlink()
        (self.fake / "lose").unlink()
        write(work / "bin" / "adb", (work / "bin" / "adb").read_text().replace("exec cp -r", "exec false"))
        self.assertEqual(self.device("push", "arm64-v8a", self.build)[:2], (1, ""))
        self.assertEqual(len(self.left()), 1)  # of the device that was lost

    # ---- which device

    def refused(self, sentence, *arguments, **environment):
        status, output, errors = self.device(*(arguments or ("check", "arm64-v8a")), **environment)
        self.assertEqual((status, output, errors), (1, "", f"device: {sentence}\n"))

    def test_which_device(self):
        self.assertEqual(self.device("check", "arm64-v8a"), (0, "", ""))
        self.refused("the device one does not run x86_64: it runs arm64-v8a,armeabi-v7a", "check", "x86_64")
        self.says("level", "23")
        self.refused("the device one has API level 23; 24 is the lowest")
        self.says("level", "24")
        self.attach("one\tdevice", "emulator-5554\toffline")
        self.refused("several devices are attached: set ANDROID_SERIAL to one of one, emulator-5554")
        self.assertEqual(self.device("check", "arm64-v8a", ANDROID_SERIAL="one")[0], 0)
        self.refused("the device emulator-5554 is attached, but offline", ANDROID_SERIAL="emulator-5554")
        self.refused("ANDROID_SERIAL is on, and no such device is attached", ANDROID_SERIAL="on")
        self.attach("one\tno permissions (user in plugdev group; are your udev rules wrong?)")
        self.refused("the device one is attached, but no permissions ")
        self.attach()
        self.refused("no device is attached: attach one, or set KYFACE_ANDROID_RUN to a command that runs programs")

    def test_without_adb(self):
        (work / "bin" / "adb").unlink()
        self.assertIsNone(shutil.which("adb"), "this machine has an adb")
        self.refused("running what is built for Android takes adb and an attached device, or a command in "
                     "KYFACE_ANDROID_RUN")

    # ---- the runner

    def test_a_runner_is_given_everything(self):
        write(work / "runner", RUNNER)
        status, output, errors = self.run_program('echo "$1, $FOO"; echo e >&2; exit 9', "a b",
                                                  KYFACE_ANDROID_RUN=work / "runner", FOO="foo")
        program = self.build / "bin" / "probe_test"
        self.assertEqual((status, errors), (9, "e\n"))
        self.assertEqual(output, f"runner: arm64-v8a {program} a b\nlibraries: {self.build}/lib:{self.build}/stand_ins\n"
                                 "a b, foo\n")
        self.assertFalse((self.fake / "calls").exists())
        self.assertEqual(self.device("check", "x86_64", KYFACE_ANDROID_RUN=work / "runner"), (0, "", ""))

    def test_a_runner_may_have_options(self):
        write(work / "runner", RUNNER)
        output = self.run_program("exit 0", KYFACE_ANDROID_RUN=f"{work}/runner option", LD_LIBRARY_PATH="/mine")[1]
        self.assertRegex(output, r"runner: option arm64-v8a /.*\nlibraries: .*/stand_ins:/mine\n")


# What stands in for cmake and ctest: a build of one test that runs and one that cannot.
CMAKE = """#!/bin/bash
echo "cmake $*" >>@log@
[ "$1" = --preset ] || exit 0
mkdir -p build/$2/bin build/$2/lib build/$2/Testing/Temporary
echo CMAKE_STRIP:FILEPATH=/bin/false >build/$2/CMakeCache.txt
printf '#!/bin/sh\\necho "it runs in $(pwd)"\\nexit @status@\\n' >build/$2/bin/probe_test
printf '#!/bin/sh\\necho "asked: $*" >&2\\nprintf "core\\\\tonly\\\\t0\\\\t0\\\\ncounters\\\\tEPERM\\\\n"\\n' >build/$2/bin/bench_phone
printf 'printf "result\\\\tgray\\\\tfastcv\\\\t8x8\\\\t4\\\\t0\\\\t0.5\\\\t-\\\\t-\\\\n"\\n' >>build/$2/bin/bench_phone
chmod +x build/$2/bin/*
"""
CTEST = """#!/bin/bash
echo "ctest $*" >>@log@
scripts/device run arm64-v8a build/$2 build/$2/bin/probe_test && passed=100 failed=0 || passed=0 failed=1
echo "not run on Android: jvm: Android's virtual machine runs apps" >build/$2/Testing/Temporary/LastTest.log
echo "$passed% tests passed, $failed tests failed out of 1"
exit $failed
"""


class Scripts(WithDevice):
    """scripts/test and .ci/run."""

    def setUp(self):
        super().setUp()
        self.project = work / "project"
        for folder in ("scripts", ".ci", "bench/tool", "fuzz/corpus/metrics"):
            shutil.copytree(ROOT / folder, self.project / folder)
        write(self.project / "scripts/setup.sh", "#!/bin/sh\n")
        self.log = work / "log"
        self.ndk = work / "ndk"
        write(self.ndk / "build/cmake/android.toolchain.cmake", "")
        (self.ndk / "toolchains/llvm/prebuilt/linux-x86_64/bin").mkdir(parents=True)
        self.tools(0)

    def tools(self, status):
        for name, text in (("cmake", CMAKE), ("ctest", CTEST)):
            write(work / "bin" / name, text.replace("@log@", str(self.log)).replace("@status@", str(status)))

    def script(self, name, *arguments, **environment):
        path = f"{work / 'bin'}:{os.environ['PATH']}"
        return run([self.project / name, *arguments], work, **{"PATH": path, **environment})

    def test_both_that_are_missing_are_named(self):
        self.attach()
        status, output, errors = self.script("scripts/test", "--preset", "android-arm64")
        self.assertEqual((status, output), (1, ""))
        self.assertEqual(errors.splitlines(), [
            "test: building for Android takes an NDK: set ANDROID_NDK_HOME to its folder",
            "device: no device is attached: attach one, or set KYFACE_ANDROID_RUN to a command that runs programs"])
        self.assertFalse(self.log.exists())
        _, _, errors = self.script("scripts/test", "--preset", "android-arm64", ANDROID_NDK_HOME=self.ndk)
        self.assertEqual(len(errors.splitlines()), 1)
        self.attach("one\tdevice")
        _, _, errors = self.script("scripts/test", "--preset", "android-arm64")
        self.assertEqual(len(errors.splitlines()), 1)

    def test_runs_on_the_device(self):
        status, output, _ = self.script("scripts/test", "--preset", "android-arm64", "--", "-R", "probe",
                                        ANDROID_NDK_HOME=self.ndk)
        self.assertEqual(status, 0)
        self.assertRegex(output, rf"it runs in .*{TEMPORARY}/kyface\.[0-9.]+\n")
        self.assertIn("android-arm64: 100% tests passed, 0 tests failed out of 1\n"
                      "android-arm64: not run: jvm: Android's virtual machine runs apps\n", output)
        self.assertIn("ctest --preset android-arm64 -j 1 -R probe\n", self.log.read_text())
        self.assertEqual(len(self.calls("push")), 1)
        self.assertEqual(self.left(), [])

    def test_cleans_up_after_failures(self):
        self.tools(3)
        status, output, _ = self.script("scripts/test", "--preset", "android-arm64", ANDROID_NDK_HOME=self.ndk)
        self.assertEqual(status, 1)
        self.assertIn("android-arm64: 0% tests passed, 1 tests failed out of 1\n", output)
        self.assertEqual(self.left(), [])

    def test_a_lost_device_fails(self):
        self.says("lose", "./bin/")
        status, output, errors = self.script("scripts/test", "--preset", "android-arm64", ANDROID_NDK_HOME=self.ndk)
        self.assertEqual(status, 1)
        self.assertIn("the device was lost while it ran probe_test", output + errors)
        self.assertIn("is left on the device", output + errors)

    def test_runs_through_the_runner(self):
        write(work / "runner", RUNNER)
        status, output, _ = self.script("scripts/test", "--preset", "android-arm64", ANDROID_NDK_HOME=self.ndk,
                                        KYFACE_ANDROID_RUN=work / "runner")
        self.assertEqual(status, 0)
        self.assertIn("runner: arm64-v8a ", output)
        self.assertFalse((self.fake / "calls").exists())

    def test_bench_measures_the_device(self):
        status, output, errors = self.script("scripts/bench", "--android", "gray", "--size", "8x8",
                                             ANDROID_NDK_HOME=self.ndk)
        self.assertEqual(status, 0, errors)
        self.assertIn("asked: 20 gray 8x8\n", errors)
        self.assertIn("Maker Phone (Chip) Android 14\nonly core (number 0)\n"
                      "  cycles and instructions are not counted there (EPERM);", output)
        self.assertRegex(output, r"\ngray +0\.500\n")
        self.assertEqual(self.left(), [])

    def test_bench_through_the_runner_only_runs(self):
        write(work / "runner", "#!/bin/sh\nshift\nexec \"$@\"\n")
        status, output, errors = self.script("scripts/bench", "--android", ANDROID_NDK_HOME=self.ndk,
                                             KYFACE_ANDROID_RUN=work / "runner")
        self.assertEqual(status, 0, errors)
        self.assertIn("asked: 0 . 1280x720 1278x718\n", errors)
        self.assertEqual(output, "bench_phone runs: 1 results; through KYFACE_ANDROID_RUN they are no measurements\n")

    def test_bench_says_what_is_missing(self):
        self.attach()
        status, output, errors = self.script("scripts/bench", "--android", ANDROID_NDK_HOME=self.ndk)
        self.assertEqual((status, output), (1, ""))
        self.assertEqual(errors, "bench: no device is attached: attach one, or set KYFACE_ANDROID_RUN to a command that "
                                 "runs programs\n")
        self.attach("one\tdevice")
        status, output, errors = self.script("scripts/bench", "--android")
        self.assertEqual((status, output), (1, ""))
        self.assertEqual(errors, "bench: building for Android takes an NDK: set ANDROID_NDK_HOME to its folder\n")

    def ci(self, *arguments, **environment):
        write(self.project / "scripts/test", "#!/bin/sh\necho \"test $*\"\n")
        status, output, _ = self.script(".ci/run", *arguments, **environment)
        self.assertEqual(status, 0)
        return output.splitlines()

    def test_integration_runs_what_there_is(self):
        both = "test --preset host --preset aarch64 --preset android-arm64 --preset android-x86_64"
        self.assertEqual(self.ci(ANDROID_NDK_HOME=self.ndk, KYFACE_ANDROID_RUN="runner"), [both])
        self.assertEqual(self.ci(KYFACE_ANDROID_RUN="runner"), ["run: without Android: ANDROID_NDK_HOME is not set",
                                                                "test "])
        self.assertEqual(self.ci("--lint"), ["test --lint"])
        self.assertEqual(self.ci(ANDROID_NDK_HOME=self.ndk), [
            "run: without android-x86_64: device: the device one does not run x86_64: it runs arm64-v8a,armeabi-v7a",
            "test --preset host --preset aarch64 --preset android-arm64"])
        self.attach()
        self.assertEqual(self.ci(ANDROID_NDK_HOME=self.ndk)[-1], "test ")


if __name__ == "__main__":
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("--work", required=True, type=Path)
    known, rest = parser.parse_known_args()
    work = known.work
    unittest.main(argv=[sys.argv[0], *rest])
