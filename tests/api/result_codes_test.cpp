#include "api/result_codes.h"

#include <gtest/gtest.h>

#include <limits>
#include <map>

#include "support/expect_zerr.h"

namespace ZV {
namespace {

TEST(ResultCodes, CameraResultsBecomeTheCodesOfTheTableAndAllOthersSixteen) {
    const std::map<int, ZentaraResult> table{{0, 0}, {15, 0}, {7, 30}, {24, 30}, {25, 15}};

    for (int result = std::numeric_limits<CameraResult>::min();
         result <= std::numeric_limits<CameraResult>::max(); ++result) {
        const auto row = table.find(result);
        const ZentaraResult expected = row != table.end() ? row->second : 16;
        ASSERT_ZERR(expected, TranslateCameraResult(static_cast<CameraResult>(result))) << result;
    }
}

TEST(ResultCodes, AnAbsentFeatureIsSuccess) {
    EXPECT_ZERR(zerrNone, TranslateCameraResult(CameraNotSupported));
}

TEST(ResultCodes, ImageErrorsBecomeFrameErrorsAndAllOthersNone) {
    const std::map<std::uint32_t, ZentaraResult> table{{18, 26}, {19, 25}, {20, 18}, {21, 23}};

    for (std::uint32_t error = 0; error <= 0xFFFF; ++error) {
        const auto row = table.find(error);
        const ZentaraResult expected = row != table.end() ? row->second : 0;
        ASSERT_ZERR(expected, TranslateImageError(static_cast<std::uint16_t>(error))) << error;
    }
}

TEST(ResultCodes, CodesWithoutWordsShareOneText) {
    for (const ZentaraResult code : {0U, 4U, 9U, 10U, 23U, 29U, 30U, 31U, 33U, 65535U}) {
        EXPECT_STREQ("error string not defined yet", GetResultMessage(code)) << code;
    }
}

TEST(ResultCodes, MessagesAreThoseOfTheLog) {
    EXPECT_STREQ("the function is not supported for this device.", GetResultMessage(1));
    EXPECT_STREQ("one of the parameters used is not valid.", GetResultMessage(2));
    EXPECT_STREQ("the Zentara_Settings structure is corrupted or the size is invalid.",
                 GetResultMessage(3));
    EXPECT_STREQ("Zentara has already been loaded through Zentara_LoadDriver().",
                 GetResultMessage(7));
    EXPECT_STREQ("Zentara has not been loaded. Call Zentara_LoadDriver().", GetResultMessage(8));
    EXPECT_STREQ("the camera ID used is invalid.", GetResultMessage(11));
    EXPECT_STREQ("general internal error occurred (hardware fault).", GetResultMessage(13));
    EXPECT_STREQ("general internal error occurred (firewire fault).", GetResultMessage(14));
    EXPECT_STREQ("general internal error occurred (camera fault).", GetResultMessage(15));
    EXPECT_STREQ("general internal error occurred (driver fault).", GetResultMessage(16));
    EXPECT_STREQ("the size of pBuffer in the Zentara_Frame structure is too small.",
                 GetResultMessage(18));
    EXPECT_STREQ("the function cannot be processed at this time.", GetResultMessage(21));
    EXPECT_STREQ("the queue for frame and settings changes is full.", GetResultMessage(22));
    EXPECT_STREQ("streaming is not on and is required for this call.  Call Zentara_SetStreaming().",
                 GetResultMessage(24));
    EXPECT_STREQ("the host and the computer are out of sync, the frame returned is invalid.",
                 GetResultMessage(25));
    EXPECT_STREQ("data in the frame is missing and has been filled in with black.",
                 GetResultMessage(26));
    EXPECT_STREQ("the host has more data than it can process, restart streaming.",
                 GetResultMessage(27));
    EXPECT_STREQ("the camera has been unplugged or turned off.", GetResultMessage(28));
    EXPECT_STREQ("the ROI used is too small.", GetResultMessage(32));
}

}  // namespace
}  // namespace ZV
