#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "hal/control_records.h"
#include "hal/fw_device_context.h"
#include "hal/hal_world.h"
#include "support/debugger_output.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

struct FWCameraIO : testing::Test {
    FWCameraIO() : camera(mono.Connect()) {}

    HALWorld mono{"mono"};
    HALCamera* camera;
};

TEST_F(FWCameraIO, AReadBringsHostOrderQuadletsOfTheAddress) {
    ASSERT_TRUE(mono.world.Poke(ScratchAddress, 0x01020304));
    std::uint32_t data[2] = {};

    ASSERT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, data, 2));

    EXPECT_EQ(0x01020304u, data[0]);
    const std::vector<TraceRecord> requests = mono.TakeRequests();
    ASSERT_EQ(1u, requests.size());
    EXPECT_EQ(FW_IOCTL_ASYNC_READ, requests[0].code);
    EXPECT_EQ(48u, requests[0].inputBytes);
    EXPECT_EQ(8u, requests[0].outputBytes);
    EXPECT_TRUE(requests[0].wasPended);
}

TEST_F(FWCameraIO, AWriteSendsHostOrderQuadletsAndLeavesTheCallersDataAlone) {
    const std::uint32_t data[] = {0x01020304, 0x05060708};

    ASSERT_EQ(HALOk, HAL_CameraWriteData(camera, ScratchAddress, data, 2));

    EXPECT_EQ(0x01020304u, mono.world.Peek(ScratchAddress));
    EXPECT_EQ(0x05060708u, mono.world.Peek(ScratchAddress + 4));
    EXPECT_EQ(0x01020304u, data[0]);
    const std::vector<TraceRecord> requests = mono.TakeRequests();
    ASSERT_EQ(1u, requests.size());
    EXPECT_EQ(48u, requests[0].inputBytes);
    EXPECT_EQ(0u, requests[0].outputBytes);
}

TEST_F(FWCameraIO, AWriteOfNullDataSendsNothingAndGivesItsMutexBack) {
    const std::uint32_t value = 5;

    EXPECT_EQ(HALNullData, HAL_CameraWriteData(camera, ScratchAddress, nullptr, 1));

    EXPECT_TRUE(mono.TakeCodes().empty());
    HALStatus status = HALUnknownFault;
    std::thread other([&] { status = HAL_CameraWriteData(camera, ScratchAddress, &value, 1); });
    other.join();
    EXPECT_EQ(HALOk, status);
}

TEST_F(FWCameraIO, AReadIntoNullSendsNothing) {
    EXPECT_EQ(HALNullData, HAL_CameraReadData(camera, ScratchAddress, nullptr, 1));

    EXPECT_TRUE(mono.TakeCodes().empty());
}

TEST_F(FWCameraIO, AReadOfNoQuadletsIsSentWithAnOutputLengthOfZero) {
    std::uint32_t data = 0xDDDDDDDD;

    EXPECT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 0));

    EXPECT_EQ(0xDDDDDDDDu, data);
    const std::vector<TraceRecord> requests = mono.TakeRequests();
    ASSERT_EQ(1u, requests.size());
    EXPECT_EQ(0u, requests[0].outputBytes);
}

TEST_F(FWCameraIO, LengthsBeyond32BitsAreRefusedUnsent) {
    std::uint32_t data = 0;

    EXPECT_EQ(HALReadFailed, HAL_CameraReadData(camera, ScratchAddress, &data, 0x40000000));
    EXPECT_EQ(HALWriteFailed, HAL_CameraWriteData(camera, ScratchAddress, &data, 0x3FFFFFF7));

    EXPECT_TRUE(mono.TakeCodes().empty());
}

TEST_F(FWCameraIO, AnUnconnectedRecordIsNotOpen) {
    ASSERT_EQ(HALOk, HAL_CameraDisconnect(camera));
    std::uint32_t data = 0;

    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraWriteData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraWriteData(camera, ScratchAddress, nullptr, 1));
}

