// Products of an 8-bit and a 16-bit vector: the even bytes meet one vector, the odd bytes another.
#include "multiply/products.h"

namespace {

template <class Byte>
constexpr auto INTERLEAVED = [](std::uint16_t bytes, std::int16_t b, std::int16_t c) {
  return Both{term(static_cast<Byte>(bytes), b), term(static_cast<Byte>(bytes >> 8), c)};
};

}  // namespace

#include "multiply/stamp.h"

#include "multiply/mixed8x16.def"

#include "frame/stamp_end.h"
