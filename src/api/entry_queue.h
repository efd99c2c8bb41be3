#pragma once

#include <cstdint>

#include "api/camera_context.h"

namespace ZV {

/// The queue of a context, oldest entry at index 0. All operations are thread-safe and keep the
/// queue whole under its leaf mutex, whatever named lock the caller holds.
///
/// An entry lives while somebody holds it: the queue holds what is in it, and a thread that works
/// on an entry holds it too. The last to let go frees it.

[[nodiscard]] std::uint32_t GetQueueCount(const CameraContext& context);

/// Makes an entry at the end of the queue, with the values of `entry`. False when there are 100
/// already or there is no memory.
[[nodiscard]] bool AppendEntry(CameraContext& context, const QueueEntry& entry);

/// The entry at `index`, held for the caller; null at or beyond the count.
[[nodiscard]] QueueEntry* HoldEntry(CameraContext& context, std::uint32_t index);

/// The entry that an ended exposure belongs to, held for the caller: the first one, which
/// `*isFirst` tells, or the one behind it if the first has had its exposure callback already, with
/// one settings change in between passed over. Null when the queue is empty.
[[nodiscard]] QueueEntry* HoldExposedEntry(CameraContext& context, bool* isFirst);

/// Takes the entry at index 0 out and hands the queue's hold to the caller; null when the queue is
/// empty.
[[nodiscard]] QueueEntry* TakeFirstEntry(CameraContext& context);

/// Takes the settings change behind `frame` out, or the first entry where `frame` is null, and
/// hands the queue's hold to the caller. Null, and the queue stays as it is, when that entry is no
/// settings change, when it is the last one and `frame` is null, and when `frame` is not, or no
/// longer, the first entry. `*ticket`, which is guarded by queueMutex, receives the change's place
/// among all that were taken, from 1.
[[nodiscard]] QueueEntry* TakeSettingsEntry(CameraContext& context, const QueueEntry* frame,
                                            std::uint64_t* ticket);

/// Lets go of an entry. Null is ignored.
void LetGoOfEntry(CameraContext& context, QueueEntry* entry);

/// Empties the queue without calling a callback.
void ClearQueue(CameraContext& context);

}  // namespace ZV
