/// Brightness metrics: how bright a rectangle of an image is, from 0 (dark) to 255 (bright).
///
/// All five take the same arguments:
/// - `data`: first byte of row 0; read only, not kept.
/// - `width`, `height`: image size in pixels. `widthStride`: bytes from one row to the next. `heightStride`:
///   accepted and ignored.
/// - `rectX`, `rectY`, `rectW`, `rectH`: the rectangle in pixels; it is clipped to the image.
///
/// The result is the rounded mean over every pixel of the clipped rectangle, (sum + n / 2) / n in 32-bit arithmetic,
/// as its low 8 bits; 0 when the clipped rectangle has an area of 0. A null `data`, a `widthStride` below 1 or a
/// rectangle whose `rectW * rectH` is 0 prints "wrong enter\r" to standard output and returns 255.
///
/// The sum is an unsigned 32-bit sum and the mean a signed division: it holds up to 2^31 - 1, which is reached at
/// the earliest by 8 421 505 pixels of 255 (about 2900 x 2900); a larger bright region gives a meaningless mean.
#pragma once

#ifndef KYFACE_EXPORT
#define KYFACE_EXPORT __attribute__((visibility("default")))
#endif

/// Mean of byte 0 of 3-byte pixels (the luma of packed YUV).
KYFACE_EXPORT unsigned char calcGray_YUV(const unsigned char* data, int width, int widthStride, int height,
                                         int heightStride, int rectX, int rectY, int rectW, int rectH);

/// Mean gray of B,G,R,A pixels: (77 B + 150 G + 29 R + 128) >> 8. Blue has the larger weight on purpose.
KYFACE_EXPORT unsigned char calcGray_BGRA(const unsigned char* data, int width, int widthStride, int height,
                                          int heightStride, int rectX, int rectY, int rectW, int rectH);

/// Mean gray of R,G,B,A pixels: (77 B + 150 G + 29 R + 128) >> 8. Blue has the larger weight on purpose.
KYFACE_EXPORT unsigned char calcGray_RGBA(const unsigned char* data, int width, int widthStride, int height,
                                          int heightStride, int rectX, int rectY, int rectW, int rectH);

/// Mean CIE lightness (L* scaled to 0..255) of B,G,R,A pixels.
KYFACE_EXPORT unsigned char calcLuminance_BGRA(const unsigned char* data, int width, int widthStride, int height,
                                               int heightStride, int rectX, int rectY, int rectW, int rectH);

/// Mean CIE lightness (L* scaled to 0..255) of R,G,B,A pixels.
KYFACE_EXPORT unsigned char calcLuminance_RGBA(const unsigned char* data, int width, int widthStride, int height,
                                               int heightStride, int rectX, int rectY, int rectW, int rectH);
