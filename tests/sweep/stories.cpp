#include "sweep/stories.h"

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <mutex>
#include <thread>
#include <utility>

#include "memory/failing_allocator.h"
#include "support/rounds.h"
#include "support/settings_words.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"
#include "sweep/failing_driver.h"

namespace ZV::Test {
namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

/// Patience is counted in spells, so that a machine which stands still for longer uses up one.
constexpr milliseconds Spell(5);
/// How long a client waits for an image that may stay away once something has failed.
constexpr milliseconds ShortPatience(IsSanitized ? 400 : 60);
/// Far more than any story takes.
constexpr milliseconds LongPatience(IsSanitized ? 40'000 : 10'000);
constexpr std::uint64_t ShortExposureNs = 2'000'000;
/// Behind them stands the camera's handle, another with each opening.
constexpr std::size_t SettingsBytesBeforeHandle = 244;
constexpr std::uint32_t TweakOfSubstrate = 0x20000123;

struct WordChoice {
    std::uint32_t key, value;
};
/// None of them a default.
constexpr WordChoice WordChoices[] = {
    {zprmBinning, 2},
    {zprmHorizontalBinning, 2},
    {zprmVerticalBinning, 2},
    {zprmRoiX, 2},
    {zprmRoiY, 2},
    {zprmRoiWidth, Client::Width / 4},
    {zprmRoiHeight, Client::Height / 4},
    {zprmReadoutSpeed, 1},
    {zprmTriggerType, 5},
    {zprmMetronaShutterDelay, 500},
    {zprmFan, 2},
};
constexpr std::uint32_t SwitchWords[] = {
    zprmCoolerActive,        zprmDoubleShot, zprmSyncb,        zprmBlackoutMode,
    zprmHighSensitivityMode, zprmDither,     zprmHighGainMode,
};
/// Their ranges are the model's.
constexpr std::uint32_t RangeWords[] = {zprmEMGain, zprmCloseDelay, zprmVClockPeriod};

bool HasSomethingFailed() {
    return GetFailedCode() != 0 || HasRefusedAllocation();
}

bool IsFrameCode(std::uint32_t code) {
    return code == zerrNone || code == zerrBufferTooSmall || code == zerrFrameIncomplete ||
           code == zerrOutOfSync || code == zerrMissingData;
}

/// The second client that aborts. Its thread stays for the life of the process.
class Aborter {
  public:
    static Aborter& Get() {
        static Aborter* const aborter = new Aborter;
        return *aborter;
    }
    void Arm(const Client& waiting) {
        std::unique_lock lock(mutex);
        client = &waiting;
        isArmed = true;
        hasAborted = false;
        armedAt = Clock::now();
        spells = 0;
        changed.notify_all();
    }
    void Disarm() {
        std::unique_lock lock(mutex);
        isArmed = false;
        changed.wait(lock, [this] { return !isAborting; });
    }
    bool HasAborted() {
        const std::lock_guard hold(mutex);
        return hasAborted;
    }

  private:
    Aborter() : thread([this] { Run(); }) {}

    /// Looked at once in a spell.
    bool HasWaitedEnough() {
        spells = HasSomethingFailed() ? spells + 1 : 0;
        return client->GivesUpAfter(spells * Spell) || Clock::now() - armedAt > LongPatience;
    }
    void Run() {
        const UncountedAllocations uncounted;
        std::unique_lock lock(mutex);
        while (true) {
            changed.wait(lock, [this] { return isArmed; });
            // An abort before the wait for the image does not count, so it is repeated.
            (void)changed.wait_for(lock, Spell, [this] { return !isArmed; });
            if (!isArmed || !HasWaitedEnough()) continue;
            isAborting = hasAborted = true;
            lock.unlock();
            (void)Zentara_Abort(client->GetHandle());
            lock.lock();
            isAborting = false;
            changed.notify_all();
        }
    }

    std::mutex mutex;
    std::condition_variable changed;
    const Client* client = nullptr;
    bool isArmed = false;
    bool isAborting = false, hasAborted = false;
    Clock::time_point armedAt;
    int spells = 0;  ///< Since something failed.
    std::thread thread;
};

}  // namespace

