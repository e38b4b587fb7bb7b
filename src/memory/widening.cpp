// Loads that widen lanes and stores that narrow them.
#include "frame/convert.h"
#include "frame/registers.h"
#include "memory/kernels.h"

namespace {

template <class V>
inline V clamped(V a, V b, std::int8_t to) {
  return pack_halves(a, b, to);
}
template <class V>
inline V clamped(V a, V b, std::int16_t to) {
  return pack_words(a, b, to);
}

// Clamps the lanes of a vector to half their width, that of Lane.
template <class Lane>
inline void store_saturated(const void* vector, void* to) {
#if defined __AVX2__
  const auto* half = static_cast<const __m256i*>(vector);
  const __m256i packed = clamped(_mm256_loadu_si256(half), _mm256_loadu_si256(half + 1), Lane{});
  // Packed within 128 bits: the quarters are put back in order.
  _mm256_storeu_si256(static_cast<__m256i*>(to), _mm256_permute4x64_epi64(packed, 0xD8));
#else
  const auto clamped_half = [quarter = static_cast<const __m128i*>(vector)](int k) {
    return clamped(_mm_loadu_si128(quarter + 2 * k), _mm_loadu_si128(quarter + 2 * k + 1), Lane{});
  };
  const __m128i low = clamped_half(0), high = clamped_half(1);  // both before a store, which may lie in the vector
  _mm_storeu_si128(static_cast<__m128i*>(to), low);
  _mm_storeu_si128(static_cast<__m128i*>(to) + 1, high);
#endif
}

}  // namespace

#include "memory/stamp.h"

// Lanes of layout A extended to those of R; under a predicate one by one.
#define KERNEL_extend(OP, R, A)                                     \
  template <class Units, class Out>                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out r) { \
    if constexpr (std::is_pointer_v<Out>)                           \
      extend_lanes<A, R, ReadWhole>(a, r);                          \
    else                                                            \
      lanes<R::count>(result<R>(r), SAME, ReadWhole<A>(a));         \
  }

// Lanes of a vector saturated to lanes L of half their width.
#define KERNEL_saturated(OP, L, V)                                       \
  template <class Units, class Memory>                                   \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, Memory* to) { \
    store_saturated<L::container>(v, to);                                \
  }
#define KERNEL_saturated_where(OP, L, V)                                                         \
  template <class Units, class PredicateUnit, class Memory>                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, const PredicateUnit* p, Memory* to) { \
    alignas(32) L::container packed[L::count];                                                   \
    store_saturated<L::container>(v, packed);                                                    \
    store_where<L, L>(packed, SAME, p, to);                                                      \
  }

#include "memory/widening.def"

#include "frame/stamp_end.h"
