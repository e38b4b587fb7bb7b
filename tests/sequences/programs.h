// Random programs of intrinsics. A program's steps work on live registers: what one step yields others take, in place
// and under predicates too, and pointers walk through one memory. Nothing in a program depends on what it computes, so
// that a number gives the same program everywhere; and no step fails: addresses are aligned where a row tests them,
// offsets of gathers are masked, and what divides or needs handlers of ports is left out.
#ifndef KASTARRI_TESTS_SEQUENCES_PROGRAMS_H
#define KASTARRI_TESTS_SEQUENCES_PROGRAMS_H

#include <map>
#include <set>
#include <string>
#include <vector>

#include "calls.h"
#include "support/numbers.h"

namespace sequences {

using testing_support::Int;
using testing_support::Random;

// --- What programs are made of ----------------------------------------------------------------------

// The registers of one C++ type are numbered from `first` on.
struct Type {
  std::string name;
  worked::View view;
  int first;
  std::vector<int> takers;  // the operations that have an operand of the type
};

struct Parameter {
  enum class What { reg, number, fixed_pointer, moving_pointer };
  What what;
  std::string name;
  std::string type;  // without const and reference; with const where memory is
  int index;         // of the type, or of the pointer's
  bool is_written;
};

struct Operation {
  const worked::Row* row;
  std::vector<Parameter> parameters;  // the result as the last
};

// Of the registers of a type the first are used freely; behind them lie a mask of offsets, which nothing writes, and
// offsets that have been masked.
constexpr int freely_used = 3, mask_of_offsets = 3, masked_offsets = 4, in_a_type = 5;
constexpr Int highest_offset = 0x3FF;

struct Vocabulary {
  Vocabulary();
  const Type& type_of(int reg) const { return types[static_cast<std::size_t>(reg / in_a_type)]; }
  int registers() const { return static_cast<int>(types.size()) * in_a_type; }

  std::vector<Type> types;
  std::vector<std::string> pointers;  // what they point to
  std::vector<Operation> operations;
  std::map<std::string, int> masking;  // type of offsets -> the operation that masks them

 private:
  Parameter parameter(const std::string& text, const std::string& name, const worked::Kind& kind);
  void add(const worked::Row& row);

  std::map<std::string, int> type_numbers_, pointer_numbers_;
};
const Vocabulary& vocabulary();

// --- Programs ---------------------------------------------------------------------------------------

struct Argument {
  int index;    // of a register or a pointer
  int value;    // a number; where the pointer has to be, from the beginning of the memory
  int after;    // where a moving pointer is then
  bool is_set;  // the pointer is set first; else it is there already
};

struct Step {
  int number;  // in the program as it was made
  const Operation* operation;
  std::vector<Argument> arguments;
};

struct Program {
  std::uint64_t key;  // what its memory and registers hold first
  std::vector<Step> steps;
};

Program program_of(std::uint64_t seed, std::uint64_t number);

// Without steps that are not among the kept ones.
Program with(Program program, const std::set<int>& kept);

// --- Where they run ---------------------------------------------------------------------------------

constexpr int memory_bytes = 2048;
constexpr int states = 5;
extern const char* const names_of_states[states];

struct LiveRegisters {
  std::set<int> registers, pointers;
};
LiveRegisters live_registers(const Program& program);

class Machine {
 public:
  Machine();
  void start(const Program& program);
  void make(const Step& step);
  std::uint64_t sum() const;  // of all that the program has touched

  const unsigned char* image(int reg) const { return images_[static_cast<std::size_t>(reg)].bytes; }
  const unsigned char* memory() const { return memory_; }
  int place(int pointer) const { return static_cast<int>(pointers_[static_cast<std::size_t>(pointer)] - memory_); }
  const LiveRegisters& live() const { return live_; }
  unsigned state(int number) const;

 private:
  std::vector<testing_support::Image> images_;
  std::vector<unsigned char*> pointers_;
  std::vector<std::vector<Int>> corners_;  // of each type
  LiveRegisters live_;
  alignas(64) unsigned char memory_[memory_bytes];
};

}  // namespace sequences

#endif
