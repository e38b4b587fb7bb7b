// The kernel for the core: 16 entries at a time in the vector unit, what is left in the scalar core.
#include <kastarri.h>
#include <kastarri/names.h>

#include "ports/scale.h"

namespace {

constexpr int BLOCK = 16;  // entries that fill a vector

// Queues that the host waits for.
struct Blocking {
  unsigned waits = 0;
  unsigned take() { return RK_READ_IPQ(); }
  void put(unsigned entry) { RK_WRITE_OPQ(entry); }
};

// Queues that are asked again and again until they are ready. A real kernel would do other work in between.
struct Polling {
  unsigned waits = 0;
  unsigned take() {
    unsigned entry = 0;
    for (rkbool ok;; ++waits) {
      RK_READ_IPQ_NBLK(entry, ok);
      if (ok._[0]) return entry;
    }
  }
  void put(unsigned entry) {
    for (; !RK_WRITE_OPQ_NBLK(entry)._[0]; ++waits) {
    }
  }
};

int scaled_sample(int sample, int gain) {
  const int rounded = RK_ADDI(RK_MUL16S(sample, gain), 1 << (GAIN_BITS - 1));
  return RK_CLAMPS(RK_SRAI(rounded, GAIN_BITS), 15);
}

unsigned scaled_entry(unsigned entry, int gain) {
  auto scaled = static_cast<unsigned>(scaled_sample(static_cast<int>(entry), gain));
  const auto upper = static_cast<int>(RK_EXTUI(entry, 16, 16));
  RK_DEPBITS(scaled, static_cast<unsigned>(scaled_sample(upper, gain)), 16, 16);
  return scaled;
}

template <class Queues>
unsigned scale(Queues queues, int entries) {
  const int gain = static_cast<int>(RK_READ_IMPWIRE());
  const qv_vecNx16 factor = gain;
  alignas(64) unsigned block[BLOCK];
  auto* const vector = reinterpret_cast<qv_vecNx16*>(block);

  RK_WUR_EXPSTATE(0);
  for (; entries >= BLOCK; entries -= BLOCK) {
    for (unsigned& entry : block) entry = queues.take();
    const qv_vecNx48 product = ZRA_MULNX16(ZRA_LVNX16_I(vector, 0), factor);
    ZRA_SVNX16_I(ZRA_PACKVRNX48(product, GAIN_BITS), vector, 0);
    for (unsigned entry : block) queues.put(entry);
    RK_WUR_EXPSTATE(RK_RUR_EXPSTATE() + BLOCK);
  }
  for (; entries > 0; --entries) {
    queues.put(scaled_entry(queues.take(), gain));
    RK_WUR_EXPSTATE(RK_RUR_EXPSTATE() + 1);
  }
  return queues.waits;
}

}  // namespace

unsigned scale_blocking(int entries) { return scale(Blocking(), entries); }
unsigned scale_polling(int entries) { return scale(Polling(), entries); }
