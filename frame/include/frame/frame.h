// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Frame helpers: conversions, crop and rotation of whole camera frames in caller memory.
///
/// Every buffer is packed (no stride): a semi-planar 4:2:0 frame is `width * height` luma bytes followed by
/// `width * height / 2` bytes of interleaved chroma pairs, a 4- or 3-channel image is `width * height * 4` or
/// `* 3` bytes. `format` selects the chroma order: `kFormatNv21`, or NV12 for any other value.
///
/// Caller memory is neither kept nor freed, and pointers and sizes are not checked here: the image library
/// checks the sizes, and on a mismatch (an odd width or height of a 4:2:0 frame) nothing is written and
/// nothing reported. A null buffer faults. The helpers keep no state; threads may call them on distinct
/// buffers.
///
/// Names and channel counts do not always agree, and callers rely on it: only `nv212BGR` and `BGRA2RGB` have
/// a 3-channel side, all others work on 4-byte pixels.
#pragma once

#define KYFACE_EXPORT __attribute__((visibility("default")))

namespace kyface {

constexpr int kFormatNv12 = 2;  ///< U before V
constexpr int kFormatNv21 = 3;  ///< V before U

}  // namespace kyface

/// 4:2:0 frame `nv` to RGBA `out`, alpha 255.
KYFACE_EXPORT void nv2RGB(unsigned char* nv, int format, int width, int height, unsigned char* out);

/// RGBA `in` to 4:2:0 frame `nv`.
KYFACE_EXPORT void RGB2nv(unsigned char* in, int format, int width, int height, unsigned char* nv);

/// 4:2:0 frame `nv` to BGRA `out`, alpha 255.
KYFACE_EXPORT void nv2BGR(unsigned char* nv, int format, int width, int height, unsigned char* out);

/// 4:2:0 frame `nv` to 3-channel BGR `out`.
KYFACE_EXPORT void nv212BGR(unsigned char* nv, int format, int width, int height, unsigned char* out);

/// BGRA `in` to 4:2:0 frame `nv`.
KYFACE_EXPORT void BGR2nv(unsigned char* in, int format, int width, int height, unsigned char* nv);

/// BGRA `in` to RGBA `out` (or back: red and blue change places, alpha stays).
KYFACE_EXPORT void BGR2RGB(unsigned char* in, int width, int height, unsigned char* out);

/// BGRA `in` to 3-channel RGB `out` (or RGBA to BGR).
KYFACE_EXPORT void BGRA2RGB(unsigned char* in, int width, int height, unsigned char* out);

/// Cuts the rectangle (`x`, `y`, `w`, `h`), in luma pixels, out of an NV21 frame and delivers it as RGBA in
/// `out` (`w * h * 4` bytes).
///
/// Coordinates are not aligned: an odd `x` starts in the middle of a V,U pair and exchanges U and V, an odd
/// `y` starts the luma one row below its chroma. A plane whose rectangle leaves the frame buffer (which is
/// 3/2 * `imageHeight` rows high, so luma rows past `imageHeight` pass) is not cropped, and undefined pixels
/// are converted in its place. An odd `w` or `h` leaves `out` unwritten, as does a temporary frame that
/// cannot be allocated.
KYFACE_EXPORT void cropNv21(unsigned char* nv21, int imageWidth, int imageHeight, int x, int y, int w, int h,
                            unsigned char* out);

/// Rotates a 3-channel image clockwise by `degree` (90, 180, 270) into `dst` and writes the result's width
/// and height to `outSize[0]` and `outSize[1]`. Any other angle leaves `dst` as it was, with `outSize` =
/// (`width`, `height`).
KYFACE_EXPORT void rotateBGR(unsigned char* src, int width, int height, unsigned char* dst, int degree,
                             int* outSize);
