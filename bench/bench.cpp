// Times every exported intrinsic by its row: a call with operands in memory, as a kernel makes it.
// tools/performance.py runs this for each target and makes the table of docs/performance.md.
#include <benchmark/benchmark.h>

#include <cstring>
#include <new>
#include <random>
#include <regex>
#include <string>
#include <tuple>

#include "families.h"
#include "frame/entry.h"
#include "kastarri.h"

namespace {

// Memory for the operands that point to it. Where it and the operands lie within their pages is settled here:
// processors take a load that follows a store to the same place of another page for one that depends on it.
constexpr int page = 4096;
struct Arena {
  alignas(page) unsigned char bytes[page];
};

Arena arena;

std::minstd_rand random_numbers;

// Of numbers: from 1 to 2; of many magnitudes, with a zero in every register; of many magnitudes, with an accumulator
// of 0 as a filter's first; from 1 to 2 with a NaN, an infinity, a subnormal number and a zero in every register.
enum class Operands { ordinary, spread, fresh, special };

template <class L>
constexpr bool holds_numbers =
    std::is_same_v<typename L::number, half_float> || std::is_same_v<typename L::number, single_float>;

// Numbers of either sign in place of random bits: of those, most registers would hold a NaN. Many magnitudes are from
// 2^-12 to 2^12, of halves from 2^-6 to 2^6: products of two are normal numbers.
template <class L>
void make_numbers(typename L::container* lanes, Operands kind) {
  using Lane = typename L::container;
  constexpr word unit = L::bits == 16 ? 0x0400 : 0x00800000, sign = word{1} << (L::bits - 1);
  constexpr word one = L::bits == 16 ? 0x3C00 : 0x3F800000, infinity = sign - unit, nan = infinity + unit / 2;
  constexpr word powers = L::bits == 16 ? 6 : 12;
  const bool many = kind == Operands::spread || kind == Operands::fresh;
  for (int i = 0; i < L::count; ++i) {
    const word exponent = many ? random_numbers() % (2 * powers) - powers : 0;
    lanes[i] = static_cast<Lane>((lanes[i] & (sign + unit - 1)) + one + exponent * unit);
  }
  if (kind == Operands::spread && L::count > 1) lanes[random_numbers() % L::count] = 0;
  constexpr word specials[] = {nan, infinity, 1, 0};
  for (int i = 0; kind == Operands::special && i < 4 && i < L::count; ++i) lanes[i] = static_cast<Lane>(specials[i]);
}

void fill_randomly(unsigned char* bytes, std::size_t count) {
  for (std::size_t i = 0; i < count; ++i) bytes[i] = static_cast<unsigned char>(random_numbers());
}

void fill_arena(Operands kind) {
  fill_randomly(arena.bytes, sizeof arena);
  for (std::size_t i = 0; i < sizeof arena; i += 64)
    make_numbers<f16x32>(reinterpret_cast<std::uint16_t*>(arena.bytes + i), kind);
}

// An argument of an intrinsic: a register with random lanes, a pointer into the arena, a small count.
template <class T>
struct alignas(64) Argument {
  T value;
  Argument() { fill_randomly(reinterpret_cast<unsigned char*>(&value), sizeof value); }
  T& get() { return value; }
};
// A count beside registers, an offset or increment beside a pointer: accesses stay within a cache line.
template <>
struct Argument<int> {
  int value = 3;
  int& get() { return value; }
};
template <>
struct Argument<unsigned> {
  unsigned value = 3;
  unsigned& get() { return value; }
};
template <class M>
struct Argument<M*> {
  M* value = reinterpret_cast<M*>(arena.bytes + 1024);
  M*& get() { return value; }
};
template <class M>
struct Argument<M**> {
  M* pointer = reinterpret_cast<M*>(arena.bytes + 1024);
  M** value = &pointer;
  M**& get() {
    pointer = reinterpret_cast<M*>(arena.bytes + 1024);
    return value;
  }
};

// What an access to memory takes is made to lie in the arena, aligned as in most programs: vectors of
// offsets and the offset or increment.
template <class T>
void place_in_arena(T&) {}
void place_in_arena(qv_vecNx16U& offsets) {
  for (auto& pair : offsets._) pair &= 0x03FE03FE;
}
void place_in_arena(qv_vecN_2x32Uv& offsets) {
  for (auto& offset : offsets._) offset &= 0x3FC;
}
void place_in_arena(int& offset) { offset = 64; }

template <class T>
using bare = std::remove_cv_t<std::remove_reference_t<T>>;

template <class T, class = void>
struct layout_if_any {
  using type = Layout<std::conditional_t<std::is_same_v<T, unsigned>, word, std::int32_t>, 32, 1>;
};
template <class T>
struct layout_if_any<T, std::void_t<layout_of<T>>> {
  using type = layout_of<T>;
};

// Numbers in a register of numbers; none below zero where the result counts without a sign.
template <class R, class T>
void place_numbers(T& value, Operands kind) {
  using L = typename layout_if_any<T>::type;
  using To = typename layout_if_any<bare<R>>::type;
  if constexpr (holds_numbers<L>) {
    make_numbers<L>(reinterpret_cast<typename L::container*>(&value), kind);
    if constexpr (std::is_same_v<typename To::number, integer> && std::is_unsigned_v<typename To::container>)
      for (int i = 0; i < L::count; ++i)
        reinterpret_cast<typename L::container*>(&value)[i] &=
            static_cast<typename L::container>((1u << (L::bits - 1)) - 1);
  }
}

// Where the operands of a call lie, one after the other.
struct Frame {
  alignas(page) unsigned char bytes[page];
  std::size_t used = 0;

