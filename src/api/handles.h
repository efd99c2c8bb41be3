#pragma once

#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

/// The handle of a camera is the address of its object. Nothing is dereferenced that is not among
/// the registered cameras: handles that the library did not give, and those of cameras that are
/// gone, name nothing. All functions are thread-safe, so that calls on one camera go on while
/// others are listed.
void RegisterCamera(ZCamera* camera);
void UnregisterCamera(ZCamera* camera);

[[nodiscard]] ZentaraHandle GetHandle(ZCamera* camera);

/// Null for a handle that names nothing.
[[nodiscard]] ZCamera* FindCamera(ZentaraHandle handle);

/// The access tests of the exported functions. A null camera fails both, without a message.
[[nodiscard]] bool IsOpen(ZCamera* camera);
/// False for every camera that this process has not open, with the log's message of `function`
/// that another process has it open: also where nobody has, so callers ask IsOpen first where the
/// message would mislead.
[[nodiscard]] bool HasExclusiveAccess(const char* function, ZCamera* camera);

}  // namespace ZV
