/// Constant tables of the core.
#ifndef KASTARRI_TABLES_H
#define KASTARRI_TABLES_H

#include "kastarri/library.h"

/// Byte j (byte 0 the lowest) of entry k is 0xFF where bit j of k is 1, else 0x00.
extern KASTARRI_API const unsigned cstub_Km_ZNB_Orbis_R5_64k_table__rk_bytelane_lsb[16];

#endif
