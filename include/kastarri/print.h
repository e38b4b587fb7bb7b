/// Registers as text, for logs. The text is that of gdb with the library's printers.
///
///     std::cout << v;                                               // 32 x int16 = {16384, -8192, ...}
///     std::cout << kastarri::as(v, kastarri::form::q(15));          // 32 x int16 q15 = {0.50000, -0.25000, ...}
///     kastarri::print(stderr, v, kastarri::form::hex);              // 32 x int16 hex = {0x4000, 0xe000, ...}
///     std::string text = kastarri::to_string(v);
///
/// Lane 0 comes first, and bit 0 of a predicate.
#ifndef KASTARRI_PRINT_H
#define KASTARRI_PRINT_H

#include <cmath>
#include <cstdio>
#include <locale>
#include <ostream>
#include <sstream>
#include <string>

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

inline std::string hexadecimal(const unsigned char* bytes, int size) {
  std::string text = "0x";
  for (int k = size - 1; k >= 0; --k) {
    text += "0123456789abcdef"[bytes[k] >> 4];
    text += "0123456789abcdef"[bytes[k] & 15];
  }
  return text;
}

// magnitude / 2^fraction_bits, rounded to as many digits as keep all lanes apart.
inline std::string fixed_point(Pattern magnitude, int fraction_bits) {
  if (fraction_bits == 0) return std::to_string(magnitude);
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
  const std::string text = std::to_string(fraction);
  return std::to_string(whole) + "." + std::string(static_cast<std::size_t>(digits) - text.size(), '0') + text;
}

// The number that an IEEE pattern stands for, made of whole numbers: independent of how the host treats subnormals.
inline std::string floating(const Register& r, int index) {
  const int fraction_bits = r.bits == 16 ? 10 : 23;
  const int top = (1 << (r.bits - 1 - fraction_bits)) - 1;
  const Pattern pattern = r.pattern(index), hidden = 1ull << fraction_bits, fraction = pattern & (hidden - 1);
  const int exponent = static_cast<int>(pattern >> fraction_bits) & top;
  if (exponent == top && fraction != 0) return "nan(" + hexadecimal(r.lane(index), r.bits / 8) + ")";
  const std::string sign = (pattern >> (r.bits - 1) & 1) != 0 ? "-" : "";
  if (exponent == top) return sign + "inf";
  const Pattern mantissa = exponent > 0 ? fraction | hidden : fraction;
  std::ostringstream text;
  text.imbue(std::locale::classic());
  text.precision(9);
  text << std::ldexp(static_cast<double>(mantissa), (exponent > 0 ? exponent : 1) - top / 2 - fraction_bits);
  return sign + text.str();
}

inline std::string lane_text(const Register& r, Form form, int index) {
  if (r.kind == 'w' || form.kind == Form::hex) return hexadecimal(r.lane(index), r.bits / 8);
  if (r.kind == 'f' || form.kind == Form::float_ || form.kind == Form::half) return floating(r, index);
  const Pattern pattern = r.pattern(index), sign = 1ull << (r.bits - 1);
  const bool negative = r.kind == 'i' && (pattern & sign) != 0;
  const Pattern magnitude = negative ? 2 * sign - pattern : pattern;
  const int fraction_bits = form.kind == Form::fixed ? form.fraction_bits : 0;
  return (negative ? "-" : "") + fixed_point(magnitude, fraction_bits);
}

inline std::string bits_text(const Register& r, Form form) {
  std::string text;
  if (form.kind == Form::hex) {
    for (int digit = (r.count + 3) / 4 - 1; digit >= 0; --digit) {
      int value = 0;
      for (int k = 3; k >= 0; --k) value = 2 * value + (4 * digit + k < r.count && r.bit(4 * digit + k) ? 1 : 0);
      text += "0123456789abcdef"[value];
    }
    return "0x" + text;
  }
  for (int k = 0; k < r.count; ++k) {
    if (k > 0 && k % 8 == 0) text += ' ';
    text += r.bit(k) ? '1' : '0';
  }
  return r.count == 1 ? text : "bits 0.." + std::to_string(r.count - 1) + ": " + text;
}

// The form, unless it is the one that goes without saying.
inline std::string form_to_tell(const Register& r, Form form) {
  if (form.kind == Form::decimal || r.kind == 'w') return "";
  if (form.kind == Form::hex) return "hex";
  if (r.kind == 'f') return "";
  if (form.kind == Form::fixed) return "q" + std::to_string(form.fraction_bits);
  return form.kind == Form::half ? "half" : "float";
}

inline std::string kind_text(const Register& r) {
  if (r.kind == 'f') return r.bits == 16 ? "half" : "float";
  return (r.kind == 'i' ? "int" : r.kind == 'u' ? "uint" : "bits") + std::to_string(r.bits);
}

inline std::string text_of(const Register& whole, Form wanted) {
  const Register r = in_parts(whole, wanted);
  const Form form = fits(r, wanted) ? wanted : form::decimal;
  if (r.kind == 'b') return bits_text(r, form);
  const std::string told = form_to_tell(r, form);
  if (r.count == 1) return lane_text(r, form, 0) + (told.empty() || told == "hex" ? "" : " (" + told + ")");
  std::string text = std::to_string(r.count) + " x " + kind_text(r) + (told.empty() ? "" : " " + told) + " = {";
  for (int i = 0; i < r.count; ++i) text += (i > 0 ? ", " : "") + lane_text(r, form, i);
  return text + "}";
}

// The types of the scalar core's words are those whose names end so.
template <std::size_t size>
constexpr bool is_word(const char (&name)[size]) {
  return name[size - 3] == 'p' && name[size - 2] == 'r';
}

template <class T>
struct Shown {
  const T& value;
  Form form;
};

}  // namespace print_detail

/// A register as text.
template <class T>
std::string to_string(const T& value, Form form = form::decimal) {
  return print_detail::text_of(print_detail::Lanes<T>::of(value), form);
}

/// Writes a register to a file of the C library, without a new line.
template <class T>
void print(std::FILE* file, const T& value, Form form = form::decimal) {
  std::fputs(to_string(value, form).c_str(), file);
}

/// A register to be written to a stream in that form. It refers to the register.
template <class T>
print_detail::Shown<T> as(const T& value, Form form) {
  return print_detail::Shown<T>{value, form};
}

namespace print_detail {
template <class T>
std::ostream& operator<<(std::ostream& out, const Shown<T>& shown) {
  return out << to_string(shown.value, shown.form);
}
}  // namespace print_detail

}  // namespace kastarri

#define KASTARRI_PRINTED(T, KIND, BITS, COUNT)                                                                  \
  namespace kastarri {                                                                                          \
  namespace print_detail {                                                                                      \
  template <>                                                                                                   \
  struct Lanes<T##_space::T##_> {                                                                               \
    static Register of(const T##_space::T##_& r) {                                                              \
      return {reinterpret_cast<const unsigned char*>(r._), sizeof r, #KIND[0], BITS, COUNT, is_word(#T)};       \
    }                                                                                                           \
  };                                                                                                            \
  }                                                                                                             \
  }                                                                                                             \
  namespace T##_space {                                                                                         \
    inline std::ostream& operator<<(std::ostream& out, const T##_& r) { return out << kastarri::to_string(r); } \
  }
KASTARRI_REGISTER_TYPES(KASTARRI_PRINTED)
#undef KASTARRI_PRINTED

#endif
