// variables.h - the test kit: other values of environment variables, which
// give way to the former ones at the end of a block.
#ifndef KIT_VARIABLES_H
#define KIT_VARIABLES_H

#include <cstdlib>
#include <optional>
#include <string>

#include "kit/target.h"

namespace kit {

// Another value of an environment variable; none if it is null.
class Variable {
 public:
  Variable(const char* variable, const char* value) : name(variable) {
    const char* old = std::getenv(variable);
    if (old != nullptr) before = old;
    set_variable(name, value);
  }
  Variable(const Variable&) = delete;
  Variable& operator=(const Variable&) = delete;
  ~Variable() { set_variable(name, before ? before->c_str() : nullptr); }

 private:
  const std::string name;
  std::optional<std::string> before;
};

// Another zone of the local clock.
class InZone : Variable {
 public:
  explicit InZone(const char* zone) : Variable("TZ", zone) {}
};

}  // namespace kit

#endif  // KIT_VARIABLES_H
