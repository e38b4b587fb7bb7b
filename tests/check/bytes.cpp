// Whether the bytes that kastarri-check takes a row to touch are those that it does touch. This program is loaded
// behind the checking library and plays the sanitizer: it finds fault with everything and writes down what it is told.
//
// Of every row with memory: what is written lies in the bytes that were named, and nearly all of those are; other bytes
// make no difference to what is read, and nearly every one of those that were named does.
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <set>

#include "calls.h"
#include "support/addresses.h"
#include "support/numbers.h"

namespace {

using namespace testing_support;
using worked::Operand;
using worked::Role;

constexpr int bytes = 4096, middle = bytes / 2;
alignas(64) unsigned char memory[bytes];
std::set<int> reads, writes;

void note(std::set<int>& touched, std::uintptr_t begin, std::size_t size) {
  for (std::size_t i = 0; i < size; ++i)
    if (begin + i - address_of(memory) < bytes) touched.insert(static_cast<int>(begin + i - address_of(memory)));
}

}  // namespace

extern "C" {
void* __asan_region_is_poisoned(void* begin, std::size_t) { return begin; }
void __asan_loadN_noabort(std::uintptr_t begin, std::size_t size) { note(reads, begin, size); }
void __asan_storeN_noabort(std::uintptr_t begin, std::size_t size) { note(writes, begin, size); }
}

namespace {

struct Seen {
  unsigned char memory[bytes];
  std::string operands;
};

class Row {
 public:
  explicit Row(const worked::Row& row) : row_(row), call_(row, memory + middle), random_(std::strlen(row.name)) {}

  bool has_memory() { return worked::find(call_.operands, "memory") != nullptr; }

  void check() {
    for (int round = 0; round < 40; ++round) check_once(round);
    // Of an element that is incremented the lowest byte changes, and seldom another.
    const bool increments = std::strstr(row_.name, "SCATTERINC") != nullptr;
    expect(10 * written_ >= (increments ? 2 : 9) * named_written_, "writes less than it names");
    expect(20 * read_ >= 11 * named_read_, "reads less than it names");  // 24 bits of a word, say
    expect(named_written_ + named_read_ > 0, "names no byte");
  }

  static int failures;

 private:
  void expect(bool holds, const char* what) {
    if (holds) return;
    if (!has_failed_) std::printf("%s %s\n", row_.name, what);
    failures += !has_failed_;
    has_failed_ = true;
  }

  void check_once(int round) {
    unsigned char before[bytes], other[bytes];
    for (unsigned char& byte : before) byte = static_cast<unsigned char>(random_());
    inputs_.clear();
    for (const Operand& operand : call_.operands) {
      unsigned char image[256] = {};
      const Format& format = operand.view.format;
      if (operand.role != Role::memory) fill_lanes(format, false, {0, 1, 2, -1}, image, random_);
      for (int i = 0; operand.name == "offsets" && i < format.count; ++i)
        set_lane(format, image, i, static_cast<Int>(random_() % 1000));
      if (round == 0 && format.is_predicate) std::memset(image, 0xFF, sizeof image);
      inputs_.emplace_back(reinterpret_cast<char*>(image), sizeof image);
    }
    place_ = middle + 4 * static_cast<int>(random_() % 32);

    const Seen first = made(before);
    const std::set<int> named_reads = reads, named_writes = writes;
    for (int i = 0; i < bytes; ++i) {
      const bool is_written = named_writes.count(i) != 0, changed = first.memory[i] != before[i];
      expect(is_written || !changed, "writes a byte that it does not name");
      named_written_ += is_written;
      written_ += is_written && changed;
      other[i] = is_written || named_reads.count(i) != 0 ? before[i] : static_cast<unsigned char>(~before[i]);
    }
    const Seen second = made(other);
    bool same = second.operands == first.operands;
    for (const int i : named_writes) same = same && second.memory[i] == first.memory[i];
    expect(same, "reads a byte that it does not name");

    if (named_reads.empty()) return;
    auto one = named_reads.begin();
    std::advance(one, static_cast<int>(random_() % named_reads.size()));
    std::memcpy(other, before, sizeof other);
    other[*one] = static_cast<unsigned char>(~other[*one]);
    ++named_read_;
    read_ += made(other).operands != first.operands;
  }

  // What a call does to this memory.
  Seen made(const unsigned char* before) {
    std::memcpy(memory, before, sizeof memory);
    for (std::size_t i = 0; i < call_.operands.size(); ++i)
      if (call_.operands[i].role != Role::memory)
        std::memcpy(call_.operands[i].image, inputs_[i].data(), inputs_[i].size());
    const Operand* offset = worked::find(call_.operands, "offset");
    const int step = offset ? static_cast<int>(lane(offset->view.format, offset->image, 0)) : 0;
    for (std::size_t i = 0; i < call_.operands.size(); ++i) {
      if (call_.operands[i].role != Role::memory) continue;
      unsigned char* const base = moved_back<unsigned char>(memory + place_, step);
      std::memcpy(call_.passed[i], &base, sizeof base);
    }
    reads.clear();
    writes.clear();
    call_.make();
    Seen seen;
    std::memcpy(seen.memory, memory, sizeof memory);
    for (const Operand& operand : call_.operands)
      if (operand.role != Role::memory)
        seen.operands.append(reinterpret_cast<char*>(operand.image), bytes_of(operand.view.format));
    return seen;
  }

  const worked::Row& row_;
  worked::Call call_;
  Random random_;
  std::vector<std::string> inputs_;
  int place_ = middle;
  long named_written_ = 0, written_ = 0, named_read_ = 0, read_ = 0;
  bool has_failed_ = false;
};

int Row::failures = 0;

}  // namespace

int main() {
  int rows = 0;
  for (const worked::Row& each : worked::rows()) {
    Row row(each);
    if (!row.has_memory()) continue;
    ++rows;
    row.check();
  }
  std::printf("%d rows, %d wrong\n", rows, Row::failures);
  return Row::failures != 0;
}
