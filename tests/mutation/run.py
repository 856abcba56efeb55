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
import time
import zipfile
from collections import Counter, defaultdict
from dataclasses import dataclass
from pathlib import Path

from mutants import mutants, only_for

# What is changed. Tests, benchmarks and the demo are not: they are what should notice.
AREAS = ("base", "simd", "fastcv", "frame", "brightness", "jni", "engine", "java")

# Suites that test an area at first hand, where they are not of its name.
NEAREST = {"base": ("jni",), "simd": ("simd", "fastcv"), "java": ("jvm",)}
SOURCES = (".cpp", ".h", ".java")

# Instruction counts are no test of what is computed, and a package is put together from what the other tests saw.
LEFT_OUT = re.compile(r"instruction_counts|^package\.|^android\.|^consumer\.|^bench_|^mutation_|^layers")

NOTICED, UNNOTICED, EQUIVALENT, UNBUILT, HANGS = "noticed", "unnoticed", "equivalent", "does not build", "hangs"


def area_of(path):
    return path.split("/")[0]


@dataclass
class Test:
    """A test of the build."""

    folder: str  # its suite's
    command: list
    seconds: float = 0  # that it took unchanged


class Tree:
    """The copy that is changed, its build, and its tests."""

    def __init__(self, root, preset, jobs, wanted):
        self.source = root
        self.wanted = wanted  # a pattern of tests' names
        self.preset = preset
        self.jobs = str(jobs)
        self.root = root / "build" / "mutate" / "tree"
        self.build_folder = self.root / "build" / preset
        self.tests = {}  # name: Test
        self.needed = {}  # program: shared libraries of the build that it loads
        self.known = set()  # files that can be built
        self.times = {}  # file that was built: (when, content)

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

    def build(self, seconds, targets=()):
        """Whether the copy builds: the targets, or without any all."""
        command = ["cmake", "--build", "--preset", self.preset, "-j", self.jobs]
        return self._quiet(command + (["--target", *self._relative(targets)] if targets else []), seconds)[0] == 0

    def build_unchanged(self):
        """Builds what the tests need: all, unless only some tests are wanted."""
        self.known = self._known()
        if not self.wanted.pattern:
            return self.build(3600)
        # The libraries are few.
        folders = [str(self.build_folder / folder) + "/" for folder in ("bin", "lib", "jar")]
        targets = [
            file
            for file in self.known
            if file.startswith((folders[1], folders[2])) or (file.startswith(folders[0]) and self.wanted.search(Path(file).name))
        ]
        return self.build(3600, sorted(targets))

    def _relative(self, files):
        return [str(Path(file).relative_to(self.build_folder)) for file in files]

    def configure(self):
        code, output = self._quiet(["cmake", "--preset", self.preset, "-Wno-dev", "--log-level=WARNING"], 600)
        if code != 0:
            sys.exit(output)

    def learn_tests(self):
        """Reads the list of tests and runs them all once, unless the same build has been; the names of those that fail."""
        listed = json.loads(
            subprocess.run(
                ["ctest", "--preset", self.preset, "--show-only=json-v1"],
                cwd=self.root, check=True, capture_output=True, text=True,
            ).stdout
        )  # fmt: skip
        for test in listed["tests"]:
            if self.wanted.search(test["name"]) and not LEFT_OUT.search(test["name"]):
                properties = {entry["name"]: entry["value"] for entry in test.get("properties", [])}
                folder = Path(properties.get("WORKING_DIRECTORY", ".")).name
                self.tests[test["name"]] = Test(folder, test.get("command", []))
        contents = self.contents()
        self.needed = {file: self._libraries(file) for file in contents if "/bin/" in file}

        record = self.root / "build" / f"baseline.{self.preset}.json"
        state = hashlib.sha256(repr(sorted(contents.items())).encode()).hexdigest()
        earlier = json.loads(record.read_text()) if record.exists() else {}
        if earlier.get("state") != state:
            # One at a time: what they take is what they are ordered by.
            code, output = self._quiet(self._ctest(self.tests, 1200, stop=False), 7200)
            passed = dict(re.findall(r"Test +#\d+: (\S+) [ .]*(?:Passed|\*\*\*Skipped) +([\d.]+) sec", output))
            earlier = {"state": state, "seconds": passed, "failed": code != 0}
            if code == 0:
                record.write_text(json.dumps(earlier))
        failed = [name for name in self.tests if name not in earlier["seconds"]] if earlier["failed"] else []
        self.tests = {name: test for name, test in self.tests.items() if name in earlier["seconds"]}
        for name, test in self.tests.items():
            test.seconds = float(earlier["seconds"][name])
        return failed

    def contents(self):
        """What was built: file to content. Only what is newer than when it was last looked at is read."""
        for folder in ("bin", "lib", "jar"):
            for file in (self.build_folder / folder).glob("*"):
                if str(file) not in self.known or not file.is_file():
                    continue
                when = file.stat().st_mtime_ns
                if self.times.get(str(file), (None,))[0] == when:
                    continue
                if file.suffix == ".jar":
                    with zipfile.ZipFile(file) as jar:
                        content = repr(sorted((entry.filename, entry.CRC) for entry in jar.infolist()))
                else:
                    content = hashlib.sha256(file.read_bytes()).hexdigest()
                self.times[str(file)] = (when, content)
        return {file: content for file, (_, content) in self.times.items()}

    def targets(self, names):
        """What must be built for these tests: their programs, and what a virtual machine or a script may load."""
        files = set()
        for name in names:
            programs = [part for part in self.tests[name].command if part in self.needed]
            files.update(part for part in self.tests[name].command if part in self.times)
            files.update(*(self.needed[program] for program in programs))
            if not programs:
                files.update(file for file in self.times if file not in self.needed)
        return sorted(files)

    def nearest(self, path):
        """Tests of a layer's own that take no long time, those first whose names are most like the file's."""
        area = area_of(path)
        folders = NEAREST.get(area, (area,))
        names = [name for name, test in self.tests.items() if test.folder in folders and test.seconds < 10]

        def words(name):
            return set(re.findall("[a-z0-9]+", Path(name).stem.lower()))

        return sorted(names, key=lambda name: (-len(words(name) & words(path)), self.tests[name].seconds))

    def concerned(self, names, changed):
        """Those of the tests that use a changed file, short ones first."""

        def uses(test):
            programs = [part for part in test.command if part in self.needed]
            if any(part in changed for part in test.command):
                return True
            if programs:
                return any(library in changed for program in programs for library in self.needed[program])
            return any(file not in self.needed for file in changed)

        return sorted((name for name in names if uses(self.tests[name])), key=lambda name: self.tests[name].seconds)

    def first_failure(self, names):
        """Runs these tests, short ones first; the name of the first that fails and how, or None."""
        for low, high in ((0, 2), (2, 10), (10, 60), (60, 1e9)):
            stage = [name for name in names if low <= self.tests[name].seconds < high]
            if not stage:
                continue
            limit = int(max(self.tests[name].seconds for name in stage) * 8 + 20)
            code, output = self._quiet(self._ctest(stage, limit, stop=True), 7200)
            if code != 0:
                failed = re.search(r"Test +#\d+: (\S+) [ .]*([A-Za-z ]*\*\*\*(?!Skipped)[^\n]*)", output)
                if failed is None:
                    return "ctest", ""  # it was ended itself
                return failed.group(1), failed.group(2)
        return None

    def _ctest(self, names, limit, stop):
        """Tests are limited in the processor's seconds, which no other load adds to; what only waits, in longer ones."""
        pattern = "^(" + "|".join(re.escape(name) for name in names) + ")$"
        return [
            "bash", "-c", f'ulimit -S -t {limit} && ulimit -H -t {limit + 10} && exec "$@"', "bash",
            "ctest", "--test-dir", str(self.build_folder), "-j", self.jobs, "--timeout", str(limit * 10),
            "-R", pattern, *(["--stop-on-failure"] if stop else []),
        ]  # fmt: skip

    def _known(self):
        """All that can be built; configuring puts files beside it that are no targets."""
        listed = subprocess.run(
            ["ninja", "-C", str(self.build_folder), "-t", "targets", "all"], check=True, capture_output=True, text=True
        ).stdout
        return {str(self.build_folder / line.split(": ")[0]) for line in listed.splitlines() if ": " in line}

    def _libraries(self, program):
        """The shared libraries of this build that a program loads, and those that they load."""
        found, queue = set(), [program]
        while queue:
            dynamic = subprocess.run(["readelf", "-dW", queue.pop()], capture_output=True, text=True).stdout
            for name in re.findall(r"\(NEEDED\).*\[(.*)\]", dynamic):
                library = str(self.build_folder / "lib" / name)
                if library in self.times and library not in found:
                    found.add(library)
                    queue.append(library)
        return found

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
        except BaseException:  # an interrupt does not reach the group
            os.killpg(process.pid, signal.SIGKILL)
            raise


