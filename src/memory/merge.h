// Predicated stores: bytes of memory that no enabled lane governs keep what they hold.
#ifndef KASTARRI_MEMORY_MERGE_H
#define KASTARRI_MEMORY_MERGE_H

#include "frame/intrinsics.h"
#include "frame/lanes.h"
#include "frame/registers.h"
#include "kastarri/state.h"
#include "kastarri/tables.h"

namespace {

// How the words of a merging store are governed by a predicate, lanes_a_word bits each: 4 lanes of 8 bits, 2 of 16, 1
// of 32. Of 16-bit lanes, word 3 is governed by bits 6 and 7 (first_lane[3] = 6), and the lanes 01, the lower one, are
// the bytes 0011 (bytes[1] = 3).
template <int lanes_a_word>
struct MergeStep {
  alignas(64) word first_lane[16] = {};  // of word w, within the predicate's unit
  alignas(64) word bytes[16] = {};       // the set of bytes that a set of lanes governs

  constexpr MergeStep() {
    for (int i = 0; i < 16; ++i) {
      first_lane[i] = static_cast<word>(i * lanes_a_word % 32);
      for (int byte = 0; byte < 4; ++byte) bytes[i] |= static_cast<word>(i >> byte * lanes_a_word / 4 & 1) << byte;
    }
  }
};

// For every word of a merging store, the entry of the byte-merge table that the set of its disabled bytes selects: with
// bytes 0 and 1 disabled entry 3, which is 0xFFFF0000 unless the program has changed it. Since it may, the table is
// looked up in every store: its 16 entries fill a register or two, and a shuffle looks up all words at once. Each lane
// governs LaneBytes bytes of memory.
template <int LaneBytes, int Words>
class MergeMask {
 public:
  alignas(64) word of_word[16];

  template <class PredicateUnit>
  void look_up(const PredicateUnit* predicate) {
    const word* const table = cstub_Km_ZNB_Orbis_R5_64k_mask;
#if defined __AVX512BW__
    // The forms with a mask of all ones: with the others the compiler warns of its own headers.
    __m512i all_lanes = _mm512_set1_epi32(disabled(predicate, 0));
    if constexpr (lanes_a_word * Words == 64)
      all_lanes = _mm512_maskz_inserti64x4(0xFF, all_lanes, _mm256_set1_epi32(disabled(predicate, Words / 2)), 1);
    const __m512i lanes = _mm512_maskz_srlv_epi32(0xFFFF, all_lanes, _mm512_load_si512(step.first_lane));
    const __m512i bytes =
        LaneBytes == 1 ? lanes : _mm512_maskz_permutexvar_epi32(0xFFFF, lanes, _mm512_load_si512(step.bytes));
    _mm512_store_si512(of_word, _mm512_maskz_permutexvar_epi32(0xFFFF, bytes, _mm512_loadu_si512(table)));
#elif defined __AVX2__
    const auto load = [](const word* from) { return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(from)); };
    const __m256i low = load(table);
    const __m256i high = load(table + 8);
    for (int w = 0; w < Words; w += 8) {
      const __m256i lanes = _mm256_srlv_epi32(_mm256_set1_epi32(disabled(predicate, w)), load(step.first_lane + w));
      const __m256i bytes = LaneBytes == 1 ? lanes : _mm256_permutevar8x32_epi32(load(step.bytes), lanes);
      const auto entry = [bytes](__m256i half) {
        return _mm256_castsi256_ps(_mm256_permutevar8x32_epi32(half, bytes));
      };
      const __m256 in_high = _mm256_castsi256_ps(_mm256_slli_epi32(bytes, 28));
      _mm256_store_ps(reinterpret_cast<float*>(of_word + w), _mm256_blendv_ps(entry(low), entry(high), in_high));
    }
#else
    word entries[1 << lanes_a_word];
    for (word lanes = 0; lanes < 1 << lanes_a_word; ++lanes) entries[lanes] = table[step.bytes[lanes]];
    const word* const of_lanes = LaneBytes == 1 ? table : entries;
    const auto entry = [=](int w) {
      const word lanes = static_cast<word>(disabled(predicate, w)) >> w * lanes_a_word % 32;
      return static_cast<int>(of_lanes[lanes % (1 << lanes_a_word)]);
    };
    for (int w = 0; w < Words; w += 4)
      _mm_store_si128(reinterpret_cast<__m128i*>(of_word + w),
                      _mm_set_epi32(entry(w + 3), entry(w + 2), entry(w + 1), entry(w)));
#endif
  }

