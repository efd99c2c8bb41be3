#include "stress/stressed_camera.h"

#include "support/settings_words.h"

namespace ZV::Test {

namespace {

constexpr std::uint32_t InfoKeysEnd = 41;
/// They have no answer and tell it on the console.
constexpr std::uint32_t SilentKeys[] = {zinfReserved27, zinfReserved28, zinfReserved35};

std::uint64_t GetPrivate(StressedCamera& camera) {
    return reinterpret_cast<std::uintptr_t>(&camera);
}

StressedCamera& GetStressed(std::uint64_t userPrivate) {
    return *reinterpret_cast<StressedCamera*>(static_cast<std::uintptr_t>(userPrivate));
}

void SendFromCallback(StressedCamera& camera, SplitMix& numbers) {
    Zentara_Settings block = DrawChange(camera.start, numbers);
    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(camera.handle, &block));
}

/// What a callback of either kind may do; the seventh and the eighth do nothing.
void CallBack(StressedCamera& camera, std::uint32_t flags) {
    if (!camera.isBusy) return;
    SplitMix numbers(camera.callbackTurns++);
    switch (numbers.DrawBelow(8)) {
        case 0:
            ReadStressedCamera(camera);
            break;
        case 1:
            AskForInformation(camera);
            break;
        case 2:
            SendFromCallback(camera, numbers);
            break;
        case 3:
            QueueStressChange(camera, numbers);
            break;
        case 4:
        case 5:
            if (flags == zcbExposeDone) TriggerStressedCamera(camera);
            break;
        default:
            break;
    }
}

}  // namespace

Zentara_Frame* Handouts::MakeFrame() {
    auto buffer = std::make_unique<FrameBuffer>();
    buffer->pixels.resize(StressFrameBytes);
    buffer->frame.pBuffer = buffer->pixels.data();
    buffer->frame.bufferSize = StressFrameBytes;
    const std::lock_guard hold(mutex);
    return &frames.emplace_back(std::move(buffer))->frame;
}

Zentara_Settings* Handouts::Keep(const Zentara_Settings& block) {
    const std::lock_guard hold(mutex);
    return &blocks.emplace_back(block);
}

Zentara_Settings DrawChange(const Zentara_Settings& start, SplitMix& numbers) {
    Zentara_Settings block = start;
    SetWide(block, zprm64Exposure, 1000000 * (1 + numbers.DrawBelow(5)));
    SetSigned(block, zprmS32AbsoluteOffset, static_cast<std::int32_t>(numbers.DrawBelow(60)));
    SetWord(block, zprmDoPostProcessing, numbers.DrawBelow(2));
    SetWord(block, zprmPostProcessGainRed, 800 + 100 * numbers.DrawBelow(8));
    SetWord(block, zprmPostProcessGainBlue, 800 + 100 * numbers.DrawBelow(8));
    SetWord(block, zprmPostProcessBayerAlgorithm, 1 + numbers.DrawBelow(4));
    SetWord(block, zprmPostProcessImageFormat, zfmtBGR24 + numbers.DrawBelow(5));
    return block;
}

Zentara_Settings DrawGeometry(const Zentara_Settings& start, SplitMix& numbers) {
    Zentara_Settings block = DrawChange(start, numbers);
    const std::uint32_t binning = 1 + numbers.DrawBelow(2);
    for (const std::uint32_t key : {zprmBinning, zprmHorizontalBinning, zprmVerticalBinning}) {
        SetWord(block, key, binning);
    }
    SetWord(block, zprmRoiX, 8 * numbers.DrawBelow(2));
    SetWord(block, zprmRoiY, 8 * numbers.DrawBelow(2));
    SetWord(block, zprmRoiWidth, 16 + 8 * numbers.DrawBelow(3));
    SetWord(block, zprmRoiHeight, 24);
    // Any format for any camera: what is not its own sets the depth, or starts the wheel.
    SetWord(block, zprmImageFormat, numbers.DrawBelow(zfmtRGB24 + 1));
    SetWord(block, zprmReadoutSpeed, numbers.DrawOneOf(3) ? zspeed10MHz : zspeed20MHz);
    SetWord(block, zprmTriggerType, numbers.DrawOneOf(3) ? ztrigSoftware : ztrigFreeRun);
    SetWord(block, zprmCameraMode, numbers.DrawOneOf(6) ? zmodeRealTimeVideo : zmodeStandard);
    return block;
}

ZentaraResult QueueStressFrame(StressedCamera& camera, std::uint32_t flags) {
    return Zentara_QueueFrame(camera.handle, camera.handouts->MakeFrame(), Serve, flags,
                              GetPrivate(camera), 0);
}

void QueueStressChange(StressedCamera& camera, SplitMix& numbers) {
    Zentara_Settings block = camera.start;
    Zentara_Settings drawn = DrawChange(camera.start, numbers);
    EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(camera.handle, &block));
    for (const std::uint32_t key : {zprmRoiX, zprmRoiY, zprmRoiWidth, zprmRoiHeight, zprmBinning,
                                    zprmHorizontalBinning, zprmVerticalBinning, zprmImageFormat,
                                    zprmReadoutSpeed, zprmTriggerType, zprmCameraMode}) {
        SetWord(drawn, key, GetWord(block, key));
    }
    const ZentaraResult result =
        Zentara_QueueSettings(camera.handle, camera.handouts->Keep(drawn), ServeChange,
                              zcbFrameDone, GetPrivate(camera), 0);
    // A change of the geometry by another client makes the block one that does not fit.
    ExpectOneOf(result, {zerrNone, zerrQueueFull, zerrBadSettings});
    if (result == zerrNone) ++camera.changesTaken;
}

void Serve(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t flags) {
    StressedCamera& camera = GetStressed(userPrivate);
    ++(flags == zcbExposeDone ? camera.exposures : camera.delivered);
    CallBack(camera, flags);
    if (flags == zcbExposeDone || camera.refills.fetch_sub(1) <= 0) return;
    ExpectOneOf(QueueStressFrame(camera, zcbFrameDone | zcbExposeDone), {zerrNone, zerrQueueFull});
}

void ServeChange(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode, std::uint32_t) {
    StressedCamera& camera = GetStressed(userPrivate);
    EXPECT_ZERR(zerrNone, errorCode);
    ++camera.changesMade;
    AskForInformation(camera);
}

void AskForInformation(const StressedCamera& camera) {
    for (std::uint32_t key = 0; key < InfoKeysEnd; ++key) {
        if (std::ranges::count(SilentKeys, key) != 0) continue;
        std::uint32_t value = 0;
        ExpectOneOf(Zentara_GetInfo(camera.handle, key, &value), {zerrNone, zerrNotSupported});
    }
    std::uint32_t width = 0;
    EXPECT_ZERR(zerrNone, Zentara_GetInfo(camera.handle, zinfCcdWidth, &width));
    EXPECT_EQ(StressWidth, width);
}

void ReadStressedCamera(const StressedCamera& camera) {
    Zentara_Settings block{};
    EXPECT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(camera.handle, &block));
    EXPECT_ZERR(zerrNone, Zentara_ReadDefaultSettings(camera.handle, &block));
    EXPECT_EQ(camera.handle, GetHandleOf(block));
}

void TriggerStressedCamera(StressedCamera& camera) {
    const ZentaraResult result = Zentara_Trigger(camera.handle);
    ExpectOneOf(result, {zerrNone, zerrNotStreaming, zerrNotSupported});
    if (result == zerrNone) ++camera.triggers;
}

}  // namespace ZV::Test
