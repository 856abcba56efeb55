// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The opaque values by which callers name the engine's objects.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <unordered_map>
#include <utility>

#include "guard.h"

namespace kyengine {

/// A value that no handle of any kind has had before: a count, so that the handle of what has been destroyed
/// never comes to name something newer. Its 64 bits do not run out.
inline void* newHandle() noexcept {
  static_assert(sizeof(uintptr_t) == 8);
  static std::atomic<uintptr_t> last = 0;
  return reinterpret_cast<void*>(++last);  // NOLINT(performance-no-int-to-ptr): callers hold pointers
}

/// All objects of type `T` that callers hold. A value that names none is refused, and an object that is
/// destroyed during a call on another thread lives until that call is over.
template <typename T>
class Handles {
 public:
  /// Takes an object in and returns its handle, which is never null.
  static void* add(std::shared_ptr<T> object) {
    void* const handle = newHandle();
    Table& table = get();
    const std::lock_guard lock(table.mutex);
    table.objects.emplace(handle, std::move(object));
    return handle;
  }

  /// Makes an object and stores its handle in `*handle`; null there and a result code on failure.
  template <typename... Arguments>
  static int create(void** handle, const Arguments&... arguments) noexcept {
    return guarded([&] {
      require(handle != nullptr, KY_ERROR_NULL_POINTER);
      *handle = nullptr;
      *handle = add(std::make_shared<T>(arguments...));
    });
  }

  /// Throws Failure{code} when `handle` names no object.
  static std::shared_ptr<T> find(void* handle, ky_result_t code = KY_ERROR_HANDLE) {
    Table& table = get();
    const std::lock_guard lock(table.mutex);
    const auto found = table.objects.find(handle);
    require(found != table.objects.end(), code);
    return found->second;
  }

  /// Forgets the object that `handle` names, if any.
  static void destroy(void* handle) noexcept {
    guarded([&] {
      Table& table = get();
      std::shared_ptr<T> last;  // outlives the lock, as taking an object down takes time
      const std::lock_guard lock(table.mutex);
      if (const auto found = table.objects.find(handle); found != table.objects.end()) {
        last = std::move(found->second);
        table.objects.erase(found);
      }
    });
  }

 private:
  struct Table {
    std::mutex mutex;
    std::unordered_map<void*, std::shared_ptr<T>> objects;
  };

  /// The one table of this type. It is never destroyed: threads may call until the process is gone.
  static Table& get() {
    static auto& table = *new Table;
    return table;
  }
};

}  // namespace kyengine
