# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""A campaign of small changes: which of them no test notices."""

import hashlib
import json
import os
import random
import re
import shutil
import signal
import subprocess
import sys
import zipfile
from collections import Counter, defaultdict
from pathlib import Path

from mutants import mutants

# What is changed. Tests, benchmarks and the demo are not: they are what should notice.
AREAS = ("base", "simd", "fastcv", "frame", "brightness", "jni", "engine", "java")
SOURCES = (".cpp", ".h", ".java")

# Instruction counts are no test of what is computed, and a package is put together from what the other tests saw.
LEFT_OUT = re.compile(r"instruction_counts|^package\.|^android\.|^consumer\.|^bench_|^mutation_|^layers")

NOTICED, UNNOTICED, EQUIVALENT, UNBUILT, HANGS = "noticed", "unnoticed", "equivalent", "does not build", "hangs"


def area_of(path):
    return path.split("/")[0]


class Tree:
    """The copy that is changed, its build, and its tests."""

    def __init__(self, root, preset):
        self.source = root
        self.preset = preset
        self.root = root / "build" / "mutate" / "tree"
        self.build_folder = self.root / "build" / preset
        self.tests = {}  # name: (seconds that it took unchanged, files that it runs)

    def synchronise(self):
        """Brings the copy to the state of the tracked files, touching only what differs."""
        listed = subprocess.run(
            ["git", "ls-files", "-z"], cwd=self.source, check=True, capture_output=True, text=True
        ).stdout.split("\0")
        wanted = {name for name in listed if name and (self.source / name).is_file()}
        self.root.mkdir(parents=True, exist_ok=True)
        for name in wanted:
            content = (self.source / name).read_bytes()
            copy = self.root / name
            if not copy.exists() or copy.read_bytes() != content:
                copy.parent.mkdir(parents=True, exist_ok=True)
                shutil.copy(self.source / name, copy)
        for copy in self.root.rglob("*"):
            name = copy.relative_to(self.root)
            if name.parts[0] not in ("build", "out", ".deps") and copy.is_file() and str(name) not in wanted:
                copy.unlink()
        dependencies = self.root / ".deps"
        if (self.source / ".deps").exists() and not dependencies.exists():
            dependencies.symlink_to(self.source / ".deps")

    def build(self, seconds):
        """Whether the copy builds."""
        return self._quiet(["cmake", "--build", "--preset", self.preset], seconds)[0] == 0

    def configure(self):
        code, output = self._quiet(["cmake", "--preset", self.preset, "-Wno-dev", "--log-level=WARNING"], 600)
        if code != 0:
            sys.exit(output)

    def learn_tests(self):
        """Reads the list of tests and runs them all once; returns the names of those that fail."""
        listed = json.loads(
            subprocess.run(
                ["ctest", "--preset", self.preset, "--show-only=json-v1"],
                cwd=self.root, check=True, capture_output=True, text=True,
            ).stdout
        )
        programs = {
            test["name"]: test.get("command", []) for test in listed["tests"] if not LEFT_OUT.search(test["name"])
        }
        log = self.root / "build" / "baseline.txt"
        code, output = self._quiet(self._ctest(programs, 1200, stop=False), 7200)
        log.write_text(output)
        passed = dict(re.findall(r"Test +#\d+: (\S+) [ .]*(?:Passed|\*\*\*Skipped) +([\d.]+) sec", output))
        self.tests = {name: (float(passed[name]), command) for name, command in programs.items() if name in passed}
        return [] if code == 0 else [name for name in programs if name not in passed]

    def contents(self):
        """What was built: file to hash."""
        hashes = {}
        for folder in ("bin", "lib", "jar"):
            for file in sorted((self.build_folder / folder).glob("*")):
                if file.suffix == ".jar":
                    with zipfile.ZipFile(file) as jar:
                        entries = [(entry.filename, entry.CRC) for entry in jar.infolist()]
                    hashes[str(file)] = repr(sorted(entries))
                elif file.is_file():
                    hashes[str(file)] = hashlib.sha256(file.read_bytes()).hexdigest()
        return hashes

    def first_failure(self, changed):
        """Runs the tests that use a changed file, short ones first; the name of the first that fails, or None."""
        libraries = any("/lib/" in file or "/jar/" in file for file in changed)

        def concerned(command):
            # A virtual machine or a script loads what no command line shows.
            return any(part in changed for part in command) or libraries

        names = sorted((seconds, name) for name, (seconds, command) in self.tests.items() if concerned(command))
        for low, high in ((0, 2), (2, 10), (10, 60), (60, 1e9)):
            stage = [name for seconds, name in names if low <= seconds < high]
            if not stage:
                continue
            limit = int(max(self.tests[name][0] for name in stage) * 8 + 20)
            code, output = self._quiet(self._ctest(stage, limit, stop=True), 7200)
            if code != 0:
                failed = re.search(r"Test +#\d+: (\S+) [ .]*(\*\*\*\S+)", output)
                if failed is None:
                    return "ctest", ""  # it was ended itself
                return failed.group(1), failed.group(2)
        return None

    def _ctest(self, names, limit, stop):
        pattern = "^(" + "|".join(re.escape(name) for name in names) + ")$"
        return [
            "ctest", "--test-dir", str(self.build_folder), "-j", str(os.cpu_count()), "--timeout", str(limit),
            "-R", pattern, *(["--stop-on-failure"] if stop else []),
        ]  # fmt: skip

    def _quiet(self, command, seconds):
        """Runs a step in a process group of its own, which ends with it; its exit status and output."""
        process = subprocess.Popen(
            command, cwd=self.root, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True,
            errors="replace", start_new_session=True,
        )  # fmt: skip
        try:
            output, _ = process.communicate(timeout=seconds)
            return process.returncode, output
        except subprocess.TimeoutExpired:
            os.killpg(process.pid, signal.SIGKILL)
            output, _ = process.communicate()
            return -1, output


