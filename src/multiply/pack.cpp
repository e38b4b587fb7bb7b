// Packs: wide lanes back to narrow ones, shifted, rounded and saturated.
#include "frame/lanes.h"

#include "frame/arithmetic.h"
#include "multiply/fractions.h"
#include "multiply/saturated.h"
#include "multiply/shifted.h"

namespace {

// --- Which lanes are packed ------------------------------------------------------------------------------

template <class L>
using All = Read<L>;

// Every other 24-bit lane, the even ones (First = 0) or the odd ones (1): two are the halves of 64 bits.
template <int First>
class EveryOther {
 public:
  explicit EveryOther(const void* acc) : pairs_(acc) {}
  word operator[](int k) const { return static_cast<word>(pairs_[k] >> (32 * First)); }

 private:
  Read<u64x32> pairs_;
};

// --- Fixed packs -----------------------------------------------------------------------------------------

constexpr auto LOW = [](auto lane) { return lane; };
constexpr auto LOW8 = [](auto lane) { return static_cast<std::uint8_t>(lane); };
constexpr auto MIDDLE = [](std::uint64_t lane) { return static_cast<word>(lane) >> 16; };
constexpr auto HIGH = [](std::int64_t lane) { return lane >> 32; };
constexpr auto Q15 = [](std::uint64_t lane) { return q15(static_cast<word>(lane)); };
constexpr auto Q10 = [](std::uint64_t lane) { return q10(static_cast<word>(lane)); };

// --- Shifts ----------------------------------------------------------------------------------------------
// Counts are unsigned, so that a negative one counts as the largest.

constexpr word clamped(word count, word bound) { return count > bound ? bound : count; }

template <class C, int Bound>
struct OwnCounts {
  alignas(64) word count[C::count];
  explicit OwnCounts(const word* counts) {
    const Read<C> given(counts);
    for (int i = 0; i < C::count; ++i) count[i] = given[i] > Bound ? Bound : given[i];
  }
  Words operator[](int k) const { return load_register<word>(count, k); }
};
class SharedCount {
 public:
  SharedCount(word count, word bound) : count_(clamped(count, bound)) {}
  word operator[](int) const { return count_; }

 private:
  word count_;
};

// Register number k of words of the lanes, shifted and rounded.
template <class Rounding, class Lanes>
struct Words24 {
  template <class N>
  static Integers part(const word* acc, int k, N n) {
    return shifted24<Rounding>(Lanes::part(acc, k), n);
  }
};
template <class Rounding, class Lanes>
struct WordsOfPairs {
  template <class N>
  static Integers part(const word* acc, int k, N n) {
    return packed_pairs<Rounding, Lanes>(Lanes::lanes(acc, k), n);
  }
};

template <class R, class Parts, class N>
inline void pack(const word* acc, const N& counts, word* r) {
  Saturated<typename R::container, R::count> results;
  for (int k = 0; k < 4 * R::count / register_bytes; ++k)
    store_register(results.lane, k, Parts::part(acc, k, counts[k]));
  results.collect(r);
}

}  // namespace

#include "multiply/stamp.h"

// KERNEL(OP, form, result layout, rule, lanes that are packed)
#define KERNEL_fixed(OP, R, RULE, LANES)                               \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word* r) { \
    lanes<R::count>(result<R>(r), RULE, LANES(acc));                   \
  }

// KERNEL(OP, form, result layout, Words24 or WordsOfPairs, rounding, lanes that are packed, largest count)
#define KERNEL_shift(OP, R, WORDS, ROUNDING, LANES, BOUND)                         \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, word* r) { \
    pack<R, WORDS<ROUNDING, LANES>>(acc, SharedCount(count, BOUND), r);            \
  }
#define KERNEL_shift_every_other24(OP, R, ROUNDING, FIRST)                               \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, word* r) {       \
    pack_every_other24<R::container, ROUNDING, FIRST>(acc, clamped(count, word{23}), r); \
  }
#define KERNEL_shift48(OP, ROUNDING)                                               \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, word* r) { \
    pack48<ROUNDING>(acc, clamped(count, word{32}), r);                            \
  }

// The same by a count a lane, in layout C.
#define KERNEL_counts(OP, R, WORDS, ROUNDING, LANES, BOUND, C)                             \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, word* r) { \
    pack<R, WORDS<ROUNDING, LANES>>(acc, OwnCounts<C, BOUND>(counts), r);                  \
  }

#if defined __AVX512BW__
#define KERNEL_counts48(OP, ROUNDING)                                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, word* r) { \
    pack48_by_counts<ROUNDING>(acc, counts, r);                                            \
  }
#else
#define KERNEL_counts48(OP, ROUNDING) KERNEL_counts(OP, i16x32, WordsOfPairs, ROUNDING, AllLanes<48>, 32, u16x32)
#endif

#include "multiply/pack.def"

#include "frame/stamp_end.h"
