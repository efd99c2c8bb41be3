#pragma once

#include <memory>
#include <vector>

#include "api/camera_context.h"
#include "camera/camera.h"

namespace ZV {

/// The cameras of the flat interface, and what it keeps for them.
///
/// One thread at a time, by the rules of the flat interface: load, release, list, open and close
/// take no lock and do not overlap.
class CameraStore {
  public:
    /// The store of the process. Never destroyed: a process may end while cameras stream.
    static CameraStore& Get();

    /// The last listing; a camera id is an index into it.
    const std::vector<ZCamera*>& GetList() const { return cameraList; }

    /// Gives the former list up and makes a new one. Closed cameras and their handles end, save
    /// that an open camera keeps those behind it; open cameras and what is behind them are retired,
    /// which leaves their handles as they are, and retired cameras that have been closed since end
    /// here. So does a camera whose close failed, so that its device is found again.
    CameraResult MakeList();

    /// Makes the context of a camera that has just been opened and attaches it; the store owns it.
    /// False when there is no memory, or by the exception that says so: the camera and the store
    /// are then as they were.
    [[nodiscard]] bool AttachContext(ZCamera& camera);

    /// Ends what belongs to a camera whose close has just returned. What is queued is the client's
    /// again at the return: a delivery in progress is waited for. A context that a thread of the
    /// camera may still use stays, retired, until the threads have ended.
    void DetachContext(ZCamera& camera);

    /// Closes and deletes every camera, the listed ones first, and then their contexts.
    void FreeAll();

  private:
    struct OwnedContext {
        ZCamera* camera;  // borrowed from the store, until it is deleted; not dereferenced
        std::unique_ptr<CameraContext> context;
    };

    void UnregisterClosedCameras();
    void FreeUnusedRetiredCameras();
    void FreeCamerasLeftOpen();
    void RetireList();
    void TakeOutContextsOf(ZCamera& camera);
    void FreeContextsOf(const ZCamera& camera);
    void FreeContextsWithoutCamera();

    std::vector<ZCamera*> cameraList;
    std::vector<ZCamera*> retiredCameras;
    std::vector<OwnedContext> contexts;
};

}  // namespace ZV
