// cases.cpp - see cases.h.

#include "kit/cases.h"

#include <cstdlib>

#include "kit/target.h"

namespace kit {
namespace {

constexpr char k_variable[] = "ZX_CASE";

// Null ahead of the first static constructor.
constinit const Case* first_case = nullptr;

std::string variable(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? value : "";
}

}  // namespace

Case::Case(const char* case_name, CaseFunction case_function)
    : name(case_name), function(case_function), next(first_case) {
  first_case = this;
}

CaseFunction find_case(const std::string& name) {
  for (const Case* c = first_case; c != nullptr; c = c->next)
    if (name == c->name) return c->function;
  return nullptr;
}

std::string wanted_case() { return variable(k_variable); }

ProcessResult run_case(const std::string& name,
                       const std::vector<std::string>& args,
                       ProcessOptions options) {
  std::vector<std::string> command = {self_path()};
  command.insert(command.end(), args.begin(), args.end());
  options.variables.emplace_back(k_variable, name);
  return run_process(command, options);
}

std::string built_program(const std::string& name) {
  const std::string folder = variable("ZX_BIN_DIR");
  if (folder.empty()) return "";
  return folder + "/" + name + (on_windows() ? ".exe" : "");
}

}  // namespace kit
