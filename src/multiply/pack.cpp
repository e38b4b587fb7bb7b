// Packs: wide lanes back to narrow ones, the only place where products are rounded and saturated.
#include "frame/lanes.h"

#include "frame/arithmetic.h"
#include "multiply/fractions.h"

namespace {

// --- Which lanes are packed ------------------------------------------------------------------------------

template <class L>
using All = Read<L>;

// Every other lane.
template <class L, int First>
class Alternate {
 public:
  explicit Alternate(const void* acc) : lanes_(acc) {}
  auto operator[](int k) const { return lanes_[2 * k + First]; }

 private:
  Read<L> lanes_;
};
template <class L>
using Even = Alternate<L, 0>;
template <class L>
using Odd = Alternate<L, 1>;

// The two words of a 48-bit lane, the upper one as it stands in memory.
struct Words48 {
  word low, high;
};
class All48 {
 public:
  explicit All48(const void* acc) : words_(static_cast<const in_memory<word>*>(acc)) {}
  Words48 operator[](int i) const { return {words_[2 * i], words_[2 * i + 1]}; }

 private:
  const in_memory<word>* words_;
};

// --- Fixed packs -----------------------------------------------------------------------------------------

constexpr auto LOW = [](auto lane) { return lane; };
constexpr auto LOW8 = [](auto lane) { return static_cast<std::uint8_t>(lane); };
constexpr auto MIDDLE = [](std::uint64_t lane) { return static_cast<word>(lane) >> 16; };
constexpr auto HIGH = [](std::int64_t lane) { return lane >> 32; };
constexpr auto Q15 = [](std::uint64_t lane) { return q15(static_cast<word>(lane)); };
constexpr auto Q10 = [](std::uint64_t lane) { return q10(static_cast<word>(lane)); };

// --- Shifts ----------------------------------------------------------------------------------------------

// A shift right by a count within the type's width. Rounded, the last bit shifted out is added, which is
// half up without a sum that could overflow; nothing is shifted out by 0.
struct Rounded {
  template <class T>
  static T shift(T x, word s) {
    const word last = s == 0 ? 0 : s - 1;
    const auto mask = static_cast<T>(s == 0 ? 0 : 1);
    return static_cast<T>(shift_right(x, s) + (static_cast<T>(unsigned_bits(x) >> last) & mask));
  }
};
struct Truncated {
  template <class T>
  static T shift(T x, word s) {
    return shift_right(x, s);
  }
};

// Counts are unsigned, so that a negative one counts as the largest.
constexpr word clamped(word count, word bound) { return count > bound ? bound : count; }

template <class Lane, class T>
constexpr Lane narrowed(T x) {
  if constexpr (sizeof(T) == 8) {
    // In halves: no target but the newest compares 64-bit lanes.
    const auto low = static_cast<std::int32_t>(x);
    const auto high = static_cast<std::int32_t>(x >> 32);
    return high == low >> 31 ? low : sign_fill(high) ^ std::numeric_limits<std::int32_t>::max();
  } else {
    return saturate<Lane>(x);
  }
}

// A 24 or 64-bit lane, or a 48-bit lane that is packed to 32 bits, as the integer that it is.
template <class Shift, class Lane>
constexpr auto pack_lane = [](auto x, word count) {
  return narrowed<Lane>(Shift::shift(x, clamped(count, sizeof x == 4 ? 23 : 32)));
};

// A 48-bit lane packed to 16 bits needs no more than 32 bits of it: for a count up to 16 the lane
// clamped to 32 bits, since whatever lies beyond saturates anyway; above 16 the lane without its low 16
// bits, of which no shift leaves a trace.
constexpr std::int32_t low_part(Words48 x) {
  const auto low = static_cast<std::int32_t>(x.low);
  const auto high = static_cast<std::int32_t>(x.high << 16);
  const std::int32_t bound = sign_fill(high) ^ std::numeric_limits<std::int32_t>::max();
  return static_cast<word>(sign_fill(low)) << 16 == unsigned_bits(high) ? low : bound;
}
constexpr std::int32_t high_part(Words48 x) { return static_cast<std::int32_t>(x.high << 16 | x.low >> 16); }

template <class Shift>
constexpr auto pack48_low = [](Words48 x, word s) { return saturate<std::int16_t>(Shift::shift(low_part(x), s)); };
template <class Shift>
constexpr auto pack48_high = [](Words48 x, word s) { return saturate<std::int16_t>(Shift::shift(high_part(x), s - 16)); };
template <class Shift>
constexpr auto pack48_lane = [](Words48 x, word count) {
  const word s = clamped(count, 32);
  return saturate<std::int16_t>(Shift::shift(s > 16 ? high_part(x) : low_part(x), s > 16 ? s - 16 : s));
};

}  // namespace

#include "frame/stamp.h"

// KERNEL(OP, form, result layout, ..., lanes that are packed)
#define KERNEL_fixed(OP, R, RULE, ...)                                \
  template <class Out>                                                \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, Out r) {  \
    lanes<R::count>(result<R>(r), RULE, __VA_ARGS__(acc));            \
  }

// One count for all lanes.
#define KERNEL_shift(OP, R, SHIFT, ...)                                                                         \
  template <class Out>                                                                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, Out r) {                                \
    lanes<R::count>(result<R>(r), pack_lane<SHIFT, R::container>, __VA_ARGS__(acc), Same(count));               \
  }
#define KERNEL_shift48(OP, R, SHIFT, ...)                                                                       \
  template <class Out>                                                                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, Out r) {                                \
    const word s = clamped(count, 32);                                                                          \
    s > 16 ? lanes<R::count>(result<R>(r), pack48_high<SHIFT>, __VA_ARGS__(acc), Same(s))                       \
           : lanes<R::count>(result<R>(r), pack48_low<SHIFT>, __VA_ARGS__(acc), Same(s));                       \
  }

// A count a lane, in layout C.
#define KERNEL_counts(OP, R, SHIFT, C, ...)                                                                     \
  template <class Out>                                                                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, Out r) {                        \
    lanes<R::count>(result<R>(r), pack_lane<SHIFT, R::container>, __VA_ARGS__(acc), Read<C>(counts));           \
  }
#define KERNEL_counts48(OP, R, SHIFT, C, ...)                                                                   \
  template <class Out>                                                                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, Out r) {                        \
    lanes<R::count>(result<R>(r), pack48_lane<SHIFT>, __VA_ARGS__(acc), Read<C>(counts));                       \
  }

#include "multiply/pack.def"

#include "frame/stamp_end.h"
