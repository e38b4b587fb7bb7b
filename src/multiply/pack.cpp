// Packs: wide lanes back to narrow ones, the only place where products are rounded and saturated.
#include "frame/lanes.h"

#include "frame/arithmetic.h"
#include "multiply/fractions.h"
#include "multiply/saturated.h"

namespace {

// --- Which lanes are packed ------------------------------------------------------------------------------

template <class L>
using All = Read<L>;

// Every other 24-bit lane: two of them are the halves of a 64-bit container.
template <int First>
class Alternate24 {
 public:
  explicit Alternate24(const void* acc) : pairs_(acc) {}
  word operator[](int k) const { return static_cast<word>(pairs_[k] >> (32 * First)); }

 private:
  Read<u64x32> pairs_;
};

// The two words of a lane: of a 48-bit lane the upper one as it stands in memory.
struct Words {
  word low, high;
};
class InWords {
 public:
  explicit InWords(const void* lanes) : words_(static_cast<const in_memory<word>*>(lanes)) {}
  Words operator[](int i) const { return {words_[2 * i], words_[2 * i + 1]}; }

 private:
  const in_memory<word>* words_;
};

// The whole containers of 64-bit lanes, which compilers read better than signed ones.
using u64x16 = Layout<std::uint64_t, 64, 16>;

// --- Fixed packs -----------------------------------------------------------------------------------------

constexpr auto LOW = [](auto lane) { return lane; };
constexpr auto LOW8 = [](auto lane) { return static_cast<std::uint8_t>(lane); };
constexpr auto MIDDLE = [](std::uint64_t lane) { return static_cast<word>(lane) >> 16; };
constexpr auto HIGH = [](std::int64_t lane) { return lane >> 32; };
constexpr auto Q15 = [](std::uint64_t lane) { return q15(static_cast<word>(lane)); };
constexpr auto Q10 = [](std::uint64_t lane) { return q10(static_cast<word>(lane)); };

// --- Shifts ----------------------------------------------------------------------------------------------
// The rules make words, which saturate to the result's lanes in a step of their own.

// Counts are unsigned, so that a negative one counts as the largest.
constexpr word clamped(word count, word bound) { return count > bound ? bound : count; }

// x shifted right by a count that all lanes share, or by the lane's own.
// (A 64-bit lane is shifted as unsigned with its sign folded away.)
constexpr std::int32_t shifted_own(std::int32_t x, word s) { return x >> s; }
constexpr std::int64_t shifted_own(std::int64_t x, word s) {
  const std::int64_t sign = sign_fill(x);
  return static_cast<std::int64_t>(unsigned_bits(x ^ sign) >> std::uint64_t{s}) ^ sign;
}
constexpr auto own = [](auto x, word s) { return shifted_own(x, s); };
// What shift_right needs of a shared count is two words long for 64-bit lanes, and slow to come by.
constexpr auto shared = [](auto x, word s) {
  if constexpr (sizeof x == 8 && lanes_shift_alone)
    return shifted_own(x, s);
  else
    return shift_right(x, s);
};

// Half of x, rounded down: few targets shift 64-bit lanes as signed.
constexpr std::int32_t half(std::int32_t x) { return x >> 1; }
constexpr std::int64_t half(std::int64_t x) { return shift_right(x, 1); }

// Rounded half up, x / 2^s is half of x / 2^(s-1), plus a half: the last bit shifted out is added.
struct Rounded {
  template <class T>
  static constexpr T halve(T twice) {
    return static_cast<T>(half(twice) + (twice & 1));
  }
};
struct Truncated {
  template <class T>
  static constexpr T halve(T twice) {
    return half(twice);
  }
};

// A 24-bit lane, moved to the top of its word and back down to twice itself: so 0 is a count like others.
template <class Rounding>
constexpr auto pack24 =
    [](auto shift, word x, word s) { return Rounding::halve(shift(static_cast<std::int32_t>(x << 8), s + 7)); };

// 48-bit lanes that are packed to 32 bits, likewise, and 64-bit lanes, which have no room to spare.
template <class Rounding>
constexpr auto pack48_wide = [](auto shift, std::uint64_t x, word s) {
  return Rounding::halve(shift(static_cast<std::int64_t>(x << 16), s + 15));
};
template <class Rounding>
constexpr auto pack64 = [](auto shift, std::uint64_t x, word s) {
  const word nothing = s == 0;
  const std::int64_t twice = shift(static_cast<std::int64_t>(x), s - 1 + nothing);
  return nothing ? twice : Rounding::halve(twice);
};

// A 48-bit lane packed to 16 bits needs no more than 32 bits of it: for a count up to 16 the lane
// clamped to 32 bits, since whatever lies beyond saturates anyway; above 16 the lane without its low 16
// bits, of which no shift leaves a trace.
constexpr std::int32_t low_part(Words x) {
  const auto low = static_cast<std::int32_t>(x.low);
  const auto high = static_cast<std::int32_t>(x.high << 16);
  const std::int32_t bound = (high >> 31) ^ std::numeric_limits<std::int32_t>::max();
  return static_cast<word>(low >> 31) << 16 == unsigned_bits(high) ? low : bound;
}
constexpr std::int32_t high_part(Words x) { return static_cast<std::int32_t>(x.high << 16 | x.low >> 16); }

constexpr auto pack48_unshifted = [](Words x) { return low_part(x); };
template <class Rounding>
constexpr auto pack48_low = [](Words x, word s) { return Rounding::halve(shared(low_part(x), s - 1)); };
template <class Rounding>
constexpr auto pack48_high = [](Words x, word s) { return Rounding::halve(shared(high_part(x), s - 17)); };

template <class Rounding>
constexpr auto pack48_own = [](Words x, auto count) {
  const word s = clamped(static_cast<word>(count), 32);
  const std::int32_t part = s > 16 ? high_part(x) : low_part(x);
  const word left = s > 16 ? s - 16 : s;
  const std::int32_t twice = own(part, left - (s != 0));
  return s == 0 ? twice : Rounding::halve(twice);
};

// Clamps a pair of words to one, in halves: no target but the newest compares 64-bit lanes.
constexpr auto one_word = [](Words x) {
  const auto low = static_cast<std::int32_t>(x.low);
  const auto high = static_cast<std::int32_t>(x.high);
  return high == low >> 31 ? low : (high >> 31) ^ std::numeric_limits<std::int32_t>::max();
};

// Applies a rule that makes words or pairs of them to every lane, and saturates.
template <class R, class Rule, class... Operands>
inline void pack(word* r, Rule rule, const Operands&... operands) {
  using Result = decltype(rule(operands[0]...));
  if constexpr (sizeof(Result) == 8) {
    alignas(64) std::int64_t pairs[R::count];
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < R::count; ++i) pairs[i] = rule(operands[i]...);
    lanes<R::count>(result<R>(r), one_word, InWords(pairs));
  } else {
    Saturated<typename R::container, R::count> words;
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < R::count; ++i) words.lane[i] = rule(operands[i]...);
    words.collect(r);
  }
}

