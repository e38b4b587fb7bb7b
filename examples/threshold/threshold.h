// A photograph parted into dark and light at a level, twice: for the core and in plain C++.
#ifndef KASTARRI_EXAMPLES_THRESHOLD_H
#define KASTARRI_EXAMPLES_THRESHOLD_H

#include <cstdint>

// Pixels are read and written in whole registers: buffers have room for this many more.
constexpr int THRESHOLD_MARGIN = 63;

struct Part {
  std::uint64_t pixels = 0;
  std::uint64_t sum = 0;  // of their values
};

// How many pixels are above the level, and what they add up to. A level of -1 takes them all.
Part lighter(const std::uint8_t* pixels, int count, int level);
Part lighter_reference(const std::uint8_t* pixels, int count, int level);

// Moves pixels above the level towards white and the others towards black: by the whole way at shift 0,
// by half of it at shift 1, by a quarter at shift 2 and so on.
void part(const std::uint8_t* pixels, std::uint8_t* parted, int count, int level, int shift);
void part_reference(const std::uint8_t* pixels, std::uint8_t* parted, int count, int level, int shift);

#endif
