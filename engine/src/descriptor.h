// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The face descriptor: a residual network that turns the picture of an aligned face into numbers, so that
/// pictures of one person lie close to one another and those of two far apart.
///
/// Nothing in here throws, and nothing keeps memory beyond a call but the weights.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "convolve.h"
#include "engine/ky_engine.h"

namespace kyengine {

/// A residual block: two 3 x 3 convolutions beside a skip. One that halves walks its first convolution and
/// the mean of its skip in steps of two.
struct ResidualBlock {
  int channels;  ///< of its output; at least those of its input
  bool halves;
};

/// What a network looks like. Its first convolution is 7 x 7 in steps of two over red, green and blue, then
/// comes the maximum of 3 x 3 in steps of two, then the blocks, then the mean over the picture and a matrix.
/// All numbers of channels, and of outputs, are multiples of 16.
struct DescriptorShape {
  int side;  ///< of the square picture
  int firstChannels;
  std::span<const ResidualBlock> blocks;
  int outputs;

  int convolutions() const { return 1 + 2 * static_cast<int>(blocks.size()); }
};

/// dlib's network for faces (`dlib_face_recognition_resnet_model_v1`): 150 x 150 pixels, 128 numbers, 270.8
/// million multiply-adds.
const DescriptorShape& faceDescriptorShape();

/// The first bytes of a model file. All numbers are little-endian.
///
///   magic        8 bytes, kMagic
///   layout       u32, 1
///   count        u32, the convolutions and the matrix
///   length       u64, bytes of them, right behind the header
///   following    u64, bytes of a landmark model (a `dlib::shape_predictor`) behind them, to the file's end;
///   0 for
///                none
///   checksum     u32, of the `length` bytes
///   header       u32, checksum of the 36 bytes before
///
/// and then for each convolution, in the order of the network:
///
///   side, step, inputs, outputs    u32 each
///   kind         u32, 1 for weights that are bytes, 4 for floats
///   zero         u32, the byte that stands for 0; 0 for floats
///   factors      f32[outputs]
///   offsets      f32[outputs]
///   weights      [outputs / 16][side][side * inputs][16], those of one output channel in one lane
struct DescriptorHeader {
  static constexpr size_t kSize = 40;
  static constexpr uint8_t kMagic[8] = {'K', 'Y', 'D', 'E', 'S', 'C', 0x1a, '\n'};

  uint32_t count = 0;
  uint64_t length = 0;
  uint64_t following = 0;
  uint32_t checksum = 0;

  /// Whether a file that starts like this means to be such a model.
  static bool recognises(std::span<const uint8_t> start);

  /// Reads the first kSize bytes of a file. KY_ERROR_MODEL when they are not the header of a model of this
  /// shape, whose `length` then is no more than one of this shape can have.
  static ky_result_t read(std::span<const uint8_t> bytes, const DescriptorShape& shape,
                          DescriptorHeader* header);
};

class Descriptor {
 public:
  /// Reads the convolutions, `header.length` bytes. KY_ERROR_MODEL when they are damaged, not of this shape
  /// or hold what is no number; KY_ERROR_MEMORY.
  static ky_result_t read(const DescriptorHeader& header, std::span<const uint8_t> bytes,
                          const DescriptorShape& shape, Descriptor* descriptor);

  /// Describes a picture of the shape's side, packed rows of red, green and blue, with `outputs` numbers.
  /// KY_ERROR_MEMORY; KY_ERROR_MODEL when the model gives what is no number. Any number of threads may call.
  ky_result_t describe(const uint8_t* rgb, float* numbers) const;

  int outputs() const { return shape_.outputs; }

  /// Tells models apart: the checksum of the weights.
  uint32_t fingerprint() const { return fingerprint_; }

 private:
  DescriptorShape shape_ = {};
  Buffer<Convolution> convolutions_;
  uint32_t fingerprint_ = 0;
};

}  // namespace kyengine
