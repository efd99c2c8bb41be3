#include "diagnostics/log.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>

#include "camera/camera.h"
#include "hal/hal.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

using Test::ClientFrame;

class LogNesting : public Test::OpenedCamera {};

TEST_F(LogNesting, ACallThatEndsLeavesTheDepthAsItWas) {
    const std::int32_t depth = GetLogNesting();
    std::uint32_t value = 0;
    ClientFrame frame(64 * 48);

    EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, zinfCcdWidth, &value));
    EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, 100, &value));
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    EXPECT_ZERR(zerrBadHandle, Zentara_Abort(0));
    Zentara_is16bit(0);
    Zentara_CalcImageSize(0, 1, 1);

    EXPECT_EQ(depth, GetLogNesting());
}

TEST_F(LogNesting, ASecondLoadLeavesTheDepthOneTooHighForGood) {
    const std::int32_t depth = GetLogNesting();

    EXPECT_ZERR(zerrAlreadyLoaded, Zentara_LoadDriver());
    EXPECT_EQ(depth + 1, GetLogNesting());
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());

    EXPECT_EQ(depth + 1, GetLogNesting());
}

TEST_F(LogNesting, AFrameThatIsNotQueuedLowersTheDepthByOne) {
    const std::int32_t depth = GetLogNesting();
    ClientFrame frame(64 * 48);

    EXPECT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), nullptr, 0, 0, 0));
    EXPECT_EQ(depth, GetLogNesting());

    EXPECT_ZERR(zerrBadParameter, Zentara_QueueFrame(handle, nullptr, nullptr, 0, 0, 0));
    EXPECT_EQ(depth - 1, GetLogNesting());
}

class LogSwitches : public testing::Test {
  protected:
    LogSwitches() : world(ZV::Test::SmallMono) {}
    ~LogSwitches() override {
        Zentara_ReleaseDriver();
        unsetenv("ZENTARA_CONFIG");
    }

    void Load(const char* stored) {
        const std::string path = world.GetFolder() / "zentara.conf";
        std::ofstream(path) << stored;
        setenv("ZENTARA_CONFIG", path.c_str(), 1);
        ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
    }

    ZV::Test::SimulationWorld world;
};

TEST_F(LogSwitches, AreOffWithoutAStore) {
    setenv("ZENTARA_CONFIG", "/nonexistent/zentara.conf", 1);
    ASSERT_ZERR(zerrNone, Zentara_LoadDriver());

    EXPECT_EQ(0, GetOutputReads());
    EXPECT_EQ(0, GetOutputWrites());
    EXPECT_FALSE(ZCamera::GetShouldOutputReads());
}

TEST_F(LogSwitches, AnyValueButZeroTurnsATraceOnAsOne) {
    Load("outputReads = 7\noutputWrites = 1\n");

    EXPECT_EQ(1, GetOutputReads());
    EXPECT_EQ(1, GetOutputWrites());
    EXPECT_TRUE(ZCamera::GetShouldOutputReads());
    EXPECT_TRUE(ZCamera::GetShouldOutputWrites());
    EXPECT_EQ(1, GetHalOutputReads());
    EXPECT_EQ(1, GetHalOutputWrites());
}

TEST_F(LogSwitches, AreReadAtEachLoad) {
    Load("outputReads = 1\n");
    Zentara_ReleaseDriver();

    Load("outputReads = 0\n");

    EXPECT_EQ(0, GetOutputReads());
    EXPECT_FALSE(ZCamera::GetShouldOutputReads());
}

TEST_F(LogSwitches, AListingTurnsTheTraceOfWritesOffAndLeavesThatOfReads) {
    Load("outputReads = 1\noutputWrites = 1\n");
    Zentara_CamListItem item{};
    std::uint32_t length = 1;
    testing::internal::CaptureStdout();

    EXPECT_ZERR(zerrNone, Zentara_ListCameras(&item, &length));

    (void)testing::internal::GetCapturedStdout();
    EXPECT_TRUE(ZCamera::GetShouldOutputReads());
    EXPECT_FALSE(ZCamera::GetShouldOutputWrites());
    EXPECT_EQ(1, GetHalOutputReads());
    EXPECT_EQ(0, GetHalOutputWrites());
}

}  // namespace
}  // namespace ZV