Aborting::Aborting(Client& client) {
    Aborter::Get().Arm(client);
}

Aborting::~Aborting() {
    Aborter::Get().Disarm();
}

bool Aborting::HasAborted() const {
    return Aborter::Get().HasAborted();
}

Client::Client() {
    for (Frame& frame : frames) {
        frame.pixels.assign(BufferBytes + GuardBytes, Guard);
        frame.record.pBuffer = frame.pixels.data();
        frame.record.bufferSize = BufferBytes;
    }
}

void Client::Reset() {
    callCount = 0;
    answers = 0;
    listedCount = 0;
    handle = 0;
    BeginQueue();
    strangeCode = 0;
    for (Frame& frame : frames) {
        frame.record = {};
        frame.record.pBuffer = frame.pixels.data();
        frame.record.bufferSize = BufferBytes;
        std::fill_n(frame.pixels.begin(), BufferBytes, std::uint8_t{0});
    }
}

bool Client::GivesUpAfter(milliseconds waited) const {
    if (waited <= ShortPatience || mayGiveUp == nullptr || !HasSomethingFailed()) return false;
    const UncountedAllocations uncounted;
    return mayGiveUp();
}

ZentaraResult Client::Note(const char* name, ZentaraResult result, bool wasAborted) {
    if (callCount < calls.size()) calls[callCount++] = {name, result, wasAborted};
    return result;
}

void Client::NoteAnswer(const void* bytes, std::size_t count) {
    const std::uint64_t both[] = {answers, CalculateChecksum(bytes, count)};
    answers = CalculateChecksum(both, sizeof both);
}

std::uint64_t Client::GetImage() const {
    const Zentara_Frame& frame = frames[0].record;
    const std::uint64_t parts[] = {
        frame.format, frame.width, frame.height,
        CalculateChecksum(frames[0].pixels.data(), std::min(frame.size, BufferBytes))};
    return CalculateChecksum(parts, sizeof parts);
}

void Client::NoteFrame(const Zentara_Frame& frame) {
    const std::uint32_t told[] = {frame.format, frame.width,        frame.height,   frame.size,
                                  frame.bits,   frame.bayerPattern, frame.errorCode};
    NoteAnswer(told, sizeof told);
    if (frame.pBuffer != nullptr) NoteAnswer(frame.pBuffer, std::min(frame.size, BufferBytes));
}

void Client::Load() {
    (void)Note("Zentara_LoadDriver", Zentara_LoadDriver());
}

void Client::List() {
    listedCount = static_cast<std::uint32_t>(std::size(items));
    const ZentaraResult result =
        Note("Zentara_ListCameras", Zentara_ListCameras(items, &listedCount));
    // A listing that failed may have left the length as it was; a first camera is tried all the
    // same.
    if (result != zerrNone) items[0].cameraId = 0;
    if (result == zerrNone) NoteAnswer(items, listedCount * sizeof items[0]);
}

void Client::Open() {
    if (!HasCamera()) return;
    (void)Note("Zentara_OpenCamera", Zentara_OpenCamera(items[0].cameraId, &handle));
}

void Client::Close() {
    if (!IsOpen()) return;
    (void)Note("Zentara_CloseCamera", Zentara_CloseCamera(handle));
}

void Client::Release() {
    Zentara_ReleaseDriver();
}

void Client::Begin(std::uint32_t imageFormat, std::uint32_t finishedFormat) {
    if (!IsOpen()) return;
    (void)Note("Zentara_ReadDefaultSettings", Zentara_ReadDefaultSettings(handle, &settings));
    // Kept: a register counts as written though its write has failed, and the first setup takes a
    // camera for free-running; values that are in force for the library reach no camera.
    others = settings;
    ChooseOthers(&others);
    (void)Note("Zentara_SendSettingsToCam", Zentara_SendSettingsToCam(handle, &others));
    SetWord(settings, zprmImageFormat, imageFormat);
    if (finishedFormat != 0) {
        SetWord(settings, zprmPostProcessImageFormat, finishedFormat);
        SetWord(settings, zprmDoPostProcessing, 1);
    }
    SetWide(settings, zprm64Exposure, ShortExposureNs);
    SetWide(settings, zprm64ExposureRed, ShortExposureNs);
    SetWide(settings, zprm64ExposureBlue, ShortExposureNs);
    Send();
}

