// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Native methods of PlaneConversion: Java's memory as the planes and the target of `convertPlanes`.
#include <android/bitmap.h>
#include <jni.h>

#include <array>
#include <cstdint>

#include "frame/planes.h"
#include "java_declarations.h"
#include "pinned.h"

namespace {

using kyface::CriticalArray;
using kyface::PixelLayout;
using kyface::PlanarPicture;
using kyface::Plane;
using kyface::PlanesStatus;
using kyface::Target;

/// What the methods answer beside a PlanesStatus.
enum BridgeStatus : jint {
  /// Planes or output that are null, no direct buffer, or shorter than they are said to be.
  kMemory = JAVA_CONSTANT(PlaneConversion, MEMORY, 16),
  /// A bitmap without pixels, such as a recycled one.
  kNotLocked = JAVA_CONSTANT(PlaneConversion, NOT_LOCKED, 17),
  /// A bitmap of another configuration than ARGB_8888.
  kNotRgba = JAVA_CONSTANT(PlaneConversion, NOT_RGBA, 18),
  /// A bitmap smaller than the result.
  kSmall = JAVA_CONSTANT(PlaneConversion, SMALL, 19),
  kNoElements = 20,  ///< the JVM does not give an array's elements; its exception is pending
};

// Java's numbers of layouts and statuses are those of `convertPlanes`.
#define SAME_IN_JAVA(value, name) \
  static_assert(static_cast<jint>(value) == JAVA_CONSTANT(PlaneConversion, name, static_cast<jint>(value)))
SAME_IN_JAVA(PixelLayout::kRgba, RGBA);
SAME_IN_JAVA(PixelLayout::kBgra, BGRA);
SAME_IN_JAVA(PixelLayout::kRgb, RGB);
SAME_IN_JAVA(PixelLayout::kBgr, BGR);
SAME_IN_JAVA(PixelLayout::kNv21, NV21);
SAME_IN_JAVA(PixelLayout::kNv12, NV12);
SAME_IN_JAVA(PixelLayout::kGray, GRAY);
SAME_IN_JAVA(PlanesStatus::kSuccess, SUCCESS);
SAME_IN_JAVA(PlanesStatus::kPicture, PICTURE);
SAME_IN_JAVA(PlanesStatus::kLuma, LUMA);
SAME_IN_JAVA(PlanesStatus::kChroma, CHROMA);
SAME_IN_JAVA(PlanesStatus::kRectangle, RECTANGLE);
SAME_IN_JAVA(PlanesStatus::kOrientation, ORIENTATION);
SAME_IN_JAVA(PlanesStatus::kLayout, LAYOUT);
SAME_IN_JAVA(PlanesStatus::kTarget, TARGET);
SAME_IN_JAVA(PlanesStatus::kOverlap, OVERLAP);

/// The picture's numbers: width and height, four for each plane (where it begins and ends in its memory, row
/// stride, pixel stride), and a bit for each plane that is a direct buffer, Y's the lowest.
constexpr int kWidth = 0;
constexpr int kHeight = 1;
constexpr int kPlanes = JAVA_CONSTANT(PlaneConversion, PLANES, 2);
constexpr int kFrom = 0;
constexpr int kTo = 1;
constexpr int kRowStride = 2;
constexpr int kPixelStride = 3;
constexpr int kPlaneNumbers = JAVA_CONSTANT(PlaneConversion, PLANE_NUMBERS, 4);
constexpr int kDirect = JAVA_CONSTANT(PlaneConversion, DIRECT, kPlanes + 3 * kPlaneNumbers);
constexpr int kNumbers = JAVA_CONSTANT(PlaneConversion, NUMBERS, kDirect + 1);

/// Bytes of a direct buffer from `from` on and before `to`; none when the buffer has not as many.
struct Bytes {
  unsigned char* data = nullptr;
  std::int64_t size = 0;
};

Bytes directBytes(JNIEnv* env, jobject buffer, jint from, jint to) {
  if (buffer == nullptr || from < 0 || from > to || to > env->GetDirectBufferCapacity(buffer)) {
    return {};
  }
  auto* const data = static_cast<unsigned char*>(env->GetDirectBufferAddress(buffer));
  return data == nullptr ? Bytes{} : Bytes{data + from, std::int64_t{to} - from};
}

/// The planes of a picture in Java's memory.
class JavaPlanes {
 public:
  /// Looks the planes up; false when one is not as long as it is said to be.
  bool find(JNIEnv* env, jobject y, jobject u, jobject v, jintArray numbers) {
    if (numbers == nullptr || env->GetArrayLength(numbers) < kNumbers) {
      return false;
    }
    std::array<jint, kNumbers> n = {};
    env->GetIntArrayRegion(numbers, 0, kNumbers, n.data());
    picture_.width = n[kWidth];
    picture_.height = n[kHeight];
    const std::array<jobject, 3> memory = {y, u, v};
    for (int i = 0; i < 3; ++i) {
      const jint* const ofPlane = &n[kPlanes + i * kPlaneNumbers];
      if (!find(env, i, memory[i], (n[kDirect] >> i & 1) != 0, ofPlane[kFrom], ofPlane[kTo])) {
        return false;
      }
      plane(i).rowStride = ofPlane[kRowStride];
      plane(i).pixelStride = ofPlane[kPixelStride];
    }
    // Planes in one array are borrowed once: each borrow may be of a copy, and views of the same pairs would
    // not be known for that.
    for (int i = 1; i < 3; ++i) {
      for (int before = 0; before < i; ++before) {
        if (arrays_[i] != nullptr && arrays_[before] != nullptr &&
            env->IsSameObject(arrays_[i], arrays_[before]) != JNI_FALSE) {
          arrays_[i] = arrays_[before];
        }
      }
    }
    return true;
  }

