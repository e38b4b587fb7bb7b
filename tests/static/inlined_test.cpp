// Floats that are inlined when a kernel is linked yield what calls yield, whatever flags the kernel is compiled with.
#include <cstdio>
#include <cstring>
#include <random>

#include "kernel.h"

namespace {

auto& states = cstub_Km_ZNB_Orbis_R5_64k_proc.states;
std::mt19937 random_bits(1);

// Registers of any bits, of numbers about 1, and of small ones with a zero among them.
template <class Register>
Register operand(unsigned kind, unsigned free, unsigned one) {
  Register x;
  for (auto& word : x._) {
    word = static_cast<unsigned>(random_bits());
    if (kind == 1) word = (word & free) | one;
    if (kind == 2) word &= free | one >> 1;
  }
  if (kind == 2) x._[random_bits() % 16] = 0;
  return x;
}

template <class Register>
int differences(unsigned free, unsigned one) {
  int count = 0;
  for (unsigned n = 0; n < 20000; ++n) {
    const auto a = operand<Register>(n % 3, free, one), b = operand<Register>(n % 3, free, one),
               c = operand<Register>(n % 3, free, one);
    states.RoundMode = n / 3 % 4;
    const unsigned flags = n / 12 % 2;
    states.StickyFlags = flags;
    const Register x = called(a, b, c);
    const unsigned raised = states.StickyFlags;
    states.StickyFlags = flags;
    const Register y = inlined(a, b, c);
    count += std::memcmp(&x, &y, sizeof x) != 0 || states.StickyFlags != raised;
  }
  return count;
}

}  // namespace

int main() {
  if (std::strcmp(cstub_Km_ZNB_Orbis_R5_64k_target(), "none") == 0) return 77;  // not for this processor
  const int singles = differences<Singles>(0x807FFFFF, 0x3F800000), halves = differences<Halves>(0x83FF83FF, 0x3C003C00);
  std::printf("different from calls: %d of singles, %d of halves\n", singles, halves);
  return singles + halves != 0;
}
