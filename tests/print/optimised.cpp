// Registers that the compiler does not keep, whole or in part, where the debugger stops in `kernel`.
#include "kastarri/names.h"

__attribute__((noinline)) void stop_here(const void* pointer) { asm volatile("" : : "r"(pointer) : "memory"); }

__attribute__((noinline)) unsigned kernel(unsigned k, const qv_vecNx48* nothing) {
  vboolN gone;
  gone._[0] = k * 3;
  qv_vecNx48 half_gone;  // the upper word of its lane 0
  half_gone._[0] = k;
  qv_vecNx16 part;
  part._[0] = k;
  part._[1] = 5;
  qv_vecNxf16 uninitialised;
  qv_vecNx16 kept(-2);
  stop_here(&kept);
  return k + static_cast<unsigned>(nothing == nullptr) + half_gone._[0];
}

int main(int argc, char**) { return static_cast<int>(kernel(static_cast<unsigned>(argc), nullptr)) & 1; }
