// The scalar core's arithmetic, logic, moves and boolean registers: every row against a model on exact
// integers, over the crossed corners of its operands.
#include <csignal>

#include "scalar/drivers.h"

namespace model {

using testing_support::Int, testing_support::TWO32;

// A model takes operands as exact numbers, the old value of a register that is read and written first; the
// result counts modulo the size of what receives it.

constexpr auto rk_core_ADD = [](Int a, Int b) { return a + b; };
constexpr auto rk_core_ADDI = rk_core_ADD, rk_core_ADDMI = rk_core_ADD, rk_density_ADD_N = rk_core_ADD,
               rk_density_ADDI_N = rk_core_ADD, rk_virtualops_ADD_A = rk_core_ADD, rk_virtualops_ADDI_A = rk_core_ADD,
               rk_virtualops_ADDMI_A = rk_core_ADD;
constexpr auto rk_core_ADDX2 = [](Int a, Int b) { return a * 2 + b; };
constexpr auto rk_core_ADDX4 = [](Int a, Int b) { return a * 4 + b; };
constexpr auto rk_core_ADDX8 = [](Int a, Int b) { return a * 8 + b; };
constexpr auto rk_virtualops_ADDX2_A = rk_core_ADDX2;
constexpr auto rk_virtualops_ADDX4_A = rk_core_ADDX4;
constexpr auto rk_virtualops_ADDX8_A = rk_core_ADDX8;
constexpr auto rk_core_SUB = [](Int a, Int b) { return a - b; };
constexpr auto rk_virtualops_SUB_A = rk_core_SUB;
constexpr auto rk_core_SUBX2 = [](Int a, Int b) { return a * 2 - b; };
constexpr auto rk_core_SUBX4 = [](Int a, Int b) { return a * 4 - b; };
constexpr auto rk_core_SUBX8 = [](Int a, Int b) { return a * 8 - b; };
constexpr auto rk_core_NEG = [](Int a) { return 0 - a; };
constexpr auto rk_core_ABS = [](Int a) { return a > 0 ? a : 0 - a; };

// Products by long multiplication: the factors' upper and lower halves apart.
constexpr Int high_of_product(Int a, Int b) {
  const Int b_high = (b - (b & 0xFFFF)) / 0x10000, partial = a * (b & 0xFFFF), middle = a * b_high;
  const Int low_sum = (partial & 0xFFFFFFFF) + ((middle & 0xFFFF) << 16);
  return (partial >> 32) + (middle >> 16) + (low_sum >> 32);
}
constexpr auto rk_mul_MULL = [](Int a, Int b) { return (a & 0xFFFF) * b + ((a >> 16) * (b & 0xFFFF)) * 0x10000; };
constexpr auto rk_mul_MULUH = [](Int a, Int b) { return high_of_product(a, b); };
constexpr auto rk_mul_MULSH = [](Int a, Int b) { return high_of_product(a, b); };
constexpr Int signed_half(Int a) { return (a & 0x7FFF) - (a & 0x8000); }
constexpr auto rk_mul_MUL16S = [](Int a, Int b) { return signed_half(a) * signed_half(b); };
constexpr auto rk_mul_MUL16U = [](Int a, Int b) { return (a & 0xFFFF) * (b & 0xFFFF); };

// Bitwise operations by arithmetic: a + b = (a or b) + (a and b), and the and bit by bit.
constexpr Int common_bits(Int a, Int b) {
  Int sum = 0;
  for (int k = 0; k < 32; ++k) sum += (a >> k) % 2 == 1 && (b >> k) % 2 == 1 ? Int{1} << k : 0;
  return sum;
}
constexpr auto rk_core_AND = [](Int a, Int b) { return common_bits(a, b); };
constexpr auto rk_core_OR = [](Int a, Int b) { return a + b - common_bits(a, b); };
constexpr auto rk_core_XOR = [](Int a, Int b) { return a + b - 2 * common_bits(a, b); };

constexpr auto rk_core_SALT = [](Int a, Int b) -> Int { return a - b < 0; };
constexpr auto rk_core_SALTU = rk_core_SALT;
constexpr auto rk_misc_MIN = [](Int a, Int b) { return std::min(a, b); };
constexpr auto rk_misc_MAX = [](Int a, Int b) { return std::max(a, b); };
constexpr auto rk_misc_MINU = rk_misc_MIN;
constexpr auto rk_misc_MAXU = rk_misc_MAX;

constexpr auto rk_misc_CLAMPS = [](Int v, Int t) {
  return t < 0 || t > 31 ? v : std::clamp(v, -(Int{1} << t), (Int{1} << t) - 1);
};
constexpr auto rk_misc_SEXT = [](Int v, Int b) {
  if (b < 0 || b > 31) return v;
  const Int range = Int{2} << b, low = (v % range + range) % range;
  return low < range / 2 ? low : low - range;
};
// The largest k for which v 2^k still is a signed 32-bit number, up to 31.
constexpr auto rk_misc_NSA = [](Int v) {
  Int k = 0;
  while (k < 31 && v * 2 >= -TWO32 / 2 && v * 2 < TWO32 / 2) v *= 2, ++k;
  return k;
};
constexpr auto rk_misc_NSAU = [](Int v) {
  Int zeros = 32;
  for (; v > 0; v /= 2) --zeros;
  return zeros;
};

constexpr Int field(Int bits) { return Int{1} << ((bits + 15) % 16 + 1); }  // 2^n
constexpr Int position(Int shift) { return Int{1} << (shift % 32 + 32) % 32; }
constexpr auto rk_core_EXTUI = [](Int v, Int shift, Int bits) { return v / position(shift) % field(bits); };
constexpr auto rk_core_DEPBITS = [](Int r, Int v, Int shift, Int bits) {
  const Int old = r / position(shift) % field(bits);
  return r + (v % field(bits) - old) * position(shift);
};
constexpr auto rk_core_CONST16 = [](Int r, Int imm) { return r * 0x10000 + imm; };

constexpr Int byte_of(Int v, int i) { return v / (Int{1} << 8 * i) % 256; }
constexpr auto rk_virtualops_BSWP = [](Int v) {
  return ((byte_of(v, 0) * 256 + byte_of(v, 1)) * 256 + byte_of(v, 2)) * 256 + byte_of(v, 3);
};
constexpr auto rk_virtualops_CMP4 = [](Int a, Int b) {
  Int equal = 0;
  for (int i = 3; i >= 0; --i) equal = equal * 2 + (byte_of(a, i) == byte_of(b, i));
  return equal;
};

constexpr auto rk_core_MOVI = [](Int a) { return a; };
constexpr auto rk_density_MOVI_N = rk_core_MOVI, rk_density_MOV_N = rk_core_MOVI, rk_virtualops_MOV_A = rk_core_MOVI,
               rk_core_uint32_move = rk_core_MOVI;
constexpr auto rk_core_MOVEQZ = [](Int r, Int v, Int t) { return t == 0 ? v : r; };
constexpr auto rk_core_MOVNEZ = [](Int r, Int v, Int t) { return t == 0 ? r : v; };
constexpr auto rk_core_MOVLTZ = [](Int r, Int v, Int t) { return t < 0 ? v : r; };
constexpr auto rk_core_MOVGEZ = [](Int r, Int v, Int t) { return t < 0 ? r : v; };

constexpr auto rk_booleans_ANDB = rk_core_AND;
constexpr auto rk_booleans_ORB = rk_core_OR;
constexpr auto rk_booleans_XORB = rk_core_XOR;
constexpr auto rk_booleans_ANDBC = [](Int a, Int b) { return b == 0 ? a % 2 : 0; };
constexpr auto rk_booleans_ORBC = [](Int a, Int b) { return b == 0 && a % 2 == 0 ? a + 1 : a; };
constexpr auto rk_booleans_ALL4 = [](Int b) -> Int { return b == 15; };
constexpr auto rk_booleans_ALL8 = [](Int b) -> Int { return b == 255; };
constexpr auto rk_booleans_ANY4 = [](Int b) -> Int { return b > 0; };
constexpr auto rk_booleans_ANY8 = rk_booleans_ANY4;
constexpr auto rk_booleans_MOVT = [](Int r, Int v, Int b) { return b > 0 ? v : r; };
constexpr auto rk_booleans_MOVF = [](Int r, Int v, Int b) { return b > 0 ? r : v; };

constexpr auto rk_core_NOP = [] {};
constexpr auto rk_density_NOP_N = rk_core_NOP;
constexpr auto rk_core_RSR_PRID = [] { return Int{cstub_Km_ZNB_Orbis_R5_64k_proc.PRID}; };

// By magnitudes: the quotient is negative when the signs differ, the remainder when the dividend is.
constexpr Int signed_by(bool negative, Int magnitude) { return negative ? 0 - magnitude : magnitude; }
constexpr auto QUOU = [](Int a, Int b) { return signed_by((a < 0) != (b < 0), rk_core_ABS(a) / rk_core_ABS(b)); };
constexpr auto QUOS = QUOU;
constexpr auto REMU = [](Int a, Int b) { return signed_by(a < 0, rk_core_ABS(a) % rk_core_ABS(b)); };
constexpr auto REMS = REMU;

}  // namespace model

