#include "api/exported_call.h"

#include <gtest/gtest.h>

#include <new>
#include <string>

#include "support/expect_zerr.h"

namespace ZV {
namespace {

TEST(ExportedCall, WhatTheStandardLibraryThrowsBecomesACode) {
    EXPECT_ZERR(zerrDriverFault, Guarded([]() -> ZentaraResult { throw std::bad_alloc(); }));
    EXPECT_ZERR(zerrDriverFault, Guarded([]() -> ZentaraResult { throw 1; }));
}

TEST(ExportedCall, TheResultOfTheBodyIsTheResult) {
    EXPECT_ZERR(zerrBusy, Guarded([]() -> ZentaraResult { return zerrBusy; }));
}

TEST(ExportedCall, TheBodyRunsOneLevelDeeperAndHearsItsName) {
    const std::int32_t depth = GetLogNesting();
    std::int32_t inside = 0;
    std::string name;

    EXPECT_ZERR(zerrNone, Traced("Zentara_Something", [&](const char* function) -> ZentaraResult {
                    inside = GetLogNesting();
                    name = function;
                    return zerrNone;
                }));

    EXPECT_EQ(depth + 1, inside);
    EXPECT_EQ("Zentara_Something", name);
    EXPECT_EQ(depth, GetLogNesting());
}

TEST(ExportedCall, ABodyThatThrowsGivesItsLevelBack) {
    const std::int32_t depth = GetLogNesting();

    EXPECT_ZERR(zerrDriverFault, Traced("Zentara_Something", [](const char*) -> ZentaraResult {
                    throw std::bad_alloc();
                }));

    EXPECT_EQ(depth, GetLogNesting());
}

}  // namespace
}  // namespace ZV
