#include "api/event_service.h"

#include <algorithm>
#include <mutex>

#include "api/entry_queue.h"
#include "hal/platform/limited_wait.h"

namespace ZV {

namespace {

/// As long as a close waits for the exposure thread.
constexpr std::uint64_t ExposureLimitMs = 5000;

/// Under queueMutex.
bool IsQueued(const CameraContext& context, const QueueEntry& entry) {
    const auto first = context.queue.begin();
    return std::find(first, first + context.queueCount, &entry) != first + context.queueCount;
}

}  // namespace

EventService::EventService(CameraContext& served, Kind servedKind)
    : context(served), kind(servedKind) {
    const std::lock_guard hold(context.queueMutex);
    number = ++context.servicesBegun;
    next = context.services;
    context.services = this;
}

EventService::~EventService() {
    const std::lock_guard hold(context.queueMutex);
    EventService** link = &context.services;
    while (*link != this) link = &(*link)->next;
    *link = next;
    context.serviceChanged.notify_all();
}

bool EventService::ClaimExposeDone(QueueEntry& entry) {
    const std::lock_guard hold(context.queueMutex);
    if (entry.exposeDoneCalled != 0 || !IsQueued(context, entry)) return false;
    entry.exposeDoneCalled = 1;
    calledEntry = &entry;
    return true;
}

void EventService::EndExposeDone() {
    const std::lock_guard hold(context.queueMutex);
    calledEntry = nullptr;
    context.serviceChanged.notify_all();
}

void EventService::AwaitExposeDone(const QueueEntry& entry) {
    std::unique_lock lock(context.queueMutex);
    const auto isOver = [&] {
        for (const EventService* service = context.services; service; service = service->next) {
            const bool isOther = service->thread != thread && !service->isReleased;
            if (isOther && service->calledEntry == &entry) return false;
        }
        return true;
    };
    (void)WaitForLimit(context.serviceChanged, lock, ExposureLimitMs, isOver);  // kept: goes on
}

QueueEntry* EventService::TakeChange(const QueueEntry* frame) {
    return TakeSettingsEntry(context, frame, &changeTicket);
}

/// Under queueMutex.
bool EventService::IsChangeNext() const {
    for (const EventService* service = context.services; service; service = service->next) {
        const bool isWaitedFor = service->changeTicket != 0 && !service->isReleased;
        if (isWaitedFor && service->changeTicket < changeTicket) return false;
    }
    return true;
}

void EventService::AwaitEarlierChanges() {
    std::unique_lock lock(context.queueMutex);
    (void)WaitForLimit(context.serviceChanged, lock, ExposureLimitMs,
                       [&] { return IsChangeNext(); });  // it goes on
}

/// Under queueMutex.
bool EventService::HasOthers(const CameraContext& context, Kind kind, std::uint64_t lastNumber) {
    const std::thread::id self = std::this_thread::get_id();
    for (const EventService* service = context.services; service; service = service->next) {
        const bool isMeant = service->kind == kind && service->number <= lastNumber;
        if (isMeant && service->thread != self && !service->isReleased) return true;
    }
    return false;
}

void ReleaseOwnServices(CameraContext& context) {
    const std::lock_guard hold(context.queueMutex);
    const std::thread::id self = std::this_thread::get_id();
    for (EventService* service = context.services; service; service = service->next) {
        if (service->thread == self) service->isReleased = true;
    }
    context.serviceChanged.notify_all();
}

void AwaitExposures(CameraContext& context) {
    std::unique_lock lock(context.queueMutex);
    const auto isOver = [&, last = context.servicesBegun] {
        return !EventService::HasOthers(context, EventService::Kind::Exposure, last);
    };
    (void)WaitForLimit(context.serviceChanged, lock, ExposureLimitMs, isOver);  // it goes on
}

void AwaitImages(CameraContext& context) {
    std::unique_lock lock(context.queueMutex);
    context.serviceChanged.wait(lock, [&, last = context.servicesBegun] {
        return !EventService::HasOthers(context, EventService::Kind::Image, last);
    });
}

}  // namespace ZV
