/// The opaque values by which callers name the engine's objects.
#pragma once

#include <memory>
#include <mutex>
#include <unordered_map>
#include <utility>

#include "guard.h"

namespace kyengine {

/// All objects of type `T` that callers hold. A value that names none is refused without looking at what it
/// points to, and an object that is destroyed during a call on another thread lives until that call is over.
template <typename T>
class Handles {
 public:
  /// Takes an object in and returns its handle, which is never null.
  static void* Add(std::shared_ptr<T> object) {
    void* const handle = object.get();
    Table& table = Get();
    const std::lock_guard lock(table.mutex);
    table.objects.emplace(handle, std::move(object));
    return handle;
  }

  /// Makes an object and stores its handle in `*handle`; null there and a result code on failure.
  template <typename... Arguments>
  static int Create(void** handle, const Arguments&... arguments) noexcept {
    return Guarded([&] {
      Require(handle != nullptr, KY_ERROR_NULL_POINTER);
      *handle = nullptr;
      *handle = Add(std::make_shared<T>(arguments...));
    });
  }

  /// Throws Failure{code} when `handle` names no object.
  static std::shared_ptr<T> Find(void* handle, ky_result_t code = KY_ERROR_HANDLE) {
    Table& table = Get();
    const std::lock_guard lock(table.mutex);
    const auto found = table.objects.find(handle);
    Require(found != table.objects.end(), code);
    return found->second;
  }

  /// Forgets the object that `handle` names, if any.
  static void Destroy(void* handle) noexcept {
    Guarded([&] {
      Table& table = Get();
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
  static Table& Get() {
    static auto& table = *new Table;
    return table;
  }
};

}  // namespace kyengine
