#include "api/delivery.h"

#include "api/camera_context.h"
#include "api/entry_queue.h"
#include "api/event_service.h"
#include "api/exported_call.h"
#include "api/frame_export.h"
#include "api/settings_block.h"
#include "diagnostics/log.h"
#include "imaging/ex_image.h"

// Threads. ExposeDone runs on the camera's exposure thread, ImageReceived on its run loop; client
// threads queue, abort and close meanwhile. The order between the two for one frame is open.
//
// Locks. ExposeDone holds `queueLock`, unless settings are being sent, and gives it back around
// every callback and every send. ImageReceived holds `deliveryLock` throughout and never takes
// `queueLock`. The entry at work is held, so that an abort or an image may take it out of the queue
// meanwhile.
//
// Hand-overs. Each of the two stands in the context's list of services while it works: a frame
// callback waits there for the exposure callback of its frame, and an abort for what was begun
// before it, so that no callback comes late. Changes of settings that the two take out of the queue
// are made one after the other: who has taken the later one waits for the earlier one.

namespace ZV {

namespace {

constexpr const char* ExposeDoneName = "ExposeDone";
constexpr const char* ImageReceivedName = "ImageReceived";

/// Holds an entry of the queue for the length of a block.
class EntryHold {
  public:
    EntryHold(CameraContext& holder, QueueEntry* held) : context(holder), entry(held) {}
    ~EntryHold() { LetGoOfEntry(context, entry); }
    EntryHold(const EntryHold&) = delete;
    EntryHold& operator=(const EntryHold&) = delete;

    explicit operator bool() const { return entry != nullptr; }
    QueueEntry& operator*() const { return *entry; }
    QueueEntry* operator->() const { return entry; }

  private:
    CameraContext& context;
    QueueEntry* entry;
};

/// `queueLock` of ExposeDone: taken unless settings are being sent, whose thread holds it already.
class QueueHold {
  public:
    explicit QueueHold(CameraContext& context)
        : queueLock(*context.queueLock), isHeld(context.sendInProgress == 0) {
        Retake();
    }
    ~QueueHold() { GiveBack(); }
    QueueHold(const QueueHold&) = delete;
    QueueHold& operator=(const QueueHold&) = delete;

    /// Runs `action` with the lock given back. It is taken again only if it was held: otherwise
    /// taking it would wait for the very send that this call must not wait for.
    template <typename Action>
    void RunReleased(Action&& action) {
        GiveBack();
        const Retaking retaking{*this};
        action();
    }

  private:
    struct Retaking {
        QueueHold& hold;
        ~Retaking() { hold.Retake(); }
    };

    void GiveBack() {
        if (isHeld) queueLock.Signal();
    }
    void Retake() {
        if (isHeld) queueLock.Wait();
    }

