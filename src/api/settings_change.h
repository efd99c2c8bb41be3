#pragma once

#include "camera/camera.h"

namespace ZV {

/// A batch of settings, for the length of a block: however it ends, the camera's frames count as
/// they come behind it.
class SettingsChange {
  public:
    explicit SettingsChange(ZCamera& changed) : camera(changed) { camera.BeginSettingsChange(); }
    ~SettingsChange() { camera.EndSettingsChange(); }
    SettingsChange(const SettingsChange&) = delete;
    SettingsChange& operator=(const SettingsChange&) = delete;

  private:
    ZCamera& camera;  // borrowed for the block
};

}  // namespace ZV
