// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// A face engine for tests: it answers as scripted and records every call in the journal.
#pragma once

#include <string>
#include <vector>

#include "fake_vm.h"
#include "kyface_api/kyface_api.h"

namespace fake {

struct Engine {
  /// Tells the names of pinned arrays in the journal.
  const Vm* vm = nullptr;

  /// Results of the creations, in order; 0 when there are no more. The n-th creation stores the handle 0x1000
  /// + n.
  std::vector<int> create_results;
  int creations = 0;
  /// Result of every other operation.
  int result = 0;

  /// What detection and tracking store.
  std::vector<ky_face_t> faces;
  /// Stored in place of the number of `faces`, unless kAsMany.
  int count = kAsMany;
  /// Store a null array whatever `faces` holds.
  bool null_faces = false;

  /// Stored by the reading of the threshold and by the comparison, unless `store_nothing`.
  float value = 0;
  bool store_nothing = false;

  /// The feature that an extraction stores, its length and its text.
  ky_feature_t feature = reinterpret_cast<ky_feature_t>(0xFEA7);
  int feature_length = 0;
  std::string text;
  /// The record that the last extraction got.
  ky_face_t record = {};
  /// Features of the deserialisations, in order; null when there are no more.
  std::vector<ky_feature_t> features;

  static constexpr int kAsMany = -1000000;
};

/// The engine that the `ky_*` functions of this program speak for on this thread.
Engine& engine();

}  // namespace fake
