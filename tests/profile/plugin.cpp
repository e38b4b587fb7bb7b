// Uses the library for a program that does not.
#include "kastarri/names.h"

extern "C" int plugin();

int plugin() { return RK_MIN(3, RK_MAX(1, 2)); }
