#include <gtest/gtest.h>

#include "hal/platform/last_error.h"
#include "simulation/driver_client.h"
#include "simulation/zentara_simulation.h"

namespace ZV::Test {
namespace {

class OneMonoDevice : public ::testing::Test {
  protected:
    void SetUp() override {
        char message[256] = "";
        ASSERT_EQ(0u, GetDriver().begin("mono", message, sizeof message)) << message;
    }
    void TearDown() override { GetDriver().end(); }
};

TEST_F(OneMonoDevice, ARegisterReadIsPendedAndAnswersInBusOrder) {
    DriverClient client;
    TestRequest read(FW_IOCTL_ASYNC_READ, MakeReadRecord(0xE0010038, 1), 4);

    const std::uint32_t sent = read.Send(client.handle);

    EXPECT_EQ(PlatformErrorIoPending, sent);
    ASSERT_TRUE(read.Wait());
    EXPECT_EQ(0u, read.error);
    EXPECT_EQ(4u, read.bytes);
    EXPECT_EQ((std::vector<std::uint8_t>{0, 5, 0, 0}), read.output);
}

TEST_F(OneMonoDevice, ARegisterKeepsWhatIsWritten) {
    DriverClient client;
    std::uint32_t value = 0;

    ASSERT_EQ(0u, client.Write(0xD0002000 + 4 * 5, 0x12345678));
    ASSERT_EQ(0u, client.Read(0xD0002000 + 4 * 5, &value));

    EXPECT_EQ(0x12345678u, value);
}

}  // namespace
}  // namespace ZV::Test
