# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Reads every #include: a layer may include the public headers of the layers that it stands on, and its own; headers of
other layers are named with their layer's name. What stands on what is the table in docs/architecture.md."""

import re
import sys
import tempfile
import unittest
from pathlib import Path

INCLUDE = re.compile(r'^\s*#\s*include\s*(["<])([^">]+)[">]', re.MULTILINE)
ROW = re.compile(r"^\| `(\w+)` \|([^|]*)\|", re.MULTILINE)
TOP = ("bench", "fuzz", "tests")  # These stand on all layers.
ROOT = Path(sys.argv.pop()) if len(sys.argv) > 1 else Path.cwd()


def layers_of(page):
    """Layer -> the layers that it stands on, from the table; each may name only rows above its own."""
    section = page[page.index("| layer | stands on |"):].split("\n\n")[0]
    layers = {}
    for name, below in ROW.findall(section):
        below = set(re.findall(r"`(\w+)`", below))
        if not below <= layers.keys():
            raise ValueError(f"{name} stands on {sorted(below - layers.keys())}, which the table has not named above it")
        layers[name] = below
    return layers


def findings_of(root, layers):
    """(number of includes, what is wrong with them)."""
    count, findings = 0, []
    folders = [*layers, *TOP, "platform"]
    for folder in folders:
        for source in sorted((root / folder).rglob("*")):
            if source.suffix not in (".h", ".cpp", ".c"):
                continue
            for quote, name in INCLUDE.findall(source.read_text()):
                count += 1
                wrong = fault_of(root, layers, folder, source, quote, name)
                if wrong:
                    findings.append(f"{source.relative_to(root)} includes {name}: {wrong}")
    return count, findings


def fault_of(root, layers, folder, source, quote, name):
    layer = name.split("/")[0]
    public = layer in layers and (root / layer / "include" / name).is_file()
    if quote == "<":
        outside = source.is_relative_to(root / "tests/install/consumer")  # somebody else's
        return "headers of the project are included in quotation marks" if public and not outside else None
    if public:
        if folder in TOP or layer == folder or layer in layers.get(folder, ()):
            return None
        return f"{folder} does not stand on {layer}"
    if (source.parent / name).is_file():
        beside = (source.parent / name).resolve().relative_to(root.resolve())
        if beside.parts[0] != folder:
            return "a private header of another layer"
        if "include" in source.parts:
            return "a public header names headers by their layer"
        return None
    if folder in TOP and (root / name).is_file():
        return None if folder in ("tests", "fuzz") or name.startswith("tests/support/") else "a header that is kept from it"
    return "no public header of a layer, and none beside it"


class Layers(unittest.TestCase):
    def test_every_include_goes_down(self):
        count, findings = findings_of(ROOT, layers_of((ROOT / "docs/architecture.md").read_text()))
        self.assertEqual(findings, [])
        self.assertGreater(count, 500)

    def test_every_layer_is_in_the_table(self):
        layers = layers_of((ROOT / "docs/architecture.md").read_text())
        with_headers = {path.parent.name for path in ROOT.glob("*/include") if path.parent.name != "platform"}
        self.assertLessEqual(with_headers, layers.keys())


class Findings(unittest.TestCase):
    """What the check is for, in a tree of two layers."""

    LAYERS = {"low": set(), "high": {"low"}}

    def findings(self, **texts):
        with tempfile.TemporaryDirectory() as folder:
            root = Path(folder)
            files = {"low/include/low/low.h": "", "low/src/inside.h": "", "high/include/high/high.h": "",
                     "high/src/high.cpp": "", "tests/support/help.h": "", "tests/low_test.cpp": ""}
            for name, text in {**files, **texts}.items():
                path = root / name
                path.parent.mkdir(parents=True, exist_ok=True)
                path.write_text(text)
            return findings_of(root, self.LAYERS)[1]

    def test_down_beside_and_inside_are_allowed(self):
        self.assertEqual(self.findings(**{
            "high/src/high.cpp": '#include <cstdint>\n#include "high/high.h"\n#include "low/low.h"\n',
            "low/src/low.cpp": '#include "inside.h"\n#include "low/low.h"\n',
            "tests/low_test.cpp": '#include "tests/support/help.h"\n#include "low/src/inside.h"\n#include "high/high.h"\n',
        }), [])

    def test_up(self):
        self.assertEqual(self.findings(**{"low/src/low.cpp": '#include "high/high.h"\n'}),
                         ["low/src/low.cpp includes high/high.h: low does not stand on high"])

    def test_into_another_layer(self):
        for name in ("inside.h", "low/src/inside.h", "../../low/src/inside.h"):
            self.assertEqual(len(self.findings(**{"high/src/high.cpp": f'#include "{name}"\n'})), 1, name)
        self.assertEqual(len(self.findings(**{"bench/b.cpp": '#include "low/src/inside.h"\n'})), 1)

    def test_flat(self):
        self.assertEqual(len(self.findings(**{"high/src/high.cpp": '#include "low.h"\n'})), 1)
        self.assertEqual(len(self.findings(**{"low/include/low/other.h": '#include "low.h"\n'})), 1)
        self.assertEqual(len(self.findings(**{"high/src/high.cpp": "#include <low/low.h>\n"})), 1)

    def test_a_table_with_a_circle(self):
        with self.assertRaises(ValueError):
            layers_of("| layer | stands on |\n|---|---|\n| `low` | `high` |\n| `high` | `low` |\n")


if __name__ == "__main__":
    unittest.main()
