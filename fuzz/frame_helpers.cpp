// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The frame helpers with any scalars, over buffers that hold what valid ones describe: the pixels that the
// formulas give or, where the sizes are refused or hold nothing, no byte touched.

#include "frame/frame.h"

#include <algorithm>
#include <vector>

#include "assertion.h"
#include "fuzz_input.h"
#include "tests/support/frame_reference.h"
#include "tests/support/guarded_image.h"

namespace {

using kyface::fuzz::asserted;
using kyface::fuzz::Input;
using kyface::test::GuardedImage;
using reference::Bytes;

int wrap(int64_t value) { return static_cast<int>(static_cast<uint32_t>(value)); }

/// A packed buffer: of nothing where a size is below 1.
class Buffer : public GuardedImage<unsigned char> {
 public:
  explicit Buffer(int64_t bytes) : GuardedImage(1, static_cast<int>(bytes), static_cast<int>(bytes)) {}
};

struct Size {
  int width, height;

  bool isEmpty() const { return width < 1 || height < 1; }
  int64_t pixels() const { return isEmpty() ? 0 : int64_t{width} * height; }
  int64_t frameBytes() const { return isEmpty() ? 0 : pixels() + int64_t{width} * (height / 2); }
};

/// Mostly a size that a buffer can have, else one that has no pixels.
Size someSize(Input& input) {
  Size size{input.in(0, 70), input.in(0, 10)};
  if (input.seldom(2)) {
    size = {size.width & ~1, size.height & ~1};
  }
  if (input.seldom(6)) {
    (input.seldom(2) ? size.width : size.height) = std::min(input.any(), 0);
  }
  return size;
}

/// The rows of the one-channel matrix over a frame.
int frameRows(int height) {
  return static_cast<int>(std::clamp<int64_t>(int64_t{3} * height / 2, INT32_MIN, INT32_MAX));
}

/// Whether a frame and its pixels have sizes that can be converted. A height whose 3/2 is beyond an int
/// cannot.
bool isConverted(Size size) {
  return size.width % 2 == 0 && size.height % 2 == 0 && size.height == frameRows(size.height) / 3 * 2;
}

Bytes contentsOf(const Buffer& buffer) { return buffer.contents(); }

// ---- conversions with a frame on one side

struct Decoder {
  void (*convert)(unsigned char*, int, int, int, unsigned char*);
  reference::Layout layout;
};
const Decoder kDecoders[] = {
    {nv2RGB, reference::kRgba}, {nv2BGR, reference::kBgra}, {nv212BGR, reference::kBgr}};
const Decoder kEncoders[] = {{RGB2nv, reference::kRgba}, {BGR2nv, reference::kBgra}};

reference::Chroma chromaOf(int format) { return format == 3 ? reference::kNv21 : reference::kNv12; }

template <bool decodes>
void fuzzConversion(Input& input) {
  const Decoder& helper = decodes ? kDecoders[input.byte() % std::size(kDecoders)]
                                  : kEncoders[input.byte() % std::size(kEncoders)];
  const Size size = someSize(input);
  const int format = input.seldom(3) ? input.any() : input.in(2, 3);
  Buffer frame(size.frameBytes());
  Buffer pixels(size.pixels() * helper.layout.channels);
  Buffer& in = decodes ? frame : pixels;
  Buffer& out = decodes ? pixels : frame;
  in.fill([&] { return input.pixel(); });
  const Bytes before = contentsOf(in);
  Bytes want = contentsOf(out);
  if (isConverted(size) && !size.isEmpty()) {
    const auto convert = decodes ? reference::toPixels : reference::toFrame;
    want = convert(before, size.width, size.height, chromaOf(format), helper.layout);
  }
  helper.convert(in.data(), format, size.width, size.height, out.data());
  FUZZ_CHECK(out.holds(want));
  FUZZ_CHECK(in.holds(before));
}

// ---- exchange of red and blue

template <int channels>
void fuzzSwap(Input& input) {
  const Size size = someSize(input);
  Buffer in(size.pixels() * 4);
  Buffer out(size.pixels() * channels);
  in.fill([&] { return input.pixel(); });
  const Bytes before = contentsOf(in);
  Bytes want;
  for (size_t i = 0; i < before.size(); i += 4) {
    const unsigned char swapped[] = {before[i + 2], before[i + 1], before[i], before[i + 3]};
    want.insert(want.end(), swapped, swapped + channels);
  }
  (channels == 4 ? BGR2RGB : BGRA2RGB)(in.data(), size.width, size.height, out.data());
  FUZZ_CHECK(out.holds(want));
  FUZZ_CHECK(in.holds(before));
}

// ---- crop

struct Rectangle {
  int64_t x, y;
  Size size;

