#include "support/registers.h"

namespace testing_support {

namespace {

// The low bits of a value as the number that they stand for; both as 64 bits, so nothing overflows.
std::uint64_t extended(const Format& format, std::uint64_t bits) {
  if (format.bits == 64) return bits;
  const std::uint64_t range = std::uint64_t{1} << format.bits;
  bits %= range;
  return format.is_signed && !format.is_predicate && bits >= range / 2 ? bits - range : bits;
}

}  // namespace

Int lane(const Format& format, const void* image, int i) {
  const auto* bytes = static_cast<const unsigned char*>(image);
  if (format.is_predicate) return bytes[i / 8] >> (i % 8) & 1;
  std::uint64_t bits = 0;
  for (int b = format.container_bytes; b-- > 0;) bits = bits << 8 | bytes[i * format.container_bytes + b];
  return static_cast<Int>(extended(format, bits));
}

void set_lane(const Format& format, void* image, int i, Int value) {
  auto* bytes = static_cast<unsigned char*>(image);
  const std::uint64_t bits = extended(format, static_cast<std::uint64_t>(value));
  if (format.is_predicate) {
    const int others = bytes[i / 8] & ~(1 << i % 8);
    bytes[i / 8] = static_cast<unsigned char>(others | static_cast<int>(bits) << i % 8);
    return;
  }
  for (int b = 0; b < format.container_bytes; ++b)
    bytes[i * format.container_bytes + b] = static_cast<unsigned char>(bits >> (8 * (b % 8)));
}

Int as_lane(const Format& format, Int value) {
  return static_cast<Int>(extended(format, static_cast<std::uint64_t>(value)));
}

}  // namespace testing_support
