/// Registers as text, for logs. The text is that of gdb with the library's printers.
///
///     std::cout << v;                                               // 32 x int16 = {16384, -8192, ...}
///     std::cout << kastarri::as(v, kastarri::form::q(15));          // 32 x int16 q15 = {0.50000, -0.25000, ...}
///     kastarri::print(stderr, v, kastarri::form::hex);              // 32 x int16 hex = {0x4000, 0xe000, ...}
///     std::string text = kastarri::to_string(v);
///
/// Lane 0 comes first, and bit 0 of a predicate. <ostream> and <string> are included by the program that uses them.
#ifndef KASTARRI_PRINT_H
#define KASTARRI_PRINT_H

#include "kastarri/library.h"

#include <cstdio>
#include <iosfwd>

#include "kastarri/layouts.h"
#include "kastarri/types.h"

namespace kastarri {

/// How the bits of a lane are read. Lanes that a form does not fit are shown in decimal: float takes 32 bits
/// and half takes 16, and fixed point takes integers. A word of coefficients (qv_int32pr, qv_int64pr) is shown by the
/// numbers of 16 or 8 bits in it, in the forms halves and bytes, and in fixed point with 8 to 15 or 1 to 7 bits of
/// fraction.
struct Form {
  enum Kind { decimal, hex, float_, half, fixed, halves, bytes };
  Kind kind;
  int fraction_bits;
};

namespace form {
constexpr Form decimal = {Form::decimal, 0};
constexpr Form hex = {Form::hex, 0};
constexpr Form float_ = {Form::float_, 0};
constexpr Form half = {Form::half, 0};
constexpr Form halves = {Form::halves, 0};
constexpr Form bytes = {Form::bytes, 0};
/// Fixed point with 0 to 63 bits of fraction.
constexpr Form q(int fraction_bits) { return Form{Form::fixed, fraction_bits}; }
}  // namespace form

namespace print_detail {

// The bits of a lane.
using Pattern = unsigned long long;

// The register's bytes, and its lanes as in layouts.h.
struct Register {
  const unsigned char* bytes;
  int size;
  char kind;
  int bits, count;
  bool coefficients;  // a word of the scalar core

  const unsigned char* lane(int index) const { return bytes + size / count * index; }
  // A lane of up to 64 bits.
  Pattern pattern(int index) const {
    Pattern p = 0;
    for (int k = bits / 8 - 1; k >= 0; --k) p = p << 8 | lane(index)[k];
    return p;
  }
  bool bit(int index) const { return (bytes[index / 8] >> index % 8 & 1) != 0; }
};

template <class T>
struct Lanes;

// Into how many bits each a form takes a word of coefficients apart; 0 if it does not.
inline int part_bits(Form form) {
  if (form.kind == Form::halves) return 16;
  if (form.kind == Form::bytes) return 8;
  const bool fraction = form.kind == Form::fixed && form.fraction_bits >= 1 && form.fraction_bits <= 15;
  return !fraction ? 0 : form.fraction_bits < 8 ? 8 : 16;
}

inline Register in_parts(Register r, Form form) {
  const int bits = r.coefficients ? part_bits(form) : 0;
  return bits == 0 ? r : Register{r.bytes, r.size, 'i', bits, r.bits / bits, false};
}

inline bool fits(const Register& r, Form form) {
  const bool number = r.kind == 'i' || r.kind == 'u';
  switch (form.kind) {
    case Form::fixed:
      return number && form.fraction_bits >= 0 && form.fraction_bits <= 63;
    case Form::float_:
      return (number || r.kind == 'f') && r.bits == 32;
    case Form::half:
      return (number || r.kind == 'f') && r.bits == 16;
    case Form::halves:
    case Form::bytes:
      return false;
    default:
      return true;
  }
}

// A line of text. The longest is that of 64 lanes of 24 characters.
class Text {
 public:
  const char* c_str() const { return text; }
  void put(char c) {
    if (length + 1 < sizeof text) text[length++] = c;
    text[length] = 0;
  }
  void put(const char* words) {
    while (*words != 0) put(*words++);
  }
  // In decimal, with leading zeros up to so many digits.
  void put(Pattern number, int digits = 1) {
    if (number > 9 || digits > 1) put(number / 10, digits - 1);
    put(static_cast<char>('0' + number % 10));
  }
  void put_hex(const unsigned char* bytes, int size) {
    put("0x");
    for (int k = 2 * size - 1; k >= 0; --k) put_hex_digit(bytes[k / 2] >> 4 * (k % 2));
  }
  void put_hex_digit(int digit) { put("0123456789abcdef"[digit & 15]); }

