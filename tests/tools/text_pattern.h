#pragma once

#include <gmock/gmock.h>

#include <regex>
#include <string>

/// Patterns of the standard library: those of the test library know no brackets on every system.
namespace ZentaraTest {

MATCHER_P(MatchesPattern, pattern, "matches " + std::string(pattern)) {
    return std::regex_match(std::string(arg), std::regex(pattern));
}

MATCHER_P(HasPattern, pattern, "has a part like " + std::string(pattern)) {
    return std::regex_search(std::string(arg), std::regex(pattern));
}

}  // namespace ZentaraTest