namespace {

using namespace testing_support;

// The result is returned.
template <class R, class... A, class Model>
void drive(const char* name, R (*f)(A...), Model model) {
  for_values<bare<A>...>([=](auto... a) {
    const R got = f(operand<bare<A>>(a)...), expected = operand<R>(model(a...));
    ASSERT_EQ(number(got), number(expected)) << name << list(a...);
  });
}

// The result is the new value of the first operand; its old value is random.
template <class T, class... A, class Model>
void drive(const char* name, void (*f)(T&, A...), Model model) {
  std::mt19937 random(seed);
  for_values<bare<A>...>([=, &random](auto... a) {
    const T old = operand<T>(static_cast<Int>(random()));
    T r = old;
    f(r, operand<bare<A>>(a)...);
    ASSERT_EQ(number(r), number(operand<T>(model(number(old), a...)))) << name << list(number(old), a...);
  });
}

template <class Model>
void drive(const char*, void (*f)(), Model) {
  f();
}

// Whatever a row does, it leaves the state block alone.
template <class F, class Model>
void drive_stateless(const char* name, F f, Model model) {
  auto& processor = cstub_Km_ZNB_Orbis_R5_64k_proc;
  processor.PRID = 0x5A5A;
  processor.states.SAR = 17;
  const auto before = processor;
  drive(name, f, model);
  EXPECT_EQ(std::memcmp(&before, &processor, sizeof before), 0) << name << " changed the state block";
  processor.PRID = 0;
}

// The host's fault, and no message of the library's.
template <class T>
void expect_division_fault(const char* name, T (*divide)(T, T), T a, T b) {
  const auto attempt = [=] {
    std::signal(SIGFPE, SIG_DFL);  // a sanitizer's handler would report it
    divide(a, b);
  };
  EXPECT_EXIT(attempt(), testing::KilledBySignal(SIGFPE), testing::Eq(std::string())) << name << list(a, b);
}

template <class T, class Model>
void drive_division(const char* name, T (*divide)(T, T), Model model) {
  const Int least = std::numeric_limits<T>::min();
  for_values<T, T>([=](Int a, Int b) {
    if (b == 0 || (b == -1 && a == least)) return;
    ASSERT_EQ(number(divide(operand<T>(a), operand<T>(b))), model(a, b)) << name << list(a, b);
  });
  expect_division_fault(name, divide, T{7}, T{0});
  expect_division_fault(name, divide, T{0}, T{0});
  if (least < 0) expect_division_fault(name, divide, static_cast<T>(least), static_cast<T>(-1));
}

#define ENTRY(SYMBOL, SHAPE, ...)              \
  [[maybe_unused]] const int tested_##SYMBOL = \
      add_test("Scalar", #SYMBOL, [] { drive_stateless(#SYMBOL, &KASTARRI_SYMBOL(SYMBOL), model::SYMBOL); });
#define HELPER(NAME, SHAPE, ...)                       \
  [[maybe_unused]] const int tested_##NAME = add_test( \
      "ScalarDeathTest", #NAME, [] { drive_division(#NAME, &cstub_Km_ZNB_Orbis_R5_64k_##NAME, model::NAME); });

#include "frame/rows.h"

#include "scalar/scalar.def"

#include "frame/rows_end.h"

}  // namespace
