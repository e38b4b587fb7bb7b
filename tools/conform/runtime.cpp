// What every program of kastarri-conform begins with, behind the core's header: operands, and what becomes of results.
// Words have 32 bits and bytes 8; nothing else is asked of the compiler but the core's types and intrinsics, and
// printf.

#ifndef VALUES
#define VALUES 0  // 1: operands and results are printed, too
#endif
#ifndef ANY_ADDRESS
#define ANY_ADDRESS 0  // 1: accesses that test no address are made at any, too
#endif

// --- The case -----------------------------------------------------------------------------------------

static const char* intrinsic;
static unsigned loops, number;     // how often all immediates are gone through, and how often they were
static unsigned cases;             // calls so far
static unsigned modes, patterns;   // rounding modes and patterns of predicates, each with each, take turns
static unsigned crossed, meeting;  // lanes that go on through the corners; operands whose corners meet: 1 or 2
static unsigned operands;          // of the call so far

// How the cases go: as plainly as can be; with wide registers filled from spill images, their lanes full; with memory
// at any address.
enum { PLAIN, SPILL, ANYWHERE };
static int way = PLAIN;
static const char* const ways[] = {"", "/spill", "/any"};
static unsigned seed, hash_low, hash_high;

// An xorshift generator; the product spreads its low bits.
inline unsigned any() {
  seed ^= seed << 13;
  seed ^= seed >> 17;
  seed ^= seed << 5;
  return seed * 0x9E3779B1u;
}

// Every bit of the word reaches every bit of the hash, so that changed signs do not cancel each other.
inline void add(unsigned bits) {
  hash_low = (hash_low ^ bits) * 0x01000193u;
  hash_low ^= hash_low >> 15;
  hash_high = (hash_high + hash_low) * 0x85EBCA6Bu;
  hash_high ^= hash_high >> 13;
}

// An intrinsic's operands follow from its name alone.
inline void begin(const char* name, unsigned all_loops, unsigned all_modes, unsigned all_patterns, unsigned lanes,
                  unsigned all_meeting) {
  const char* letter;
  intrinsic = name;
  loops = all_loops;
  modes = all_modes;
  patterns = all_patterns;
  crossed = lanes;
  meeting = all_meeting;
  number = ~0u;
  cases = 0;
  hash_low = 0x811C9DC5u;
  hash_high = 0x050C5D1Fu;
  for (letter = name; *letter; ++letter) add((unsigned)*letter);
  add((unsigned)way);
  seed = hash_high | 1;
}

inline int more() { return ++number < loops; }

inline void next_call() {
  ++cases;
  operands = 0;
}

// What ends a program early leaves the lines before.
inline void end() {
  printf("%s%s %u %08x%08x\n", intrinsic, ways[way], cases, hash_high, hash_low);
  fflush(stdout);
}

// --- Lanes --------------------------------------------------------------------------------------------

static qv_vecN_2x32v staged[7], stored[11];

// At a multiple of 64 bytes, which suits every type and access: a compiler may align registers to less.
inline unsigned char* aligned(void* from) { return (unsigned char*)from + (64 - (unsigned long)from % 64) % 64; }

// Registers are filled and read here.
static unsigned char* const staging = aligned(staged);

static unsigned low, high;  // a lane of up to 64 bits

inline void negate_bits() {
  low = ~low;
  high = ~high;
}

inline void set_bit(unsigned bit) {
  low = bit < 32 ? 1u << bit : 0;
  high = bit < 32 ? 0 : 1u << (bit - 32);
}

// Numbers of corners are odd and prime: every other or every fourth lane goes through all of them, too.
enum { INTEGER, FLOAT, QUIET };
enum { INTEGER_CORNERS = 11, FLOAT_CORNERS = 17 };

inline void integer_corner(unsigned corner, unsigned bits) {
  low = high = 0;
  switch (corner) {
    case 0:
      break;
    case 1:
      low = 1;
      break;
    case 2:
      low = 2;
      break;
    case 3:
      negate_bits();
      break;
    case 4:
      low = 1;
      negate_bits();
      break;
    case 5:
      set_bit(bits - 1);
      negate_bits();
      break;  // the greatest number
    case 6:
      set_bit(bits - 1);
      low |= 1;
      negate_bits();
      break;  // and the one below
    case 7:
      set_bit(bits - 1);
      break;  // the least
    case 8:
      set_bit(bits - 1);
      low |= 1;
      break;
    case 9:
      low = high = 0x55555555u;
      break;
    default:
      set_bit(bits - 2);
      break;
  }
}

inline unsigned fraction_of(unsigned bits) { return bits == 16 ? 10 : 23; }

