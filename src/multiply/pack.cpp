// Packs: wide lanes back to narrow ones, shifted, rounded and saturated.
#include "frame/lanes.h"

#include "frame/arithmetic.h"
#include "multiply/fractions.h"
#include "multiply/saturated.h"
#include "multiply/scaled.h"
#include "multiply/shifted.h"

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

// A register of these lanes.
struct Whole24 {
  static Word part(const void* acc, int k) { return load_register<word>(acc, k); }
};
template <int First>
struct Part24 {
  static Word part(const void* acc, int k) {
    const auto a = load_register<std::uint8_t>(acc, 2 * k), b = load_register<std::uint8_t>(acc, 2 * k + 1);
    return as<word>(bits_of(in_order<std::uint64_t>(bits_of(every_other_word<First>(a, b)))));
  }
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
// The rules make words, or pairs of them, which saturate to the result's lanes in a step of their own.

// Counts are unsigned, so that a negative one counts as the largest.
template <class Count>
constexpr Count clamped(Count count, Count bound) {
  return count > bound ? bound : count;
}

// Lanes of 64 bits are shifted as unsigned, moved up by half their range, since few targets shift them as
// signed: this is where that half goes.
constexpr std::uint64_t half_range = std::uint64_t{1} << 63;
struct ShiftedHalf {
  std::uint64_t by[64] = {};
  constexpr ShiftedHalf() {
    for (int s = 0; s < 64; ++s) by[s] = half_range >> s;
  }
};
constexpr ShiftedHalf shifted_half;

// x shifted right by a count that all lanes share, or by the lane's own.
struct Shared {
  [[maybe_unused]] static constexpr bool scales = false, is_signed = false;
  static constexpr std::int32_t shift(std::int32_t x, word s) { return shift_right(x, s); }
  static constexpr std::uint64_t shift(std::uint64_t x, word s) { return x >> s; }
  // Out of a table: to shift two words by a run-time count the compiler goes through memory in two halves.
  static std::uint64_t half_range_by(word s) { return shifted_half.by[s]; }
};
class Own {
 public:
  [[maybe_unused]] static constexpr bool scales = !lanes_shift_alone, is_signed = pairs_shift_signed;
  static constexpr std::int32_t shift(std::int32_t x, word s) { return x >> s; }
  static constexpr std::int64_t shift(std::int64_t x, word s) { return x >> std::int64_t{s}; }
  static constexpr std::uint64_t shift(std::uint64_t x, word s) { return x >> std::uint64_t{s}; }
  std::uint64_t half_range_by(word s) const { return half_range_ >> std::uint64_t{s}; }

 private:
  // Compilers do not vectorise shifts of what they know to be constant.
  static std::uint64_t unknown_half_range() {
    const std::uint64_t* at = shifted_half.by;
    asm("" : "+r"(at));
    return *at;
  }
  std::uint64_t half_range_ = unknown_half_range();
};

// Rounded half up, x / 2^s is half of x / 2^(s-1), plus a half: the last bit shifted out is added.
struct Rounded {
  [[maybe_unused]] static constexpr double added = 0.5;
  template <class Shift, class T>
  static constexpr T down(Shift, T x, word s) {
    const T twice = Shift::shift(x, s - 1);
    return static_cast<T>(twice - (twice >> 1));
  }
  // For a count that may be 0.
  template <class Shift, class T>
  static constexpr T down_from_zero(Shift, T x, word s) {
    const auto bits = unsigned_bits(x);
    return static_cast<T>(Shift::shift(x, s) + static_cast<T>(Shift::shift(bits + bits, s) & 1));
  }
};
struct Truncated {
  [[maybe_unused]] static constexpr double added = 0;
  template <class Shift, class T>
  static constexpr T down(Shift, T x, word s) {
    return Shift::shift(x, s);
  }
  template <class Shift, class T>
  static constexpr T down_from_zero(Shift, T x, word s) {
    return Shift::shift(x, s);
  }
};

// A lane of at most 24 bits shifted right by its own count where the target has no such shift: scaled as a number,
// as in scaled.h.
template <class Rounding>
inline std::int32_t scaled(float x, word s) {
  const float y = x * __builtin_bit_cast(float, (127 - s) << 23) + static_cast<float>(Rounding::added);
  const auto towards_zero = static_cast<std::int32_t>(y);
  return towards_zero - (y < static_cast<float>(towards_zero));
}

// A 24-bit lane, at the top of its word: so 0 is a count like others.
template <class Rounding>
constexpr auto pack24 = [](auto shift, word x, word s) {
  const auto top = static_cast<std::int32_t>(x << 8);
  if constexpr (decltype(shift)::scales)
    return scaled<Rounding>(static_cast<float>(top), s + 8);
  else
    return Rounding::down(shift, top, s + 8);
};

// Lanes of 48 bits likewise, and of 64, which have no room to spare.
template <int Bits, class Rounding>
struct PackPairs {
  using number = std::conditional_t<Bits == 48, Number48, Number64>;
  using rounding = Rounding;

