// Times every exported intrinsic by its row: a call with operands in memory, as a kernel makes it.
// tools/performance.py runs this for each target and makes the table of docs/performance.md.
#include <benchmark/benchmark.h>

#include <cstring>
#include <random>
#include <tuple>

#include "frame/entry.h"
#include "frame/shapes.h"

namespace {

// Memory for the operands that point to it. Where it and the operands lie within their pages is settled here:
// processors take a load that follows a store to the same place of another page for one that depends on it.
constexpr int page = 4096;
struct Arena {
  alignas(page) unsigned char bytes[page];
};

Arena arena;

// Random numbers from 1 to 2 of either sign in place of random bits: of those, most registers would hold
// a NaN.
template <class L>
void make_numbers(void* image) {
  auto* lanes = static_cast<typename L::container*>(image);
  constexpr word one = L::bits == 16 ? 0x3C00 : 0x3F800000, free = L::bits == 16 ? 0x83FF : 0x807FFFFF;
  for (int i = 0; i < L::count; ++i) lanes[i] = static_cast<typename L::container>((lanes[i] & free) | one);
}
template <class T, class = void>
struct numbers {
  static void make(T&) {}
};
template <class T>
struct numbers<T, std::enable_if_t<std::is_same_v<typename layout_of<T>::number, half_float> ||
                                   std::is_same_v<typename layout_of<T>::number, single_float>>> {
  static void make(T& value) { make_numbers<layout_of<T>>(value._); }
};

// An argument of an intrinsic: a register with random lanes, a pointer into the arena, a small count.
template <class T>
struct alignas(64) Argument {
  T value;
  Argument() {
    std::minstd_rand random(1);
    auto* bytes = reinterpret_cast<unsigned char*>(&value);
    for (std::size_t i = 0; i < sizeof value; ++i) bytes[i] = static_cast<unsigned char>(random());
    numbers<T>::make(value);
  }
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

template <class R, class... A>
[[gnu::noinline]] void time_calls(benchmark::State& state, R (*f)(A...)) {
  alignas(page) std::tuple<Argument<bare<A>>...> arguments;
  if constexpr ((std::is_pointer_v<A> || ...))
    std::apply([](auto&... a) { (place_in_arena(a.get()), ...); }, arguments);
  asm volatile("" : "+r"(f));  // a call, as from another library: the compiler knows nothing of it
  for (auto _ : state) {
    if constexpr (std::is_void_v<R>) {
      std::apply([&](auto&... a) { f(a.get()...); }, arguments);
      benchmark::ClobberMemory();
    } else {
      alignas(64) R result = std::apply([&](auto&... a) { return f(a.get()...); }, arguments);
      asm volatile("" : : "m"(result) : "memory");
    }
  }
}

}  // namespace

namespace {

struct Timed {
  const char* name;
  void (*run)(benchmark::State&);
};

#define ENTRY(SYMBOL, SHAPE, ...) \
  {#SYMBOL, [](benchmark::State& state) { time_calls(state, &KASTARRI_SYMBOL(SYMBOL)); }},
#define HELPER(NAME, SHAPE, ...) \
  {"RK_" #NAME, [](benchmark::State& state) { time_calls(state, &cstub_Km_ZNB_Orbis_R5_64k_##NAME); }},

#include "frame/rows.h"

constexpr Timed timed[] = {
#include "scalar_rows.def"
#include "rows.def"
};

#include "frame/rows_end.h"

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
  for (const Timed& intrinsic : timed) benchmark::RegisterBenchmark(intrinsic.name, intrinsic.run);
  benchmark::RunSpecifiedBenchmarks();
}
