// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// What libyuv has of the operations. Its conversions of limited range and its 8-bit approximations stand for
// ours: they move the same bytes and are what camera code calls today.

#include <libyuv.h>

#include "operation.h"

namespace bench {
namespace {

// A call's buffers: packed rows, chroma directly behind the luma.
struct Frame {
  int width;
  int height;
  unsigned char* in;
  unsigned char* out;

  size_t luma() const { return static_cast<size_t>(width) * static_cast<size_t>(height); }
};

void add(std::vector<Operation>& operations, const char* name, double inBytes, double outBytes,
         void (*call)(const Frame&)) {
  operations.push_back({name, "libyuv", inBytes + outBytes, [=](Size size) {
                          const double pixels = static_cast<double>(size.pixels());
                          // With a margin, for crops.
                          const double whole = static_cast<double>(croppedFrom(size).pixels());
                          const auto in = samples<unsigned char>(static_cast<size_t>(whole * inBytes));
                          const auto out = samples<unsigned char>(static_cast<size_t>(pixels * outBytes));
                          return [=] { call({size.width, size.height, in.get(), out.get()}); };
                        }});
}

template <auto function, int nc>
void fromSemiPlanar(const Frame& f) {
  function(f.in, f.width, f.in + f.luma(), f.width, f.out, f.width * nc, f.width, f.height);
}

template <auto function, int nc>
void toSemiPlanar(const Frame& f) {
  function(f.in, f.width * nc, f.out, f.width, f.out + f.luma(), f.width, f.width, f.height);
}

template <auto function, int nc>
void fromPlanar(const Frame& f) {
  const int half = f.width / 2;
  function(f.in, f.width, f.in + f.luma(), half, f.in + f.luma() + f.luma() / 4, half, f.out, f.width * nc,
           f.width, f.height);
}

template <auto function, int nc>
void toPlanar(const Frame& f) {
  const int half = f.width / 2;
  function(f.in, f.width * nc, f.out, f.width, f.out + f.luma(), half, f.out + f.luma() + f.luma() / 4, half,
           f.width, f.height);
}

template <auto function, int ncSrc, int ncDst>
void packed(const Frame& f) {
  function(f.in, f.width * ncSrc, f.out, f.width * ncDst, f.width, f.height);
}

template <libyuv::RotationMode mode>
constexpr bool kUpright = mode == libyuv::kRotate0 || mode == libyuv::kRotate180;

template <auto function, libyuv::RotationMode mode, int nc>
void rotated(const Frame& f) {
  function(f.in, f.width * nc, f.out, (kUpright<mode> ? f.width : f.height) * nc, f.width, f.height, mode);
}

template <libyuv::RotationMode mode>
void rotatedPlanar(const Frame& f) {
  const int outWidth = kUpright<mode> ? f.width : f.height;
  const auto chroma = [&](unsigned char* base) { return base + f.luma(); };
  libyuv::I420Rotate(f.in, f.width, chroma(f.in), f.width / 2, chroma(f.in) + f.luma() / 4, f.width / 2,
                     f.out, outWidth, chroma(f.out), outWidth / 2, chroma(f.out) + f.luma() / 4, outWidth / 2,
                     f.width, f.height, mode);
}

// A frame of chroma pairs turned by 180 degrees: mirrored, from the last row to the first.
void rotated180SemiPlanar(const Frame& f) {
  libyuv::NV12Mirror(f.in, f.width, f.in + f.luma(), f.width, f.out, f.width, f.out + f.luma(), f.width,
                     f.width, -f.height);
}

template <int nc>
void cropped(const Frame& f) {
  const int stride = croppedFrom({f.width, f.height}).width * nc;
  libyuv::CopyPlane(f.in + kCropMargin * (stride + nc), stride, f.out, f.width * nc, f.width * nc, f.height);
}

void copied(const Frame& f) { libyuv::CopyPlane(f.in, f.width, f.out, f.width, f.width, f.height); }

/// A camera's planes converted, then turned, with rows of their own between the two. `mode` 0 converts alone.
void addPlanes(std::vector<Operation>& operations, bool pairs, libyuv::RotationMode mode, bool mirrored) {
  std::string name = pairs ? "pairs-to-RGBA" : "planes-to-RGBA";
  if (mode != libyuv::kRotate0) {
    name.append("-").append(std::to_string(static_cast<int>(mode)));
  }
  name.append(mirrored ? "-mirrored" : "");
  operations.push_back({name, "libyuv", 1.5 + 4, [=](Size size) {
                          const int padding = 64;
                          const int stride = size.width + padding;
                          const int chromaStride = (pairs ? size.width : size.width / 2) + padding;
                          const auto bytes = [](int rows, int row) {
                            return static_cast<size_t>(rows) * static_cast<size_t>(row);
                          };
                          const auto luma = samples<unsigned char>(bytes(size.height, stride));
                          const size_t plane = bytes(size.height / 2, chromaStride);
                          const auto chroma = samples<unsigned char>(2 * plane);
                          const auto upright = samples<unsigned char>(size.pixels() * 4);
                          const auto out = samples<unsigned char>(size.pixels() * 4);
                          const bool direct = mode == libyuv::kRotate0 && !mirrored;
                          const Size turned = direct ? size : rotatedBy(mode == 0 ? 180 : mode, size);
                          return [=] {
                            libyuv::Android420ToABGR(luma.get(), stride, chroma.get() + (pairs ? 1 : plane),
                                                     chromaStride, chroma.get(), chromaStride, pairs ? 2 : 1,
                                                     (direct ? out : upright).get(), size.width * 4,
                                                     size.width, size.height);
                            if (mirrored) {
                              libyuv::ARGBMirror(upright.get(), size.width * 4, out.get(), size.width * 4,
                                                 size.width, size.height);
                            } else if (!direct) {
                              libyuv::ARGBRotate(upright.get(), size.width * 4, out.get(), turned.width * 4,
                                                 size.width, size.height, mode);
                            }
                          };
                        }});
}

}  // namespace

void addLibyuv(std::vector<Operation>& operations) {
  using namespace libyuv;
  const auto conversion = [&](const char* name, double inBytes, double outBytes, void (*call)(const Frame&)) {
    add(operations, name, inBytes, outBytes, call);
  };
  // libyuv names a pixel's bytes from the last to the first: its ARGB is BGRA here, its RAW is RGB.
  conversion("NV21-to-BGR", 1.5, 3, fromSemiPlanar<NV21ToRGB24, 3>);
  conversion("NV21-to-BGRA", 1.5, 4, fromSemiPlanar<NV21ToARGB, 4>);
  conversion("NV21-to-RGB", 1.5, 3, fromSemiPlanar<NV21ToRAW, 3>);
  conversion("NV21-to-RGBA", 1.5, 4, fromSemiPlanar<NV21ToABGR, 4>);
  conversion("NV12-to-BGR", 1.5, 3, fromSemiPlanar<NV12ToRGB24, 3>);
  conversion("NV12-to-BGRA", 1.5, 4, fromSemiPlanar<NV12ToARGB, 4>);
  conversion("NV12-to-RGB", 1.5, 3, fromSemiPlanar<NV12ToRAW, 3>);
  conversion("NV12-to-RGBA", 1.5, 4, fromSemiPlanar<NV12ToABGR, 4>);
  conversion("BGRA-to-NV21", 4, 1.5, toSemiPlanar<ARGBToNV21, 4>);
  conversion("RGBA-to-NV21", 4, 1.5, toSemiPlanar<ABGRToNV21, 4>);
  conversion("BGRA-to-NV12", 4, 1.5, toSemiPlanar<ARGBToNV12, 4>);
  conversion("RGBA-to-NV12", 4, 1.5, toSemiPlanar<ABGRToNV12, 4>);
  // Of three channels it has only RGB to NV21; another order of bytes would cost as much.
  for (const char* name : {"BGR-to-NV21", "RGB-to-NV21", "BGR-to-NV12", "RGB-to-NV12"}) {
    conversion(name, 3, 1.5, toSemiPlanar<RAWToJNV21, 3>);
  }
  conversion("I420-to-BGR", 1.5, 3, fromPlanar<I420ToRGB24, 3>);
  conversion("I420-to-BGRA", 1.5, 4, fromPlanar<I420ToARGB, 4>);
  conversion("BGR-to-I420", 3, 1.5, toPlanar<RGB24ToI420, 3>);
  conversion("BGRA-to-I420", 4, 1.5, toPlanar<ARGBToI420, 4>);
  conversion("YUV-to-GRAY", 1, 1, copied);

  conversion("BGR-to-RGB", 3, 3, packed<RAWToRGB24, 3, 3>);
  conversion("BGR-to-BGRA", 3, 4, packed<RGB24ToARGB, 3, 4>);
  conversion("BGR-to-RGBA", 3, 4, packed<RAWToARGB, 3, 4>);
  conversion("BGRA-to-BGR", 4, 3, packed<ARGBToRGB24, 4, 3>);
  conversion("BGRA-to-RGB", 4, 3, packed<ARGBToRAW, 4, 3>);
  conversion("BGRA-to-RGBA", 4, 4, packed<ARGBToABGR, 4, 4>);
  conversion("BGR-to-GRAY", 3, 1, packed<RGB24ToJ400, 3, 1>);
  conversion("BGRA-to-GRAY", 4, 1, packed<ARGBToJ400, 4, 1>);
  conversion("GRAY-to-BGRA", 1, 4, packed<J400ToARGB, 1, 4>);

  conversion("rotate90-u8x1", 1, 1, rotated<RotatePlane, kRotate90, 1>);
  conversion("rotate180-u8x1", 1, 1, rotated<RotatePlane, kRotate180, 1>);
  conversion("rotate270-u8x1", 1, 1, rotated<RotatePlane, kRotate270, 1>);
  conversion("rotate90-u8x4", 4, 4, rotated<ARGBRotate, kRotate90, 4>);
  conversion("rotate180-u8x4", 4, 4, rotated<ARGBRotate, kRotate180, 4>);
  conversion("rotate270-u8x4", 4, 4, rotated<ARGBRotate, kRotate270, 4>);
  conversion("rotate90-I420", 1.5, 1.5, rotatedPlanar<kRotate90>);
  conversion("rotate180-I420", 1.5, 1.5, rotatedPlanar<kRotate180>);
  conversion("rotate270-I420", 1.5, 1.5, rotatedPlanar<kRotate270>);
  conversion("rotate180-NV21", 1.5, 1.5, rotated180SemiPlanar);
  conversion("crop-u8x1", 1, 1, cropped<1>);
  conversion("crop-u8x3", 3, 3, cropped<3>);
  conversion("crop-u8x4", 4, 4, cropped<4>);
  for (const bool pairs : {true, false}) {
    for (const RotationMode mode : {kRotate0, kRotate90, kRotate180, kRotate270}) {
      addPlanes(operations, pairs, mode, false);
    }
    addPlanes(operations, pairs, kRotate0, true);
  }
}

}  // namespace bench
