// Every pair of register types that converts compiles, unambiguously, in each form a program may use.
// Only compiled, by both compilers, as C++11 and with the warnings of a careful user.
#include "kastarri.h"

#define TYPE(T, UNIT, UNITS, LAYOUT, MEANING) typedef cstub_Km_ZNB_Orbis_R5_64k_##T T;
#include "frame/types.def"

#include "frame/host_ints.h"

template <class T>
T make();

template <class T>
void take(const T&);

template <class To, class From>
void forms(From source) {
  To direct(source);
  To copied = source;
  copied = source;
  take<To>(source);
  take<To>(direct);
  take<To>(copied);
}

template <class To, class From>
void from_temporary() {
  To direct(make<From>());
  To copied = make<From>();
  copied = make<From>();
  take<To>(make<From>());
  take<To>(direct);
  take<To>(copied);
}

#define REGISTER(FROM, TO)                           \
  template void forms<TO, FROM&>(FROM&);             \
  template void forms<TO, const FROM&>(const FROM&); \
  template void from_temporary<TO, FROM>();
#define HOST(NAME, HOST_TYPE, TO)                              \
  template void forms<TO, HOST_TYPE&>(HOST_TYPE&);             \
  template void forms<TO, const HOST_TYPE&>(const HOST_TYPE&); \
  template void from_temporary<TO, HOST_TYPE>();
#define HOST_BOTH(NAME, HOST_TYPE, TO)      \
  HOST(NAME, HOST_TYPE, TO)                 \
  template void forms<HOST_TYPE, TO&>(TO&); \
  template void forms<HOST_TYPE, const TO&>(const TO&);
#define DOC(TEXT)

#include "frame/conversions.def"
#include "float/conversions.def"
