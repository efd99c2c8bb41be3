// Every allocation of a finished image fails once. The world is real but for the allocator: number
// n is refused, for n from 1 until a round comes to its end without it. The client's pixels end
// where an unreadable page begins.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <cstring>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "camera/camera.h"
#include "hal/platform/clock.h"
#include "memory/failing_allocator.h"
#include "support/flat_camera.h"
#include "support/guarded_pages.h"
#include "support/rounds.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

using Bytes = std::vector<std::uint8_t>;

constexpr std::int64_t AllocationsMax = 5'000;  ///< Far above what any round takes.
constexpr int RepeatedMax = 100;
constexpr ZentaraResult GreatestCode = 32;
constexpr std::uint32_t ProbeBytes = 6 * 64 * 48;

struct FinishedWorld {
    const char* name;
    const char* base;
    std::uint32_t imageFormat;
    std::uint32_t finishedFormat;
    bool isMosaic;
};

/// A frame whose pixels end at an unreadable page.
struct EdgeFrame {
    explicit EdgeFrame(std::uint32_t bytes) : pages(1, bytes) {
        record.bufferSize = bytes;
        Clear();
    }
    void Clear() {
        const std::uint32_t bytes = record.bufferSize;
        record = {};
        record.pBuffer = pages.GetEnd(0) - bytes;
        record.bufferSize = bytes;
        std::memset(record.pBuffer, 0, bytes);
    }
    bool Shows(const Bytes& image) const {
        return record.size == image.size() && record.size <= record.bufferSize &&
               std::memcmp(record.pBuffer, image.data(), image.size()) == 0;
    }
    Bytes GetImage() const {
        const auto* const pixels = static_cast<const std::uint8_t*>(record.pBuffer);
        return {pixels, pixels + record.size};
    }

    GuardedPages pages;
    Zentara_Frame record{};
};

/// What the callbacks of a round have told. Takes no memory.
struct HeardCalls {
    static constexpr std::uint32_t Change = 100;

    static void Record(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                       std::uint32_t flags) {
        auto& heard = *reinterpret_cast<HeardCalls*>(static_cast<std::uintptr_t>(userPrivate));
        if (errorCode > GreatestCode) heard.unknownCode = errorCode;
        if (flags == zcbExposeDone) return;
        ++(userData == Change ? heard.changes : heard.frames);
    }
    std::uint64_t GetPrivate() { return reinterpret_cast<std::uintptr_t>(this); }

    std::atomic<std::uint32_t> frames{0}, changes{0}, unknownCode{0};
};

class FinishedImage : public OpenedCamera, public testing::WithParamInterface<FinishedWorld> {
  protected:
    FinishedImage() : OpenedCamera(MakeScenario()) { SetWaitClockDivisor(1000); }
    ~FinishedImage() override { SetWaitClockDivisor(1); }

