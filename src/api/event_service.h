#pragma once

#include <cstdint>
#include <thread>

#include "api/camera_context.h"

namespace ZV {

/// What one thread of the engine serves for a client at the moment: the end of an exposure or an
/// image. It lies on the stack of that thread and stands in its context's list from construction to
/// destruction, so that others can wait for its end.
///
/// No wait is without a way out: none waits for the own thread's service, nor for one whose client
/// has called Zentara_Abort from its callback, and an exposure is waited for five seconds at most.
class EventService {
  public:
    enum class Kind { Exposure, Image };

    EventService(CameraContext& served, Kind servedKind);
    ~EventService();
    EventService(const EventService&) = delete;
    EventService& operator=(const EventService&) = delete;

    /// Claims the exposure callback of a frame for this thread. False when the frame is no longer
    /// in the queue or its callback has been claimed already: of two threads one gets true.
    [[nodiscard]] bool ClaimExposeDone(QueueEntry& entry);
    /// The claimed callback has returned.
    void EndExposeDone();
    /// Waits while another thread is inside the exposure callback of `entry`.
    void AwaitExposeDone(const QueueEntry& entry);

    /// Takes a settings change out of the queue as TakeSettingsEntry does. Changes are made, and
    /// their callbacks called, in the order in which they are taken, whichever thread takes them: a
    /// change is in hand until the service ends.
    [[nodiscard]] QueueEntry* TakeChange(const QueueEntry* frame);
    /// Waits until no other thread has an earlier change in hand.
    void AwaitEarlierChanges();

  private:
    friend void ReleaseOwnServices(CameraContext& context);
    friend void AwaitExposures(CameraContext& context);
    friend void AwaitImages(CameraContext& context);

    static bool HasOthers(const CameraContext& context, Kind kind, std::uint64_t lastNumber);
    bool IsChangeNext() const;

    CameraContext& context;
    const Kind kind;
    const std::thread::id thread = std::this_thread::get_id();
    // All below: guarded by queueMutex.
    std::uint64_t number = 0;                 ///< Place among the context's services, from 1.
    const QueueEntry* calledEntry = nullptr;  ///< Its exposure callback is running.
    std::uint64_t changeTicket = 0;           ///< Place of the change in hand; 0 for none.
    bool isReleased = false;                  ///< Nobody waits for it any more.
    EventService* next = nullptr;
};

/// Lets nobody wait for what this very thread is serving: it is about to wait itself.
void ReleaseOwnServices(CameraContext& context);

/// Waits until no other thread serves the end of an exposure that it had begun to serve before the
/// call, or five seconds have passed.
void AwaitExposures(CameraContext& context);

/// Waits until no other thread serves an image that it had begun to serve before the call.
void AwaitImages(CameraContext& context);

}  // namespace ZV
