// Prints the versions of the headers and of the library, what the library runs on, and a lane that it computed.
#include <kastarri.h>
#include <kastarri/names.h>

#include <cstdio>

int main() {
  const qv_vecNx16 a(300), b(-45);
  const int lane = static_cast<short>(ZRA_ADDNX16(a, b)._[15] >> 16);
  std::printf("%s %s %s %d\n", KASTARRI_VERSION, cstub_Km_ZNB_Orbis_R5_64k_version(),
              cstub_Km_ZNB_Orbis_R5_64k_target(), lane);
}
