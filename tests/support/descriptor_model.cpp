// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "tests/support/descriptor_model.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <iterator>

namespace kyengine::test {
namespace {

class Random {
 public:
  explicit Random(uint32_t seed) : engine_(seed) {}
  uint32_t Below(uint32_t limit) { return static_cast<uint32_t>(engine_() % limit); }
  /// From `low` to `high`, the same on every machine.
  double Between(double low, double high) {
    return low + (high - low) * static_cast<double>(engine_()) / 4294967295.0;
  }

 private:
  std::mt19937 engine_;
};

ModelConvolution RandomConvolution(Random& random, int side, int step, int inputs, int outputs) {
  ModelConvolution c = {side, step, inputs, outputs, random.Below(3) != 0, 0, {}, {}, {}};
  const int taps = side * side * inputs;
  const double spread = std::sqrt(1.0 / taps);
  if (c.bytes) {
    c.zero = static_cast<int>(100 + random.Below(56));
  }
  for (int i = 0; i < taps * outputs; ++i) {
    const double weight =
        c.bytes ? static_cast<double>(random.Below(256)) - c.zero : spread * random.Between(-2, 2);
    c.weights.push_back(static_cast<float>(weight));
  }
  for (int i = 0; i < outputs; ++i) {
    c.factors.push_back(static_cast<float>(random.Between(0.7, 1.1) * (c.bytes ? spread / 74 : 1)));
    c.offsets.push_back(static_cast<float>(random.Between(-0.2, 0.2)));
  }
  return c;
}

template <typename T>
void Append(std::vector<uint8_t>& bytes, const T* values, size_t count) {
  if (count == 0) {
    return;
  }
  const size_t end = bytes.size();
  bytes.resize(end + count * sizeof(T));
  std::memcpy(bytes.data() + end, values, count * sizeof(T));
}

template <typename T>
void Append(std::vector<uint8_t>& bytes, T value) {
  Append(bytes, &value, 1);
}

/// CRC-32 by its definition: the remainder of a division, bit by bit.
uint32_t Remainder(const uint8_t* bytes, size_t count) {
  uint32_t remainder = 0xffffffff;
  for (size_t i = 0; i < count; ++i) {
    remainder ^= bytes[i];
    for (int bit = 0; bit < 8; ++bit) {
      remainder = remainder >> 1 ^ ((remainder & 1) != 0 ? 0xedb88320 : 0);
    }
  }
  return ~remainder;
}

/// A picture of numbers, zero outside.
struct Numbers {
  int side;
  int channels;
  std::vector<double> values;

  Numbers(int s, int c) : side(s), channels(c), values(static_cast<size_t>(s * s * c), 0.0) {}

