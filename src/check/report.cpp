#include "check/report.h"

#include <dlfcn.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string_view>

// Functions of the address sanitizer, which are there if the program was built with it. The two that report go on
// afterwards if the program's options say so (halt_on_error=0).
extern "C" {
__attribute__((weak)) void* __asan_region_is_poisoned(void* begin, std::size_t size);
__attribute__((weak)) void __asan_loadN_noabort(std::uintptr_t begin, std::size_t size);
__attribute__((weak)) void __asan_storeN_noabort(std::uintptr_t begin, std::size_t size);
}

namespace check {

namespace {

#define INTRINSIC(INDEX, SYMBOL) #SYMBOL,
constexpr const char* symbols[] = {
#include "intrinsics.inc"
};
#undef INTRINSIC

[[noreturn]] void fail(const char* message) {
  std::fprintf(stderr, "kastarri-check: %s\n", message);
  std::_Exit(125);
}

// Whether the linker's symbol, _Z<length><name><types>, is that of the name.
bool is_symbol_of(const char* symbol, const char* name, std::size_t length) {
  char* behind;
  return std::strtoul(symbol + 2, &behind, 10) == length && std::strncmp(behind, name, length) == 0;
}

// As programs have it: ZRA_LVNX16_I of rk_zra32_ZRA_LVNX16_I, RK_S32I of rk_core_S32I.
void print_short(const char* row) {
  const std::string_view name = row;
  const std::size_t package = name.find('_', 3) + 1;
  const std::string_view rest = name.substr(package), owner = name.substr(0, package);
  const bool is_bare = owner == "rk_zra32_" || owner == "rk_zran_" || rest.substr(0, 7) == "uint32_";
  std::fprintf(stderr, "kastarri-check: %s%.*s", is_bare ? "" : "RK_", static_cast<int>(rest.size()), rest.data());
}

// The sanitizer is told of the bytes from the first bad one on: it goes by that one when it says what is wrong.
__attribute__((cold, noinline)) void report(const char* row, const void* at, std::size_t bytes, bool writes,
                                            const void* bad) {
  print_short(row);
  std::fprintf(stderr, " %s %zu byte%s at %p\n", writes ? "writes" : "reads", bytes, bytes == 1 ? "" : "s", at);
  const auto begin = reinterpret_cast<std::uintptr_t>(bad), end = reinterpret_cast<std::uintptr_t>(at) + bytes;
  if (writes)
    __asan_storeN_noabort(begin, end - begin);
  else
    __asan_loadN_noabort(begin, end - begin);
}

}  // namespace

void* find(const char* row) {
  if (!__asan_region_is_poisoned || !__asan_loadN_noabort || !__asan_storeN_noabort)
    fail("the program does not have the address sanitizer, or not so that libraries find it");
  char name[200];
  const auto length =
      static_cast<std::size_t>(std::snprintf(name, sizeof name, "cstub_Km_ZNB_Orbis_R5_64k__KOR_%s", row));
  void* const library = dlopen(KASTARRI_SONAME, RTLD_LAZY | RTLD_NOLOAD);
  if (!library) fail("an intrinsic is called, but " KASTARRI_SONAME " is not loaded");
  for (const char* symbol : symbols)
    if (is_symbol_of(symbol, name, length))
      if (void* const function = dlsym(library, symbol)) return function;
  fail("the program's libkastarri lacks this intrinsic: it is not the checker's version");
}

bool all_bytes() {
  static const bool all = std::getenv("KASTARRI_CHECK_ALL_BYTES") != nullptr;
  return all;
}

void touch(const char* row, const void* at, std::size_t bytes, bool writes) {
  if (const void* const bad = __asan_region_is_poisoned(const_cast<void*>(at), bytes))
    report(row, at, bytes, writes, bad);
}

}  // namespace check
