// Programs, run.
#include "memory.h"
#include "programs.h"
#include "support/sum.h"

namespace sequences {

namespace {

using What = Parameter::What;
using worked::Number;

auto& state_block = cstub_Km_ZNB_Orbis_R5_64k_proc.states;
unsigned* const states_used[states] = {&state_block.SAR, &state_block.RoundMode, &state_block.StickyFlags,
                                       &state_block.StickyEnable, &state_block.EXPSTATE};

constexpr std::size_t most_arguments = 12;

void fill_offsets(const testing_support::Format& format, unsigned char* image, bool is_mask, Random& random) {
  for (int i = 0; i < format.count; ++i)
    testing_support::set_lane(format, image, i,
                              is_mask ? highest_offset : static_cast<Int>(random() % (highest_offset + 1)));
}

}  // namespace

const char* const names_of_states[states] = {"SAR", "RoundMode", "StickyFlags", "StickyEnable", "EXPSTATE"};

unsigned Machine::state(int number) const { return *states_used[number]; }

Machine::Machine()
    : images_(static_cast<std::size_t>(vocabulary().registers())), pointers_(vocabulary().pointers.size()) {
  for (const Type& type : vocabulary().types) corners_.push_back(testing_support::corners(type.view.format));
}

// What a register holds depends on its own number only, not on which others there are.
void Machine::start(const Program& program) {
  live_ = live_registers(program);
  fill(memory_, sizeof memory_, program.key);
  for (const int reg : live_.registers) {
    const Type& type = vocabulary().type_of(reg);
    const testing_support::Format& format = type.view.format;
    unsigned char* const bytes = images_[static_cast<std::size_t>(reg)].bytes;
    Random random(program.key + static_cast<unsigned>(reg));
    const bool is_float = type.view.number == Number::half || type.view.number == Number::single;
    if (reg - type.first >= freely_used)
      fill_offsets(format, bytes, reg - type.first == mask_of_offsets, random);
    else
      fill_lanes(format, is_float, corners_[static_cast<std::size_t>(reg / in_a_type)], bytes, random);
    if (type.name == "float") testing_support::quieten(bytes);
  }
  for (const int pointer : live_.pointers) pointers_[static_cast<std::size_t>(pointer)] = memory_;
  Random random(program.key);
  const unsigned limits[states] = {64, 4, 32, 32, 0xFFFF};
  for (int i = 0; i < states; ++i) *states_used[i] = static_cast<unsigned>(random() % limits[i]);
}

void Machine::make(const Step& step) {
  unsigned char* images[most_arguments] = {};
  int numbers[most_arguments];
  for (std::size_t i = 0; i < step.arguments.size(); ++i) {
    const Argument& argument = step.arguments[i];
    switch (step.operation->parameters[i].what) {
      case What::reg:
        images[i] = images_[static_cast<std::size_t>(argument.index)].bytes;
        break;
      case What::number:
        numbers[i] = argument.value;
        images[i] = reinterpret_cast<unsigned char*>(&numbers[i]);
        break;
      default: {
        unsigned char*& pointer = pointers_[static_cast<std::size_t>(argument.index)];
        if (argument.is_set) pointer = memory_ + argument.value;
        images[i] = reinterpret_cast<unsigned char*>(&pointer);
      }
    }
  }
  const worked::Row& row = *step.operation->row;
  row.signature.call(row.function, images);
  const bool gives_float = row.signature.has_result && step.operation->parameters.back().type == "float";
  if (gives_float) testing_support::quieten(images[step.arguments.size() - 1]);
}

std::uint64_t Machine::sum() const {
  testing_support::Sum sum;
  for (const int reg : live_.registers)
    sum.add(image(reg), testing_support::bytes_of(vocabulary().type_of(reg).view.format));
  for (const int pointer : live_.pointers) sum.add(static_cast<std::uint64_t>(std::int64_t{place(pointer)}));
  sum.add(memory_, sizeof memory_);
  for (const unsigned* state : states_used) sum.add(*state);
  return sum.value();
}

}  // namespace sequences
