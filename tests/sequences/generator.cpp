// Programs from numbers.
#include <algorithm>
#include <cstring>
#include <deque>
#include <utility>

#include "programs.h"

namespace sequences {

namespace {

using What = Parameter::What;

// Where accesses begin: all that they touch lies in the memory.
constexpr int lowest = 128, highest = 1280;

// Where a pointer is before it has been set.
constexpr int nowhere = -memory_bytes;

// Neighbouring numbers become far apart.
std::uint64_t mixed(std::uint64_t x) {
  x += 0x9E3779B97F4A7C15u;
  x = (x ^ x >> 30) * 0xBF58476D1CE4E5B9u;
  x = (x ^ x >> 27) * 0x94D049BB133111EBu;
  return x ^ x >> 31;
}

class Generator {
 public:
  explicit Generator(std::uint64_t key) : random_(key), at_(vocabulary().pointers.size(), nowhere) {}

  Program program(std::uint64_t key) {
    const int length = 5 + below(46);
    while (static_cast<int>(steps_.size()) < length) add(next());
    return {key, std::move(steps_)};
  }

 private:
  int below(int n) { return static_cast<int>(random_() % static_cast<unsigned>(n)); }
  bool by_chance() { return below(2) == 0; }

  // Three times of four one that takes what was just computed.
  const Operation& next() {
    const auto& all = vocabulary().operations;
    taken_ = -1;
    if (!recent_.empty() && below(4) > 0) {
      const int reg = recent_[static_cast<std::size_t>(below(static_cast<int>(recent_.size())))];
      const auto& takers = vocabulary().type_of(reg).takers;
      if (!takers.empty()) {
        taken_ = reg;
        return all[static_cast<std::size_t>(takers[static_cast<std::size_t>(below(static_cast<int>(takers.size())))])];
      }
    }
    return all[static_cast<std::size_t>(below(static_cast<int>(all.size())))];
  }

  void add(const Operation& operation) {
    for (const Parameter& parameter : operation.parameters)
      if (parameter.name == "offsets") mask(parameter);
    Step step = {static_cast<int>(steps_.size()), &operation, {}};
    for (const Parameter& parameter : operation.parameters) step.arguments.push_back(argument(parameter, step));
    place_in_memory(step);
    record(step);
    steps_.push_back(std::move(step));
  }

  // Offsets that a gather may take: any, masked.
  void mask(const Parameter& offsets) {
    const Type& type = vocabulary().types[static_cast<std::size_t>(offsets.index)];
    const int operation = vocabulary().masking.at(offsets.type);
    Step step = {static_cast<int>(steps_.size()), &vocabulary().operations[static_cast<std::size_t>(operation)], {}};
    for (const int number : {below(freely_used), mask_of_offsets, masked_offsets})
      step.arguments.push_back({type.first + number, 0, 0, false});
    steps_.push_back(std::move(step));
  }

  Argument argument(const Parameter& parameter, const Step& step) {
    if (parameter.what == What::number) return {0, number(), 0, false};
    if (parameter.what != What::reg) return {parameter.index, 0, 0, false};
    const Type& type = vocabulary().types[static_cast<std::size_t>(parameter.index)];
    if (parameter.name == "offsets") return {type.first + masked_offsets, 0, 0, false};
    int reg = a_register(type);
    while (parameter.is_written && is_written_by(step, reg)) reg = type.first + below(freely_used);
    return {reg, 0, 0, false};
  }

  // Most often one that has just been written. The first operand of its type is what the step was chosen for.
  int a_register(const Type& type) {
    if (taken_ >= 0 && &vocabulary().type_of(taken_) == &type) return std::exchange(taken_, -1);
    if (by_chance())
      for (const int reg : recent_)
        if (&vocabulary().type_of(reg) == &type) return reg;
    return type.first + below(freely_used);
  }

  static bool is_written_by(const Step& step, int reg) {
    for (std::size_t i = 0; i < step.arguments.size(); ++i) {
      const Parameter& parameter = step.operation->parameters[i];
      if (parameter.what == What::reg && parameter.is_written && step.arguments[i].index == reg) return true;
    }
    return false;
  }

  int number() {
    const int ranges[] = {8, 70, 1000};
    const int range = below(4);
    return range == 3 ? static_cast<int>(random_()) : below(ranges[range]) - (range == 2 ? 500 : 0);
  }