inline void float_corner(unsigned corner, unsigned bits) {
  const unsigned unit = 1u << fraction_of(bits), sign = 1u << (bits - 1), infinity = sign - unit;
  const unsigned one = ((sign >> 1) - 1) & ~(unit - 1);
  switch (corner) {
    case 0:
      low = 0;
      break;
    case 1:
      low = sign;
      break;
    case 2:
      low = 1;
      break;  // the subnormals' ends
    case 3:
      low = sign + unit - 1;
      break;
    case 4:
      low = unit;
      break;
    case 5:
      low = sign + unit + 1;
      break;
    case 6:
      low = one;
      break;
    case 7:
      low = sign + one;
      break;
    case 8:
      low = one + 1;
      break;
    case 9:
      low = sign + one + unit / 2;
      break;
    case 10:
      low = infinity - 1;
      break;
    case 11:
      low = sign + infinity - 1;
      break;
    case 12:
      low = infinity;
      break;
    case 13:
      low = sign + infinity;
      break;
    case 14:
      low = infinity + unit / 2 + 5;
      break;  // quiet NaNs, and one that signals
    case 15:
      low = sign + infinity + unit / 2;
      break;
    default:
      low = infinity + 9;
      break;
  }
}

// Of any magnitude, and about 1, so that sums cancel and round.
inline void any_float(unsigned bits) {
  const unsigned unit = 1u << fraction_of(bits), sign = 1u << (bits - 1), one = ((sign >> 1) - 1) & ~(unit - 1);
  low = any();
  if (low & 1) low = (low & sign) + one + (low >> 4) % 9 * unit - 4 * unit + (low & 2 ? any() % unit : 0);
}

// Full ones and such as have leading copies of their sign.
inline void any_integer() {
  unsigned shift;
  low = any();
  high = any();
  if (low & 1) {
    shift = any() % 32;
    low = (low >> shift) | (shift ? high << (32 - shift) : 0);
    high = high & 0x80000000u ? ~(~high >> shift) : high >> shift;
  }
}

// How far a lane has come in the corners of the first two operands, which meet each with each.
inline unsigned place_of(unsigned lane) { return number / (modes * patterns) * crossed + lane; }

inline int is_crossed(unsigned lane, unsigned corners) {
  return place_of(lane) < (meeting > 1 ? corners * corners : corners);
}

inline unsigned corner_of(unsigned lane, unsigned corners) {
  if (!is_crossed(lane, corners) || operands > 1) return any() % corners;
  return (operands == 0 ? place_of(lane) : place_of(lane) / corners) % corners;
}

// A signalling NaN may become quiet where the PC's floats are passed.
inline void quieten(unsigned bits) {
  const unsigned unit = 1u << fraction_of(bits), sign = 1u << (bits - 1);
  if ((low & (sign - 1)) > sign - unit) low |= unit / 2;
}

inline unsigned corners_of(int kind) { return kind == INTEGER ? INTEGER_CORNERS : FLOAT_CORNERS; }

// Into low and high: lane i of an operand.
inline void choose(unsigned lane, unsigned bits, int kind) {
  const unsigned corners = corners_of(kind);
  const int at_corner = is_crossed(lane, corners) || any() % 4 == 0;
  high = 0;
  if (kind == INTEGER) {
    if (at_corner)
      integer_corner(corner_of(lane, corners), bits);
    else
      any_integer();
  } else {
    if (at_corner)
      float_corner(corner_of(lane, corners), bits);
    else
      any_float(bits);
    if (kind == QUIET) quieten(bits);
  }
}

inline void write_bytes(unsigned char* to, unsigned bits, unsigned bytes) {
  for (; bytes; --bytes, bits >>= 8) *to++ = (unsigned char)(bits & 255);
}

inline unsigned read_bytes(const unsigned char* from, unsigned bytes) {
  unsigned bits = 0;
  while (bytes) bits = bits << 8 | from[--bytes];
  return bits;
}

inline void write_lane(unsigned char* to, unsigned bits) {
  write_bytes(to, low, bits < 32 ? bits / 8 : 4);
  if (bits > 32) write_bytes(to + 4, high, (bits - 32) / 8);
}

inline void show(const char* role, const char* name, const unsigned char* from, unsigned lanes, unsigned bits) {
  unsigned i, byte;
  if (!VALUES) return;
  printf("%s%s %u %s%s", intrinsic, ways[way], cases, role, name);
  for (i = 0; i < lanes; ++i) {
    printf(" ");
    for (byte = bits / 8; byte; --byte) printf("%02x", (unsigned)from[i * bits / 8 + byte - 1]);
  }
  printf("\n");
  fflush(stdout);
}

