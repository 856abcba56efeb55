// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "picture.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <stdexcept>

#include "engine/ky_engine.h"

namespace kyengine::test {
namespace {

constexpr uint8_t kOutside = 128;

// ---- PNG
// -----------------------------------------------------------------------------------------------------

[[noreturn]] void Malformed() { throw std::runtime_error("not a PNG file of 8-bit RGB pixels"); }

class Bits {
 public:
  explicit Bits(const std::vector<uint8_t>& bytes) : bytes_(bytes) {}

  uint32_t Take(int count) {
    uint32_t value = 0;
    for (int i = 0; i < count; ++i, ++position_) {
      value |= static_cast<uint32_t>(bytes_.at(position_ / 8) >> (position_ % 8) & 1) << i;
    }
    return value;
  }
  void SkipToByte() { position_ = (position_ + 7) / 8 * 8; }

 private:
  const std::vector<uint8_t>& bytes_;
  size_t position_ = 0;
};

/// A canonical prefix code, from the lengths of its symbols' codes.
class PrefixCode {
 public:
  explicit PrefixCode(const std::vector<int>& lengths) {
    for (int length = 1; length <= kLongest; ++length) {
      for (size_t symbol = 0; symbol < lengths.size(); ++symbol) {
        if (lengths[symbol] == length) {
          symbols_.push_back(static_cast<int>(symbol));
          ++count_[static_cast<size_t>(length)];
        }
      }
    }
  }

  int Take(Bits& bits) const {
    int code = 0;
    int first = 0;
    int index = 0;
    for (size_t length = 1; length <= kLongest; ++length) {
      code = code << 1 | static_cast<int>(bits.Take(1));
      if (code - first < count_[length]) {
        return symbols_[static_cast<size_t>(index + code - first)];
      }
      index += count_[length];
      first = (first + count_[length]) << 1;
    }
    Malformed();
  }

