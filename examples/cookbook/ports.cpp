// Double-buffered ports: one block fills from the input queue while the other is worked on.
#include <cstdio>

#include "kastarri/names.h"

// The host's side: entries 0, 1, 2, ..., which are not always there when asked for.
struct Source {
  unsigned next = 0, asked = 0;
  static unsigned ready(const cstub_InputQueue_t* port) {
    return static_cast<Source*>(port->user_object)->asked++ % 5 != 0;
  }
  static void data(const cstub_InputQueue_t* port, unsigned flag, unsigned* entry) {
    if (flag == 0) *entry = static_cast<Source*>(port->user_object)->next++;
  }
};

struct Block {
  int words[16];
  int filled = 0;
  void poll() {  // takes an entry if there is one, and room for it
    if (filled == 16) return;
    unsigned entry = 0;
    rkbool ok;
    RK_READ_IPQ_NBLK(entry, ok);
    if (ok._[0]) words[filled++] = static_cast<int>(entry);
  }
};

int main() {
  Source source;
  cstub_Km_ZNB_Orbis_R5_64k_register_IPQ(&source, Source::ready, Source::data);
  Block blocks[2];
  for (int n = 0; n < 4; ++n) {
    Block &now = blocks[n % 2], &next = blocks[(n + 1) % 2];
    const int early = now.filled;
    while (now.filled < 16) now.poll();
    const qv_vecN_2x32v v = ZRA_LVN_2X32_I(reinterpret_cast<const qv_vecN_2x32v*>(now.words), 0);
    now.filled = 0;
    int sum = 0;
    for (int step = 0; step < 8; ++step) {  // the work, with a look at the queue after each step
      sum += static_cast<int>(ZRA_RADDN_2X32(ZRA_SRAIN_2X32(v, step))._[0]);
      next.poll();
    }
    std::printf("block %d: %d; %d of its 16 entries came during the one before\n", n, sum, early);
  }
}