  bool isInside(int width, int height) const {
    return x >= 0 && x <= width && y >= 0 && y <= height && wrap(x + size.width) <= width &&
           wrap(y + size.height) <= height;
  }
};

/// Appends a rectangle of the frame's rows.
void cut(const Bytes& frame, int width, const Rectangle& rectangle, Bytes* out) {
  for (int r = 0; r < rectangle.size.height; ++r) {
    const auto first = frame.begin() + (rectangle.y + r) * width + rectangle.x;
    out->insert(out->end(), first, first + std::max(rectangle.size.width, 0));
  }
}

void fuzzCrop(Input& input) {
  const Size image = someSize(input);
  const auto scalar = [&](int low, int high) { return input.seldom(8) ? input.any() : input.in(low, high); };
  const int x = scalar(-1, 40), y = scalar(-1, 10);
  Size size{scalar(0, 70), scalar(0, 10)};
  if (input.seldom(2)) {
    size = {size.width & ~1, size.height & ~1};
  }
  // A temporary frame that is large but can be had would only take time; one that cannot be had may be asked
  // for.
  const int64_t temporary = int64_t{size.width} * frameRows(size.height);
  if (temporary > 1 << 20) {
    return;
  }
  Buffer frame(image.frameBytes());
  Buffer out(temporary < 0 ? 0 : size.pixels() * 4);
  frame.fill([&] { return input.pixel(); });
  const Bytes before = contentsOf(frame);

  const int rows = frameRows(image.height);
  const Rectangle luma{x, y, size};
  const Rectangle chroma{x, wrap(int64_t{image.height} + y / 2), {size.width, size.height / 2}};
  const bool isWhole = luma.isInside(image.width, rows) && chroma.isInside(image.width, rows);
  const bool isWritten = temporary >= 0 && isConverted(size) && !size.isEmpty();
  Bytes want = contentsOf(out);
  cropNv21(frame.data(), image.width, image.height, x, y, size.width, size.height, out.data());
  if (isWritten && isWhole) {
    Bytes cropped;
    cut(before, image.width, luma, &cropped);
    cut(before, image.width, chroma, &cropped);
    want = reference::toPixels(cropped, size.width, size.height, reference::kNv21, reference::kRgba);
  } else if (isWritten) {
    want = contentsOf(out);  // undefined, but for the fourth channel
    for (size_t i = 3; i < want.size(); i += 4) {
      want[i] = 255;
    }
  }
  FUZZ_CHECK(out.holds(want));
  FUZZ_CHECK(frame.holds(before));
}

// ---- rotation

void fuzzRotation(Input& input) {
  static constexpr int kAngles[] = {90, 180, 270, 0, 360, -90, 89, 91, 450};
  const Size size = someSize(input);
  const int degree = input.seldom(8) ? input.any() : kAngles[input.byte() % std::size(kAngles)];
  const bool isTurned = degree == 90 || degree == 180 || degree == 270;
  Buffer in(size.pixels() * 3);
  Buffer out(size.pixels() * 3);
  in.fill([&] { return input.pixel(); });
  const Bytes before = contentsOf(in);
  Bytes want = contentsOf(out);
  const bool sideways = degree == 90 || degree == 270;
  const Size turned = sideways ? Size{size.height, size.width} : size;
  if (isTurned && !size.isEmpty()) {
    for (int r = 0; r < turned.height; ++r) {
      for (int c = 0; c < turned.width; ++c) {
        const int row = degree == 90 ? size.height - 1 - c : degree == 180 ? size.height - 1 - r : c;
        const int column = degree == 90 ? r : degree == 180 ? size.width - 1 - c : size.width - 1 - r;
        std::copy_n(&before[(static_cast<size_t>(row) * size.width + column) * 3], 3,
                    &want[(static_cast<size_t>(r) * turned.width + c) * 3]);
      }
    }
  }
  int outSize[] = {-5, -6};
  const bool stopped =
      asserted([&] { rotateBGR(in.data(), size.width, size.height, out.data(), degree, outSize); });
  FUZZ_CHECK(stopped == (isTurned && (size.width == 0 || size.height == 0)));
  FUZZ_CHECK(outSize[0] == turned.width && outSize[1] == turned.height);
  FUZZ_CHECK(out.holds(want));
  FUZZ_CHECK(in.holds(before));
}

using Target = void (*)(Input&);
const Target kTargets[] = {fuzzConversion<true>,
                           fuzzConversion<true>,
                           fuzzConversion<false>,
                           fuzzSwap<4>,
                           fuzzSwap<3>,
                           fuzzCrop,
                           fuzzCrop,
                           fuzzRotation};

}  // namespace

// The helpers' notes would fill the terminal.
extern "C" int __android_log_print(int, const char*, const char*, ...);
extern "C" int __android_log_print(int /*priority*/, const char* /*tag*/, const char* /*format*/, ...) {
  return 1;
}

// Memory that there is not must be null, as it is without the checks.
extern "C" const char* __asan_default_options();
extern "C" const char* __asan_default_options() { return "allocator_may_return_null=1"; }

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  kTargets[input.byte() % std::size(kTargets)](input);
  return 0;
}
