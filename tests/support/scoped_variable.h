#pragma once

#include <cstdlib>
#include <string>

#include "support/environment_variable.h"

namespace ZV::Test {

/// A variable of the environment for the life of the object; null removes it. The former value
/// comes back at the end.
class ScopedVariable {
  public:
    ScopedVariable(const char* variableName, const char* value) : name(variableName) {
        if (const char* present = std::getenv(variableName); present != nullptr) {
            wasSet = true;
            former = present;
        }
        Set(value);
    }
    ~ScopedVariable() { Set(wasSet ? former.c_str() : nullptr); }
    ScopedVariable(const ScopedVariable&) = delete;
    ScopedVariable& operator=(const ScopedVariable&) = delete;

    void Set(const char* value) const { SetVariable(name.c_str(), value); }

  private:
    std::string name;
    bool wasSet = false;
    std::string former;
};

}  // namespace ZV::Test
