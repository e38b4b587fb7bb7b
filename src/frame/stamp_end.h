KASTARRI_ENTRIES_END

#include "frame/rows_end.h"
