// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The picture of a face that the descriptor takes: upright, its eyes in fixed places.
#pragma once

#include <cstdint>
#include <vector>

#include "landmarks.h"

namespace kyengine {

/// Cuts a face out of a frame that is upright, by its eyes, as `side` x `side` packed pixels of red, green
/// and blue: turned, scaled and moved so that the eyes come to where the descriptor's training had them, in
/// 150ths of the side (46.6, 46.4) and (99.95, 47.1). A face that is scaled down is averaged, not sampled;
/// what lies outside the frame is black. The result is the same on every machine.
std::vector<uint8_t> alignedFace(const Frame& frame, const Eyes& eyes, int side);

}  // namespace kyengine
