// The processors' intrinsics.
#ifndef KASTARRI_FRAME_INTRINSICS_H
#define KASTARRI_FRAME_INTRINSICS_H

// g++ takes what its own header leaves undefined on purpose for a mistake.
#ifndef __clang__
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wuninitialized"
#pragma GCC diagnostic ignored "-Wmaybe-uninitialized"
#endif
#include <immintrin.h>
#ifndef __clang__
#pragma GCC diagnostic pop
#endif

#endif
