/// The opaque values by which callers name the engine's objects.
#pragma once

#include <memory>
#include <mutex>
#include <unordered_map>
#include <utility>

#include "failure.h"

namespace kyengine {

/// All objects of one kind that callers hold. A value that is not in the table is refused without looking at
/// what it points to, and an object that is destroyed during a call on another thread lives until that call
/// is over.
template <typename T>
class HandleTable {
 public:
  /// The process's table of this kind. It is never destroyed: threads may call until the process is gone.
  static HandleTable& Get() {
    static auto& table = *new HandleTable;
    return table;
  }

  /// Takes an object in and returns its handle, which is never null.
  void* Add(std::shared_ptr<T> object) {
    void* const handle = object.get();
    const std::lock_guard lock(mutex_);
    objects_.emplace(handle, std::move(object));
    return handle;
  }

  /// Throws Failure{code} when there is no such object.
  std::shared_ptr<T> Find(void* handle, ky_result_t code) const {
    const std::lock_guard lock(mutex_);
    const auto found = objects_.find(handle);
    Require(found != objects_.end(), code);
    return found->second;
  }

  /// Forgets the object, if there is one.
  void Remove(void* handle) {
    std::shared_ptr<T> last;  // outlives the lock, as taking an object down takes time
    const std::lock_guard lock(mutex_);
    if (const auto found = objects_.find(handle); found != objects_.end()) {
      last = std::move(found->second);
      objects_.erase(found);
    }
  }

 private:
  mutable std::mutex mutex_;
  std::unordered_map<void*, std::shared_ptr<T>> objects_;
};

}  // namespace kyengine
