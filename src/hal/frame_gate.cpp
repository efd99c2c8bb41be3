#include "hal/frame_gate.h"

namespace ZV {

FrameGate::FrameGate() : frameEvent(MakeEvent(EventReset::Manual)) {}

FrameGate::~FrameGate() {
    (void)DestroyEvent(frameEvent);
}

void FrameGate::Open() {
    ClearEvent(frameEvent);
    isOpen.store(true);
}

void FrameGate::Close() {
    isOpen.store(false);
    (void)SignalEvent(frameEvent);
}

HALStatus FrameGate::Wait(const FrameArrivals* arrivals) {
    ClearEvent(frameEvent);
    // Looked at behind the clearing, so that the signal that counts is never the one that is lost.
    if (!isOpen.load()) return HALOk;
    if (arrivals != nullptr && arrivals->count->load() != arrivals->seen) return HALOk;
    const WaitOutcome outcome = WaitForEvent(frameEvent, WaitForEver);
    return outcome == WaitOutcome::Signalled ? HALOk : HALConditionFailed;
}

void FrameGate::Release() {
    (void)SignalEvent(frameEvent);
}

}  // namespace ZV