void Client::ReadSettings() {
    (void)Note("Zentara_ReadSettingsFromCam", Zentara_ReadSettingsFromCam(handle, &settings));
    NoteAnswer(&settings, SettingsBytesBeforeHandle);
}

void Client::Send() {
    (void)Note("Zentara_SendSettingsToCam", Zentara_SendSettingsToCam(handle, &settings));
}

/// The other end of the range of a parameter, or its value when the model does not have it.
std::uint32_t Client::ChooseOtherWord(Zentara_Settings* block, std::uint32_t key) const {
    const std::uint32_t value = GetWord(*block, key);
    std::uint32_t least = value, greatest = value;
    if (Zentara_IsParamSupported(handle, key) != zerrNone ||
        Zentara_GetParamMin(block, key, &least) != zerrNone ||
        Zentara_GetParamMax(block, key, &greatest) != zerrNone) {
        return value;
    }
    return value == greatest ? least : greatest;
}

void Client::ChooseOthers(Zentara_Settings* block) const {
    SetWord(*block, zprmImageFormat, GetWord(*block, zprmImageFormat) ^ 1);
    for (const WordChoice& choice : WordChoices) SetWord(*block, choice.key, choice.value);
    for (const std::uint32_t key : SwitchWords) SetWord(*block, key, GetWord(*block, key) ^ 1);
    for (const std::uint32_t key : RangeWords) SetWord(*block, key, ChooseOtherWord(block, key));
    SetSigned(*block, zprmS32NormalizedGaindB, 3'000'000);
    SetSigned(*block, zprmS32AbsoluteOffset, 100);
    SetSigned(*block, zprmS32RegulatedCoolingTemp, -5);
    SetWide(*block, zprm64Exposure, 7'000'000);
    SetWide(*block, zprm64ExposureRed, 8'000'000);
    SetWide(*block, zprm64ExposureBlue, 9'000'000);
    std::uint64_t gain = GetWide(*block, zprm64NormIntensGain);
    if (Zentara_GetParam64Max(block, zprm64NormIntensGain, &gain) == zerrNone) {
        SetWide(*block, zprm64NormIntensGain, gain);
    }
}

void Client::SendOthers() {
    ReadSettings();
    ChooseOthers(&settings);
    Send();
    SetWord(settings, zprmCameraMode, zmodeRealTimeVideo);
    SetWord(settings, zprmRegisterTweak, TweakOfSubstrate);
    Send();
}

void Client::Grab() {
    const Aborting aborting(*this);
    const ZentaraResult result = Zentara_GrabFrame(handle, &frames[0].record);
    (void)Note("Zentara_GrabFrame", result, aborting.HasAborted());
    NoteFrame(frames[0].record);
}

void Client::Serve(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                   std::uint32_t flags) {
    auto* const client = reinterpret_cast<Client*>(static_cast<std::uintptr_t>(userPrivate));
    if (!IsFrameCode(errorCode)) client->strangeCode = errorCode;
    if ((flags & zcbFrameDone) == 0) return;
    if (errorCode != zerrNone) ++client->damaged;
    ++client->served;
}

void Client::ServeChange(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                         std::uint32_t) {
    auto* const client = reinterpret_cast<Client*>(static_cast<std::uintptr_t>(userPrivate));
    ++(errorCode == zerrNone ? client->changed : client->unchanged);
}

Client::StreamOutcome Client::GetStream() const {
    return {queued, served, damaged, changed, unchanged};
}

std::uint32_t Client::GetStrangeFrameCode() const {
    for (const Frame& frame : frames) {
        if (!IsFrameCode(frame.record.errorCode)) return frame.record.errorCode;
    }
    return strangeCode;
}

