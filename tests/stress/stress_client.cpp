#include "stress/stress_client.h"

#include <array>
#include <iterator>
#include <vector>

#include "support/settings_words.h"

namespace ZV::Test {

namespace {

constexpr std::uint32_t WordKeys = 47, SignedKeys = 3, WideKeys = 4;
constexpr std::uint32_t ExposeImagesMax = 10, BalanceImagesMax = 6;
constexpr int TriggersBehindASend = 3;
constexpr std::uint32_t ReadConfigurationBlock = 2;

template <typename Value>
using Accessor = ZentaraResult (*)(Zentara_Settings*, std::uint32_t, Value*);

template <typename Value>
void GetParameters(Zentara_Settings& block, std::uint32_t keys,
                   std::initializer_list<Accessor<Value>> accessors) {
    for (std::uint32_t key = 0; key < keys; ++key) {
        for (const Accessor<Value> get : accessors) {
            Value value{};
            ExpectOneOf(get(&block, key, &value), {zerrNone, zerrNotSupported});
        }
    }
}

void AskWhetherSupported(ZentaraHandle handle) {
    for (std::uint32_t key = 0; key < WordKeys; ++key) {
        ExpectOneOf(Zentara_IsParamSupported(handle, key), {zerrNone, zerrNotSupported});
    }
    EXPECT_ZERR(zerrNone, Zentara_IsParamS32Supported(handle, zprmS32AbsoluteOffset));
    EXPECT_ZERR(zerrNone, Zentara_IsParam64Supported(handle, zprm64Exposure));
}

}  // namespace

// What a client does often stands more than once.
const StressClient::Step StressClient::Steps[] = {&StressClient::QueueFrame,
                                                  &StressClient::QueueFrame,
                                                  &StressClient::QueueFrame,
                                                  &StressClient::QueueFrame,
                                                  &StressClient::QueueFrame,
                                                  &StressClient::QueueSettings,
                                                  &StressClient::QueueSettings,
                                                  &StressClient::Send,
                                                  &StressClient::Send,
                                                  &StressClient::SendGeometry,
                                                  &StressClient::Switch,
                                                  &StressClient::SwitchOn,
                                                  &StressClient::SwitchOn,
                                                  &StressClient::Abort,
                                                  &StressClient::Grab,
                                                  &StressClient::Trigger,
                                                  &StressClient::Trigger,
                                                  &StressClient::Trigger,
                                                  &StressClient::Read,
                                                  &StressClient::Ask,
                                                  &StressClient::Preflight,
                                                  &StressClient::AskForTexts,
                                                  &StressClient::UseParameters,
                                                  &StressClient::UseTables,
                                                  &StressClient::CallWhatIsIgnored,
                                                  &StressClient::ReadConfiguration,
                                                  &StressClient::CalculateSizes,
                                                  &StressClient::ProcessGrab,
                                                  &StressClient::ConvertGrab,
                                                  &StressClient::Expose,
                                                  &StressClient::Balance};

StressClient::StressClient(std::span<StressedCamera> stressed, std::uint64_t first)
    : cameras(stressed), seed(first) {}

void StressClient::TakeStep() {
    numbers = SplitMix(SplitMix(seed).Draw() + stepsTaken++);
    StressedCamera& camera = cameras[numbers.DrawBelow(static_cast<std::uint32_t>(cameras.size()))];
    const std::uint32_t step = numbers.DrawBelow(static_cast<std::uint32_t>(std::size(Steps)));
    (this->*Steps[step])(camera);
    // The next number differs when a call has changed how many its step drew.
    plan = plan * 31 + numbers.Draw();
}

void StressClient::QueueFrame(StressedCamera& camera) {
    camera.refills = static_cast<int>(numbers.DrawBelow(8));
    const std::uint32_t flags = numbers.DrawOneOf(2) ? zcbFrameDone : zcbFrameDone | zcbExposeDone;
    ExpectOneOf(QueueStressFrame(camera, flags), {zerrNone, zerrQueueFull});
}

void StressClient::QueueSettings(StressedCamera& camera) {
    QueueStressChange(camera, numbers);
}

void StressClient::Send(StressedCamera& camera) {
    Zentara_Settings block = DrawChange(camera.start, numbers);
    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(camera.handle, &block));
}

