#include "hal/platform/environment.h"

#include <gtest/gtest.h>

#include "support/scoped_variable.h"

namespace ZV {
namespace {

using Test::ScopedVariable;

TEST(LibraryVariable, IsNullWhenItIsNotSet) {
    const ScopedVariable unset("ZENTARA_TEST_VARIABLE", nullptr);

    EXPECT_EQ(GetLibraryVariable("ZENTARA_TEST_VARIABLE"), nullptr);
}

TEST(LibraryVariable, IsWhatTheEnvironmentSaysNow) {
    const ScopedVariable variable("ZENTARA_TEST_VARIABLE", "one");
    EXPECT_STREQ(GetLibraryVariable("ZENTARA_TEST_VARIABLE"), "one");

    variable.Set("two");

    EXPECT_STREQ(GetLibraryVariable("ZENTARA_TEST_VARIABLE"), "two");
}

TEST(LibraryVariable, MayBeEmpty) {
    const ScopedVariable empty("ZENTARA_TEST_VARIABLE", "");

    EXPECT_STREQ(GetLibraryVariable("ZENTARA_TEST_VARIABLE"), "");
}

}  // namespace
}  // namespace ZV