  // --- Addresses --------------------------------------------------------------------------------------

  // Half of the time near what was accessed before.
  int a_place(bool is_aligned) {
    int place = by_chance() ? last_place_ + below(129) - 64 : lowest + below(highest - lowest);
    place = std::min(std::max(place, lowest), highest);
    return is_aligned ? place & ~3 : place;
  }

  bool can_stay(int pointer, bool is_aligned) {
    const int at = at_[static_cast<std::size_t>(pointer)];
    return at >= lowest && at <= highest && (!is_aligned || at % 4 == 0) && by_chance();
  }

  // Rows that test addresses are given aligned ones.
  static bool tests_address(const Operation& operation) {
    return std::strstr(operation.row->shape, "aligned") || std::strcmp(operation.row->shape, "scalar") == 0;
  }

  void place_in_memory(Step& step) {
    Argument *pointer = nullptr, *offset = nullptr, *increment = nullptr;
    bool gathers = false, moves = false;
    for (std::size_t i = 0; i < step.arguments.size(); ++i) {
      const Parameter& parameter = step.operation->parameters[i];
      Argument& argument = step.arguments[i];
      if (parameter.name == "offset") offset = &argument;
      if (parameter.name == "increment") increment = &argument;
      if (parameter.name == "offsets") gathers = true;
      if (parameter.what == What::fixed_pointer || parameter.what == What::moving_pointer) pointer = &argument;
      moves = moves || parameter.what == What::moving_pointer;
    }
    if (!pointer) return;
    const bool is_aligned = tests_address(*step.operation);
    int& at = at_[static_cast<std::size_t>(pointer->index)];
    int place = gathers ? 64 + below(256) : a_place(is_aligned);
    if (moves) {
      if (can_stay(pointer->index, is_aligned)) place = at;
      pointer->value = place;
      increment->value = by_chance() ? 64 - 128 * below(2) : a_place(is_aligned) - place;
    } else if (offset) {
      pointer->value = at != nowhere && by_chance() ? at : place + below(513) - 256;
      offset->value = place - pointer->value;
    } else {
      pointer->value = place;
    }
    at = pointer->after = pointer->value + (moves ? increment->value : 0);
    last_place_ = place;
  }

  void record(const Step& step) {
    for (std::size_t i = 0; i < step.arguments.size(); ++i)
      if (step.operation->parameters[i].is_written) recent_.push_front(step.arguments[i].index);
    if (recent_.size() > 4) recent_.resize(4);
  }

  Random random_;
  std::vector<Step> steps_;
  std::deque<int> recent_;  // registers that were written, the last one first
  int taken_ = -1;          // the one that the step is to take
  std::vector<int> at_;     // where each pointer is
  int last_place_ = lowest;
};

}  // namespace

Program program_of(std::uint64_t seed, std::uint64_t number) {
  const std::uint64_t key = mixed(mixed(seed) + number);
  return with(Generator(key).program(key), {});
}

Program with(Program program, const std::set<int>& kept) {
  std::vector<Step> steps;
  std::vector<int> at(vocabulary().pointers.size(), nowhere);
  for (Step& step : program.steps) {
    if (!kept.empty() && kept.count(step.number) == 0) continue;
    for (std::size_t i = 0; i < step.arguments.size(); ++i) {
      const Parameter::What what = step.operation->parameters[i].what;
      if (what != What::fixed_pointer && what != What::moving_pointer) continue;
      Argument& pointer = step.arguments[i];
      int& is_at = at[static_cast<std::size_t>(pointer.index)];
      pointer.is_set = is_at != pointer.value;
      is_at = pointer.after;
    }
    steps.push_back(std::move(step));
  }
  program.steps = std::move(steps);
  return program;
}

LiveRegisters live_registers(const Program& program) {
  LiveRegisters all;
  for (const Step& step : program.steps) {
    for (std::size_t i = 0; i < step.arguments.size(); ++i) {
      const Parameter::What what = step.operation->parameters[i].what;
      if (what == What::number) continue;
      (what == What::reg ? all.registers : all.pointers).insert(step.arguments[i].index);
    }
  }
  return all;
}

}  // namespace sequences