  template <class T>
  Argument<T>& make() {
    auto* argument = new (bytes + used) Argument<T>;
    used += (sizeof *argument + 63) & ~std::size_t{63};
    return *argument;
  }
};

// What a call writes besides its result is put back now and then: an accumulator would grow until it overflows. Where
// its magnitude counts it is put back before every call, by the copy that is the unit of all figures.
constexpr int calls_between = 1024;

void put_back(unsigned char* accumulator, const unsigned char* from) {
  new (accumulator) qv_vecNx16(KASTARRI_SYMBOL(rk_zra32_qv_vecNx16_move)(*reinterpret_cast<const qv_vecNx16*>(from)));
}

template <class R, class... A>
[[gnu::noinline]] void time_with(benchmark::State& state, R (*f)(A...), [[maybe_unused]] Operands kind, Frame& frame,
                                 Argument<bare<A>>&... a) {
  (place_numbers<R>(a.get(), kind), ...);
  if constexpr ((std::is_pointer_v<A> || ...)) (place_in_arena(a.get()), ...);
  asm volatile("" : "+r"(f));  // a call, as from another library: the compiler knows nothing of it
  const bool puts_back = kind == Operands::spread || kind == Operands::fresh;
  if (kind == Operands::fresh) std::memset(frame.bytes, 0, sizeof(qv_vecNx16));
  const Frame untouched = frame;
  while (state.KeepRunningBatch(calls_between)) {
    std::memcpy(frame.bytes, untouched.bytes, frame.used);
    for (int i = 0; i < calls_between; ++i) {
      if constexpr (std::is_void_v<R>) {
        if (puts_back) put_back(frame.bytes, untouched.bytes);
        f(a.get()...);
        benchmark::ClobberMemory();
      } else {
        alignas(64) R result = f(a.get()...);
        asm volatile("" : : "m"(result) : "memory");
      }
    }
  }
}

template <class R, class... A>
void time_calls(benchmark::State& state, R (*f)(A...), unsigned rounding, Operands kind) {
  Frame frame;
  random_numbers.seed(1);  // the same operands whatever has been timed before
  fill_arena(kind);
  constexpr unsigned as_a_program_starts = 0x1F80;  // whatever the benchmarks' own arithmetic has raised is forgotten
  asm volatile("ldmxcsr %0" : : "m"(as_a_program_starts));
  cstub_Km_ZNB_Orbis_R5_64k_proc.states.RoundMode = rounding;
  const std::tuple<Argument<bare<A>>&...> arguments{frame.make<bare<A>>()...};  // in this order, unlike a call's
  std::apply([&](auto&... a) { time_with(state, f, kind, frame, a...); }, arguments);
}

struct Timed {
  const char* name;
  void (*run)(benchmark::State&, unsigned rounding, Operands kind);
};

#define ENTRY(SYMBOL, SHAPE, ...)                                           \
  {#SYMBOL, [](benchmark::State& state, unsigned rounding, Operands kind) { \
     time_calls(state, &KASTARRI_SYMBOL(SYMBOL), rounding, kind);           \
   }},
