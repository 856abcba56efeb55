// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "descriptor.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <iterator>
#include <type_traits>
#include <utility>

#include "checksum.h"
#include "lanes.h"

namespace kyengine {
namespace {

constexpr int kFirstSide = 7;
constexpr int kSide = 3;
constexpr int kColours = 3;

/// The mean of the pictures that the network was trained with, red first, and what it divides by.
constexpr std::array<float, kColours> kMean = {122.782F, 117.001F, 104.298F};
constexpr float kRange = 256;

constexpr ResidualBlock kBlocks[] = {{32, false}, {32, false},  {32, false},  {64, true},   {64, false},
                                     {64, false}, {64, false},  {128, true},  {128, false}, {128, false},
                                     {256, true}, {256, false}, {256, false}, {256, true}};

/// What one convolution of a network must be.
struct Expected {
  int side;
  int step;
  int inputs;
  int outputs;

  size_t weights() const {
    return static_cast<size_t>(side) * static_cast<size_t>(side) * static_cast<size_t>(inputs) *
           static_cast<size_t>(outputs);
  }
};

/// Calls `visit` with what each convolution of the network and its matrix must be, in their order, until one
/// call returns something else than success.
template <typename Visit>
ky_result_t ForEachExpected(const DescriptorShape& shape, Visit visit) {
  ky_result_t result = visit(Expected{kFirstSide, 2, kColours, shape.first_channels});
  int channels = shape.first_channels;
  for (const ResidualBlock& block : shape.blocks) {
    if (result == KY_SUCCESS) {
      result = visit(Expected{kSide, block.halves ? 2 : 1, channels, block.channels});
    }
    if (result == KY_SUCCESS) {
      result = visit(Expected{kSide, 1, block.channels, block.channels});
    }
    channels = block.channels;
  }
  return result == KY_SUCCESS ? visit(Expected{1, 1, channels, shape.outputs}) : result;
}

constexpr size_t kConvolutionHeader = 6 * sizeof(uint32_t);

/// Reads little-endian numbers one after the other; what lies beyond the end is refused.
class Reader {
 public:
  explicit Reader(std::span<const uint8_t> bytes) : bytes_(bytes) {}

  template <typename T>
  bool Take(T* values, size_t count) {
    const size_t size = count * sizeof(T);
    if (bytes_.size() < size) {
      return false;
    }
    if (size > 0) {
      std::memcpy(values, bytes_.data(), size);
      bytes_ = bytes_.subspan(size);
    }
    return true;
  }

  bool at_end() const { return bytes_.empty(); }

