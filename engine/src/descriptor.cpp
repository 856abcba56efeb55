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
ky_result_t forEachExpected(const DescriptorShape& shape, Visit visit) {
  ky_result_t result = visit(Expected{kFirstSide, 2, kColours, shape.firstChannels});
  int channels = shape.firstChannels;
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
  bool take(T* values, size_t count) {
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

  bool atEnd() const { return bytes_.empty(); }

 private:
  std::span<const uint8_t> bytes_;
};

/// Larger numbers belong to no trained network, and sums of their products might overflow.
constexpr float kMostWeight = 1e4F;

bool allSound(const Buffer<float>& numbers) {
  // NaN fails the comparison.
  return std::all_of(numbers.begin(), numbers.end(), [](float x) { return std::fabs(x) <= kMostWeight; });
}

ky_result_t readConvolution(Reader& reader, const Expected& expected, Convolution* convolution) {
  std::array<uint32_t, 6> head = {};
  if (!reader.take(head.data(), head.size())) {
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
  const bool read = reader.take(c.factors.data(), outputs) && reader.take(c.offsets.data(), outputs) &&
                    reader.take(c.bytes.data(), c.bytes.size()) &&
                    reader.take(c.floats.data(), c.floats.size());
  return read && allSound(c.factors) && allSound(c.offsets) && allSound(c.floats) ? KY_SUCCESS
                                                                                  : KY_ERROR_MODEL;
}

// ---- the network at work

/// A map in `memory`, all zeros.
Map cleared(float* memory, int side, int channels) {
  std::fill_n(memory, Map::size(side, channels), 0.0F);
  return {memory, side, channels};
}

/// Calls `work` for every pixel of `map` and 16 of its channels.
template <typename Work>
void forEachGroup(const Map& map, Work work) {
  for (int y = 0; y < map.side; ++y) {
    for (int x = 0; x < map.side; ++x) {
      for (int channel = 0; channel < map.channels; channel += kLanes) {
        work(y, x, channel);
      }
    }
  }
}

/// The maximum of 3 x 3 in steps of two.
void maxPool(const Map& from, const Map& to) {
  forEachGroup(to, [&](int y, int x, int channel) {
    Lanes most = load(from.at(2 * y, 2 * x) + channel);
    for (int dy = 0; dy < 3; ++dy) {
      for (int dx = 0; dx < 3; ++dx) {
        most = max(most, load(from.at(2 * y + dy, 2 * x + dx) + channel));
      }
    }
    store(most, to.at(y, x) + channel);
  });
}

/// Adds the mean of 2 x 2 of `from` in steps of two to `to`, and makes the negative 0. `from` has no more
/// channels than `to`: the others it adds zeros to.
void addMeansAndRectify(const Map& from, const Map& to) {
  forEachGroup(to, [&](int y, int x, int channel) {
    Lanes sum = load(to.at(y, x) + channel);
    if (channel < from.channels) {
      const auto at = [&](int dy, int dx) { return load(from.at(2 * y + dy, 2 * x + dx) + channel); };
      sum = multiplyAdd(sum, (at(0, 0) + at(0, 1)) + (at(1, 0) + at(1, 1)), broadcast(0.25F));
    }
    store(max(sum, broadcast(0)), to.at(y, x) + channel);
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
    picture = Map::size(shape.side, kColours);
    int side = resultSide(shape.side, kFirstSide, 2);
    int channels = shape.firstChannels;
    first = Map::size(side, channels);
    convolve = convolveMemory(kFirstSide, 2, kColours, shape.side);
    side = resultSide(side, kSide, 2);
    map = std::max(Map::size(side, channels), Map::size(1, shape.outputs));
    for (const ResidualBlock& block : shape.blocks) {
      const int step = block.halves ? 2 : 1;
      convolve = std::max({convolve, convolveMemory(kSide, step, channels, side),
                           convolveMemory(kSide, 1, block.channels, resultSide(side, kSide, step))});
      side = block.halves ? side / 2 : side;
      channels = block.channels;
      map = std::max(map, Map::size(side, channels));
    }
    convolve = std::max(convolve, convolveMemory(1, 1, channels, 1));
  }

  size_t sum() const { return picture + first + 3 * map + convolve; }
};

}  // namespace

const DescriptorShape& faceDescriptorShape() {
  static constexpr DescriptorShape kShape = {150, 32, kBlocks, 128};
  return kShape;
}

bool DescriptorHeader::recognises(std::span<const uint8_t> start) {
  return start.size() >= sizeof(kMagic) && std::equal(std::begin(kMagic), std::end(kMagic), start.begin());
}

ky_result_t DescriptorHeader::read(std::span<const uint8_t> bytes, const DescriptorShape& shape,
                                   DescriptorHeader* header) {
  if (bytes.size() < kSize || !recognises(bytes)) {
    return KY_ERROR_MODEL;
  }
  Reader reader(bytes.subspan(sizeof(kMagic), kSize - sizeof(kMagic)));
  uint32_t layout = 0;
  uint32_t ownChecksum = 0;
  DescriptorHeader h;
  reader.take(&layout, 1);
  reader.take(&h.count, 1);
  reader.take(&h.length, 1);
  reader.take(&h.following, 1);
  reader.take(&h.checksum, 1);
  reader.take(&ownChecksum, 1);
  size_t most = 0;
  forEachExpected(shape, [&most](const Expected& e) {
    most += kConvolutionHeader + (2 * static_cast<size_t>(e.outputs) + e.weights()) * sizeof(float);
    return KY_SUCCESS;
  });
  if (layout != 1 || ownChecksum != crcOf(bytes.first(kSize - sizeof(uint32_t))) ||
      h.count != static_cast<uint32_t>(shape.convolutions() + 1) || h.length > most) {
    return KY_ERROR_MODEL;
  }
  *header = h;
  return KY_SUCCESS;
}

ky_result_t Descriptor::read(const DescriptorHeader& header, std::span<const uint8_t> bytes,
                             const DescriptorShape& shape, Descriptor* descriptor) {
  if (bytes.size() != header.length || crcOf(bytes) != header.checksum) {
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
      forEachExpected(shape, [&](const Expected& e) { return readConvolution(reader, e, next++); });
  if (result != KY_SUCCESS || !reader.atEnd()) {
    return result != KY_SUCCESS ? result : KY_ERROR_MODEL;
  }
  *descriptor = std::move(read);
  return KY_SUCCESS;
}

ky_result_t Descriptor::describe(const uint8_t* rgb, float* numbers) const {
  const Needs needs(shape_);
  const Buffer<float> memory(needs.sum());
  if (!memory.ok()) {
    return KY_ERROR_MEMORY;
  }
  float* const pictureMemory = memory.data();
  float* const firstMemory = pictureMemory + needs.picture;
  float* const maps = firstMemory + needs.first;
  float* const scratch = maps + 3 * needs.map;
  std::array<float*, 3> free = {maps, maps + needs.map, maps + 2 * needs.map};

  const Map picture = cleared(pictureMemory, shape_.side, kColours);
  for (int y = 0; y < shape_.side; ++y) {
    float* const row = picture.at(y, 0);
    for (int i = 0; i < shape_.side * kColours; ++i) {
      row[i] = (static_cast<float>(*rgb++) - kMean[static_cast<size_t>(i % kColours)]) / kRange;
    }
  }

  const Convolution* convolution = convolutions_.begin();
  const Map first = cleared(firstMemory, resultSide(shape_.side, kFirstSide, 2), shape_.firstChannels);
  convolve(*convolution++, picture, {.rectify = true}, first, scratch);
  Map now = cleared(free[0], resultSide(first.side, kSide, 2), shape_.firstChannels);
  maxPool(first, now);

  for (const ResidualBlock& block : shape_.blocks) {
    const Map middle = cleared(free[1], resultSide(now.side, kSide, block.halves ? 2 : 1), block.channels);
    convolve(*convolution++, now, {.rectify = true}, middle, scratch);
    // The mean may have a row and a column more than the convolutions, which have zeros there.
    const Map after = cleared(free[2], block.halves ? now.side / 2 : now.side, block.channels);
    if (block.halves) {
      convolve(*convolution++, middle, {}, after, scratch);
      addMeansAndRectify(now, after);
    } else {
      convolve(*convolution++, middle, {.rectify = true, .skip = &now}, after, scratch);
    }
    now = after;
    std::swap(free[0], free[2]);
  }

  const Map mean = cleared(free[1], 1, now.channels);
  const Lanes share = broadcast(1 / static_cast<float>(now.side * now.side));
  forEachGroup(now, [&](int y, int x, int channel) {
    float* const sum = mean.at(0, 0) + channel;
    store(multiplyAdd(load(sum), load(now.at(y, x) + channel), share), sum);
  });
  const Map result = cleared(free[2], 1, shape_.outputs);
  convolve(*convolution, mean, {}, result, scratch);
  std::copy_n(result.at(0, 0), shape_.outputs, numbers);
  return std::all_of(numbers, numbers + shape_.outputs, [](float x) { return std::isfinite(x); })
             ? KY_SUCCESS
             : KY_ERROR_MODEL;
}

}  // namespace kyengine