class Campaign:
    """One call of scripts/mutate."""

    def __init__(self, root, arguments):
        self.root = root
        self.arguments = arguments
        self.results_file = root / "out" / "mutate" / f"{arguments.preset}.jsonl"
        equivalent = root / "tests" / "mutation" / "equivalent.json"
        self.equivalent = json.loads(equivalent.read_text()) if equivalent.exists() else {}

    def candidates(self):
        """The changes to try: all of the given paths, or a sample that takes from every area alike."""
        paths = [Path(path).resolve().relative_to(self.root) for path in self.arguments.path] or [
            Path(area) for area in AREAS if (self.root / area).is_dir()
        ]
        by_area = defaultdict(list)
        for path in paths:
            whole = self.root / path
            for file in [whole] if whole.is_file() else sorted(whole.rglob("*")):
                if file.suffix in SOURCES:
                    name = str(file.relative_to(self.root))
                    by_area[area_of(name)] += mutants(name, file.read_text())
        if self.arguments.sample is None:
            return [mutant for area in by_area.values() for mutant in area]
        chance = random.Random(self.arguments.seed)
        for changes in by_area.values():
            chance.shuffle(changes)
        drawn = []
        while len(drawn) < self.arguments.sample and any(by_area.values()):
            for changes in by_area.values():
                if changes and len(drawn) < self.arguments.sample:
                    drawn.append(changes.pop())
        return drawn

    def run(self):
        candidates = self.candidates()
        if self.arguments.list:
            for mutant in candidates:
                print(f"{mutant.path}:{mutant.line}: {mutant.kind}: {mutant.before} -> {mutant.after}")
            return 0
        tree = Tree(self.root, self.arguments.preset)
        tree.synchronise()
        tree.configure()
        self._say(f"building and testing the unchanged tree, {self.arguments.preset}")
        if not tree.build(3600):
            self._say("the unchanged tree does not build")
            return 2
        failed = tree.learn_tests()
        if failed:
            self._say(f"the unchanged tree fails {', '.join(failed)}")
            return 2
        unchanged = tree.contents()

        results = self._earlier()
        self.results_file.parent.mkdir(parents=True, exist_ok=True)
        with self.results_file.open("a") as log:
            for number, mutant in enumerate(candidates, 1):
                if mutant.key in self.equivalent:
                    results[mutant.key] = {"result": EQUIVALENT}
                if mutant.key not in results:
                    results[mutant.key] = self._try(tree, unchanged, mutant)
                    log.write(json.dumps({"key": mutant.key, **results[mutant.key]}) + "\n")
                    log.flush()
                result = results[mutant.key]
                self._say(
                    f"{number}/{len(candidates)} {result['result']} {result.get('by', '')}: "
                    f"{mutant.path}:{mutant.line}: {mutant.kind}: {mutant.before} -> {mutant.after}"
                )
        return self._report(candidates, results)

    def _earlier(self):
        if not self.results_file.exists():
            return {}
        lines = (json.loads(line) for line in self.results_file.read_text().splitlines())
        # What was not noticed, or is no longer listed as equivalent, may be by now.
        return {entry["key"]: entry for entry in lines if entry["result"] in (NOTICED, UNBUILT, HANGS)}

    def _try(self, tree, unchanged, mutant):
        file = tree.root / mutant.path
        text = file.read_text()
        file.write_text(mutant.applied(text))
        try:
            if not tree.build(900):
                return {"result": UNBUILT}
            built = tree.contents()
            changed = {name for name, content in built.items() if unchanged.get(name) != content}
            if not changed:
                return {"result": EQUIVALENT, "by": "(the same code)"}
            failure = tree.first_failure(changed)
            if failure is None:
                return {"result": UNNOTICED}
            name, how = failure
            return {"result": HANGS if "Timeout" in how else NOTICED, "by": name}
        finally:
            file.write_text(text)

    def _report(self, candidates, results):
        kinds = (NOTICED, HANGS, UNNOTICED, EQUIVALENT, UNBUILT)
        by_area = defaultdict(Counter)
        for mutant in candidates:
            result = results[mutant.key]["result"]
            by_area[area_of(mutant.path)][result] += 1
            by_area["all"][result] += 1
        print("| area | " + " | ".join(kinds) + " | of those that can be noticed |")
        print("|---" * (len(kinds) + 2) + "|")
        for area, counts in by_area.items():
            seen = counts[NOTICED] + counts[HANGS]
            could = seen + counts[UNNOTICED]
            share = f"{100 * seen / could:.1f} %" if could else ""
            print(f"| {area} | " + " | ".join(str(counts[kind]) for kind in kinds) + f" | {share} |")
        survivors = [mutant for mutant in candidates if results[mutant.key]["result"] == UNNOTICED]
        for mutant in survivors:
            print(f"{mutant.path}:{mutant.line}: {mutant.kind}: {mutant.before} -> {mutant.after}")
            print(f"    {mutant.context}")
        return 1 if survivors else 0

    @staticmethod
    def _say(text):
        print(f"mutate: {text}", file=sys.stderr, flush=True)