 private:
  static constexpr int lanes_a_word = 4 / LaneBytes;

  // The predicate's unit that holds the lanes of a word, with 1 for a disabled lane. Bits above those lanes
  // make no difference anywhere.
  template <class PredicateUnit>
  static int disabled(const PredicateUnit* predicate, int w) {
    return ~static_cast<int>(predicate[w * lanes_a_word / (8 * static_cast<int>(sizeof(PredicateUnit)))]);
  }

  static constexpr MergeStep<lanes_a_word> step{};
};

// Whether the table is as the library came with it, so that a byte is stored where its lane is enabled and no entry
// need be looked up. Asked on SSE2 alone, whose registers cannot look up the table.
inline bool merges_plainly() {
#ifdef __AVX2__
  return false;
#else
  __m128i inverse = _mm_set1_epi32(-1);
  for (int i = 0; i < 16; i += 4) {
    const auto load = [i](const word* from) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(from + i)); };
    inverse = _mm_and_si128(inverse, _mm_xor_si128(load(cstub_Km_ZNB_Orbis_R5_64k_mask),
                                                   load(cstub_Km_ZNB_Orbis_R5_64k_table__rk_bytelane_lsb)));
  }
  return _mm_movemask_epi8(_mm_cmpeq_epi32(inverse, _mm_set1_epi32(-1))) == 0xFFFF;
#endif
}

// Bytes that go to memory, all of them or where a mask's bits are 1: new = old ^ ((given ^ old) & mask). They are
// loaded before any is stored: what they are loaded from may overlap what they go to.
template <int Size>
class Outgoing {
  typedef word HalfRegister __attribute__((vector_size(register_bytes / 2)));
  using Chunk = std::conditional_t<(Size < register_bytes), HalfRegister, Words>;
  static constexpr int chunk_bytes = sizeof(Chunk), chunks = Size / chunk_bytes;
  static_assert(chunks * chunk_bytes == Size);

 public:
  explicit Outgoing(const void* from) {
    for (int k = 0; k < chunks; ++k) chunk_[k] = load(from, k);
  }

  void store(void* to) const {
    for (int k = 0; k < chunks; ++k) store(to, k, chunk_[k]);
  }
  void store_where(const void* mask, void* to) const {
    for (int k = 0; k < chunks; ++k) {
      const Chunk old = load(to, k);
      store(to, k, old ^ ((chunk_[k] ^ old) & load(mask, k)));
    }
  }

 private:
  static Chunk load(const void* from, int k) {
    Chunk chunk;
    std::memcpy(&chunk, static_cast<const unsigned char*>(from) + k * chunk_bytes, sizeof chunk);
    return chunk;
  }
  static void store(void* to, int k, Chunk chunk) {
    std::memcpy(static_cast<unsigned char*>(to) + k * chunk_bytes, &chunk, sizeof chunk);
  }

  Chunk chunk_[chunks];
};

// Stores the lanes of v, of layout A, by the rule as lanes of layout M where the predicate enables them. Memory is not
// touched when no lane is enabled; else, unless all are, every word of it is read and written back.
template <class M, class A, class Rule, class PredicateUnit>
inline void store_where(const void* v, Rule rule, const PredicateUnit* predicate, void* to) {
  constexpr int lane_bytes = sizeof(typename M::container), bytes = M::count * lane_bytes;
  static_assert(M::bits == 8 * lane_bytes);
  bool any = false;
  bool all = true;
  for (int bit = 0; bit < M::count; bit += 8 * sizeof(PredicateUnit)) {
    const PredicateUnit unit = predicate[bit / (8 * static_cast<int>(sizeof unit))];
    any = any || unit != 0;
    all = all && unit == static_cast<PredicateUnit>(-1);
  }
  if (!any) return;
  alignas(64) unsigned char image[std::is_same_v<M, A> ? 1 : bytes];
  if constexpr (!std::is_same_v<M, A>) {
    lanes<M::count>(Write<M>(image), rule, Read<A>(v));
    v = image;
  }
  const Outgoing<bytes> given(v);
  if (all) return given.store(to);
  if (bytes == 64 && merges_plainly()) {
    LaneMask<M::bits, M::count> enabled;
    enabled.expand(predicate);
    return given.store_where(enabled.lane, to);
  }
  MergeMask<lane_bytes, bytes / 4> mask;
  mask.look_up(predicate);
  given.store_where(mask.of_word, to);
}

}  // namespace

#endif
