// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Memory that is only taken where it is touched, for images that are larger than any test may be.
#pragma once

#include <sys/mman.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstddef>
#include <cstdlib>

namespace kyface::test {

/// `bytes` of zeros, or of nothing that may be touched.
class SparseMemory {
 public:
  explicit SparseMemory(size_t bytes, int protection = PROT_READ | PROT_WRITE)
      : bytes_(bytes),
        memory_(mmap(nullptr, bytes, protection, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0)) {
    if (memory_ == MAP_FAILED) {
      abort();
    }
  }
  ~SparseMemory() { munmap(memory_, bytes_); }
  SparseMemory(const SparseMemory&) = delete;
  SparseMemory& operator=(const SparseMemory&) = delete;

  template <typename T>
  T* as() const {
    return static_cast<T*>(memory_);
  }

 private:
  size_t bytes_;
  void* memory_;
};

/// `blocks` blocks of `block` bytes, a whole number of pages of any size, of which all but the last are the
/// same memory.
class RepeatedMemory {
 public:
  RepeatedMemory(size_t blocks, size_t block)
      : memory_(blocks * block, PROT_NONE), size_(blocks * block), file_(file(2 * block)) {
    for (size_t at = 0; at + block < size_; at += block) {
      map(at, block, 0);
    }
    map(size_ - block, block, block);
    close(file_);
  }

  template <typename T>
  T* as() const {
    return memory_.as<T>();
  }

 private:
  static int file(size_t bytes) {
    // Android's C library has no function for it at the level that is built for.
    const int file = static_cast<int>(syscall(SYS_memfd_create, "repeated", 0));
    if (file < 0 || ftruncate(file, static_cast<off_t>(bytes)) != 0) {
      abort();
    }
    return file;
  }
  void map(size_t at, size_t block, size_t offset) {
    if (mmap(memory_.as<char>() + at, block, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_FIXED, file_,
             static_cast<off_t>(offset)) == MAP_FAILED) {
      abort();
    }
  }

  SparseMemory memory_;
  size_t size_;
  int file_;
};

/// Short rows so far apart that the second is more than 2^30, the third more than 2^31 elements behind the
/// first. They end flush with a page; between that and the last page before the next row's end nothing may be
/// touched.
template <typename T>
class DistantRows {
 public:
  /// From row to row, in elements; a whole number of pages of any size.
  static constexpr int kStride = 0x50000000;

  explicit DistantRows(int rows)
      : memory_(static_cast<size_t>(rows) * kStride * sizeof(T), PROT_NONE),
        capacity_(static_cast<size_t>(sysconf(_SC_PAGESIZE)) / sizeof(T)) {
    for (int r = 0; r < rows; ++r) {
      if (mprotect(end(r) - capacity_, capacity_ * sizeof(T), PROT_READ | PROT_WRITE) != 0) {
        abort();
      }
    }
  }

  /// The last `elements` of row `r`: with r = 0 the first pixel of an image whose rows are that long.
  T* row(int r, int elements) const {
    if (static_cast<size_t>(elements) > capacity_) {
      abort();
    }
    return end(r) - elements;
  }

  /// Where the memory begins, a stride before the end of row 0.
  T* begin() const { return memory_.as<T>(); }

 private:
  T* end(int r) const { return begin() + (static_cast<ptrdiff_t>(r) + 1) * kStride; }

  SparseMemory memory_;
  size_t capacity_;
};

}  // namespace kyface::test
