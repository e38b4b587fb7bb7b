// Every pack, by its name, on exact integers. Hosts have floating-point states of their own, which packs leave alone,
// for SSE2 shifts lanes by floating-point arithmetic.
#include <algorithm>

#include "multiply/drivers.h"
#include "support/host_state.h"

namespace testing_support {

// floor(a / 2^n)
constexpr Int floor_shift(Int a, int n) {
  const Int d = Int{1} << n;
  return a / d - (a % d < 0);
}

class PackModel {
 public:
  explicit PackModel(const std::string& op) {
    letter_ = op[4];
    lanes_of_24_ = op.find("2NX24") != std::string::npos;
    rounds_ = op.find("NR2NX") == std::string::npos && op.find("NRN") == std::string::npos;
    to_unsigned_ = op.find("U2NX") != std::string::npos;
    half_ = op.find("_0") != std::string::npos ? 0 : op.find("_1") != std::string::npos ? 1 : -1;
  }

  int source(int i) const { return half_ < 0 ? i : 2 * i + half_; }

  // What a result of `bits` bits gets of the lane.
  Int packed(Int acc, Int count, int bits) const {
    switch (letter_) {
      case 'L':
        return half_ < 0 ? acc : acc & 0xFF;
      case 'M':
        return floor_shift(acc, 16);
      case 'H':
        return floor_shift(acc, 32);
      case 'Q':
        return floor_shift(2 * (acc & 0xFFFFFFFF) + 0x8000, 16);
      case 'P':
        return floor_shift((acc & 0xFFFFFFFF) + 0x200, 10);
      default:
        return shifted(acc, count, bits);
    }
  }

 private:
  Int shifted(Int acc, Int count, int bits) const {
    const Int bound = lanes_of_24_ ? 23 : 32;
    const int s = static_cast<int>(count < 0 || count > bound ? bound : count);
    // Half up is one up when the remainder is half of 2^s or more.
    Int value = floor_shift(acc, s);
    const Int remainder = static_cast<Int>(static_cast<Bits>(acc) - static_cast<Bits>(value) * (Bits{1} << s));
    if (rounds_ && s > 0 && 2 * remainder >= Int{1} << s) ++value;
    const Int range = Int{1} << (bits - !to_unsigned_);
    return std::clamp<Int>(value, to_unsigned_ ? 0 : -range, range - 1);
  }

  char letter_;
  bool lanes_of_24_, rounds_, to_unsigned_;
  int half_;
};

// Calls with the registers of every round; call(accumulator, round's count lanes) gives the result.
template <class R, class W, class Counts, class Call, class CountOf>
void drive_pack(const std::string& op, Call call, CountOf count_of) {
  using L = layout_of<R>;
  const PackModel model(op);
  Operands<layout_of<W>, Counts> operands;
  std::mt19937 random(seed);
  for (int n = 0; n < operands.rounds(); ++n) {
    const auto* images = operands.round(n);
    W acc = as_register<W>(images[0].bytes);
    Int expected[L::count];
    for (int i = 0; i < L::count; ++i)
      expected[i] = model.packed(lane<layout_of<W>>(acc._, model.source(i)), count_of(images[1].bytes, i), L::bits);
    dirty<layout_of<W>>(acc._, random);
    const HostState host(static_cast<unsigned>(n));
    const R result = call(acc, images[1].bytes);
    host.expect_unchanged(op);
    expect_lanes<L>(op, n, expected, result, [&](int i) {
      return std::to_string(lane<layout_of<W>>(acc._, model.source(i))) + " by " +
             std::to_string(count_of(images[1].bytes, i));
    });
    if (testing::Test::HasFatalFailure()) return;
  }
}

template <class R, class W>
void drive_pack(const std::string& op, R (*f)(const W&)) {
  drive_pack<R, W, i8x1>(
      op, [f](const W& acc, const void*) { return f(acc); }, [](const void*, int) { return Int{0}; });
}
template <class R, class W, class Counts>
void drive_pack(const std::string& op, R (*f)(const W&, const Counts&)) {
  drive_pack<R, W, layout_of<Counts>>(
      op, [f](const W& acc, const void* counts) { return f(acc, as_register<Counts>(counts)); },
      [](const void* counts, int i) { return lane<layout_of<Counts>>(counts, i); });
}
// One count for all lanes: lane 0 of the counts, a small one in most rounds.
template <class R, class W, class Count, class = std::enable_if_t<std::is_integral_v<Count>>>
void drive_pack(const std::string& op, R (*f)(const W&, Count)) {
  const auto count_of = [](const void* counts, int) {
    const Int count = lane<i32x1>(counts, 0);
    return count % 3 == 0 ? count : (count % 40 + 40) % 40;
  };
  drive_pack<R, W, i32x1>(
      op, [&](const W& acc, const void* counts) { return f(acc, static_cast<Count>(count_of(counts, 0))); }, count_of);
}

}  // namespace testing_support

#define ENTRY(SYMBOL, SHAPE, ...)                                                                         \
  const int tested_##SYMBOL = testing_support::add_test("pack", testing_support::operation(#SYMBOL), [] { \
    testing_support::drive_pack(testing_support::operation(#SYMBOL), &KASTARRI_SYMBOL(SYMBOL));           \
  });

namespace {

#include "frame/rows.h"

#include "multiply/pack.def"

}  // namespace

#include "frame/rows_end.h"
