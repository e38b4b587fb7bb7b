// What all multiplies share. A multiply is three choices that do not touch each other:
//   the factors' layouts, which carry their signedness;
//   the arrangement, a rule that makes a lane's sum of products from the factors;
//   the kind, which puts that sum into the result: Fresh, Added to the accumulator, Subtracted from it.
#ifndef KASTARRI_MULTIPLY_PRODUCTS_H
#define KASTARRI_MULTIPLY_PRODUCTS_H

#include <cstdint>
#include <type_traits>

#include "frame/arithmetic.h"
#include "frame/lanes.h"

namespace {

// The whole containers of a fresh accumulator's 24 and 48-bit lanes, and of a complex number's two words.
using i32x64 = Layout<std::int32_t, 32, 64>;
using i64x32 = Layout<std::int64_t, 64, 32>;
using u64x8 = Layout<std::uint64_t, 64, 8>;

template <class X, class Y>
constexpr bool both_unsigned = std::is_unsigned_v<X>&& std::is_unsigned_v<Y>;

// Whether words of which both are signed, or one, are best multiplied as signed.
#if defined __AVX512BW__
template <class X, class Y>
constexpr bool multiply_as_signed = true;
#elif defined __AVX2__
template <class X, class Y>
constexpr bool multiply_as_signed = std::is_signed_v<X>&& std::is_signed_v<Y>;
#else
template <class X, class Y>
constexpr bool multiply_as_signed = false;
#endif

// The exact product of 32-bit factors, not both unsigned. Taken as signed, an unsigned one with its top bit set is 2^32
// too small; taken as unsigned, a factor below zero is 2^32 too large.
template <class X, class Y>
constexpr std::int64_t product_of_words(X x, Y y) {
  const std::uint32_t a = unsigned_bits(x), b = unsigned_bits(y);
  const auto i = static_cast<std::int32_t>(x), j = static_cast<std::int32_t>(y);
  const auto where_negative = [](std::int32_t factor, std::uint32_t other) {
    return other & unsigned_bits(factor >> 31);
  };
  if constexpr (multiply_as_signed<X, Y>) {
    const std::uint32_t missing =
        (std::is_signed_v<X> ? 0 : where_negative(i, b)) + (std::is_signed_v<Y> ? 0 : where_negative(j, a));
    return static_cast<std::int64_t>(unsigned_bits(std::int64_t{i} * j) + (std::uint64_t{missing} << 32));
  } else {
    const std::uint32_t excess =
        (std::is_signed_v<X> ? where_negative(i, b) : 0) + (std::is_signed_v<Y> ? where_negative(j, a) : 0);
    return static_cast<std::int64_t>(std::uint64_t{a} * b - (std::uint64_t{excess} << 32));
  }
}

// The exact product of two factors, in a type as narrow as holds it: narrow types make fast loops.
template <class X, class Y>
constexpr auto product(X x, Y y) {
  if constexpr (sizeof(X) == 4 && sizeof(Y) == 4) {
    if constexpr (both_unsigned<X, Y>)
      return std::uint64_t{x} * y;
    else
      return product_of_words(x, y);
  } else if constexpr (sizeof(X) == 1 && sizeof(Y) == 1) {
    using Product = std::conditional_t<both_unsigned<X, Y>, std::uint16_t, std::int16_t>;
    return static_cast<Product>(x * y);
  } else if constexpr (both_unsigned<X, Y>) {
    return std::uint32_t{x} * y;
  } else {
    return std::int32_t{x} * y;
  }
}

// Products of bytes are summed for 24-bit lanes, in a word, others for 48 and 64-bit lanes in a pair of
// words. Sums are unsigned: they wrap, and whatever passes the lane's top bit is cut off in the end.
template <class X, class Y>
using sum_of = std::conditional_t<sizeof(X) == 1 || sizeof(Y) == 1, std::uint32_t, std::uint64_t>;

template <class X, class Y>
constexpr sum_of<X, Y> term(X x, Y y) {
  return static_cast<sum_of<X, Y>>(product(x, y));
}

constexpr auto SINGLE = [](auto a, auto b) { return term(a, b); };

// What a rule returns that makes two lanes of the result, 2k and 2k + 1, from lanes k of its operands.
template <class Sum>
struct Both {
  Sum even, odd;
};
template <class Sum>
Both(Sum, Sum) -> Both<Sum>;

// --- Kinds ------------------------------------------------------------------------------------------------
// What becomes of a sum of products: it is the result, or is added to what the accumulator holds, or subtracted from
// it. with(acc, sum) is the result, of a lane or of a register of lanes.

struct Fresh {};

struct Added {
  template <class V>
  static V with(V acc, V sum) {
    return static_cast<V>(acc + sum);
  }
};

struct Subtracted {
  template <class V>
  static V with(V acc, V sum) {
    return static_cast<V>(acc - sum);
  }
};

// The whole containers of an accumulator: what they hold above the lane's own bits is cut from the sum.
template <class R>
using whole = Layout<std::make_unsigned_t<typename R::container>, 8 * sizeof(typename R::container), R::count>;

// Lane i of the result. A fresh result has no accumulator to read.
template <class R, class Kind, class Sum>
inline Sum accumulated(const void* acc, int i, Sum sum) {
  if constexpr (std::is_same_v<Kind, Fresh>)
    return sum;
  else
    return Kind::with(static_cast<Sum>(Read<whole<R>>(acc)[i]), sum);
}

// --- The loop ---------------------------------------------------------------------------------------------

template <class R, class Kind, class Out, class Sum>
inline void put(const Out& out, const void* acc, int i, Sum sum) {
  out.put(i, accumulated<R, Kind>(acc, i, sum));
}
template <class R, class Kind, class Out, class Sum>
inline void put(const Out& out, const void* acc, int k, Both<Sum> sums) {
  const auto even = accumulated<R, Kind>(acc, 2 * k, sums.even);
  const auto odd = accumulated<R, Kind>(acc, 2 * k + 1, sums.odd);
  out.put(2 * k, even);
  out.put(2 * k + 1, odd);
}

// Lane i (lanes 2i and 2i + 1) of the result from lanes i of the operands, for i = 0 .. Steps - 1.
template <class R, class Kind, int Steps, class Out, class Rule, class... Operands>
inline void multiply(const void* acc, const Out& out, Rule rule, const Operands&... operands) {
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < Steps; ++i) put<R, Kind>(out, acc, i, rule(operands[i]...));
}

