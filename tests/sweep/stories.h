#pragma once

#include <array>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <string_view>
#include <utility>
#include <vector>

#include "zentara/zentara.h"

namespace ZV::Test {

/// A client of the first camera of a world, with all that its calls need taken beforehand: while a
/// story runs, only the library allocates.
class Client {
  public:
    static constexpr std::uint32_t Width = 64;
    static constexpr std::uint32_t Height = 48;
    static constexpr std::size_t FrameCount = 20;
    /// Of the four changes of a stream. Kept: the one behind the last frame waits for an exposure
    /// that may not come.
    static constexpr std::uint32_t ChangesDue = 3;

    struct Call {
        const char* name;
        ZentaraResult result;
        bool wasAborted;  ///< It waited for an image that did not come.
    };
    /// What became of the queued frames of a stream and of the changes among them.
    struct StreamOutcome {
        std::uint32_t queued = 0, served = 0;
        std::uint32_t damaged = 0;                 ///< Of those served.
        std::uint32_t changed = 0, unchanged = 0;  ///< By the changes' own callbacks.
    };

    Client();
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;

    /// Forgets the last round. Nothing of the library may know of it any more.
    void Reset();

    /// Asked by who waits for an image in vain once something has failed: whether it may stay away.
    /// Null: nothing may. May be asked by a thread of its own; in a story that waits for queued
    /// frames by the caller's alone.
    void SetGivingUp(std::function<bool()> mayGiveUpNow) { mayGiveUp = std::move(mayGiveUpNow); }
    /// Who does not give up waits for as long as any story takes.
    bool GivesUpAfter(std::chrono::milliseconds waited) const;
    /// Whether it has given up the frames that were queued last.
    bool HasGivenUp() const { return hasGivenUp; }

    void Load();
    /// The first camera of the list, or none.
    void List();
    void Open();
    void Close();
    void Release();

    /// Puts an image format and a short exposure in force, all else by default. Whatever the camera
    /// was left with, each of its registers is written: other values come first.
    /// `finishedFormat` is that of post-processing, which is off when there is none.
    void Begin(std::uint32_t imageFormat, std::uint32_t finishedFormat);
    void ReadSettings();
    void Send();
    /// A send of values that all differ from those in force, as far as the model has more than one,
    /// and one that turns on real-time video and tweaks a register.
    void SendOthers();
    void Grab();
    /// Queues all frames with settings changes among them, streams, changes what stops the stream,
    /// and waits for the frames.
    void StreamWithChanges();
    void StartStream();
    /// A few queued frames and no changes.
    void StreamShortly();
    void Balance();
    void Expose();

    /// Lists of allowed values, and a block that is mended.
    void ReadTables();
    /// These, and the calls that finish a single frame, on the one that was grabbed last.
    void Finish();

    /// Calls for which locks must be free: they return. `deliveryLock`, `queueLock`, `streamLock`;
    /// an image through the same camera takes the rest.
    void TakeEveryLock();

    bool HasCamera() const { return listedCount != 0; }
    bool IsOpen() const { return handle != 0; }
    ZentaraHandle GetHandle() const { return handle; }
    /// What the calls answered since Reset.
    std::size_t CountCalls() const { return callCount; }
    const Call& GetCall(std::size_t index) const { return calls[index]; }
    /// A code that no frame ends with, of a frame or of its callback since Reset, or 0.
    std::uint32_t GetStrangeFrameCode() const;
    /// Nothing was written behind any buffer, and no frame says that it is longer than its own.
    bool HasFramesInOrder() const;
    const Zentara_Frame& GetGrabbed() const { return frames[0].record; }
    /// A checksum of the grabbed frame but for its number.
    std::uint64_t GetImage() const;
    bool HasFrameWithError() const;
    /// Of the last stream.
    StreamOutcome GetStream() const;
    /// A checksum of what the calls have handed out since Reset beside their results: lists,
    /// settings, tables and images, without the numbers of the frames.
    std::uint64_t GetAnswers() const { return answers; }
    /// Checksums of the frames that two calls for single frames have made, whose failure no code
    /// tells.
    using FinishedFrames = std::array<std::uint64_t, 2>;
    FinishedFrames GetFinished() const;

  private:
    static constexpr std::size_t CallsMax = 256;
    /// Room for four words of two bytes a pixel.
    static constexpr std::uint32_t BufferBytes = Width * Height * 8;
    static constexpr std::size_t GuardBytes = 64;
    static constexpr std::uint8_t Guard = 0xA5;
    struct Frame {
        Zentara_Frame record{};
        std::vector<std::uint8_t> pixels;
    };

    void ChooseOthers(Zentara_Settings* block) const;
    std::uint32_t ChooseOtherWord(Zentara_Settings* block, std::uint32_t key) const;
    ZentaraResult Note(const char* name, ZentaraResult result, bool wasAborted = false);
    void NoteAnswer(const void* bytes, std::size_t count);
    void NoteFrame(const Zentara_Frame& frame);
    static void Serve(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                      std::uint32_t flags);
    static void ServeChange(std::uint64_t userPrivate, std::uint32_t userData,
                            std::uint32_t errorCode, std::uint32_t flags);
    void BeginQueue();
    void QueueFrame(std::size_t index);
    void QueueChange(std::size_t index);
    void QueueAll();
    void AwaitFrames();

    std::array<Call, CallsMax> calls{};
    std::size_t callCount = 0;
    std::uint64_t answers = 0;
    Zentara_CamListItem items[4] = {};
    std::uint32_t listedCount = 0;
    ZentaraHandle handle = 0;
    Zentara_Settings settings{};
    Zentara_Settings others{};
    std::array<Zentara_Settings, 4> changes{};
    std::array<Frame, FrameCount> frames;
    std::uint32_t queued = 0, changesDue = 0;
    std::function<bool()> mayGiveUp;
    bool hasGivenUp = false;
    std::atomic<std::uint32_t> served{0}, damaged{0};
    std::atomic<std::uint32_t> changed{0}, unchanged{0};
    std::atomic<std::uint32_t> strangeCode{0};
};

/// Where a story begins and ends.
enum class Stage { Unloaded, Loaded, Opened, Grabbed, Streaming };

struct Story {
    std::string_view name;
    Stage begins;
    void (*run)(Client& client);
    Stage ends;           ///< Without a failure.
    bool dependsOnModel;  ///< Goes another way with another model.
};

extern const Story Stories[10];

/// Ends calls that wait for an image that will not come: while it lives, a call that goes on for
/// long after something has failed is aborted, as a client would.
class Aborting {
  public:
    explicit Aborting(Client& client);
    ~Aborting();
    /// Whether it has aborted so far.
    bool HasAborted() const;
    Aborting(const Aborting&) = delete;
    Aborting& operator=(const Aborting&) = delete;
};

}  // namespace ZV::Test
