// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the engine throws inside; the C interface turns it into its result code.
#pragma once

#include "engine/ky_engine.h"

namespace kyengine {

struct Failure {
  ky_result_t code;
};

/// Throws Failure{code} unless `condition` holds.
inline void require(bool condition, ky_result_t code) {
  if (!condition) {
    throw Failure{code};
  }
}

}  // namespace kyengine
