// Loads and stores of the scalar core.
#include <cstring>

#include "frame/entry.h"
#include "frame/failure.h"
#include "frame/memory.h"

namespace {

// The memory may hold objects of any type.
template <class T>
const void* aligned(const T* base, int offset) {
  const T* const accessed = address(base, offset);
  const auto number = reinterpret_cast<std::uintptr_t>(accessed);
  if (number % sizeof(T) != 0) kastarri::not_aligned(number);
  return accessed;
}

template <class T>
T load(const T* base, int offset) {
  T value;
  std::memcpy(&value, aligned(base, offset), sizeof value);
  return value;
}

template <class T, class Value>
void store(Value from, const T* base, int offset) {
  const T value = static_cast<T>(from);
  std::memcpy(writable(aligned(base, offset)), &value, sizeof value);
}

}  // namespace

#include "scalar/stamp.h"

#include "scalar/access.def"

#include "frame/rows_end.h"
