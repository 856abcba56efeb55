// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Images for kernel tests: rows with padding that must stay untouched, ending flush with a protected page.
#pragma once

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <random>
#include <vector>

namespace kyface::test {

/// `rows` rows of `rowElements` elements of `T`, `stride` elements apart. The last row's last element is the
/// last one before a protected page (the padding behind the last row does not exist), and the first is
/// preceded by one where the image fills its pages: an access outside faults. `slack` elements behind the
/// last row are accessible, for kernels that are documented to reach there.
template <typename T>
class GuardedImage {
 public:
  GuardedImage(int rows, int rowElements, int stride, int slack = 0)
      : rows_(rows), rowElements_(rowElements), stride_(stride) {
    size_ = rows < 1 ? 0
                     : static_cast<size_t>(rows - 1) * static_cast<size_t>(stride) +
                           static_cast<size_t>(rowElements);
    const size_t page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
    const size_t bytes = (size_ + static_cast<size_t>(slack)) * sizeof(T);
    const size_t usable = (bytes + page - 1) / page * page;
    mapped_ = usable + 2 * page;
    void* mapping = mmap(nullptr, mapped_, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (mapping == MAP_FAILED ||
        (usable > 0 && mprotect(static_cast<char*>(mapping) + page, usable, PROT_READ | PROT_WRITE) != 0)) {
      abort();
    }
    base_ = static_cast<char*>(mapping);
    data_ = reinterpret_cast<T*>(base_ + page + usable - bytes);
    for (size_t i = 0; i < size_; ++i) {
      data_[i] = padding(i);
    }
  }
  ~GuardedImage() { munmap(base_, mapped_); }
  GuardedImage(const GuardedImage&) = delete;
  GuardedImage& operator=(const GuardedImage&) = delete;

  T* data() { return data_; }
  const T* data() const { return data_; }
  int stride() const { return stride_; }
  int rows() const { return rows_; }
  int rowElements() const { return rowElements_; }
  T* row(int r) { return data_ + static_cast<ptrdiff_t>(r) * stride_; }
  const T* row(int r) const { return data_ + static_cast<ptrdiff_t>(r) * stride_; }

  /// Fills the rows, not the padding, from `next()`.
  template <typename Next>
  void fill(Next next) {
    for (int r = 0; r < rows_; ++r) {
      for (int i = 0; i < rowElements_; ++i) {
        row(r)[i] = next();
      }
    }
  }

  /// The value that element `i` of the buffer has before anything is written: a pattern without a short
  /// period.
  static T padding(size_t i) { return static_cast<T>((i * 2654435761u >> 7) & 0xff); }

  /// Whether the image is, bit for bit, `expected` in the rows and untouched between them.
  ::testing::AssertionResult holds(const std::vector<T>& expected) const {
    size_t next = 0;
    for (int r = 0; r < rows_; ++r) {
      for (int i = 0; i < (r + 1 < rows_ ? stride_ : rowElements_); ++i) {
        const size_t at = static_cast<size_t>(r) * static_cast<size_t>(stride_) + static_cast<size_t>(i);
        const T want = i < rowElements_ ? expected[next++] : padding(at);
        // NOLINTNEXTLINE(bugprone-suspicious-memory-comparison,cert-exp42-c,cert-flp37-c): bit for bit
        if (memcmp(&want, &data_[at], sizeof(T)) != 0) {
          return ::testing::AssertionFailure()
                 << (i < rowElements_ ? "row " : "padding of row ") << r << ", element " << i << ": "
                 << +data_[at] << ", expected " << +want;
        }
      }
    }
    return ::testing::AssertionSuccess();
  }

  /// The rows' contents, without padding: what `holds` compares with.
  std::vector<T> contents() const {
    std::vector<T> all;
    for (int r = 0; r < rows_; ++r) {
      all.insert(all.end(), row(r), row(r) + rowElements_);
    }
    return all;
  }

 private:
  int rows_;
  int rowElements_;
  int stride_;
  size_t size_ = 0;
  size_t mapped_ = 0;
  char* base_ = nullptr;
  T* data_ = nullptr;
};

/// Random bytes with every extreme likely: a third are 0, 255 or next to them.
class ByteSource {
 public:
  explicit ByteSource(unsigned seed) : engine_(seed) {}
  unsigned char operator()() {
    static constexpr unsigned char kEdges[] = {0, 255, 1, 254, 127, 128, 16, 235};
    const uint32_t bits = static_cast<uint32_t>(engine_());
    return (bits >> 8) % 3 == 0 ? kEdges[bits & 7] : static_cast<unsigned char>(bits);
  }

 private:
  std::minstd_rand engine_;
};

}  // namespace kyface::test
