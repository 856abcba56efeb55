// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// How a kernel family defines its entry points: one line for each instance, as in a table.
#pragma once

#include "fastcv/kernels.h"

/// Makes the explicit instantiation of a kernel part of the shared library's interface: GCC does not take
/// that from the kernel's declaration.
#define FASTCV_EXPORTED __attribute__((visibility("default")))

/// Defines the instance `Name<T, ncSrc, T, ncDst>` of a colour kernel as a forward of its six arguments to
/// the worker named last.
#define FASTCV_ENTRY(Name, T, ncSrc, ncDst, ...)                                                           \
  template <>                                                                                              \
  FASTCV_EXPORTED void Name<T, ncSrc, T, ncDst>(int height, int width, int inWidthStride, const T* inData, \
                                                int outWidthStride, T* outData) {                          \
    __VA_ARGS__(height, width, inWidthStride, inData, outWidthStride, outData);                            \
  }
