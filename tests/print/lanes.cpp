// Reads a variable of every register type and tells its lanes, by kastarri/lanes.h. Run as: lanes IMAGE, the bytes of
// the variables one after the other. The exit status is 1 where lanes that are written are not the ones that are read.
#include "kastarri/lanes.h"

#include <cstdio>

namespace {

using namespace kastarri;

int wrong = 0;

void require(bool holds, const char* type, const char* what) {
  if (holds) return;
  std::printf("%s: %s\n", type, what);
  wrong = 1;
}

void tell(bool lane) { std::printf(" %d", lane); }
void tell(float lane) { std::printf(" %.9g", static_cast<double>(lane)); }
template <class Integer>
void tell(Integer lane) {
  std::printf(std::is_signed<Integer>::value ? " %lld" : " %llu", static_cast<unsigned long long>(lane));
}
template <std::size_t words>
void tell(const std::array<std::uint32_t, words>& lane) {
  std::printf(" 0x");
  for (std::size_t k = words; k > 0; --k) std::printf("%08x", static_cast<unsigned>(lane[k - 1]));
}

template <class R>
void copy_lane(R& to, const R& from, int i, std::true_type /* up to 64 bits */) {
  set_lane_bits(to, i, lane_bits(from, i));
}
template <class R>
void copy_lane(R& to, const R& from, int i, std::false_type) {
  set_lane(to, i, lane(from, i));
}

template <class R, int bits>
void look_at(std::FILE* image, const char* type) {
  typedef std::integral_constant<bool, (bits <= 64)> Narrow;
  R r;
  require(std::fread(r._, sizeof r, 1, image) == 1, type, "is missing in the image");
  std::printf("%s", type);
  for (const Lane<R>& one : lanes(r)) tell(one);
  std::printf("\n");

  R copy = r;  // with every bit turned
  for (unsigned char* byte = reinterpret_cast<unsigned char*>(&copy);
       byte != reinterpret_cast<unsigned char*>(&copy + 1); ++byte)
    *byte = static_cast<unsigned char>(~*byte);
  for (int i = 0; i < lane_count<R>(); ++i) {
    require(!equal(copy, r), type, "is equal before all lanes are copied");
    copy_lane(copy, r, i, Narrow());
  }
  require(equal(copy, r), type, "is not equal to its copy");
  // A value goes the way of its bits, but that a function of a 32-bit program makes a signalling NaN quiet.
  const R made = from_lanes<R>(lanes(r));
  const R again = by_lane<R>([&](int i) { return lane(made, i); });
  require(equal(made, again), type, "is not equal to what is made of its lanes");
  require(std::is_same<Lane<R>, float>::value || equal(made, r), type, "is not made of its lanes");
}

}  // namespace

int main(int argc, char** argv) {
  std::FILE* image = argc == 2 ? std::fopen(argv[1], "rb") : nullptr;
  if (!image) return 2;
#define LOOK_AT(T, KIND, BITS, COUNT) look_at<cstub_Km_ZNB_Orbis_R5_64k_##T, BITS>(image, #T);
  KASTARRI_REGISTER_TYPES(LOOK_AT)
  return wrong;
}