template <class>
using image = const void*;

template <class L, class... Ls>
constexpr int lanes_of = L::count;

// Operands of layouts Ls.
template <const auto& rule, class R, class Kind, class... Ls>
struct ByLane {
  template <class Out>
  static inline void run(const void* acc, image<Ls>... operands, Out r) {
    multiply<R, Kind, lanes_of<Ls...>>(acc, result<R>(r), rule, Read<Ls>(operands)...);
  }
};

}  // namespace

// The semantic function of a kind: operands first, before them the accumulator if the kind has one, the result last.
// The last arguments are the function that it hands them to, which always takes an accumulator.
#define KERNEL_OF_KIND(OP, KIND, ...)                                               \
  template <class... Units>                                                         \
  [[gnu::always_inline]] static inline void KASTARRI_SEMANTIC(OP)(Units... units) { \
    if constexpr (std::is_same_v<KIND, Fresh>)                                      \
      __VA_ARGS__(nullptr, units...);                                               \
    else                                                                            \
      __VA_ARGS__(units...);                                                        \
  }

// KERNEL(OP, by_lane, kind, result layout, rule, operand layouts ...). A fresh sum that cannot pass the lane's top bit
// is written as a whole container, which it fills in canonical form by itself.
#define KERNEL_by_lane(OP, KIND, R, RULE, ...) KERNEL_OF_KIND(OP, KIND, ByLane<RULE, R, KIND, __VA_ARGS__>::run)

#endif
