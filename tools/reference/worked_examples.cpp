// Calls every intrinsic once on fixed operands and prints, as JSON, what went in and what came out. Where every
// operand has one lane there is a call for each column of values.
#include <cstdio>
#include <type_traits>
#include <utility>
#include <vector>

#include "families.h"
#include "kastarri.h"
#include "operands.h"

namespace worked {

namespace {

using testing_support::Format;

auto& processor = cstub_Km_ZNB_Orbis_R5_64k_proc;

// --- Views of types ---------------------------------------------------------------------------------

enum class Pointer { none, fixed, moving };

struct Kind {
  View view;
  Role role;
  Pointer pointer;
};

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

using Function = void (*)();

// A type of function: one for many intrinsics.
struct Signature {
  const Kind* kinds;  // of the parameters, and of the result as the last if there is one
  std::size_t count;
  bool has_result;
  void (*call)(Function, unsigned char* const* images);
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

struct Row {
  const char* name;
  const char* prototype;
  Function function;
  Signature signature;
  int most_calls;
};

// --- What is shown ----------------------------------------------------------------------------------

// Names with the texts that calls gave them, in the order in which they came up.
class Table {
 public:
  void add(const std::string& name, const std::string& text) {
    for (auto& [known, texts] : rows_) {
      if (known == name) {
        texts += " " + text;
        return;
      }
    }
    rows_.emplace_back(name, text);
  }
  std::string json() const {
    std::string all;
    for (const auto& [name, texts] : rows_) all += (all.empty() ? "[\"" : ", [\"") + name + "\", \"" + texts + "\"]";
    return "[" + all + "]";
  }

