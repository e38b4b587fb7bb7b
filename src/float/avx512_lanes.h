// Sixteen floats of AVX-512 and operands made of them; the host's control word beside them (avx512.h).
#ifndef KASTARRI_FLOAT_AVX512_LANES_H
#define KASTARRI_FLOAT_AVX512_LANES_H

#include <cstring>

#include "float/bits.h"
#include "float/host_fpu.h"
#include "frame/intrinsics.h"
#include "frame/lanes.h"

namespace {

template <Rounding R>
constexpr int in_instruction = _MM_FROUND_NO_EXC | (R == to_nearest    ? _MM_FROUND_TO_NEAREST_INT
                                                    : R == toward_zero ? _MM_FROUND_TO_ZERO
                                                    : R == upward      ? _MM_FROUND_TO_POS_INF
                                                                       : _MM_FROUND_TO_NEG_INF);

// The mask of masked forms that leave nothing out. The plain ones have the compiler warn of its own header.
inline __mmask16 sixteen_lanes() { return 0xFFFF; }

// Where numbers differ. The compiler's own function of this instruction may raise flags: clang makes of a comparison
// that raises none one that does.
inline __mmask16 differing(__m512 a, __m512 b) {
  __mmask16 differ;
  asm("vcmpneqps %{sae%}, %2, %1, %0" : "=k"(differ) : "v"(a), "v"(b));
  return differ;
}

// Sixteen singles, with arithmetic that rounds by R.
template <Rounding R>
struct Sixteen {
  __m512 v;
  friend Sixteen operator+(Sixteen a, Sixteen b) { return {_mm512_add_round_ps(a.v, b.v, in_instruction<R>)}; }
  friend Sixteen operator-(Sixteen a, Sixteen b) { return {_mm512_sub_round_ps(a.v, b.v, in_instruction<R>)}; }
  friend Sixteen operator*(Sixteen a, Sixteen b) { return {_mm512_mul_round_ps(a.v, b.v, in_instruction<R>)}; }
  friend Sixteen operator*(Sixteen a, float b) { return a * Sixteen{_mm512_set1_ps(b)}; }
  friend Sixteen operator-(Sixteen a) { return {_mm512_xor_ps(a.v, _mm512_set1_ps(-0.0f))}; }
};

template <class F, Rounding R>
inline Sixteen<R> sum(Sixteen<R> a, Sixteen<R> b) {
  return a + b;
}
template <class F, Rounding R>
inline Sixteen<R> product(Sixteen<R> a, Sixteen<R> b) {
  return a * b;
}

template <class F, Rounding R>
inline Sixteen<R> fused(Sixteen<R> acc, Sixteen<R> a, Sixteen<R> b) {
  return {_mm512_fmadd_round_ps(a.v, b.v, acc.v, in_instruction<R>)};
}

inline __m512 integral_away(__m512 x) {
  const __m512 absolute = _mm512_andnot_ps(_mm512_set1_ps(-0.0f), x);
  const __m512 cut =
      _mm512_maskz_roundscale_round_ps(sixteen_lanes(), absolute, in_instruction<toward_zero>, _MM_FROUND_NO_EXC);
  const __m512 cut_off = _mm512_sub_round_ps(absolute, cut, in_instruction<to_nearest>);
  // What is cut off is at least 0, or a NaN.
  const __mmask16 up = _mm512_cmpge_epi32_mask(_mm512_castps_si512(cut_off), _mm512_castps_si512(_mm512_set1_ps(0.5f)));
  const __m512 rounded = _mm512_mask_add_round_ps(cut, up, cut, _mm512_set1_ps(1), in_instruction<to_nearest>);
  return _mm512_or_ps(rounded, _mm512_and_ps(_mm512_set1_ps(-0.0f), x));
}

template <Rounding R>
inline Sixteen<R> integral(const TiesAway&, Sixteen<R> x) {
  return {integral_away(x.v)};
}
template <Rounding R>
inline Sixteen<R> integral(Rounding, Sixteen<R> x) {
  return {_mm512_maskz_roundscale_round_ps(sixteen_lanes(), x.v, in_instruction<R>, _MM_FROUND_NO_EXC)};
}

// --- Lanes ------------------------------------------------------------------------------------------

// Sixteen lanes of a layout, or the first of them; and an operand, which is one or two such parts.
template <int Bits>
struct part_type {
  using type = __m512i;
};
template <>
struct part_type<16> {
  using type = __m256i;
};
template <class L>
using Part = typename part_type<L::bits>::type;
template <class L>
constexpr int parts_of = L::count == 32 ? 2 : 1;

template <class L>
struct Parts {
  Parts() = default;
  explicit Parts(const void* operand) {
    if constexpr (L::count == 1) {
      const __m128i lane = _mm_cvtsi32_si128(static_cast<int>(Read<L>(operand)[0]));
      if constexpr (L::bits == 16) part[0] = _mm256_zextsi128_si256(lane);
      if constexpr (L::bits == 32) part[0] = _mm512_zextsi128_si512(lane);
    } else {
      for (int k = 0; k < parts_of<L>; ++k)
        std::memcpy(&part[k], static_cast<const unsigned char*>(operand) + k * static_cast<int>(sizeof(Part<L>)),
                    sizeof(Part<L>));
    }
  }
  explicit Parts(__m512i lanes) {
    if constexpr (L::bits == 32) part[0] = lanes;
    if constexpr (L::bits == 16) part[0] = _mm512_castsi512_si256(lanes);
    if constexpr (parts_of<L> == 2) part[1] = _mm512_extracti64x4_epi64(lanes, 1);
  }
  Part<L> part[parts_of<L>];
};

// As a register, as which operands go to functions: an object that is handed over lies in memory.
template <class L>
inline __m512i joined(const Parts<L>& lanes) {
  if constexpr (L::bits == 32) {
    return lanes.part[0];
  } else {
    const __m512i lower = _mm512_castsi256_si512(lanes.part[0]);
    if constexpr (parts_of<L> == 2) return _mm512_inserti64x4(lower, lanes.part[1], 1);
    return lower;
  }
}

// Sixteen lanes as singles. Halves and integers of 16 bits are singles, integers of 32 bits are rounded by R.
template <class L, Rounding R>
inline Sixteen<R> singles_of(Part<L> lanes) {
  constexpr bool is_signed = std::is_signed_v<typename L::container>;
  if constexpr (std::is_same_v<typename L::number, half_float>) {
    return {_mm512_maskz_cvt_roundph_ps(sixteen_lanes(), lanes, _MM_FROUND_NO_EXC)};
  } else if constexpr (std::is_same_v<typename L::number, single_float>) {
    return {_mm512_castsi512_ps(lanes)};
  } else if constexpr (L::bits == 32) {
    if constexpr (is_signed) return {_mm512_maskz_cvt_roundepi32_ps(sixteen_lanes(), lanes, in_instruction<R>)};
    return {_mm512_maskz_cvt_roundepu32_ps(sixteen_lanes(), lanes, in_instruction<R>)};
  } else {
    const __m512i wide = is_signed ? _mm512_maskz_cvtepi16_epi32(sixteen_lanes(), lanes)
                                   : _mm512_maskz_cvtepu16_epi32(sixteen_lanes(), lanes);
    return {_mm512_maskz_cvt_roundepi32_ps(sixteen_lanes(), wide, in_instruction<R>)};
  }
}

template <Rounding R>
inline Sixteen<R> exact_single_of(Sixteen<R> converted) {
  return converted;
}
template <Rounding R>
inline Sixteen<R> scaled_single(Sixteen<R> converted, float unit) {
  return converted * unit;
}

// The compiler's own function of this instruction lets it raise flags.
template <Rounding R>
inline __m256i halves_of(Sixteen<R> x) {
  __m256i halves;
  asm("vcvtps2ph %2, %{sae%}, %1, %0" : "=v"(halves) : "v"(x.v), "i"(in_instruction<R> & 3));
  return halves;
}

// --- The host's control word --------------------------------------------------------------------------

// Whether the host has subnormals flushed to zero, as results or as operands.
inline bool flushes_subnormals() {
  __m128 sum;
  bool is_zero;
  asm volatile(
      "vaddss %{rn-sae%}, %3, %2, %0\n\t"
      "vptest %0, %0"
      : "=x"(sum), "=@ccz"(is_zero)
      : "x"(_mm_castsi128_ps(_mm_cvtsi32_si128(1))), "x"(_mm_setzero_ps()));
  return is_zero;
}

// While it lives, subnormals are honoured. Compilers know nothing of the control word: what is computed meanwhile has
// to be pinned (HostFpu) after the one write and before the other.
class SubnormalsHonoured {
 public:
  SubnormalsHonoured() : found_(flushes_subnormals() ? read_control_word() : 0) {
    if (__builtin_expect(found_ != 0, 0)) write_control_word(found_ & ~flushing);
  }
  ~SubnormalsHonoured() {
    if (__builtin_expect(found_ != 0, 0)) write_control_word(found_);
  }
  SubnormalsHonoured(const SubnormalsHonoured&) = delete;
  SubnormalsHonoured& operator=(const SubnormalsHonoured&) = delete;
  bool were_flushed() const { return found_ != 0; }

 private:
  static constexpr word flushing = 0x8040;  // flush-to-zero and denormals-are-zero
  const word found_;                        // 0 where it is left alone
};

template <class V>
inline void pin(V& x) {
  asm volatile("" : "+v"(x));
}
inline void pin_word(word& x) { asm volatile("" : "+r"(x)); }
template <class L>
inline void pin(Parts<L>& lanes) {
  for (auto& part : lanes.part) pin(part);
}

}  // namespace

#endif
