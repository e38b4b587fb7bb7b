// Calls known intrinsics known numbers of times, in the way that its argument names. It is built in every way in
// which a program can reach a function of a shared library.
#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "kastarri/names.h"

namespace {

const qv_vecNx16 ones =
    int32_rtor_qv_vecNx16(RK_CLAMPS(1, 7));  // called before main: CLAMPS and int32_rtor_qv_vecNx16, once each

// Not inlined, so that it is who calls.
__attribute__((noinline)) void add(int times) {
  alignas(64) qv_vecNx16 sum = ones;
  for (int i = 0; i < times; ++i) sum = ZRA_ADDNX16(sum, ones);
  if (static_cast<short>(sum._[15] >> 16) != static_cast<short>(times + 1)) std::abort();
}

// Results in every place that the i386 ABI has for them, arguments of every kind.
void results() {
  errno = 7;
  const qv_vecNx16* pointer = &ones;
  qv_vecNx16 loaded;
  ZRA_LVNX16_IP(loaded, &pointer, 64);
  qv_vecNx48 product = ZRA_MULNX16(loaded, ones);
  ZRA_MULANX16(product, loaded, loaded);
  const qv_vecN_2xf32 floats = float_rtor_qv_vecN_2xf32(1.5f);
  std::printf("%d %d %u %x %d\n", static_cast<int>(pointer - &ones), RK_CLAMPS(1000, 7), product._[62], floats._[15],
              errno);
}

void through_pointers() {
  qv_vecNx16 (*const add_them)(const qv_vecNx16&, const qv_vecNx16&) = &ZRA_ADDNX16;
  qv_vecNx16 (*volatile subtract)(const qv_vecNx16&, const qv_vecNx16&) = &ZRA_SUBNX16;
  for (int i = 0; i < 6; ++i) {
    if (i % 2 ? add_them(ones, ones)._[0] != 0x20002 : subtract(ones, ones)._[0] != 0) std::abort();
  }
}

void in_threads(int threads, int times) {
  std::vector<std::thread> running;
  for (int i = 0; i < threads; ++i) running.emplace_back([=] { add(times); });
  for (std::thread& thread : running) thread.join();
}

// Parent and child count at the same time, and so does a thread of the child that begins when another has ended.
void in_fork() {
  add(1);
  int child_runs[2];
  if (pipe(child_runs) != 0) std::abort();
  const pid_t child = fork();
  char byte = 0;
  if (child == 0) {
    in_threads(1, 10);
    if (write(child_runs[1], &byte, 1) != 1) std::abort();
  } else if (read(child_runs[0], &byte, 1) != 1) {
    std::abort();
  }
  add(5000000);
  if (child == 0) _exit(0);
  int status;
  waitpid(child, &status, 0);
}

void in_exec(char* program, bool forked) {
  add(3);
  char mode[] = "results";
  char* const arguments[] = {program, mode, nullptr};
  if (!forked || fork() == 0) execv("/proc/self/exe", arguments);
  int status;
  wait(&status);
}

void wait_for_a_signal() {
  add(4);
  std::puts("ready");
  std::fflush(stdout);
  for (;;) pause();
}

void store_at_an_odd_address() {
  vboolN p;
  p._[0] = 0;
  alignas(4) char memory[8];
  ZRA_SBN_I(p, reinterpret_cast<const vboolN*>(memory), 1);
}

void copy_input() {
  for (int c; (c = std::getchar()) != EOF;) std::putchar(c);
}

}  // namespace

int main(int argc, char** argv) {
  const std::string mode = argc > 1 ? argv[1] : "";
  const int number = argc > 2 ? std::atoi(argv[2]) : 0;
  if (mode == "results") results();
  if (mode == "pointers") through_pointers();
  if (mode == "threads") in_threads(4, 100000);
  if (mode == "many-threads") {
    for (int i = 0; i < 100; ++i) in_threads(3, 10);
  }
  if (mode == "fork") in_fork();
  if (mode == "exec") in_exec(argv[0], false);
  if (mode == "fork-exec") in_exec(argv[0], true);
  if (mode == "wait") wait_for_a_signal();
  if (mode == "unaligned") store_at_an_odd_address();
  if (mode == "copy") copy_input();
  if (mode == "arguments") {
    for (int i = 2; i < argc; ++i) std::puts(argv[i]);
  }
  if (mode == "exit" || mode == "_exit" || mode == "signal" || mode == "fault") add(5);
  if (mode == "_exit") _exit(number);
  if (mode == "signal") raise(number);
  if (mode == "fault") *reinterpret_cast<volatile int*>(number) = 1;
  return number;
}
