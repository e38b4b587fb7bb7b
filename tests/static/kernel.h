// The same kernel twice: `called`, compiled as the library is, and `inlined`, optimised when it is linked.
#ifndef KASTARRI_TESTS_STATIC_KERNEL_H
#define KASTARRI_TESTS_STATIC_KERNEL_H

#include "kastarri.h"

using Singles = cstub_Km_ZNB_Orbis_R5_64k_qv_vecN_2xf32;
using Halves = cstub_Km_ZNB_Orbis_R5_64k_qv_vecNxf16;

Singles called(const Singles& a, const Singles& b, const Singles& c);
Halves called(const Halves& a, const Halves& b, const Halves& c);
Singles inlined(const Singles& a, const Singles& b, const Singles& c);
Halves inlined(const Halves& a, const Halves& b, const Halves& c);

#endif
