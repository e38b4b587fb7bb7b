// The register types and the types of the host, as values.
#ifndef KASTARRI_PYTHON_TYPES_H
#define KASTARRI_PYTHON_TYPES_H

#include <type_traits>

#include "kastarri.h"
#include "kastarri/lanes.h"

namespace kastarri_python {

// Kinds of lanes as in lanes.h: i signed, u unsigned, f floating point, b bits of a predicate, w words without a
// number.
struct Type {
  const char* name;
  char kind;
  int bits, count;  // of a lane; lanes
  int bytes, unit;  // of a value; what its address is a multiple of
};

template <class T, class = void>
struct TypeOf;

template <class T>
struct TypeOf<T, std::enable_if_t<std::is_arithmetic_v<T>>> {
  static constexpr char kind = std::is_same_v<T, bool>       ? 'b'
                               : std::is_floating_point_v<T> ? 'f'
                               : std::is_signed_v<T>         ? 'i'
                                                             : 'u';
  static constexpr const char* name() {
    if (kind == 'b') return "bool";
    if (kind == 'f') return "float";
    constexpr const char* names[][4] = {{"int8", "int16", "int32", "int64"}, {"uint8", "uint16", "uint32", "uint64"}};
    return names[kind == 'u'][sizeof(T) == 1 ? 0 : sizeof(T) == 2 ? 1 : sizeof(T) == 4 ? 2 : 3];
  }
  static constexpr Type value = {name(), kind, kind == 'b' ? 1 : 8 * int{sizeof(T)}, 1, sizeof(T), alignof(T)};
};

#define KASTARRI_TYPE(T, KIND, BITS, COUNT)                                                   \
  template <>                                                                                 \
  struct TypeOf<T##_space::T##_> {                                                            \
    using Class = T##_space::T##_;                                                            \
    static constexpr Type value = {#T, #KIND[0], BITS, COUNT, sizeof(Class), alignof(Class)}; \
  };
KASTARRI_REGISTER_TYPES(KASTARRI_TYPE)
#undef KASTARRI_TYPE

}  // namespace kastarri_python

#endif
