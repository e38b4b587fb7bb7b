// The integers of the host that registers are made of: HOST(name in symbols, type, register type) of each of them.
// Who includes this says what HOST is.
#ifndef KASTARRI_FRAME_HOST_INTS_H
#define KASTARRI_FRAME_HOST_INTS_H

#define HOST_INTS(TO)              \
  HOST(int8, signed char, TO)      \
  HOST(uint8, unsigned char, TO)   \
  HOST(int16, short, TO)           \
  HOST(uint16, unsigned short, TO) \
  HOST(int32, int, TO)             \
  HOST(uint32, unsigned int, TO)

#endif
