#include "images.h"

#include <emmintrin.h>

#include <cstdint>
#include <cstring>

namespace kastarri_python {

namespace {

// Whether all numbers fit in lanes of so many bits: if bits are left above, or a borrow from them, when half the range is
// added.
template <int bits>
class Fitting {
 public:
  void add(std::int64_t number) { all_ |= static_cast<std::uint64_t>(number) + (std::uint64_t{1} << (bits - 1)); }
  explicit operator bool() const { return all_ >> bits == 0; }

 private:
  std::uint64_t all_ = 0;
};

template <int bits, class Lane>
bool numbers_to_lanes(const std::int64_t* numbers, int count, Lane* lanes) {
  Fitting<bits> fitting;
  for (int i = 0; i < count; ++i) {
    fitting.add(numbers[i]);
    lanes[i] = static_cast<Lane>(numbers[i]);
  }
  return static_cast<bool>(fitting);
}

const __m128i bit_of_byte = _mm_set1_epi64x(static_cast<long long>(0x8040201008040201u));

void bytes_to_bits(const char* bytes, int count, char* image) {
  for (int i = 0; i < count; i += 16, bytes += 16, image += 2) {
    const __m128i zeros = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes)), _mm_setzero_si128());
    const auto bits = static_cast<std::uint16_t>(~_mm_movemask_epi8(zeros));
    std::memcpy(image, &bits, sizeof bits);
  }
}

void bits_to_bytes(const char* image, int count, char* bytes) {
  for (int i = 0; i < count; i += 16, bytes += 16, image += 2) {
    const auto byte = [image](int k) { return static_cast<unsigned char>(image[k]) * 0x0101010101010101; };
    const __m128i copies = _mm_set_epi64x(static_cast<long long>(byte(1)), static_cast<long long>(byte(0)));
    const __m128i set = _mm_cmpeq_epi8(_mm_and_si128(copies, bit_of_byte), bit_of_byte);
    _mm_storeu_si128(reinterpret_cast<__m128i*>(bytes), _mm_and_si128(set, _mm_set1_epi8(1)));
  }
}

// Booleans of the scalar core have a byte, of which 1, 4 or 8 bits count.
char few_bits(const char* bytes, int count) {
  int bits = 0;
  for (int i = 0; i < count; ++i) bits |= (bytes[i] != 0) << i;
  return static_cast<char>(bits);
}

bool to_image(const Type& type, Way way, const char* array, char* image) {
  switch (way) {
    case Way::same:
      std::memcpy(image, array, static_cast<std::size_t>(type.bytes));
      return true;
    case Way::sum24:
      return numbers_to_lanes<24>(reinterpret_cast<const std::int64_t*>(array), type.count,
                                  reinterpret_cast<std::int32_t*>(image));
    case Way::sum48:
      return numbers_to_lanes<48>(reinterpret_cast<const std::int64_t*>(array), type.count,
                                  reinterpret_cast<std::int64_t*>(image));
    case Way::predicate:
      if (type.count < 16)
        *image = few_bits(array, type.count);
      else
        bytes_to_bits(array, type.count, image);
  }
  return true;
}

}  // namespace

Shape shape_of(const Type& type) {
  if (type.kind == 'b') return {Way::predicate, 'b', 1, type.count};
  if (type.kind == 'w') return {Way::same, 'u', 4, type.bytes / 4};
  if (type.bits == 24) return {Way::sum24, 'i', 8, type.count};
  if (type.bits == 48) return {Way::sum48, 'i', 8, type.count};
  return {Way::same, type.kind, type.bits / 8, type.count};
}

bool to_images(const Type& type, const char* array, std::ptrdiff_t stride, std::ptrdiff_t n, char* images) {
  const Way way = shape_of(type).way;
  bool fits = true;
  for (std::ptrdiff_t k = 0; k < n; ++k) fits &= to_image(type, way, array + k * stride, images + k * type.bytes);
  return fits;
}

void to_array(const Type& type, const char* images, std::ptrdiff_t n, char* array) {
  const Shape shape = shape_of(type);
  for (std::ptrdiff_t k = 0; k < n; ++k, images += type.bytes, array += shape.bytes()) {
    if (shape.way == Way::sum24) {
      for (int i = 0; i < type.count; ++i)
        reinterpret_cast<std::int64_t*>(array)[i] = reinterpret_cast<const std::int32_t*>(images)[i];
    } else if (shape.way != Way::predicate) {
      std::memcpy(array, images, static_cast<std::size_t>(type.bytes));
    } else if (type.count >= 16) {
      bits_to_bytes(images, type.count, array);
    } else {
      for (int i = 0; i < type.count; ++i) array[i] = static_cast<char>(*images >> i & 1);
    }
  }
}

}  // namespace kastarri_python
