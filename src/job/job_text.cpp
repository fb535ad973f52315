#include "job/job_text.h"

#include <algorithm>

namespace vox {

void VarList::Add(std::string_view definition) {
  const size_t equals = definition.find('=');
  if (equals == std::string_view::npos) {
    Add(std::string(definition), std::string());
  } else {
    Add(std::string(definition.substr(0, equals)), std::string(definition.substr(equals + 1)));
  }
}

void VarList::Add(std::string name, std::string value) {
  vars_.push_front(Var{std::move(name), std::move(value)});
}

const Var* VarList::Find(std::string_view name) const {
  for (const Var& var : vars_)
    if (var.name == name) return &var;
  return nullptr;
}

void RemoveCarriageReturns(std::string& text) {
  text.erase(std::remove(text.begin(), text.end(), '\r'), text.end());
}

namespace {

// Walks the references of text; calls literal(part) for text kept as it is and
// reference(name) for each "$(name)". False on an unterminated reference.
template <typename Literal, typename Reference>
bool WalkReferences(std::string_view text, Literal literal, Reference reference) {
  size_t pos = 0;
  for (;;) {
    const size_t open = text.find("$(", pos);
    if (open == std::string_view::npos) {
      literal(text.substr(pos));
      return true;
    }
    const size_t close = text.find(')', open + 2);
    if (close == std::string_view::npos) return false;
    literal(text.substr(pos, open - pos));
    reference(text.substr(open + 2, close - open - 2));
    pos = close + 1;
  }
}

}  // namespace

bool SubstituteVariables(std::string& text, const VarList& vars) {
  if (text.find("$(") == std::string::npos) return true;

  auto value_of = [&vars](std::string_view name) -> std::string_view {
    const Var* var = vars.Find(name);
    return var == nullptr ? std::string_view() : std::string_view(var->value);
  };
  // First pass sizes the result (and finds an unterminated reference before anything
  // changes); the second fills it.
  size_t length = 0;
  if (!WalkReferences(
          text, [&](std::string_view part) { length += part.size(); },
          [&](std::string_view name) { length += value_of(name).size(); }))
    return false;

  std::string result;
  result.reserve(length);
  WalkReferences(
      text, [&](std::string_view part) { result.append(part); },
      [&](std::string_view name) { result.append(value_of(name)); });
  text = std::move(result);
  return true;
}

}  // namespace vox
