// Fixed fractions of a 32-bit product, rounded half up, without saturation.
#ifndef KASTARRI_MULTIPLY_FRACTIONS_H
#define KASTARRI_MULTIPLY_FRACTIONS_H

#include <cstdint>

namespace {

// A product of two Q15 numbers as Q15: bits 16 .. 31 of twice the product plus a half.
constexpr std::uint16_t q15(std::uint32_t product) { return static_cast<std::uint16_t>((2 * product + 0x8000) >> 16); }

// A product less 10 fractional bits: bits 10 .. 25 of the product plus a half.
constexpr std::uint16_t q10(std::uint32_t product) { return static_cast<std::uint16_t>((product + 0x200) >> 10); }

}  // namespace

#endif
