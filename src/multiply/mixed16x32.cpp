// Products of a 16-bit factor, one of the two in each word of a vector, and a 32-bit factor.
#include "multiply/products.h"

namespace {

// The 16-bit factor is extended to a word, so that the product is one of two words.
template <class Factor>
constexpr auto word_of = [](word bits) {
  using Word = std::conditional_t<std::is_signed_v<Factor>, std::int32_t, std::uint32_t>;
  return static_cast<Word>(static_cast<Word>(bits << 16) >> 16);
};

template <class Factor>
constexpr auto EVEN = [](word pair, auto y) { return term(word_of<Factor>(pair), y); };
template <class Factor>
constexpr auto ODD = [](word pair, auto y) { return term(word_of<Factor>(pair >> 16), y); };
template <class Factor>
constexpr auto ODD_HIGH = [](word pair, auto y) { return ODD<Factor>(pair, y) << 16; };

}  // namespace

#include "multiply/stamp.h"

#include "multiply/mixed16x32.def"

#include "frame/stamp_end.h"
