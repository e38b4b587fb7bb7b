// Vectors times coefficients that come in words of the scalar core: one, two or four products a lane.
// Vector operand v of V meets coefficient V - 1 - v of the word, counted from its low end and around:
// the last operand meets the lowest coefficient.
#ifndef KASTARRI_MULTIPLY_TAPS_H
#define KASTARRI_MULTIPLY_TAPS_H

#include <utility>

#include "multiply/products.h"

namespace {

// Coefficients stored as Stored in each of Words words, which lanes use in turn; they multiply as Factor.
template <class Stored, int Words = 1, class Factor = Stored>
struct Coefficients {
  using factor = Factor;
  static constexpr int words = Words;
  static constexpr int in_a_word = 4 / sizeof(Stored);

  static Factor at(word w, int j) {
    return static_cast<Stored>(w >> (8 * static_cast<int>(sizeof(Stored)) * (j % in_a_word)));
  }
};

// One coefficient of every lane: the same one, or those of several words in turn.
template <class C, bool = C::words == 1>
class Coefficient {
 public:
  Coefficient(const word* words, int j) : value_(C::at(words[0], j)) {}
  auto operator[](int) const { return value_; }

 private:
  typename C::factor value_;
};

// All ones in the lanes whose number has the bit, as a table: compilers blend by it in registers, where
// an array filled at run time would go through memory.
template <class Lane, int Bit>
struct LanesWithBit {
  Lane mask[64] = {};
  constexpr LanesWithBit() {
    for (int i = 0; i < 64; ++i) mask[i] = static_cast<Lane>(i & Bit ? -1 : 0);
  }
};
template <class Lane, int Bit>
constexpr LanesWithBit<Lane, Bit> lanes_with_bit;

template <class C>
class Coefficient<C, false> {
 public:
  Coefficient(const word* words, int j) {
    for (int w = 0; w < C::words; ++w) values_[w] = C::at(words[w], j);
  }
  auto operator[](int i) const {
    if constexpr (C::words == 2) {
      return turn<1>(i, values_[0], values_[1]);
    } else {
      return turn<2>(i, turn<1>(i, values_[0], values_[1]), turn<1>(i, values_[2], values_[3]));
    }
  }

 private:
  using factor = typename C::factor;
  template <int Bit>
  static factor turn(int i, factor without, factor with) {
    return static_cast<factor>(without ^ ((without ^ with) & lanes_with_bit<factor, Bit>.mask[i]));
  }
  factor values_[C::words];
};

// Lane i of an operand times its coefficient.
template <class L, class C>
struct Tap {
  Read<L> lane;
  Coefficient<C> coefficient;
  auto operator[](int i) const { return term(lane[i], coefficient[i]); }
};

constexpr auto SUM = [](auto... terms) { return (terms + ...); };
template <int Operands, int Channels>
constexpr int coefficient_number(int operand) {
  return Operands / Channels - 1 - operand / Channels;
}

// The semantic functions: Operands vectors of layout L, then the words of coefficients, the accumulator
// before them, the result last.
template <class R, int Channels, class L, class C, class Operands, class Words = std::make_index_sequence<C::words>>
struct Taps;

template <std::size_t>
using word_image = const word*;

template <class R, int Channels, class L, class C, std::size_t... V, std::size_t... W>
struct Taps<R, Channels, L, C, std::index_sequence<V...>, std::index_sequence<W...>> {
  template <class Rule, class Kind>
  static inline void run(Rule rule, const Kind& kind, word_image<V>... vectors, const word* words, word* r) {
    constexpr int operands = sizeof...(V);
    multiply<L::count>(result<R>(r), kind, rule,
                       Tap<L, C>{Read<L>(vectors), {words, coefficient_number<operands, Channels>(V)}}...);
  }
  template <class Rule>
  static inline void fresh(Rule rule, word_image<V>... vectors, word_image<W>... words, word* r) {
    const word all[] = {*words...};
    run(rule, Fresh{}, vectors..., all, r);
  }
  template <class Rule>
  static inline void add(Rule rule, const word* acc, word_image<V>... vectors, word_image<W>... words, word* r) {
    const word all[] = {*words...};
    run(rule, Added<R>{Read<whole<R>>(acc)}, vectors..., all, r);
  }
};

using s8 = Coefficients<std::int8_t>;
using u8 = Coefficients<std::uint8_t>;
using s8_in_2 = Coefficients<std::int8_t, 2>;
using u8_in_2 = Coefficients<std::uint8_t, 2>;
using s8_in_4 = Coefficients<std::int8_t, 4>;
using u8_in_4 = Coefficients<std::uint8_t, 4>;
using s8_as_16 = Coefficients<std::int8_t, 1, std::int16_t>;
using s16 = Coefficients<std::int16_t>;
using u16 = Coefficients<std::uint16_t>;
using s16_in_2 = Coefficients<std::int16_t, 2>;
using u16_in_2 = Coefficients<std::uint16_t, 2>;

}  // namespace

// A semantic function whose operands, all arrays of words, go to CALL as `units`.
#define KERNEL_OF_WORDS(OP, CALL)                               \
  template <class... Units>                                     \
  static inline void KASTARRI_SEMANTIC(OP)(Units * ... units) { \
    CALL;                                                       \
  }

#endif
