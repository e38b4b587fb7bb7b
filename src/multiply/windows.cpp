// Vectors times coefficients where lanes cross: windows over neighbouring lanes, and channels that alternate.
#include "multiply/taps.h"

namespace {

// The lanes of a from number First on, followed by those of b.
template <class L, int First>
struct Neighbours {
  const word *a, *b;
  Bytes part(int k) const {
    const bool last = k + 1 == 64 / register_bytes;
    const auto next = last ? load_register<std::uint8_t>(b, 0) : load_register<std::uint8_t>(a, k + 1);
    return from_byte<First * L::bits / 8>(load_register<std::uint8_t>(a, k), next);
  }
};

// Four neighbours of the lanes of a followed by those of b.
template <class R, class Kind, class L, class C>
struct Window {
  [[gnu::always_inline]] static inline void run(const word* acc, const word* a, const word* b, const word* s, word* r) {
    sum_of_taps<R, Kind, L, C>(acc, s, r, Whole{a}, Neighbours<L, 1>{a, b}, Neighbours<L, 2>{a, b},
                               Neighbours<L, 3>{a, b});
  }
};

// Lane i of an operand times its coefficient.
template <class L, class C>
struct Tap {
  Tap(const word* image, const word* words, int number)
      : lane_(image), coefficient_(static_cast<typename C::stored>(*words >> (C::bits * number))) {}
  auto operator[](int i) const { return term(lane_[i], coefficient_); }

 private:
  Read<L> lane_;
  typename C::stored coefficient_;
};

// Two channels, whose operands alternate: the first makes the even lanes of the result.
constexpr auto CHANNEL = [](auto even, auto odd) { return Both{even, odd}; };
constexpr auto CHANNEL_PAIR = [](auto even, auto odd, auto even2, auto odd2) { return Both{even + even2, odd + odd2}; };

template <const auto& rule, class R, class Kind, class L, class C, class Operands>
struct Channels;

template <const auto& rule, class R, class Kind, class L, class C, std::size_t... V>
struct Channels<rule, R, Kind, L, C, std::index_sequence<V...>> {
  static inline void run(const word* acc, word_image<V>... vectors, const word* s, word* r) {
    constexpr int last = sizeof...(V) / 2 - 1;
    multiply<R, Kind, L::count>(acc, result<R>(r), rule, Tap<L, C>(vectors, s, last - static_cast<int>(V) / 2)...);
  }
};

}  // namespace

#include "multiply/stamp.h"

// KERNEL(OP, window, kind, result layout, operand layout, coefficients)
#define KERNEL_window(OP, KIND, R, L, C) KERNEL_OF_KIND(OP, KIND, Window<R, KIND, L, C>::run)

// KERNEL(OP, channels, kind, result layout, rule, number of operands, their layout, coefficients)
#define KERNEL_channels(OP, KIND, R, RULE, N, L, C) \
  KERNEL_OF_KIND(OP, KIND, Channels<RULE, R, KIND, L, C, std::make_index_sequence<N>>::run)

#include "multiply/windows.def"

#include "frame/stamp_end.h"
