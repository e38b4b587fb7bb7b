// The exported data: the processor's state block and the byte-merge table. Both are part of the library's
// image, so that they hold their values before any code of the program runs.
#include "kastarri/state.h"

namespace {

constexpr cstub_Km_ZNB_Orbis_R5_64k_processor_t initial() {
  cstub_Km_ZNB_Orbis_R5_64k_processor_t p{};
  p.states.VECBASE = 0x840000;
  p.states.PSDIEXC = 1;
  p.states.PSDI = 1;
  p.states.WB_S = 1;
  p.states.MS_DISPST = 2;
  p.states.ISB = 0x2813fd70;
  p.states.MEMCTL = 9;
  p.states.MPUNUMENTRIES = 0x10;
  p.states.APB0CFG = 0x29000013;
  p.states.IRAM0CFG = 0x28000010;
  p.states.DRAM0CFG = 0x28100011;
  p.states.DRAM1CFG = 0x28120011;
  p.states.CPENABLE = 0x7f;
  p.states.ATOMCTL = 0x28;
  p.EXPSTATE.name = "EXPSTATE";
  p.EXPSTATE.width = 32;
  p.IPQ.name = "IPQ";
  p.IPQ.width = 32;
  p.OPQ.name = "OPQ";
  p.OPQ.width = 32;
  p.IMPWIRE.name = "IMPWIRE";
  p.IMPWIRE.width = 32;
  return p;
}

constexpr cstub_Km_ZNB_Orbis_R5_64k_processor_t at_load = initial();

}  // namespace

cstub_Km_ZNB_Orbis_R5_64k_processor_t cstub_Km_ZNB_Orbis_R5_64k_proc = at_load;

unsigned cstub_Km_ZNB_Orbis_R5_64k_mask[16] = {
    0xFFFFFFFF, 0xFFFFFF00, 0xFFFF00FF, 0xFFFF0000, 0xFF00FFFF, 0xFF00FF00, 0xFF0000FF, 0xFF000000,
    0x00FFFFFF, 0x00FFFF00, 0x00FF00FF, 0x00FF0000, 0x0000FFFF, 0x0000FF00, 0x000000FF, 0x00000000,
};
