// Complex products: lane 2k of a vector is the real part, lane 2k + 1 the imaginary part of number k.
#include "multiply/products.h"

namespace {

template <class Part>
struct Complex {
  Part re, im;
};

// A number of two 16-bit parts is a word, one of two 32-bit parts a pair of words.
constexpr Complex<std::int16_t> number(std::uint32_t bits) {
  return {static_cast<std::int16_t>(bits), static_cast<std::int16_t>(bits >> 16)};
}
constexpr Complex<std::int32_t> number(std::uint64_t bits) {
  return {static_cast<std::int32_t>(bits), static_cast<std::int32_t>(bits >> 32)};
}

// Parts are taken out of numbers one at a time: their product is best the processor's own.
template <class Part>
constexpr std::uint64_t product_of_parts(Part x, Part y) {
  if constexpr (sizeof(Part) == 4)
    return unsigned_bits(std::int64_t{x} * y);
  else
    return term(x, y);
}

// The terms with the second factor's real part, those with its imaginary part, and all of them.
constexpr auto REAL = [](auto a, auto b) {
  const auto x = number(a), y = number(b);
  return Both{product_of_parts(x.re, y.re), product_of_parts(x.im, y.re)};
};
constexpr auto IMAGINARY = [](auto a, auto b) {
  const auto x = number(a), y = number(b);
  return Both{0 - product_of_parts(x.im, y.im), product_of_parts(x.re, y.im)};
};
constexpr auto COMPLEX = [](auto a, auto b) {
  const auto real = REAL(a, b), imaginary = IMAGINARY(a, b);
  return Both{real.even + imaginary.even, real.odd + imaginary.odd};
};
// The second factor conjugated: its imaginary part changes sign.
constexpr auto CONJUGATE = [](auto a, auto b) {
  const auto real = REAL(a, b), imaginary = IMAGINARY(a, b);
  return Both{real.even - imaginary.even, real.odd - imaginary.odd};
};

}  // namespace

#include "multiply/stamp.h"

#include "multiply/complex.def"

#include "frame/stamp_end.h"
