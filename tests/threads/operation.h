// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The calls that the threads make.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace threads {

using Bytes = std::vector<unsigned char>;

/// A call with destinations of its own, over sources that all threads share. `run` makes the call and answers
/// with all that it wrote, returned and did.
struct Operation {
  std::string name;
  std::function<Bytes()> run;
};

/// Every conversion, crop, rotation, metric and frame helper. The sources are filled when this returns.
std::vector<Operation> imageOperations();

/// Every native method, each call in a JVM of its own. The library must have been loaded.
std::vector<Operation> nativeOperations();

}  // namespace threads