 private:
  char text[2048] = "";
  unsigned length = 0;
};

// magnitude / 2^fraction_bits, rounded to as many digits as keep all lanes apart.
inline void put_fixed_point(Text& text, Pattern magnitude, int fraction_bits) {
  if (fraction_bits == 0) return text.put(magnitude);
  const int digits = (fraction_bits * 30103 + 99999) / 100000;  // fraction_bits * log10(2), rounded up
  Pattern whole = magnitude >> fraction_bits;
  Pattern rest = magnitude << (64 - fraction_bits);  // in units of 2^-64
  Pattern fraction = 0, one = 1;
  for (int k = 0; k < digits; ++k) {
    const Pattern low = (rest & 0xffffffff) * 10, high = (rest >> 32) * 10 + (low >> 32);
    rest = high << 32 | (low & 0xffffffff);
    fraction = fraction * 10 + (high >> 32);
    one *= 10;
  }
  fraction += rest >> 63;
  if (fraction == one) {
    fraction = 0;
    ++whole;
  }
  text.put(whole);
  text.put('.');
  text.put(fraction, digits);
}

// Nine digits, with a point whatever the program's locale has.
inline void put_double(Text& text, double number) {
  char digits[32];
  std::snprintf(digits, sizeof digits, "%.9g", number);
  bool point = false;
  for (const char* c = digits; *c != 0; ++c) {
    const bool of_number = (*c >= '0' && *c <= '9') || *c == 'e' || *c == '+' || *c == '-';
    if (of_number || !point) text.put(of_number ? *c : '.');
    point = point || !of_number;
  }
}

// The number that an IEEE pattern stands for, made of whole numbers: independent of how the host treats subnormals.
inline void put_floating(Text& text, const Register& r, int index) {
  const int fraction_bits = r.bits == 16 ? 10 : 23;
  const int top = (1 << (r.bits - 1 - fraction_bits)) - 1;
  const Pattern pattern = r.pattern(index), hidden = 1ull << fraction_bits, fraction = pattern & (hidden - 1);
  const int exponent = static_cast<int>(pattern >> fraction_bits) & top;
  if (exponent == top && fraction != 0) {
    text.put("nan(");
    text.put_hex(r.lane(index), r.bits / 8);
    return text.put(')');
  }
  if ((pattern >> (r.bits - 1) & 1) != 0) text.put('-');
  if (exponent == top) return text.put("inf");
  const Pattern mantissa = exponent > 0 ? fraction | hidden : fraction;
  const int scale = (exponent > 0 ? exponent : 1) - top / 2 - fraction_bits;
  put_double(text, __builtin_ldexp(static_cast<double>(mantissa), scale));
}

inline void put_lane(Text& text, const Register& r, Form form, int index) {
  if (r.kind == 'w' || form.kind == Form::hex) return text.put_hex(r.lane(index), r.bits / 8);
  if (r.kind == 'f' || form.kind == Form::float_ || form.kind == Form::half) return put_floating(text, r, index);
  const Pattern pattern = r.pattern(index), sign = 1ull << (r.bits - 1);
  const bool negative = r.kind == 'i' && (pattern & sign) != 0;
  if (negative) text.put('-');
  put_fixed_point(text, negative ? 2 * sign - pattern : pattern, form.kind == Form::fixed ? form.fraction_bits : 0);
}

inline void put_bits(Text& text, const Register& r, Form form) {
  if (form.kind == Form::hex) {
    text.put("0x");
    for (int digit = (r.count + 3) / 4 - 1; digit >= 0; --digit) {
      int value = 0;
      for (int k = 3; k >= 0; --k) value = 2 * value + (4 * digit + k < r.count && r.bit(4 * digit + k) ? 1 : 0);
      text.put_hex_digit(value);
    }
    return;
  }
  if (r.count > 1) {
    text.put("bits 0..");
    text.put(static_cast<Pattern>(r.count - 1));
    text.put(": ");
  }
  for (int k = 0; k < r.count; ++k) {
    if (k > 0 && k % 8 == 0) text.put(' ');
    text.put(r.bit(k) ? '1' : '0');
  }
}

// The form between two texts, unless it is the one that goes without saying.
inline void put_form(Text& text, const Register& r, Form form, const char* before, const char* behind) {
  if (form.kind == Form::decimal || r.kind == 'w' || (r.kind == 'f' && form.kind != Form::hex)) return;
  text.put(before);
  if (form.kind == Form::fixed) {
    text.put('q');
    text.put(static_cast<Pattern>(form.fraction_bits));
  } else {
    text.put(form.kind == Form::hex ? "hex" : form.kind == Form::half ? "half" : "float");
  }
  text.put(behind);
}

inline void put_kind(Text& text, const Register& r) {
  if (r.kind == 'f') return text.put(r.bits == 16 ? "half" : "float");
  text.put(r.kind == 'i' ? "int" : r.kind == 'u' ? "uint" : "bits");
  text.put(static_cast<Pattern>(r.bits));
}

inline Text text_of(const Register& whole, Form wanted) {
  Text text;
  const Register r = in_parts(whole, wanted);
  const Form form = fits(r, wanted) ? wanted : form::decimal;
  if (r.kind == 'b') {
    put_bits(text, r, form);
  } else if (r.count == 1) {
    put_lane(text, r, form, 0);
    if (form.kind != Form::hex) put_form(text, r, form, " (", ")");
  } else {
    text.put(static_cast<Pattern>(r.count));
    text.put(" x ");
    put_kind(text, r);
    put_form(text, r, form, " ", "");
    text.put(" = {");
    for (int i = 0; i < r.count; ++i) {
      if (i > 0) text.put(", ");
      put_lane(text, r, form, i);
    }
    text.put('}');
  }
  return text;
}

template <class T>
Text text_of(const T& value, Form form) {
  return text_of(Lanes<T>::of(value), form);
}

// The types of the scalar core's words are those whose names end so.
inline bool is_word(const char* name) {
  const std::size_t length = __builtin_strlen(name);
  return name[length - 2] == 'p' && name[length - 1] == 'r';
}

template <class T>
struct Shown {
  const T& value;
  Form form;
};

}  // namespace print_detail

/// A register as text.
template <class T, class String = std::string>
String to_string(const T& value, Form form = form::decimal) {
  return String(print_detail::text_of(value, form).c_str());
}

/// Writes a register to a file of the C library, without a new line.
template <class T>
void print(std::FILE* file, const T& value, Form form = form::decimal) {
  std::fputs(print_detail::text_of(value, form).c_str(), file);
}

/// A register to be written to a stream in that form. It refers to the register.
template <class T>
print_detail::Shown<T> as(const T& value, Form form) {
  return print_detail::Shown<T>{value, form};
}

namespace print_detail {
template <class Traits, class T>
std::basic_ostream<char, Traits>& operator<<(std::basic_ostream<char, Traits>& out, const Shown<T>& shown) {
  return out << text_of(shown.value, shown.form).c_str();
}
}  // namespace print_detail

}  // namespace kastarri

#define KASTARRI_PRINTED(T, KIND, BITS, COUNT)                                                            \
  namespace kastarri {                                                                                    \
  namespace print_detail {                                                                                \
  template <>                                                                                             \
  struct Lanes<T##_space::T##_> {                                                                         \
    static Register of(const T##_space::T##_& r) {                                                        \
      return {reinterpret_cast<const unsigned char*>(r._), sizeof r, #KIND[0], BITS, COUNT, is_word(#T)}; \
    }                                                                                                     \
  };                                                                                                      \
  }                                                                                                       \
  }                                                                                                       \
  namespace T##_space {                                                                                   \
    template <class Traits>                                                                               \
    std::basic_ostream<char, Traits>& operator<<(std::basic_ostream<char, Traits>& out, const T##_& r) {  \
      return out << kastarri::print_detail::text_of(r, kastarri::form::decimal).c_str();                  \
    }                                                                                                     \
  }
KASTARRI_REGISTER_TYPES(KASTARRI_PRINTED)
#undef KASTARRI_PRINTED

#endif
