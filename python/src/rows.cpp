#include "rows.h"

#include <new>
#include <utility>

namespace kastarri_python {

namespace {

// How a call takes a parameter from its image.
template <class A>
struct Passed {
  using Value = std::remove_cv_t<A>;
  static A from(char* image) { return *reinterpret_cast<A*>(image); }
};
template <class T>
struct Passed<const T&> {
  using Value = T;
  static const T& from(char* image) { return *reinterpret_cast<const T*>(image); }
};
template <class T>
struct Passed<T&> {
  using Value = T;
  static T& from(char* image) { return *reinterpret_cast<T*>(image); }
};
template <class M>
struct Passed<M*> {
  using Value = std::remove_cv_t<M>;
  static M* from(char* image) { return *reinterpret_cast<M**>(image); }
};
template <class M>
struct Passed<M**> {
  using Value = std::remove_cv_t<M>;
  static M** from(char* image) { return reinterpret_cast<M**>(image); }
};

template <class R, class... A, std::size_t... I>
void call(Function function, char* const* images, const std::ptrdiff_t* strides, std::ptrdiff_t n,
          std::index_sequence<I...>) {
  const auto f = reinterpret_cast<R (*)(A...)>(function);
  for (std::ptrdiff_t k = 0; k < n; ++k) {
    if constexpr (std::is_void_v<R>) {
      f(Passed<A>::from(images[I] + k * strides[I])...);
    } else {
      // A result that is returned in memory is written where it belongs.
      constexpr std::size_t last = sizeof...(A);
      new (images[last] + k * strides[last]) R(f(Passed<A>::from(images[I] + k * strides[I])...));
    }
  }
}

template <class R, class... A>
struct SignatureOf {
  static void call(Function function, char* const* images, const std::ptrdiff_t* strides, std::ptrdiff_t n) {
    kastarri_python::call<R, A...>(function, images, strides, n, std::index_sequence_for<A...>());
  }
  static constexpr int count = sizeof...(A) + !std::is_void_v<R>;
  static_assert(count <= most_parameters);
  // A result of nothing is behind the count.
  using Result = std::conditional_t<std::is_void_v<R>, int, R>;
  static constexpr const Type* types[] = {&TypeOf<typename Passed<A>::Value>::value..., &TypeOf<Result>::value};
  static constexpr Signature value = {types, count, call};
};

template <class R, class... A>
constexpr const Signature* signature(R (*)(A...)) {
  return &SignatureOf<R, A...>::value;
}

}  // namespace

#define ROW(SYMBOL, NAME, DIVIDES, ...) \
  {NAME, reinterpret_cast<Function>(&SYMBOL), signature(&SYMBOL), DIVIDES, {__VA_ARGS__}},
const Row rows[] = {
#include "rows.inc"
};
#undef ROW

const int row_count = sizeof rows / sizeof *rows;

}  // namespace kastarri_python
