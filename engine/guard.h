/// The border between the engine and its C callers.
#pragma once

#include <cstdlib>
#include <cstring>
#include <new>
#include <vector>

#include "c_interface.h"
#include "failure.h"

namespace kyengine {

/// Runs `work` and turns how it ends into a result code: no exception passes.
template <typename Work>
int Guarded(Work work) noexcept {
  try {
    work();
    return KY_SUCCESS;
  } catch (const Failure& failure) {
    return failure.code;
  } catch (const std::bad_alloc&) {
    return KY_ERROR_MEMORY;
  } catch (...) {
    return KY_ERROR_INTERNAL;
  }
}

/// Hands an array of faces to the caller, who gives it back with `ReleaseFaces`. No faces are a null array.
inline void HandOver(const std::vector<ky_face_t>& records, ky_face_t** faces, int* count) {
  if (records.empty()) {
    return;
  }
  const size_t size = records.size() * sizeof(ky_face_t);
  void* const copy = std::malloc(size);
  Require(copy != nullptr, KY_ERROR_MEMORY);
  std::memcpy(copy, records.data(), size);
  *faces = static_cast<ky_face_t*>(copy);
  *count = static_cast<int>(records.size());
}

inline void ReleaseFaces(ky_face_t* faces) { std::free(faces); }

}  // namespace kyengine
