// Drives multiplies by their names. What a lane has to be is told by the name alone, read letter by letter
// as the core's programmer reads it, so that a row with a wrong layout, kind or arrangement fails too.
#ifndef KASTARRI_TESTS_MULTIPLY_DRIVERS_H
#define KASTARRI_TESTS_MULTIPLY_DRIVERS_H

#include "kastarri/multiply.h"
#include "support/drivers.h"

namespace testing_support {

using Bits = std::uint64_t;  // numbers modulo 2^64: every lane is a part of it

class MultiplyName {
 public:
  explicit MultiplyName(std::string name) : rest_(std::move(name)) {
    square = take("SQR");
    widened = take("ADDW") ? '+' : take("SUBW") ? '-' : ' ';
    if (!square) take("MUL");
    transfer = take("SGN");
    saturating = transfer && take("S");
    first_unsigned = second_unsigned = take("UU") || ((square || widened != ' ') && take("U"));
    if (!first_unsigned && !(first_unsigned = take("US"))) second_unsigned = take("SU");
    window = take("4T");
    difference = take("PD");
    products = difference || take("P") ? 2 : take("Q") || window ? 4 : 1;
    kind = take("A") ? 'A' : take("S") ? 'S' : ' ';
    high = take("H");
    predicated = rest_.back() == 'T';
    for (const char* p : {"PACKL", "PACKQ", "PACKP"})
      if (rest_.find(p) != std::string::npos) pack = p[4];
    shape = rest_;
  }

  bool has(const char* text) const { return shape.find(text) != std::string::npos; }

  bool square, transfer, saturating, first_unsigned, second_unsigned, window, difference, high, predicated;
  int products;
  char kind, pack = ' ', widened;  // widened lanes are added or subtracted, not multiplied
  std::string shape;

 private:
  bool take(const char* prefix) {
    if (rest_.compare(0, std::strlen(prefix), prefix) != 0) return false;
    rest_.erase(0, std::strlen(prefix));
    return true;
  }
  std::string rest_;
};

// The operands of one call, as bytes in memory. A reference to one may point beyond its first byte, into the same word.
struct Factors {
  const unsigned char* operand[8];
  std::size_t beyond[8];

  template <class A>
  __attribute__((no_sanitize("undefined"))) const A& reference(std::size_t which) const {
    return *reinterpret_cast<const A*>(operand[which] + beyond[which]);
  }

  Bits at(int which, int lane, int bits, bool is_unsigned) const {
    Bits value = 0;
    for (int b = bits / 8; b-- > 0;) value = value << 8 | operand[which][lane * (bits / 8) + b];
    const Bits sign = Bits{1} << (bits - 1);
    return is_unsigned ? value : (value ^ sign) - sign;
  }
};

// The sum of products that lane i gets, by the shape's letters.
class MultiplyModel {
 public:
  explicit MultiplyModel(const std::string& name) : n_(name) {
    mixed_words_ = n_.has("X16X32");
    if (n_.has("2NX8X16")) form_ = bytes_and_halves;
    if (n_.has("2NR8")) form_ = channels;
    if (n_.has("XR")) form_ = coefficients;
    if (n_.has("NX16C") || n_.has("NX16J") || n_.has("X32C") || n_.has("X32J")) form_ = complex;
    bits_ = n_.has("32") ? 32 : n_.has("16") && !n_.has("2N8") ? 16 : 8;
    coefficient_bits_ = n_.has("XR16") ? 16 : 8;
    words_ = n_.has("8QXR") ? 4 : n_.has("DXR") ? 2 : 1;
    unsigned_coefficient_ = n_.second_unsigned || n_.has("R8UX");
  }

  const MultiplyName& name() const { return n_; }

  Bits sum(const Factors& f, int i) const {
    switch (form_) {
      case bytes_and_halves:
        return f.at(0, i, 8, n_.first_unsigned) * f.at(1 + i % 2, i / 2, 16, false);
      case channels:
        return channel_sum(f, i);
      case coefficients:
        return coefficient_sum(f, i);
      case complex:
        return complex_sum(f, i);
      default:
        return plain_sum(f, i);
    }
  }

