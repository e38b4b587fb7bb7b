// The processor's state block: where every member lies and what it holds when the library is loaded.
#include <cstddef>

#include "support/drivers.h"

namespace {

using Processor = cstub_Km_ZNB_Orbis_R5_64k_processor_t;
using States = cstub_Km_ZNB_Orbis_R5_64k_states_t;

// The state block as it was before any test ran.
const Processor at_load = cstub_Km_ZNB_Orbis_R5_64k_proc;

struct Member {
  const char* name;
  std::size_t offset, size;
};
#define STATE(NAME) \
  { #NAME, offsetof(States, NAME), sizeof(States::NAME) }

// clang-format off
const Member in_order[] = {
    STATE(RKSYNC), STATE(VECBASE), STATE(VECBASELOCK), STATE(EPC), STATE(PSDIEXC), STATE(PSDI), STATE(PSRING),
    STATE(PSSTACK), STATE(PSENTRYNR), STATE(WB_S), STATE(WB_P), STATE(WB_C), STATE(WB_N), STATE(WB_T), STATE(WB_M),
    STATE(REV8AR), STATE(MS_DISPST), STATE(EXCCAUSE), STATE(EXCINF), STATE(EXCVADDR), STATE(ISB), STATE(ISL),
    STATE(KSL), STATE(PSSS), STATE(MS_DE), STATE(InOCDMode), STATE(ActivePriority), STATE(ActiveInterrupt),
    STATE(ActiveFairness), STATE(SecondPriority), STATE(SecondInterrupt), STATE(SecondFairness),
    STATE(CurrentPriority), STATE(LBEG), STATE(LEND), STATE(MEMCTL), STATE(SAR), STATE(MISC0), STATE(MISC1),
    STATE(MPUNUMENTRIES), STATE(APB0CFG), STATE(DBREAKA0), STATE(DBREAKC0), STATE(DBREAKC_SG0), STATE(DBREAKA1),
    STATE(DBREAKC1), STATE(DBREAKC_SG1), STATE(IBREAKA0), STATE(IBREAKC0), STATE(IBREAKA1), STATE(IBREAKC1),
    STATE(CCOMPARE0), STATE(CCOMPARE1), STATE(CCOMPARE2), STATE(IRAM0CFG), STATE(DRAM0CFG), STATE(DRAM1CFG),
    STATE(PREFCTL), STATE(CACHEADRDIS), STATE(MPUENB), STATE(MPULOCK), STATE(CPENABLE), STATE(ATOMCTL),
    STATE(ERI_RAW_INTERLOCK), STATE(ERACCESS), STATE(RoundMode), STATE(StickyFlags), STATE(StickyEnable),
    STATE(ZRA_FS0), STATE(ZRA_FS1), STATE(ZRA_FS2), STATE(ZRA_FS3), STATE(ZRA_FS4), STATE(ZRA_FS5), STATE(ZRA_FS6),
    STATE(ZRA_FS7), STATE(EXPSTATE),
};
// clang-format on

const std::pair<const char*, unsigned> not_zero[] = {
    {"VECBASE", 0x840000},    {"PSDIEXC", 1},           {"PSDI", 1},       {"WB_S", 1},
    {"MS_DISPST", 2},         {"ISB", 0x2813fd70},      {"MEMCTL", 9},     {"MPUNUMENTRIES", 16},
    {"APB0CFG", 0x29000013},  {"IRAM0CFG", 0x28000010}, {"CPENABLE", 127}, {"DRAM0CFG", 0x28100011},
    {"DRAM1CFG", 0x28120011}, {"ATOMCTL", 0x28},
};

TEST(State, StatesLieInOrderAndHoldTheirFirstValues) {
  std::size_t offset = 0;
  for (const Member& member : in_order) {
    EXPECT_EQ(member.offset, offset) << member.name;
    const bool wide = std::strncmp(member.name, "ZRA_FS", 6) == 0;
    EXPECT_EQ(member.size, wide ? 8u : 4u) << member.name;
    unsigned expected = 0;
    for (const auto& [name, value] : not_zero)
      if (std::strcmp(name, member.name) == 0) expected = value;
    for (std::size_t at = 0; at < member.size; at += 4) {
      unsigned got;
      std::memcpy(&got, reinterpret_cast<const char*>(&at_load.states) + offset + at, sizeof got);
      EXPECT_EQ(got, expected) << member.name;
    }
    offset += member.size;
  }
  EXPECT_EQ(sizeof(States), offset);
}

TEST(State, ThePortsFollowTheStates) {
  const std::size_t expected_32[] = {0, 340, 356, 380, 384, 404, 420, 424, 428, 432};
  const std::size_t expected_64[] = {0, 344, 376, 424, 432, 472, 504, 512, 520, 528};
  const auto& expected = sizeof(void*) == 4 ? expected_32 : expected_64;
  const std::size_t got[] = {offsetof(Processor, states),    offsetof(Processor, EXPSTATE),
                             offsetof(Processor, IPQ),       offsetof(Processor, cstub_IPQ_data),
                             offsetof(Processor, OPQ),       offsetof(Processor, IMPWIRE),
                             offsetof(Processor, callbacks), offsetof(Processor, PRID),
                             offsetof(Processor, last),      sizeof(Processor)};
  for (int i = 0; i < 10; ++i) EXPECT_EQ(got[i], expected[i]) << "member " << i;
  EXPECT_EQ(at_load.PRID, 0);
  EXPECT_EQ(at_load.last, nullptr);
  EXPECT_EQ(at_load.callbacks.mulpp_inplace, nullptr);
  EXPECT_EQ(at_load.cstub_IPQ_data[0], 0u);
}

// A record: the object, the name, the width, then handlers, all null; each takes as much as a pointer.
template <class Record>
void expect_port(const Record& record, const char* name, std::size_t members) {
  EXPECT_EQ(sizeof record, sizeof(void*) * members) << name;
  EXPECT_EQ(record.user_object, nullptr) << name;
  EXPECT_STREQ(record.name, name);
  EXPECT_EQ(record.width, 32u) << name;
  for (std::size_t i = 3 * sizeof(void*); i < sizeof record; ++i)
    EXPECT_EQ(reinterpret_cast<const char*>(&record)[i], 0) << name;
}

TEST(State, PortsStartWithoutHandlers) {
  expect_port(at_load.EXPSTATE, "EXPSTATE", 4);
  expect_port(at_load.IPQ, "IPQ", 6);
  expect_port(at_load.OPQ, "OPQ", 5);
  expect_port(at_load.IMPWIRE, "IMPWIRE", 4);
}

}  // namespace
