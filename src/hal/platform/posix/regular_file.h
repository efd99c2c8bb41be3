#pragma once

namespace ZV {

/// Opens a regular file with the `flags` of open(), and with mode 0644 where they make it. Never
/// waits: what is no regular file could, so it is refused. Returns the descriptor, or -1 with
/// errno, which is EACCES for another kind of file.
int OpenRegularFile(const char* path, int flags);

}  // namespace ZV
