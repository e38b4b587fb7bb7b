/// Registers made from host scalars: every lane the scalar's bits. Here and not behind a call, so that a compiler
/// folds what it knows and hoists what does not change.
#ifndef KASTARRI_REPLICATE_H
#define KASTARRI_REPLICATE_H

#include "kastarri/library.h"

/// A program may have parts compiled for different instruction sets. A function that the linker takes from any of them
/// must not be one of these.
#define KASTARRI_ALWAYS_INLINE __attribute__((always_inline)) inline

namespace kastarri {

/// The scalars that registers made from several types of scalar do not take: which of those it is to become, the
/// program has to say.
template <class Scalar>
struct not_taken {};
template <>
struct not_taken<float> {
  typedef float type;
};
template <>
struct not_taken<double> {
  typedef double type;
};
template <>
struct not_taken<long double> {
  typedef long double type;
};
template <>
struct not_taken<long> {
  typedef long type;
};
template <>
struct not_taken<unsigned long> {
  typedef unsigned long type;
};
template <>
struct not_taken<long long> {
  typedef long long type;
};
template <>
struct not_taken<unsigned long long> {
  typedef unsigned long long type;
};

/// The bits of a scalar: integers extended by their sign, floats as they lie in memory.
template <class Host>
KASTARRI_ALWAYS_INLINE unsigned long long bits_of(Host value) {
  return static_cast<unsigned long long>(value);
}
KASTARRI_ALWAYS_INLINE unsigned long long bits_of(float value) {
  unsigned int bits;
  __builtin_memcpy(&bits, &value, sizeof bits);  // no register of the x87, which would make a NaN quiet
  return bits;
}

/// The low bits of a scalar as a lane of that many bits, extended: 24 bits of 0x800000, signed, are 0xFF800000.
template <int lane_bits, bool is_signed>
KASTARRI_ALWAYS_INLINE unsigned long long extended(unsigned long long bits) {
  const unsigned long long sign = 1ull << (lane_bits - 1);
  const unsigned long long own = bits & (2 * sign - 1);
  return is_signed ? (own ^ sign) - sign : own;
}

/// The widest piece that the program's own instruction set stores at once, which is no wider than the loads of the
/// intrinsics: a load is not forwarded from several narrower stores.
#if defined __AVX512F__
#define KASTARRI_PIECE 64
#elif defined __AVX__
#define KASTARRI_PIECE 32
#else
#define KASTARRI_PIECE 16
#endif

/// Fills units with the same value, of a word or two.
template <class Value, class Unit, unsigned int units>
KASTARRI_ALWAYS_INLINE void fill(Unit (&to)[units], Value value) {
  typedef Value piece __attribute__((vector_size(KASTARRI_PIECE), aligned(1), may_alias));
  const unsigned int bytes = sizeof(Unit) * units, whole = bytes - bytes % sizeof(piece);
  char* const at = reinterpret_cast<char*>(to);
  for (unsigned int i = 0; i < whole; i += sizeof(piece)) *reinterpret_cast<piece*>(at + i) = piece() + value;
  for (unsigned int i = whole; i < bytes; i += sizeof value) __builtin_memcpy(at + i, &value, sizeof value);
}

/// How lanes that share words evenly fill them: two of 16 bits are 0xABCD -> 0xABCDABCD. A scalar is its low unit.
template <int share>
struct Lanes {
  template <class Unit, unsigned int units>
  KASTARRI_ALWAYS_INLINE static void fill_all(Unit (&to)[units], unsigned long long lane) {
    const unsigned int ones = 0xFFFFFFFFu >> (32 - share);
    fill(to, static_cast<Unit>((static_cast<unsigned int>(lane) & ones) * (0xFFFFFFFFu / ones)));
  }
};
template <>
struct Lanes<64> {
  template <unsigned int units>
  KASTARRI_ALWAYS_INLINE static void fill_all(unsigned int (&to)[units], unsigned long long lane) {
    fill(to, lane);
  }
};

/// Fills a register whose lanes have the given bits and share of the register.
template <int lane_bits, int share, bool is_signed, class Unit, unsigned int units, class Host>
KASTARRI_ALWAYS_INLINE void replicate(Unit (&to)[units], Host from) {
  Lanes<share>::fill_all(to, extended<lane_bits, is_signed>(bits_of(from)));
}

}  // namespace kastarri
#undef KASTARRI_PIECE

#endif
