// The counters behind kastarri-profile. The library made of this and entries.S is loaded before the program's
// libkastarri, so that calls from outside it come to the entries.
//
// Each thread has counters of its own, a block of a file, which it alone writes: nothing is locked and nothing lost.
#include <dlfcn.h>
#include <pthread.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "callers.h"
#include "files.h"
#include "signals.h"

namespace {

using profile::page;

#define INTRINSIC(INDEX, SYMBOL) #SYMBOL,
constexpr const char* symbols[] = {
#include "intrinsics.inc"
};
#undef INTRINSIC

constexpr unsigned intrinsics = sizeof symbols / sizeof *symbols;
constexpr char variable[] = "KASTARRI_PROFILE_COUNTERS";

struct Counters {
  unsigned long long calls[intrinsics];
  Counters* next_free;
};

struct Header {
  unsigned block_size;  // in bytes
  unsigned blocks;
  unsigned lost;    // threads whose calls could not be counted
  char target[16];  // the instruction set that intrinsics use
};

constexpr unsigned block_size = profile::in_pages(sizeof(Counters));

}  // namespace

// What the entries read: see there.
#define KASTARRI_FOR_ENTRIES extern "C" __attribute__((visibility("hidden")))
KASTARRI_FOR_ENTRIES void* kastarri_profile_targets[intrinsics];
KASTARRI_FOR_ENTRIES __thread Counters* kastarri_profile_counters __attribute__((tls_model("initial-exec")));
KASTARRI_FOR_ENTRIES void kastarri_profile_begin_thread();
KASTARRI_FOR_ENTRIES void* kastarri_profile_note_caller(unsigned intrinsic, const void* return_address);
KASTARRI_FOR_ENTRIES const char kastarri_profile_detours[][16];

void* kastarri_profile_targets[intrinsics];
__thread Counters* kastarri_profile_counters;

namespace {

Counters uncounted;  // where calls go that cannot be counted
Header* header;
void* functions[intrinsics];  // of the library
pthread_once_t once = PTHREAD_ONCE_INIT;
pthread_key_t thread_end;
pthread_mutex_t lock = PTHREAD_MUTEX_INITIALIZER;
Counters* free_counters;  // of threads that ended: the next ones go on counting there

[[noreturn]] void fail(const char* message) {
  std::fprintf(stderr, "kastarri-profile: %s\n", message);
  std::abort();
}

[[noreturn]] void missing() {
  fail("the program's libkastarri lacks this intrinsic: it is not the profiler's version");
}

void* loaded_library() {
  void* const library = dlopen(KASTARRI_SONAME, RTLD_LAZY | RTLD_NOLOAD);
  if (!library) fail("an intrinsic is called, but " KASTARRI_SONAME " is not loaded");
  return library;
}

// Done at the first call: a constructor of this library would come too late for calls from those of others, and
// the program may load libkastarri while it runs. Several threads may do it at once: all write the same. A lock
// could deadlock with the loader's own.
void find_targets() {
  static bool found;
  if (__atomic_load_n(&found, __ATOMIC_ACQUIRE)) return;
  void* const library = loaded_library();
  const bool noting_callers = profile::callers_wanted();
  for (unsigned i = 0; i < intrinsics; ++i) {
    void* const function = dlsym(library, symbols[i]);
    functions[i] = function ? function : reinterpret_cast<void*>(&missing);
    void* const target = noting_callers ? const_cast<char*>(kastarri_profile_detours[i]) : functions[i];
    __atomic_store_n(&kastarri_profile_targets[i], target, __ATOMIC_RELAXED);
  }
  __atomic_store_n(&found, true, __ATOMIC_RELEASE);
}

Counters* new_counters() {
  if (!header) return &uncounted;
  void* const counters = profile::next_block(variable, header->blocks, block_size);
  if (counters) return static_cast<Counters*>(counters);
  __atomic_fetch_add(&header->lost, 1, __ATOMIC_RELAXED);
  return &uncounted;
}

void give_back(void* counters) {
  kastarri_profile_counters = nullptr;
  if (counters == &uncounted) return;
  const profile::SignalsWait signals_wait;
  pthread_mutex_lock(&lock);
  static_cast<Counters*>(counters)->next_free = free_counters;
  free_counters = static_cast<Counters*>(counters);
  pthread_mutex_unlock(&lock);
}

void set_up() {
  header = static_cast<Header*>(profile::mapped(variable, 0, page));
  if (header) {
    header->block_size = block_size;
    if (void* const target = dlsym(loaded_library(), "_Z32cstub_Km_ZNB_Orbis_R5_64k_targetv"))
      std::strncpy(header->target, reinterpret_cast<const char* (*)()>(target)(), sizeof header->target - 1);
  }
  if (profile::callers_wanted()) profile::begin_callers();
  if (pthread_key_create(&thread_end, give_back) != 0) fail("the program uses every thread-specific key");
  // A forked process leaves the counters that it inherits to its parent.
  pthread_atfork(
      [] {
        pthread_mutex_lock(&lock);
        profile::lock_callers();
      },
      [] {
        profile::unlock_callers();
        pthread_mutex_unlock(&lock);
      },
      [] {
        kastarri_profile_counters = nullptr;
        pthread_setspecific(thread_end, nullptr);
        free_counters = nullptr;
        profile::unlock_callers();
        pthread_mutex_unlock(&lock);
        if (profile::callers_wanted()) profile::begin_callers();
      });
}

}  // namespace

void kastarri_profile_begin_thread() {
  const int program_errno = errno;
  const profile::SignalsWait signals_wait;
  if (kastarri_profile_counters) return;  // a handler's first call came before
  find_targets();
  pthread_once(&once, set_up);

  pthread_mutex_lock(&lock);
  Counters* counters = free_counters;
  if (counters) free_counters = counters->next_free;
  pthread_mutex_unlock(&lock);

  if (!counters) counters = new_counters();
  pthread_setspecific(thread_end, counters);
  kastarri_profile_counters = counters;
  errno = program_errno;
}

void* kastarri_profile_note_caller(unsigned intrinsic, const void* return_address) {
  const int program_errno = errno;
  profile::count_caller(intrinsic, return_address);
  errno = program_errno;
  return functions[intrinsic];
}
