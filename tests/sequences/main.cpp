// Runs random programs of intrinsics and prints a number for each, made of all registers, pointers, memory and states
// that it has touched. tools/fuzz.py compares the numbers of libraries.
//
//   kastarri_sequences run SEED FIRST COUNT            the number of each program, then how many steps and intrinsics
//   kastarri_sequences steps SEED PROGRAM [STEP...]    the number after each step; of a program of these steps alone
//   kastarri_sequences values SEED PROGRAM [STEP...]   what is in registers, memory and states at the end
//   kastarri_sequences show SEED PROGRAM [STEP...]     the program, as JSON
#include <cinttypes>
#include <cstdio>
#include <cstdlib>

#include "programs.h"

namespace {

using namespace sequences;
using What = Parameter::What;

void print_hex(const unsigned char* bytes, std::size_t size) {
  for (std::size_t i = 0; i < size; ++i) std::printf("%02x", bytes[i]);
}

std::string name_of(int reg) {
  const Type& type = vocabulary().type_of(reg);
  std::string name = type.name + "_r" + std::to_string(reg - type.first);
  for (char& c : name)
    if (c == ' ') c = '_';
  return name;
}

std::size_t size_of(int reg) { return testing_support::bytes_of(vocabulary().type_of(reg).view.format); }

void run(std::uint64_t seed, std::uint64_t first, std::uint64_t count) {
  Machine machine;
  std::size_t steps = 0;
  std::set<const Operation*> called;
  for (std::uint64_t n = first; n < first + count; ++n) {
    const Program program = program_of(seed, n);
    machine.start(program);
    for (const Step& step : program.steps) {
      machine.make(step);
      called.insert(step.operation);
    }
    steps += program.steps.size();
    std::printf("%" PRIu64 " %016" PRIx64 "\n", n, machine.sum());
    std::fflush(stdout);  // what a program crashed is the one after the last that is there
  }
  std::printf("steps %zu\n", steps);
  for (const Operation* operation : called) std::printf("called %s\n", operation->row->name);
  std::printf("of %zu\n", vocabulary().operations.size());
}

void print_steps(const Program& program) {
  Machine machine;
  machine.start(program);
  for (const Step& step : program.steps) {
    machine.make(step);
    std::printf("%d %016" PRIx64 " %s\n", step.number, machine.sum(), step.operation->row->name);
    std::fflush(stdout);
  }
}

void print_values(const Program& program) {
  Machine machine;
  machine.start(program);
  for (const Step& step : program.steps) machine.make(step);
  for (const int reg : machine.live().registers) {
    std::printf("%s ", name_of(reg).c_str());
    print_hex(machine.image(reg), size_of(reg));
    std::printf("\n");
  }
  std::printf("memory ");
  print_hex(machine.memory(), memory_bytes);
  std::printf("\n");
  for (const int pointer : machine.live().pointers) std::printf("p%d %d\n", pointer, machine.place(pointer));
  for (int i = 0; i < states; ++i) std::printf("%s %u\n", names_of_states[i], machine.state(i));
}

// --- A program as JSON --------------------------------------------------------------------------------

std::string text_of(const Parameter& parameter, const Argument& argument) {
  if (parameter.what == What::number) return std::to_string(argument.value);
  if (parameter.what == What::reg) return name_of(argument.index);
  const std::string pointer = "p" + std::to_string(argument.index);
  return parameter.what == What::moving_pointer ? "&" + pointer : pointer;
}

void show_step(const Step& step) {
  const auto& parameters = step.operation->parameters;
  const bool has_result = step.operation->row->signature.has_result;
  const std::size_t inputs = parameters.size() - has_result;
  std::printf("{\"number\": %d, \"intrinsic\": \"%s\", \"result\": \"%s\", \"is_float\": %s, \"arguments\": [",
              step.number, step.operation->row->name,
              has_result ? text_of(parameters.back(), step.arguments.back()).c_str() : "",
              has_result && parameters.back().type == "float" ? "true" : "false");
  for (std::size_t i = 0; i < inputs; ++i)
    std::printf("%s\"%s\"", i ? ", " : "", text_of(parameters[i], step.arguments[i]).c_str());
  std::printf("], \"set\": {");
  for (std::size_t i = 0; i < inputs; ++i)
    if (parameters[i].what != What::reg && step.arguments[i].is_set)
      std::printf("\"p%d\": %d", step.arguments[i].index, step.arguments[i].value);
  std::printf("}}");
}

void show(const Program& program) {
  Machine machine;
  machine.start(program);
  std::printf("{\"key\": %" PRIu64 ", \"memory\": %d,\n\"registers\": [", program.key, memory_bytes);
  const char* separator = "";
  for (const int reg : machine.live().registers) {
    std::printf("%s\n{\"name\": \"%s\", \"type\": \"%s\", \"bytes\": \"", separator, name_of(reg).c_str(),
                vocabulary().type_of(reg).name.c_str());
    print_hex(machine.image(reg), size_of(reg));
    std::printf("\"}");
    separator = ",";
  }
  std::printf("],\n\"pointers\": {");
  separator = "";
  for (const int pointer : machine.live().pointers) {
    std::printf("%s\"p%d\": \"%s\"", separator, pointer,
                vocabulary().pointers[static_cast<std::size_t>(pointer)].c_str());
    separator = ", ";
  }
  std::printf("},\n\"states\": {");
  for (int i = 0; i < states; ++i) std::printf("%s\"%s\": %u", i ? ", " : "", names_of_states[i], machine.state(i));
  std::printf("},\n\"steps\": [");
  separator = "";
  for (const Step& step : program.steps) {
    std::printf("%s\n", separator);
    show_step(step);
    separator = ",";
  }
  std::printf("]}\n");
}

}  // namespace

// The exit status is 77 where the processor does not run the library's target.
int main(int argc, char** argv) {
  const std::string what = argc > 3 ? argv[1] : "";
  const std::string target = cstub_Km_ZNB_Orbis_R5_64k_target();
  if (target == "none") return 77;
  const auto number = [argv](int i) { return std::strtoull(argv[i], nullptr, 10); };
  if (what == "run" && argc == 5) {
    std::printf("%s %d\n", target.c_str(), static_cast<int>(8 * sizeof(void*)));
    run(number(2), number(3), number(4));
    return 0;
  }
  std::set<int> kept;
  for (int i = 4; i < argc; ++i) kept.insert(std::atoi(argv[i]));
  if (what == "steps")
    print_steps(with(program_of(number(2), number(3)), kept));
  else if (what == "values")
    print_values(with(program_of(number(2), number(3)), kept));
  else if (what == "show")
    show(with(program_of(number(2), number(3)), kept));
  else
    return 2;
  return 0;
}
