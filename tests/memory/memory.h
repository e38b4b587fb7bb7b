// Memory that an access can be caught in: the pages around it may not be touched.
#ifndef KASTARRI_TESTS_MEMORY_H
#define KASTARRI_TESTS_MEMORY_H

#include <random>
#include <vector>

#include "kastarri/gather.h"
#include "kastarri/memory.h"
#include "memory/row_kinds.h"
#include "support/addresses.h"
#include "support/drivers.h"

namespace testing_support {

// A child process shares it, so that one sees what the child did before it ended.
class Memory {
 public:
  static constexpr unsigned page = 4096;

  explicit Memory(unsigned pages = 1) : size_(pages * page), all_(new_pages(size_ + 2 * page)) {
    mprotect(begin(), size_, PROT_READ | PROT_WRITE);
  }
  Memory(const Memory&) = delete;
  ~Memory() { munmap(all_, size_ + 2 * page); }

  unsigned size() const { return size_; }
  unsigned char* begin() const { return all_ + page; }
  unsigned char* end() const { return begin() + size_; }
  unsigned char* forbidden() const { return all_ + page / 2; }

  void fill(std::mt19937& random) {
    for (unsigned i = 0; i < size_; ++i) begin()[i] = static_cast<unsigned char>(random() >> 7);
  }
  std::vector<unsigned char> copy() const { return {begin(), end()}; }
  void expect(const std::vector<unsigned char>& expected, const std::string& name) const {
    for (unsigned i = 0; i < size_; ++i)
      ASSERT_EQ(int{begin()[i]}, int{expected[i]})
          << name << " [" << cstub_Km_ZNB_Orbis_R5_64k_target() << "] byte " << i;
  }

 private:
  unsigned size_;
  unsigned char* all_;
};

// Predicates of all zeros, all ones, then random bits.
template <class P>
P predicate(int n, std::mt19937& random) {
  P p = filled<P>(n % 6 == 0 ? 0 : 0xFF);
  if (n % 6 > 1) fill_random<layout_of<P>>(p._, random);
  return p;
}

}  // namespace testing_support

#endif
