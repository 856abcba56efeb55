// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Seeded random models of the face descriptor, as files, and what a network with such weights gives, worked
/// out from the definitions in double precision.
#pragma once

#include <cstdint>
#include <random>
#include <vector>

#include "engine/src/descriptor.h"

namespace kyengine::test {

/// The weights of one convolution. Those of bytes are whole numbers.
struct ModelConvolution {
  int side;
  int step;
  int inputs;
  int outputs;
  bool bytes;
  int zero;                    ///< the byte that stands for 0
  std::vector<float> weights;  ///< [side][side][inputs][outputs]
  std::vector<float> factors;
  std::vector<float> offsets;

  double weight(int y, int x, int input, int output) const {
    const int at = ((y * side + x) * inputs + input) * outputs + output;
    return static_cast<double>(weights[static_cast<size_t>(at)]);
  }
};

/// A model of `shape`. Some convolutions have bytes, some floats, and zeros are different bytes.
std::vector<ModelConvolution> RandomModel(const DescriptorShape& shape, uint32_t seed);

/// The file of a model, with what follows the descriptor.
std::vector<uint8_t> FileOf(const std::vector<ModelConvolution>& model,
                            const std::vector<uint8_t>& following = {});

/// Writes the checksums that belong to what the file holds now.
void Seal(std::vector<uint8_t>& file);

/// The numbers of a picture of packed red, green and blue.
std::vector<double> NumbersOf(const std::vector<ModelConvolution>& model, const DescriptorShape& shape,
                              const std::vector<uint8_t>& rgb);

}  // namespace kyengine::test