void StressClient::SendGeometry(StressedCamera& camera) {
    Zentara_Settings block = DrawGeometry(camera.start, numbers);
    const bool isSoftware = GetWord(block, zprmTriggerType) == ztrigSoftware;
    EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(camera.handle, &block));
    // A camera that waits for its trigger gives the others no image.
    for (int i = 0; isSoftware && i < TriggersBehindASend; ++i) TriggerStressedCamera(camera);
}

void StressClient::Switch(StressedCamera& camera) {
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(camera.handle, numbers.DrawBelow(2)));
}

void StressClient::SwitchOn(StressedCamera& camera) {
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(camera.handle, 1));
}

void StressClient::Abort(StressedCamera& camera) {
    ++camera.aborts;
    EXPECT_ZERR(zerrNone, Zentara_Abort(camera.handle));
}

/// Null when there was no image: the rescue, or another client, has aborted.
Zentara_Frame* StressClient::GrabInto(StressedCamera& camera) {
    Zentara_Frame* frame = camera.handouts->MakeFrame();
    const ZentaraResult result = Zentara_GrabFrame(camera.handle, frame);
    ExpectOneOf(result, {zerrNone, zerrBusy, zerrDriverFault});
    if (result != zerrNone) return nullptr;
    ++camera.grabs;
    return frame;
}

void StressClient::Grab(StressedCamera& camera) {
    (void)GrabInto(camera);
}

void StressClient::Trigger(StressedCamera& camera) {
    TriggerStressedCamera(camera);
}

void StressClient::Read(StressedCamera& camera) {
    ReadStressedCamera(camera);
}

void StressClient::Ask(StressedCamera& camera) {
    AskForInformation(camera);
    AskWhetherSupported(camera.handle);
}

void StressClient::Preflight(StressedCamera& camera) {
    Zentara_Settings block = DrawGeometry(camera.start, numbers);
    EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(camera.handle, &block));
}

void StressClient::AskForTexts(StressedCamera& camera) {
    std::array<char, 64> text{};
    EXPECT_ZERR(zerrNone, Zentara_GetSerialString(camera.handle, text.data(), text.size()));
    EXPECT_ZERR(zerrNone, Zentara_GetCameraModelString(camera.handle, text.data(), text.size()));
}

void StressClient::UseParameters(StressedCamera& camera) {
    Zentara_Settings block = DrawGeometry(camera.start, numbers);
    GetParameters<std::uint32_t>(block, WordKeys,
                                 {Zentara_GetParam, Zentara_GetParamMin, Zentara_GetParamMax});
    GetParameters<std::int32_t>(
        block, SignedKeys, {Zentara_GetParamS32, Zentara_GetParamS32Min, Zentara_GetParamS32Max});
    GetParameters<std::uint64_t>(
        block, WideKeys, {Zentara_GetParam64, Zentara_GetParam64Min, Zentara_GetParam64Max});
    const std::uint32_t key = numbers.DrawBelow(WordKeys);
    ExpectOneOf(Zentara_SetParam(&block, key, numbers.DrawBelow(100)),
                {zerrNone, zerrNotSupported, zerrBadParameter});
    EXPECT_ZERR(zerrNone, Zentara_SetParamS32(&block, zprmS32AbsoluteOffset, 1));
    EXPECT_ZERR(zerrNone, Zentara_SetParam64(&block, zprm64Exposure, 2000000));
}

void StressClient::UseTables(StressedCamera& camera) {
    Zentara_Settings block = camera.start;
    std::array<std::uint32_t, 64> words{};
    for (std::uint32_t key = 0; key < WordKeys; ++key) {
        auto size = static_cast<std::int32_t>(words.size());
        ExpectOneOf(Zentara_IsRangeTable(&block, key), {zerrNone, zerrNotSupported});
        ExpectOneOf(Zentara_IsSparseTable(&block, key), {zerrNone, zerrNotSupported});
        ExpectOneOf(Zentara_GetParamSparseTable(&block, key, words.data(), &size),
                    {zerrNone, zerrNotSupported});
    }
    std::int32_t size = 1, entry = 0;
    std::uint64_t wideEntry = 0;
    EXPECT_ZERR(zerrNotSupported,
                Zentara_GetParamSparseTableS32(&block, zprmS32AbsoluteOffset, &entry, &size));
    EXPECT_ZERR(zerrNotSupported,
                Zentara_GetParamSparseTable64(&block, zprm64Exposure, &wideEntry, &size));
    EXPECT_ZERR(zerrNone, Zentara_IsRangeTableS32(&block, zprmS32AbsoluteOffset));
    EXPECT_ZERR(zerrNone, Zentara_IsRangeTable64(&block, zprm64Exposure));
    EXPECT_ZERR(zerrNotSupported, Zentara_IsSparseTableS32(&block, zprmS32AbsoluteOffset));
    EXPECT_ZERR(zerrNotSupported, Zentara_IsSparseTable64(&block, zprm64Exposure));
}

