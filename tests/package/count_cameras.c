/* A program without a runtime, which any compiler for Windows can build; it ends with the number of
 * cameras. */
#include <zentara/zentara.h>

static Zentara_CamListItem cameras[10];

int start(void) {
    uint32_t count = sizeof cameras / sizeof cameras[0];
    if (Zentara_LoadDriver() != zerrNone) return 100;
    if (Zentara_ListCameras(cameras, &count) != zerrNone) return 101;
    Zentara_ReleaseDriver();
    return (int)count;
}