class Campaign:
    """One call of scripts/mutate."""

    def __init__(self, root, arguments):
        self.root = root
        self.arguments = arguments
        self.results_file = root / "out" / "mutate" / f"{arguments.preset}.jsonl"
        equivalent = root / "tests" / "mutation" / "equivalent.json"
        self.noticed_by = defaultdict(list)  # file: tests that noticed a change to it, the last one last
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
                    text = file.read_text()
                    lines = only_for(self.arguments.preset == "aarch64", name, text)
                    by_area[area_of(name)] += [
                        mutant
                        for mutant in mutants(name, text)
                        if lines[mutant.line - 1] in ((True,) if self.arguments.branches else (True, None))
                    ]
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
        if self.arguments.report:
            return self._report(self._kept())
        candidates = self.candidates()
        if self.arguments.list:
            for mutant in candidates:
                print(f"{mutant.path}:{mutant.line}: {mutant.kind}: {mutant.before} -> {mutant.after}")
            return 0
        tree = Tree(self.root, self.arguments.preset, self.arguments.jobs, re.compile(self.arguments.tests))
        tree.synchronise()
        tree.configure()
        self._say(f"building and testing the unchanged tree, {self.arguments.preset}")
        if not tree.build_unchanged():
            self._say("the unchanged tree does not build")
            return 2
        failed = tree.learn_tests()
        if failed:
            self._say(f"the unchanged tree fails {', '.join(failed)}")
            return 2
        unchanged = tree.contents()

        results = self._earlier()
        for mutant in candidates:
            if results.get(mutant.key, {}).get("result") == NOTICED:
                self.noticed_by[mutant.path].append(results[mutant.key]["by"])
        self.results_file.parent.mkdir(parents=True, exist_ok=True)
        with self.results_file.open("a") as log:
            for number, mutant in enumerate(candidates, 1):
                if mutant.key in self.equivalent:
                    results[mutant.key] = {"result": EQUIVALENT}
                if mutant.key not in results:
                    began = time.monotonic()
                    results[mutant.key] = self._try(tree, unchanged, mutant)
                    results[mutant.key]["seconds"] = round(time.monotonic() - began)
                    if results[mutant.key]["result"] == NOTICED:
                        self.noticed_by[mutant.path].append(results[mutant.key]["by"])
                    log.write(json.dumps({"key": mutant.key, **results[mutant.key]}) + "\n")
                    log.flush()
                result = results[mutant.key]
                self._say(
                    f"{number}/{len(candidates)} {result['result']} {result.get('by', '')}: "
                    f"{mutant.path}:{mutant.line}: {mutant.kind}: {mutant.before} -> {mutant.after}"
                )
        return self._report({mutant.key: results[mutant.key] for mutant in candidates})

    def _kept(self):
        """What was tried by now; of two trials of one change the later counts."""
        lines = self.results_file.read_text().splitlines() if self.results_file.exists() else []
        kept = {entry["key"]: entry for entry in map(json.loads, lines)}
        return {key: {"result": EQUIVALENT} if key in self.equivalent else entry for key, entry in kept.items()}

    def _earlier(self):
        # What was not noticed, or is no longer listed as equivalent, may be by now.
        return {key: entry for key, entry in self._kept().items() if entry["result"] in (NOTICED, UNBUILT, HANGS)}

    def _recent(self, path):
        """The two tests that were last to notice a change to a file."""
        return list(dict.fromkeys(reversed(self.noticed_by[path])))[:2]

    def _try(self, tree, unchanged, mutant):
        file = tree.root / mutant.path
        text = file.read_text()
        file.write_text(mutant.applied(text))
        tried, any_change = set(), False
        try:
            # What noticed another change to this file, then what is nearest, then everything: of most changes only the
            # first has to be built.
            nearest = [[name] for name in tree.nearest(mutant.path)]
            for stage in [*([name] for name in self._recent(mutant.path)), *nearest, list(tree.tests)]:
                names = [name for name in stage if name in tree.tests and name not in tried]
                if not names:
                    continue
                targets = tree.targets(names)
                if not tree.build(1800, targets):
                    return {"result": UNBUILT}
                built = tree.contents()
                changed = {name for name in targets if unchanged.get(name) != built.get(name)}
                any_change = any_change or bool(changed)
                failure = tree.first_failure(tree.concerned(names, changed))
                if failure is not None:
                    name, how = failure
                    return {"result": HANGS if re.search("Timeout|CPU", how) else NOTICED, "by": name}
                tried.update(names)
            return {"result": UNNOTICED} if any_change else {"result": EQUIVALENT, "by": "(the same code)"}
        finally:
            file.write_text(text)

    def _report(self, results):
        """Prints a table by layer and what was not noticed; 1 when there is any."""
        kinds = (NOTICED, HANGS, UNNOTICED, EQUIVALENT, UNBUILT)
        by_area = defaultdict(Counter)
        for key, entry in results.items():
            by_area[area_of(key)][entry["result"]] += 1
            by_area["all"][entry["result"]] += 1
        print("| area | " + " | ".join(kinds) + " | of those that can be noticed |")
        print("|---" * (len(kinds) + 2) + "|")
        for area, counts in sorted(by_area.items(), key=lambda entry: (entry[0] == "all", entry[0])):
            seen = counts[NOTICED] + counts[HANGS]
            could = seen + counts[UNNOTICED]
            share = f"{100 * seen / could:.1f} %" if could else ""
            print(f"| {area} | " + " | ".join(str(counts[kind]) for kind in kinds) + f" | {share} |")
        survivors = [key for key, entry in results.items() if entry["result"] == UNNOTICED]
        for key in survivors:
            print(key)
        return 1 if survivors else 0

    @staticmethod
    def _say(text):
        print(f"mutate: {text}", file=sys.stderr, flush=True)