    static std::string MakeScenario() {
        return R"({"base": ")" + std::string(GetParam().base) +
               R"(", "cameras": [{"sensor": {"width": 64, "height": 48, "noise": false}, )"
               R"("scene": {"kind": "chart", "brightness": 400000}}]})";
    }
    void SetUp() override {
        OpenedCamera::SetUp();
        ASSERT_NE(0U, handle);
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        if (GetParam().isMosaic) FinishSingleFrame();
        Send(true);
        EdgeFrame probe(ProbeBytes);
        ASSERT_ZERR(zerrNone, Grab(probe));
        ASSERT_ZERR(zerrNone, probe.record.errorCode);
        ASSERT_EQ(GetParam().finishedFormat, probe.record.format);
        image = probe.GetImage();
        frame = std::make_unique<EdgeFrame>(
            std::max(static_cast<std::uint32_t>(image.size()), GetImageBytes()));
    }
    void Send(bool isFinished) {
        settings = ReadSettings();
        SetWord(settings, zprmImageFormat, GetParam().imageFormat);
        SetWord(settings, zprmPostProcessImageFormat, GetParam().finishedFormat);
        SetWord(settings, zprmPostProcessBayerAlgorithm, zbayerBicubic);
        SetWord(settings, zprmDoPostProcessing, isFinished ? 1 : 0);
        SetWord(settings, zprmTriggerType, ztrigSoftware);
        for (const std::uint32_t key : {zprm64Exposure, zprm64ExposureRed, zprm64ExposureBlue}) {
            SetWide(settings, key, 2'000'000);
        }
        ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &settings));
    }

    // ---- Single frames ----

    /// A mosaic that ends at an unreadable page, and what it is finished to.
    void FinishSingleFrame() {
        Send(false);
        mosaic = std::make_unique<EdgeFrame>(GetImageBytes());
        ASSERT_ZERR(zerrNone, Grab(*mosaic));
        mosaicImage = mosaic->GetImage();
        finished = std::make_unique<EdgeFrame>(ProbeBytes);
        ASSERT_ZERR(zerrNone, Finish());
        finishedImage = finished->GetImage();
    }
    ZentaraResult Finish() {
        finished->Clear();
        return Zentara_PostProcessSingleFrame(handle, &settings, &mosaic->record,
                                              &finished->record);
    }
    void ExpectSingleFrameIsFinished() {
        if (!GetParam().isMosaic) return;
        EXPECT_ZERR(zerrNone, Finish());
        EXPECT_TRUE(finished->Shows(finishedImage));
        EXPECT_TRUE(mosaic->Shows(mosaicImage)) << "the client's own pixels";
    }

    // ---- Grabs ----

    /// Triggers the stream until the grab of another thread is done.
    void TriggerWhile(const std::atomic<bool>& isGrabbing) {
        const UncountedAllocations uncounted;
        while (isGrabbing) {
            const std::uint64_t before = CountUnheard();
            (void)Zentara_Trigger(handle);
            (void)WaitUntil([&] { return !isGrabbing || CountUnheard() != before; },
                            std::chrono::seconds(2));
        }
    }
    ZentaraResult Grab(EdgeFrame& grabbed, std::int64_t failing = AllocationsMax) {
        grabbed.Clear();
        std::atomic<bool> isBegun{false}, isGrabbing{true};
        std::thread triggering([&] {
            EXPECT_TRUE(WaitUntil([&] { return isBegun.load(); }));
            TriggerWhile(isGrabbing);
        });
        BeginAllocations(failing);
        isBegun = true;
        const ZentaraResult result = Zentara_GrabFrame(handle, &grabbed.record);
        hasRefused = EndAllocations();
        isGrabbing = false;
        triggering.join();
        return result;
    }
    /// Whole, or told to be otherwise; `refusals` counts images that want of memory has left raw.
    void ExpectToldImage() {
        const Zentara_Frame& record = frame->record;
        EXPECT_LE(record.errorCode, GreatestCode);
        EXPECT_LE(record.size, record.bufferSize);
        if (record.errorCode == zerrNone) {
            EXPECT_TRUE(frame->Shows(image));
        }
        if (record.errorCode == zerrBufferTooSmall) ++unfinished;
    }
    void ExpectGoodGrab() {
        EXPECT_ZERR(zerrNone, Grab(*frame));
        EXPECT_ZERR(zerrNone, frame->record.errorCode);
        EXPECT_TRUE(frame->Shows(image));
    }
    void ExpectNothingLost(std::size_t live) {
        const bool isAsBefore =
            WaitUntil([live] { return CountLiveAllocations() == live; }, std::chrono::seconds(10));
        EXPECT_TRUE(isAsBefore) << CountLiveAllocations() << " in place of " << live;
    }

    // ---- Queued frames ----

    const StreamCounters& GetCounters() {
        return reinterpret_cast<ZCamera*>(handle)->GetStreamCounters();
    }
    /// Frames that nobody will hear of. A trigger may come before the grab waits.
    std::uint64_t CountUnheard() {
        const StreamCounters& counters = GetCounters();
        return counters.refused.Get() + counters.bad.Get() + counters.dropped.Get() +
               counters.heldBack.Get() + counters.withoutTaker.GetSum();
    }
    std::uint64_t CountTaken() {
        return GetCounters().delivered.GetSum() - GetCounters().withoutTaker.GetSum();
    }
    template <typename Condition>
    void TriggerUntil(const Condition& isMet) {
        constexpr int TriggersMax = 20;
        for (int i = 0; i < TriggersMax && !isMet(); ++i) {
            const std::uint64_t before = CountUnheard();
            if (Zentara_Trigger(handle) != zerrNone) continue;
            (void)WaitUntil([&] { return isMet() || CountUnheard() != before; },
                            std::chrono::seconds(2));
        }
        EXPECT_TRUE(isMet());
    }
    ZentaraResult Queue(EdgeFrame& queued, std::uint32_t userData) {
        queued.Clear();
        return Zentara_QueueFrame(handle, &queued.record, HeardCalls::Record,
                                  zcbFrameDone | zcbExposeDone, heard.GetPrivate(), userData);
    }
    /// A frame with a change and a further frame behind it; the allocation is one of the first's.
    void StreamWithout(std::int64_t failing) {
        heard.frames = heard.changes = 0;
        EXPECT_ZERR(zerrNone, Queue(*frame, 0));
        EXPECT_ZERR(zerrNone,
                    Zentara_QueueSettings(handle, &settings, HeardCalls::Record, zcbFrameDone,
                                          heard.GetPrivate(), HeardCalls::Change));
        EXPECT_ZERR(zerrNone, Queue(*next, 1));
        BeginAllocations(failing);
        TriggerUntil([&] { return heard.frames >= 1 && heard.changes == 1; });
        hasRefused = EndAllocations();
        TriggerUntil([&] { return heard.frames == 2; });
    }

    Zentara_Settings settings{};
    Bytes image, mosaicImage, finishedImage;
    std::unique_ptr<EdgeFrame> frame, next, mosaic, finished;
    HeardCalls heard;
    bool hasRefused = true;
    int unfinished = 0;
};

