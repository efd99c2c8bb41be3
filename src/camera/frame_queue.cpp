#include "camera/frame_queue.h"

#include <algorithm>
#include <cstdlib>
#include <new>

namespace ZV {

namespace {

bool IsFree(const tStFrameInfo* frame) {
    return !frame->isHeld.load(std::memory_order_acquire);
}

}  // namespace

tStFrameInfo* MakeFrame() {
    return new (std::nothrow) tStFrameInfo;
}

void FreeFrameWithBuffer(tStFrameInfo* frame) {
    std::free(frame->buffer);
    FreeFrame(frame);
}

void FreeFrame(tStFrameInfo* frame) {
    delete frame;
}

bool FrameQueue::PushNewest(tStFrameInfo* frame) {
    const std::lock_guard hold(leafMutex);
    if (count == Capacity) return false;
    frames[count++] = frame;
    return true;
}

tStFrameInfo* FrameQueue::TakeNewest() {
    const std::lock_guard hold(leafMutex);
    std::size_t place = count;
    while (place > 0 && !IsFree(frames[place - 1])) --place;
    return place > 0 ? TakeOut(place - 1) : nullptr;
}

tStFrameInfo* FrameQueue::TakeOldest() {
    const std::lock_guard hold(leafMutex);
    std::size_t place = 0;
    while (place < count && !IsFree(frames[place])) ++place;
    return place < count ? TakeOut(place) : nullptr;
}

tStFrameInfo* FrameQueue::TakeAny() {
    const std::lock_guard hold(leafMutex);
    return count > 0 ? TakeOut(0) : nullptr;
}

tStFrameInfo* FrameQueue::TakeOut(std::size_t place) {
    tStFrameInfo* frame = frames[place];
    const auto begin = frames.begin() + static_cast<std::ptrdiff_t>(place);
    std::copy(begin + 1, frames.begin() + static_cast<std::ptrdiff_t>(count), begin);
    frames[--count] = nullptr;
    return frame;
}

tStFrameInfo* FrameQueue::FindHeld() const {
    const std::lock_guard hold(leafMutex);
    for (std::size_t place = count; place > 0; --place) {
        if (!IsFree(frames[place - 1])) return frames[place - 1];
    }
    return nullptr;
}

void FrameQueue::MarkAllInvalid() {
    const std::lock_guard hold(leafMutex);
    for (std::size_t place = 0; place < count; ++place) frames[place]->valid = false;
}

void ExternalBufferQueue::Append(void* buffer) {
    const std::lock_guard hold(leafMutex);
    buffers.push_back(buffer);
}

void* ExternalBufferQueue::TakeFirst() {
    const std::lock_guard hold(leafMutex);
    if (buffers.empty()) return nullptr;
    void* first = buffers.front();
    buffers.erase(buffers.begin());
    return first;
}

bool ExternalBufferQueue::IsEmpty() const {
    const std::lock_guard hold(leafMutex);
    return buffers.empty();
}

}  // namespace ZV
