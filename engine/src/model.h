// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Loading of the models that a detector or tracker works with.
#pragma once

#include "landmarks.h"
#include "scanner.h"

#include <ios>
#include <memory>

#include "descriptor.h"

namespace kyengine {

struct Model {
  std::shared_ptr<const Filters> detector;
  std::shared_ptr<const LandmarkModel> landmarks;  ///< null when there is none
};

/// Loads what `path` names, as `ky_engine.h` describes; throws Failure.
Model loadModel(const char* path);

/// Loads a landmark model; throws Failure, with the code `misfit` when the file holds something else. Handles
/// created from one file share it: such models are large. The model starts at byte `start` of the file.
std::shared_ptr<const LandmarkModel> loadLandmarks(const char* path, ky_result_t misfit,
                                                   std::streamoff start = 0);

struct VerifierModel {
  std::shared_ptr<const LandmarkModel> landmarks;  ///< null when there is none
  std::shared_ptr<const Descriptor> descriptor;    ///< null when there is none
};

/// Loads what `path` names for a verifier, as `ky_engine.h` describes; throws Failure.
VerifierModel loadVerifierModel(const char* path);

}  // namespace kyengine
