#pragma once

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace ZV::Test {

/// A log file's bytes in a form that can be read and compared: one line for each record, its time
/// as "<time>", an address as "<address>", a line end as "\n", and "|" for the zero byte that ends
/// the record.
[[nodiscard]] std::string DescribeLog(std::string_view bytes);

/// Compares with the file tests/`name`. What was compared is left under build/.../golden for a
/// look, and to be copied where the change is meant.
[[nodiscard]] testing::AssertionResult MatchesGolden(std::string_view name,
                                                     const std::string& text);

}  // namespace ZV::Test
