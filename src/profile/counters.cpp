// The counters behind kastarri-profile. The library made of this and entries.S is loaded before the program's
// libkastarri, so that calls from outside it come to the entries.
//
// Each thread has counters of its own, which it alone writes: nothing is locked and nothing lost. They lie in a
// file that the profiler made and reads afterwards, so that they outlive the process however it ends. The file
// is a page with its header, then block after block of counters; forked and executed processes add to it.
#include <dlfcn.h>
#include <fcntl.h>
#include <pthread.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>

namespace {

#define INTRINSIC(INDEX, SYMBOL) #SYMBOL,
constexpr const char* symbols[] = {
#include "intrinsics.inc"
};
#undef INTRINSIC

constexpr unsigned intrinsics = sizeof symbols / sizeof *symbols;
constexpr unsigned page = 4096;

struct Counters {
  unsigned long long calls[intrinsics];
  Counters* next_free;
};

struct Header {
  unsigned block_size;  // in bytes
  unsigned blocks;
  unsigned lost;  // threads whose calls could not be counted
};

constexpr unsigned block_size = (sizeof(Counters) + page - 1) / page * page;

}  // namespace

// What the entries read: see there.
#define KASTARRI_FOR_ENTRIES extern "C" __attribute__((visibility("hidden")))
KASTARRI_FOR_ENTRIES void* kastarri_profile_targets[intrinsics];
KASTARRI_FOR_ENTRIES __thread Counters* kastarri_profile_counters __attribute__((tls_model("initial-exec")));
KASTARRI_FOR_ENTRIES void kastarri_profile_begin_thread();

void* kastarri_profile_targets[intrinsics];
__thread Counters* kastarri_profile_counters;

namespace {

Counters uncounted;  // where calls go that cannot be counted
Header* header;
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

// Done at the first call: a constructor of this library would come too late for calls from those of others, and
// the program may load libkastarri while it runs. Several threads may do it at once: all write the same. A lock
// could deadlock with the loader's own.
void find_targets() {
  static bool found;
  if (__atomic_load_n(&found, __ATOMIC_ACQUIRE)) return;
  void* const library = dlopen(KASTARRI_SONAME, RTLD_LAZY | RTLD_NOLOAD);
  if (!library) fail("an intrinsic is called, but " KASTARRI_SONAME " is not loaded");
  for (unsigned i = 0; i < intrinsics; ++i) {
    void* const target = dlsym(library, symbols[i]);
    __atomic_store_n(&kastarri_profile_targets[i], target ? target : reinterpret_cast<void*>(&missing),
                     __ATOMIC_RELAXED);
  }
  __atomic_store_n(&found, true, __ATOMIC_RELEASE);
}

// A new part of the file, which is made longer where it ends before that; null when that fails.
void* mapped(off_t offset, unsigned size) {
  const char* const path = std::getenv("KASTARRI_PROFILE_COUNTERS");
  const int file = path ? open(path, O_RDWR | O_CLOEXEC) : -1;
  if (file < 0) return nullptr;
  void* memory = MAP_FAILED;
  if (pwrite(file, "", 1, offset + size - 1) == 1)
    memory = mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_SHARED, file, offset);
  close(file);
  return memory == MAP_FAILED ? nullptr : memory;
}

Counters* new_counters() {
  if (!header) return &uncounted;
  const unsigned block = __atomic_fetch_add(&header->blocks, 1, __ATOMIC_RELAXED);
  void* const counters = mapped(page + static_cast<off_t>(block) * block_size, block_size);
  if (counters) return static_cast<Counters*>(counters);
  __atomic_fetch_add(&header->lost, 1, __ATOMIC_RELAXED);
  return &uncounted;
}

void give_back(void* counters) {
  kastarri_profile_counters = nullptr;
  if (counters == &uncounted) return;
  pthread_mutex_lock(&lock);
  static_cast<Counters*>(counters)->next_free = free_counters;
  free_counters = static_cast<Counters*>(counters);
  pthread_mutex_unlock(&lock);
}

void set_up() {
  header = static_cast<Header*>(mapped(0, page));
  if (header) header->block_size = block_size;
  if (pthread_key_create(&thread_end, give_back) != 0) fail("the program uses every thread-specific key");
  // A forked process leaves the counters that it inherits to its parent.
  pthread_atfork([] { pthread_mutex_lock(&lock); }, [] { pthread_mutex_unlock(&lock); },
                 [] {
                   kastarri_profile_counters = nullptr;
                   pthread_setspecific(thread_end, nullptr);
                   free_counters = nullptr;
                   pthread_mutex_unlock(&lock);
                 });
}

}  // namespace

void kastarri_profile_begin_thread() {
  const int program_errno = errno;
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