 private:
  std::span<const uint8_t> bytes_;
};

/// Larger numbers belong to no trained network, and sums of their products might overflow.
constexpr float kMostWeight = 1e4F;

bool AllSound(const Buffer<float>& numbers) {
  // NaN fails the comparison.
  return std::all_of(numbers.begin(), numbers.end(), [](float x) { return std::fabs(x) <= kMostWeight; });
}

ky_result_t ReadConvolution(Reader& reader, const Expected& expected, Convolution* convolution) {
  std::array<uint32_t, 6> head = {};
  if (!reader.Take(head.data(), head.size())) {
    return KY_ERROR_MODEL;
  }
  const auto is = [](uint32_t number, int wanted) { return number == static_cast<uint32_t>(wanted); };
  const uint32_t kind = head[4];
  const uint32_t zero = head[5];
  if (!is(head[0], expected.side) || !is(head[1], expected.step) || !is(head[2], expected.inputs) ||
      !is(head[3], expected.outputs) || !(kind == 1 ? zero <= 255 : kind == 4 && zero == 0)) {
    return KY_ERROR_MODEL;
  }
  Convolution& c = *convolution;
  c.side = expected.side;
  c.step = expected.step;
  c.inputs = expected.inputs;
  c.outputs = expected.outputs;
  c.zero = static_cast<uint8_t>(zero);
  const size_t outputs = static_cast<size_t>(expected.outputs);
  c.factors = Buffer<float>(outputs);
  c.offsets = Buffer<float>(outputs);
  if (kind == 1) {
    c.bytes = Buffer<uint8_t>(expected.weights());
  } else {
    c.floats = Buffer<float>(expected.weights());
  }
  if (!c.factors.ok() || !c.offsets.ok() || !(c.bytes.ok() || c.floats.ok())) {
    return KY_ERROR_MEMORY;
  }
  const bool read = reader.Take(c.factors.data(), outputs) && reader.Take(c.offsets.data(), outputs) &&
                    reader.Take(c.bytes.data(), c.bytes.size()) &&
                    reader.Take(c.floats.data(), c.floats.size());
  return read && AllSound(c.factors) && AllSound(c.offsets) && AllSound(c.floats) ? KY_SUCCESS
                                                                                  : KY_ERROR_MODEL;
}

// ---- the network at work

/// A map in `memory`, all zeros.
Map Cleared(float* memory, int side, int channels) {
  std::fill_n(memory, Map::Size(side, channels), 0.0F);
  return {memory, side, channels};
}

/// Calls `work` for every pixel of `map` and 16 of its channels.
template <typename Work>
void ForEachGroup(const Map& map, Work work) {
  for (int y = 0; y < map.side; ++y) {
    for (int x = 0; x < map.side; ++x) {
      for (int channel = 0; channel < map.channels; channel += kLanes) {
        work(y, x, channel);
      }
    }
  }
}

/// The maximum of 3 x 3 in steps of two.
void MaxPool(const Map& from, const Map& to) {
  ForEachGroup(to, [&](int y, int x, int channel) {
    Lanes most = Load(from.at(2 * y, 2 * x) + channel);
    for (int dy = 0; dy < 3; ++dy) {
      for (int dx = 0; dx < 3; ++dx) {
        most = Max(most, Load(from.at(2 * y + dy, 2 * x + dx) + channel));
      }
    }
    Store(most, to.at(y, x) + channel);
  });
}

/// Adds the mean of 2 x 2 of `from` in steps of two to `to`, and makes the negative 0. `from` has no more
/// channels than `to`: the others it adds zeros to.
void AddMeansAndRectify(const Map& from, const Map& to) {
  ForEachGroup(to, [&](int y, int x, int channel) {
    Lanes sum = Load(to.at(y, x) + channel);
    if (channel < from.channels) {
      const auto at = [&](int dy, int dx) { return Load(from.at(2 * y + dy, 2 * x + dx) + channel); };
      sum = MultiplyAdd(sum, (at(0, 0) + at(0, 1)) + (at(1, 0) + at(1, 1)), Broadcast(0.25F));
    }
    Store(Max(sum, Broadcast(0)), to.at(y, x) + channel);
  });
}

/// The memory that a walk through the network takes: the picture, what the first convolution makes of it,
/// three maps that take turns, and what a convolution takes for itself.
struct Needs {
  size_t picture = 0;
  size_t first = 0;
  size_t map = 0;
  size_t convolve = 0;

  explicit Needs(const DescriptorShape& shape) {
    picture = Map::Size(shape.side, kColours);
    int side = ResultSide(shape.side, kFirstSide, 2);
    int channels = shape.first_channels;
    first = Map::Size(side, channels);
    convolve = ConvolveMemory(kFirstSide, 2, kColours, shape.side);
    side = ResultSide(side, kSide, 2);
    map = std::max(Map::Size(side, channels), Map::Size(1, shape.outputs));
    for (const ResidualBlock& block : shape.blocks) {
      const int step = block.halves ? 2 : 1;
      convolve = std::max({convolve, ConvolveMemory(kSide, step, channels, side),
                           ConvolveMemory(kSide, 1, block.channels, ResultSide(side, kSide, step))});
      side = block.halves ? side / 2 : side;
      channels = block.channels;
      map = std::max(map, Map::Size(side, channels));
    }
    convolve = std::max(convolve, ConvolveMemory(1, 1, channels, 1));
  }

