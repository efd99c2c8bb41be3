#include "support/debugger_output.h"
#include "support/scoped_variable.h"
#include "support/temporary_folder.h"

namespace ZV::Test {

struct DebuggerOutput::Listener {
    TemporaryFolder folder;
    ScopedVariable variable{"ZENTARA_DEBUG_OUTPUT", folder.GetPath("debugger.txt").c_str()};
};

DebuggerOutput::DebuggerOutput() : listener(std::make_unique<Listener>()) {}

DebuggerOutput::~DebuggerOutput() = default;

std::string DebuggerOutput::Take() {
    const std::string text = Read();
    const std::size_t first = taken;
    taken = text.size();
    return text.substr(first);
}

std::string DebuggerOutput::Read() const {
    return listener->folder.ReadFile("debugger.txt");
}

}  // namespace ZV::Test