void Client::BeginQueue() {
    queued = 0;
    served = damaged = 0;
    changed = unchanged = changesDue = 0;
    hasGivenUp = false;
}

void Client::QueueFrame(std::size_t index) {
    const ZentaraResult result = Zentara_QueueFrame(
        handle, &frames[index].record, Serve, zcbFrameDone | zcbExposeDone,
        reinterpret_cast<std::uintptr_t>(this), static_cast<std::uint32_t>(index));
    if (Note("Zentara_QueueFrame", result) == zerrNone) ++queued;
}

void Client::QueueChange(std::size_t index) {
    Zentara_Settings& change = changes[index];
    change = settings;
    SetWide(change, zprm64Exposure, ShortExposureNs * (2 + index));
    (void)Note("Zentara_QueueSettings",
               Zentara_QueueSettings(handle, &change, ServeChange, zcbFrameDone,
                                     reinterpret_cast<std::uintptr_t>(this), 0));
}

void Client::QueueAll() {
    BeginQueue();
    for (std::size_t i = 0; i < frames.size(); ++i) {
        QueueFrame(i);
        if (i % 5 == 4) QueueChange(i / 5);
    }
    changesDue = ChangesDue;
}

void Client::AwaitFrames() {
    std::uint32_t lastCome = 0;
    int spells = 0;
    auto spellBegan = Clock::now();
    // What was asked for may be dropped for good once something has failed.
    (void)WaitUntil(
        [&] {
            const std::uint32_t changes = changed + unchanged;
            if (served >= queued && changes >= changesDue) return true;
            if (std::exchange(lastCome, served + changes) != served + changes) spells = 0;
            if (Clock::now() - spellBegan < Spell) return false;
            spellBegan = Clock::now();
            const milliseconds waited = ++spells * Spell;
            hasGivenUp = GivesUpAfter(waited);
            return hasGivenUp || waited > LongPatience;
        },
        2 * LongPatience);
}

void Client::StreamWithChanges() {
    QueueAll();
    (void)Note("Zentara_SetStreaming", Zentara_SetStreaming(handle, 1));
    SetWord(settings, zprmRoiHeight, GetWord(settings, zprmRoiHeight) - 8);
    Send();
    AwaitFrames();
    (void)Note("Zentara_SetStreaming", Zentara_SetStreaming(handle, 0));
    (void)Note("Zentara_Abort", Zentara_Abort(handle));
}

void Client::StartStream() {
    QueueAll();
    (void)Note("Zentara_SetStreaming", Zentara_SetStreaming(handle, 1));
}

void Client::StreamShortly() {
    constexpr std::size_t Count = 4;
    BeginQueue();
    for (std::size_t i = 0; i < Count; ++i) QueueFrame(i);
    (void)Note("Zentara_SetStreaming", Zentara_SetStreaming(handle, 1));
    AwaitFrames();
    (void)Note("Zentara_SetStreaming", Zentara_SetStreaming(handle, 0));
    (void)Note("Zentara_Abort", Zentara_Abort(handle));
}

void Client::Balance() {
    SetWord(settings, zprmPostProcessImageFormat, zfmtRGB24);
    SetWord(settings, zprmDoPostProcessing, 1);
    const Aborting aborting(*this);
    Send();
    const ZentaraResult result = Zentara_WhiteBalance(&settings, 0, 0, Width, Height);
    (void)Note("Zentara_WhiteBalance", result, aborting.HasAborted());
}

void Client::Expose() {
    const Aborting aborting(*this);
    const ZentaraResult result = Zentara_AutoExpose(&settings, 0, 0, Width, Height);
    (void)Note("Zentara_AutoExpose", result, aborting.HasAborted());
}

void Client::ReadTables() {
    constexpr std::uint32_t Keys[] = {zprmReadoutSpeed, zprmTriggerType, zprmImageFormat};
    for (const std::uint32_t key : Keys) {
        std::uint32_t table[64];
        auto size = static_cast<std::int32_t>(std::size(table));
        (void)Note("Zentara_GetParamSparseTable",
                   Zentara_GetParamSparseTable(&settings, key, table, &size));
        const auto told = std::min(static_cast<std::size_t>(size), std::size(table));
        NoteAnswer(table, told * sizeof table[0]);
    }
    (void)Note("Zentara_PreflightSettings", Zentara_PreflightSettings(handle, &settings));
    NoteAnswer(&settings, SettingsBytesBeforeHandle);
}

