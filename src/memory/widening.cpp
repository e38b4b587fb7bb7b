// Loads that widen lanes and stores that narrow them.
#include "memory/kernels.h"

namespace {

// Clamps the lanes of a vector to half their width, that of Lane. Processors have single instructions for it that
// compilers do not find.
template <class Lane>
inline void store_saturated(const void* vector, void* to) {
#if defined __AVX2__
  const auto* half = static_cast<const __m256i*>(vector);
  const __m256i low = _mm256_loadu_si256(half);
  const __m256i high = _mm256_loadu_si256(half + 1);
  const __m256i packed = sizeof(Lane) == 1 ? _mm256_packs_epi16(low, high) : _mm256_packs_epi32(low, high);
  // packs works within 128 bits: put the quarters back in order.
  _mm256_storeu_si256(static_cast<__m256i*>(to), _mm256_permute4x64_epi64(packed, 0xD8));
#else
  const auto* quarter = static_cast<const __m128i*>(vector);
  for (int k = 0; k < 2; ++k) {
    const __m128i low = _mm_loadu_si128(quarter + 2 * k);
    const __m128i high = _mm_loadu_si128(quarter + 2 * k + 1);
    const __m128i packed = sizeof(Lane) == 1 ? _mm_packs_epi16(low, high) : _mm_packs_epi32(low, high);
    _mm_storeu_si128(static_cast<__m128i*>(to) + k, packed);
  }
#endif
}

}  // namespace

#include "frame/stamp.h"

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
    store_where<L>(Read<L>(packed), SAME, p, to);                                                \
  }

#include "memory/widening.def"

#include "frame/stamp_end.h"
