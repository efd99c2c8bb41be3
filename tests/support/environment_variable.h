#pragma once

namespace ZV::Test {

/// Sets a variable of this process's environment for all that read it; null removes it.
void SetVariable(const char* name, const char* value);

}  // namespace ZV::Test
