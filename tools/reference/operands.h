// Operands of the worked examples: their values, chosen so that a reader sees what an intrinsic does, and
// their text.
#ifndef KASTARRI_TOOLS_REFERENCE_OPERANDS_H
#define KASTARRI_TOOLS_REFERENCE_OPERANDS_H

#include <string>

#include "support/registers.h"

namespace worked {

// What a lane stands for.
enum class Number { integer, half, single, boolean, bits };

struct View {
  testing_support::Format format;
  Number number;
};

enum class Role { input, output, memory };

struct Operand {
  View view;
  Role role;
  unsigned char* image;               // its value; of memory, what is accessed first
  unsigned char** pointer = nullptr;  // the pointer that an access moves
  std::string name = "";              // the parameter's
  std::string values = "";            // whose values it takes: most often those of its name
  int step = 1;                       // what they are multiplied by
};

// Lanes repeat after so many, and one call is made for each of them where all operands have one lane.
constexpr int columns = 8;

// Writes the operand's values: every lane, or in a single lane that of the column.
void fill(const Operand& operand, int column);

// As many lanes as there are columns, from the first on, separated by spaces.
std::string text(const View& view, const void* image, int first = 0);

}  // namespace worked

#endif
