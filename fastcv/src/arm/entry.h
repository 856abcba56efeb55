/// How a kernel family defines its entry points: one line for each instance, as in a table.
#pragma once

#include "kernels.h"

/// Defines the instance `Name<T, ncSrc, T, ncDst>` of a colour kernel as a forward of its six arguments to
/// the worker named last.
#define FASTCV_ENTRY(Name, T, ncSrc, ncDst, ...)                                                   \
  template <>                                                                                      \
  __attribute__((visibility("default"))) void Name<T, ncSrc, T, ncDst>(                            \
      int height, int width, int inWidthStride, const T* inData, int outWidthStride, T* outData) { \
    __VA_ARGS__(height, width, inWidthStride, inData, outWidthStride, outData);                    \
  }