#define HELPER(NAME, SHAPE, ...)                                                \
  {"RK_" #NAME, [](benchmark::State& state, unsigned rounding, Operands kind) { \
     time_calls(state, &cstub_Km_ZNB_Orbis_R5_64k_##NAME, rounding, kind);      \
   }},

#include "frame/rows.h"

constexpr Timed timed[] = {
#include "scalar_rows.def"
#include "rows.def"
};

#include "frame/rows_end.h"

// An intrinsic with ordinary operands, rounding to nearest; arithmetic on numbers in the other rounding modes
// too, and of many magnitudes; what has a fast path for numbers with special operands.
void register_row(const Timed& row) {
  static const std::regex rounded(R"(rk_zra32_ZRA_(ADD|SUB|MUL|MULA|MULS)(NXF16|N_2XF32)T?)"
                                  R"(|rk_zran_scalarfp_(ADD|SUB|MUL|MADD|MSUB)_[HS])");
  static const std::regex of_numbers(
      R"(rk_zra32_ZRA_((ADD|SUB|MULA?|MULS|(MIN|MAX)(NUM)?|[OU](EQ|LT|LE|N))(NXF16|N_2XF32)T?)"
      R"(|U?TRUNCN.*|CVTF(16|32)N.*|[LS]VN_2XF16T?_I))");
  static const std::regex accumulates(R"(rk_zra32_ZRA_MUL[AS](NXF16|N_2XF32)T?)");
  const auto time = [&row](const char* variant, unsigned rounding, Operands kind) {
    auto* const timing = benchmark::RegisterBenchmark(
        (row.name + std::string(variant)).c_str(),
        [&row, rounding, kind](benchmark::State& state) { row.run(state, rounding, kind); });
    // What all the others are compared with has to be known best: it is timed between them, again and again.
    if (row.name == std::string("rk_zra32_qv_vecNx16_move")) timing->Repetitions(61);
  };
  time("", 0, Operands::ordinary);
  if (std::regex_match(row.name, rounded)) {
    time("/zero", 1, Operands::ordinary);
    time("/up", 2, Operands::ordinary);
    time("/down", 3, Operands::ordinary);
  }
  if (std::regex_match(row.name, rounded)) time("/spread", 0, Operands::spread);
  if (std::regex_match(row.name, accumulates)) time("/fresh", 0, Operands::fresh);
  if (std::regex_match(row.name, of_numbers)) time("/special", 0, Operands::special);
}

// A thousand multiplications, each of which waits for the one before, for three cycles of the processor's clock. (Some
// processors add constants without taking time.)
void time_cycles(benchmark::State& state) {
  unsigned product = 3;
  for (auto _ : state) asm volatile(".rept 1000\n\timull %0, %0\n\t.endr" : "+r"(product));
}

// Ports that are always ready, so that what is timed is the intrinsics.
void open_ports() {
  cstub_Km_ZNB_Orbis_R5_64k_register_EXPSTATE(nullptr, [](const cstub_ExportState_t*, const unsigned*) {});
  cstub_Km_ZNB_Orbis_R5_64k_register_IPQ(
      nullptr, [](const cstub_InputQueue_t*) { return 1u; }, [](const cstub_InputQueue_t*, unsigned, unsigned*) {});
  cstub_Km_ZNB_Orbis_R5_64k_register_OPQ(
      nullptr, [](const cstub_OutputQueue_t*) { return 1u; },
      [](const cstub_OutputQueue_t*, unsigned, const unsigned*) {});
  cstub_Km_ZNB_Orbis_R5_64k_register_IMPWIRE(nullptr, [](const cstub_ImportWire_t*, unsigned*) {});
}

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  benchmark::AddCustomContext("target", cstub_Km_ZNB_Orbis_R5_64k_target());
  open_ports();
  benchmark::RegisterBenchmark("3000 cycles", time_cycles)->Repetitions(61);
  for (const Timed& row : timed) register_row(row);
  benchmark::RunSpecifiedBenchmarks();
}