template <class R, class Rounding, class Lanes>
inline void pack48(const Lanes& lanes, word count, word* r) {
  const word s = clamped(count, 32);
  if (s == 0) return pack<R>(r, pack48_unshifted, lanes);
  s > 16 ? pack<R>(r, pack48_high<Rounding>, lanes, Same(s)) : pack<R>(r, pack48_low<Rounding>, lanes, Same(s));
}

}  // namespace

#include "frame/stamp.h"

// KERNEL(OP, form, result layout, rule, lanes that are packed)
#define KERNEL_fixed(OP, R, RULE, LANES)                               \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word* r) { \
    lanes<R::count>(result<R>(r), RULE, LANES(acc));                   \
  }

// One count for all lanes, no more than BOUND.
#define KERNEL_shift(OP, R, RULE, BOUND, LANES)                                    \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, word* r) { \
    const word s = clamped(count, BOUND);                                          \
    pack<R>(                                                                       \
        r, [s](auto x) { return RULE(shared, x, s); }, LANES(acc));                \
  }
#define KERNEL_shift48(OP, R, ROUNDING, LANES)                                     \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, word* r) { \
    pack48<R, ROUNDING>(LANES(acc), count, r);                                     \
  }

// A count a lane, in layout C.
#define KERNEL_counts(OP, R, RULE, BOUND, LANES, C)                                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, word* r) {               \
    const auto rule = [](auto x, auto n) { return RULE(own, x, clamped(static_cast<word>(n), BOUND)); }; \
    pack<R>(r, rule, LANES(acc), Read<C>(counts));                                                       \
  }
#define KERNEL_counts48(OP, R, ROUNDING, LANES, C)                                         \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, word* r) { \
    pack<R>(r, pack48_own<ROUNDING>, LANES(acc), Read<C>(counts));                         \
  }

#include "multiply/pack.def"

#include "frame/stamp_end.h"
