// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the C operations that search a frame for faces have in common.
#pragma once

#include <cstdlib>
#include <cstring>
#include <vector>

#include "frame.h"
#include "handles.h"

namespace kyengine {

/// Runs `search` of the object that `handle` names on a frame and hands its faces over as an array that
/// `releaseFaces` frees. No faces, and a failure, are a null array.
template <typename T>
int search(std::vector<ky_face_t> (T::*search)(const Frame&), ky_handle_t handle, const unsigned char* image,
           int pixelFormat, int width, int height, int stride, int orientation, ky_face_t** faces,
           int* count) noexcept {
  return guarded([&] {
    require(faces != nullptr && count != nullptr, KY_ERROR_NULL_POINTER);
    *faces = nullptr;
    *count = 0;
    const auto object = Handles<T>::find(handle);
    const Frame frame(image, pixelFormat, width, height, stride, orientation);
    const std::vector<ky_face_t> found = (*object.*search)(frame);
    if (found.empty()) {
      return;
    }
    const size_t size = found.size() * sizeof(ky_face_t);
    void* const copy = std::malloc(size);
    require(copy != nullptr, KY_ERROR_MEMORY);
    std::memcpy(copy, found.data(), size);
    *faces = static_cast<ky_face_t*>(copy);
    *count = static_cast<int>(found.size());
  });
}

inline void releaseFaces(ky_face_t* faces) { std::free(faces); }

}  // namespace kyengine
