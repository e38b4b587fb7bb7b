#include "images.h"

#include <immintrin.h>

#include <cstdint>
#include <cstring>

namespace kastarri_python {

namespace {

// Loops that compilers vectorise are compiled for several instruction sets.
#define FOR_EVERY_PROCESSOR __attribute__((target_clones("avx512f", "avx2", "default")))

// All numbers fit lanes of so many bits if nothing is left above the bits, no borrow either, when half of the range is
// added.
template <int bits>
inline std::uint64_t above_zero(std::int64_t number) {
  return static_cast<std::uint64_t>(number) + (std::uint64_t{1} << (bits - 1));
}

FOR_EVERY_PROCESSOR bool numbers_fit48(const std::int64_t* numbers, std::ptrdiff_t count) {
  std::uint64_t all = 0;
  for (std::ptrdiff_t i = 0; i < count; ++i) all |= above_zero<48>(numbers[i]);
  return all >> 48 == 0;
}

FOR_EVERY_PROCESSOR bool numbers_to_lanes48(const std::int64_t* numbers, std::ptrdiff_t count, std::int64_t* lanes) {
  std::uint64_t all = 0;
  for (std::ptrdiff_t i = 0; i < count; ++i) {
    all |= above_zero<48>(numbers[i]);
    lanes[i] = numbers[i];
  }
  return all >> 48 == 0;
}

FOR_EVERY_PROCESSOR bool numbers_to_lanes24(const std::int64_t* numbers, std::ptrdiff_t count, std::int32_t* lanes) {
  std::uint64_t all = 0;
  for (std::ptrdiff_t i = 0; i < count; ++i) {
    all |= above_zero<24>(numbers[i]);
    lanes[i] = static_cast<std::int32_t>(numbers[i]);
  }
  return all >> 24 == 0;
}

FOR_EVERY_PROCESSOR void lanes24_to_numbers(const std::int32_t* lanes, std::ptrdiff_t count, std::int64_t* numbers) {
  for (std::ptrdiff_t i = 0; i < count; ++i) numbers[i] = lanes[i];
}

__attribute__((target("avx2"))) void bytes_to_words(const char* bytes, std::ptrdiff_t words, char* image) {
  for (std::ptrdiff_t i = 0; i < words; ++i) {
    const __m256i lanes = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(bytes) + i);
    const int word = ~_mm256_movemask_epi8(_mm256_cmpeq_epi8(lanes, _mm256_setzero_si256()));
    std::memcpy(image + 4 * i, &word, sizeof word);
  }
}

void bytes_to_bits(const char* bytes, std::ptrdiff_t count, char* image) {
  if (count % 32 == 0 && __builtin_cpu_supports("avx2")) return bytes_to_words(bytes, count / 32, image);
  for (std::ptrdiff_t i = 0; i < count; i += 16) {
    const __m128i lanes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes + i));
    const auto bits = static_cast<std::uint16_t>(~_mm_movemask_epi8(_mm_cmpeq_epi8(lanes, _mm_setzero_si128())));
    std::memcpy(image + i / 8, &bits, sizeof bits);
  }
}

// Each byte of bits eight times over, of which one bit each is kept.
constexpr long long one_of_each = static_cast<long long>(0x8040201008040201u);

__m128i bytes_of(std::uint16_t bits) {
  const __m128i pairs = _mm_unpacklo_epi8(_mm_cvtsi32_si128(bits), _mm_cvtsi32_si128(bits));
  const __m128i copies = _mm_shuffle_epi32(_mm_shufflelo_epi16(pairs, 0x50), 0x50);
  const __m128i kept = _mm_set1_epi64x(one_of_each);
  return _mm_and_si128(_mm_cmpeq_epi8(_mm_and_si128(copies, kept), kept), _mm_set1_epi8(1));
}

__attribute__((target("avx2"))) void words_to_bytes(const char* image, std::ptrdiff_t words, char* bytes) {
  const __m256i eight_times = _mm256_setr_epi64x(0, 0x0101010101010101, 0x0202020202020202, 0x0303030303030303);
  const __m256i kept = _mm256_set1_epi64x(one_of_each), one = _mm256_set1_epi8(1);
  for (std::ptrdiff_t i = 0; i < words; ++i) {
    int word;
    std::memcpy(&word, image + 4 * i, sizeof word);
    const __m256i copies = _mm256_shuffle_epi8(_mm256_set1_epi32(word), eight_times);
    const __m256i set = _mm256_cmpeq_epi8(_mm256_and_si256(copies, kept), kept);
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(bytes) + i, _mm256_and_si256(set, one));
  }
}