  /// Whether one of the planes is in `array`.
  bool areIn(JNIEnv* env, jarray array) const {
    for (jarray ofPlane : arrays_) {
      if (ofPlane != nullptr && env->IsSameObject(ofPlane, array) != JNI_FALSE) {
        return true;
      }
    }
    return false;
  }

  /// Calls `use` with the picture, for which it borrows the arrays that hold planes: until it is done no
  /// other function of the JVM may be called. Its result, or kNoElements.
  template <typename Use>
  jint withPicture(JNIEnv* env, const Use& use) {
    CriticalArray y(env, arrays_[0], JNI_ABORT);
    CriticalArray u(env, arrays_[1] == arrays_[0] ? nullptr : arrays_[1], JNI_ABORT);
    const bool vIsBorrowed = arrays_[2] == arrays_[0] || arrays_[2] == arrays_[1];
    CriticalArray v(env, vIsBorrowed ? nullptr : arrays_[2], JNI_ABORT);
    if (y.refused() || u.refused() || v.refused()) {
      return kNoElements;
    }
    const auto borrowed = [&](jarray array) {
      return array == arrays_[0] ? y.bytes() : array == arrays_[1] ? u.bytes() : v.bytes();
    };
    for (int i = 0; i < 3; ++i) {
      if (arrays_[i] != nullptr) {
        plane(i).data = borrowed(arrays_[i]) + from_[i];
      }
    }
    return use(picture_);
  }

 private:
  bool find(JNIEnv* env, int index, jobject memory, bool direct, jint from, jint to) {
    if (direct) {
      const Bytes bytes = directBytes(env, memory, from, to);
      plane(index).data = bytes.data;
      plane(index).size = bytes.size;
      return bytes.data != nullptr;
    }
    arrays_[index] = static_cast<jarray>(memory);
    from_[index] = from;
    plane(index).size = std::int64_t{to} - from;
    return memory != nullptr && from >= 0 && from <= to && to <= env->GetArrayLength(arrays_[index]);
  }

  Plane& plane(int index) { return index == 0 ? picture_.y : index == 1 ? picture_.u : picture_.v; }