TEST_F(FWCameraIO, ARefusedReadIs18) {
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ASYNC_READ"})"));
    std::uint32_t data = 0;

    EXPECT_EQ(HALReadFailed, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
}

TEST_F(FWCameraIO, APendedReadThatFailsIs18AndIsNotReversed) {
    ASSERT_TRUE(mono.world.AddFault(
        R"({"kind":"failRequest","code":"FW_IOCTL_ASYNC_READ","error":1167,"pended":true})"));
    std::uint32_t data = 0x01020304;

    EXPECT_EQ(HALReadFailed, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(0x01020304u, data);
}

TEST_F(FWCameraIO, ARefusedWriteIs19) {
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ASYNC_WRITE"})"));
    const std::uint32_t data = 0;

    EXPECT_EQ(HALWriteFailed, HAL_CameraWriteData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(HALOk, HAL_CameraWriteData(camera, ScratchAddress, &data, 1));
}

TEST_F(FWCameraIO, APendedWriteThatFailsPassesTheSystemsErrorNumberOn) {
    ASSERT_TRUE(mono.world.AddFault(
        R"({"kind":"failRequest","code":"FW_IOCTL_ASYNC_WRITE","error":1167,"pended":true})"));
    const std::uint32_t data = 0;

    EXPECT_EQ(1167u, HAL_CameraWriteData(camera, ScratchAddress, &data, 1));
}

TEST_F(FWCameraIO, NothingIsTriedTwice) {
    ASSERT_TRUE(mono.world.AddFault(
        R"({"kind":"failRequest","code":"FW_IOCTL_ASYNC_READ","pended":true})"));
    std::uint32_t data = 0;

    (void)HAL_CameraReadData(camera, ScratchAddress, &data, 1);

    EXPECT_EQ(1u, mono.TakeCodes().size());
}

TEST_F(FWCameraIO, AReadThatIsAnsweredAtOnceStaysInBusOrder) {
    ASSERT_TRUE(mono.world.Poke(ScratchAddress, 0x01020304));
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"answerAtOnce","code":"FW_IOCTL_ASYNC_READ"})"));
    std::uint32_t data = 0;

    ASSERT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(0x04030201u, data);

    ASSERT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(0x01020304u, data);
}

TEST_F(FWCameraIO, AWriteThatIsAnsweredAtOnceIsDone) {
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"answerAtOnce","code":"FW_IOCTL_ASYNC_WRITE"})"));
    const std::uint32_t data = 0x01020304;

    EXPECT_EQ(HALOk, HAL_CameraWriteData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ(data, mono.world.Peek(ScratchAddress));
}

TEST_F(FWCameraIO, AShortAnswerIsASuccess) {
    ASSERT_TRUE(
        mono.world.AddFault(R"({"kind":"shortAnswer","code":"FW_IOCTL_ASYNC_READ","bytes":0})"));
    std::uint32_t data = 0;

    EXPECT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
}

TEST_F(FWCameraIO, AReadThatNeverCompletesEndsWhenTheCameraGoesAway) {
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"neverComplete","code":"FW_IOCTL_ASYNC_READ"})"));
    std::atomic<HALStatus> status{HALUnknownFault};
    std::thread reader([&] {
        std::uint32_t data = 0;
        status = HAL_CameraReadData(camera, ScratchAddress, &data, 1);
    });
    ASSERT_TRUE(WaitUntil([&] { return mono.world.GetState().pendedRequests == 1; }));

    ASSERT_TRUE(mono.world.Unplug());
    reader.join();

    EXPECT_EQ(HALReadFailed, status.load());
}

class AccessUnderWay : public FWCameraIO, public testing::WithParamInterface<const char*> {};

