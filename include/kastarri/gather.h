/// What all gathers and scatters come down to, for programs that bring their own masks and control word.
#ifndef KASTARRI_GATHER_H
#define KASTARRI_GATHER_H

#include "kastarri/library.h"

/* Element i lies at base + offset i bytes. A mask of 0 disables it: it is neither read nor written, and gathers
   0. The control word:
     bits 4-5  0: 32 elements, their offsets, masks and data 16 bits wide, packed two a word; 1: 16 of 32 bits;
               anything else does nothing
     bits 6-7  of the former, 0: elements of 8 bits in 16-bit units; anything else: of 16 bits
     bits 0-3  of a scatter, 6: increment; anything else: store
   An 8-bit element is read with the byte after it, and written without. */

/// Element i ANDed with mask i into unit i of `out`, an 8-bit element zero-extended.
KASTARRI_API void cstub_Km_ZNB_Orbis_R5_64k_do_gathera(const void* base, const unsigned* offsets, const unsigned* masks,
                                                       unsigned control, unsigned* out);

/// Element after element: a store writes data i where mask i has ones, an increment adds bit 0 of the mask.
KASTARRI_API void cstub_Km_ZNB_Orbis_R5_64k_do_scatter(const void* base, const unsigned* offsets, const unsigned* masks,
                                                       unsigned control, const unsigned* data);

#endif
