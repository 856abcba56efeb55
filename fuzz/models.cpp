// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Model files from strangers: detectors and landmark models as dlib writes them, and containers of
// descriptors. They are refused, or work, whatever that gives; reading them takes memory in proportion to the
// file.

#include "engine/src/dlib_config.h"
// The configuration of dlib comes first.
#include <dlib/image_processing/frontal_face_detector.h>
#include <dlib/serialize.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <span>
#include <sstream>
#include <string>
#include <vector>

#include "engine/src/descriptor.h"
#include "engine/src/failure.h"
#include "engine/src/model.h"
#include "engine/src/scanner.h"
#include "fuzz_input.h"
#include "tests/support/descriptor_model.h"

namespace {

using kyengine::Failure;
using kyengine::GrayImage;
using kyface::fuzz::Input;

/// A file that is gone with the process.
class File {
 public:
  explicit File(const std::string& bytes) : descriptor_(memfd_create("model", 0)) {
    FUZZ_CHECK(descriptor_ >= 0);
    FUZZ_CHECK(write(descriptor_, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size()));
  }
  ~File() { close(descriptor_); }
  File(const File&) = delete;
  File& operator=(const File&) = delete;

  std::string path() const { return "/proc/self/fd/" + std::to_string(descriptor_); }

 private:
  int descriptor_;
};

GrayImage somePicture(Input& input, long side) {
  GrayImage picture(side, side);
  for (unsigned char& pixel : picture) {
    pixel = input.pixel();
  }
  return picture;
}

/// What dlib would have written, but that some of the numbers are others.
class Forgery {
 public:
  explicit Forgery(Input& input) : input_(input), changes_(input.in(0, 3)) {}

  void integer(long number) { dlib::serialize(forged(number), out_); }
  void natural(unsigned long number) {
    dlib::serialize(static_cast<unsigned long>(forged(static_cast<long>(number))), out_);
  }
  void real(double number) {
    dlib::serialize(forges() ? static_cast<double>(input_.anyFloat()) : number, out_);
  }
  void column(long length, double scale) {
    integer(-length);
    integer(-1);
    for (long i = 0; i < length; ++i) {
      real((input_.pixel() - 128) * scale);
    }
  }
  std::string bytes() const { return out_.str(); }

 private:
  bool forges() {
    if (changes_ == 0 || !input_.seldom(24)) {
      return false;
    }
    --changes_;
    return true;
  }
  long forged(long number) {
    if (!forges()) {
      return number;
    }
    switch (input_.in(0, 3)) {
      case 0:
        return number + input_.in(-2, 2);
      case 1:
        return input_.any();
      case 2:
        return -number;
      default:
        return 1L << input_.in(0, 62);
    }
  }

