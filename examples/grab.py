"""Takes one image of 20 ms with the first camera and writes its samples to image.raw.

    python3 grab.py LIBRARY

LIBRARY is the path of zentara.dll or libzentara.so.
"""
import ctypes
import sys
from ctypes import POINTER, byref
from ctypes import c_uint16 as u16, c_uint32 as u32, c_uint64 as u64, c_void_p as pointer

INFO_IMAGE_SIZE = 10
PARAM_EXPOSURE = 2


class CamListItem(ctypes.Structure):
    _fields_ = [("cameraId", u32), ("cameraType", u32), ("uniqueId", u32), ("isOpen", u32),
                ("reserved", u32 * 10)]


class Frame(ctypes.Structure):
    _fields_ = [("pBuffer", pointer), ("bufferSize", u32), ("format", u32), ("width", u32),
                ("height", u32), ("size", u32), ("bits", u16), ("frameNumber", u16),
                ("bayerPattern", u32), ("errorCode", u32), ("timeStamp", u32),
                ("privateAndReserved", u32 * 9)]


class Settings(ctypes.Structure):
    """Opaque: the library fills it, and its functions read and change it."""
    _fields_ = [("size", u32), ("private", u32 * 64)]


assert [ctypes.sizeof(record) for record in (CamListItem, Frame, Settings)] == [56, 80, 260]


def check(result, function, arguments):
    if result != 0:
        raise OSError(f"{function.__name__} answered {result}")
    return result


def load(path):
    library = ctypes.CDLL(path)
    for name, arguments in {
        "Zentara_LoadDriver": [],
        "Zentara_ListCameras": [POINTER(CamListItem), POINTER(u32)],
        "Zentara_OpenCamera": [u32, POINTER(u64)],
        "Zentara_ReadSettingsFromCam": [u64, POINTER(Settings)],
        "Zentara_SetParam": [POINTER(Settings), u32, u32],
        "Zentara_SendSettingsToCam": [u64, POINTER(Settings)],
        "Zentara_GetInfo": [u64, u32, POINTER(u32)],
        "Zentara_GrabFrame": [u64, POINTER(Frame)],
        "Zentara_CloseCamera": [u64],
    }.items():
        function = getattr(library, name)
        function.argtypes, function.restype, function.errcheck = arguments, u32, check
    library.Zentara_ReleaseDriver.restype = None
    return library


def set_exposure(library, camera, microseconds):
    settings = Settings()
    library.Zentara_ReadSettingsFromCam(camera, byref(settings))
    library.Zentara_SetParam(byref(settings), PARAM_EXPOSURE, microseconds)
    library.Zentara_SendSettingsToCam(camera, byref(settings))


def grab(library, camera):
    size = u32()
    library.Zentara_GetInfo(camera, INFO_IMAGE_SIZE, byref(size))
    pixels = ctypes.create_string_buffer(size.value)
    frame = Frame(pBuffer=ctypes.addressof(pixels), bufferSize=size.value)
    library.Zentara_GrabFrame(camera, byref(frame))
    if frame.errorCode != 0:
        raise OSError(f"the image came with {frame.errorCode}")
    print(f"{frame.width} x {frame.height} pixels, {frame.bits} bits")
    with open("image.raw", "wb") as file:
        file.write(pixels.raw[:frame.size])


def main(path):
    library = load(path)
    library.Zentara_LoadDriver()
    try:
        items, count, camera = (CamListItem * 8)(), u32(8), u64()
        library.Zentara_ListCameras(items, byref(count))
        if count.value == 0:
            raise OSError("there is no camera")
        library.Zentara_OpenCamera(items[0].cameraId, byref(camera))
        try:
            set_exposure(library, camera, 20000)
            grab(library, camera)
        finally:
            library.Zentara_CloseCamera(camera)
    finally:
        library.Zentara_ReleaseDriver()


if __name__ == "__main__":
    main(sys.argv[1])
