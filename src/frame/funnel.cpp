// The shift-amount state SAR and the shifts of the scalar core.
#include "frame/entry.h"

namespace {

cstub_Km_ZNB_Orbis_R5_64k_states_t& states = cstub_Km_ZNB_Orbis_R5_64k_proc.states;

// A program may have stored more than six bits in the state.
word sar() { return states.SAR & 63; }

template <class T>
void set_sar(T amount) {
  states.SAR = static_cast<word>(amount);
}

void exchange_sar(word& r) {
  const word old = states.SAR;
  set_sar(r & 63);
  r = old;
}

word funnel(word hi, word lo, word amount) { return static_cast<word>((std::uint64_t{hi} << 32 | lo) >> amount); }

}  // namespace

#include "frame/scalar_stamp.h"

#include "frame/funnel.def"

#include "frame/rows_end.h"
