// Single products: one product a lane.
#include "multiply/products.h"
#include "multiply/wide_sums.h"

namespace {

// Products of vectors whose accumulators have lanes four times as wide. They are made twice as wide first, those of
// either half of a block, and then extended by their sign.
template <class A, class B>
struct Products {
  static constexpr bool a_signed = std::is_signed_v<typename A::container>;
  static constexpr bool b_signed = std::is_signed_v<typename B::container>;
  using Lane = std::conditional_t<A::bits == 8, std::int16_t, std::int32_t>;
  using Unsigned = std::make_unsigned_t<Lane>;
  Vector<Lane> half[2];

  Products(Bytes a, Bytes b) : half{of_half<0>(a, b), of_half<1>(a, b)} {}

  template <int Quarter>
  auto quarter() const {
    const auto product = half[Quarter / 2];
    const auto above = a_signed || b_signed ? product >> (8 * sizeof(Lane) - 1) : Vector<Lane>{};
    return as_sum(interleaved<Quarter % 2, Unsigned>(bits_of(product), bits_of(above)));
  }

 private:
  static Vector<word> as_sum(Vector<std::uint16_t> v) { return reinterpret_cast<Vector<word>>(v); }
  static Vector<std::uint64_t> as_sum(Vector<word> v) { return reinterpret_cast<Vector<std::uint64_t>>(v); }

  template <int Half>
  static Vector<Lane> of_half(Bytes a, Bytes b) {
    if constexpr (A::bits == 8)
      return of_bytes<Half>(a, b);
    else
      return reinterpret_cast<Vector<Lane>>(
          interleaved<Half, std::uint16_t>(bits_of(as<std::uint16_t>(a) * as<std::uint16_t>(b)), upper(a, b)));
  }

  template <int Half>
  static Vector<std::int16_t> of_bytes(Bytes a, Bytes b) {
    if constexpr (a_signed && b_signed) return upper_halves<std::int16_t>(at_top<Half>(a), at_top<Half>(b));
    return reinterpret_cast<Vector<std::int16_t>>(widened<Half, a_signed>(a) * widened<Half, b_signed>(b));
  }
  // Bytes as 2^8 times themselves, and as themselves.
  template <int Half>
  static Vector<std::int16_t> at_top(Bytes v) {
    return reinterpret_cast<Vector<std::int16_t>>(interleaved<Half, std::uint8_t>(Bytes{}, v));
  }
  template <int Half, bool IsSigned>
  static Vector<std::uint16_t> widened(Bytes v) {
    return reinterpret_cast<Vector<std::uint16_t>>(IsSigned ? bits_of(at_top<Half>(v) >> 8)
                                                            : bits_of(interleaved<Half, std::uint8_t>(v, Bytes{})));
  }

  // The upper halves of products of 16-bit lanes. An unsigned factor taken as signed is short of 2^16 if its top bit
  // is set.
  static Bytes upper(Bytes a, Bytes b) {
    const auto x = as<std::int16_t>(a), y = as<std::int16_t>(b);
    if constexpr (a_signed && b_signed)
      return bits_of(upper_halves<std::int16_t>(x, y));
    else if constexpr (b_signed)
      return bits_of(as<std::uint16_t>(bits_of(upper_halves<std::int16_t>(x, y))) +
                     as<std::uint16_t>(bits_of(y & x >> 15)));
    else
      return bits_of(upper_halves<std::uint16_t>(as<std::uint16_t>(a), as<std::uint16_t>(b)));
  }
};

template <class R, class How, class A, class B>
inline void put_products(const word* acc, const word* a, const word* b, word* r) {
  for (int k = 0; k < 64 / register_bytes; ++k) {
    const Products<A, B> products(dealt(load_register<std::uint8_t>(a, k)), dealt(load_register<std::uint8_t>(b, k)));
    put_sums<R, How, 0>([&](auto quarter) { return products.template quarter<quarter>(); }, 4 * k, acc, r);
  }
}

}  // namespace

#include "multiply/stamp.h"

// KERNEL(OP, kind_vectors, result layout, factors' layouts)
#define KERNEL_fresh_vectors(OP, R, A, B)                                           \
  static inline void KASTARRI_SEMANTIC(OP)(const word* a, const word* b, word* r) { \
    put_products<R, Over, A, B>(nullptr, a, b, r);                                  \
  }
#define KERNEL_onto(OP, HOW, R, A, B)                                                                \
  static inline void KASTARRI_SEMANTIC(OP)(const word* acc, const word* a, const word* b, word* r) { \
    put_products<R, HOW, A, B>(acc, a, b, r);                                                        \
  }
#define KERNEL_add_vectors(OP, ...) KERNEL_onto(OP, Onto, __VA_ARGS__)
#define KERNEL_subtract_vectors(OP, ...) KERNEL_onto(OP, From, __VA_ARGS__)

#include "multiply/products.def"

#include "frame/stamp_end.h"
