// The target's registers as vectors of lanes, for arrangements that compilers do not find in a loop over lanes.
// What compilers have no expression for is here once a target, all else is the same text for all.
#ifndef KASTARRI_FRAME_REGISTERS_H
#define KASTARRI_FRAME_REGISTERS_H

#include <cstdint>
#include <cstring>
#include <utility>

#include "frame/intrinsics.h"

namespace {

#if defined __AVX512BW__
constexpr int register_bytes = 64;
#elif defined __AVX2__
constexpr int register_bytes = 32;
#else
constexpr int register_bytes = 16;
#endif
constexpr int blocks_in_register = register_bytes / 16;  // most shuffles work within blocks of 128 bits

template <class Lane>
struct vector_of {
  typedef Lane type __attribute__((vector_size(register_bytes)));
};
template <class Lane>
using Vector = typename vector_of<Lane>::type;
template <class Lane>
constexpr int lanes_in_register = register_bytes / static_cast<int>(sizeof(Lane));

template <class Lane>
inline Vector<Lane> as(Vector<std::uint8_t> v) {
  return reinterpret_cast<Vector<Lane>>(v);
}
template <class V>
inline Vector<std::uint8_t> bits_of(V v) {
  return reinterpret_cast<Vector<std::uint8_t>>(v);
}

// Register number k of those at an address.
template <class Lane>
inline Vector<Lane> load_register(const void* from, int k) {
  Vector<Lane> v;
  std::memcpy(&v, static_cast<const unsigned char*>(from) + k * register_bytes, sizeof v);
  return v;
}
template <class V>
inline void store_register(void* to, int k, V v) {
  std::memcpy(static_cast<unsigned char*>(to) + k * register_bytes, &v, sizeof v);
}

// Whether the top bit of any lane is set.
template <class Lane>
inline bool any_sign(Vector<Lane> v) {
  constexpr Lane sign = static_cast<Lane>(Lane{1} << (8 * sizeof(Lane) - 1));
  const auto signs = v & sign;
#if defined __AVX512BW__
  return _mm512_test_epi32_mask(reinterpret_cast<__m512i>(signs), reinterpret_cast<__m512i>(signs)) != 0;
#elif defined __AVX2__
  return _mm256_testz_si256(reinterpret_cast<__m256i>(signs), reinterpret_cast<__m256i>(signs)) == 0;
#else
  return _mm_movemask_epi8(reinterpret_cast<__m128i>(signs)) != 0;
#endif
}

// Magnitudes with the signs of v, where it is not 0.
#if defined __AVX2__ && !defined __AVX512BW__
inline Vector<std::int16_t> signed_as(Vector<std::int16_t> magnitudes, Vector<std::int16_t> v) {
  return reinterpret_cast<Vector<std::int16_t>>(
      _mm256_sign_epi16(reinterpret_cast<__m256i>(magnitudes), reinterpret_cast<__m256i>(v)));
}
inline Vector<std::int32_t> signed_as(Vector<std::int32_t> magnitudes, Vector<std::int32_t> v) {
  return reinterpret_cast<Vector<std::int32_t>>(
      _mm256_sign_epi32(reinterpret_cast<__m256i>(magnitudes), reinterpret_cast<__m256i>(v)));
}
#else
template <class V>
inline V signed_as(V magnitudes, V v) {
  const V negative = v >> (8 * static_cast<int>(sizeof(v[0])) - 1);
  return (magnitudes ^ negative) - negative;
}
#endif

// Words that fill a block, one after the other and again, and that block over and over.
template <int Words, std::size_t... I>
inline __m128i block_of(const std::uint32_t* words, std::index_sequence<I...>) {
  typedef std::uint32_t Block __attribute__((vector_size(16)));
  return reinterpret_cast<__m128i>(Block{words[I % Words]...});
}
template <int Words>
inline Vector<std::uint32_t> repeated(const std::uint32_t* words) {
  if constexpr (Words == 1) return Vector<std::uint32_t>{} + *words;
  const __m128i block = block_of<Words>(words, std::make_index_sequence<4>());
#if defined __AVX512BW__
  return reinterpret_cast<Vector<std::uint32_t>>(_mm512_maskz_broadcast_i32x4(0xFFFF, block));
#elif defined __AVX2__
  return reinterpret_cast<Vector<std::uint32_t>>(_mm256_broadcastsi128_si256(block));
#else
  return reinterpret_cast<Vector<std::uint32_t>>(block);
#endif
}

// The lower (Half = 0) or upper (1) lanes of every block of a and b, taken in turn.
template <int Half, class Lane, std::size_t... I>
inline Vector<Lane> interleaved(Vector<Lane> a, Vector<Lane> b, std::index_sequence<I...>) {
  constexpr int in_block = 16 / sizeof(Lane), all = lanes_in_register<Lane>;
  return __builtin_shufflevector(a, b,
                                 (I / in_block * in_block + Half * in_block / 2 + I % in_block / 2 + I % 2 * all)...);
}
template <int Half, class Lane>
inline Vector<Lane> interleaved(Vector<std::uint8_t> a, Vector<std::uint8_t> b) {
  return interleaved<Half, Lane>(as<Lane>(a), as<Lane>(b), std::make_index_sequence<lanes_in_register<Lane>>());
}

// The even (First = 0) or odd (1) words of a and b, block by block: a's, then b's. As numbers they are shuffled in one
// step.
template <int First, std::size_t... I>
inline Vector<float> every_other_word(Vector<float> a, Vector<float> b, std::index_sequence<I...>) {
  return __builtin_shufflevector(a, b, (I / 4 * 4 + I % 2 * 2 + First + I % 4 / 2 * sizeof...(I))...);
}
template <int First>
inline Vector<std::uint32_t> every_other_word(Vector<std::uint8_t> a, Vector<std::uint8_t> b) {
  return reinterpret_cast<Vector<std::uint32_t>>(
      every_other_word<First>(as<float>(a), as<float>(b), std::make_index_sequence<lanes_in_register<float>>()));
}

// The lanes of a register, of which every block holds one of each of its parts, with the parts in order.
template <class Lane, std::size_t... I>
inline Vector<Lane> in_order(Vector<Lane> v, std::index_sequence<I...>) {
  return __builtin_shufflevector(v, v, (I % blocks_in_register * (16 / sizeof(Lane)) + I / blocks_in_register)...);
}
template <class Lane>
inline Vector<Lane> in_order(Vector<std::uint8_t> v) {
  return in_order<Lane>(as<Lane>(v), std::make_index_sequence<lanes_in_register<Lane>>());
}

// The words of a register dealt to its blocks in turn: interleaving such registers twice puts lanes in order.
template <std::size_t... I>
inline Vector<std::uint32_t> dealt(Vector<std::uint32_t> v, std::index_sequence<I...>) {
  return __builtin_shufflevector(v, v, (I % 4 * blocks_in_register + I / 4)...);
}
inline Vector<std::uint8_t> dealt(Vector<std::uint8_t> v) {
  return bits_of(dealt(as<std::uint32_t>(v), std::make_index_sequence<lanes_in_register<std::uint32_t>>()));
}

// The blocks of a but its first, then the first of b.
template <std::size_t... I>
inline Vector<std::uint64_t> next_block(Vector<std::uint64_t> a, Vector<std::uint64_t> b, std::index_sequence<I...>) {
  return __builtin_shufflevector(a, b, (I + 2)...);
}

#if defined __AVX512BW__
using Register = __m512i;
inline Register paired_products(Register a, Register b) { return _mm512_madd_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::int16_t) { return _mm512_mulhi_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::uint16_t) { return _mm512_mulhi_epu16(a, b); }
#elif defined __AVX2__
using Register = __m256i;
inline Register paired_products(Register a, Register b) { return _mm256_madd_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::int16_t) { return _mm256_mulhi_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::uint16_t) { return _mm256_mulhi_epu16(a, b); }
#else
using Register = __m128i;
inline Register paired_products(Register a, Register b) { return _mm_madd_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::int16_t) { return _mm_mulhi_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::uint16_t) { return _mm_mulhi_epu16(a, b); }
#endif

// The sum of two neighbouring products a lane. It passes 2^31 - 1 only if all four factors are -2^15,
// and then wraps.
inline Vector<std::int32_t> sums_of_products(Vector<std::int16_t> a, Vector<std::int16_t> b) {
  return reinterpret_cast<Vector<std::int32_t>>(
      paired_products(reinterpret_cast<Register>(a), reinterpret_cast<Register>(b)));
}

// The bits that at least two of three hold.
inline Vector<std::int32_t> majority(Vector<std::int32_t> a, Vector<std::int32_t> b, Vector<std::int32_t> c) {
#if defined __AVX512BW__
  return reinterpret_cast<Vector<std::int32_t>>(_mm512_ternarylogic_epi32(
      reinterpret_cast<__m512i>(a), reinterpret_cast<__m512i>(b), reinterpret_cast<__m512i>(c), 0xE8));
#else
  return (a & b) | ((a | b) & c);
#endif
}

// Counts to shift words by: the lanes' own, or where the target has no such shift one for all. Any count serves that is
// below 32 or stands for nothing being left. (Compilers take a count that all share through memory in two halves, which
// a load of both waits for.)
using Counts = Register;
#if defined __AVX512BW__
inline Counts counts_of(std::uint32_t n) { return _mm512_set1_epi32(static_cast<int>(n)); }
inline Register left_by(Register v, Counts n) { return _mm512_maskz_sllv_epi32(0xFFFF, v, n); }
inline Register right_by(Register v, Counts n, std::uint32_t) { return _mm512_maskz_srlv_epi32(0xFFFF, v, n); }
inline Register right_by(Register v, Counts n, std::int32_t) { return _mm512_maskz_srav_epi32(0xFFFF, v, n); }
#elif defined __AVX2__
inline Counts counts_of(std::uint32_t n) { return _mm256_set1_epi32(static_cast<int>(n)); }
inline Register left_by(Register v, Counts n) { return _mm256_sllv_epi32(v, n); }
inline Register right_by(Register v, Counts n, std::uint32_t) { return _mm256_srlv_epi32(v, n); }
inline Register right_by(Register v, Counts n, std::int32_t) { return _mm256_srav_epi32(v, n); }
#else
inline Counts counts_of(std::uint32_t n) { return _mm_cvtsi32_si128(static_cast<int>(n)); }
inline Register left_by(Register v, Counts n) { return _mm_sll_epi32(v, n); }
inline Register right_by(Register v, Counts n, std::uint32_t) { return _mm_srl_epi32(v, n); }
inline Register right_by(Register v, Counts n, std::int32_t) { return _mm_sra_epi32(v, n); }
#endif
#if defined __AVX2__
inline Counts counts_of(Vector<std::uint32_t> n) { return reinterpret_cast<Counts>(n); }
#endif
template <class Lane>
inline Vector<Lane> shifted_left(Vector<Lane> v, Counts n) {
  return reinterpret_cast<Vector<Lane>>(left_by(reinterpret_cast<Counts>(v), n));
}
template <class Lane>
inline Vector<Lane> shifted_right(Vector<Lane> v, Counts n) {
  return reinterpret_cast<Vector<Lane>>(right_by(reinterpret_cast<Counts>(v), n, Lane{}));
}

// The upper halves of 32-bit products.
template <class Lane>
inline Vector<Lane> upper_halves(Vector<Lane> a, Vector<Lane> b) {
  return reinterpret_cast<Vector<Lane>>(
      upper_products(reinterpret_cast<Register>(a), reinterpret_cast<Register>(b), Lane{}));
}

// The low 24 bits of a word, the low 48 of a pair of words, sign-extended. Where a target can multiply some lanes and
// leave the rest, the sign is that of a product with 1.
inline Vector<std::uint32_t> extended_from_24(Vector<std::uint32_t> v) {
#if defined __AVX512BW__
  const auto all = reinterpret_cast<__m512i>(v);
  return reinterpret_cast<Vector<std::uint32_t>>(_mm512_mask_maddubs_epi16(all, 0xAAAAAAAA, _mm512_set1_epi16(1), all));
#else
  return reinterpret_cast<Vector<std::uint32_t>>(reinterpret_cast<Vector<std::int32_t>>(v << 8) >> 8);
#endif
}
inline Vector<std::uint64_t> extended_from_48(Vector<std::uint64_t> v) {
#if defined __AVX512BW__
  const auto all = reinterpret_cast<__m512i>(v);
  return reinterpret_cast<Vector<std::uint64_t>>(_mm512_mask_madd_epi16(all, 0xAAAA, all, _mm512_set1_epi32(1)));
#elif defined __AVX2__
  const auto all = reinterpret_cast<__m256i>(v);
  return reinterpret_cast<Vector<std::uint64_t>>(
      _mm256_blend_epi32(all, _mm256_madd_epi16(all, _mm256_set1_epi32(1)), 0xAA));
#else
  constexpr std::uint64_t sign = std::uint64_t{1} << 47;
  return ((v & (2 * sign - 1)) ^ sign) - sign;
#endif
}

// The bytes from Bytes on of a followed by b.
template <int Bytes>
inline Vector<std::uint8_t> from_byte(Vector<std::uint8_t> a, Vector<std::uint8_t> b) {
  const auto next = bits_of(next_block(as<std::uint64_t>(a), as<std::uint64_t>(b),
                                       std::make_index_sequence<lanes_in_register<std::uint64_t>>()));
#if defined __AVX512BW__
  return bits_of(_mm512_alignr_epi8(reinterpret_cast<__m512i>(next), reinterpret_cast<__m512i>(a), Bytes));
#elif defined __AVX2__
  return bits_of(_mm256_alignr_epi8(reinterpret_cast<__m256i>(next), reinterpret_cast<__m256i>(a), Bytes));
#else
  return bits_of(_mm_srli_si128(reinterpret_cast<__m128i>(a), Bytes)) |
         bits_of(_mm_slli_si128(reinterpret_cast<__m128i>(next), 16 - Bytes));
#endif
}

}  // namespace

#endif
