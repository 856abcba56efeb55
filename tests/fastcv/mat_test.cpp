// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The image matrix: layout, views, ownership.

#include <gtest/gtest.h>
#include <malloc.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <type_traits>
#include <utility>

// What a matrix frees is noted: whether an allocator gives memory back at once is its own affair.
namespace {
const void* freed;
void noteAndFree(void* memory) {
  freed = memory;
  free(memory);
}
}  // namespace
#define free noteAndFree
#include "fastcv/fastcv.h"
#undef free

namespace {

using HPC::fastcv::ECO_ENV_ARM;
using HPC::fastcv::Mat;
using HPC::fastcv::Point2_;

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

size_t allocatedAlignment, allocatedSize;

}  // namespace

// Stands in for the C library's, to see what is asked for.
extern "C" void* memalign(size_t alignment, size_t size) noexcept(noexcept(memalign(64, 64))) {
  allocatedAlignment = alignment;
  allocatedSize = size;
  void* memory = nullptr;
  return posix_memalign(&memory, alignment, size) == 0 ? memory : nullptr;
}

namespace {

template <typename M>
class MatLayout : public testing::Test {};
using AllMats = testing::Types<Image<unsigned char, 1>, Image<unsigned char, 3>, Image<unsigned char, 4>,
                               Image<float, 1>, Image<float, 3>, Image<float, 4>>;
TYPED_TEST_SUITE(MatLayout, AllMats);

TYPED_TEST(MatLayout, FieldsInOrder) {
  using M = TypeParam;
  static_assert(std::is_standard_layout_v<M>);
  static_assert(std::is_same_v<decltype(M::dims), int32_t> && offsetof(M, dims) == 0);
  static_assert(std::is_same_v<decltype(M::width), int32_t> && offsetof(M, width) == 4);
  static_assert(std::is_same_v<decltype(M::height), int32_t> && offsetof(M, height) == 8);
  static_assert(std::is_same_v<decltype(M::step), int64_t> && offsetof(M, step) == 16);
  static_assert(std::is_same_v<decltype(M::total), int64_t> && offsetof(M, total) == 24);
  static_assert(std::is_same_v<decltype(M::byteSize), int64_t> && offsetof(M, byteSize) == 32);
  static_assert(std::is_pointer_v<decltype(M::data)> && offsetof(M, data) == 40);
  static_assert(std::is_same_v<decltype(M::ownsData), bool> && offsetof(M, ownsData) == 48);
  static_assert(sizeof(M) == 56 && sizeof(bool) == 1);
  static_assert(!std::is_copy_constructible_v<M> && !std::is_copy_assignable_v<M>);
  static_assert(std::is_nothrow_move_constructible_v<M> && std::is_nothrow_move_assignable_v<M>);
}

TYPED_TEST(MatLayout, EmptyByDefault) {
  const TypeParam mat;
  EXPECT_EQ(mat.dims, 0);
  EXPECT_EQ(mat.width, 0);
  EXPECT_EQ(mat.height, 0);
  EXPECT_EQ(mat.step, 0);
  EXPECT_EQ(mat.total, 0);
  EXPECT_EQ(mat.byteSize, 0);
  EXPECT_EQ(mat.data, nullptr);
  EXPECT_FALSE(mat.ownsData);
}

TEST(Mat, PointIsColumnThenRow) {
  static_assert(offsetof(Point2_<int>, x) == 0 && offsetof(Point2_<int>, y) == 4 &&
                sizeof(Point2_<int>) == 8);
  const Point2_<int> point = {3, 4};
  EXPECT_EQ(point.x, 3);
  EXPECT_EQ(point.y, 4);
}

TEST(Mat, ViewIsPackedAndOwnsNothing) {
  float pixels[5 * 7 * 3] = {};  // freeing these would end the process
  {
    const Image<float, 3> view(7, 5, pixels);
    EXPECT_EQ(view.dims, 2);
    EXPECT_EQ(view.width, 7);
    EXPECT_EQ(view.height, 5);
    EXPECT_EQ(view.step, 7 * 3 * 4);
    EXPECT_EQ(view.total, 35);
    EXPECT_EQ(view.byteSize, 7 * 3 * 4 * 5);
    EXPECT_EQ(view.data, pixels);
    EXPECT_FALSE(view.ownsData);
  }
  unsigned char bytes[12] = {};
  const Image<unsigned char, 4> view(3, 1, bytes);
  EXPECT_EQ(view.step, 12);
}

TEST(Mat, ViewSizesAreComputedIn64Bits) {
  const Image<float, 4> view(1 << 20, 1 << 14, nullptr);
  EXPECT_EQ(view.step, int64_t{1} << 24);
  EXPECT_EQ(view.total, int64_t{1} << 34);
  EXPECT_EQ(view.byteSize, int64_t{1} << 38);
}

TEST(Mat, AllocatesAlignedInWholeMultiples) {
  const struct {
    int width, height;
    size_t size;
  } cases[] = {{1, 1, 64}, {21, 1, 64}, {22, 1, 128}, {64, 1, 192}, {64, 2, 384}, {7, 5, 128}};
  for (const auto& c : cases) {
    const auto mat = Image<unsigned char, 3>::allocate(c.width, c.height);
    EXPECT_EQ(allocatedAlignment, 64u);
    EXPECT_EQ(allocatedSize, c.size) << c.width << " x " << c.height;
    ASSERT_NE(mat.data, nullptr);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(mat.data) % 64, 0u);
    EXPECT_TRUE(mat.ownsData);
    EXPECT_EQ(mat.dims, 2);
    EXPECT_EQ(mat.step, c.width * 3);
    EXPECT_EQ(mat.byteSize, c.width * 3 * c.height);
  }
  const auto floats = Image<float, 1>::allocate(17, 1);
  EXPECT_EQ(allocatedSize, 128u);
}

TEST(Mat, AllocationMayFail) {
  const auto mat = Image<float, 4>::allocate(1 << 29, 1 << 29);
  EXPECT_EQ(mat.data, nullptr);
}

TEST(Mat, FreesWhatItOwns) {
  freed = nullptr;
  const unsigned char* data = nullptr;
  {
    const auto mat = Image<unsigned char, 1>::allocate(16, 4);
    data = mat.data;
    ASSERT_NE(data, nullptr);
  }
  EXPECT_EQ(freed, data);

  freed = nullptr;
  unsigned char pixels[16] = {};
  {
    const Image<unsigned char, 1> view(4, 4, pixels);
  }
  EXPECT_EQ(freed, nullptr);
}

TEST(Mat, MovesItsPixels) {
  auto first = Image<unsigned char, 1>::allocate(16, 4);
  unsigned char* const data = first.data;
  freed = nullptr;
  {
    Image<unsigned char, 1> second = std::move(first);
    EXPECT_EQ(second.data, data);
    EXPECT_EQ(second.dims, 2);
    EXPECT_EQ(second.width, 16);
    EXPECT_EQ(second.height, 4);
    EXPECT_EQ(second.step, 16);
    EXPECT_EQ(second.total, 64);
    EXPECT_EQ(second.byteSize, 64);
    EXPECT_TRUE(second.ownsData);
    EXPECT_EQ(first.data, nullptr);  // NOLINT(bugprone-use-after-move): an empty matrix is left behind
    EXPECT_EQ(first.dims, 0);
    EXPECT_FALSE(first.ownsData);
    first = std::move(second);
  }
  EXPECT_EQ(first.data, data);
  EXPECT_NE(freed, data);
  first = Image<unsigned char, 1>();
  EXPECT_EQ(freed, data);
}

}  // namespace
