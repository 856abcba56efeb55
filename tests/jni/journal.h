// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The one record of everything that happens during a native call, in order: calls into the JVM,
/// calls into the engine and the bitmap interface, and log messages.
#pragma once

#include <string>
#include <vector>

namespace fake {

/// All entries of this thread since the last `clear`, one line each.
std::vector<std::string>& journal();

/// Adds an entry, formatted as by printf.
__attribute__((format(printf, 1, 2))) void note(const char* format, ...);

/// The entries that start with `prefix`.
std::vector<std::string> entries(const std::string& prefix);

}  // namespace fake
