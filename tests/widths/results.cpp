// Calls every intrinsic on operands that follow from its name alone, and prints a number for each, made of all that the
// calls did: results, memory, pointers, states, ports. Whatever a library was built for, its numbers have to be the
// same.
//
//   kastarri_results [CALLS]    of each intrinsic
#include <csetjmp>
#include <csignal>
#include <cstdio>

#include "calls.h"
#include "kastarri/library.h"
#include "kastarri/state.h"
#include "support/addresses.h"
#include "support/numbers.h"
#include "support/sum.h"

namespace {

using namespace testing_support;
using worked::Call;
using worked::Number;
using worked::Operand;
using worked::Role;
using worked::Row;

auto& processor = cstub_Km_ZNB_Orbis_R5_64k_proc;

// --- What was done ----------------------------------------------------------------------------------

Sum sum;

// --- Memory -----------------------------------------------------------------------------------------

// Accesses lie about the middle, which is a multiple of 4 GiB on a 64-bit host.
constexpr std::size_t pages = 4096 * 2, seen = 4096;
unsigned char* const mapped = new_pages(pages);
unsigned char* const middle = mapped + pages / 2;
constexpr int reach = 1024;  // of the elements of a gather

// The offsets of a gather's elements, and the base that they are offsets from: as far away as offsets reach, half of
// the time those of 16 bits at either end of their range.
unsigned char* aim_elements(const Operand& offsets, unsigned char* place, Random& random) {
  const Format& format = offsets.view.format;
  const bool is_wide = format.bits == 32;
  const auto range = is_wide ? std::int64_t{1} << 32 : std::int64_t{1} << 16;
  const std::int64_t lowest = is_wide ? -range / 2 : 0, highest = lowest + range - reach;
  const std::int64_t ends[] = {
      lowest, highest, is_wide ? -reach / 2 : 0,
      lowest + static_cast<std::int64_t>(random() % static_cast<std::uint64_t>(range - reach))};
  const std::int64_t first = ends[random() % 4];
  for (int i = 0; i < format.count; ++i)
    set_lane(format, offsets.image, i, first + static_cast<std::int64_t>(random() % (reach - 4)));
  return moved_back<unsigned char>(place, static_cast<int>(first));
}

// Lets the call's pointer lead to the place, which an offset may be added for.
void aim(Call& call, unsigned char* place, Random& random) {
  for (std::size_t i = 0; i < call.operands.size(); ++i) {
    Operand& memory = call.operands[i];
    if (memory.role != Role::memory) continue;
    memory.image = place;
    unsigned char* base = place;
    if (const Operand* offset = worked::find(call.operands, "offset"))
      base = moved_back<unsigned char>(place, static_cast<int>(lane(offset->view.format, offset->image, 0)));
    if (const Operand* offsets = worked::find(call.operands, "offsets")) base = aim_elements(*offsets, place, random);
    std::memcpy(call.passed[i], &base, sizeof base);
  }
}

// --- Operands ---------------------------------------------------------------------------------------

void fill(const Operand& operand, const std::vector<Int>& corners, Random& random) {
  const bool is_float = operand.view.number == Number::half || operand.view.number == Number::single;
  fill_lanes(operand.view.format, is_float, corners, operand.image, random);
}

void set_states(Random& random) {
  processor.states.SAR = random() % 64;
  processor.states.RoundMode = random() % 4;
  processor.states.StickyFlags = random() % 32;
  processor.states.StickyEnable = random() % 32;
  processor.states.EXPSTATE = static_cast<unsigned>(random());
  processor.PRID = static_cast<int>(random());
}

// --- A row ------------------------------------------------------------------------------------------

// The processor divides for the core, and complains for it.
sigjmp_buf division;
void complain(int) { siglongjmp(division, 1); }

void make(Call& call) {
  if (sigsetjmp(division, 1) == 0) {
    call.make();
  } else {
    sum.add(1);
  }
}

std::uint64_t seed_of(const char* name) {
  Sum letters;
  letters.add(name, std::strlen(name));
  return letters.value();
}

std::uint64_t sum_of(const Row& row, int calls) {
  sum = Sum();
  Random random(seed_of(row.name));
  Call call(row, middle);
  std::vector<std::vector<Int>> corners_of;
  for (const Operand& operand : call.operands) corners_of.push_back(corners(operand.view.format));
  for (int n = 0; n < calls; ++n) {
    for (std::size_t i = 0; i < seen; i += 8) {
      const std::uint64_t bytes = random();
      std::memcpy(middle - seen / 2 + i, &bytes, sizeof bytes);
    }
    for (std::size_t i = 0; i < call.operands.size(); ++i)
      if (call.operands[i].role != Role::memory) fill(call.operands[i], corners_of[i], random);
    unsigned char* const place = middle + 4 * (static_cast<int>(random() % 128) - 64);
    aim(call, place, random);
    set_states(random);
    make(call);
    if (std::strncmp(row.prototype, "float ", 6) == 0) quieten(call.operands.back().image);
    for (const Operand& operand : call.operands) {
      if (operand.role != Role::memory) sum.add(operand.image, bytes_of(operand.view.format));
      if (operand.pointer) sum.add(static_cast<std::uint64_t>(std::int64_t{*operand.pointer - place}));
    }
    sum.add(middle - seen / 2, seen);
    sum.add(&processor.states, sizeof processor.states);
  }
  return sum.value();
}

}  // namespace

// The exit status is 77 where the processor does not run the library's target.
int main(int argc, char** argv) {
  const int calls = argc > 1 ? std::atoi(argv[1]) : 200;
  const std::string target = cstub_Km_ZNB_Orbis_R5_64k_target();
  std::printf("%s %d\n", target.c_str(), static_cast<int>(8 * sizeof(void*)));
  if (target == "none") return 77;
  mprotect(mapped, pages, PROT_READ | PROT_WRITE);
  worked::open_ports([](const char* event, unsigned value) {
    sum.add(event, std::strlen(event));
    sum.add(value);
  });
  std::signal(SIGFPE, complain);
  for (const Row& row : worked::rows()) std::printf("%s %016" PRIx64 "\n", row.name, sum_of(row, calls));
}
