#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace ZV::Test {

/// What the process has now.
struct Belongings {
    Belongings();
    std::size_t threads, files;
};

/// What the process has when no library is loaded, once all helpers have begun.
const Belongings& GetOwnBelongings();

/// Complains of what is there beyond `own`, when it does not go soon.
void CheckBelongings(const Belongings& own, std::vector<std::string>* problems);

/// Ends the process when a round does not end.
class Watchdog {
  public:
    explicit Watchdog(const std::string& text);
    ~Watchdog();
    Watchdog(const Watchdog&) = delete;
    Watchdog& operator=(const Watchdog&) = delete;
};

}  // namespace ZV::Test
