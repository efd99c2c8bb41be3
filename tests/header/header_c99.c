/* The header stands alone in C99: nothing before it, nothing beside it. */
#include <zentara/zentara.h>

/* A function of C that takes its types, constants and functions by name. */
int UseHeaderFromC(void);

int UseHeaderFromC(void) {
    Zentara_CamListItem item = {0};
    Zentara_Settings settings = {0};
    Zentara_Frame frame = {0};
    ZentaraAsyncCallback callback = 0;
    uint32_t number = 0;
    ZentaraHandle handle = 0;
    ZentaraResult result = Zentara_GrabFrame(handle, &frame);
    if (result != zerrNotLoaded) return 1;
    if (Zentara_ListCameras(&item, &number) != zerrNotLoaded) return 2;
    if (Zentara_ReadSettingsFromCam(handle, &settings) != zerrNotLoaded) return 3;
    result = Zentara_QueueFrame(handle, &frame, callback, zcbFrameDone | zcbExposeDone, 0, 0);
    if (result != zerrNotLoaded) return 4;
    return Zentara_is16bit(zfmtMono16) == 1 ? 0 : 5;
}