void Client::Finish() {
    ReadTables();
    const Zentara_Frame& grabbed = frames[0].record;
    const bool isDeep = Zentara_is16bit(grabbed.format) != 0;
    SetWord(settings, zprmPostProcessImageFormat, isDeep ? zfmtRGB48 : zfmtRGB24);
    SetWord(settings, zprmPostProcessBayerAlgorithm, zbayerBicubicFaster);
    Zentara_Frame copied{};
    (void)Note("Zentara_PostProcessSingleFrame",
               Zentara_PostProcessSingleFrame(handle, &settings, &grabbed, &copied));
    NoteFrame(copied);
    std::free(copied.pBuffer);
    (void)Note("Zentara_PostProcessSingleFrame",
               Zentara_PostProcessSingleFrame(handle, &settings, &grabbed, &frames[1].record));
    frames[2].record.format = isDeep ? zfmtRGB48 : zfmtXRGB32;
    (void)Note("Zentara_BayerToRgb",
               Zentara_BayerToRgb(zbayerBicubicFaster, &grabbed, &frames[2].record));
    frames[3].record.height = 2 * grabbed.height;
    (void)Note("Zentara_BayerZoomVert",
               Zentara_BayerZoomVert(zbayerFast, &grabbed, &frames[3].record));
    NoteFrame(frames[3].record);
}

Client::FinishedFrames Client::GetFinished() const {
    return {CalculateChecksum(frames[1].pixels.data(), BufferBytes),
            CalculateChecksum(frames[2].pixels.data(), BufferBytes)};
}

bool Client::HasFrameWithError() const {
    return std::any_of(frames.begin(), frames.end(),
                       [](const Frame& frame) { return frame.record.errorCode != zerrNone; });
}

bool Client::HasFramesInOrder() const {
    return std::all_of(frames.begin(), frames.end(), [](const Frame& frame) {
        const auto guards = frame.pixels.end() - static_cast<std::ptrdiff_t>(GuardBytes);
        return frame.record.pBuffer == frame.pixels.data() && frame.record.size <= BufferBytes &&
               std::all_of(guards, frame.pixels.end(), [](auto byte) { return byte == Guard; });
    });
}

void Client::TakeEveryLock() {
    if (!IsOpen()) return;
    (void)Note("Zentara_QueueSettings", Zentara_QueueSettings(handle, nullptr, nullptr, 0, 0, 0));
    (void)Note("Zentara_Abort", Zentara_Abort(handle));
    (void)Note("Zentara_SetStreaming", Zentara_SetStreaming(handle, 0));
}

const Story Stories[10] = {
    {"load", Stage::Unloaded, [](Client& client) { client.Load(); }, Stage::Loaded, true},
    {"list", Stage::Loaded,
     [](Client& client) {
         client.List();
         client.Open();
     },
     Stage::Opened, true},
    {"send", Stage::Opened, [](Client& client) { client.SendOthers(); }, Stage::Opened, true},
    {"grab", Stage::Opened, [](Client& client) { client.Grab(); }, Stage::Opened, true},
    {"stream", Stage::Opened, [](Client& client) { client.StreamWithChanges(); }, Stage::Opened,
     false},
    {"balance", Stage::Opened, [](Client& client) { client.Balance(); }, Stage::Opened, false},
    {"expose", Stage::Opened, [](Client& client) { client.Expose(); }, Stage::Opened, false},
    {"finish", Stage::Grabbed, [](Client& client) { client.Finish(); }, Stage::Opened, true},
    {"close", Stage::Streaming, [](Client& client) { client.Close(); }, Stage::Loaded, false},
    {"release", Stage::Streaming, [](Client& client) { client.Release(); }, Stage::Unloaded, false},
};

}  // namespace ZV::Test
