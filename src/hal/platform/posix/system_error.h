#pragma once

namespace ZV {

/// Sets the calling thread's last platform error to the number that stands for `errorNumber`.
void SetLastPlatformErrorFromErrno(int errorNumber);

}  // namespace ZV
