// The constants of CONST: numbers that a program would otherwise load from memory, each rounded to nearest in both
// formats.
#ifndef KASTARRI_TABLES_FLOAT_CONSTANTS_H
#define KASTARRI_TABLES_FLOAT_CONSTANTS_H

#include <cstdint>

namespace {

struct FloatConstant {
  std::uint16_t half;
  std::uint32_t single;
};

constexpr FloatConstant float_constants[16] = {
    {0x0000, 0x00000000},  // 0
    {0x3C00, 0x3F800000},  // 1
    {0x4000, 0x40000000},  // 2
    {0x3800, 0x3F000000},  // 0.5
    {0x4200, 0x40400000},  // 3
    {0x4400, 0x40800000},  // 4
    {0x3400, 0x3E800000},  // 0.25
    {0x4900, 0x41200000},  // 10
    {0x2E66, 0x3DCCCCCD},  // 0.1
    {0x4248, 0x40490FDB},  // pi
    {0x3E48, 0x3FC90FDB},  // pi / 2
    {0x3518, 0x3EA2F983},  // 1 / pi
    {0x4170, 0x402DF854},  // e
    {0x398C, 0x3F317218},  // ln 2
    {0x3DC5, 0x3FB8AA3B},  // log2 e
    {0x3DA8, 0x3FB504F3},  // sqrt 2
};

}  // namespace

#endif