void StressClient::CallWhatIsIgnored(StressedCamera& camera) {
    Zentara_Settings block = camera.start;
    Zentara_Frame* const frame = camera.handouts->MakeFrame();
    EXPECT_ZERR(zerrNone, Zentara_RegisterUnpluggedCallback(camera.handle, nullptr, 0));
    EXPECT_ZERR(zerrNotSupported, Zentara_TranslateSettings(camera.handle, &block));
    EXPECT_ZERR(zerrNotSupported, Zentara_GrabFrameNow(camera.handle, frame));
    EXPECT_ZERR(zerrNotSupported, Zentara_GrabRawNow(camera.handle, frame));
    EXPECT_ZERR(zerrNotSupported, Zentara_ProcessRaw(camera.handle, frame));
    EXPECT_ZERR(zerrNotSupported, Zentara_SetFrameBuffers(camera.handle, frame));
    std::uint16_t major = 0, minor = 0, build = 0;
    EXPECT_ZERR(zerrNone, Zentara_Version(&major, &minor));
    EXPECT_ZERR(zerrNone, Zentara_LibVersion(&major, &minor, &build));
}

void StressClient::ReadConfiguration(StressedCamera& camera) {
    std::array<std::uint32_t, 64> quadlets{};
    EXPECT_ZERR(zerrNone, _Zentara_factory_reserved0(camera.handle, ReadConfigurationBlock,
                                                     quadlets.data(), quadlets.size(), 0));
}

void StressClient::CalculateSizes(StressedCamera&) {
    const std::uint32_t format = numbers.DrawBelow(zfmtRGB24 + 1);
    const std::uint64_t bytes = Zentara_CalcImageSize(format, StressWidth, StressHeight);
    EXPECT_NE(0U, bytes);
    EXPECT_LE(bytes, StressFrameBytes);
    EXPECT_EQ(1U, Zentara_isColor(format) + Zentara_isMonochrome(format) + (format <= zfmtRaw16));
    EXPECT_EQ(Zentara_isColor(format), Zentara_is3Color(format) + Zentara_isBayer(format));
    EXPECT_LE(Zentara_is16bit(format), 1U);
}

void StressClient::ProcessGrab(StressedCamera& camera) {
    Zentara_Settings block = DrawChange(camera.start, numbers);
    const Zentara_Frame* const frame = GrabInto(camera);
    if (frame == nullptr) return;
    EXPECT_ZERR(zerrNone, Zentara_PostProcessSingleFrame(camera.handle, &block, frame,
                                                         camera.handouts->MakeFrame()));
}

void StressClient::ConvertGrab(StressedCamera& camera) {
    const std::uint32_t algorithm = 1 + numbers.DrawBelow(4);
    const std::uint32_t format = zfmtBGR24 + numbers.DrawBelow(5);
    const Zentara_Frame* const frame = GrabInto(camera);
    if (frame == nullptr) return;
    Zentara_Frame* const colours = camera.handouts->MakeFrame();
    colours->format = format;
    EXPECT_ZERR(zerrNone, Zentara_BayerToRgb(algorithm, frame, colours));
    Zentara_Frame* const tall = camera.handouts->MakeFrame();
    tall->height = 2 * frame->height;
    EXPECT_ZERR(zerrNone, Zentara_BayerZoomVert(zbayerFast, frame, tall));
}

// They grab image after image; a client that ends the stream, or aborts, ends them with a code.
void StressClient::Expose(StressedCamera& camera) {
    Zentara_Settings block = DrawChange(camera.start, numbers);
    if (!numbers.DrawOneOf(4)) return;
    camera.measured += ExposeImagesMax;
    EXPECT_ZERR(zerrNone, Zentara_AutoExpose(&block, 0, 0, 16, 16));
}

void StressClient::Balance(StressedCamera& camera) {
    Zentara_Settings block = DrawChange(camera.start, numbers);
    if (!numbers.DrawOneOf(4)) return;
    camera.measured += BalanceImagesMax;
    ExpectOneOf(Zentara_WhiteBalance(&block, 0, 0, 16, 16), {zerrNone, zerrDriverFault});
}

}  // namespace ZV::Test
