// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The operations that are measured, and how one is described.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <functional>
#include <memory>
#include <new>
#include <string>
#include <vector>

namespace bench {

/// A picture's size, in pixels.
struct Size {
  int width;
  int height;

  size_t pixels() const { return static_cast<size_t>(width) * static_cast<size_t>(height); }
};

/// A picture's size after a rotation by 90, 180 or 270 degrees.
inline Size rotatedBy(int angle, Size size) { return angle == 180 ? size : Size{size.height, size.width}; }

/// What a picture is cropped out of: one with a margin on all sides.
constexpr int kCropMargin = 8;
inline Size croppedFrom(Size size) { return {size.width + 2 * kCropMargin, size.height + 2 * kCropMargin}; }

/// One way of doing something to a picture. Operations of the same name do the same thing, so that those of
/// several libraries stand side by side.
struct Operation {
  std::string name;     ///< such as "NV21-to-RGBA", "rotate90-u8x3"
  std::string library;  ///< "fastcv", or a peer
  double traffic;       ///< bytes read and written, a pixel
  /// Sets up the buffers for a picture and returns the call.
  std::function<std::function<void()>(Size)> prepare;
};

/// What a picture's samples are filled with: random values from `low` to `high`, the same in every run.
struct Range {
  float low;
  float high;
};

/// `count` random samples, on a page boundary so that nothing depends on where memory happened to be.
template <typename T>
std::shared_ptr<T> samples(size_t count, Range range = {0, sizeof(T) == 1 ? 255.0f : 1.0f}) {
  constexpr size_t kPage = 4096;
  // Some kernels may touch a few samples past the last.
  constexpr size_t kSlack = 64;
  // Random samples that are repeated, at a distance that fits no picture.
  constexpr size_t kPeriod = 65521;
  const size_t total = count + kSlack;
  void* allocated = nullptr;
  if (posix_memalign(&allocated, kPage, total * sizeof(T)) != 0) {
    throw std::bad_alloc();
  }
  T* memory = static_cast<T*>(allocated);
  unsigned state = 1;
  for (size_t i = 0; i < std::min(total, kPeriod); ++i) {
    state = state * 1664525 + 1013904223;
    const float unit = static_cast<float>(state >> 8) / 0xffffff;
    memory[i] = static_cast<T>(range.low + unit * (range.high - range.low));
  }
  for (size_t i = kPeriod; i < total; i += kPeriod) {
    std::copy_n(memory, std::min(total - i, kPeriod), memory + i);
  }
  return std::shared_ptr<T>(memory, std::free);
}

/// The operations of each library.
void addFastcv(std::vector<Operation>& operations);
void addPlanes(std::vector<Operation>& operations);
void addLibyuv(std::vector<Operation>& operations);
void addOpencv(std::vector<Operation>& operations);
/// For every traffic among `operations`, a plain copy that reads and writes as much: what no operation can
/// undercut.
void addFloor(std::vector<Operation>& operations);

/// Those whose name holds a match of the regular expression `pattern`, whatever the case, with their floors.
/// Those of this project alone when `own`.
std::vector<Operation> operationsMatching(const std::string& pattern, bool own);

/// A size written "1280x720"; ends the program when it is not.
Size sizeOf(const std::string& text);

}  // namespace bench
