/// Immediates out of range: what compilers are told so that they warn.
#ifndef KASTARRI_NAMES_CHECKS_H
#define KASTARRI_NAMES_CHECKS_H

#include "kastarri/library.h"

/// Of a function with an immediate: it has to be below a limit, which the core takes it modulo. A constant that is not
/// is warned of, by clang in any build.
#ifdef __clang__
#define KASTARRI_BELOW(LIMIT, IMMEDIATE)                                                                             \
  _Pragma("clang diagnostic push") _Pragma("clang diagnostic ignored \"-Wgcc-compat\"")                              \
      __attribute__((diagnose_if(IMMEDIATE < 0 || IMMEDIATE >= LIMIT,                                                \
                                 "the immediate " #IMMEDIATE " is not below " #LIMIT ": it is taken modulo " #LIMIT, \
                                 "warning"))) _Pragma("clang diagnostic pop")
#else
#define KASTARRI_BELOW(LIMIT, IMMEDIATE)
#endif

/// g++ knows a constant in an optimised build, in a body that is inlined. The body is for calls alone: CALL is the
/// function by its full name, of which the short one stays another name, and its address the library's.
#if defined __OPTIMIZE__ && !defined __clang__
#define KASTARRI_BELOW_BODY(LIMIT, IMMEDIATE, PROTOTYPE, CALL)                      \
  extern inline __attribute__((gnu_inline, always_inline, artificial)) PROTOTYPE {  \
    if (__builtin_constant_p(IMMEDIATE) && (IMMEDIATE < 0 || IMMEDIATE >= LIMIT)) { \
      kastarri::not_below_##LIMIT();                                                \
    }                                                                               \
    return CALL;                                                                    \
  }

namespace kastarri {
/// A call of this is warned of. It is any function of the library that changes nothing.
#define KASTARRI_NOT_BELOW(LIMIT)                                                   \
  const char* not_below_##LIMIT() __asm__("_Z33cstub_Km_ZNB_Orbis_R5_64k_versionv") \
      __attribute__((warning("the immediate is not below " #LIMIT ": it is taken modulo " #LIMIT)))
KASTARRI_NOT_BELOW(8);
KASTARRI_NOT_BELOW(16);
KASTARRI_NOT_BELOW(32);
KASTARRI_NOT_BELOW(64);
#undef KASTARRI_NOT_BELOW
}  // namespace kastarri
#else
#define KASTARRI_BELOW_BODY(LIMIT, IMMEDIATE, PROTOTYPE, CALL)
#endif

#endif
