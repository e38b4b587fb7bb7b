// The target's registers as vectors of lanes, for arrangements that compilers do not find in a loop over lanes.
// What compilers have no expression for is here once a target, all else is the same text for all.
#ifndef KASTARRI_FRAME_REGISTERS_H
#define KASTARRI_FRAME_REGISTERS_H

#include <cstdint>
#include <cstring>
#include <utility>

#include "frame/intrinsics.h"

namespace {

// Register is what the processors' intrinsics for integers take. Most shuffles work within blocks of 128 bits.
#if defined __AVX512BW__
using Register = __m512i;
#elif defined __AVX2__
using Register = __m256i;
#else
using Register = __m128i;
#endif
constexpr int register_bytes = sizeof(Register);
constexpr int blocks_in_register = register_bytes / 16;

template <class Lane>
struct vector_of {
  typedef Lane type __attribute__((vector_size(register_bytes)));
};
template <class Lane>
using Vector = typename vector_of<Lane>::type;
template <class Lane>
constexpr int lanes_in_register = register_bytes / static_cast<int>(sizeof(Lane));

using Bytes = Vector<std::uint8_t>;
using Shorts = Vector<std::int16_t>;
using Halves = Vector<std::uint16_t>;
using Integers = Vector<std::int32_t>;
using Words = Vector<std::uint32_t>;
using LongWords = Vector<std::uint64_t>;
using Singles = Vector<float>;
using Doubles = Vector<double>;

// The same bits as another type of register.
template <class To, class From>
inline To in_bits(From v) {
  return reinterpret_cast<To>(v);
}

// Register number k of those at an address. One load each, also where processors forward a store that crosses cache
// lines to two halves sooner than to the whole: bench/notes.md has what both cost.
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

// A copy in whole registers, all of them loaded before the first is stored: source and target may overlap.
template <int Size>
inline void copy_registers(const void* from, void* to) {
  static_assert(Size % register_bytes == 0);
  Bytes all[Size / register_bytes];
  for (int k = 0; k < Size / register_bytes; ++k) all[k] = load_register<std::uint8_t>(from, k);
  for (int k = 0; k < Size / register_bytes; ++k) store_register(to, k, all[k]);
}

// Whether the top bit of any lane is set.
template <class Lane>
inline bool any_sign(Vector<Lane> v) {
  constexpr Lane sign = static_cast<Lane>(Lane{1} << (8 * sizeof(Lane) - 1));
  const auto signs = in_bits<Register>(v & sign);
#if defined __AVX512BW__
  return _mm512_test_epi32_mask(signs, signs) != 0;
#elif defined __AVX2__
  return _mm256_testz_si256(signs, signs) == 0;
#else
  return _mm_movemask_epi8(signs) != 0;
#endif
}

// Lane i = magnitude i with the sign of v[i]; where v[i] is 0, magnitude i or 0.
#if defined __AVX2__ && !defined __AVX512BW__
inline Shorts signed_as(Shorts magnitudes, Shorts v) {
  return in_bits<Shorts>(_mm256_sign_epi16(in_bits<Register>(magnitudes), in_bits<Register>(v)));
}
inline Integers signed_as(Integers magnitudes, Integers v) {
  return in_bits<Integers>(_mm256_sign_epi32(in_bits<Register>(magnitudes), in_bits<Register>(v)));
}
#else
template <class V>
inline V signed_as(V magnitudes, V v) {
  const V negative = v >> (8 * static_cast<int>(sizeof(v[0])) - 1);
  return (magnitudes ^ negative) - negative;
}
#endif

// --- Shuffles ------------------------------------------------------------------------------------------------
// Each is told the lane that it moves, and leaves the type of the register as it is. Examples are of words in
// registers of 256 bits: two blocks of four words.

template <class Lane>
using lane_numbers = std::make_index_sequence<lanes_in_register<Lane>>;

// `Count` words over and over: 1 2 1 2 1 2 1 2 of 1 2.
template <int Count, std::size_t... I>
inline __m128i block_of(const std::uint32_t* words, std::index_sequence<I...>) {
  typedef std::uint32_t Block __attribute__((vector_size(16)));
  return reinterpret_cast<__m128i>(Block{words[I % Count]...});
}
template <int Count>
inline Words repeated(const std::uint32_t* words) {
  if constexpr (Count == 1) return Words{} + *words;
  const __m128i block = block_of<Count>(words, std::make_index_sequence<4>());
#if defined __AVX512BW__
  return in_bits<Words>(_mm512_maskz_broadcast_i32x4(0xFFFF, block));
#elif defined __AVX2__
  return in_bits<Words>(_mm256_broadcastsi128_si256(block));
#else
  return in_bits<Words>(block);
#endif
}

// The lower (Half = 0) or upper (1) lanes of every block of a and b, taken in turn: the lower ones of
// a0 .. a7 and b0 .. b7 are a0 b0 a1 b1, a4 b4 a5 b5.
template <int Half, class Lane, std::size_t... I>
inline Vector<Lane> interleaved(Vector<Lane> a, Vector<Lane> b, std::index_sequence<I...>) {
  constexpr int in_block = 16 / sizeof(Lane), all = lanes_in_register<Lane>;
  return __builtin_shufflevector(a, b,
                                 (I / in_block * in_block + Half * in_block / 2 + I % in_block / 2 + I % 2 * all)...);
}
template <int Half, class Lane, class V>
inline V interleaved(V a, V b) {
  return in_bits<V>(interleaved<Half, Lane>(in_bits<Vector<Lane>>(a), in_bits<Vector<Lane>>(b), lane_numbers<Lane>()));
}

// Every other word, the even ones (First = 0) or the odd ones (1), block by block, a's before b's: the even ones are
// a0 a2 b0 b2, a4 a6 b4 b6. Shuffled as floats, which takes one step.
template <int First, std::size_t... I>
inline Singles every_other_word(Singles a, Singles b, std::index_sequence<I...>) {
  return __builtin_shufflevector(a, b, (I / 4 * 4 + I % 2 * 2 + First + I % 4 / 2 * sizeof...(I))...);
}
template <int First, class V>
inline V every_other_word(V a, V b) {
  return in_bits<V>(every_other_word<First>(in_bits<Singles>(a), in_bits<Singles>(b), lane_numbers<float>()));
}

// The first lanes of all blocks, then their second ones, and so on: v0 v4 v1 v5, v2 v6 v3 v7. That puts in order what
// was made block by block: with lanes of 64 bits a0 a2 b0 b2, a4 a6 b4 b6 becomes a0 a2 a4 a6, b0 b2 b4 b6.
template <class Lane, std::size_t... I>
inline Vector<Lane> in_order(Vector<Lane> v, std::index_sequence<I...>) {
  return __builtin_shufflevector(v, v, (I % blocks_in_register * (16 / sizeof(Lane)) + I / blocks_in_register)...);
}
template <class Lane, class V>
inline V in_order(V v) {
  return in_bits<V>(in_order<Lane>(in_bits<Vector<Lane>>(v), lane_numbers<Lane>()));
}

// Words dealt to the blocks in turn: v0 v2 v4 v6, v1 v3 v5 v7. The four registers that interleaving makes of it, the
// halves of its halves, are then in order: v0 v1, v2 v3, v4 v5, v6 v7, each word over a whole block.
template <std::size_t... I>
inline Words dealt(Words v, std::index_sequence<I...>) {
  return __builtin_shufflevector(v, v, (I % 4 * blocks_in_register + I / 4)...);
}
template <class V>
inline V dealt(V v) {
  return in_bits<V>(dealt(in_bits<Words>(v), lane_numbers<std::uint32_t>()));
}

// A register of the bytes of a followed by those of b, from byte number First of a block on.
template <std::size_t... I>
inline LongWords next_block(LongWords a, LongWords b, std::index_sequence<I...>) {
  return __builtin_shufflevector(a, b, (I + 2)...);
}
template <int First>
inline Bytes from_byte(Bytes a, Bytes b) {
  const auto all = in_bits<Register>(a);
  const auto next =
      in_bits<Register>(next_block(in_bits<LongWords>(a), in_bits<LongWords>(b), lane_numbers<std::uint64_t>()));
#if defined __AVX512BW__
  return in_bits<Bytes>(_mm512_alignr_epi8(next, all, First));
#elif defined __AVX2__
  return in_bits<Bytes>(_mm256_alignr_epi8(next, all, First));
#else
  return in_bits<Bytes>(_mm_srli_si128(all, First)) | in_bits<Bytes>(_mm_slli_si128(next, 16 - First));
#endif
}

// --- Lanes clamped to half their width -----------------------------------------------------------------------

// Words clamped to halves, halves to bytes, signed or not as the last operand; block by block, a's before b's.
#if defined __AVX512BW__
inline __m512i pack_words(__m512i a, __m512i b, std::int16_t) { return _mm512_packs_epi32(a, b); }
inline __m512i pack_words(__m512i a, __m512i b, std::uint16_t) { return _mm512_packus_epi32(a, b); }
inline __m512i pack_halves(__m512i a, __m512i b, std::int8_t) { return _mm512_packs_epi16(a, b); }
inline __m512i pack_halves(__m512i a, __m512i b, std::uint8_t) { return _mm512_packus_epi16(a, b); }
#endif
#if defined __AVX2__
inline __m256i pack_words(__m256i a, __m256i b, std::int16_t) { return _mm256_packs_epi32(a, b); }
inline __m256i pack_words(__m256i a, __m256i b, std::uint16_t) { return _mm256_packus_epi32(a, b); }
inline __m256i pack_halves(__m256i a, __m256i b, std::int8_t) { return _mm256_packs_epi16(a, b); }
inline __m256i pack_halves(__m256i a, __m256i b, std::uint8_t) { return _mm256_packus_epi16(a, b); }
#else
inline __m128i pack_words(__m128i a, __m128i b, std::int16_t) { return _mm_packs_epi32(a, b); }
// Clamped as signed, 2^15 lower. Words that are 2^15 or less from the lowest one would wrap; none are.
inline __m128i pack_words(__m128i a, __m128i b, std::uint16_t) {
  const __m128i half = _mm_set1_epi32(0x8000);
  const __m128i packed = _mm_packs_epi32(_mm_sub_epi32(a, half), _mm_sub_epi32(b, half));
  return _mm_xor_si128(packed, _mm_set1_epi16(-0x8000));
}
inline __m128i pack_halves(__m128i a, __m128i b, std::int8_t) { return _mm_packs_epi16(a, b); }
inline __m128i pack_halves(__m128i a, __m128i b, std::uint8_t) { return _mm_packus_epi16(a, b); }
#endif

// --- Shifts of words by counts -------------------------------------------------------------------------------

// The counts are the lanes' own, or where the target has no such shift one for all. A count from 0 to 31 shifts by as
// much, one beyond leaves nothing but signs. (A shift operator would take a shared count through memory.)
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
inline Counts counts_of(Words n) { return in_bits<Counts>(n); }
#endif
template <class Lane>
inline Vector<Lane> shifted_left(Vector<Lane> v, Counts n) {
  return in_bits<Vector<Lane>>(left_by(in_bits<Register>(v), n));
}
template <class Lane>
inline Vector<Lane> shifted_right(Vector<Lane> v, Counts n) {
  return in_bits<Vector<Lane>>(right_by(in_bits<Register>(v), n, Lane{}));
}

}  // namespace

#endif
