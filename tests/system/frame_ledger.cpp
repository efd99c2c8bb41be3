#include "system/frame_ledger.h"

#include <gtest/gtest.h>

#include <utility>

#include "support/expect_zerr.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

/// Frame status code of an image and the code that the client gets for it.
struct CodeRow {
    std::uint16_t status;
    std::uint32_t code;
};
constexpr CodeRow Codes[] = {{FrameStatusGood, zerrNone},
                             {FrameStatusMissingData, zerrMissingData},
                             {FrameStatusOutOfSync, zerrOutOfSync},
                             {FrameStatusBufferTooSmall, zerrBufferTooSmall},
                             {FrameStatusIncomplete, zerrFrameIncomplete}};

}  // namespace

std::string MakeLedgerScenario(const std::string& faults, std::uint32_t version) {
    return R"({"timeScale": 0.02, "cameras": [{"model": "SolvaneA1", "streamingVersion": )" +
           std::to_string(version) + R"(, "sensor": {"width": )" + std::to_string(LedgerWidth) +
           R"(, "height": )" + std::to_string(LedgerHeight) + R"(, "colour": "mono"},
           "scene": {"kind": "flat"}, "faults": [)" +
           faults + "]}]}";
}

void CountingClient::Queue(std::size_t count, std::uint32_t bytes) {
    for (std::size_t i = 0; i < count; ++i) {
        DeliveredFrame& delivered = frames.emplace_back();
        delivered.pixels.resize(bytes);
        delivered.frame.pBuffer = delivered.pixels.data();
        delivered.frame.bufferSize = bytes;
        EXPECT_ZERR(zerrNone,
                    Zentara_QueueFrame(session.GetHandle(), &delivered.frame, Receive, zcbFrameDone,
                                       reinterpret_cast<std::uintptr_t>(this), 0));
    }
}

std::map<std::uint32_t, std::uint64_t> CountingClient::CountCodes() const {
    const std::lock_guard hold(mutex);
    return codes;
}

std::uint64_t CountingClient::CountAll() const {
    std::uint64_t sum = 0;
    for (const auto& [code, count] : CountCodes()) sum += count;
    return sum;
}

std::map<std::uint32_t, std::uint64_t> CountingClient::GetWholeChecksums() const {
    std::map<std::uint32_t, std::uint64_t> checksums;
    for (const DeliveredFrame& delivered : frames) {
        if (delivered.frame.frameNumber == 0 || delivered.frame.errorCode != 0) continue;
        checksums[delivered.frame.frameNumber] =
            CalculateChecksum(delivered.pixels.data(), delivered.frame.size);
    }
    return checksums;
}

std::set<std::uint32_t> CountingClient::GetWholeNumbers() const {
    std::set<std::uint32_t> numbers;
    for (const auto& [number, checksum] : GetWholeChecksums()) numbers.insert(number);
    return numbers;
}

void CountingClient::Receive(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                             std::uint32_t) {
    auto& client = *reinterpret_cast<CountingClient*>(userPrivate);
    {
        const std::lock_guard hold(client.mutex);
        ++client.codes[errorCode];
    }
    if (std::exchange(client.hasDawdled, true)) return;
    const StreamCounters& counters = client.session.GetCamera().GetStreamCounters();
    EXPECT_TRUE(WaitUntil([&] { return counters.dropped.Get() > 0; }));
}

std::uint64_t CountSeen(const StreamCounters& counters) {
    return counters.begun.Get() + counters.refused.Get();
}

std::uint64_t SumFates(const StreamCounters& counters) {
    return counters.delivered.GetSum() + counters.heldBack.Get() + counters.dropped.Get() +
           counters.bad.Get() + counters.cleared.Get();
}

bool WaitUntilServed(const CountingClient& client, const StreamCounters& counters,
                     std::uint64_t waiting) {
    return WaitUntil([&] {
        return counters.delivered.GetSum() == client.CountAll() + counters.withoutTaker.GetSum() &&
               counters.begun.Get() <= SumFates(counters) + waiting;
    });
}

void ExpectClientGotWhatWasDelivered(const CountingClient& client, const StreamCounters& counters) {
    auto codes = client.CountCodes();
    for (const CodeRow& row : Codes) {
        EXPECT_EQ(counters.delivered.Get(row.status),
                  codes[row.code] + counters.withoutTaker.Get(row.status))
            << GetZerrName(row.code);
    }
}

void ExpectWholeFramesWereSent(const CountingClient& client, const SimulationWorld& world) {
    std::set<std::uint32_t> sent;
    for (const TraceRecord& record : world.ReadFrames()) sent.insert(record.rollingFrameNumber);
    for (const std::uint32_t number : client.GetWholeNumbers()) {
        EXPECT_EQ(1U, sent.count(number)) << "frame " << number;
    }
}

}  // namespace ZV::Test
