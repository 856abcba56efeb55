# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Cycles per pixel that LLVM's static models predict, with everything in the first-level cache.

Each hot block is taken as a loop of its own and weighted by how often it ran. What is not hot is taken to cost as much
an instruction as what is.
"""

import re
import shutil
import subprocess
import sys
from pathlib import Path

CORES = {"A55": "cortex-a55", "N1": "neoverse-n1"}

# Hot blocks are those that make up this share of the instructions.
HOT_SHARE = 0.99
# Two neighbouring blocks belong to one loop when the one runs at least this part as often as the other: the first turn
# of a loop may enter in a block that begins before it.
SAME_LOOP = 0.9
ITERATIONS = 100
WORD_BYTES = 4


def cycles(counts):
    """Returns {Key: {core: cycles per pixel}} for the Counts."""
    stretches = {key: _hot_stretches(count, counts.blocks) for key, count in counts.counts.items()}
    codes = sorted({words for hot in stretches.values() for words, _ in hot})
    assembly = _disassembled({word for words in codes for word in words})
    per_core = {core: _cycles_of(codes, assembly, cpu) for core, cpu in CORES.items()}
    result = {}
    for key, hot in stretches.items():
        count = counts.counts[key]
        instructions = sum(len(words) * executions for words, executions in hot)
        scale = count.instructions / instructions / count.pixels if instructions else 0
        result[key] = {
            core: scale * sum(per_core[core][words] * executions for words, executions in hot) for core in CORES
        }
    return result


def _hot_stretches(count, blocks):
    """[(words, executions)] of the hot code. Blocks that follow one another and run as often are one stretch: a loop's
    body is cut where a page of memory ends, or by a branch that is never taken."""
    stretches = []
    end = before = None
    for block, executions in sorted(count.blocks.items(), key=lambda item: blocks[item[0]].address):
        code = blocks[block]
        if code.address == end and min(executions, before) >= SAME_LOOP * max(executions, before):
            stretches[-1] = (stretches[-1][0] + code.words, max(executions, before))
        else:
            stretches.append((code.words, executions))
        end = code.address + WORD_BYTES * len(code.words)
        before = executions
    stretches.sort(key=lambda stretch: len(stretch[0]) * stretch[1], reverse=True)
    hot = []
    covered = 0
    for words, executions in stretches:
        if covered >= HOT_SHARE * count.instructions:
            break
        hot.append((words, executions))
        covered += len(words) * executions
    return hot


def _llvm(tool):
    """The name of one of LLVM's tools, of the version that everything is built with."""
    versions = (Path(__file__).parents[2] / "cmake" / "llvm-versions").read_text().split()
    for version in versions:
        if shutil.which(f"clang-{version}"):
            return f"{tool}-{version}"
    sys.exit("bench: there is no clang from 16 on")


def _run(command, text):
    run = subprocess.run(command, input=text, stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True, check=False)
    if run.returncode != 0:
        sys.exit(f"bench: {command[0]} failed:\n{run.stderr}")
    return run.stdout


def _disassembled(words):
    """{word: assembly} of instruction words."""
    words = sorted(words)
    lines = "\n".join(" ".join(f"0x{byte:02x}" for byte in int(word, 16).to_bytes(WORD_BYTES, "little")) for word in words)
    output = _run([_llvm("llvm-mc"), "--disassemble", "--triple=aarch64", "-mattr=+all"], lines)
    assembly = [line.strip() for line in output.splitlines() if line.strip() and not line.strip().startswith(".")]
    if len(assembly) != len(words):
        sys.exit("bench: some hot code could not be disassembled")
    return dict(zip(words, assembly))


def _cycles_of(codes, assembly, cpu):
    """{words: cycles of one execution} on a core."""
    source = []
    for number, words in enumerate(codes):
        source.append(f"# LLVM-MCA-BEGIN {number}")
        source += [assembly[word] for word in words]
        source.append("# LLVM-MCA-END")
    command = [_llvm("llvm-mca"), "-mtriple=aarch64", "-mattr=+all", f"-mcpu={cpu}", f"-iterations={ITERATIONS}"]
    command += ["-instruction-info=false", "-resource-pressure=false", "-skip-unsupported-instructions=any"]
    output = _run(command, "\n".join(source) + "\n") if codes else ""
    found = re.findall(r"Code Region - (\d+)\s.*?Total Cycles:\s+(\d+)", output, flags=re.DOTALL)
    if len(found) != len(codes):
        sys.exit(f"bench: {len(codes)} stretches of code gave {len(found)} results for {cpu}")
    return {codes[int(number)]: int(total) / ITERATIONS for number, total in found}
