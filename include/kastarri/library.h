/// The library itself: version and target.
#ifndef KASTARRI_LIBRARY_H
#define KASTARRI_LIBRARY_H

#ifndef __cplusplus
#error "kastarri is for C++: compile with g++ or clang++, a kernel in C with g++ -x c++"
#include <cstddef>  // which a C compiler does not find: it stops here
#endif

/// What a declaration of the library carries: its symbol is exported.
#define KASTARRI_API __attribute__((visibility("default")))

/// The same of a function that is called for its result: a call that does not use it is warned of, unless it is cast to
/// void.
#ifdef __clang__
#define KASTARRI_RESULT KASTARRI_API __attribute__((warn_unused_result))
#else
#define KASTARRI_RESULT [[nodiscard]] KASTARRI_API
#endif

/// The version of these headers, "0.2.0". The build, the packages and the tools take theirs from here.
#define KASTARRI_VERSION_MAJOR 0
#define KASTARRI_VERSION_MINOR 2
#define KASTARRI_VERSION_PATCH 0
#define KASTARRI_VERSION KASTARRI_DOTTED(KASTARRI_VERSION_MAJOR, KASTARRI_VERSION_MINOR, KASTARRI_VERSION_PATCH)

/// The version of the library that is loaded, as KASTARRI_VERSION.
KASTARRI_API const char* cstub_Km_ZNB_Orbis_R5_64k_version();

/// The instruction set that the loaded library's intrinsics use on this processor: "avx512", "avx2" or
/// "sse2"; "none" if it runs none that the library was built for.
KASTARRI_API const char* cstub_Km_ZNB_Orbis_R5_64k_target();

#define KASTARRI_DOTTED(MAJOR, MINOR, PATCH) KASTARRI_DOTTED_AS_IS(MAJOR, MINOR, PATCH)
#define KASTARRI_DOTTED_AS_IS(MAJOR, MINOR, PATCH) #MAJOR "." #MINOR "." #PATCH

#if !defined __i386__ && !(defined __x86_64__ && defined __LP64__)
#error "kastarri is a library for x86: compile with -m32 or -m64, the width of the library that you link"
#endif

#endif
