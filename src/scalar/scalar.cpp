// The scalar core's arithmetic, logic, comparisons, moves and boolean registers.
#include <emmintrin.h>

#include "frame/entry.h"
#include "scalar/state.h"

namespace {

int clamped(int v, int t) {
  if (t < 0 || t > 31) return v;
  const int most = static_cast<int>((word{1} << t) - 1), least = ~most;
  return v < least ? least : v > most ? most : v;
}

int leading_zeros(word v) { return v ? __builtin_clz(v) : 32; }

// As many low ones as a field is wide.
word ones(word bits) { return 0xFFFFu >> (-bits & 15); }

void deposit(word& r, word v, int shift, word field) { r = (r & ~(field << shift)) | (v & field) << shift; }

word equal_bytes(word a, word b) {
  const __m128i x = _mm_cvtsi32_si128(static_cast<int>(a)), y = _mm_cvtsi32_si128(static_cast<int>(b));
  return static_cast<word>(_mm_movemask_epi8(_mm_cmpeq_epi8(x, y))) & 15;
}

template <class T>
void move_if(bool when, T& r, T v) {
  if (when) r = v;
}

rkbool boolean(int byte) {
  rkbool r;
  r._[0] = static_cast<unsigned char>(byte);
  return r;
}

template <class T>
struct Division {
  T quotient, remainder;
};

// The host's own instructions: they fault where the language leaves the result undefined.
Division<unsigned> divided(unsigned a, unsigned b) {
  Division<unsigned> r;
  asm volatile("divl %4" : "=a"(r.quotient), "=d"(r.remainder) : "0"(a), "1"(0), "rm"(b) : "cc");
  return r;
}

Division<int> divided(int a, int b) {
  Division<int> r;
  asm volatile("idivl %4" : "=a"(r.quotient), "=d"(r.remainder) : "0"(a), "1"(a >> 31), "rm"(b) : "cc");
  return r;
}

}  // namespace

#include "scalar/stamp.h"

#include "scalar/scalar.def"

#include "frame/rows_end.h"
