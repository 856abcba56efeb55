// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// One convolution of the face descriptor.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>

namespace kyengine {

/// Memory for `size` elements, or none.
template <typename T>
class Buffer {
 public:
  Buffer() = default;
  explicit Buffer(size_t size) : data_(new(std::nothrow) T[size]), size_(data_ == nullptr ? 0 : size) {}

  bool ok() const { return data_ != nullptr; }
  T* data() const { return data_.get(); }
  size_t size() const { return size_; }
  T* begin() const { return data(); }
  T* end() const { return data() + size_; }

 private:
  std::unique_ptr<T[]> data_;
  size_t size_ = 0;
};

/// One convolution, or the matrix at the end (1 x 1): output = (weights * input) factor + offset for each
/// output channel, the factor holding the scale of the weights and of the affine layer that follows.
struct Convolution {
  int side = 0;  ///< of the square kernel
  int step = 0;
  int inputs = 0;
  int outputs = 0;
  uint8_t zero = 0;       ///< the byte that stands for a weight of 0
  Buffer<uint8_t> bytes;  ///< the weights as bytes, or
  Buffer<float> floats;   ///< as they are: [outputs / 16][side][side * inputs][16]
  Buffer<float> factors;
  Buffer<float> offsets;
};

/// Numbers of a picture, [side][side][channels], within a border of zeros one pixel wide.
struct Map {
  float* data = nullptr;
  int side = 0;
  int channels = 0;

  ptrdiff_t row() const { return static_cast<ptrdiff_t>(side + 2) * channels; }
  float* at(int y, int x) const { return data + (y + 1) * row() + static_cast<ptrdiff_t>(x + 1) * channels; }

  static size_t size(int side, int channels) {
    return static_cast<size_t>(side + 2) * static_cast<size_t>(side + 2) * static_cast<size_t>(channels);
  }
};

/// What follows the sums of a convolution.
struct Finish {
  bool rectify = false;       ///< negative results become 0
  const Map* skip = nullptr;  ///< added before that, at the same pixel
};

/// The side of the result where a kernel walks over a map of `side`. In steps of one the map's border takes
/// part, and the result is as large as the map; in others it takes none.
constexpr int resultSide(int side, int kernel, int step) {
  return step == 1 ? side : (side - kernel) / step + 1;
}

/// The floats that convolve takes for itself, for a kernel, its inputs and the side of the map.
size_t convolveMemory(int kernel, int step, int inputs, int side);

/// Convolves all of `from`. `to` is as large as the result, or larger.
void convolve(const Convolution& c, const Map& from, const Finish& finish, const Map& to, float* memory);

}  // namespace kyengine
