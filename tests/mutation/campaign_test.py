# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Tests of a campaign, over a small project of its own."""

import contextlib
import io
import json
import subprocess
import tempfile
import unittest
from argparse import Namespace
from pathlib import Path

from run import Campaign

FILES = {
    "CMakeLists.txt": """\
cmake_minimum_required(VERSION 3.25)
project(small LANGUAGES CXX)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/bin)
enable_testing()
add_executable(check fastcv/sum.cpp check.cpp)
add_test(NAME check COMMAND check)
""",
    "CMakePresets.json": json.dumps(
        {
            "version": 4,
            "configurePresets": [
                {"name": "host", "generator": "Ninja", "binaryDir": "${sourceDir}/build/host",
                 "cacheVariables": {"CMAKE_BUILD_TYPE": "Release"}}
            ],
            "buildPresets": [{"name": "host", "configurePreset": "host"}],
            "testPresets": [{"name": "host", "configurePreset": "host"}],
        }
    ),
    "check.cpp": """\
int sum(int a, int b);
int unseen(int a);
int main() { return sum(2, 3) == 5 && unseen(0) == 0 ? 0 : 1; }
""",
    "fastcv/sum.cpp": """\
int sum(int a, int b) { return a + b; }
int unseen(int a) { return a << 3; }
int unnamed(int a) { return a; }
template <int n> int sized() { int x[n]; return sizeof x; }
int built() { return sized<1>() < 4 || 4 / 4 == 1; }
""",
}  # fmt: skip


def campaign(root, report=False):
    """(exit status, what it printed) of a campaign over the small project."""
    arguments = Namespace(path=[], sample=None, seed=1, preset="host", jobs=2, branches=False, tests="", list=False, report=report)
    printed = io.StringIO()
    with contextlib.redirect_stdout(printed), contextlib.redirect_stderr(io.StringIO()):
        status = Campaign(root, arguments).run()
    return status, printed.getvalue()


class Campaigns(unittest.TestCase):
    def test_tells_noticed_from_unnoticed(self):
        with tempfile.TemporaryDirectory() as folder:
            root = Path(folder).resolve()
            for name, text in FILES.items():
                (root / name).parent.mkdir(exist_ok=True)
                (root / name).write_text(text)
            subprocess.run(["git", "init", "-q"], cwd=root, check=True)
            subprocess.run(["git", "add", "."], cwd=root, check=True)

            status, printed = campaign(root)
            self.assertEqual(status, 1, printed)
            results = [json.loads(line) for line in (root / "out/mutate/host.jsonl").read_text().splitlines()]
            by_change = {entry["key"].rsplit(": ", 1)[1]: entry["result"] for entry in results}
            self.assertEqual(by_change["+ -> -"], "noticed")
            self.assertEqual(by_change["<< -> >>"], "unnoticed")
            self.assertEqual(by_change["3 -> 4"], "unnoticed")
            self.assertIn("fastcv/sum.cpp: int unseen(int a) { return a << 3; } @29 shift: << -> >>\n", printed)
            self.assertEqual(campaign(root, report=True), (status, printed), "and so again, without a trial")
            self.assertEqual((root / "fastcv/sum.cpp").read_text(), FILES["fastcv/sum.cpp"])
            copy = root / "build/mutate/tree/fastcv/sum.cpp"
            self.assertEqual(copy.read_text(), FILES["fastcv/sum.cpp"], "put back")

            # What is listed as equivalent counts no more; what was noticed is not tried again.
            unnoticed = [entry["key"] for entry in results if entry["result"] == "unnoticed"]
            (root / "tests/mutation").mkdir(parents=True)
            (root / "tests/mutation/equivalent.json").write_text(json.dumps(dict.fromkeys(unnoticed, "a reason")))
            before = len(results)
            status, printed = campaign(root)
            self.assertEqual(status, 0, printed)
            tried = len((root / "out/mutate/host.jsonl").read_text().splitlines()) - before
            again = sum(entry["result"] == "equivalent" for entry in results)
            self.assertEqual(tried, again)

    def test_refuses_a_tree_that_fails(self):
        with tempfile.TemporaryDirectory() as folder:
            root = Path(folder).resolve()
            for name, text in FILES.items():
                (root / name).parent.mkdir(exist_ok=True)
                (root / name).write_text(text.replace("a + b", "a - b"))
            subprocess.run(["git", "init", "-q"], cwd=root, check=True)
            subprocess.run(["git", "add", "."], cwd=root, check=True)
            status, _ = campaign(root)
            self.assertEqual(status, 2)
            self.assertFalse((root / "out").exists())


if __name__ == "__main__":
    unittest.main()
