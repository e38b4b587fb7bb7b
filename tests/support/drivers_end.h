}  // namespace

#include "frame/rows_end.h"
