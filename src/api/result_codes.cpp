#include "api/result_codes.h"

#include <array>

namespace ZV {

namespace {

struct CameraResultRow {
    CameraResult result;
    ZentaraResult code;
};

constexpr std::array CameraResults{
    CameraResultRow{CameraOk, zerrNone},
    // Kept: a feature this model lacks counts as success, so one settings block fits all models.
    CameraResultRow{CameraNotSupported, zerrNone},
    CameraResultRow{CameraBandwidthFault, zerrCameraBusy},
    CameraResultRow{CameraAlreadyInitialized, zerrCameraBusy},
    CameraResultRow{CameraUnknownFault, zerrCameraFault},
};

struct ImageErrorRow {
    std::uint16_t imageError;
    ZentaraResult code;
};

constexpr std::array ImageErrors{
    ImageErrorRow{FrameStatusMissingData, zerrMissingData},
    ImageErrorRow{FrameStatusOutOfSync, zerrOutOfSync},
    ImageErrorRow{FrameStatusBufferTooSmall, zerrBufferTooSmall},
    ImageErrorRow{FrameStatusIncomplete, zerrFrameIncomplete},
};

struct MessageRow {
    ZentaraResult code;
    const char* message;
};

// Kept: 9, 23 and 30 have no words, although 9 is the most common failure.
constexpr std::array Messages{
    MessageRow{zerrNotSupported, "the function is not supported for this device."},
    MessageRow{zerrBadParameter, "one of the parameters used is not valid."},
    MessageRow{zerrBadSettings,
               "the Zentara_Settings structure is corrupted or the size is invalid."},
    MessageRow{zerrAlreadyLoaded, "Zentara has already been loaded through Zentara_LoadDriver()."},
    MessageRow{zerrNotLoaded, "Zentara has not been loaded. Call Zentara_LoadDriver()."},
    MessageRow{zerrBadCameraId, "the camera ID used is invalid."},
    MessageRow{zerrHardwareFault, "general internal error occurred (hardware fault)."},
    MessageRow{zerrFirewireFault, "general internal error occurred (firewire fault)."},
    MessageRow{zerrCameraFault, "general internal error occurred (camera fault)."},
    MessageRow{zerrDriverFault, "general internal error occurred (driver fault)."},
    MessageRow{zerrBufferTooSmall,
               "the size of pBuffer in the Zentara_Frame structure is too small."},
    MessageRow{zerrBusy, "the function cannot be processed at this time."},
    MessageRow{zerrQueueFull, "the queue for frame and settings changes is full."},
    MessageRow{zerrNotStreaming,
               "streaming is not on and is required for this call.  Call Zentara_SetStreaming()."},
    MessageRow{zerrOutOfSync,
               "the host and the computer are out of sync, the frame returned is invalid."},
    MessageRow{zerrMissingData, "data in the frame is missing and has been filled in with black."},
    MessageRow{zerrHostOverrun, "the host has more data than it can process, restart streaming."},
    MessageRow{zerrUnplugged, "the camera has been unplugged or turned off."},
    MessageRow{zerrRoiTooSmall, "the ROI used is too small."},
};

}  // namespace

ZentaraResult TranslateCameraResult(CameraResult result) {
    for (const CameraResultRow& row : CameraResults) {
        if (row.result == result) return row.code;
    }
    return zerrDriverFault;
}

ZentaraResult TranslateImageError(std::uint16_t imageError) {
    for (const ImageErrorRow& row : ImageErrors) {
        if (row.imageError == imageError) return row.code;
    }
    return zerrNone;
}

const char* GetResultMessage(ZentaraResult code) {
    for (const MessageRow& row : Messages) {
        if (row.code == code) return row.message;
    }
    return "error string not defined yet";
}

}  // namespace ZV
