// Call sites, counted: which intrinsic, from which address. Each process has one table for all of its threads, a block
// of a file: chains of sites by a hash of both. Sites are added under a lock and never change place, so that a site
// that is there is found and counted without one.
#include "callers.h"

#include <dlfcn.h>
#include <link.h>
#include <pthread.h>

#include <cstdint>
#include <cstring>

#include "files.h"
#include "signals.h"

namespace profile {
namespace {

constexpr char variable[] = "KASTARRI_PROFILE_CALLERS";
constexpr unsigned max_modules = 64, max_sites = 1 << 15, chains = 1 << 12;

// A file of code, and what is added to its addresses where it is loaded.
struct Module {
  std::uint64_t bias;
  char path[248];
};

struct Site {
  std::uint32_t calls, calls_high;  // 64 bits: atomic ones of that width are a matter of the i386's model
  std::uint64_t address;
  std::uint32_t intrinsic, module, next, unused;
};

struct Table {
  std::uint32_t sites, modules;           // module 0 is not known, site 0 ends the chains
  std::uint32_t left_out, left_out_high;  // calls for whose site there was no room
  Module module[max_modules];
  Site site[max_sites];
  std::uint32_t chain[chains];
};

struct Header {
  unsigned block_size, blocks;
};

static_assert(sizeof(Module) == 256 && sizeof(Site) == 32, "as the profiler reads them");

Table* table;
pthread_mutex_t lock = PTHREAD_MUTEX_INITIALIZER;

void count(std::uint32_t& low, std::uint32_t& high) {
  if (__atomic_add_fetch(&low, 1, __ATOMIC_RELAXED) == 0) __atomic_add_fetch(&high, 1, __ATOMIC_RELAXED);
}

// The number of the module that was loaded with that bias. The program itself has no name among those loaded.
unsigned module_of(const link_map* loaded) {
  if (!loaded) return 0;
  for (unsigned m = 1; m < table->modules; ++m) {
    if (table->module[m].bias == loaded->l_addr) return m;
  }
  if (table->modules == max_modules) return 0;
  Module& module = table->module[table->modules];
  module.bias = loaded->l_addr;
  if (*loaded->l_name) {
    std::strncpy(module.path, loaded->l_name, sizeof module.path - 1);
  } else if (readlink("/proc/self/exe", module.path, sizeof module.path - 1) < 0) {
    return 0;
  }
  return table->modules++;
}

Site* find(std::uint32_t& chain, unsigned intrinsic, std::uint64_t address) {
  for (unsigned s = __atomic_load_n(&chain, __ATOMIC_ACQUIRE); s != 0; s = table->site[s].next) {
    Site& site = table->site[s];
    if (site.address == address && site.intrinsic == intrinsic) return &site;
  }
  return nullptr;
}

Site* add(std::uint32_t& chain, unsigned intrinsic, std::uint64_t address, const link_map* loaded) {
  const SignalsWait signals_wait;
  pthread_mutex_lock(&lock);
  Site* site = find(chain, intrinsic, address);
  if (!site && table->sites < max_sites) {
    site = &table->site[table->sites];
    *site = {0, 0, address, intrinsic, module_of(loaded), chain, 0};
    __atomic_store_n(&chain, table->sites++, __ATOMIC_RELEASE);
  }
  pthread_mutex_unlock(&lock);
  return site;
}

}  // namespace

bool callers_wanted() { return std::getenv(variable) != nullptr; }

void begin_callers() {
  table = nullptr;
  Header* const header = static_cast<Header*>(mapped(variable, 0, page));
  if (!header) return;
  header->block_size = in_pages(sizeof(Table));
  table = static_cast<Table*>(next_block(variable, header->blocks, in_pages(sizeof(Table))));
  munmap(header, page);
  if (table) table->sites = table->modules = 1;
}

void count_caller(unsigned intrinsic, const void* return_address) {
  if (!table) return;
  const std::uint64_t address = reinterpret_cast<std::uintptr_t>(return_address);
  std::uint32_t& chain = table->chain[(address ^ intrinsic * 0x9e3779b1u) % chains];
  Site* site = find(chain, intrinsic, address);
  if (!site) {
    // Before the lock is taken, for the loader has one of its own.
    Dl_info symbol;
    link_map* loaded = nullptr;
    if (!dladdr1(return_address, &symbol, reinterpret_cast<void**>(&loaded), RTLD_DL_LINKMAP)) loaded = nullptr;
    site = add(chain, intrinsic, address, loaded);
  }
  if (site) {
    count(site->calls, site->calls_high);
  } else {
    count(table->left_out, table->left_out_high);
  }
}

void lock_callers() { pthread_mutex_lock(&lock); }
void unlock_callers() { pthread_mutex_unlock(&lock); }

}  // namespace profile
