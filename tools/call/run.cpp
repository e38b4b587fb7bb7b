// Calls one intrinsic for kastarri-call, which knows types and reads what people write.
//
//   run NAME FORM BITS [STATE=VALUE ...] -- OPERAND ...
//
// FORM and the BITS of its fraction are those of kastarri/print.h. There is an operand for each parameter, and one for
// the result: KIND:BITS:LANES:IMAGE, as in kastarri/lanes.h and the bytes of the value, lowest first, in hexadecimal.
// What a call gives is printed by names; of memory, states and ports what it changes.
#include <cstdio>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <vector>

#include "calls.h"
#include "kastarri/print.h"
#include "kastarri/state.h"

namespace {

using kastarri::print_detail::Register;
using worked::Call;
using worked::Operand;
using worked::Role;

// Of what is at the address that a call accesses; offsets of elements may lead anywhere in it.
constexpr int before = 4096, behind = 1 << 17;
alignas(64) unsigned char memory[before + behind];

struct Value {
  Register as;  // how it is read; the bytes are the operand's
  std::vector<unsigned char> image;
};

Value value_of(const std::string& text) {
  Value value = {};
  int end = 0;
  if (std::sscanf(text.c_str(), "%c:%d:%d:%n", &value.as.kind, &value.as.bits, &value.as.count, &end) != 3)
    throw std::runtime_error("not an operand: " + text);
  for (std::size_t i = static_cast<std::size_t>(end); i + 1 < text.size(); i += 2)
    value.image.push_back(static_cast<unsigned char>(std::stoi(text.substr(i, 2), nullptr, 16)));
  value.as.size = static_cast<int>(value.image.size());
  return value;
}

auto& states = cstub_Km_ZNB_Orbis_R5_64k_proc.states;
struct State {
  const char* name;
  unsigned& word;
};
const State shown_states[] = {{"SAR", states.SAR},
                              {"EXPSTATE", states.EXPSTATE},
                              {"RoundMode", states.RoundMode},
                              {"StickyFlags", states.StickyFlags},
                              {"StickyEnable", states.StickyEnable}};

void set_state(const std::string& setting) {
  const std::size_t equals = setting.find('=');
  for (const State& state : shown_states)
    if (setting.substr(0, equals) == state.name)
      state.word = static_cast<unsigned>(std::stoul(setting.substr(equals + 1), nullptr, 0));
}

const worked::Row& row_named(const std::string& name) {
  for (const worked::Row& row : worked::rows())
    if (name == row.name) return row;
  throw std::runtime_error("no intrinsic is called " + name);
}

// Lets the pointer lead to where memory lies, less the offset that the call adds.
void aim(Call& call) {
  const Operand* offset = worked::find(call.operands, "offset");
  int distance = 0;
  if (offset) std::memcpy(&distance, offset->image, sizeof distance);
  for (std::size_t i = 0; i < call.operands.size(); ++i) {
    if (call.operands[i].role != Role::memory) continue;
    const auto base = reinterpret_cast<std::uintptr_t>(memory + before) - static_cast<std::uintptr_t>(distance);
    std::memcpy(call.passed[i], &base, sizeof base);
  }
}

// Elements have to be where there is memory.
void expect_elements(const Call& call, const std::vector<Value>& values) {
  for (std::size_t i = 0; i < values.size(); ++i) {
    const Operand& operand = call.operands[i];
    for (int k = 0; operand.name == "offsets" && k < operand.view.format.count; ++k) {
      const auto lane = testing_support::lane(operand.view.format, operand.image, k);
      const auto offset = operand.view.format.bits == 32 ? static_cast<std::int32_t>(lane) : lane;
      if (offset < -before || offset > behind - 8)
        throw std::runtime_error("offset " + std::to_string(offset) + " is not from -4096 to 131064");
    }
  }
}

void show(const Operand& operand, const Value& value, kastarri::Form form) {
  const bool is_result = operand.name == "result";
  if (operand.role == Role::input && !is_result) return;
  Register shown = value.as;
  shown.bytes = operand.image;
  const bool changed = std::memcmp(operand.image, value.image.data(), value.image.size()) != 0;
  if (operand.role != Role::memory || changed)
    std::printf("%s = %s\n", operand.name.c_str(), kastarri::print_detail::text_of(shown, form).c_str());
  if (operand.pointer) std::printf("the pointer moves by %td bytes\n", *operand.pointer - operand.image);
}

void run(const std::vector<std::string>& arguments) {
  if (arguments.size() < 3) throw std::runtime_error("for kastarri-call alone");
  const kastarri::Form form = {static_cast<kastarri::Form::Kind>(std::stoi(arguments[1])), std::stoi(arguments[2])};
  std::size_t next = 3;
  while (next < arguments.size() && arguments[next] != "--") set_state(arguments[next++]);

  Call call(row_named(arguments[0]), memory + before);
  std::vector<Value> values;
  for (const Operand& operand : call.operands) {
    if (++next >= arguments.size()) throw std::runtime_error("operands are missing");
    values.push_back(value_of(arguments[next]));
    std::memcpy(operand.image, values.back().image.data(), values.back().image.size());
  }
  aim(call);
  expect_elements(call, values);
  std::vector<unsigned> were;
  for (const State& state : shown_states) were.push_back(state.word);
  call.make();
  for (std::size_t i = 0; i < values.size(); ++i) show(call.operands[i], values[i], form);
  for (std::size_t i = 0; i < were.size(); ++i)
    if (shown_states[i].word != were[i]) std::printf("%s = %u\n", shown_states[i].name, shown_states[i].word);
}

}  // namespace

int main(int argc, char** argv) {
  std::setvbuf(stdout, nullptr, _IOLBF, BUFSIZ);
  worked::open_ports([](const char* event, unsigned value) { std::printf("%s %u\n", event, value); });
  try {
    run({argv + 1, argv + argc});
  } catch (const std::exception& error) {
    std::fprintf(stderr, "%s\n", error.what());
    return 2;
  }
}
