#include "operands.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cinttypes>
#include <cstdio>
#include <limits>
#include <map>

namespace worked {

namespace {

using testing_support::Format;
using testing_support::Int;

using Series = std::array<Int, columns>;

// Round numbers of which two overflow a lane when they are added.
Int half_of_range(const Format& format) {
  static const std::map<int, Int> rounded = {{8, 100},
                                             {16, 20000},
                                             {24, 5'000'000},
                                             {32, 1'500'000'000},
                                             {48, 100'000'000'000'000},
                                             {64, 5'000'000'000'000'000'000}};
  const auto found = rounded.find(format.bits);
  const Int half = found == rounded.end() ? 1 : found->second;
  return format.is_signed || format.bits == 64 ? half : 2 * half;
}

// Small numbers, both bounds of the lane, and pairs whose sums and products leave its range.
Series integers(const Format& format, const std::string& name) {
  const bool is_signed = format.is_signed;
  const Int highest = testing_support::as_lane(format, is_signed ? (Int{1} << (format.bits - 2)) * 2 - 1 : -1);
  const Int lowest = is_signed ? -highest - 1 : 0, sign = is_signed ? -1 : 1;
  const Int middle = format.bits <= 8 ? 30 : 300, half = half_of_range(format);
  if (name == "b") return {2, 5, sign * 7, middle, 1, sign, half, 0};
  if (name == "c") return {3, sign, 10, sign * 2, 1, 2, sign * 5, 4};
  if (name == "d") return {1, 2, 3, 4, sign, sign * 2, sign * 3, sign * 4};
  const bool is_wide = format.bits >= 24 && format.bits != 32;
  if (name == "old" && is_wide) return {10, sign * 20, 30, sign * 40, highest, lowest, 70, sign * 80};
  if (name == "old") return {10, sign * 20, 30, sign * 40, 50, sign * 60, 70, sign * 80};
  // What a wide lane holds is packed: some numbers are halfway between two when they are shifted by 4.
  if (is_wide) return {1, 24, sign * 24, middle, highest, lowest, half, sign * 40};
  return {1, sign * 2, middle, middle, highest, lowest, half, is_signed ? -1 : 5};
}

constexpr Series counts = {0, 1, 4, 7, 15, 31, 33, -1};

// All pairs of bits in the first lanes of a and b; p enables most lanes in which something happens.
Series booleans(const std::string& name) {
  if (name == "p") return {1, 0, 1, 0, 1, 1, 0, 1};
  if (name == "b") return {1, 0, 1, 0, 0, 1, 1, 0};
  if (name == "old") return {0, 0, 0, 0, 1, 1, 1, 1};
  return {1, 1, 0, 0, 1, 0, 1, 1};
}

// Bit patterns of ordinary numbers, then a bound of the format, a subnormal, infinities and a NaN.
Series halves(const std::string& name) {
  if (name == "b") return {0x4000, 0x3800, 0x3266, 0x4200, 0x7BFF, 0x3800, 0xFC00, 0x3C00};    // 2 0.5 0.2 3 65504 ...
  if (name == "c") return {0x3800, 0x4400, 0xBC00, 0x3C00, 0x3C00, 0x4000, 0x4200, 0x4400};    // 0.5 4 -1 1 1 2 3 4
  if (name == "old") return {0x4900, 0xCD00, 0x4F80, 0xD100, 0x7BFF, 0x3C00, 0x4000, 0x4200};  // 10 -20 30 -40 ...
  return {0x3C00, 0xC100, 0x2E66, 0x4200, 0x7BFF, 0x0032, 0x7C00, 0x7E00};                     // 1 -2.5 0.1 3 ...
}
Series singles(const std::string& name) {
  if (name == "b")
    return {0x40000000, 0x3F000000, 0x3E4CCCCD, 0x40400000, 0x7F7FFFFF, 0x3F000000, 0xFF800000, 0x3F800000};
  if (name == "c")
    return {0x3F000000, 0x40800000, 0xBF800000, 0x3F800000, 0x3F800000, 0x40000000, 0x40400000, 0x40800000};
  if (name == "old")
    return {0x41200000, 0xC1A00000, 0x41F00000, 0xC2200000, 0x7F7FFFFF, 0x3F800000, 0x40000000, 0x40400000};
  return {0x3F800000, 0xC0200000, 0x3DCCCCCD, 0x40400000, 0x7F7FFFFF, 0x000116C2, 0x7F800000, 0x7FC00000};
}

bool is_one_of(const std::string& name, std::initializer_list<const char*> names) {
  return std::find(names.begin(), names.end(), name) != names.end();
}

Series repeated(Int value) {
  Series all;
  all.fill(value);
  return all;
}

Series series(const Operand& operand) {
  static const std::map<std::string, Int> coefficients = {
      {"s", 0x0403FFFE}, {"t", 0x01020304}, {"u", 0x05060708}, {"v", 0xFFFF0001}};
  const std::string& name = operand.values;
  const View& view = operand.view;
  if (is_one_of(name, {"offset", "increment"})) return repeated(64);
  if (name == "offsets") return {3, 1, 4, 1, 5, 7, 2, 6};
  if (name == "elements") return {0, 10, 20, 30, 40, 50, 60, 70};
  if (view.number == Number::bits && view.format.count == 1 && coefficients.count(name))
    return repeated(coefficients.at(name));
  if (is_one_of(name, {"shift", "s", "t", "i", "n", "bit", "bits", "scale", "number", "condition"})) return counts;
  switch (view.number) {
    case Number::half:
      return halves(name);
    case Number::single:
      return singles(name);
    case Number::boolean:
      return booleans(name);
    case Number::bits:
      return {0x11, 0x22, 0x33, 0x44, 0x55, 0x66, 0x77, 0x88};
    case Number::integer:
      break;
  }
  return integers(view.format, name);
}

// The value of a finite or infinite half, which a single holds exactly.
float single_of_half(Int bits) {
  const int exponent = static_cast<int>(bits >> 10 & 31), fraction = static_cast<int>(bits & 0x3FF);
  const float magnitude = exponent == 31 ? std::numeric_limits<float>::infinity()
                          : exponent == 0
                              ? static_cast<float>(fraction) / (1 << 24)
                              : static_cast<float>(fraction + 1024) / (1 << 25) * static_cast<float>(1u << exponent);
  return bits & 0x8000 ? -magnitude : magnitude;
}

template <class... Format>
std::string shortest(float value, Format... format) {
  char buffer[32];
  return {buffer, std::to_chars(buffer, std::end(buffer), value, format...).ptr};
}

std::string half_text(Int bits) {
  const bool is_nan = (bits & 0x7FFF) > 0x7C00;
  if (is_nan) return bits & 0x8000 ? "-nan" : "nan";
  return shortest(single_of_half(bits), std::chars_format::general, 5);
}

std::string single_text(Int bits) {
  const auto pattern = static_cast<std::uint32_t>(bits);
  float value;
  std::memcpy(&value, &pattern, sizeof value);
  return shortest(value);
}

std::string hexadecimal(const Format& format, const void* image, int i) {
  const auto* bytes = static_cast<const unsigned char*>(image) + i * format.container_bytes;
  std::string digits = "0x";
  for (int b = format.container_bytes; b-- > 0;) {
    char pair[3];
    std::snprintf(pair, sizeof pair, "%02x", bytes[b]);
    digits += pair;
  }
  return digits;
}

std::string lane_text(const View& view, const void* image, int i) {
  if (view.number == Number::bits) return hexadecimal(view.format, image, i);
  const Int value = testing_support::lane(view.format, image, i);
  if (view.number == Number::half) return half_text(value);
  if (view.number == Number::single) return single_text(value);
  return view.format.is_signed ? std::to_string(value) : std::to_string(static_cast<std::uint64_t>(value));
}

}  // namespace

void fill(const Operand& operand, int column) {
  const Format& format = operand.view.format;
  const Series values = series(operand);
  const int first = format.count == 1 ? column : 0;
  for (int i = 0; i < format.count; ++i) {
    const Int value = values[static_cast<std::size_t>((first + i) % columns)];
    testing_support::set_lane(format, operand.image, i, value * operand.step);
  }
}

std::string text(const View& view, const void* image, int first) {
  const int end = std::min(view.format.count, first + columns);
  std::string all;
  for (int i = first; i < end; ++i) all += (i > first ? " " : "") + lane_text(view, image, i);
  return all;
}

}  // namespace worked
