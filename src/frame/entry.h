// Names and types that entries are made with, and where they are put: in a build for several targets
// each target's entries live in a namespace of their own and dispatch.cpp exports one symbol over
// them; in a build for one target the entries are the exported symbols.
#ifndef KASTARRI_FRAME_ENTRY_H
#define KASTARRI_FRAME_ENTRY_H

#include "frame/layouts.h"
#include "kastarri/types.h"

#define KASTARRI_SYMBOL(SYMBOL) cstub_Km_ZNB_Orbis_R5_64k__KOR_##SYMBOL

#ifdef KASTARRI_NAMESPACE
#define KASTARRI_ENTRIES_BEGIN namespace KASTARRI_NAMESPACE {
#define KASTARRI_ENTRIES_END }
#else
#define KASTARRI_ENTRIES_BEGIN
#define KASTARRI_ENTRIES_END
#endif

// The sources say qv_vecNx16 for cstub_Km_ZNB_Orbis_R5_64k_qv_vecNx16.
#define TYPE(T, UNIT, UNITS, LAYOUT, MEANING) using T = cstub_Km_ZNB_Orbis_R5_64k_##T;
#include "frame/types.def"
#undef TYPE

namespace {

template <class T>
struct layout_of_type;

#define TYPE(T, UNIT, UNITS, LAYOUT, MEANING) \
  template <>                                 \
  struct layout_of_type<T> {                  \
    using type = LAYOUT;                      \
  };
#include "frame/types.def"
#undef TYPE

template <class T>
using layout_of = typename layout_of_type<T>::type;

}  // namespace

// The static library's entries are inlined into kernels whatever their size. The compiler judges sizes before it
// vectorises: a loop over 32 lanes looks large then and ends as one or two instructions.
#ifdef KASTARRI_INLINE_ENTRIES
#define KASTARRI_ENTRY __attribute__((always_inline, flatten))
constexpr bool entries_are_inlined = true;
#else
#define KASTARRI_ENTRY
constexpr bool entries_are_inlined = false;
#endif

#endif
