#include "api/entry_queue.h"

#include <algorithm>
#include <new>

namespace ZV {

namespace {

// All helpers: under queueMutex.

QueueEntry* TakeEntryAt(CameraContext& context, std::uint32_t index) {
    QueueEntry** const first = context.queue.data();
    QueueEntry* const taken = first[index];
    std::move(first + index + 1, first + context.queueCount, first + index);
    --context.queueCount;
    first[context.queueCount] = nullptr;
    return taken;
}

std::uint32_t FindExposedEntry(const CameraContext& context) {
    const auto& queue = context.queue;
    const auto goesOnBehind = [&](std::uint32_t index) {
        return context.queueCount > index + 1 && context.abortRequested == 0;
    };
    if (queue[0]->exposeDoneCalled != 1 || !goesOnBehind(0)) return 0;
    if (queue[1]->kind == QueueKindFrame || !goesOnBehind(1)) return 1;
    return 2;
}

void DropHold(QueueEntry* entry) {
    --entry->holdCount;
    if (entry->holdCount == 0) delete entry;
}

QueueEntry* CopyEntry(const QueueEntry& entry) {
    auto* const copy = new (std::nothrow) QueueEntry;
    if (copy == nullptr) return nullptr;
    copy->camera = entry.camera;
    copy->frame = entry.frame;
    copy->settings = entry.settings;
    copy->callback = entry.callback;
    copy->flags = entry.flags;
    copy->userPrivate = entry.userPrivate;
    copy->userData = entry.userData;
    copy->kind = entry.kind;
    copy->holdCount = 1;
    return copy;
}

}  // namespace

std::uint32_t GetQueueCount(const CameraContext& context) {
    const std::lock_guard hold(context.queueMutex);
    return context.queueCount;
}

bool AppendEntry(CameraContext& context, const QueueEntry& entry) {
    QueueEntry* const copy = CopyEntry(entry);
    if (copy == nullptr) return false;
    const std::lock_guard hold(context.queueMutex);
    if (context.queueCount >= QueueCapacity) {
        delete copy;
        return false;
    }
    context.queue[context.queueCount] = copy;
    ++context.queueCount;
    return true;
}

QueueEntry* HoldEntry(CameraContext& context, std::uint32_t index) {
    const std::lock_guard hold(context.queueMutex);
    if (index >= context.queueCount) return nullptr;
    QueueEntry* const entry = context.queue[index];
    ++entry->holdCount;
    return entry;
}

QueueEntry* HoldExposedEntry(CameraContext& context, bool* isFirst) {
    const std::lock_guard hold(context.queueMutex);
    if (context.queueCount == 0) return nullptr;
    const std::uint32_t index = FindExposedEntry(context);
    *isFirst = index == 0;
    QueueEntry* const entry = context.queue[index];
    ++entry->holdCount;
    return entry;
}

QueueEntry* TakeFirstEntry(CameraContext& context) {
    const std::lock_guard hold(context.queueMutex);
    if (context.queueCount == 0) return nullptr;
    return TakeEntryAt(context, 0);
}

QueueEntry* TakeSettingsEntry(CameraContext& context, const QueueEntry* frame,
                              std::uint64_t* ticket) {
    const std::lock_guard hold(context.queueMutex);
    const std::uint32_t index = frame != nullptr ? 1 : 0;
    if (context.queueCount < 2) return nullptr;
    if (frame != nullptr && context.queue[0] != frame) return nullptr;
    if (context.queue[index]->kind != QueueKindSettings) return nullptr;
    *ticket = ++context.changesTaken;
    return TakeEntryAt(context, index);
}

void LetGoOfEntry(CameraContext& context, QueueEntry* entry) {
    if (entry == nullptr) return;
    const std::lock_guard hold(context.queueMutex);
    DropHold(entry);
}

void ClearQueue(CameraContext& context) {
    const std::lock_guard hold(context.queueMutex);
    for (std::uint32_t index = 0; index < context.queueCount; ++index) {
        DropHold(context.queue[index]);
        context.queue[index] = nullptr;
    }
    context.queueCount = 0;
}

}  // namespace ZV