void bits_to_bytes(const char* image, std::ptrdiff_t count, char* bytes) {
  if (count % 32 == 0 && __builtin_cpu_supports("avx2")) return words_to_bytes(image, count / 32, bytes);
  for (std::ptrdiff_t i = 0; i < count; i += 16) {
    std::uint16_t bits;
    std::memcpy(&bits, image + i / 8, sizeof bits);
    _mm_storeu_si128(reinterpret_cast<__m128i*>(bytes + i), bytes_of(bits));
  }
}

// Booleans of the scalar core have a byte, of which 1, 4 or 8 bits count.
char few_bits(const char* bytes, int count) {
  int bits = 0;
  for (int i = 0; i < count; ++i) bits |= (bytes[i] != 0) << i;
  return static_cast<char>(bits);
}

// `count` lanes in all, of one or more values.
bool to_lanes(const Type& type, Way way, const char* array, std::ptrdiff_t count, char* image) {
  const auto* numbers = reinterpret_cast<const std::int64_t*>(array);
  switch (way) {
    case Way::same:
      std::memcpy(image, array, static_cast<std::size_t>(type.bytes / type.count * count));
      return true;
    case Way::sum24:
      return numbers_to_lanes24(numbers, count, reinterpret_cast<std::int32_t*>(image));
    case Way::sum48:
      return numbers_to_lanes48(numbers, count, reinterpret_cast<std::int64_t*>(image));
    case Way::predicate:
      if (count < 16)
        *image = few_bits(array, static_cast<int>(count));
      else
        bytes_to_bits(array, count, image);
  }
  return true;
}

void from_lanes(const Type& type, Way way, const char* image, std::ptrdiff_t count, char* array) {
  if (way == Way::sum24) {
    lanes24_to_numbers(reinterpret_cast<const std::int32_t*>(image), count, reinterpret_cast<std::int64_t*>(array));
  } else if (way != Way::predicate) {
    std::memcpy(array, image, static_cast<std::size_t>(type.bytes / type.count * count));
  } else if (count >= 16) {
    bits_to_bytes(image, count, array);
  } else {
    for (std::ptrdiff_t i = 0; i < count; ++i) array[i] = static_cast<char>(*image >> i & 1);
  }
}

// Whether values that lie one behind the other are one sequence of lanes: those of less than 16 bits are not.
bool has_no_gaps(const Type& type, Way way) { return way != Way::predicate || type.count >= 16; }

}  // namespace

Shape shape_of(const Type& type) {
  if (type.kind == 'b') return {Way::predicate, 'b', 1, type.count};
  if (type.kind == 'w') return {Way::same, 'u', 4, type.bytes / 4};
  if (type.bits == 24) return {Way::sum24, 'i', 8, type.count};
  if (type.bits == 48) return {Way::sum48, 'i', 8, type.count};
  return {Way::same, type.kind, type.bits / 8, type.count};
}

bool to_images(const Type& type, const char* array, std::ptrdiff_t stride, std::ptrdiff_t n, char* images) {
  const Shape shape = shape_of(type);
  if (stride == shape.bytes() && has_no_gaps(type, shape.way))
    return to_lanes(type, shape.way, array, n * type.count, images);
  bool fits = true;
  for (std::ptrdiff_t k = 0; k < n; ++k)
    fits &= to_lanes(type, shape.way, array + k * stride, type.count, images + k * type.bytes);
  return fits;
}

bool fit(const Type& type, const char* array, std::ptrdiff_t stride, std::ptrdiff_t n) {
  if (shape_of(type).way != Way::sum48) return true;
  const auto lanes = [array](std::ptrdiff_t from) { return reinterpret_cast<const std::int64_t*>(array + from); };
  if (stride == type.bytes) return numbers_fit48(lanes(0), n * type.count);
  bool all_fit = true;
  for (std::ptrdiff_t k = 0; k < n; ++k) all_fit &= numbers_fit48(lanes(k * stride), type.count);
  return all_fit;
}

void to_array(const Type& type, const char* images, std::ptrdiff_t n, char* array) {
  const Shape shape = shape_of(type);
  if (has_no_gaps(type, shape.way)) return from_lanes(type, shape.way, images, n * type.count, array);
  for (std::ptrdiff_t k = 0; k < n; ++k)
    from_lanes(type, shape.way, images + k * type.bytes, type.count, array + k * shape.bytes());
}

}  // namespace kastarri_python
