// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "model.h"

#include <dlib/serialize.h>

#include <array>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <map>
#include <mutex>
#include <span>
#include <string>
#include <system_error>
#include <tuple>
#include <utility>
#include <vector>

#include "failure.h"
#include "serialized.h"

namespace kyengine {
namespace {

/// Unpacking the built-in detector takes long. It is never destroyed: threads may search until the process is
/// gone.
const std::shared_ptr<const Filters>& BuiltInDetector() {
  static const auto& detector = *new auto(std::make_shared<const Filters>(dlib::get_frontal_face_detector()));
  return detector;
}

std::ifstream Open(const std::string& path, ky_result_t code) {
  std::ifstream in(path, std::ios::binary);
  Require(in.is_open(), code);
  return in;
}

bool Exists(const std::string& path) {
  std::error_code ignored;
  return std::filesystem::exists(path, ignored);
}

/// Runs `read`; false when it threw, which is how dlib says, too, that a file holds something else.
template <typename Read>
bool Reads(Read read) {
  try {
    read();
    return true;
  } catch (const Failure&) {
    return false;
  } catch (const std::exception&) {
    return false;
  }
}

}  // namespace

std::shared_ptr<const LandmarkModel> LoadLandmarks(const char* path, ky_result_t misfit,
                                                   std::streamoff start) {
  // A file that was replaced is another file.
  using File = std::tuple<std::string, uintmax_t, std::filesystem::file_time_type>;
  static std::mutex mutex;
  static std::map<File, std::weak_ptr<const LandmarkModel>> loaded;

  std::ifstream in = Open(path, KY_ERROR_MODEL_FILE);
  std::error_code ignored;
  const File file(path, std::filesystem::file_size(path, ignored),
                  std::filesystem::last_write_time(path, ignored));
  const std::lock_guard lock(mutex);
  std::erase_if(loaded, [](const auto& entry) { return entry.second.expired(); });
  if (const auto found = loaded.find(file); found != loaded.end()) {
    if (auto model = found->second.lock()) {
      return model;
    }
  }
  std::shared_ptr<const LandmarkModel> model;
  in.seekg(start);
  Require(Reads([&] { model = std::make_shared<const LandmarkModel>(in); }), misfit);
  loaded[file] = model;
  return model;
}

Model LoadModel(const char* path) {
  if (path == nullptr) {
    return {BuiltInDetector(), nullptr};
  }
  std::ifstream in = Open(path, KY_ERROR_MODEL_FILE);
  dlib::frontal_face_detector detector;
  const auto read = [&] {
    CheckDetector(in);
    deserialize(detector, in);
  };
  if (Reads(read)) {
    const std::string beside = std::string(path) + KY_LANDMARKS_SUFFIX;
    return {std::make_shared<const Filters>(detector),
            Exists(beside) ? LoadLandmarks(beside.c_str(), KY_ERROR_LANDMARK_MODEL) : nullptr};
  }
  return {BuiltInDetector(), LoadLandmarks(path, KY_ERROR_MODEL)};
}

VerifierModel LoadVerifierModel(const char* path) {
  std::ifstream in = Open(path, KY_ERROR_MODEL_FILE);
  std::array<uint8_t, DescriptorHeader::kSize> start = {};
  in.read(reinterpret_cast<char*>(start.data()), start.size());
  const auto head = std::span<const uint8_t>(start).first(static_cast<size_t>(in.gcount()));
  if (!DescriptorHeader::Recognises(head)) {
    return {LoadLandmarks(path, KY_ERROR_MODEL), nullptr};
  }
  const auto require = [](ky_result_t result) { Require(result == KY_SUCCESS, result); };
  DescriptorHeader header;
  require(DescriptorHeader::Read(head, FaceDescriptorShape(), &header));
  std::error_code failure;
  const uintmax_t size = std::filesystem::file_size(path, failure);
  const uint64_t end = head.size() + header.length;
  Require(!failure && size >= end && size - end == header.following, KY_ERROR_MODEL);

  std::vector<uint8_t> bytes(header.length);
  in.read(reinterpret_cast<char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
  Require(in.gcount() == static_cast<std::streamsize>(bytes.size()), KY_ERROR_MODEL);
  auto descriptor = std::make_shared<Descriptor>();
  require(Descriptor::Read(header, bytes, FaceDescriptorShape(), descriptor.get()));
  std::shared_ptr<const LandmarkModel> landmarks;
  if (header.following > 0) {
    landmarks = LoadLandmarks(path, KY_ERROR_LANDMARK_MODEL, static_cast<std::streamoff>(end));
  }
  return {landmarks, descriptor};
}

}  // namespace kyengine