 private:
  Bits plain_sum(const Factors& f, int i) const {
    if (mixed_words_) {
      const Bits product = f.at(0, 2 * i + n_.has("_1"), 16, n_.first_unsigned) * f.at(1, i, 32, n_.second_unsigned);
      return n_.high ? product << 16 : product;
    }
    const auto product = [&](int p) {
      const Bits x = f.at(n_.square ? p : 2 * p, i, bits_, n_.first_unsigned);
      return x * (n_.square ? x : f.at(2 * p + 1, i, bits_, n_.second_unsigned));
    };
    if (n_.widened != ' ') {
      const Bits a = f.at(0, i, bits_, n_.first_unsigned), b = f.at(1, i, bits_, n_.first_unsigned);
      return n_.widened == '+' ? a + b : a - b;
    }
    if (n_.transfer) return signed_by(f.at(0, i, bits_, false), f.at(1, i, bits_, false));
    if (n_.products == 1) return product(0);
    return n_.difference ? product(0) - product(1) : product(0) + product(1);
  }

  Bits signed_by(Bits a, Bits b) const {
    const Bits smallest = 0 - (Bits{1} << (bits_ - 1));
    if (a == 0 || static_cast<Int>(a) > 0) return a == 0 ? 0 : b;
    return n_.saturating && b == smallest ? ~smallest : 0 - b;
  }

  // Coefficient number `from_top` of the word, counted from the first that the form uses downwards.
  Bits coefficient(const Factors& f, int word_operand, int from_top) const {
    const int in_word = 32 / coefficient_bits_;
    const int used = n_.products < in_word ? n_.products : in_word;
    return f.at(word_operand, used - 1 - from_top % used, coefficient_bits_, unsigned_coefficient_);
  }

  Bits coefficient_sum(const Factors& f, int i) const {
    const int vectors = n_.window ? 2 : n_.products, lanes = 512 / bits_;
    Bits sum = 0;
    for (int p = 0; p < n_.products; ++p) {
      const int operand = n_.window ? (i + p) / lanes : p, lane = n_.window ? (i + p) % lanes : i;
      sum += f.at(operand, lane, bits_, n_.first_unsigned) * coefficient(f, vectors + i % words_, p);
    }
    return sum;
  }

  Bits channel_sum(const Factors& f, int i) const {
    Bits sum = 0;
    for (int p = 0; p < n_.products; ++p)
      sum += f.at(2 * p + i % 2, i / 2, 16, n_.first_unsigned) * coefficient(f, 2 * n_.products, p);
    return sum;
  }

  Bits complex_sum(const Factors& f, int i) const {
    const int k = i / 2;
    const Bits re = f.at(0, 2 * k, bits_, false), im = f.at(0, 2 * k + 1, bits_, false);
    const Bits re2 = n_.has("_1") ? 0 : f.at(1, 2 * k, bits_, false);
    const Bits im2 = n_.has("_0") ? 0 : f.at(1, 2 * k + 1, bits_, false) * (n_.has("J") ? Bits(-1) : 1);
    return i % 2 == 0 ? re * re2 - im * im2 : im * re2 + re * im2;
  }