TEST_P(FinishedImage, OfAGrabIsWholeOrToldWhicheverAllocationFails) {
    ExpectGoodGrab();
    bool isLast = false;
    int repeated = 0;
    for (std::int64_t failing = 1; !isLast && failing < AllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        const std::size_t live = CountLiveAllocations();
        const std::uint64_t dropped = GetCounters().withoutTaker.GetSum();

        const ZentaraResult result = Grab(*frame, failing);
        isLast = !hasRefused;
        // It was another image that the allocation was refused to.
        if (GetCounters().withoutTaker.GetSum() != dropped && repeated++ < RepeatedMax) --failing;

        EXPECT_LE(result, GreatestCode);
        if (result == zerrNone) ExpectToldImage();
        ExpectSingleFrameIsFinished();
        ExpectGoodGrab();
        ExpectNothingLost(live);
        if (HasFailure()) break;
    }
    EXPECT_TRUE(isLast);
    if (GetParam().isMosaic) {
        EXPECT_LE(2, unfinished) << "for the pixels and for their owner";
    }
    PrintRefusals();
}

TEST_P(FinishedImage, OfAQueuedFrameIsWholeOrToldAndTheChangeBehindItIsMade) {
    next = std::make_unique<EdgeFrame>(frame->record.bufferSize);
    StreamWithout(AllocationsMax);
    ASSERT_FALSE(hasRefused);
    hasRefused = true;
    for (std::int64_t failing = 1; hasRefused && failing < AllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        const std::size_t live = CountLiveAllocations();
        const std::uint64_t taken = CountTaken();

        StreamWithout(failing);

        ExpectToldImage();
        EXPECT_ZERR(zerrNone, next->record.errorCode);
        EXPECT_TRUE(next->Shows(image));
        EXPECT_EQ(0U, heard.unknownCode);
        EXPECT_EQ(2U, CountTaken() - taken);
        ExpectSingleFrameIsFinished();
        ExpectNothingLost(live);
        if (HasFailure()) break;
    }
    EXPECT_FALSE(hasRefused);
    if (GetParam().isMosaic) {
        EXPECT_LE(2, unfinished) << "for the pixels and for their owner";
    }
    PrintRefusals();
}

INSTANTIATE_TEST_SUITE_P(
    Worlds, FinishedImage,
    testing::Values(FinishedWorld{"Bytes", "colour", zfmtBayer8, zfmtRGB24, true},
                    FinishedWorld{"Words", "colour", zfmtBayer16, zfmtRGB48, true},
                    FinishedWorld{"Wheel", "wheel", zfmtRGBPlane8, zfmtRGBPlane8, false}),
    [](const auto& world) { return world.param.name; });

}  // namespace
}  // namespace ZV::Test
