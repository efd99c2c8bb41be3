// A client that holds a camera: `camera-holder [stream]`. Opens the first camera of the list and
// starts its stream if it is told to, prints "ok" or the code of the call that failed, and keeps
// the camera until its input ends.

#include <cstdint>
#include <iostream>
#include <string>

#include "zentara/zentara.h"

namespace {

ZentaraResult OpenFirst(ZentaraHandle* handle) {
    Zentara_CamListItem items[8]{};
    std::uint32_t count = 8;
    if (const ZentaraResult result = Zentara_LoadDriver(); result != zerrNone) return result;
    if (const ZentaraResult result = Zentara_ListCameras(items, &count); result != zerrNone) {
        return result;
    }
    return Zentara_OpenCamera(0, handle);
}

}  // namespace

int main(int argc, char**) {
    ZentaraHandle handle = 0;
    ZentaraResult result = OpenFirst(&handle);
    if (result == zerrNone && argc > 1) result = Zentara_SetStreaming(handle, 1);
    if (result != zerrNone) {
        std::cout << "failed " << result << std::endl;
        return 1;
    }
    std::cout << "ok" << std::endl;
    for (std::string line; std::getline(std::cin, line);) {
    }
    const bool isClosed = Zentara_CloseCamera(handle) == zerrNone;
    Zentara_ReleaseDriver();
    return isClosed ? 0 : 1;
}