TEST_P(AccessUnderWay, EndsWhenAnotherThreadClosesTheDevice) {
    const bool isRead = std::string_view(GetParam()) == "FW_IOCTL_ASYNC_READ";
    ASSERT_TRUE(mono.world.AddFault(std::string(R"({"kind":"neverComplete","code":")") +
                                    GetParam() + R"("})"));
    std::atomic<HALStatus> status{HALOk};
    std::thread accessor([&, record = *camera]() mutable {
        std::uint32_t data = 0;
        status = isRead ? HAL_CameraReadData(&record, ScratchAddress, &data, 1)
                        : HAL_CameraWriteData(&record, ScratchAddress, &data, 1);
    });
    ASSERT_TRUE(WaitUntil([&] { return mono.world.GetState().pendedRequests == 1; }));

    // What a release does; a disconnect's requests would wait behind the write.
    EXPECT_TRUE(CloseHeldDevice(*GetFWContext(*camera)));
    accessor.join();

    EXPECT_EQ(isRead ? HALReadFailed : HALStatus{995}, status.load());
    EXPECT_EQ(0u, mono.world.GetState().openHandles);
    std::uint32_t data = 0;
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
}

INSTANTIATE_TEST_SUITE_P(Codes, AccessUnderWay,
                         testing::Values("FW_IOCTL_ASYNC_READ", "FW_IOCTL_ASYNC_WRITE"));

TEST_F(FWCameraIO, AccessesFromManyThreadsMeetAnOpenDeviceOrNone) {
    std::atomic<bool> mayEnd{false};
    std::atomic<std::uint32_t> strange{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 3; ++i) {
        threads.emplace_back([&, record = *camera]() mutable {
            while (!mayEnd) {
                std::uint32_t data = 0;
                const HALStatus read = HAL_CameraReadData(&record, ScratchAddress, &data, 1);
                if (read != HALOk && read != HALDeviceNotOpen && read != HALReadFailed) ++strange;
                const HALStatus written = HAL_CameraWriteData(&record, ScratchAddress, &data, 1);
                if (written != HALOk && written != HALDeviceNotOpen && written != HALWriteFailed &&
                    written != 995) {
                    ++strange;
                }
            }
        });
    }

    for (int round = 0; round < 30; ++round) {
        EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
        EXPECT_EQ(HALOk, ConnectPlain(camera, 100));
    }
    mayEnd = true;
    for (std::thread& thread : threads) thread.join();

    EXPECT_EQ(0u, strange.load());
}

TEST_F(FWCameraIO, AReadPassesByAWriteThatIsPended) {
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"neverComplete","code":"FW_IOCTL_ASYNC_WRITE"})"));
    std::atomic<HALStatus> status{HALOk};
    std::thread writer([&] {
        const std::uint32_t value = 1;
        status = HAL_CameraWriteData(camera, ScratchAddress, &value, 1);
    });
    ASSERT_TRUE(WaitUntil([&] { return mono.world.GetState().pendedRequests == 1; }));

    std::uint32_t data = 0;
    EXPECT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));

    ASSERT_TRUE(mono.world.Unplug());
    writer.join();
    EXPECT_EQ(1167u, status.load());
}

TEST_F(FWCameraIO, WritesWaitForEachOther) {
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"neverComplete","code":"FW_IOCTL_ASYNC_WRITE"})"));
    std::atomic<int> ended{0};
    const auto write = [&] {
        const std::uint32_t value = 1;
        (void)HAL_CameraWriteData(camera, ScratchAddress, &value, 1);
        ++ended;
    };
    std::thread first(write);
    ASSERT_TRUE(WaitUntil([&] { return mono.world.GetState().pendedRequests == 1; }));
    const std::uint32_t served = mono.world.GetState().requestsServed;
    std::thread second(write);
    EXPECT_FALSE(WaitUntil([&] { return mono.world.GetState().requestsServed != served; },
                           std::chrono::milliseconds(50)));

    ASSERT_TRUE(mono.world.Unplug());
    first.join();
    second.join();

    EXPECT_EQ(2, ended.load());
}

