#include "hal/platform/driver_maintenance.h"

#include <unistd.h>

namespace ZV {
namespace {

constexpr std::uint32_t ListingFailed = 998;

}  // namespace

void GetCommonProgramFilesFolder(char path[260]) {
    path[0] = '\0';
}

bool IsProcessAdministrator() {
    return geteuid() == 0;
}

bool QueryProcessElevation(bool*) {
    return false;
}

bool QuerySystemVersion(SystemVersion*) {
    return false;
}

std::uint32_t AppendAdapterIds(std::uint32_t*, char**) {
    return ListingFailed;
}

std::uint32_t AppendClassDeviceIds(const std::uint8_t*, std::uint32_t*, char**) {
    return ListingFailed;
}

// Drivers come with the system's kernel: there is none to install.
void InstallDriver(const char*, const char*, bool, bool) {}

}  // namespace ZV
