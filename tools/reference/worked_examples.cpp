// Calls every intrinsic once on fixed operands and prints, as JSON, what went in and what came out. Where every
// operand has one lane there is a call for each column of values.
#include <cstdio>
#include <utility>
#include <vector>

#include "calls.h"
#include "kastarri/state.h"

namespace worked {

namespace {

using testing_support::Format;

auto& processor = cstub_Km_ZNB_Orbis_R5_64k_proc;

// --- What is shown ----------------------------------------------------------------------------------

// Names with the texts that calls gave them, in the order in which they came up.
class Table {
 public:
  void add(const std::string& name, const std::string& text) {
    for (auto& [known, texts] : rows_) {
      if (known == name) {
        texts += " " + text;
        return;
      }
    }
    rows_.emplace_back(name, text);
  }
  std::string json() const {
    std::string all;
    for (const auto& [name, texts] : rows_) all += (all.empty() ? "[\"" : ", [\"") + name + "\", \"" + texts + "\"]";
    return "[" + all + "]";
  }

 private:
  std::vector<std::pair<std::string, std::string>> rows_;
};

// The state that intrinsics read and change, as it is before every call.
struct State {
  const char* name;
  unsigned& value;
  unsigned initial;
};
const State states[] = {
    {"SAR", processor.states.SAR, 8},
    {"EXPSTATE", processor.states.EXPSTATE, 0xA0},
    {"RoundMode", processor.states.RoundMode, 0},
    {"StickyFlags", processor.states.StickyFlags, 0},
    {"StickyEnable", processor.states.StickyEnable, 0},
};
constexpr int processor_number = 5;

// What the ports did during a call.
Table* events;

// What pointers point to: aligned, with room before and behind.
constexpr int base = 128;
alignas(64) unsigned char memory[512];

// --- A row ------------------------------------------------------------------------------------------

bool is_vector(const Operand& operand) { return operand.view.format.count > 1; }

// Of memory the elements from the address on are shown, as many as there are columns.
void see_elements(Operand& place) {
  if (!is_vector(place)) place.view.format.count = columns;
}

void place_in_memory(Call& call) {
  Operand* place = find(call.operands, "memory");
  if (!place) return;
  const bool loads = call.signature.has_result || find(call.operands, "r");
  const int size = place->view.format.container_bytes;
  see_elements(*place);
  place->values = loads ? "a" : "old";
  if (find(call.operands, "offset")) place->image += 64;
  if (Operand* offsets = find(call.operands, "offsets")) {
    offsets->step = size;
    if (loads) place->values = "elements";
  }
}

// A register of plain bits is shown in units as wide as the other lanes.
void see_units(Call& call) {
  bool has_words = false;
  for (const Operand& operand : call.operands)
    has_words |= operand.view.format.bits == 32 && operand.view.number != Number::bits;
  for (Operand& operand : call.operands) {
    Format& format = operand.view.format;
    const bool is_gathered = operand.view.number == Number::bits && format.count == 16 && call.operands.size() > 1;
    if (is_gathered && !has_words) format = {16, 2, 32, false, false};
  }
}

void set_states() {
  for (const State& state : states) state.value = state.initial;
  processor.PRID = processor_number;
}

std::vector<unsigned> values_of_states() {
  std::vector<unsigned> values;
  for (const State& state : states) values.push_back(state.value);
  return values;
}

void fill_operands(Call& call, int column) {
  for (Operand& operand : call.operands) {
    if (operand.pointer) *operand.pointer = operand.image;
    if (operand.name != "result") fill(operand, column);
  }
}

std::vector<std::string> images(const Call& call) {
  std::vector<std::string> all;
  for (const Operand& operand : call.operands) {
    const Format& format = operand.view.format;
    all.emplace_back(
        reinterpret_cast<const char*>(operand.image),
        static_cast<std::size_t>(format.is_predicate ? (format.count + 7) / 8 : format.count * format.container_bytes));
  }
  return all;
}

// The first of the lanes to show: that of the first column, unless only lanes behind the columns changed.
int first_lane(const Operand& operand, const std::string& before) {
  const Format& format = operand.view.format;
  for (int i = 0; i < format.count; ++i)
    if (testing_support::lane(format, before.data(), i) != testing_support::lane(format, operand.image, i))
      return i / columns * columns;
  return 0;
}

void add_output(Table& out, const Operand& operand, const std::string& before) {
  const bool is_result = operand.name == "result";
  if (operand.role == Role::input && !is_result) return;
  const int first = is_result ? 0 : first_lane(operand, before);
  const std::string suffix = first ? "@" + std::to_string(first) : "";
  out.add(operand.name + suffix, text(operand.view, operand.image, first));
  if (operand.pointer) out.add("pointer", "+" + std::to_string(*operand.pointer - operand.image));
}

void add_changed_states(Table& out, const std::vector<std::vector<unsigned>>& after) {
  for (std::size_t i = 0; i < std::size(states); ++i) {
    bool changed = false;
    for (const auto& values : after) changed |= values[i] != states[i].initial;
    for (const auto& values : after)
      if (changed) out.add(states[i].name, std::to_string(values[i]));
  }
}

// A single lane among vectors takes the value of this column: a middling one.
constexpr int middle_column = 2;

int calls_of(const Call& call, int most) {
  const std::size_t inputs = call.operands.size() - call.signature.has_result;
  for (const Operand& operand : call.operands)
    if (is_vector(operand)) return 1;
  return inputs > 0 ? most : 1;
}

std::string example_of(const Row& row) {
  Call call(row, memory + base);
  place_in_memory(call);
  see_units(call);
  const int calls = calls_of(call, row.most_calls);
  Table in, out;
  std::vector<std::vector<unsigned>> states_after;
  events = &out;
  for (int n = 0; n < calls; ++n) {
    set_states();
    fill_operands(call, calls == 1 ? middle_column : n);
    const std::vector<std::string> before = images(call);
    for (const Operand& operand : call.operands)
      if (operand.name != "result") in.add(operand.name, text(operand.view, operand.image));
    call.make();
    for (std::size_t i = 0; i < before.size(); ++i) add_output(out, call.operands[i], before[i]);
    states_after.push_back(values_of_states());
  }
  add_changed_states(out, states_after);
  return "{\"calls\": " + std::to_string(calls) + ", \"in\": " + in.json() + ", \"out\": " + out.json() + "}";
}

}  // namespace

}  // namespace worked

int main() {
  worked::open_ports([](const char* event, unsigned value) { worked::events->add(event, std::to_string(value)); });
  std::printf("{\"initial\": {");
  for (const auto& state : worked::states) std::printf("\"%s\": %u, ", state.name, state.initial);
  std::printf("\"PRID\": %d},\n\"examples\": {\n", worked::processor_number);
  for (const worked::Row& row : worked::rows())
    std::printf("\"%s\": %s%s\n", row.name, worked::example_of(row).c_str(), &row == &worked::rows().back() ? "" : ",");
  std::printf("}}\n");
}
