#pragma once

#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

struct CameraContext;
class ZExImage;

/// What the streaming engine calls when an exposure has ended; `refCon` is the camera. Serves the
/// exposure callback of the frame that it belongs to, and applies a settings change that follows
/// it. Null always. Runs on the camera's exposure thread, a client's callback with no lock held.
void* ExposeDone(void* refCon);

/// What the streaming engine calls for each image; `record->refCon` is the camera. Takes over the
/// image, delivers it to the oldest frame of the queue, or drops it. Null always. Runs on the
/// camera's run loop, a client's callbacks under `deliveryLock`.
void* ImageReceived(ZImageReceivedCallbackStruct* record);

/// Runs the post-processing chain on `image` if it is on and the client has not asked for raw data.
/// Throws nothing: an image that it leaves unfinished for want of memory bears a code.
void PostProcess(CameraContext& context, ZExImage& image);

}  // namespace ZV
