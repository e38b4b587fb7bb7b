#include "support/operands.h"

#include <algorithm>

namespace testing_support {

namespace {

std::vector<Int> every_value(const Format& format) {
  std::vector<Int> values;
  for (Int v = 0; v < Int{1} << format.bits; ++v) values.push_back(as_lane(format, v));
  return values;
}

}  // namespace

std::vector<Int> corners(const Format& format) {
  if (format.bits <= 8) return every_value(format);
  std::vector<Int> values;
  for (Int v = -3; v <= 3; ++v) values.push_back(as_lane(format, v));
  for (Int v : {-70, -40, -33, -32, -31, -20, -17, -16, -15, -8, 7, 8, 15, 16, 17, 31, 32, 33, 40, 64, 70, 1000})
    values.push_back(as_lane(format, v));
  for (int k = 2; k < std::min(format.bits, 64); ++k)
    for (std::uint64_t neighbour : {std::uint64_t{1} << k, (std::uint64_t{1} << k) - 1, (std::uint64_t{1} << k) + 1})
      values.push_back(as_lane(format, static_cast<Int>(neighbour)));
  for (std::uint64_t pattern : {0x5555555555555555u, 0xAAAAAAAAAAAAAAAAu, 0x123456789ABCDEFu})
    values.push_back(as_lane(format, static_cast<Int>(pattern)));
  std::sort(values.begin(), values.end());
  values.erase(std::unique(values.begin(), values.end()), values.end());
  return values;
}

void fill_random(const Format& format, void* image, std::mt19937& random) {
  for (int i = 0; i < format.count; ++i) {
    const std::uint64_t bits = std::uint64_t{random()} << 32 | random();
    const int kept = random() & 1 ? 64 : std::min(64, format.bits / 2 + 1);
    set_lane(format, image, i, static_cast<Int>(bits >> (64 - kept)));
  }
}

OperandImages::OperandImages(std::vector<Format> formats, bool all_values)
    : formats_(std::move(formats)), images_(formats_.size()) {
  for (const Format& format : formats_) {
    values_.push_back(all_values && formats_.size() == 1 && format.bits <= 16 ? every_value(format) : corners(format));
    lanes_ = std::max(lanes_, format.count);
  }
  std::size_t pairs = values_.back().size();
  if (values_.size() > 1) pairs *= values_[values_.size() - 2].size();
  cross_rounds_ = static_cast<int>((pairs + static_cast<std::size_t>(lanes_) - 1) / static_cast<std::size_t>(lanes_));
}

Int OperandImages::corner(std::size_t operand, std::size_t number) const {
  const std::size_t last = formats_.size() - 1;
  const std::size_t index = operand == last       ? number
                            : operand + 1 == last ? number / values_[last].size()
                                                  : number * 7 + operand;
  return values_[operand][index % values_[operand].size()];
}

const Image* OperandImages::round(int n) {
  for (std::size_t operand = 0; operand < formats_.size(); ++operand) {
    const Format& format = formats_[operand];
    if (n >= cross_rounds_) {
      fill_random(format, images_[operand].bytes, random_);
      continue;
    }
    for (int i = 0; i < format.count; ++i)
      set_lane(format, images_[operand].bytes, i, corner(operand, static_cast<std::size_t>(n * lanes_ + i)));
  }
  return images_.data();
}

}  // namespace testing_support