  size_t sum() const { return picture + first + 3 * map + convolve; }
};

}  // namespace

const DescriptorShape& FaceDescriptorShape() {
  static constexpr DescriptorShape kShape = {150, 32, kBlocks, 128};
  return kShape;
}

bool DescriptorHeader::Recognises(std::span<const uint8_t> start) {
  return start.size() >= sizeof(kMagic) && std::equal(std::begin(kMagic), std::end(kMagic), start.begin());
}

ky_result_t DescriptorHeader::Read(std::span<const uint8_t> bytes, const DescriptorShape& shape,
                                   DescriptorHeader* header) {
  if (bytes.size() < kSize || !Recognises(bytes)) {
    return KY_ERROR_MODEL;
  }
  Reader reader(bytes.subspan(sizeof(kMagic), kSize - sizeof(kMagic)));
  uint32_t layout = 0;
  uint32_t own_checksum = 0;
  DescriptorHeader h;
  reader.Take(&layout, 1);
  reader.Take(&h.count, 1);
  reader.Take(&h.length, 1);
  reader.Take(&h.following, 1);
  reader.Take(&h.checksum, 1);
  reader.Take(&own_checksum, 1);
  size_t most = 0;
  ForEachExpected(shape, [&most](const Expected& e) {
    most += kConvolutionHeader + (2 * static_cast<size_t>(e.outputs) + e.weights()) * sizeof(float);
    return KY_SUCCESS;
  });
  if (layout != 1 || own_checksum != Checksum(bytes.first(kSize - sizeof(uint32_t))) ||
      h.count != static_cast<uint32_t>(shape.convolutions() + 1) || h.length > most) {
    return KY_ERROR_MODEL;
  }
  *header = h;
  return KY_SUCCESS;
}

ky_result_t Descriptor::Read(const DescriptorHeader& header, std::span<const uint8_t> bytes,
                             const DescriptorShape& shape, Descriptor* descriptor) {
  if (bytes.size() != header.length || Checksum(bytes) != header.checksum) {
    return KY_ERROR_MODEL;
  }
  Descriptor read;
  read.shape_ = shape;
  read.fingerprint_ = header.checksum;
  read.convolutions_ = Buffer<Convolution>(header.count);
  if (!read.convolutions_.ok()) {
    return KY_ERROR_MEMORY;
  }
  Reader reader(bytes);
  Convolution* next = read.convolutions_.begin();
  const ky_result_t result =
      ForEachExpected(shape, [&](const Expected& e) { return ReadConvolution(reader, e, next++); });
  if (result != KY_SUCCESS || !reader.at_end()) {
    return result != KY_SUCCESS ? result : KY_ERROR_MODEL;
  }
  *descriptor = std::move(read);
  return KY_SUCCESS;
}

ky_result_t Descriptor::Describe(const uint8_t* rgb, float* numbers) const {
  const Needs needs(shape_);
  const Buffer<float> memory(needs.sum());
  if (!memory.ok()) {
    return KY_ERROR_MEMORY;
  }
  float* const picture_memory = memory.data();
  float* const first_memory = picture_memory + needs.picture;
  float* const maps = first_memory + needs.first;
  float* const scratch = maps + 3 * needs.map;
  std::array<float*, 3> free = {maps, maps + needs.map, maps + 2 * needs.map};

  const Map picture = Cleared(picture_memory, shape_.side, kColours);
  for (int y = 0; y < shape_.side; ++y) {
    float* const row = picture.at(y, 0);
    for (int i = 0; i < shape_.side * kColours; ++i) {
      row[i] = (static_cast<float>(*rgb++) - kMean[static_cast<size_t>(i % kColours)]) / kRange;
    }
  }

  const Convolution* convolution = convolutions_.begin();
  const Map first = Cleared(first_memory, ResultSide(shape_.side, kFirstSide, 2), shape_.first_channels);
  Convolve(*convolution++, picture, {.rectify = true}, first, scratch);
  Map now = Cleared(free[0], ResultSide(first.side, kSide, 2), shape_.first_channels);
  MaxPool(first, now);

  for (const ResidualBlock& block : shape_.blocks) {
    const Map middle = Cleared(free[1], ResultSide(now.side, kSide, block.halves ? 2 : 1), block.channels);
    Convolve(*convolution++, now, {.rectify = true}, middle, scratch);
    // The mean may have a row and a column more than the convolutions, which have zeros there.
    const Map after = Cleared(free[2], block.halves ? now.side / 2 : now.side, block.channels);
    if (block.halves) {
      Convolve(*convolution++, middle, {}, after, scratch);
      AddMeansAndRectify(now, after);
    } else {
      Convolve(*convolution++, middle, {.rectify = true, .skip = &now}, after, scratch);
    }
    now = after;
    std::swap(free[0], free[2]);
  }

  const Map mean = Cleared(free[1], 1, now.channels);
  const Lanes share = Broadcast(1 / static_cast<float>(now.side * now.side));
  ForEachGroup(now, [&](int y, int x, int channel) {
    float* const sum = mean.at(0, 0) + channel;
    Store(MultiplyAdd(Load(sum), Load(now.at(y, x) + channel), share), sum);
  });
  const Map result = Cleared(free[2], 1, shape_.outputs);
  Convolve(*convolution, mean, {}, result, scratch);
  std::copy_n(result.at(0, 0), shape_.outputs, numbers);
  return std::all_of(numbers, numbers + shape_.outputs, [](float x) { return std::isfinite(x); })
             ? KY_SUCCESS
             : KY_ERROR_MODEL;
}

}  // namespace kyengine