  Input& input_;
  int changes_;
  std::ostringstream out_;
};

std::string someLandmarks(Input& input) {
  Forgery file(input);
  const long points = input.seldom(8) ? input.in(1, 256) : input.in(1, 5);
  file.integer(1);
  file.column(2 * points, 1.0 / 128);
  const auto cascades = static_cast<unsigned long>(input.in(0, 3));
  const auto pixels = static_cast<unsigned long>(input.in(1, 4));
  file.natural(cascades);
  for (unsigned long cascade = 0; cascade < cascades; ++cascade) {
    const auto trees = static_cast<unsigned long>(input.in(0, 2));
    file.natural(trees);
    for (unsigned long tree = 0; tree < trees; ++tree) {
      const unsigned long leaves = 1UL << input.in(0, 3);
      file.natural(leaves - 1);
      for (unsigned long split = 1; split < leaves; ++split) {
        file.natural(input.pixel() % pixels);
        file.natural(input.pixel() % pixels);
        file.real(input.pixel() - 128);
      }
      file.natural(leaves);
      for (unsigned long leaf = 0; leaf < leaves; ++leaf) {
        file.column(2 * points, 1.0 / 1024);
      }
    }
  }
  for (const bool anchors : {true, false}) {
    file.natural(cascades);
    for (unsigned long cascade = 0; cascade < cascades; ++cascade) {
      file.natural(pixels);
      for (unsigned long pixel = 0; pixel < pixels; ++pixel) {
        if (anchors) {
          file.natural(input.pixel() % static_cast<unsigned long>(points));
        } else {
          file.real((input.pixel() - 128) / 256.0);
          file.real((input.pixel() - 128) / 256.0);
        }
      }
    }
  }
  return file.bytes();
}

std::string someDetector(Input& input) {
  dlib::scan_fhog_pyramid<dlib::pyramid_down<6>> scanner;
  const auto cell = static_cast<unsigned long>(input.in(2, 16));
  scanner.set_cell_size(cell);
  scanner.set_padding(static_cast<unsigned long>(input.in(0, 1)));
  scanner.set_detection_window_size(cell * static_cast<unsigned long>(input.in(2, 4)),
                                    cell * static_cast<unsigned long>(input.in(2, 4)));
  Forgery file(input);
  const bool one = input.seldom(3);
  file.integer(one ? 1 : 2);
  file.integer(1);
  file.natural(0);
  file.natural(0);
  file.natural(scanner.get_cell_size());
  file.natural(scanner.get_padding());
  file.natural(scanner.get_detection_window_width());
  file.natural(scanner.get_detection_window_height());
  file.natural(static_cast<unsigned long>(input.in(1, 4)));
  file.natural(static_cast<unsigned long>(input.in(1, 20)));
  file.natural(static_cast<unsigned long>(input.in(1, 20)));
  file.real(1);
  file.integer(scanner.get_num_dimensions());
  const auto filter = [&] { file.column(scanner.get_num_dimensions() + 1, 1.0 / 128); };
  const auto overlap = [&] {
    file.real(input.in(0, 8) / 8.0);
    file.real(input.in(0, 8) / 8.0);
  };
  if (one) {
    filter();
    overlap();
  } else {
    overlap();
    const auto filters = static_cast<unsigned long>(input.in(1, 3));
    file.natural(filters);
    for (unsigned long i = 0; i < filters; ++i) {
      filter();
    }
  }
  return file.bytes();
}

void tryDetector(Input& input, const std::string& bytes) {
  const File file(bytes);
  try {
    const kyengine::Model model = kyengine::loadModel(file.path().c_str());
    GrayImage picture = somePicture(input, input.in(1, 48));
    const dlib::drectangle box(input.in(-60, 60), input.in(-60, 60), input.in(-60, 60), input.in(-60, 60));
    if (model.landmarks != nullptr) {
      const auto points = model.landmarks->locate(picture, box);
      FUZZ_CHECK(!points.empty() && points.size() <= KY_FACE_MAX_POINTS);
    } else {
      kyengine::Scanner(model.detector).find(picture, input.in(-3, 3));
    }
  } catch (const Failure& failure) {
    FUZZ_CHECK(failure.code != KY_SUCCESS);
  }
}

void tryVerifier(const std::string& bytes) {
  const File file(bytes);
  ky_handle_t verifier = nullptr;
  const int result = ky_verify_create_handle(&verifier, file.path().c_str());
  FUZZ_CHECK((result == KY_SUCCESS) == (verifier != nullptr));
  ky_verify_destroy_handle(verifier);
}

void tryDescriptor(Input& input) {
  static constexpr kyengine::ResidualBlock kBlocks[] = {{16, false}, {32, true}};
  static constexpr kyengine::DescriptorShape kShape = {31, 16, kBlocks, 16};
  static const auto model = kyengine::test::RandomModel(kShape, 1);
  static const std::vector<uint8_t> whole = kyengine::test::FileOf(model);
  std::vector<uint8_t> file = whole;
  if (input.seldom(3)) {
    file.resize(static_cast<size_t>(input.in(0, static_cast<int>(whole.size()))));
  }
  for (int changes = input.in(0, 6); changes > 0 && !file.empty(); --changes) {
    // In the header, in the first convolution's numbers, or anywhere.
    const int range = input.in(0, 2);
    const size_t at = static_cast<size_t>(input.in(0, range == 0   ? 39
                                                      : range == 1 ? 300
                                                                   : 1 << 30)) %
                      file.size();
    file[at] = input.pixel();
  }
  if (!input.seldom(4) && file.size() > kyengine::DescriptorHeader::kSize) {
    kyengine::test::Seal(file);
  }
  kyengine::DescriptorHeader header;
  const std::span<const uint8_t> bytes(file);
  if (kyengine::DescriptorHeader::read(bytes.first(std::min(bytes.size(), kyengine::DescriptorHeader::kSize)),
                                       kShape, &header) != KY_SUCCESS) {
    return;
  }
  FUZZ_CHECK(header.length <= 2 * whole.size() * sizeof(float));
  const auto rest = bytes.subspan(kyengine::DescriptorHeader::kSize);
  kyengine::Descriptor descriptor;
  if (kyengine::Descriptor::read(header, rest.first(std::min<size_t>(rest.size(), header.length)), kShape,
                                 &descriptor) != KY_SUCCESS) {
    return;
  }
  std::array<uint8_t, size_t{3} * 31 * 31> picture = {};
  std::generate(picture.begin(), picture.end(), [&] { return input.pixel(); });
  std::array<float, 16> numbers = {};
  if (descriptor.describe(picture.data(), numbers.data()) == KY_SUCCESS) {
    FUZZ_CHECK(std::all_of(numbers.begin(), numbers.end(), [](float x) { return std::isfinite(x); }));
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  switch (input.in(0, 5)) {
    case 0: {
      // The bytes of a file as they are; what follows them is all zeros.
      const std::string bytes(reinterpret_cast<const char*>(input.rest()), input.restSize());
      Input none(nullptr, 0);
      tryDetector(none, bytes);
      break;
    }
    case 1:
      tryVerifier(std::string(reinterpret_cast<const char*>(input.rest()), input.restSize()));
      break;
    case 2:
    case 3:
      tryDetector(input, someLandmarks(input));
      break;
    case 4:
      tryDetector(input, someDetector(input));
      break;
    default:
      tryDescriptor(input);
      break;
  }
  return 0;
}
