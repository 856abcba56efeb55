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
const std::shared_ptr<const Filters>& builtInDetector() {
  static const auto& detector = *new auto(std::make_shared<const Filters>(dlib::get_frontal_face_detector()));
  return detector;
}

std::ifstream open(const std::string& path, ky_result_t code) {
  std::ifstream in(path, std::ios::binary);
  require(in.is_open(), code);
  return in;
}

bool exists(const std::string& path) {
  std::error_code ignored;
  return std::filesystem::exists(path, ignored);
}

/// Runs `read`; false when it threw, which is how dlib says, too, that a file holds something else.
template <typename Read>
bool reads(Read read) {
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

std::shared_ptr<const LandmarkModel> loadLandmarks(const char* path, ky_result_t misfit,
                                                   std::streamoff start) {
  // A file that was replaced is another file, and what begins elsewhere in it is another model.
  using File = std::tuple<std::string, std::streamoff, uintmax_t, std::filesystem::file_time_type>;
  static std::mutex mutex;
  static std::map<File, std::weak_ptr<const LandmarkModel>> loaded;

  std::ifstream in = open(path, KY_ERROR_MODEL_FILE);
  std::error_code ignored;
  const File file(path, start, std::filesystem::file_size(path, ignored),
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
  require(reads([&] { model = std::make_shared<const LandmarkModel>(in); }), misfit);
  loaded[file] = model;
  return model;
}

Model loadModel(const char* path) {
  if (path == nullptr) {
    return {builtInDetector(), nullptr};
  }
  std::ifstream in = open(path, KY_ERROR_MODEL_FILE);
  dlib::frontal_face_detector detector;
  const auto read = [&] {
    checkDetector(in);
    deserialize(detector, in);
  };
  if (reads(read)) {
    const std::string beside = std::string(path) + KY_LANDMARKS_SUFFIX;
    return {std::make_shared<const Filters>(detector),
            exists(beside) ? loadLandmarks(beside.c_str(), KY_ERROR_LANDMARK_MODEL) : nullptr};
  }
  return {builtInDetector(), loadLandmarks(path, KY_ERROR_MODEL)};
}

VerifierModel loadVerifierModel(const char* path) {
  std::ifstream in = open(path, KY_ERROR_MODEL_FILE);
  std::array<uint8_t, DescriptorHeader::kSize> start = {};
  in.read(reinterpret_cast<char*>(start.data()), start.size());
  const auto head = std::span<const uint8_t>(start).first(static_cast<size_t>(in.gcount()));
  if (!DescriptorHeader::recognises(head)) {
    return {loadLandmarks(path, KY_ERROR_MODEL), nullptr};
  }
  const auto requireSuccess = [](ky_result_t result) { require(result == KY_SUCCESS, result); };
  DescriptorHeader header;
  requireSuccess(DescriptorHeader::read(head, faceDescriptorShape(), &header));
  std::error_code failure;
  const uintmax_t size = std::filesystem::file_size(path, failure);
  const uint64_t end = head.size() + header.length;
  require(!failure && size >= end && size - end == header.following, KY_ERROR_MODEL);

  std::vector<uint8_t> bytes(header.length);
  in.read(reinterpret_cast<char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
  require(in.gcount() == static_cast<std::streamsize>(bytes.size()), KY_ERROR_MODEL);
  auto descriptor = std::make_shared<Descriptor>();
  requireSuccess(Descriptor::read(header, bytes, faceDescriptorShape(), descriptor.get()));
  std::shared_ptr<const LandmarkModel> landmarks;
  if (header.following > 0) {
    landmarks = loadLandmarks(path, KY_ERROR_LANDMARK_MODEL, static_cast<std::streamoff>(end));
  }
  return {landmarks, descriptor};
}

}  // namespace kyengine
