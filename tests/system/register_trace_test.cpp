// The trace of register writes as a client switches it on: by the export of the bus layer.

#include <gtest/gtest.h>

#include <string>

#include "camera/camera.h"
#include "hal/hal.h"
#include "support/debugger_output.h"
#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

class RegisterTrace : public LoadedLibrary {
  protected:
    ~RegisterTrace() override { (void)HAL_CameraSetShouldOutputWrites(0, 0); }

    std::size_t CountWrites() const {
        const std::string text = output.Read();
        std::size_t count = 0;
        for (std::size_t at = text.find("Async write to"); at != std::string::npos;
             at = text.find("Async write to", at + 1)) {
            ++count;
        }
        return count;
    }

    const DebuggerOutput output;
};

TEST_F(RegisterTrace, KeptAListingSwitchesItOffAndTheExportSwitchesItOnAgain) {
    ASSERT_EQ(HALOk, HAL_CameraSetShouldOutputWrites(0, 1));
    ASSERT_EQ(1u, ListCameras().size());
    EXPECT_EQ(0u, CountWrites()) << "each camera that is made switches it off";
    EXPECT_FALSE(ZCamera::GetShouldOutputWrites());

    ASSERT_EQ(HALOk, HAL_CameraSetShouldOutputWrites(0, 1));
    ZentaraHandle handle = 0;
    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    const std::size_t sentBefore = world.ReadRegisterWrites().size();
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

    const std::size_t sent = world.ReadRegisterWrites().size() - sentBefore;
    EXPECT_GT(sent, 0u);
    EXPECT_EQ(sent, CountWrites());
}

}  // namespace
}  // namespace ZV::Test
