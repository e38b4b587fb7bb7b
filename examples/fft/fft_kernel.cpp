// The transform as a kernel for the core: 16 pairs of numbers at a time.
//
// A register holds 16 complex numbers, and a stage pairs registers that lie 1, 2, 4, ... registers apart. So the first
// four stages want number n of 16 transforms in one register, and the last six want a transform's numbers beside one
// another. Gathers put them so, before the first stage and before the fifth:
//
//   x, as it comes -> 4 blocks of 16 registers: register r of a block has number r of 16 transforms of 16 numbers
//                  -> 64 registers in a row: transform t has register t
#include <kastarri.h>
#include <kastarri/names.h>

#include "fft/fft.h"

namespace {

constexpr int LANES = 16;  // complex numbers in a register
constexpr int REGISTERS = FFT_SIZE / LANES;
constexpr int NUMBER = 2 * sizeof(short);  // bytes

constexpr int REVERSED_4[16] = {0, 8, 4, 12, 2, 10, 6, 14, 1, 9, 5, 13, 3, 11, 7, 15};
constexpr int REVERSED_2[4] = {0, 2, 1, 3};

// Lane i of 32 bits is i * step bytes, or with the bits of i reversed.
qv_vecN_2x32Uv offsets(int step, bool reversed = false) {
  alignas(64) unsigned bytes[LANES];
  for (int i = 0; i < LANES; ++i) bytes[i] = static_cast<unsigned>((reversed ? REVERSED_4[i] : i) * step);
  return ZRA_LVN_2X32U_I(reinterpret_cast<const qv_vecN_2x32Uv*>(bytes), 0);
}

// Complex numbers, which a gather takes as elements of 32 bits.
qv_vecNx16 gathered(const short* from, const qv_vecN_2x32Uv& at) {
  return ZRA_GATHERDNX16(ZRA_GATHERAN_2X32(reinterpret_cast<const int*>(from), at));
}

// The largest part so far, lane by lane.
class Peak {
 public:
  void see(const qv_vecNx16& v) {
    alignas(64) const qv_vecNx16 size = ZRA_ABSSNX16(v);
    // A store writes the register at once, where an assignment would copy it in pieces.
    ZRA_SVNX16_I(ZRA_MAXNX16(largest_, size), &largest_, 0);
  }
  int part() const { return static_cast<short>(ZRA_RMAXNX16(largest_)._[0]); }

 private:
  alignas(64) qv_vecNx16 largest_ = 0;
};

// Sums and differences of registers that lie `span` apart. The k-th of a span is turned by turns[k * 512 / span] and
// on, lanes at the given offsets.
Peak stage(qv_vecNx16* x, int span, const short* turns, const qv_vecN_2x32Uv& turn_offsets, int shift) {
  Peak peak;
  alignas(64) const qv_vecNx16 shifts = static_cast<short>(shift);
  for (int k = 0; k < span; ++k) {
    alignas(64) const qv_vecNx16 w = gathered(turns + 2 * (k * (FFT_SIZE / 2 / span)), turn_offsets);
    for (qv_vecNx16* a = x + k; a < x + REGISTERS; a += 2 * span) {
      qv_vecNx16* const b = a + span;
      alignas(64) const qv_vecNx48 product = ZRA_MULNX16C(*b, w);
      alignas(64) const qv_vecNx16 turned = ZRA_PACKVRNX48(product, TURN_BITS + shift);
      alignas(64) const qv_vecNx16 scaled = ZRA_SRANX16(*a, shifts);
      alignas(64) const qv_vecNx16 sum = ZRA_ADDSNX16(scaled, turned);
      alignas(64) const qv_vecNx16 difference = ZRA_SUBSNX16(scaled, turned);
      ZRA_SVNX16_I(sum, a, 0);
      ZRA_SVNX16_I(difference, b, 0);
      peak.see(sum);
      peak.see(difference);
    }
  }
  return peak;
}

}  // namespace

int fft(const short* x, const short* turns, short* y) {
  alignas(64) qv_vecNx16 blocks[REGISTERS];
  auto* const rows = reinterpret_cast<qv_vecNx16*>(y);
  int exponent = 0;
  Peak peak;

  // The place of a number has the bits of its own reversed, four for the register, four for the lane, two for the
  // block.
  alignas(64) const qv_vecN_2x32Uv reversed = offsets(4 * NUMBER, true);
  for (int r = 0; r < REGISTERS; ++r) {
    const int first = 64 * REVERSED_4[r % 16] + REVERSED_2[r / 16];
    alignas(64) const qv_vecNx16 numbers = gathered(x + 2 * first, reversed);
    ZRA_SVNX16_I(numbers, blocks + r, 0);
    peak.see(numbers);
  }
  alignas(64) const qv_vecN_2x32Uv same = offsets(0);
  for (int span = 1; span < 16; span *= 2) {
    const int shift = block_shift(peak.part());
    exponent += shift;
    peak = stage(blocks, span, turns, same, shift);
  }

  alignas(64) const qv_vecN_2x32Uv across = offsets(sizeof(qv_vecNx16));
  for (int t = 0; t < REGISTERS; ++t)
    ZRA_SVNX16_I(gathered(reinterpret_cast<const short*>(blocks + t / 16 * 16) + 2 * (t % 16), across), rows + t, 0);
  for (int span = 1; span < REGISTERS; span *= 2) {
    const int shift = block_shift(peak.part());
    exponent += shift;
    peak = stage(rows, span, turns, offsets(FFT_SIZE / 2 / LANES / span * NUMBER), shift);
  }
  return exponent;
}
