#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "zentara/zentara.h"

namespace ZV::Test {

/// Name of a result code, for messages.
inline std::string GetZerrName(std::uint32_t code) {
    struct Row {
        std::uint32_t code;
        const char* name;
    };
    static constexpr Row Rows[] = {
        {zerrNone, "zerrNone"},
        {zerrNotSupported, "zerrNotSupported"},
        {zerrBadParameter, "zerrBadParameter"},
        {zerrBadSettings, "zerrBadSettings"},
        {zerrAlreadyLoaded, "zerrAlreadyLoaded"},
        {zerrNotLoaded, "zerrNotLoaded"},
        {zerrBadHandle, "zerrBadHandle"},
        {zerrBadCameraId, "zerrBadCameraId"},
        {zerrHardwareFault, "zerrHardwareFault"},
        {zerrFirewireFault, "zerrFirewireFault"},
        {zerrCameraFault, "zerrCameraFault"},
        {zerrDriverFault, "zerrDriverFault"},
        {zerrBufferTooSmall, "zerrBufferTooSmall"},
        {zerrBusy, "zerrBusy"},
        {zerrQueueFull, "zerrQueueFull"},
        {zerrFrameIncomplete, "zerrFrameIncomplete"},
        {zerrNotStreaming, "zerrNotStreaming"},
        {zerrOutOfSync, "zerrOutOfSync"},
        {zerrMissingData, "zerrMissingData"},
        {zerrHostOverrun, "zerrHostOverrun"},
        {zerrUnplugged, "zerrUnplugged"},
        {zerrCameraBusy, "zerrCameraBusy"},
        {zerrRoiTooSmall, "zerrRoiTooSmall"},
    };
    for (const Row& row : Rows) {
        if (row.code == code) return row.name + (" (" + std::to_string(code) + ")");
    }
    return std::to_string(code);
}

inline testing::AssertionResult CompareZerr(const char* expectedText, const char* actualText,
                                            std::uint32_t expected, std::uint32_t actual) {
    if (expected == actual) return testing::AssertionSuccess();
    return testing::AssertionFailure() << actualText << " is " << GetZerrName(actual) << ", not "
                                       << GetZerrName(expected) << " (" << expectedText << ")";
}

}  // namespace ZV::Test

#define EXPECT_ZERR(expected, actual) EXPECT_PRED_FORMAT2(::ZV::Test::CompareZerr, expected, actual)
#define ASSERT_ZERR(expected, actual) ASSERT_PRED_FORMAT2(::ZV::Test::CompareZerr, expected, actual)
