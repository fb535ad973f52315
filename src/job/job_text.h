// Preparation of a job text before it is parsed: carriage returns removed and run variables
// "$(NAME)" substituted.
//
// A VarList belongs to one run request; it is filled before the job thread starts and only
// read afterwards, so it needs no lock.
#pragma once

#include <deque>
#include <string>
#include <string_view>

namespace vox {

// A run variable.
struct Var {
  std::string name;
  std::string value;
};

// The run's variables; the one added last is found first.
class VarList {
 public:
  // Defines a variable from "NAME=VALUE": the name is the text before the first '=', the value
  // everything after it; a text without '=' is a name with an empty value.
  void Add(std::string_view definition);
  void Add(std::string name, std::string value);
  // The most recently added variable of that exact name, or null.
  const Var* Find(std::string_view name) const;
  bool empty() const { return vars_.empty(); }
  size_t size() const { return vars_.size(); }

 private:
  std::deque<Var> vars_;  // front: most recent
};

// Removes every carriage-return byte, leaving line feeds as the only line ends.
void RemoveCarriageReturns(std::string& text);

// Replaces every "$(NAME)" by the variable's value (or by nothing for an unknown name);
// inserted values are not scanned again. An unterminated "$(" fails and leaves text as it was.
bool SubstituteVariables(std::string& text, const VarList& vars);

}  // namespace vox