// Lanes of 8, 16, 24, 32, 48 or 64 bits, one after the other. Of the cases behind the corners every third has one lane
// alone that is unlike the others: what all lanes have in common is most often nothing.
inline void operand(const char* name, unsigned lanes, unsigned bits, int kind) {
  const int alike = lanes > 1 && number / (modes * patterns) % 3 == 2 && !is_crossed(0, corners_of(kind));
  const unsigned unlike = any() % lanes;
  unsigned i;
  if (alike) choose(lanes, bits, kind);
  for (i = 0; i < lanes; ++i) {
    if (!alike) choose(i, bits, kind);
    if (!alike || i != unlike) write_lane(staging + i * bits / 8, bits);
  }
  if (alike) {
    choose(lanes, bits, kind);
    write_lane(staging + unlike * bits / 8, bits);
  }
  ++operands;
  show("", name, staging, lanes, bits);
}

inline void result_at(const char* name, const unsigned char* from, unsigned lanes, unsigned bits) {
  unsigned i;
  const unsigned bytes = lanes * bits / 8;
  for (i = 0; i + 4 <= bytes; i += 4) add(read_bytes(from + i, 4));
  if (i < bytes) add(read_bytes(from + i, bytes - i));
  show("=", name, from, lanes, bits);
}

inline void result(const char* name, unsigned lanes, unsigned bits) { result_at(name, staging, lanes, bits); }

// What governs lanes: all of them, every other one, none or a half, as it comes.
inline void predicate(const char* name, unsigned bits) {
  const unsigned pattern = number / modes % patterns, odd = number / (modes * patterns) & 1;
  low = any();
  high = any();
  if (pattern == 0) low = high = ~0u;
  if (pattern == 1) low = high = odd ? 0xAAAAAAAAu : 0x55555555u;
  if (pattern == 2) set_bit(bits / 2);
  if (pattern == 2 && !odd) low = high = 0;
  if (pattern == 2 && odd) --low, high -= bits == 64 ? 1 : 0;
  write_bytes(staging, low, bits < 32 ? 2 : 4);
  write_bytes(staging + 4, high, 4);
  show("", name, staging, 1, bits);
}

// --- Scalars ------------------------------------------------------------------------------------------

inline unsigned scalar(const char* name, unsigned bits) {
  operand(name, 1, bits, INTEGER);
  return read_bytes(staging, bits < 32 ? bits / 8 : 4);
}

inline void show_number(const char* role, const char* name, unsigned value) {
  if (VALUES) printf("%s%s %u %s%s %08x\n", intrinsic, ways[way], cases, role, name, value & 0xFFFFFFFFu);
}

inline void result_number(const char* name, unsigned value) {
  add(value);
  show_number("=", name, value);
}

// An amount to shift by, a number of lanes: mostly within what has a meaning.
inline int count(const char* name) {
  const int value = (int)(any() % 76) - 6;
  show_number("", name, (unsigned)value);
  return value;
}

// A multiple of size, small enough to stay within the memory.
inline int distance(const char* name, int size) {
  const int steps = 64 / size, value = ((int)(any() % (unsigned)(2 * steps + 1)) - steps) * size;
  show_number("", name, (unsigned)value);
  return value;
}

// --- Memory -------------------------------------------------------------------------------------------

enum { MEMORY = 512, PLACE = 192 };  // bytes
static unsigned char* const memory = aligned(stored);
static unsigned char* place;  // what pointers lead to

// Integers as they come, for there are many; floats with their corners.
inline void fill_memory(unsigned bits, int kind) {
  const unsigned width = kind == INTEGER ? 32 : bits;
  unsigned i;
  for (i = 0; i < MEMORY * 8 / width; ++i) {
    if (kind == INTEGER)
      low = any();
    else
      choose(i, bits, kind);
    write_lane(memory + i * width / 8, width);
  }
  place = memory + PLACE;
  show("", "memory", memory, MEMORY * 8 / bits, bits);
}

inline void move_place(unsigned size) {
  if (way == ANYWHERE) place += any() % size;
}

inline void result_memory(unsigned bits) { result_at("memory", memory, MEMORY * 8 / bits, bits); }

inline void result_pointer(const void* pointer) {
  result_number("pointer", (unsigned)(int)((const unsigned char*)pointer - place));
}

// The elements of a gather or scatter: 256 bytes of different addresses in some order, from `first` on.
inline void offsets(const char* name, unsigned lanes, unsigned bits, unsigned size, int first) {
  const unsigned slots = 256 / size, step = any() | 1, start = any();
  unsigned i;
  for (i = 0; i < lanes; ++i) {
    low = (unsigned)first + (start + i * step) % slots * size;
    high = 0;
    write_lane(staging + i * bits / 8, bits);
  }
  show("", name, staging, lanes, bits);
}