TEST_F(FWCameraIO, ReadsAndWritesOfManyThreadsKeepTheirDataApart) {
    constexpr std::uint32_t ThreadCount = 4;
    std::vector<std::thread> threads;
    std::atomic<std::uint32_t> wrong{0};
    for (std::uint32_t i = 0; i < ThreadCount; ++i) {
        threads.emplace_back([&, i] {
            for (std::uint32_t k = 0; k < 50; ++k) {
                const std::uint32_t written = i << 16 | k;
                std::uint32_t read = 0;
                const std::uint32_t address = ScratchAddress + 4 * i;
                if (HAL_CameraWriteData(camera, address, &written, 1) != HALOk) ++wrong;
                if (HAL_CameraReadData(camera, address, &read, 1) != HALOk) ++wrong;
                if (read != written) ++wrong;
            }
        });
    }
    for (std::thread& thread : threads) thread.join();

    EXPECT_EQ(0u, wrong.load());
}

const std::string Opening = "\n---\n";

/// Hours, minutes and seconds of two digits, and milliseconds of one to three.
bool IsTime(const std::string& text) {
    const std::string form = "00:00:00.";
    if (text.size() <= form.size() || text.size() > form.size() + 3) return false;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const char wanted = i < form.size() ? form[i] : '0';
        if (wanted == '0' ? text[i] < '0' || text[i] > '9' : text[i] != wanted) return false;
    }
    return true;
}

struct RegisterTrace : FWCameraIO {
    RegisterTrace() {
        (void)HAL_CameraSetShouldOutputReads(0, 0);
        (void)HAL_CameraSetShouldOutputWrites(0, 0);
    }
    ~RegisterTrace() override {
        (void)HAL_CameraSetShouldOutputReads(0, 0);
        (void)HAL_CameraSetShouldOutputWrites(0, 0);
    }

    /// The output with the time of day, if it is one, replaced.
    std::string Take() {
        std::string text = output.Take();
        const std::size_t begin = text.find(Opening);
        if (begin == std::string::npos) return text;
        const std::size_t time = begin + Opening.size();
        const std::size_t end = text.find('\n', time);
        if (IsTime(text.substr(time, end - time))) text.replace(time, end - time, "TIME");
        return text;
    }

    DebuggerOutput output;
};

TEST_F(RegisterTrace, AWriteShowsTheValuesBeforeTheirReversal) {
    ASSERT_EQ(HALOk, HAL_CameraSetShouldOutputWrites(0, 1));
    const std::uint32_t data[] = {0x01020304, 0xA};

    ASSERT_EQ(HALOk, HAL_CameraWriteData(camera, ScratchAddress, data, 2));

    EXPECT_EQ(
        "\n---\nTIME\nAsync write to address 0xd0002010\nLength in bytes: 8\n"
        "Hex data: 01020304 0000000a \n",
        Take());
}

TEST_F(RegisterTrace, ItsSwitchMayChangeWhileOtherThreadsRead) {
    ASSERT_TRUE(mono.world.Poke(ScratchAddress, 0x01020304));
    std::atomic<std::uint32_t> right{0}, wrong{0};
    std::atomic<bool> mayEnd{false};
    const auto readOn = [&] {
        while (!mayEnd) {
            std::uint32_t data = 0;
            const HALStatus status = HAL_CameraReadData(camera, ScratchAddress, &data, 1);
            ++(status == HALOk && data == 0x01020304 ? right : wrong);
        }
    };
    std::thread first(readOn), second(readOn);
    for (std::uint8_t i = 0; i < 100; ++i) {
        EXPECT_EQ(HALOk, HAL_CameraSetShouldOutputReads(0, i % 2));
        const std::uint32_t before = right;
        EXPECT_TRUE(WaitUntil([&] { return right > before || wrong > 0; }));
    }
    EXPECT_EQ(HALOk, HAL_CameraSetShouldOutputReads(0, 0));
    mayEnd = true;
    first.join();
    second.join();

    EXPECT_EQ(0u, wrong.load());
    EXPECT_NE(std::string::npos, output.Take().find("Async read from address"));
    std::uint32_t data = 0;
    EXPECT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
    EXPECT_EQ("", output.Take());
}