 private:
  static constexpr int kLongest = 15;
  std::array<int, kLongest + 1> count_ = {};
  std::vector<int> symbols_;
};

void InflateBlock(Bits& bits, const PrefixCode& literals, const PrefixCode& distances,
                  std::vector<uint8_t>& out) {
  static constexpr int kLengthBase[] = {3,  4,  5,  6,  7,  8,  9,  10, 11,  13,  15,  17,  19,  23, 27,
                                        31, 35, 43, 51, 59, 67, 83, 99, 115, 131, 163, 195, 227, 258};
  static constexpr int kLengthBits[] = {0, 0, 0, 0, 0, 0, 0, 0, 1, 1, 1, 1, 2, 2, 2,
                                        2, 3, 3, 3, 3, 4, 4, 4, 4, 5, 5, 5, 5, 0};
  for (;;) {
    int symbol = literals.Take(bits);
    if (symbol == 256) {
      return;
    }
    if (symbol < 256) {
      out.push_back(static_cast<uint8_t>(symbol));
      continue;
    }
    symbol -= 257;
    if (symbol >= static_cast<int>(std::size(kLengthBase))) {
      Malformed();
    }
    const size_t length = static_cast<size_t>(kLengthBase[symbol]) + bits.Take(kLengthBits[symbol]);
    const int code = distances.Take(bits);
    const int extra = code < 4 ? 0 : code / 2 - 1;
    const size_t base = code < 4 ? static_cast<size_t>(code) : static_cast<size_t>(2 + code % 2) << extra;
    const size_t distance = base + bits.Take(extra) + 1;
    if (distance > out.size()) {
      Malformed();
    }
    for (size_t i = 0; i < length; ++i) {
      out.push_back(out[out.size() - distance]);
    }
  }
}

std::vector<uint8_t> Inflate(const std::vector<uint8_t>& zlib) {
  Bits bits(zlib);
  bits.Take(16);  // the zlib header
  std::vector<uint8_t> out;
  for (bool last = false; !last;) {
    last = bits.Take(1) != 0;
    const uint32_t kind = bits.Take(2);
    if (kind == 0) {
      bits.SkipToByte();
      const uint32_t length = bits.Take(16);
      bits.Take(16);
      for (uint32_t i = 0; i < length; ++i) {
        out.push_back(static_cast<uint8_t>(bits.Take(8)));
      }
    } else if (kind == 1) {
      std::vector<int> lengths(288, 8);
      std::fill(lengths.begin() + 144, lengths.begin() + 256, 9);
      std::fill(lengths.begin() + 256, lengths.begin() + 280, 7);
      InflateBlock(bits, PrefixCode(lengths), PrefixCode(std::vector<int>(30, 5)), out);
    } else if (kind == 2) {
      static constexpr size_t kOrder[] = {16, 17, 18, 0, 8, 7, 9, 6, 10, 5, 11, 4, 12, 3, 13, 2, 14, 1, 15};
      const size_t literals = bits.Take(5) + 257;
      const size_t distances = bits.Take(5) + 1;
      const size_t codes = bits.Take(4) + 4;
      std::vector<int> code_lengths(19, 0);
      for (size_t i = 0; i < codes; ++i) {
        code_lengths[kOrder[i]] = static_cast<int>(bits.Take(3));
      }
      const PrefixCode code(code_lengths);
      std::vector<int> lengths;
      while (lengths.size() < literals + distances) {
        const int symbol = code.Take(bits);
        if (symbol < 16) {
          lengths.push_back(symbol);
        } else if (symbol == 16) {
          lengths.insert(lengths.end(), 3 + bits.Take(2), lengths.empty() ? 0 : lengths.back());
        } else {
          lengths.insert(lengths.end(), symbol == 17 ? 3 + bits.Take(3) : 11 + bits.Take(7), 0);
        }
      }
      const auto split = lengths.begin() + static_cast<ptrdiff_t>(literals);
      InflateBlock(bits, PrefixCode({lengths.begin(), split}), PrefixCode({split, lengths.end()}), out);
    } else {
      Malformed();
    }
  }
  return out;
}

/// The prediction of PNG's filters from the bytes to the left, above, and above to the left.
int Predict(int filter, int left, int above, int corner) {
  switch (filter) {
    case 0:
      return 0;
    case 1:
      return left;
    case 2:
      return above;
    case 3:
      return (left + above) / 2;
    case 4: {
      const int p = left + above - corner;
      const int to_left = std::abs(p - left);
      const int to_above = std::abs(p - above);
      const int to_corner = std::abs(p - corner);
      return to_left <= to_above && to_left <= to_corner ? left : to_above <= to_corner ? above : corner;
    }
    default:
      Malformed();
  }
}

uint8_t ToByte(double value) { return static_cast<uint8_t>(std::lround(std::clamp(value, 0.0, 255.0))); }

/// The turn and scale of a view, as a complex number.
struct Turn {
  double c;
  double s;
  Turn(double zoom, double degrees)
      : c(zoom * std::cos(degrees * M_PI / 180)), s(zoom * std::sin(degrees * M_PI / 180)) {}
};

}  // namespace

Picture ReadPng(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  const std::vector<uint8_t> bytes((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
  const auto word = [&bytes](size_t at) {
    return static_cast<uint32_t>(bytes.at(at)) << 24 | static_cast<uint32_t>(bytes.at(at + 1)) << 16 |
           static_cast<uint32_t>(bytes.at(at + 2)) << 8 | bytes.at(at + 3);
  };
  constexpr size_t kFirstChunk = 8;
  constexpr size_t kHeader = kFirstChunk + 8;
  // 8 bits, RGB, the one compression, the one filtering, not interlaced.
  if (word(0) != 0x89504e47 || word(kHeader + 8) != 0x08020000 || bytes.at(kHeader + 12) != 0) {
    Malformed();
  }
  Picture picture(static_cast<int>(word(kHeader)), static_cast<int>(word(kHeader + 4)));
  std::vector<uint8_t> packed;
  for (size_t chunk = kFirstChunk; chunk + 12 <= bytes.size(); chunk += word(chunk) + 12) {
    if (word(chunk + 4) == 0x49444154) {  // IDAT
      const auto data = bytes.begin() + static_cast<ptrdiff_t>(chunk) + 8;
      packed.insert(packed.end(), data, data + static_cast<ptrdiff_t>(word(chunk)));
    }
  }

  const std::vector<uint8_t> lines = Inflate(packed);
  const size_t row = static_cast<size_t>(picture.width) * 3;
  for (size_t y = 0; y < static_cast<size_t>(picture.height); ++y) {
    const int filter = lines.at(y * (row + 1));
    for (size_t i = 0; i < row; ++i) {
      const size_t at = y * row + i;
      const int left = i >= 3 ? picture.rgb[at - 3] : 0;
      const int above = y > 0 ? picture.rgb[at - row] : 0;
      const int corner = i >= 3 && y > 0 ? picture.rgb[at - row - 3] : 0;
      picture.rgb[at] =
          static_cast<uint8_t>(lines.at(y * (row + 1) + 1 + i) + Predict(filter, left, above, corner));
    }
  }
  return picture;
}

const Picture& Portrait() {
  static const Picture portrait = ReadPng(KY_PORTRAIT);
  return portrait;
}

Picture Part(const Picture& picture, int left, int top, int width, int height) {
  Picture part(width, height, kOutside);
  for (int y = std::max(0, -top); y < height && top + y < picture.height; ++y) {
    for (int x = std::max(0, -left); x < width && left + x < picture.width; ++x) {
      std::copy_n(picture.at(left + x, top + y), 3, part.at(x, y));
    }
  }
  return part;
}

ky_pointf_t InView(double px, double py, double x, double y, double zoom, double degrees, int size) {
  const Turn turn(zoom, degrees);
  const double dx = px - x;
  const double dy = py - y;
  const double middle = (size - 1) / 2.0;
  return {static_cast<float>(middle + turn.c * dx - turn.s * dy),
          static_cast<float>(middle + turn.s * dx + turn.c * dy)};
}

Picture View(const Picture& picture, double x, double y, double zoom, double degrees, int size) {
  const Turn back(1 / zoom, -degrees);
  const double middle = (size - 1) / 2.0;
  Picture view(size, size, kOutside);
  for (int v = 0; v < size; ++v) {
    for (int u = 0; u < size; ++u) {
      const double px = x + back.c * (u - middle) - back.s * (v - middle);
      const double py = y + back.s * (u - middle) + back.c * (v - middle);
      const int left = static_cast<int>(std::floor(px));
      const int top = static_cast<int>(std::floor(py));
      if (left < 0 || top < 0 || left + 1 >= picture.width || top + 1 >= picture.height) {
        continue;
      }
      const double fx = px - left;
      const double fy = py - top;
      for (int c = 0; c < 3; ++c) {
        view.at(u, v)[c] =
            ToByte((picture.at(left, top)[c] * (1 - fx) + picture.at(left + 1, top)[c] * fx) * (1 - fy) +
                   (picture.at(left, top + 1)[c] * (1 - fx) + picture.at(left + 1, top + 1)[c] * fx) * fy);
      }
    }
  }
  return view;
}

Picture Turned(const Picture& picture, int orientation) {
  Picture turned = picture;
  for (int turns = 0; turns < orientation / 90; ++turns) {
    Picture next(turned.height, turned.width);
    for (int y = 0; y < next.height; ++y) {
      for (int x = 0; x < next.width; ++x) {
        std::copy_n(turned.at(turned.width - 1 - y, x), 3, next.at(x, y));
      }
    }
    turned = next;
  }
  return turned;
}

ky_rect_t Turned(const ky_rect_t& upright, int width, int height, int orientation) {
  ky_rect_t r = upright;
  for (int turns = 0; turns < orientation / 90; ++turns) {
    r = {r.top, width - r.right, r.bottom, width - r.left};
    std::swap(width, height);
  }
  return r;
}

int RowBytes(int pixel_format, int width) {
  switch (pixel_format) {
    case KY_PIXEL_BGR:
    case KY_PIXEL_RGB:
      return width * 3;
    case KY_PIXEL_BGRA:
    case KY_PIXEL_RGBA:
      return width * 4;
    default:
      return width;
  }
}

int Rows(int pixel_format, int height) {
  return pixel_format == KY_PIXEL_NV21 || pixel_format == KY_PIXEL_NV12 ? height * 3 / 2 : height;
}

std::vector<uint8_t> Encode(const Picture& picture, int pixel_format, int stride, uint8_t padding) {
  const int rows = Rows(pixel_format, picture.height);
  const int row_bytes = RowBytes(pixel_format, picture.width);
  std::vector<uint8_t> bytes(
      static_cast<size_t>(rows - 1) * static_cast<size_t>(stride) + static_cast<size_t>(row_bytes), padding);
  const auto at = [&](int row, int byte) -> uint8_t& {
    return bytes[static_cast<size_t>(row) * static_cast<size_t>(stride) + static_cast<size_t>(byte)];
  };
  for (int y = 0; y < picture.height; ++y) {
    for (int x = 0; x < picture.width; ++x) {
      const uint8_t* const p = picture.at(x, y);
      const double r = p[0];
      const double g = p[1];
      const double b = p[2];
      switch (pixel_format) {
        case KY_PIXEL_GRAY:
          at(y, x) = ToByte(0.299 * r + 0.587 * g + 0.114 * b);
          break;
        case KY_PIXEL_BGR:
        case KY_PIXEL_BGRA:
        case KY_PIXEL_RGB:
        case KY_PIXEL_RGBA: {
          const bool blue_first = pixel_format == KY_PIXEL_BGR || pixel_format == KY_PIXEL_BGRA;
          const int bytes_per_pixel = row_bytes / picture.width;
          for (int c = 0; c < 3; ++c) {
            at(y, x * bytes_per_pixel + c) = p[blue_first ? 2 - c : c];
          }
          if (bytes_per_pixel == 4) {
            at(y, x * 4 + 3) = static_cast<uint8_t>(x * 7 + y * 13);  // alpha is nobody's business
          }
          break;
        }
        default: {
          // BT.601 in studio range.
          at(y, x) = ToByte(16 + (65.481 * r + 128.553 * g + 24.966 * b) / 255);
          const uint8_t cb = ToByte(128 + (-37.797 * r - 74.203 * g + 112 * b) / 255);
          const uint8_t cr = ToByte(128 + (112 * r - 93.786 * g - 18.214 * b) / 255);
          const bool v_first = pixel_format == KY_PIXEL_NV21;
          at(picture.height + y / 2, x / 2 * 2) = v_first ? cr : cb;
          at(picture.height + y / 2, x / 2 * 2 + 1) = v_first ? cb : cr;
          break;
        }
      }
    }
  }
  return bytes;
}

double Overlap(const ky_rect_t& a, const ky_rect_t& b) {
  const auto area = [](double width, double height) { return std::max(0.0, width) * std::max(0.0, height); };
  const double both = area(std::min(a.right, b.right) - std::max(a.left, b.left),
                           std::min(a.bottom, b.bottom) - std::max(a.top, b.top));
  const double all =
      area(a.right - a.left, a.bottom - a.top) + area(b.right - b.left, b.bottom - b.top) - both;
  return all > 0 ? both / all : 0;
}

}  // namespace kyengine::test
