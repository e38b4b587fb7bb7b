// Conversions of numbers: the intrinsics with a scale, those between the formats, and the conversions of
// register types that change the kind of number.
#include "float/convert.h"
#include "frame/convert.h"

namespace {

template <class From, class To, class FromUnit, class ToUnit>
inline void convert_numbers(const FromUnit* from, ToUnit* to) {
  convert_register<From, To>(to, from, 0);
}

// Every other half of a vector, from `first`, as half a vector; and the way back, zeros between.
template <int First, class Units>
inline void every_other_half(const Units* vector, std::uint16_t* halves) {
  const Read<u32x16> pair(vector);
  for (int i = 0; i < 16; ++i) halves[i] = static_cast<std::uint16_t>(pair[i] >> (16 * First));
}

template <int First, class Out>
inline void spread_halves(const std::uint16_t* halves, Out* vector) {
  lanes<16>(
      Write<u32x16>(vector), [](word half) { return half << (16 * First); }, Read<u16x16>(halves));
}

}  // namespace

#include "float/stamp.h"

#include "float/kernels.h"

// A scaled conversion of every lane: from one layout to another; the scale is read modulo the width of
// the integer among them.
#define KERNEL_convert_scaled(OP, FROM, TO, INTEGER)                             \
  template <class Units, class Out>                                              \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, word scale, Out* r) { \
    convert_register<FROM, TO>(r, a, scale_of<INTEGER>(scale));                  \
  }
#define KERNEL_convert_from_every_other(OP, FIRST)                   \
  template <class Units, class Out>                                  \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out* r) { \
    alignas(64) std::uint16_t halves[16];                            \
    every_other_half<FIRST>(a, halves);                              \
    convert_register<f16x16, f32x16>(r, halves, 0);                  \
  }
#define KERNEL_convert_to_every_other(OP, FIRST)                     \
  template <class Units, class Out>                                  \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out* r) { \
    alignas(64) std::uint16_t halves[16];                            \
    convert_register<f32x16, f16x16>(halves, a, 0);                  \
    spread_halves<FIRST>(halves, r);                                 \
  }

#include "float/scaled.def"
#include "float/conversions.def"

#include "frame/stamp_end.h"
