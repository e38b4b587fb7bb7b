// Registers that the headers make of host scalars, in pieces as wide as this program's own instruction set, against
// those that the exported conversions make. Prints which differ.
#include <cstdio>
#include <cstring>
#include <initializer_list>
#include <limits>

#include "kastarri.h"

#define TYPE(T, UNIT, UNITS, LAYOUT, MEANING) typedef cstub_Km_ZNB_Orbis_R5_64k_##T T;
#include "frame/types.def"

#include "frame/host_ints.h"

namespace {

int failures = 0;

template <class To, class Host>
void compare(const char* name, Host value, To (*exported)(Host)) {
  const To expected = exported(value);
  char room[sizeof(To) + 3];
  std::memset(room, 0x55, sizeof room);
  To& assigned = *reinterpret_cast<To*>(room);
  To constructed(value);
  assigned = value;
  const bool same = std::memcmp(&constructed, &expected, sizeof expected) == 0 &&
                    std::memcmp(&assigned, &expected, sizeof expected) == 0 && room[sizeof(To)] == 0x55;
  if (same) return;
  ++failures;
  std::printf("%s of %g\n", name, static_cast<double>(value));
}

template <class To, class Host>
void compare_corners(const char* name, To (*exported)(Host)) {
  typedef std::numeric_limits<Host> limits;
  for (Host value :
       {limits::min(), limits::max(), Host(0), Host(1), Host(-1), Host(2), Host(127), Host(128), Host(-128)})
    compare(name, value, exported);
  for (int bit = 0; bit < limits::digits; ++bit)
    compare(name, static_cast<Host>(static_cast<Host>(1) << bit), exported);
}
template <class To>
void compare_corners(const char* name, To (*exported)(float)) {
  // No signalling NaN: arguments that pass through the x87 get quiet on their way to the exported conversion.
  const unsigned int images[] = {0x3F800000, 0x80000000, 0x00000001, 0x7FC00001, 0xFF800000, 0x12345678};
  for (unsigned int image : images) {
    float value;
    std::memcpy(&value, &image, sizeof value);
    compare(name, value, exported);
  }
}

}  // namespace

#define NAMED(NAME) cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_zra32_##NAME
#define HOST(NAME, HOST_TYPE, TO) compare_corners<TO>(#NAME "_rtor_" #TO, &NAMED(NAME##_rtor_##TO));
#define HOST_BOTH HOST
#define REGISTER(FROM, TO)
#define DOC(TEXT)

int main() {
#include "frame/conversions.def"
  return failures != 0;
}
