// Vectors times coefficients where lanes cross: windows over neighbouring lanes, and channels that alternate.
#include <cstring>

#include "multiply/taps.h"

namespace {

// Four neighbours of the lanes of a followed by those of b.
template <class R, class L, class C>
struct Window {
  struct alignas(64) Joined {
    Joined(const word* a, const word* b) {
      std::memcpy(words, a, 64);
      std::memcpy(words + 16, b, 64);
    }
    const word* from_lane(int i) const {
      return reinterpret_cast<const word*>(reinterpret_cast<const unsigned char*>(words) + i * L::bits / 8);
    }
    word words[32];
  };
  using Quad = Taps<R, 1, L, C, std::make_index_sequence<4>>;

  template <class Rule>
  static inline void fresh(Rule rule, const word* a, const word* b, const word* s, word* r) {
    const Joined x(a, b);
    Quad::fresh(rule, x.words, x.from_lane(1), x.from_lane(2), x.from_lane(3), s, r);
  }
  template <class Rule>
  static inline void add(Rule rule, const word* acc, const word* a, const word* b, const word* s, word* r) {
    const Joined x(a, b);
    Quad::add(rule, acc, x.words, x.from_lane(1), x.from_lane(2), x.from_lane(3), s, r);
  }
};

// Two channels, whose operands alternate: the first makes the even lanes of the result.
constexpr auto CHANNEL = [](auto even, auto odd) { return Both{even, odd}; };
constexpr auto CHANNEL_PAIR = [](auto even, auto odd, auto even2, auto odd2) { return Both{even + even2, odd + odd2}; };

}  // namespace

#include "frame/stamp.h"

// KERNEL(OP, kind_window, result layout, operand layout, coefficients)
#define KERNEL_fresh_window(OP, R, L, C) KERNEL_OF_WORDS(OP, (Window<R, L, C>::fresh(SUM, units...)))
#define KERNEL_add_window(OP, R, L, C) KERNEL_OF_WORDS(OP, (Window<R, L, C>::add(SUM, units...)))

// KERNEL(OP, kind_channels, result layout, rule, number of operands, their layout, coefficients)
#define KERNEL_CHANNELS(OP, KIND, R, RULE, N, L, C) \
  KERNEL_OF_WORDS(OP, (Taps<R, 2, L, C, std::make_index_sequence<N>>::KIND(RULE, units...)))
#define KERNEL_fresh_channels(OP, ...) KERNEL_CHANNELS(OP, fresh, __VA_ARGS__)
#define KERNEL_add_channels(OP, ...) KERNEL_CHANNELS(OP, add, __VA_ARGS__)

#include "multiply/windows.def"

#include "frame/stamp_end.h"
