// Drivers of loads and stores: every byte misalignment, both ends of a page, steps that wrap.
#ifndef KASTARRI_TESTS_MEMORY_DRIVERS_H
#define KASTARRI_TESTS_MEMORY_DRIVERS_H

#include <algorithm>

#include "memory/memory.h"

namespace testing_support {

// Lanes wider than a number are as good as several words.
template <class L>
using numbers_of = std::conditional_t<(L::bits > 64), Layout<word, 32, L::count * L::bits / 32>, L>;

// What memory and register hold of an access: lane i of R = rule(lane i of L), of a single element for all i.
template <class R, class L, class Rule>
constexpr auto memory_model(Rule rule) {
  return model_of<numbers_of<R>, numbers_of<L>>(rule);
}
template <class R, class Rule, class L>
Int lane_of(const Model<R, Rule, L>& model, const void* image, int i) {
  return static_cast<Int>(model.rule(lane<L>(image, L::count == 1 ? 0 : i)));
}

// Offsets into a page at which `size` bytes are accessed.
inline std::vector<unsigned> places(unsigned size, unsigned alignment) {
  std::vector<unsigned> all = {0, Memory::page - size};
  for (unsigned k = 0; k < 64; k += alignment) all.push_back(1024 + k);
  return all;
}

constexpr int steps[] = {0, 64, -64, 1, 2, 12345, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()};

template <class... P>
bool enabled([[maybe_unused]] int i, const P&... p) {
  return (lane<layout_of<P>>(p._, i) && ...);
}

template <class R, class Rule, class L, class V, class... P>
void expect_loaded(const std::string& name, int n, const Model<R, Rule, L>& model, const unsigned char* image,
                   const V& got, const P&... p) {
  Int expected[R::count];
  for (int i = 0; i < R::count; ++i) expected[i] = enabled(i, p...) ? lane_of(model, image, i) : 0;
  expect_lanes<R>(name, n, expected, got, [&](int) { return "alignment " + std::to_string(address_of(image) % 64); });
}

// load(at, step, p ...) returns the register.
template <class... P, class R, class Rule, class L, class Load>
void expect_loads(const std::string& name, const Model<R, Rule, L>& model, unsigned alignment, Load load) {
  Memory memory;
  std::mt19937 random(seed);
  int n = 0;
  for (unsigned place : places(L::count * sizeof(typename L::container), alignment)) {
    memory.fill(random);
    const auto before = memory.copy();
    const auto check = [&](const P&... p) {
      const auto got = load(memory.begin() + place, steps[n % 8], p...);
      expect_loaded(name, n, model, &before[place], got, p...);
    };
    check(predicate<P>(n, random)...);
    memory.expect(before, name);
    if (testing::Test::HasFatalFailure()) return;
    ++n;
  }
}

template <class Model, class V, class M, class... P>
void drive_load_I(const std::string& name, const Model& model, V (*f)(const M*, int, const P&...)) {
  expect_loads<P...>(name, model, 1, [f](const unsigned char* at, int offset, const P&... p) {
    return f(moved_back<const M>(at, offset), offset, p...);
  });
}

template <class Model, class V, class M, class... P>
void drive_load_IP(const std::string& name, const Model& model, void (*f)(V&, const M**, int, const P&...),
                   unsigned alignment = 1) {
  expect_loads<P...>(name, model, alignment, [&](const unsigned char* at, int increment, const P&... p) {
    V r[3] = {filled<V>(0x5A), filled<V>(0xA5), filled<V>(0x5A)};
    auto* pointer = moved<const M>(at, 0);
    f(r[1], &pointer, increment, p...);
    EXPECT_EQ(pointer, moved<const M>(at, increment)) << name;
    EXPECT_TRUE(same_bits(r[0], filled<V>(0x5A)) && same_bits(r[2], filled<V>(0x5A))) << name;
    return r[1];
  });
  // The pointer lies in the memory that it points to: it is loaded as it was before it moved.
  Memory memory;
  std::mt19937 random(seed);
  memory.fill(random);
  auto** pointer = reinterpret_cast<const M**>(memory.begin());
  *pointer = moved<const M>(pointer, 0);
  const auto before = memory.copy();
  V r;
  f(r, pointer, 68, filled<P>(0xFF)...);
  EXPECT_EQ(*pointer, moved<const M>(pointer, 68)) << name;
  expect_loaded(name, -1, model, before.data(), r, filled<P>(0xFF)...);
  // So does part of the register: all is loaded before any of it changes.
  for (int distance = -60; distance < 64; distance += 4) {
    memory.fill(random);
    const auto whole = memory.copy();
    const auto* at = moved<const M>(memory.begin() + 256, 0);
    V& part = *moved<V>(memory.begin() + 256, distance);
    const auto check = [&](const P&... p) {
      f(part, &at, 4, p...);
      expect_loaded(name + " into " + std::to_string(distance), distance, model, &whole[256], part, p...);
    };
    check(predicate<P>(distance + 60, random)...);
  }
}

// What a store leaves of an image in memory: the merge of bytes by the table, word after word, unless all
// are enabled or none. A float that is not enabled is not rounded, but taken as 0, for a table that has it stored.
template <class R, class Rule, class L, class V, class... P>
void model_store(const Model<R, Rule, L>& model, const V& v, unsigned char* image, const P&... p) {
  constexpr int lane_bytes = R::bits / 8, size = R::count * lane_bytes;
  unsigned char stored[size];
  int count = 0;
  for (int i = 0; i < R::count; ++i) {
    const bool taken = std::is_same_v<typename R::number, integer> || enabled(i, p...);
    set_lane<R>(stored, i, taken ? lane_of(model, v._, i) : 0);
    count += enabled(i, p...);
  }
  if (count == 0) return;
  const bool all = count == R::count;
  for (int i = 0; i < size; ++i) {
    int disabled = 0;
    if (!all)
      for (int k = 0; k < 4; ++k) disabled |= !enabled((i / 4 * 4 + k) / lane_bytes, p...) << k;
    const unsigned mask = all ? 0xFF : cstub_Km_ZNB_Orbis_R5_64k_mask[disabled] >> 8 * (i % 4) & 0xFF;
    image[i] = static_cast<unsigned char>((image[i] & ~mask) | (stored[i] & mask));
  }
}

// store(v, at, step, p ...)
template <class V, class... P, class R, class Rule, class L, class Store>
void expect_stores(const std::string& name, const Model<R, Rule, L>& model, unsigned alignment, Store store) {
  Memory memory;
  std::mt19937 random(seed);
  const auto values = corners<L>();
  int n = 0;
  for (unsigned place : places(R::count * sizeof(typename R::container), alignment)) {
    memory.fill(random);
    auto expected = memory.copy();
    V v = filled<V>(0);
    using Lanes = numbers_of<layout_of<V>>;
    fill_random<Lanes>(v._, random);
    for (int i = 0; n % 2 && i < Lanes::count; ++i)
      set_lane<Lanes>(v._, i, values[static_cast<std::size_t>(n * Lanes::count + i) % values.size()]);
    const auto check = [&](const P&... p) {
      model_store(model, v, &expected[place], p...);
      store(v, memory.begin() + place, steps[n % 8], p...);
    };
    check(predicate<P>(n, random)...);
    memory.expect(expected, name);
    if (testing::Test::HasFatalFailure()) return;
    ++n;
  }
}

// A register part of which is stored to: all of it is loaded before.
template <class V, class... P, class Model, class Store>
void expect_stores_into_operand(const std::string& name, const Model& model, Store store) {
  Memory memory;
  std::mt19937 random(seed);
  for (int distance = -60; distance < 64; distance += 4) {
    memory.fill(random);
    auto expected = memory.copy();
    const V v = *moved<V>(memory.begin() + 256, 0);
    const auto check = [&](const P&... p) {
      model_store(model, v, &expected[static_cast<std::size_t>(256 + distance)], p...);
      store(*moved<V>(memory.begin() + 256, 0), memory.begin() + 256 + distance, 4, p...);
    };
    check(predicate<P>(distance + 60, random)...);
    memory.expect(expected, name + " at " + std::to_string(distance) + " of its operand");
  }
}

// What only predicated stores do, store(v, at, step, p) with a predicate of the type of `none`.
template <class V, class P, class Model, class Store>
void expect_merges(const std::string& name, const Model& model, Store store, P p) {
  Memory memory;
  store(filled<V>(1), memory.forbidden(), 4, filled<P>(0));
  // One enabled lane has every word read and written back.
  p._[0] = 1;
  EXPECT_DEATH(store(filled<V>(1), memory.end() - 4, 4, p), "") << name;
  // The program may change the table.
  const std::vector<unsigned> table(cstub_Km_ZNB_Orbis_R5_64k_mask, cstub_Km_ZNB_Orbis_R5_64k_mask + 16);
  std::mt19937 random(seed);
  for (unsigned& entry : cstub_Km_ZNB_Orbis_R5_64k_mask) entry = random();
  expect_stores<V, P>(name + " with another table", model, 1, store);
  std::copy(table.begin(), table.end(), cstub_Km_ZNB_Orbis_R5_64k_mask);
}

template <class Model, class V, class M, class... P>
void drive_store_I(const std::string& name, const Model& model, void (*f)(const V&, const M*, int, const P&...),
                   unsigned alignment = 1) {
  const auto store = [=](const V& v, unsigned char* at, int offset, const P&... p) {
    f(v, moved_back<const M>(at, offset), offset, p...);
  };
  expect_stores<V, P...>(name, model, alignment, store);
  expect_stores_into_operand<V, P...>(name, model, store);
  (expect_merges<V, P>(name, model, store, filled<P>(0)), ...);
}

template <class Model, class V, class M, class... P>
void drive_store_IP(const std::string& name, const Model& model, void (*f)(const V&, M**, int, const P&...),
                    unsigned alignment = 1) {
  const auto store = [=](const V& v, unsigned char* at, int increment, const P&... p) {
    auto* pointer = moved<M>(at, 0);
    f(v, &pointer, increment, p...);
    EXPECT_EQ(pointer, moved<M>(at, increment)) << name;
  };
  expect_stores<V, P...>(name, model, alignment, store);
  expect_stores_into_operand<V, P...>(name, model, store);
  (expect_merges<V, P>(name, model, store, filled<P>(0)), ...);
}

// --- Alignment ----------------------------------------------------------------------------------------

constexpr unsigned alignment_of(std::size_t size) { return size < 4 ? static_cast<unsigned>(size) : 4; }

// The access ends the program with the one line that names the address.
template <class Access>
void expect_failure(const std::string& name, const void* address, Access access) {
  EXPECT_EXIT(access(), testing::ExitedWithCode(1), testing::Eq(not_aligned_message(address_of(address)))) << name;
}

// Accesses at addresses that are not aligned, in memory that may not be touched. The pointer of a
// post-increment access stays as it is.
template <class V, class M>
void expect_failures(const std::string& name, void (*f)(const V&, const M*, int)) {
  Memory memory;
  for (unsigned k = 1; k < alignment_of(sizeof(M)); ++k)
    for (int offset : {-1, 0, 3, 64})
      expect_failure(name, memory.forbidden() + k,
                     [&] { f(filled<V>(0), reinterpret_cast<const M*>(memory.forbidden() + k - offset), offset); });
}
template <class V, class M>
void expect_failures(const std::string& name, void (*f)(V&, M**, int)) {
  Memory memory;
  auto** pointer = reinterpret_cast<M**>(memory.begin());
  auto* r = reinterpret_cast<std::remove_const_t<V>*>(memory.begin() + 64);
  for (unsigned k = 1; k < alignment_of(sizeof(M)); ++k) {
    *pointer = moved<M>(memory.forbidden() + k, 0);
    const auto before = memory.copy();
    expect_failure(name, *pointer, [&] { f(*r, pointer, 8); });
    memory.expect(before, name);
  }
}

template <class V>
__attribute__((no_sanitize("undefined"))) V& misaligned(void* place) {
  return *static_cast<V*>(place);
}

// The same of the destination; what the pointer says makes no difference.
template <class V, class M>
void expect_destination_failures(const std::string& name, void (*f)(V&, const M**, int)) {
  Memory memory;
  auto** pointer = reinterpret_cast<const M**>(memory.begin());
  *pointer = moved<const M>(memory.forbidden(), 0);
  const auto before = memory.copy();
  for (unsigned k = 1; k < alignment_of(sizeof(V)); ++k) {
    unsigned char* place = memory.begin() + 64 + k;
    expect_failure(name, place, [&] { f(misaligned<V>(place), pointer, 8); });
    memory.expect(before, name);
  }
}

}  // namespace testing_support

#endif