 private:
  std::vector<std::pair<std::string, std::string>> rows_;
};

// The state that intrinsics read and change, as it is before every call.
struct State {
  const char* name;
  unsigned& value;
  unsigned initial;
};
const State states[] = {
    {"SAR", processor.states.SAR, 8},
    {"EXPSTATE", processor.states.EXPSTATE, 0xA0},
    {"RoundMode", processor.states.RoundMode, 0},
    {"StickyFlags", processor.states.StickyFlags, 0},
    {"StickyEnable", processor.states.StickyEnable, 0},
};
constexpr int processor_number = 5;

// What the ports did during a call.
Table* events;
void note(const char* event, unsigned value) { events->add(event, std::to_string(value)); }

void open_ports() {
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

// --- A row ------------------------------------------------------------------------------------------

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

// What pointers point to: aligned, with room before and behind.
constexpr int base = 128;
alignas(64) unsigned char memory[512];

// A row's operands, which lie where the call finds them: what passes them in images, in memory what is pointed to.
struct Call {
  explicit Call(const Row& row);
  Call(const Call&) = delete;

  void make() { signature.call(function, passed.data()); }

  Function function;
  const Signature& signature;
  std::vector<Operand> operands;
  std::vector<unsigned char*> passed;
};

// More than any intrinsic has.
constexpr std::size_t most_operands = 12, most_bytes = 256;
alignas(64) unsigned char passed_images[most_operands][most_bytes];

Call::Call(const Row& row) : function(row.function), signature(row.signature) {
  const std::vector<std::string> names = parameter_names(row.prototype);
  for (std::size_t i = 0; i < signature.count; ++i) {
    const Kind& kind = signature.kinds[i];
    unsigned char* const image = passed_images[i];
    Operand operand = {kind.view, kind.role, kind.role == Role::memory ? memory + base : image};
    if (kind.pointer != Pointer::none) std::memcpy(image, &operand.image, sizeof operand.image);
    if (kind.pointer == Pointer::moving) operand.pointer = reinterpret_cast<unsigned char**>(image);
    const bool is_result = signature.has_result && i + 1 == signature.count;
    operand.name = is_result ? "result" : kind.role == Role::memory ? "memory" : names[i];
    operand.values = kind.role == Role::output ? "old" : operand.name;
    operands.push_back(operand);
    passed.push_back(image);
  }
}

bool is_vector(const Operand& operand) { return operand.view.format.count > 1; }

Operand* find(std::vector<Operand>& operands, const char* name) {
  for (Operand& operand : operands)
    if (operand.name == name) return &operand;
  return nullptr;
}

// Of memory the elements from the address on are shown, as many as there are columns.
void see_elements(Operand& place) {
  if (!is_vector(place)) place.view.format.count = columns;
}

void place_in_memory(Call& call) {
  Operand* place = find(call.operands, "memory");
  if (!place) return;
  const bool loads = call.signature.has_result || find(call.operands, "r");
  const int size = place->view.format.container_bytes;
  see_elements(*place);
  place->values = loads ? "a" : "old";
  if (find(call.operands, "offset")) place->image += 64;
  if (Operand* offsets = find(call.operands, "offsets")) {
    offsets->step = size;
    if (loads) place->values = "elements";
  }
}

// A register of plain bits is shown in units as wide as the other lanes.
void see_units(Call& call) {
  bool has_words = false;
  for (const Operand& operand : call.operands)
    has_words |= operand.view.format.bits == 32 && operand.view.number != Number::bits;
  for (Operand& operand : call.operands) {
    Format& format = operand.view.format;
    const bool is_gathered = operand.view.number == Number::bits && format.count == 16 && call.operands.size() > 1;
    if (is_gathered && !has_words) format = {16, 2, 32, false, false};
  }
}

void set_states() {
  for (const State& state : states) state.value = state.initial;
  processor.PRID = processor_number;
}

std::vector<unsigned> values_of_states() {
  std::vector<unsigned> values;
  for (const State& state : states) values.push_back(state.value);
  return values;
}

void fill_operands(Call& call, int column) {
  for (Operand& operand : call.operands) {
    if (operand.pointer) *operand.pointer = operand.image;
    if (operand.name != "result") fill(operand, column);
  }
}

std::vector<std::string> images(const Call& call) {
  std::vector<std::string> all;
  for (const Operand& operand : call.operands) {
    const Format& format = operand.view.format;
    all.emplace_back(
        reinterpret_cast<const char*>(operand.image),
        static_cast<std::size_t>(format.is_predicate ? (format.count + 7) / 8 : format.count * format.container_bytes));
  }
  return all;
}

// The first of the lanes to show: that of the first column, unless only lanes behind the columns changed.
int first_lane(const Operand& operand, const std::string& before) {
  const Format& format = operand.view.format;
  for (int i = 0; i < format.count; ++i)
    if (testing_support::lane(format, before.data(), i) != testing_support::lane(format, operand.image, i))
      return i / columns * columns;
  return 0;
}

void add_output(Table& out, const Operand& operand, const std::string& before) {
  const bool is_result = operand.name == "result";
  if (operand.role == Role::input && !is_result) return;
  const int first = is_result ? 0 : first_lane(operand, before);
  const std::string suffix = first ? "@" + std::to_string(first) : "";
  out.add(operand.name + suffix, text(operand.view, operand.image, first));
  if (operand.pointer) out.add("pointer", "+" + std::to_string(*operand.pointer - operand.image));
}

void add_changed_states(Table& out, const std::vector<std::vector<unsigned>>& after) {
  for (std::size_t i = 0; i < std::size(states); ++i) {
    bool changed = false;
    for (const auto& values : after) changed |= values[i] != states[i].initial;
    for (const auto& values : after)
      if (changed) out.add(states[i].name, std::to_string(values[i]));
  }
}

// A single lane among vectors takes the value of this column: a middling one.
constexpr int middle_column = 2;

int calls_of(const Call& call, int most) {
  const std::size_t inputs = call.operands.size() - call.signature.has_result;
  for (const Operand& operand : call.operands)
    if (is_vector(operand)) return 1;
  return inputs > 0 ? most : 1;
}

std::string example_of(const Row& row) {
  Call call(row);
  place_in_memory(call);
  see_units(call);
  const int calls = calls_of(call, row.most_calls);
  Table in, out;
  std::vector<std::vector<unsigned>> states_after;
  events = &out;
  for (int n = 0; n < calls; ++n) {
    set_states();
    fill_operands(call, calls == 1 ? middle_column : n);
    const std::vector<std::string> before = images(call);
    for (const Operand& operand : call.operands)
      if (operand.name != "result") in.add(operand.name, text(operand.view, operand.image));
    call.make();
    for (std::size_t i = 0; i < before.size(); ++i) add_output(out, call.operands[i], before[i]);
    states_after.push_back(values_of_states());
  }
  add_changed_states(out, states_after);
  return "{\"calls\": " + std::to_string(calls) + ", \"in\": " + in.json() + ", \"out\": " + out.json() + "}";
}

}  // namespace

}  // namespace worked

#define TEXT(...) TEXT_(__VA_ARGS__)
#define TEXT_(...) #__VA_ARGS__
#define EXAMPLE(NAME, F, CALLS, ...) \
  {#NAME, TEXT(__VA_ARGS__), reinterpret_cast<worked::Function>(&F), worked::signature(&F), CALLS},
#define ENTRY(SYMBOL, SHAPE, ...) \
  EXAMPLE(SYMBOL, KASTARRI_SYMBOL(SYMBOL), worked::columns, SIG_##SHAPE(SYMBOL, __VA_ARGS__))
// In the last columns divisions would fault.
#define HELPER(NAME, SHAPE, ...) EXAMPLE(NAME, cstub_Km_ZNB_Orbis_R5_64k_##NAME, 4, SIG_##SHAPE(NAME, __VA_ARGS__))

namespace {

#include "frame/rows.h"

const worked::Row rows[] = {
#include "scalar_rows.def"
#include "rows.def"
};

#include "frame/rows_end.h"

}  // namespace

int main() {
  worked::open_ports();
  std::printf("{\"initial\": {");
  for (const auto& state : worked::states) std::printf("\"%s\": %u, ", state.name, state.initial);
  std::printf("\"PRID\": %d},\n\"examples\": {\n", worked::processor_number);
  for (const worked::Row& row : rows)
    std::printf("\"%s\": %s%s\n", row.name, worked::example_of(row).c_str(), &row + 1 == std::end(rows) ? "" : ",");
  std::printf("}}\n");
}