    ZSemaphore& queueLock;
    const bool isHeld;
};

void CallClient(const QueueEntry& entry, std::uint32_t errorCode, std::uint32_t flags) {
    entry.callback(entry.userPrivate, entry.userData, errorCode, flags);
}

bool WantsCall(const QueueEntry& entry, std::uint32_t event) {
    return (entry.flags & event) != 0 && entry.callback != nullptr;
}

// ---- An exposure has ended ----

void CallExposeDone(CameraContext& context, QueueHold& queueHold, EventService& service,
                    QueueEntry& entry) {
    if (context.abortRequested != 0) {
        ZLogMessage(ExposeDoneName,
                    "Not calling expose done callback because Zentara_Abort was called");
        return;
    }
    if (entry.exposeDoneCalled == 1) {
        ZLogMessage(ExposeDoneName,
                    "Not calling expose done callback  for frame %d because it's already been "
                    "called for this frame",
                    entry.userData);
        return;
    }
    if (entry.callback == nullptr) {
        ZLogMessage(ExposeDoneName, "Not calling expose done callback because it is null");
        return;
    }
    // The image may have been quicker, or an abort, which a send in progress does not keep out.
    if (!service.ClaimExposeDone(entry)) return;
    queueHold.RunReleased([&] {
        CallClient(entry, zerrNone, zcbExposeDone);
        service.EndExposeDone();
    });
    ZLogMessage(ExposeDoneName, "Called expose done callback for frame number %d", entry.userData);
}

/// Makes a change that `service` has taken, in its turn.
ZentaraResult MakeChange(EventService& service, const QueueEntry& change) {
    service.AwaitEarlierChanges();
    return Zentara_SendSettingsToCam(change.camera, change.settings);
}

/// Applies the settings change behind `frame`, whose pixels are still on the way, so that it is in
/// force for the next exposure. Behind an image that has taken the frame out meanwhile, the change
/// in that place belongs to a later exposure.
void ApplySettingsEarly(CameraContext& context, QueueHold& queueHold, EventService& service,
                        const QueueEntry& frame) {
    if (context.abortRequested != 0 || context.sendInProgress != 0) return;
    const EntryHold change(context, service.TakeChange(&frame));
    if (!change) return;
    ZentaraResult result = zerrNone;
    queueHold.RunReleased([&] { result = MakeChange(service, *change); });
    if (!WantsCall(*change, zcbFrameDone)) return;
    queueHold.RunReleased([&] { CallClient(*change, result, change->flags); });
}

void ServeExposure(CameraContext& context) {
    QueueHold queueHold(context);
    if (GetQueueCount(context) == 0 || context.abortRequested != 0) {
        ZLogMessage(ExposeDoneName,
                    "Not calling expose done callback because the queue is empty or abort was "
                    "called");
        return;
    }
    EventService service(context, EventService::Kind::Exposure);
    bool isFirst = false;
    const EntryHold chosen(context, HoldExposedEntry(context, &isFirst));
    if (!chosen || chosen->kind != QueueKindFrame) return;
    if ((chosen->flags & zcbExposeDone) != 0) CallExposeDone(context, queueHold, service, *chosen);
    if (isFirst) ApplySettingsEarly(context, queueHold, service, *chosen);
}

// ---- An image has arrived ----

/// The exposure callback always comes before the frame callback: it is made up for here.
void MakeUpForExposeDone(CameraContext& context, EventService& service, QueueEntry& entry) {
    if (entry.kind != QueueKindFrame || (entry.flags & zcbExposeDone) == 0) return;
    if (entry.exposeDoneCalled != 0) {
        service.AwaitExposeDone(entry);
        return;
    }
    ZLogMessage(ImageReceivedName,
                "Received a frame but the expose done callback wasn't called.  Calling it now "
                "before returning the frame.");
    if (context.abortRequested != 0) return;
    if (entry.callback == nullptr) {
        ZLogMessage(ImageReceivedName, "Not calling expose done callback because it is null");
    }
    if (!service.ClaimExposeDone(entry)) {
        service.AwaitExposeDone(entry);  // it began in this very moment
        return;
    }
    if (entry.callback != nullptr) CallClient(entry, zerrNone, zcbExposeDone);
    service.EndExposeDone();
}

void CallFrameDone(CameraContext& context, const QueueEntry& entry) {
    if ((entry.flags & zcbFrameDone) == 0) {
        ZLogMessage(ImageReceivedName,
                    "Not calling framedone callback the user doesn't want framedone callbacks");
        return;
    }
    if (context.abortRequested != 0) {
        ZLogMessage(ImageReceivedName,
                    "Not calling framedone callback because Zentara_Abort was called");
        return;
    }
    if (entry.callback == nullptr) {
        ZLogMessage(ImageReceivedName,
                    "Not calling framedone callback because the callback in null");
        return;
    }
    ZLogFrame(ImageReceivedName, *entry.frame);
    CallClient(entry, entry.frame->errorCode, zcbFrameDone);
}

void DeliverFrame(CameraContext& context, const QueueEntry& entry, ZExImage* image,
                  std::uint16_t status) {
    if (status == FrameStatusTimedOut) {
        entry.frame->errorCode = zerrUnplugged;
    } else if (image != nullptr) {
        PostProcess(context, *image);
    }
    // Kept: this overwrites errorCode, so zerrUnplugged stays only where no image came with it.
    if (image != nullptr) {
        ExportImageToFrame(entry.camera, GetLastSettings(context), *image, *entry.frame,
                           /*copiesPixels=*/true);
    }
    CallFrameDone(context, entry);
}

void CountWithoutTaker(ZCamera& camera, ZExImage* image) {
    if (image == nullptr) return;
    camera.GetStreamCounters().withoutTaker.Add(image->GetErrorCode());
}

/// `*hasTaker` becomes true when a frame waited for the image.
void ServeImage(CameraContext& context, ZExImage* image, std::uint16_t status, bool* hasTaker) {
    const SemaphoreHold delivery(*context.deliveryLock);
    EventService service(context, EventService::Kind::Image);
    {
        const EntryHold head(context, HoldEntry(context, 0));
        if (!head) return;
        MakeUpForExposeDone(context, service, *head);
    }
    const EntryHold entry(context, TakeFirstEntry(context));
    if (!entry) return;
    // Kept: a change that is the last entry stays. At the next image it is taken out as the entry
    // itself, dropped without being sent, and that image is dropped with it.
    const EntryHold change(context, service.TakeChange(/*frame=*/nullptr));
    *hasTaker = entry->kind == QueueKindFrame;
    if (*hasTaker) DeliverFrame(context, *entry, image, status);
    if (!change) return;
    const ZentaraResult result = MakeChange(service, *change);
    if (WantsCall(*change, zcbFrameDone)) CallClient(*change, result, change->flags);
}

}  // namespace

void* ExposeDone(void* refCon) {
    ZLogEnter(ExposeDoneName);
    CameraContext* const context = GetCameraContext(*static_cast<ZCamera*>(refCon));
    if (context == nullptr) {
        ZLogLeave(ExposeDoneName, zerrBadParameter);
        return nullptr;
    }
    (void)Guarded([&] {
        ServeExposure(*context);
        return ZentaraResult{zerrNone};
    });
    ZLogLeave(ExposeDoneName, zerrNone);
    return nullptr;
}

void* ImageReceived(ZImageReceivedCallbackStruct* record) {
    ZLogEnter(ImageReceivedName);
    ZCamera& camera = *static_cast<ZCamera*>(record->refCon);
    CameraContext* const context = GetCameraContext(camera);
    if (context == nullptr) {
        CountWithoutTaker(camera, record->image);
        ZCamera::FreeImage(record->image);
        ZLogLeave(ImageReceivedName, zerrBadParameter);
        return nullptr;
    }
    bool hasTaker = false;
    (void)Guarded([&] {
        ServeImage(*context, record->image, record->status, &hasTaker);
        return ZentaraResult{zerrNone};
    });
    if (!hasTaker) CountWithoutTaker(camera, record->image);
    ZCamera::FreeImage(record->image);
    ZLogLeave(ImageReceivedName, zerrNone);
    return nullptr;
}

void PostProcess(CameraContext& context, ZExImage& image) {
    if (context.postProcessing != 1) return;
    const std::uint32_t format = GetSettingsWord(GetLastSettings(context), zprmImageFormat);
    if (format == zfmtRaw8 || format == zfmtRaw16) return;
    const ZentaraResult ended = Guarded([&] {
        const std::lock_guard hold(context.postMutex);
        bool isComplete = true;
        // The image says what became of it.
        (void)context.postPipeline->ProcessImage(&image, &isComplete);
        return ZentaraResult{zerrNone};
    });
    // What was thrown on the way is want of memory, and the frame is the client's all the same.
    if (ended != zerrNone && image.GetErrorCode() == FrameStatusGood) {
        image.SetErrorCode(FrameStatusBufferTooSmall);
    }
}

}  // namespace ZV
