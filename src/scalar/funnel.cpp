// The shift-amount state SAR and the shifts of the scalar core.
#include "frame/entry.h"
#include "scalar/state.h"

namespace {

auto& states() { return processor().states; }

// A program may have stored more than six bits in the state.
word sar() { return states().SAR & 63; }

template <class T>
void set_sar(T amount) {
  states().SAR = static_cast<word>(amount);
}

void exchange_sar(word& r) {
  const word old = states().SAR;
  set_sar(r & 63);
  r = old;
}

// In words: what compilers make of a shift of 64 bits takes longer.
word funnel(word hi, word lo, word amount) {
  const word low = amount & 32 ? hi : lo, high = amount & 32 ? 0 : hi;
  return low >> (amount & 31) | high << 1 << (~amount & 31);
}

}  // namespace

#include "scalar/stamp.h"

#include "scalar/funnel.def"

#include "frame/rows_end.h"
