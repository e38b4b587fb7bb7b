// What a program can ask of the library itself.
#include "kastarri/library.h"

#include "frame/processor.h"

const char* cstub_Km_ZNB_Orbis_R5_64k_target() {
#define NAME_IF_CHOSEN(TARGET, UNUSED) \
  if (runs_##TARGET()) return #TARGET;
  KASTARRI_FOR_TARGETS(NAME_IF_CHOSEN, )
  return "none";
}

const char* cstub_Km_ZNB_Orbis_R5_64k_version() { return KASTARRI_VERSION; }
