// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The checksum of features and of model files.
#pragma once

#include <dlib/crc32.h>

#include <cstdint>
#include <span>

namespace kyengine {

/// CRC-32 as Ethernet and zlib have it.
inline uint32_t crcOf(std::span<const uint8_t> bytes) {
  dlib::crc32 crc;
  for (const uint8_t byte : bytes) {
    crc.add(byte);
  }
  return static_cast<uint32_t>(crc.get_checksum());
}

}  // namespace kyengine
