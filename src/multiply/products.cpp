// Single products: one product a lane.
#include "multiply/products.h"
#include "multiply/wide_sums.h"

namespace {

// Products of vectors whose accumulators have lanes four times as wide: 8 bits to 24 in a word, 16 to 48 in two. They
// are made twice as wide first, those of either half of a block, and then extended by their sign.
template <class A, class B>
struct Products {
  static constexpr bool a_signed = std::is_signed_v<typename A::container>;
  static constexpr bool b_signed = std::is_signed_v<typename B::container>;
  using Lane = std::conditional_t<A::bits == 8, std::int16_t, std::int32_t>;
  Vector<Lane> half[2];

  Products(Bytes a, Bytes b) : half{of_half<0>(a, b), of_half<1>(a, b)} {}

  template <int Quarter>
  auto quarter() const {
    using Sum = std::conditional_t<A::bits == 8, Words, LongWords>;
    const auto product = half[Quarter / 2];
    const auto above = a_signed || b_signed ? product >> (8 * sizeof(Lane) - 1) : Vector<Lane>{};
    return in_bits<Sum>(interleaved<Quarter % 2, Lane>(product, above));
  }

 private:
  template <int Half>
  static Vector<Lane> of_half(Bytes a, Bytes b) {
    if constexpr (A::bits == 8)
      return of_bytes<Half>(a, b);
    else
      return in_bits<Integers>(interleaved<Half, std::uint16_t>(in_bits<Halves>(a) * in_bits<Halves>(b),
                                                                upper(in_bits<Halves>(a), in_bits<Halves>(b))));
  }

  template <int Half>
  static Shorts of_bytes(Bytes a, Bytes b) {
    if constexpr (a_signed && b_signed)
      return upper_halves<std::int16_t>(at_top<Half>(a), at_top<Half>(b));
    else
      return in_bits<Shorts>(widened<Half, a_signed>(a) * widened<Half, b_signed>(b));
  }
  // Bytes x as 16-bit lanes: as 2^8 x, and as x.
  template <int Half>
  static Shorts at_top(Bytes v) {
    return in_bits<Shorts>(interleaved<Half, std::uint8_t>(Bytes{}, v));
  }
  template <int Half, bool IsSigned>
  static Halves widened(Bytes v) {
    return IsSigned ? in_bits<Halves>(at_top<Half>(v) >> 8)
                    : in_bits<Halves>(interleaved<Half, std::uint8_t>(v, Bytes{}));
  }

  // The upper halves of products of 16-bit lanes. For an unsigned x and a signed y, x read as signed is x - 2^16 where
  // its top bit is set; the upper half is then y too small.
  static Halves upper(Halves a, Halves b) {
    const auto x = in_bits<Shorts>(a), y = in_bits<Shorts>(b);
    if constexpr (a_signed && b_signed)
      return in_bits<Halves>(upper_halves<std::int16_t>(x, y));
    else if constexpr (b_signed)
      return in_bits<Halves>(upper_halves<std::int16_t>(x, y)) + in_bits<Halves>(y & x >> 15);
    else
      return upper_halves<std::uint16_t>(a, b);
  }
};

template <class R, class Kind, class A, class B>
struct ByRegister {
  static inline void run(const word* acc, const word* a, const word* b, word* r) {
    for (int k = 0; k < 64 / register_bytes; ++k) {
      const Products<A, B> products(dealt(load_register<std::uint8_t>(a, k)), dealt(load_register<std::uint8_t>(b, k)));
      put_sums<R, Kind, 0>([&](auto quarter) { return products.template quarter<quarter>(); }, 4 * k, acc, r);
    }
  }
};

}  // namespace

#include "multiply/stamp.h"

// KERNEL(OP, by_register, kind, result layout, layouts of the factors)
#define KERNEL_by_register(OP, KIND, R, A, B) KERNEL_OF_KIND(OP, KIND, ByRegister<R, KIND, A, B>::run)

#include "multiply/products.def"

#include "frame/stamp_end.h"
