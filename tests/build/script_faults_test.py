# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Scripts whose disk is full, whose folders are read-only, that are interrupted, or of which two run at once.

They run in a copy of the project's folder, beside tools that only pretend.
"""

import hashlib
import os
import re
import shutil
import signal
import subprocess
import sys
import tempfile
import time
import unittest
from pathlib import Path

ROOT = Path(sys.argv.pop(1)).resolve()
NOBODY = 65534
# One that everybody may run, for the scripts that are in Python: the tool of this name only pretends.
PYTHON = shutil.which("python3", path="/usr/bin") or sys.executable

TOOLS = {
    # Builds by noting when it was at it, and puts down the libraries and archives that scripts look for.
    "cmake": """\
        echo "begin $$" >>"$TRIAL/log"
        sleep "${BUILD_SECONDS:-0}"
        if [ "$1" = --build ]; then
          mkdir -p "build/$3/lib" "build/$3/jar" "build/$3/bin" "build/$3/profiles"
          for library in jni_kyface_api kyface_api; do echo "$library" >"build/$3/lib/lib$library.so"; done
          echo jar >"build/$3/jar/faceapi.jar"
          cp "$TRIAL/tools/java" "build/$3/bin/java"
        fi
        echo "end $$" >>"$TRIAL/log"
        exit "${BUILD_STATUS:-0}"
        """,
    "java": """\
        echo half >out/faces.png
        printf "${JAVA_SAYS:-}"
        exit "${JAVA_STATUS:-0}"
        """,
    "mvn": """\
        echo fetched >>"$TRIAL/log"
        for option in "$@"; do
          case $option in -DoutputDirectory=*) jars=${option#*=} ;; esac
        done
        mkdir -p "$jars"
        printf half >"$jars/one.jar"
        sleep "${FETCH_SECONDS:-0}"
        [ -z "${FETCH_FAILS:-}" ] || exit 1
        printf whole >"$jars/one.jar"
        """,
    "jar": """\
        while [ $# -gt 0 ]; do
          case $1 in
            --file) file=$2 ;;
            --extract) mkdir -p com ;;
            --list) exit 0 ;;
          esac
          shift
        done
        case ${file:-} in
          */faceapi.jar) ;;
          *) echo half >"$file"; [ -z "${JAR_FAILS:-}" ] || exit 1; echo whole >"$file" ;;
        esac
        """,
    "javadoc": 'while [ "$1" != -d ]; do shift; done; mkdir -p "$2"; touch "$2/index.html"\n',
    "llvm-strip-19": 'while [ "$1" != -o ]; do shift; done; cp "$3" "$2"\n',
    "clang-19": "exit 0\n",
    "python3": "exit 0\n",
    "apt-get": "exit 0\n",
    "ctest": "echo '100% tests passed, 0 tests failed out of 0'\n",
}


class Scripts(unittest.TestCase):
    def setUp(self):
        self.folder = Path(tempfile.mkdtemp()).resolve()
        self.addCleanup(shutil.rmtree, self.folder)
        self.folder.chmod(0o755)
        self.clone = self.folder / "clone"
        for name in ("scripts", "cmake", "android", "bench/tool", "fuzz/java", "java", "fastcv/include", "tests/mutation"):
            shutil.copytree(ROOT / name, self.clone / name)
        (self.clone / "demo").mkdir()
        for name in ("CMakeLists.txt", "LICENSE", "demo/portrait.png"):
            shutil.copy(ROOT / name, self.clone / name)
        tools = self.folder / "tools"
        tools.mkdir()
        setup = (ROOT / "scripts/setup.sh").read_text()
        installed = "".join(f"ii {name}, \\n" for name in sorted(set(re.findall(r"[a-z0-9][a-z0-9.+-]+", setup))))
        for name, text in {**TOOLS, "dpkg-query": f"printf '{installed}'\n"}.items():
            (tools / name).write_text("#!/bin/bash\nset -e\n" + text)
            (tools / name).chmod(0o755)

    def install_nothing(self):
        (self.clone / "scripts/setup.sh").write_text("#!/bin/bash\n")

    def start(self, *command, limit="", user=None, **environment):
        """A script of the copy; `limit` comes before it in its shell."""
        return subprocess.Popen(
            ["bash", "-c", f'{limit} exec "$@"', "bash", *command],
            cwd=self.clone, stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True, start_new_session=True, user=user,
            env={**os.environ, "PATH": f"{self.folder}/tools:{os.environ['PATH']}", "TRIAL": str(self.folder),
                 "ANDROID_NDK_HOME": "", "ANDROID_NDK": "", **environment},
        )  # fmt: skip

    def run_script(self, *command, **options):
        process = self.start(*command, **options)
        out, err = process.communicate(timeout=60)
        return process.returncode, out, err

    def trial(self, body):
        """A script of the project's, with this body."""
        script = self.clone / "scripts/trial"
        script.write_text(f'#!/bin/bash\nsource "$(dirname "${{BASH_SOURCE[0]}}")/common.sh"\n{body}\n')
        script.chmod(0o755)
        return "scripts/trial"

    def log(self):
        log = self.folder / "log"
        return log.read_text().splitlines() if log.exists() else []

    # ---- nowhere to write

    WRITERS = (
        ("scripts/demo",), ("scripts/package",), ("scripts/soak", "10"), ("scripts/fuzz", "1"), ("scripts/coverage",),
        ("scripts/test", "--preset", "host"), ("scripts/accuracy",), ("scripts/lint",),
        (PYTHON, "scripts/bench"), (PYTHON, "scripts/bench", "--update"), (PYTHON, "scripts/mutate"),
    )  # fmt: skip

    def assert_refused(self, command, status, out, err):
        self.assertNotEqual(status, 0, command)
        self.assertEqual(out, "", command)
        sentences = [line for line in err.splitlines() if "installing" not in line]
        self.assertEqual(len(sentences), 1, err)
        self.assertRegex(sentences[0], rf"{self.clone}/\S+ cannot be written to: it is no folder, or read-only, or its disk")

    def test_full_disks(self):
        self.install_nothing()
        for command in self.WRITERS:
            # What ends at once where a file would grow stands for a disk without room.
            answer = self.run_script(*command, limit="trap '' XFSZ; ulimit -f 0;")
            self.assert_refused(command, *answer)
            self.assertEqual(self.log(), [], "nothing was built before")

    def test_read_only_folders(self):
        self.install_nothing()
        for name in ("out", "build"):
            (self.clone / name).mkdir()
            (self.clone / name).chmod(0o555)
        user = NOBODY if os.geteuid() == 0 else None
        for command in self.WRITERS:
            self.assert_refused(command, *self.run_script(*command, user=user))

    def test_files_in_place_of_folders(self):
        self.install_nothing()
        for name in ("out", "build"):
            (self.clone / name).write_text("")
        for command in self.WRITERS:
            self.assert_refused(command, *self.run_script(*command))
        self.assertEqual(self.run_script("scripts/demo")[0], 3)

    def test_setup_without_room(self):
        for limit in ("trap '' XFSZ; ulimit -f 0;", ""):
            if not limit:
                shutil.rmtree(self.clone / ".deps", ignore_errors=True)
                (self.clone / ".deps").write_text("")
            self.assert_refused("setup", *self.run_script("scripts/setup.sh", "fuzz-java", limit=limit))

    # ---- two at once, and one that was interrupted

    def test_builds_wait_for_one_another(self):
        script = self.trial("build host something")
        both = [self.start(script, BUILD_SECONDS="0.3") for _ in range(2)]
        errors = [process.communicate(timeout=60)[1] for process in both]
        self.assertEqual([process.returncode for process in both], [0, 0], errors)
        log = self.log()
        self.assertEqual(len(log), 8)
        self.assertEqual([line.split()[0] for line in log], ["begin", "end"] * 4, "one after the other")
        self.assertEqual(sum("waiting for another script that works on build/host" in error for error in errors), 1)

    def test_benchmarks_wait_for_builds(self):
        build = self.start(self.trial("build aarch64 something"), BUILD_SECONDS="1")
        while not self.log():
            time.sleep(0.02)
        # It has nothing to measure once it has built.
        _, _, err = self.run_script(PYTHON, "scripts/bench", "--count")
        self.assertEqual(build.wait(60), 0, build.communicate())
        self.assertEqual([line.split()[0] for line in self.log()], ["begin", "end"] * 4, "one after the other")
        self.assertIn("bench: waiting for another script that works on build/aarch64\n", err)

    def test_records_are_whole(self):
        page = self.clone / "page"
        replace = "import clone, pathlib, sys; clone.replace(pathlib.Path(sys.argv[1]), sys.argv[2])"
        write = (PYTHON, "-c", f"import sys; sys.path.insert(0, 'scripts'); {replace}", str(page))
        self.assertEqual(self.run_script(*write, "before")[0], 0)
        self.assertNotEqual(self.run_script(*write, "x" * 5000, limit="trap '' XFSZ; ulimit -f 1;")[0], 0)
        self.assertEqual(page.read_text(), "before")
        self.assertEqual([path.name for path in self.clone.glob(".page*")], [])

    def test_builds_of_two_presets_do_not_wait(self):
        first = self.start(self.trial('build "$1"'), "host", BUILD_SECONDS="5")
        while not self.log():
            time.sleep(0.02)
        status, _, err = self.run_script("scripts/trial", "aarch64")
        self.assertEqual(status, 0)
        self.assertNotIn("waiting", err)
        os.killpg(first.pid, signal.SIGKILL)
        first.communicate()
        # Nobody has to tidy up after it.
        status, _, err = self.run_script("scripts/trial", "host")
        self.assertEqual(status, 0)
        self.assertNotIn("waiting", err)

    def test_a_build_that_fails_lets_others_go_on(self):
        script = self.trial("build host || echo failed; build host")
        status, out, _ = self.run_script(script, BUILD_STATUS="1")
        self.assertEqual((status, out), (1, "failed\n"))

    # ---- what is fetched

    def fetching(self):
        content = hashlib.sha256(b"whole").hexdigest()
        (self.clone / "fuzz/java/jars.sha256").write_text(f"{content}  one.jar\n")
        return ("scripts/setup.sh", "fuzz-java"), self.clone / ".deps/fuzz-java"

    def test_fetching_that_fails_leaves_nothing(self):
        command, fetched = self.fetching()
        status, _, err = self.run_script(*command, FETCH_FAILS="1")
        self.assertEqual(status, 1)
        self.assertIn("setup.sh: Maven could not fetch the fuzzer of the Java classes; they are not fuzzed\n", err)
        self.assertFalse(fetched.exists())
        status, _, err = self.run_script(*command)
        self.assertEqual(status, 0, err)
        self.assertEqual((fetched / "one.jar").read_text(), "whole")

    def test_fetching_that_is_interrupted_is_repeated(self):
        command, fetched = self.fetching()
        process = self.start(*command, FETCH_SECONDS="20")
        while not self.log():
            time.sleep(0.02)
        os.killpg(process.pid, signal.SIGKILL)
        process.communicate()
        self.assertFalse(fetched.exists())
        (self.clone / ".deps/models.abcdef").mkdir()
        status, _, err = self.run_script(*command)
        self.assertEqual(status, 0, err)
        self.assertEqual((fetched / "one.jar").read_text(), "whole")
        left = sorted(path.name for path in (self.clone / ".deps").iterdir() if not path.name.startswith("."))
        self.assertEqual(left, ["fuzz-java"], "and of the other nothing is left")

    def test_two_fetch_once(self):
        command, fetched = self.fetching()
        both = [self.start(*command, FETCH_SECONDS="0.3") for _ in range(2)]
        errors = [process.communicate(timeout=60)[1] for process in both]
        self.assertEqual([process.returncode for process in both], [0, 0], errors)
        self.assertEqual(self.log(), ["fetched"])
        self.assertEqual((fetched / "one.jar").read_text(), "whole")

    # ---- what is made

    def test_half_a_package_is_none(self):
        self.install_nothing()
        status, _, err = self.run_script("scripts/package", JAR_FAILS="1")
        self.assertNotEqual(status, 0)
        self.assertFalse((self.clone / "out/package").exists())
        status, _, err = self.run_script("scripts/package")
        self.assertEqual(status, 0, err)
        files = sorted((self.clone / "out/package").rglob("*"))
        self.assertTrue(any(file.suffix == ".aar" for file in files))
        self.assertNotEqual(self.run_script("scripts/package", JAR_FAILS="1")[0], 0)
        self.assertEqual(sorted((self.clone / "out/package").rglob("*")), files, "the earlier one stays")
        for file in files:
            if file.suffix in (".aar", ".jar"):
                self.assertEqual(file.read_text(), "whole\n")

    def test_half_a_picture_is_none(self):
        self.install_nothing()
        for java_status, left in (("0", True), ("1", True), ("2", False), ("3", False), ("137", False)):
            status, _, err = self.run_script("scripts/demo", JAVA_STATUS=java_status)
            self.assertEqual(status, int(java_status), err)
            self.assertEqual((self.clone / "out/faces.png").exists(), left, java_status)

    # ---- what is found

    def test_complaints_of_the_virtual_machine(self):
        self.fetching()
        said = "WARNING: JNI local refs: 99, exceeds capacity: 32\\n\\tat sun.Some.thing(Native Method)\\n\\tat com.{}.call\\n"
        status, _, err = self.run_script("scripts/fuzz", "1", "--java", JAVA_SAYS=said.format("another"))
        self.assertEqual(status, 0, err)
        status, _, err = self.run_script("scripts/fuzz", "1", "--java", JAVA_SAYS=said.format("vantrel"))
        self.assertEqual(status, 1)
        self.assertIn("fuzz: the virtual machine complained\n", err)


if __name__ == "__main__":
    unittest.main()
