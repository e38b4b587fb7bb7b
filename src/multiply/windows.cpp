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
template <class R, class L, class C>
struct Window {
  template <class How>
  [[gnu::always_inline]] static inline void run(const word* acc, const word* a, const word* b, const word* s, word* r) {
    sum_of_taps<R, How, L, C>(acc, s, r, Whole{a}, Neighbours<L, 1>{a, b}, Neighbours<L, 2>{a, b},
                              Neighbours<L, 3>{a, b});
  }
  static inline void fresh(const word* a, const word* b, const word* s, word* r) { run<Over>(nullptr, a, b, s, r); }
  static inline void add(const word* acc, const word* a, const word* b, const word* s, word* r) {
    run<Onto>(acc, a, b, s, r);
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

template <class R, class L, class C, class Operands>
struct Channels;

template <class R, class L, class C, std::size_t... V>
struct Channels<R, L, C, std::index_sequence<V...>> {
  template <class Rule, class Kind>
  static inline void run(Rule rule, const Kind& kind, word_image<V>... vectors, const word* s, word* r) {
    constexpr int last = sizeof...(V) / 2 - 1;
    multiply<L::count>(result<R>(r), kind, rule, Tap<L, C>(vectors, s, last - static_cast<int>(V) / 2)...);
  }
  template <class Rule>
  static inline void fresh(Rule rule, word_image<V>... vectors, const word* s, word* r) {
    run(rule, Fresh{}, vectors..., s, r);
  }
  template <class Rule>
  static inline void add(Rule rule, const word* acc, word_image<V>... vectors, const word* s, word* r) {
    run(rule, Added<R>{Read<whole<R>>(acc)}, vectors..., s, r);
  }
};

}  // namespace

#include "multiply/stamp.h"

// KERNEL(OP, kind_window, result layout, operand layout, coefficients)
#define KERNEL_fresh_window(OP, R, L, C) KERNEL_OF_WORDS(OP, (Window<R, L, C>::fresh(units...)))
#define KERNEL_add_window(OP, R, L, C) KERNEL_OF_WORDS(OP, (Window<R, L, C>::add(units...)))

// KERNEL(OP, kind_channels, result layout, rule, number of operands, their layout, coefficients)
#define KERNEL_CHANNELS(OP, KIND, R, RULE, N, L, C) \
  KERNEL_OF_WORDS(OP, (Channels<R, L, C, std::make_index_sequence<N>>::KIND(RULE, units...)))
#define KERNEL_fresh_channels(OP, ...) KERNEL_CHANNELS(OP, fresh, __VA_ARGS__)
#define KERNEL_add_channels(OP, ...) KERNEL_CHANNELS(OP, add, __VA_ARGS__)

#include "multiply/windows.def"

#include "frame/stamp_end.h"