TEST_F(RegisterTrace, AReadShowsTheValuesAfterTheirReversal) {
    ASSERT_EQ(HALOk, HAL_CameraSetShouldOutputReads(0, 1));
    ASSERT_TRUE(mono.world.Poke(ScratchAddress, 0x01020304));
    std::uint32_t data = 0;

    ASSERT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));

    EXPECT_EQ(
        "\n---\nTIME\nAsync read from address 0xd0002010\nLength in bytes: 4\n"
        "Hex data: 01020304 \n",
        Take());
}

TEST_F(RegisterTrace, AReadOfNoQuadletsSaysThatNoDataAreAvailable) {
    ASSERT_EQ(HALOk, HAL_CameraSetShouldOutputReads(0, 1));
    std::uint32_t data = 0;

    ASSERT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 0));

    EXPECT_EQ(
        "\n---\nTIME\nAsync read from address 0xd0002010\n"
        "Packet data is not available because the length is 0 bytes.\n\n",
        Take());
}

TEST_F(RegisterTrace, AFailedReadIsPrintedAllTheSame) {
    ASSERT_EQ(HALOk, HAL_CameraSetShouldOutputReads(0, 1));
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ASYNC_READ"})"));
    std::uint32_t data = 7;

    ASSERT_EQ(HALReadFailed, HAL_CameraReadData(camera, ScratchAddress, &data, 1));

    EXPECT_NE(std::string::npos, Take().find("Hex data: 00000007 \n"));
}

TEST_F(RegisterTrace, NullDataArePrintedAsNone) {
    ASSERT_EQ(HALOk, HAL_CameraSetShouldOutputWrites(0, 1));

    ASSERT_EQ(HALNullData, HAL_CameraWriteData(camera, ScratchAddress, nullptr, 1));

    EXPECT_EQ("\n---\nTIME\nAsync write to address 0xd0002010\nLength in bytes: 4\nHex data: \n",
              Take());
}

TEST_F(RegisterTrace, ASwitchWorksOnlyWhileItHoldsExactlyOne) {
    std::uint32_t data = 0;
    for (const std::uint8_t value : std::initializer_list<std::uint8_t>{0, 2, 255}) {
        (void)HAL_CameraSetShouldOutputReads(0, value);
        (void)HAL_CameraSetShouldOutputWrites(0, value);
        EXPECT_EQ(value, GetHalOutputReads());
        EXPECT_EQ(value, GetHalOutputWrites());

        ASSERT_EQ(HALOk, HAL_CameraReadData(camera, ScratchAddress, &data, 1));
        ASSERT_EQ(HALOk, HAL_CameraWriteData(camera, ScratchAddress, &data, 1));
    }

    EXPECT_EQ("", Take());
}

TEST_F(RegisterTrace, ARecordOfNoKindHasAReadTraceButNoWriteTrace) {
    (void)HAL_CameraSetShouldOutputReads(0, 1);
    (void)HAL_CameraSetShouldOutputWrites(0, 1);
    HALCamera stranger = *camera;
    stranger.kind = 2;
    std::uint32_t data = 9;

    EXPECT_EQ(HALOk, HAL_CameraWriteData(&stranger, ScratchAddress, &data, 1));
    EXPECT_EQ("", Take());

    EXPECT_EQ(HALOk, HAL_CameraReadData(&stranger, ScratchAddress, &data, 1));
    EXPECT_NE(std::string::npos, Take().find("Hex data: 00000009 \n"));
    EXPECT_TRUE(mono.TakeCodes().empty());
}

}  // namespace
}  // namespace ZV::Test
