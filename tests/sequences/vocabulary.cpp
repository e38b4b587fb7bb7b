// The intrinsics that programs are made of, from the rows.
#include <algorithm>

#include "programs.h"

namespace sequences {

namespace {

using worked::Pointer;
using worked::Role;

// Between the parentheses of a prototype.
std::vector<std::string> parameters_of(const std::string& prototype) {
  std::vector<std::string> texts(1);
  const std::size_t begin = prototype.find('(') + 1;
  for (const char c : prototype.substr(begin, prototype.rfind(')') - begin)) {
    if (c == ',')
      texts.emplace_back();
    else
      texts.back() += c;
  }
  return texts;
}

bool is_of_name(char c) { return std::isalnum(static_cast<unsigned char>(c)) || c == '_'; }

// "const unsigned short* base": the words, without const.
std::vector<std::string> words_of(const std::string& text) {
  std::vector<std::string> words(1);
  for (const char c : text) {
    if (is_of_name(c))
      words.back() += c;
    else if (!words.back().empty())
      words.emplace_back();
  }
  words.erase(std::remove_if(words.begin(), words.end(), [](auto& word) { return word.empty() || word == "const"; }),
              words.end());
  return words;
}

std::string joined(const std::vector<std::string>& words) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : " ") + word;
  return text == "unsigned" ? "unsigned int" : text;
}

bool is_usable(const worked::Row& row) {
  const std::string name = row.name;
  const bool divides = row.most_calls < worked::columns;
  return !divides && name.find("rk_ioports_") == std::string::npos;
}

}  // namespace

Parameter Vocabulary::parameter(const std::string& text, const std::string& name, const worked::Kind& kind) {
  std::vector<std::string> words = words_of(text);
  if (!name.empty()) words.pop_back();
  Parameter made = {Parameter::What::reg, name, joined(words), 0, false};
  if (kind.pointer != Pointer::none) {
    made.what = kind.pointer == Pointer::moving ? Parameter::What::moving_pointer : Parameter::What::fixed_pointer;
    if (text.find("const ") != std::string::npos) made.type = "const " + made.type;
    const auto [found, is_new] = pointer_numbers_.try_emplace(made.type, static_cast<int>(pointers.size()));
    if (is_new) pointers.push_back(made.type);
    made.index = found->second;
  } else if (made.type == "immediate" || name == "offset" || name == "increment") {
    made.what = Parameter::What::number;
  } else {
    const auto [found, is_new] = type_numbers_.try_emplace(made.type, static_cast<int>(types.size()));
    made.index = found->second;
    if (is_new) types.push_back({made.type, kind.view, made.index * in_a_type, {}});
    made.is_written = kind.role == Role::output;
  }
  return made;
}

void Vocabulary::add(const worked::Row& row) {
  Operation operation = {&row, {}};
  const std::string prototype = row.prototype;
  const std::size_t inputs = row.signature.count - row.signature.has_result;
  const std::vector<std::string> texts = parameters_of(prototype);
  for (std::size_t i = 0; i < inputs; ++i) {
    const std::vector<std::string> words = words_of(texts[i]);
    operation.parameters.push_back(parameter(texts[i], words.size() > 1 ? words.back() : "", row.signature.kinds[i]));
  }
  const int number = static_cast<int>(operations.size());
  for (const Parameter& taken : operation.parameters) {
    if (taken.what != Parameter::What::reg) continue;
    std::vector<int>& takers = types[static_cast<std::size_t>(taken.index)].takers;
    if (takers.empty() || takers.back() != number) takers.push_back(number);
  }
  if (row.signature.has_result) {
    const std::string type = prototype.substr(0, prototype.find(std::string(" ") + row.name));
    operation.parameters.push_back(parameter(type, "", row.signature.kinds[inputs]));
    operation.parameters.back().is_written = true;
  }
  const std::string name = row.name;
  if (name == "rk_zra32_ZRA_ANDNX16U" || name == "rk_zra32_ZRA_ANDN_2X32U")
    masking[operation.parameters.back().type] = number;
  operations.push_back(std::move(operation));
}

Vocabulary::Vocabulary() {
  for (const worked::Row& row : worked::rows())
    if (is_usable(row)) add(row);
}

const Vocabulary& vocabulary() {
  static const Vocabulary all;
  return all;
}

}  // namespace sequences