  bool has(int y, int x) const { return y >= 0 && x >= 0 && y < side && x < side; }
  double& at(int y, int x, int channel) {
    return values[static_cast<size_t>((y * side + x) * channels + channel)];
  }
  double at(int y, int x, int channel) const {
    return has(y, x) && channel < channels ? values[static_cast<size_t>((y * side + x) * channels + channel)]
                                           : 0;
  }
};

Numbers Convolved(const ModelConvolution& c, const Numbers& from, int border) {
  Numbers to((from.side + 2 * border - c.side) / c.step + 1, c.outputs);
  for (int y = 0; y < to.side; ++y) {
    for (int x = 0; x < to.side; ++x) {
      for (int dy = 0; dy < c.side; ++dy) {
        for (int dx = 0; dx < c.side; ++dx) {
          for (int i = 0; i < c.inputs; ++i) {
            const double number = from.at(y * c.step + dy - border, x * c.step + dx - border, i);
            for (int o = 0; o < c.outputs; ++o) {
              to.at(y, x, o) += number * c.weight(dy, dx, i, o);
            }
          }
        }
      }
      for (int o = 0; o < c.outputs; ++o) {
        const auto channel = static_cast<size_t>(o);
        to.at(y, x, o) = to.at(y, x, o) * static_cast<double>(c.factors[channel]) +
                         static_cast<double>(c.offsets[channel]);
      }
    }
  }
  return to;
}

void Rectify(Numbers& numbers) {
  for (double& value : numbers.values) {
    value = std::max(value, 0.0);
  }
}

/// What a block's convolutions are added to: its input, or the means of 2 x 2.
Numbers Skip(const Numbers& from, bool halves) {
  if (!halves) {
    return from;
  }
  Numbers to(from.side / 2, from.channels);
  for (int y = 0; y < to.side; ++y) {
    for (int x = 0; x < to.side; ++x) {
      for (int i = 0; i < to.channels; ++i) {
        to.at(y, x, i) = (from.at(2 * y, 2 * x, i) + from.at(2 * y, 2 * x + 1, i) +
                          from.at(2 * y + 1, 2 * x, i) + from.at(2 * y + 1, 2 * x + 1, i)) /
                         4;
      }
    }
  }
  return to;
}

}  // namespace

std::vector<ModelConvolution> RandomModel(const DescriptorShape& shape, uint32_t seed) {
  Random random(seed);
  std::vector<ModelConvolution> model;
  model.push_back(RandomConvolution(random, 7, 2, 3, shape.firstChannels));
  int channels = shape.firstChannels;
  for (const ResidualBlock& block : shape.blocks) {
    model.push_back(RandomConvolution(random, 3, block.halves ? 2 : 1, channels, block.channels));
    model.push_back(RandomConvolution(random, 3, 1, block.channels, block.channels));
    channels = block.channels;
  }
  model.push_back(RandomConvolution(random, 1, 1, channels, shape.outputs));
  return model;
}

std::vector<uint8_t> FileOf(const std::vector<ModelConvolution>& model,
                            const std::vector<uint8_t>& following) {
  std::vector<uint8_t> payload;
  for (const ModelConvolution& c : model) {
    for (const int number : {c.side, c.step, c.inputs, c.outputs, c.bytes ? 1 : 4, c.zero}) {
      Append(payload, static_cast<uint32_t>(number));
    }
    Append(payload, c.factors.data(), c.factors.size());
    Append(payload, c.offsets.data(), c.offsets.size());
    for (int first = 0; first < c.outputs; first += 16) {
      for (int y = 0; y < c.side; ++y) {
        for (int x = 0; x < c.side; ++x) {
          for (int i = 0; i < c.inputs; ++i) {
            for (int o = first; o < first + 16; ++o) {
              const double weight = c.weight(y, x, i, o);
              if (c.bytes) {
                payload.push_back(static_cast<uint8_t>(weight + c.zero));
              } else {
                Append(payload, static_cast<float>(weight));
              }
            }
          }
        }
      }
    }
  }
  static constexpr uint8_t kMagic[] = {'K', 'Y', 'D', 'E', 'S', 'C', 0x1a, '\n'};
  std::vector<uint8_t> file;
  Append(file, kMagic, std::size(kMagic));
  Append(file, uint32_t{1});
  Append(file, static_cast<uint32_t>(model.size()));
  Append(file, static_cast<uint64_t>(payload.size()));
  Append(file, static_cast<uint64_t>(following.size()));
  Append(file, uint64_t{0});
  Append(file, payload.data(), payload.size());
  Append(file, following.data(), following.size());
  Seal(file);
  return file;
}

void Seal(std::vector<uint8_t>& file) {
  uint64_t length = 0;
  std::memcpy(&length, &file[16], sizeof(length));
  const uint32_t payload = Remainder(&file[40], std::min<size_t>(length, file.size() - 40));
  std::memcpy(&file[32], &payload, sizeof(payload));
  const uint32_t header = Remainder(file.data(), 36);
  std::memcpy(&file[36], &header, sizeof(header));
}

std::vector<double> NumbersOf(const std::vector<ModelConvolution>& model, const DescriptorShape& shape,
                              const std::vector<uint8_t>& rgb) {
  static constexpr double kMean[] = {122.782, 117.001, 104.298};
  Numbers picture(shape.side, 3);
  for (size_t i = 0; i < picture.values.size(); ++i) {
    picture.values[i] = (rgb[i] - kMean[i % 3]) / 256;
  }
  auto next = model.begin();
  Numbers first = Convolved(*next++, picture, 0);
  Rectify(first);
  Numbers now((first.side - 3) / 2 + 1, first.channels);
  for (int y = 0; y < now.side; ++y) {
    for (int x = 0; x < now.side; ++x) {
      for (int i = 0; i < now.channels; ++i) {
        double most = first.at(2 * y, 2 * x, i);
        for (int k = 1; k < 9; ++k) {
          most = std::max(most, first.at(2 * y + k / 3, 2 * x + k % 3, i));
        }
        now.at(y, x, i) = most;
      }
    }
  }
  for (const ResidualBlock& block : shape.blocks) {
    Numbers middle = Convolved(*next++, now, block.halves ? 0 : 1);
    Rectify(middle);
    const Numbers result = Convolved(*next++, middle, 1);
    const Numbers skip = Skip(now, block.halves);
    // The larger of both sizes; zeros where the other has nothing.
    Numbers sum(std::max(result.side, skip.side), block.channels);
    for (int y = 0; y < sum.side; ++y) {
      for (int x = 0; x < sum.side; ++x) {
        for (int i = 0; i < sum.channels; ++i) {
          sum.at(y, x, i) = result.at(y, x, i) + skip.at(y, x, i);
        }
      }
    }
    Rectify(sum);
    now = sum;
  }
  Numbers mean(1, now.channels);
  for (int y = 0; y < now.side; ++y) {
    for (int x = 0; x < now.side; ++x) {
      for (int i = 0; i < now.channels; ++i) {
        mean.at(0, 0, i) += now.at(y, x, i) / (now.side * now.side);
      }
    }
  }
  return Convolved(*next, mean, 0).values;
}

}  // namespace kyengine::test
