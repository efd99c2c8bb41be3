#pragma once

#include <nlohmann/json.hpp>
#include <string>

#include "tools/program.h"

namespace ZentaraTest {

/// A scenario of one quick camera without noise, with a trace beside it.
struct TracedScenario {
    explicit TracedScenario(const std::string& camera) {
        const std::string trace = nlohmann::json(GetTrace()).dump();
        const std::string text = R"({"base": "mono", "timeScale": 0, "trace": )" + trace +
                                 R"(, "cameras": [)" + camera + "]}";
        WriteFile(GetName(), text);
    }
    [[nodiscard]] std::string GetName() const { return folder.GetPath("scenario.json"); }
    [[nodiscard]] std::string GetTrace() const { return folder.GetPath("trace.jsonl"); }

    TemporaryFolder folder;
};

/// Register writes, by their name in a trace.
inline std::size_t CountWrites(const std::string& trace) {
    const std::string text = ReadFile(trace);
    const std::string name = "\"FW_IOCTL_ASYNC_WRITE\"";
    std::size_t count = 0;
    for (std::size_t at = text.find(name); at != std::string::npos; at = text.find(name, at + 1))
        ++count;
    return count;
}

}  // namespace ZentaraTest