  template <class Shift>
  auto operator()(Shift shift, std::uint64_t x, word s) const {
    constexpr int room = 64 - Bits;
    if constexpr (Shift::is_signed)
      return down(shift, static_cast<std::int64_t>(x << room), s + room);
    else
      return static_cast<std::int64_t>(down(shift, x << room ^ half_range, s + room) - shift.half_range_by(s + room));
  }

 private:
  template <class Shift, class T>
  static constexpr T down(Shift shift, T x, word s) {
    if constexpr (Bits == 64) return Rounding::down_from_zero(shift, x, s);
    return Rounding::down(shift, x, s);
  }
};
template <class Rounding>
using Pack48 = PackPairs<48, Rounding>;
template <class Rounding>
using Pack64 = PackPairs<64, Rounding>;

// Applies a rule that makes words or pairs of them to every lane, and saturates.
template <class R, class Rule, class... Operands>
inline void pack(word* r, Rule rule, const Operands&... operands) {
  Saturated<decltype(rule(operands[0]...)), typename R::container, R::count> results;
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < R::count; ++i) results.lane[i] = rule(operands[i]...);
  results.collect(r);
}

// The same by counts of the lanes' own.
template <class R, int Bound, class Rule, class Lanes, class Counts>
inline void pack_by_counts(word* r, Rule rule, const Lanes& lanes_packed, const Counts& counts) {
  using Count = decltype(counts[0]);
  if constexpr (Own::scales && sizeof(decltype(lanes_packed[0])) == 8) {
    alignas(16) std::uint64_t lane[R::count];
    alignas(16) word count[R::count];
    for (int i = 0; i < R::count; ++i) lane[i] = lanes_packed[i];
    for (int i = 0; i < R::count; ++i) count[i] = clamped(counts[i], Count{Bound});
    Saturated<std::int32_t, typename R::container, R::count> words;
    scale_lanes<typename Rule::number, typename Rule::rounding, R::count>(lane, count, words.lane);
    words.collect(r);
  } else {
    const Own own;
    const auto by_count = [&](auto x, Count n) { return rule(own, x, clamped(n, Count{Bound})); };
    pack<R>(r, by_count, lanes_packed, counts);
  }
}

template <class R, class Rounding, class Lanes>
inline void pack24_shifted(const word* acc, word count, word* r) {
  const word s = clamped(count, word{23});
  Saturated<std::int32_t, typename R::container, R::count> results;
  for (int k = 0; k < 4 * R::count / register_bytes; ++k)
    store_register(results.lane, k, shifted24<Rounding>(Lanes::part(acc, k), s));
  results.collect(r);
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
    const word s = clamped(count, word{BOUND});                                    \
    pack<R>(                                                                       \
        r, [s](auto x) { return RULE(Shared{}, x, s); }, LANES(acc));              \
  }
#define KERNEL_shift24(OP, R, ROUNDING, LANES)                                     \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, word* r) { \
    pack24_shifted<R, ROUNDING, LANES>(acc, count, r);                             \
  }
#define KERNEL_shift48(OP, ROUNDING)                                               \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, word count, word* r) { \
    pack48<ROUNDING>(acc, clamped(count, word{32}), r);                            \
  }

// A count a lane, in layout C.
#define KERNEL_counts(OP, R, RULE, BOUND, LANES, C)                                        \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, word* r) { \
    pack_by_counts<R, BOUND>(r, RULE, LANES(acc), Read<C>(counts));                        \
  }

#define KERNEL_counts48(OP, ROUNDING)                                                       \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* counts, word* r) {  \
    if constexpr (lanes_shift_alone && !pairs_shift_signed)                                 \
      pack48_by_counts<ROUNDING>(acc, counts, r);                                           \
    else                                                                                    \
      pack_by_counts<i16x32, 32>(r, Pack48<ROUNDING>{}, All<u64x32>(acc), Read<u16x32>(counts)); \
  }

#include "multiply/pack.def"

#include "frame/stamp_end.h"
