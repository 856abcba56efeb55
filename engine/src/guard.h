// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The border between the engine and its C callers.
#pragma once

#include <new>

#include "failure.h"

namespace kyengine {

/// Runs `work` and turns how it ends into a result code: no exception passes.
template <typename Work>
int guarded(Work work) noexcept {
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

}  // namespace kyengine
