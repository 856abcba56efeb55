// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The C interface that the engine implements, whose functions alone are visible from outside.
#pragma once

#pragma GCC visibility push(default)
#include "kyface_api/kyface_api.h"
#pragma GCC visibility pop

#include "engine/ky_engine.h"
