#include "api/handles.h"

#include <gtest/gtest.h>

#include "support/flat_camera.h"

namespace ZV {
namespace {

class Handles : public Test::OpenedCamera {};

TEST_F(Handles, AHandleIsTheAddressOfItsCamera) {
    ZCamera* const camera = FindCamera(handle);

    ASSERT_NE(nullptr, camera);
    EXPECT_EQ(handle, GetHandle(camera));
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(camera), handle);
}

TEST_F(Handles, NothingIsFoundForWhatIsNotACamera) {
    EXPECT_EQ(nullptr, FindCamera(0));
    EXPECT_EQ(nullptr, FindCamera(1));
    EXPECT_EQ(nullptr, FindCamera(handle + 8));
}

TEST_F(Handles, ANullCameraPassesNoAccessTest) {
    EXPECT_FALSE(IsOpen(nullptr));
    EXPECT_FALSE(HasExclusiveAccess("Zentara_Something", nullptr));
}

TEST_F(Handles, ACloseEndsAccessAndOpenness) {
    ZCamera* const camera = FindCamera(handle);
    EXPECT_TRUE(IsOpen(camera));
    EXPECT_TRUE(HasExclusiveAccess("Zentara_Something", camera));

    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_EQ(camera, FindCamera(handle));
    EXPECT_FALSE(IsOpen(camera));
    EXPECT_FALSE(HasExclusiveAccess("Zentara_Something", camera));
}

TEST_F(Handles, TheListingAfterAnOpenCameraKeepsItsHandle) {
    ListCameras();

    EXPECT_NE(nullptr, FindCamera(handle));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    ListCameras();
    // The address may be that of a new camera by now, which nobody has opened.
    EXPECT_FALSE(IsOpen(FindCamera(handle)));
}

}  // namespace
}  // namespace ZV