  PlanarPicture picture_;
  std::array<jarray, 3> arrays_ = {};
  std::array<jint, 3> from_ = {};
};

/// What is made of a picture.
struct View {
  kyface::Rectangle part;
  kyface::Orientation orientation;
};

View viewOf(jint left, jint top, jint width, jint height, jint degrees, jboolean mirrored) {
  return {{left, top, width, height}, {degrees, mirrored != JNI_FALSE}};
}

jint convert(const PlanarPicture& picture, const View& view, const Target& target) {
  return static_cast<jint>(kyface::convertPlanes(picture, view.part, view.orientation, target));
}

/// Into the elements of an array, of `element` bytes each.
jint convertToArray(JNIEnv* env, JavaPlanes& planes, const View& view, jint layout, jarray out, jint from,
                    jint stride, int element) {
  if (out == nullptr || from < 0 || from > env->GetArrayLength(out)) {
    return kMemory;
  }
  if (planes.areIn(env, out)) {
    return static_cast<jint>(PlanesStatus::kOverlap);
  }
  const std::int64_t size = (std::int64_t{env->GetArrayLength(out)} - from) * element;
  return planes.withPicture(env, [&](const PlanarPicture& picture) {
    CriticalArray elements(env, out, 0);
    if (elements.refused()) {
      return jint{kNoElements};
    }
    return convert(picture, view,
                   {elements.bytes() + std::int64_t{from} * element, size, std::int64_t{stride} * element,
                    PixelLayout{layout}});
  });
}

}  // namespace

/// A native method; all begin with the planes and what is made of them.
#define PLANE_CONVERSION(method, ...)                                                                        \
  JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_PlaneConversion_##method(                                  \
      JNIEnv* env, jclass /*type*/, jobject y, jobject u, jobject v, jintArray numbers, jint left, jint top, \
      jint width, jint height, jint degrees, jboolean mirrored, __VA_ARGS__)

extern "C" {

PLANE_CONVERSION(toBytes, jint layout, jbyteArray out, jint from, jint stride) {
  JavaPlanes planes;
  if (!planes.find(env, y, u, v, numbers)) {
    return kMemory;
  }
  return convertToArray(env, planes, viewOf(left, top, width, height, degrees, mirrored), layout, out, from,
                        stride, sizeof(jbyte));
}

PLANE_CONVERSION(toInts, jint layout, jintArray out, jint from, jint stride) {
  JavaPlanes planes;
  if (!planes.find(env, y, u, v, numbers)) {
    return kMemory;
  }
  return convertToArray(env, planes, viewOf(left, top, width, height, degrees, mirrored), layout, out, from,
                        stride, sizeof(jint));
}

PLANE_CONVERSION(toBuffer, jint layout, jobject out, jint from, jint to, jint stride) {
  JavaPlanes planes;
  if (!planes.find(env, y, u, v, numbers)) {
    return kMemory;
  }
  const Bytes bytes = directBytes(env, out, from, to);
  if (bytes.data == nullptr) {
    return kMemory;
  }
  return planes.withPicture(env, [&](const PlanarPicture& picture) {
    return convert(picture, viewOf(left, top, width, height, degrees, mirrored),
                   {bytes.data, bytes.size, stride, PixelLayout{layout}});
  });
}

PLANE_CONVERSION(toBitmap, jobject bitmap) {
  JavaPlanes planes;
  if (bitmap == nullptr || !planes.find(env, y, u, v, numbers)) {
    return kMemory;
  }
  AndroidBitmapInfo info = {};
  if (AndroidBitmap_getInfo(env, bitmap, &info) != ANDROID_BITMAP_RESULT_SUCCESS) {
    return kNotLocked;
  }
  if (info.format != ANDROID_BITMAP_FORMAT_RGBA_8888) {
    return kNotRgba;
  }
  const View view = viewOf(left, top, width, height, degrees, mirrored);
  const kyface::Size size = kyface::sizeOfView(view.part, view.orientation);
  if (size.width > static_cast<std::int64_t>(info.width) ||
      size.height > static_cast<std::int64_t>(info.height)) {
    return kSmall;
  }
  void* pixels = nullptr;
  if (AndroidBitmap_lockPixels(env, bitmap, &pixels) != ANDROID_BITMAP_RESULT_SUCCESS) {
    return kNotLocked;
  }
  const std::int64_t bytes = pixels == nullptr ? 0 : std::int64_t{info.stride} * info.height;
  const jint status = planes.withPicture(env, [&](const PlanarPicture& picture) {
    return convert(picture, view,
                   {static_cast<unsigned char*>(pixels), bytes, info.stride, PixelLayout::kRgba});
  });
  AndroidBitmap_unlockPixels(env, bitmap);
  return status;
}

}  // extern "C"
