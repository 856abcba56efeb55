#!/usr/bin/env python3
# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Makes the verifier's model file out of published weights.

  make_verifier_model.py WEIGHTS_FOLDER OUTPUT [--landmarks FILE]

WEIGHTS_FOLDER holds face_recognition_model.bin and its weights manifest, as the npm package @vladmandic/face-api has
them: dlib's face descriptor, its numbers quantised to bytes but for some filters. With --landmarks a landmark model
serialized by dlib goes behind the descriptor, so that one file is all that a verifier needs. The format is described
in engine/src/descriptor.h.
"""

import argparse
import array
import json
import math
import struct
import sys
import zlib
from pathlib import Path

NAME = "face_recognition_model"
LANES = 16
MAGIC = b"KYDESC\x1a\n"

# The blocks of the network: their names there, and the steps of their first convolution.
BLOCKS = [("conv32_1", 1), ("conv32_2", 1), ("conv32_3", 1),
          ("conv64_down", 2), ("conv64_1", 1), ("conv64_2", 1), ("conv64_3", 1),
          ("conv128_down", 2), ("conv128_1", 1), ("conv128_2", 1),
          ("conv256_down", 2), ("conv256_1", 1), ("conv256_2", 1), ("conv256_down_out", 2)]


class Tensor:
    """One tensor as it was published: bytes with a scale and a least value, or floats."""

    def __init__(self, shape, quantization, data):
        self.shape = shape
        self.quantization = quantization
        self.data = data

    def numbers(self):
        if self.quantization is None:
            return list(floats(self.data))
        scale, least = self.quantization["scale"], self.quantization["min"]
        return [q * scale + least for q in self.data]


def floats(data):
    values = array.array("f", data)
    if sys.byteorder != "little":
        values.byteswap()
    return values


def read(folder):
    """All tensors of the package's model, by name."""
    manifest = json.loads((folder / f"{NAME}-weights_manifest.json").read_text())
    tensors = {}
    for group in manifest:
        data = b"".join((folder / path).read_bytes() for path in group["paths"])
        at = 0
        for entry in group["weights"]:
            quantization = entry.get("quantization")
            if entry["dtype"] != "float32" or (quantization or {"dtype": "uint8"})["dtype"] != "uint8":
                raise ValueError(f"{entry['name']} has a type that is not known here")
            size = math.prod(entry["shape"]) * (1 if quantization else 4)
            if at + size > len(data):
                raise ValueError("the weights are shorter than their manifest says")
            tensors[entry["name"]] = Tensor(entry["shape"], quantization, data[at:at + size])
            at += size
        if at != len(data):
            raise ValueError("the weights are longer than their manifest says")
    return tensors


def convolution(filters, step, factors, offsets):
    """The record of a convolution whose filters are [side][side][inputs][outputs]."""
    side, _, inputs, outputs = filters.shape
    item = 1 if filters.quantization else 4
    zero = 0
    if filters.quantization:
        # The quantisation gives the number 0 a byte of its own.
        scale, least = filters.quantization["scale"], filters.quantization["min"]
        zero = round(-least / scale)
        if not 0 <= zero <= 255 or abs(least + zero * scale) > 1e-3 * scale:
            raise ValueError("no byte stands for a weight of 0")
        factors = [factor * scale for factor in factors]
    taps = side * side * inputs
    weights = b"".join(filters.data[(tap * outputs + first) * item:(tap * outputs + first + LANES) * item]
                       for first in range(0, outputs, LANES) for tap in range(taps))
    assert len(weights) == len(filters.data)
    return b"".join([struct.pack("<6I", side, step, inputs, outputs, item, zero),
                     struct.pack(f"<{outputs}f", *factors), struct.pack(f"<{outputs}f", *offsets), weights])


def descriptor(tensors):
    """The records of all convolutions and of the matrix."""
    records = []

    def add(name, step):
        # A bias, then an affine layer: (x + bias) weight + offset.
        weights = tensors[f"{name}/scale/weights"].numbers()
        biases = tensors[f"{name}/conv/bias"].numbers()
        offsets = tensors[f"{name}/scale/biases"].numbers()
        records.append(convolution(tensors[f"{name}/conv/filters"], step, weights,
                                   [b * w + o for b, w, o in zip(biases, weights, offsets)]))

    add("conv32_down", 2)
    for name, step in BLOCKS:
        add(f"{name}/conv1", step)
        add(f"{name}/conv2", 1)
    matrix = tensors["fc"]
    inputs, outputs = matrix.shape
    matrix.shape = [1, 1, inputs, outputs]
    records.append(convolution(matrix, 1, [1.0] * outputs, [0.0] * outputs))
    return records


def model(records, landmarks=b""):
    payload = b"".join(records)
    head = MAGIC + struct.pack("<IIQQI", 1, len(records), len(payload), len(landmarks), zlib.crc32(payload))
    return head + struct.pack("<I", zlib.crc32(head)) + payload + landmarks


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("folder", type=Path)
    parser.add_argument("output", type=Path)
    parser.add_argument("--landmarks", type=Path)
    arguments = parser.parse_args()
    landmarks = arguments.landmarks.read_bytes() if arguments.landmarks else b""
    arguments.output.write_bytes(model(descriptor(read(arguments.folder)), landmarks))


if __name__ == "__main__":
    main()
