// A variable of every register type: prints each in each form, and stops for the debugger where they all
// have their values. Run as: registers IMAGE, the bytes of the variables one after the other.
#include "kastarri/print.h"

#include <iostream>
#include <locale>

#define REGISTER_VARIABLE(T, KIND, BITS, COUNT) cstub_Km_ZNB_Orbis_R5_64k_##T a_##T;
KASTARRI_REGISTER_TYPES(REGISTER_VARIABLE)

struct Filter {
  cstub_Km_ZNB_Orbis_R5_64k_qv_int16 taps[2];
} filter;

namespace {

struct Named {
  const char* name;
  kastarri::Form form;
};
const Named forms[] = {
    {"decimal", kastarri::form::decimal}, {"hex", kastarri::form::hex},   {"float", kastarri::form::float_},
    {"half", kastarri::form::half},       {"q0", kastarri::form::q(0)},   {"q7", kastarri::form::q(7)},
    {"q15", kastarri::form::q(15)},       {"q31", kastarri::form::q(31)}, {"q63", kastarri::form::q(63)},
    {"q8", kastarri::form::q(8)},         {"q16", kastarri::form::q(16)}, {"halves", kastarri::form::halves},
    {"bytes", kastarri::form::bytes}};

// A user's locale, which must not show in the text.
struct Grouped : std::numpunct<char> {
  char do_decimal_point() const override { return ','; }
  std::string do_grouping() const override { return "\1"; }
};

template <class T>
void show(const char* name, const T& value) {
  for (const Named& form : forms) {
    std::cout << name << " stream " << form.name << ' ' << kastarri::as(value, form.form) << std::endl;
    std::printf("%s file %s ", name, form.name);
    kastarri::print(stdout, value, form.form);
    std::printf("\n");
    std::fflush(stdout);
  }
  std::cout << name << " plain decimal " << value << std::endl;
}

template <class T>
bool read(std::FILE* image, T& value) {
  return std::fread(value._, sizeof value, 1, image) == 1;
}

}  // namespace

void stop_here(const cstub_Km_ZNB_Orbis_R5_64k_qv_vecNx16& argument) {
  static_cast<void>(argument);
  std::fflush(stdout);
}

int main(int argc, char** argv) {
  std::FILE* image = argc == 2 ? std::fopen(argv[1], "rb") : nullptr;
  if (!image) return 2;
  std::locale::global(std::locale(std::locale::classic(), new Grouped));
  bool complete = true;
#define READ(T, KIND, BITS, COUNT) complete = complete && read(image, a_##T);
  KASTARRI_REGISTER_TYPES(READ)
  if (!complete) return 2;
  filter.taps[0] = -3;  // a conversion of the library, which is thus loaded
  filter.taps[1] = 7;
#define SHOW(T, KIND, BITS, COUNT) show(#T, a_##T);
  KASTARRI_REGISTER_TYPES(SHOW)
  stop_here(a_qv_vecNx16);
  return 0;
}
