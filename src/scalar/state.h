// The state block, as the library's own sources reach it.
#ifndef KASTARRI_SCALAR_STATE_H
#define KASTARRI_SCALAR_STATE_H

#include "kastarri/state.h"

namespace {

#ifdef __i386__

// Exported data is found through the global offset table, and the table from the program counter. For the latter
// compilers call a function that reads its return address. A call of the very next instruction does the same, and
// processors run it without a branch: they do not take it for a call.
inline cstub_Km_ZNB_Orbis_R5_64k_processor_t& processor() {
  cstub_Km_ZNB_Orbis_R5_64k_processor_t* found;
  asm("call 0f\n"
      "0:\n\t"
      "popl %0\n\t"
      "addl $_GLOBAL_OFFSET_TABLE_+(.-0b), %0\n\t"
      "movl cstub_Km_ZNB_Orbis_R5_64k_proc@GOT(%0), %0"
      : "=r"(found)
      :
      : "cc");
  return *found;
}

#else

inline cstub_Km_ZNB_Orbis_R5_64k_processor_t& processor() { return cstub_Km_ZNB_Orbis_R5_64k_proc; }

#endif

}  // namespace

#endif
