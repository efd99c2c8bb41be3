/* Takes one image with the first camera and writes its samples to image.raw. */
#include <stdio.h>
#include <stdlib.h>
#include <zentara/zentara.h>

static int grab(ZentaraHandle camera) {
    uint32_t bytes = 0;
    Zentara_Frame frame = {0};
    FILE* file = fopen("image.raw", "wb");
    if (file == NULL || Zentara_GetInfo(camera, zinfImageSize, &bytes) != zerrNone) return 1;
    frame.pBuffer = malloc(bytes);
    frame.bufferSize = bytes;
    if (Zentara_GrabFrame(camera, &frame) != zerrNone || frame.errorCode != zerrNone) return 1;
    printf("%u x %u pixels, %u bits\n", (unsigned)frame.width, (unsigned)frame.height, frame.bits);
    fwrite(frame.pBuffer, 1, frame.size, file);
    free(frame.pBuffer);
    return fclose(file) != 0;
}

int main(void) {
    Zentara_CamListItem cameras[8];
    uint32_t count = 8;
    ZentaraHandle camera = 0;
    int result = 1;
    if (Zentara_LoadDriver() != zerrNone) return 1;
    if (Zentara_ListCameras(cameras, &count) == zerrNone && count > 0 &&
        Zentara_OpenCamera(cameras[0].cameraId, &camera) == zerrNone) {
        result = grab(camera);
        Zentara_CloseCamera(camera);
    }
    Zentara_ReleaseDriver();
    return result;
}
