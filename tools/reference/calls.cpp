#include "calls.h"

#include <type_traits>
#include <utility>

#include "families.h"
#include "kastarri.h"

namespace worked {

namespace {

// --- Views of types ---------------------------------------------------------------------------------

template <class L, class T>
constexpr Number number_of() {
  using N = typename L::number;
  if (std::is_same_v<T, qv_int32pr>) return Number::bits;  // words of coefficients, packed
  if (std::is_same_v<N, half_float>) return Number::half;
  if (std::is_same_v<N, single_float>) return Number::single;
  if (L::bits == 1) return Number::boolean;
  return std::is_same_v<N, integer> ? Number::integer : Number::bits;
}

template <class T, class = void>
struct view_of {
  static constexpr View view = {testing_support::format_of<layout_of<T>>(), number_of<layout_of<T>, T>()};
};
template <class T>
struct view_of<T, std::enable_if_t<std::is_arithmetic_v<T>>> {
  static constexpr bool is_bool = std::is_same_v<T, bool>;
  static constexpr View view = {{is_bool ? 1 : 8 * int{sizeof(T)}, sizeof(T), 1, std::is_signed_v<T>, false},
                                is_bool                       ? Number::boolean
                                : std::is_floating_point_v<T> ? Number::single
                                                              : Number::integer};
};

// --- Calls ------------------------------------------------------------------------------------------

// What a parameter or a result holds, and how a call takes it from an image: by value, by reference, or as a
// pointer that the image holds.
template <class A>
struct Parameter {
  static constexpr Kind kind = {view_of<std::remove_cv_t<A>>::view, Role::input, Pointer::none};
  static A get(unsigned char* image) { return *reinterpret_cast<A*>(image); }
};
template <class T>
struct Parameter<const T&> : Parameter<T> {
  static const T& get(unsigned char* image) { return *reinterpret_cast<const T*>(image); }
};
template <class T>
struct Parameter<T&> {
  static constexpr Kind kind = {view_of<T>::view, Role::output, Pointer::none};
  static T& get(unsigned char* image) { return *reinterpret_cast<T*>(image); }
};
template <class M>
struct Parameter<M*> {
  static constexpr Kind kind = {view_of<std::remove_cv_t<M>>::view, Role::memory, Pointer::fixed};
  static M* get(unsigned char* image) { return *reinterpret_cast<M**>(image); }
};
template <class M>
struct Parameter<M**> {
  static constexpr Kind kind = {view_of<std::remove_cv_t<M>>::view, Role::memory, Pointer::moving};
  static M** get(unsigned char* image) { return reinterpret_cast<M**>(image); }
};

template <class... A>
constexpr Kind kinds_of[sizeof...(A) + 1] = {Parameter<A>::kind...};

template <class R, class... A, std::size_t... I>
void call(Function function, unsigned char* const* images, std::index_sequence<I...>) {
  const auto f = reinterpret_cast<R (*)(A...)>(function);
  if constexpr (std::is_void_v<R>) {
    f(Parameter<A>::get(images[I])...);
  } else {
    *reinterpret_cast<R*>(images[sizeof...(A)]) = f(Parameter<A>::get(images[I])...);
  }
}

template <class R, class... A>
void call(Function function, unsigned char* const* images) {
  call<R, A...>(function, images, std::index_sequence_for<A...>());
}

template <class R, class... A>
constexpr Signature signature(R (*)(A...)) {
  if constexpr (std::is_void_v<R>) {
    return {kinds_of<A...>, sizeof...(A), false, call<R, A...>};
  } else {
    return {kinds_of<A..., R>, sizeof...(A) + 1, true, call<R, A...>};
  }
}

// --- Operands ---------------------------------------------------------------------------------------

// The names of the parameters of a prototype; none for a parameter that has none.
std::vector<std::string> parameter_names(const std::string& prototype) {
  std::vector<std::string> names;
  std::string word;
  int words = 0;
  for (std::size_t i = prototype.find('(') + 1; i < prototype.size(); ++i) {
    const char c = prototype[i];
    if (std::isalnum(c) || c == '_') {
      if (!std::isalnum(prototype[i - 1]) && prototype[i - 1] != '_') word.clear(), ++words;
      word += c;
    } else if (c == ',' || c == ')') {
      names.push_back(words > 1 ? word : "");
      words = 0;
    }
  }
  return names;
}

// More than any intrinsic has.
constexpr std::size_t most_operands = 12, most_bytes = 256;
alignas(64) unsigned char passed_images[most_operands][most_bytes];

// --- Ports ------------------------------------------------------------------------------------------

void (*told)(const char* event, unsigned value);

void note(const char* event, unsigned value) { told(event, value); }

}  // namespace

Call::Call(const Row& row, unsigned char* memory) : function(row.function), signature(row.signature) {
  const std::vector<std::string> names = parameter_names(row.prototype);
  std::memset(passed_images, 0, sizeof passed_images);  // bits beside an operand's lanes, too
  for (std::size_t i = 0; i < signature.count; ++i) {
    const Kind& kind = signature.kinds[i];
    unsigned char* const image = passed_images[i];
    Operand operand = {kind.view, kind.role, kind.role == Role::memory ? memory : image};
    if (kind.pointer != Pointer::none) std::memcpy(image, &operand.image, sizeof operand.image);
    if (kind.pointer == Pointer::moving) operand.pointer = reinterpret_cast<unsigned char**>(image);
    const bool is_result = signature.has_result && i + 1 == signature.count;
    operand.name = is_result ? "result" : kind.role == Role::memory ? "memory" : names[i];
    operand.values = kind.role == Role::output ? "old" : operand.name;
    operands.push_back(operand);
    passed.push_back(image);
  }
}

Operand* find(std::vector<Operand>& operands, const char* name) {
  for (Operand& operand : operands)
    if (operand.name == name) return &operand;
  return nullptr;
}

void open_ports(void (*note_event)(const char* event, unsigned value)) {
  told = note_event;
  cstub_Km_ZNB_Orbis_R5_64k_register_EXPSTATE(nullptr, [](const cstub_ExportState_t*, const unsigned* value) {
    note("the handler of the exported state is told", *value);
  });
  cstub_Km_ZNB_Orbis_R5_64k_register_IPQ(
      nullptr, [](const cstub_InputQueue_t*) { return 1u; },
      [](const cstub_InputQueue_t*, unsigned flag, unsigned* data) {
        if (flag == 0) note("the input queue gives", *data = 41);
      });
  cstub_Km_ZNB_Orbis_R5_64k_register_OPQ(
      nullptr, [](const cstub_OutputQueue_t*) { return 1u; },
      [](const cstub_OutputQueue_t*, unsigned flag, const unsigned* data) {
        if (flag == 0) note("the output queue takes", *data);
      });
  cstub_Km_ZNB_Orbis_R5_64k_register_IMPWIRE(
      nullptr, [](const cstub_ImportWire_t*, unsigned* value) { note("the wire has", *value = 1234); });
}

}  // namespace worked

#define TEXT(...) TEXT_(__VA_ARGS__)
#define TEXT_(...) #__VA_ARGS__
#define EXAMPLE(NAME, SHAPE, F, CALLS, ...) \
  {#NAME, TEXT(__VA_ARGS__), SHAPE, reinterpret_cast<worked::Function>(&F), worked::signature(&F), CALLS},
#define ENTRY(SYMBOL, SHAPE, ...) \
  EXAMPLE(SYMBOL, #SHAPE, KASTARRI_SYMBOL(SYMBOL), worked::columns, SIG_##SHAPE(SYMBOL, __VA_ARGS__))
// In the last columns divisions would fault.
#define HELPER(NAME, SHAPE, ...) \
  EXAMPLE(NAME, #SHAPE, cstub_Km_ZNB_Orbis_R5_64k_##NAME, 4, SIG_##SHAPE(NAME, __VA_ARGS__))

namespace {

#include "frame/rows.h"

const std::vector<worked::Row> table = {
#include "scalar_rows.def"
#include "rows.def"
};

#include "frame/rows_end.h"

}  // namespace

const std::vector<worked::Row>& worked::rows() { return table; }
