// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Brightness metrics: how bright a rectangle of an image is, from 0 (dark) to 255 (bright).
///
/// All five take the same arguments:
/// - `data`: first byte of row 0; read only, not kept.
/// - `width`, `height`: image size in pixels. `widthStride`: bytes from one row to the next. `heightStride`:
///   accepted and ignored.
/// - `rectX`, `rectY`, `rectW`, `rectH`: the rectangle in pixels; it is clipped to the image.
///
/// The result is the rounded mean over the n pixels of the clipped rectangle, (sum + n / 2) / n, as its low 8
/// bits; 0 when n is 0. A null `data`, a `widthStride` below 1 or a rectangle whose `rectW * rectH` is 0
/// prints "wrong enter\r" and a newline to standard output and returns 255.
///
/// The rectangle is clipped in 64 bits. The rest is 32-bit arithmetic that wraps, whatever the arguments: an
/// unsigned sum, a signed n and a signed division. Any region up to 8 405 024 pixels (2899 x 2899) is safe.
/// From there on a region that is white throughout makes sum + n / 2 exceed 2^31 - 1, from 16 843 010 pixels
/// on the sum itself wraps, and the mean means nothing; a darker region may be larger in proportion.
///
/// The functions may be called from several threads at once.
///
/// In C++ a function's name in a library tells whether its pointer is to `const`. The library exports each
/// metric under the other name, too, for callers whose own declarations have a plain `unsigned char*`.
#pragma once

#ifndef KYFACE_EXPORT
#define KYFACE_EXPORT __attribute__((visibility("default")))
#endif

/// Mean of byte 0 of 3-byte pixels (the luma of packed YUV).
KYFACE_EXPORT unsigned char calcGray_YUV(const unsigned char* data, int width, int widthStride, int height,
                                         int heightStride, int rectX, int rectY, int rectW, int rectH);

/// Mean gray of B,G,R,A pixels: (77 B + 150 G + 29 R + 128) >> 8. Blue has the larger weight (C1).
KYFACE_EXPORT unsigned char calcGray_BGRA(const unsigned char* data, int width, int widthStride, int height,
                                          int heightStride, int rectX, int rectY, int rectW, int rectH);

/// Mean gray of R,G,B,A pixels: (77 B + 150 G + 29 R + 128) >> 8. Blue has the larger weight (C1).
KYFACE_EXPORT unsigned char calcGray_RGBA(const unsigned char* data, int width, int widthStride, int height,
                                          int heightStride, int rectX, int rectY, int rectW, int rectH);

/// Mean CIE lightness (L* scaled to 0..255) of B,G,R,A pixels. Each call rebuilds the two look-up tables, 6.5
/// KB.
KYFACE_EXPORT unsigned char calcLuminance_BGRA(const unsigned char* data, int width, int widthStride,
                                               int height, int heightStride, int rectX, int rectY, int rectW,
                                               int rectH);

/// Mean CIE lightness (L* scaled to 0..255) of R,G,B,A pixels. Each call rebuilds the two look-up tables, 6.5
/// KB.
KYFACE_EXPORT unsigned char calcLuminance_RGBA(const unsigned char* data, int width, int widthStride,
                                               int height, int heightStride, int rectX, int rectY, int rectW,
                                               int rectH);