  MultiplyName n_;
  enum { plain, bytes_and_halves, channels, coefficients, complex } form_ = plain;
  bool mixed_words_, unsigned_coefficient_;
  int bits_, coefficient_bits_, words_;
};

// Bits of a narrow result.
inline Bits packed(char pack, Bits product) {
  return pack == 'Q' ? (product * 2 + 0x8000) >> 16 : pack == 'P' ? (product * 64 + 0x8000) >> 16 : product;
}

// Random bits above the lanes of a wide register, which its readers must not see.
template <class L>
void dirty(void* image, std::mt19937& random) {
  constexpr int size = sizeof(typename L::container);
  for (int i = 0; i < L::count; ++i)
    for (int b = L::bits / 8; b < size; ++b)
      static_cast<unsigned char*>(image)[size * i + b] = static_cast<unsigned char>(random());
}

// Most halves of words the smallest number, signed or unsigned: sums of their products are as large as they can be.
inline void make_smallest(Image& image, bool is_unsigned, std::mt19937& random) {
  for (std::size_t i = 0; i < sizeof image.bytes; i += 2) {
    if (random() % 4 == 0) continue;
    image.bytes[i] = 0;
    image.bytes[i + 1] = is_unsigned ? 0 : 0x80;
  }
}

template <class T>
constexpr bool is_coefficient = std::is_same_v<T, qv_int32pr>;

// One member: W is its result, which the accumulating kinds read and write; `call` gets the accumulator
// and the operands' addresses and returns the result.
template <class W, class... A, class Call>
void drive_multiply(const std::string& op, Call call) {
  using L = layout_of<W>;
  const MultiplyModel model(op);
  const MultiplyName& name = model.name();
  Operands<layout_of<W>, layout_of<A>...> operands;
  std::mt19937 random(seed);
  for (int n = 0; n < operands.rounds(); ++n) {
    const auto* images = operands.round(n);
    W acc = as_register<W>(images[0].bytes);
    dirty<L>(acc._, random);
    const W before = acc;
    // A word of coefficients lies anywhere, at times in the accumulator that is about to be written.
    Factors f{};
    int which = 0;
    Image factors[] = {(static_cast<void>(sizeof(A)), *++images)...};
    constexpr bool are_words[] = {is_coefficient<A>...};
    for (std::size_t i = 0; n % 4 == 0 && i < sizeof...(A); ++i)
      make_smallest(factors[i], name.first_unsigned && !are_words[i], random);
    const auto place = [&](bool is_word) {
      const unsigned char* from = factors[which].bytes;
      const std::size_t slot = random() % 16;
      if (is_word && n % 2) from = reinterpret_cast<unsigned char*>(acc._);
      if (is_word && n % 3 == 0) f.beyond[which] = random() % 4;
      f.operand[which++] = is_word ? from + 4 * slot : from;
    };
    (place(is_coefficient<A>), ...);

    W expected = acc;
    for (int i = 0; i < L::count; ++i) {
      const Bits old = static_cast<Bits>(lane<L>(acc._, i)), sum = packed(name.pack, model.sum(f, i));
      if (name.predicated && !(f.operand[2][i / 8] >> (i % 8) & 1)) continue;
      set_lane<L>(expected._, i, static_cast<Int>(name.kind == 'A' ? old + sum : name.kind == 'S' ? old - sum : sum));
    }
    const W got = call(acc, f);
    if (same_bits(expected, got)) continue;
    for (int i = 0; i < L::count; ++i)
      if (lane<L>(expected._, i) != lane<L>(got._, i))
        FAIL() << op << " [" << cstub_Km_ZNB_Orbis_R5_64k_target() << ", seed " << seed << ", round " << n << "] lane "
               << i << ": sum " << static_cast<Int>(model.sum(f, i)) << ", accumulator " << lane<L>(before._, i)
               << ", expected " << lane<L>(expected._, i) << ", got " << lane<L>(got._, i);
    FAIL() << op << ": lanes are right, bits outside them are not";
  }
}

template <class R, class... A, std::size_t... I>
void drive_multiply(const std::string& op, R (*function)(const A&...), std::index_sequence<I...>) {
  drive_multiply<R, A...>(op, [function](R&, const Factors& f) { return function(f.template reference<A>(I)...); });
}
template <class W, class... A, std::size_t... I>
void drive_multiply(const std::string& op, void (*function)(W&, const A&...), std::index_sequence<I...>) {
  drive_multiply<W, A...>(op, [function](W& acc, const Factors& f) {
    function(acc, f.template reference<A>(I)...);
    return acc;
  });
}
// The accumulator handed in as a factor too: it is read before it is written.
template <class W, class B, class... A>
void expect_in_place(const std::string& op, void (*function)(W&, const W&, const B&, const A&...),
                     const A&... predicate) {
  std::mt19937 random(seed);
  W apart, in_place, b;
  fill_random<layout_of<W>>(in_place._, random);
  fill_random<layout_of<W>>(b._, random);
  apart = in_place;
  const W a = in_place;
  function(apart, a, b, predicate...);
  function(in_place, in_place, b, predicate...);
  EXPECT_TRUE(same_bits(apart, in_place)) << op << " in place";
}

template <class R, class... A>
void drive_multiply(const std::string& op, R (*function)(const A&...)) {
  drive_multiply(op, function, std::index_sequence_for<A...>{});
}
template <class W, class... A>
void drive_multiply(const std::string& op, void (*function)(W&, const A&...)) {
  drive_multiply(op, function, std::index_sequence_for<A...>{});
  if constexpr (std::is_same_v<void(W&, const W&, const W&), void(W&, const A&...)>)
    expect_in_place<W, W>(op, function);
}

}  // namespace testing_support

#endif
