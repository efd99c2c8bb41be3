/**
 * Flat C interface of the Zentara camera driver library, version 2.0.
 *
 * A client loads the library, lists the cameras, opens one, works with its handle, closes it and
 * releases the library:
 *
 *     Zentara_LoadDriver();
 *     uint32_t length = 4;
 *     Zentara_CamListItem items[4];
 *     Zentara_ListCameras(items, &length);
 *     ZentaraHandle camera;
 *     Zentara_OpenCamera(items[0].cameraId, &camera);
 *     ... Zentara_GrabFrame, or Zentara_QueueFrame and Zentara_SetStreaming ...
 *     Zentara_CloseCamera(camera);
 *     Zentara_ReleaseDriver();
 *
 * RULES FOR ALL FUNCTIONS
 *
 * Results. Unless its description says otherwise a function returns a ZentaraResult: zerrNone (0)
 * or the code of the first test that failed. The tests run in the order in which each description
 * lists them, and the order differs from one function to the next. A failed call leaves its out
 * arguments as they were unless its description says otherwise. Nothing is retried. What a camera
 * operation reports arrives as zerrCameraBusy (30)   no bandwidth or channel left on the bus,
 *     zerrCameraFault (15)  an unknown fault,
 *     zerrDriverFault (16)  anything else;
 * a feature that the camera does not have is no failure.
 *
 * Yes and no. Functions that answer a question by their result code answer 0 for yes and 1 for no.
 * The five Zentara_is... helpers are the exception: they return 1 for true and 0 for false.
 *
 * Handles. A handle names one camera. It is good from Zentara_OpenCamera until the first
 * Zentara_ListCameras after Zentara_CloseCamera, and never longer than until
 * Zentara_ReleaseDriver. A null handle, one that the library did not give, and one whose camera is
 * not open are answered with zerrBadHandle (9), and so is a camera that another process has open.
 * A camera that stays open across Zentara_ListCameras keeps its handle, but is not in the new list.
 *
 * Buffers. Every record, array, text and pixel buffer belongs to the client. The library keeps
 * pointers only to what is queued: a queued Zentara_Frame with its pixel buffer, and a queued
 * Zentara_Settings, must stay alive and untouched until its callback with zcbFrameDone, or until
 * Zentara_Abort or Zentara_CloseCamera returns. Only these two give back what has no such callback:
 * none was asked for, or a change of settings was dropped (Zentara_QueueSettings).
 *
 * Threads. Zentara_LoadDriver, Zentara_ReleaseDriver, Zentara_ListCameras, Zentara_OpenCamera and
 * Zentara_CloseCamera take no lock: never run them alongside one another or alongside other calls
 * on the same camera. All other functions may be called from any thread. Functions that read a
 * camera do not touch the bus unless they say so.
 *
 * Callbacks come from the library's own threads: the frame thread and the exposure thread of the
 * camera, which are alive from open to close. A callback may call Zentara_QueueFrame,
 * Zentara_QueueSettings, Zentara_SendSettingsToCam, the functions that read, and, with
 * zcbExposeDone, Zentara_Trigger. It must not call Zentara_CloseCamera or Zentara_ReleaseDriver,
 * which wait for the very thread that the callback runs on, nor, from a call with zcbFrameDone,
 * Zentara_Abort or Zentara_GrabFrame: each of these waits for itself for ever.
 * Zentara_Abort is no better from a call with zcbExposeDone: it may be made up for on the frame
 * thread, when the image is there first.
 * A callback of Zentara_QueueSettings that runs inside that call (empty queue) must not call any
 * queue function or send settings. A callback should be short: while it runs no further event of
 * its kind is served.
 *
 * Numbers are little-endian; records are read and written by byte offset and have the sizes that
 * are asserted below.
 */
#ifndef ZENTARA_ZENTARA_H
#define ZENTARA_ZENTARA_H

#include <stddef.h>
#include <stdint.h>

/**
 * Marks what leaves the library; the DLL exports it by its list of names. The one platform test of
 * the project above its platform seam.
 */
#if defined(_WIN32)
#if defined(ZENTARA_BUILDING_LIBRARY)
#define ZENTARA_API
#else
#define ZENTARA_API __declspec(dllimport)
#endif
#else
#define ZENTARA_API __attribute__((visibility("default")))
#endif

#ifdef __cplusplus
extern "C" {
#endif

/** Code of the first test that failed, or zerrNone. */
typedef uint32_t ZentaraResult;

/** Names one open camera; opaque. 0 is never a handle. */
typedef uint64_t ZentaraHandle;

/** Result codes. Numbers that are missing are not produced. */
enum {
    zerrNone = 0,
    zerrNotSupported = 1,     /**< The function is not supported for this device. */
    zerrBadParameter = 2,     /**< One of the parameters is not valid. */
    zerrBadSettings = 3,      /**< The settings block has no magic number, or does not fit. */
    zerrAlreadyLoaded = 7,    /**< Zentara_LoadDriver was called before. */
    zerrNotLoaded = 8,        /**< Zentara_LoadDriver was not called. */
    zerrBadHandle = 9,        /**< No open camera, or one that another process has open. */
    zerrBadCameraId = 11,     /**< No such camera in the list, or it is already open. */
    zerrHardwareFault = 13,   /**< General internal error (hardware). */
    zerrFirewireFault = 14,   /**< General internal error (bus). */
    zerrCameraFault = 15,     /**< General internal error (camera). */
    zerrDriverFault = 16,     /**< General internal error (driver). */
    zerrBufferTooSmall = 18,  /**< The frame's buffer, or memory for its image, is too small. */
    zerrBusy = 21,            /**< The function cannot be processed at this time. */
    zerrQueueFull = 22,       /**< The queue of frames and settings changes is full. */
    zerrFrameIncomplete = 23, /**< Frame: it ended before all its data had come. */
    zerrNotStreaming = 24,    /**< Streaming is off, and the call needs it. */
    zerrOutOfSync = 25,   /**< Frame: host and camera are out of step, the frame is not valid. */
    zerrMissingData = 26, /**< Frame: data were missing and are filled in with black. */
    zerrHostOverrun = 27, /**< The host has more data than it can process. */
    zerrUnplugged = 28,   /**< Frame: the camera was unplugged or turned off. */
    zerrCameraBusy = 30,  /**< No bandwidth or channel left on the bus. */
    zerrRoiTooSmall = 32  /**< The region of interest is too small. */
};

/** Events of a queued entry: what a client asks for, and what a callback is told. */
enum {
    zcbFrameDone = 1, /**< The frame was delivered, or the settings change was applied. */
    zcbExposeDone = 2 /**< The exposure of the frame has ended; its pixels are still on the way. */
};

/**
 * Image formats: zprmImageFormat, zprmPostProcessImageFormat and Zentara_Frame.format. Samples of
 * 16 bits are words of host order.
 */
enum {
    zfmtRaw8 = 0,       /**< Camera words of one byte. */
    zfmtRaw16 = 1,      /**< Camera words of two bytes. */
    zfmtMono8 = 2,      /**< Monochrome, one byte. */
    zfmtMono16 = 3,     /**< Monochrome, two bytes. */
    zfmtBayer8 = 4,     /**< Colour mosaic, one byte. */
    zfmtBayer16 = 5,    /**< Colour mosaic, two bytes. */
    zfmtRGBPlane8 = 6,  /**< Three whole planes R, G, B of one byte per sample. */
    zfmtRGBPlane16 = 7, /**< Three whole planes R, G, B of two bytes per sample. */
    zfmtBGR24 = 8,      /**< Bytes B, G, R. */
    zfmtXRGB32 = 9,     /**< Bytes X, R, G, B; X is 255. */
    zfmtRGB48 = 10,     /**< Words R, G, B. */
    zfmtBGRX32 = 11,    /**< Bytes B, G, R, X; X is 255. */
    zfmtRGB24 = 12      /**< Bytes R, G, B. */
};

/** Zentara_Frame.bayerPattern: the mosaic cell at the frame's top left, rows one above the other.
 */
enum {
    zpatRGGB = 0, /**< R G over G B; also the value of frames without a mosaic. */
    zpatGRBG = 1, /**< G R over B G. */
    zpatGBRG = 2, /**< G B over R G. */
    zpatBGGR = 3  /**< B G over G R. */
};

/** Camera models: Zentara_CamListItem.cameraType and zinfCameraType. */
enum {
    zmodelSolvaneA1 = 5,
    zmodelSolvaneA2 = 6,
    zmodelDorixB1 = 7,
    zmodelFolary = 8,
    zmodelSolvaneK1 = 9,
    zmodelDorixR1 = 10,
    zmodelSolvaneC1 = 12,
    zmodelSolvaneB1 = 13,
    zmodelPellanA1 = 14,
    zmodelSolvaneD1 = 15,
    zmodelSolvaneF1 = 16,
    zmodelSolvaneC2 = 18,
    zmodelSolvaneB2 = 19,
    zmodelPellanB1 = 25,
    zmodelSolvaneE1 = 26,
    zmodelPellanA2 = 27,
    zmodelSolvaneD2 = 28,
    zmodelSolvaneG2 = 29,
    zmodelSolvaneG1 = 30,
    zmodelTirelM2 = 31,
    zmodelTirelM1 = 32,
    zmodelSolvaneH1 = 33,
    zmodelSolvaneJ1 = 1001,
    zmodelMetrona = 1002
};

/** Keys of the 32-bit parameters of a settings block. */
enum {
    zprmGain = 0,                       /**< Camera gain units. */
    zprmOffset = 1,                     /**< Camera offset units. */
    zprmExposure = 2,                   /**< Exposure, microseconds. */
    zprmBinning = 3,                    /**< Symmetrical binning. */
    zprmHorizontalBinning = 4,          /**< Horizontal binning. */
    zprmVerticalBinning = 5,            /**< Vertical binning. */
    zprmReadoutSpeed = 6,               /**< Readout speed, one of zspeed.... */
    zprmTriggerType = 7,                /**< Trigger mode, one of ztrig.... */
    zprmColorWheel = 8,                 /**< Start colour of the filter wheel, one of zwheel.... */
    zprmCoolerActive = 9,               /**< 1 when the cooler is on. */
    zprmExposureRed = 10,               /**< Red exposure, microseconds. */
    zprmExposureBlue = 11,              /**< Blue exposure, microseconds. */
    zprmImageFormat = 12,               /**< Image format, one of zfmt.... */
    zprmRoiX = 13,                      /**< Left edge, pixels. */
    zprmRoiY = 14,                      /**< Top edge, pixels. */
    zprmRoiWidth = 15,                  /**< Width, pixels. */
    zprmRoiHeight = 16,                 /**< Height, pixels. */
    zprmReserved17 = 17,                /**< No use. */
    zprmShutterState = 18,              /**< No use. */
    zprmDoubleShot = 19,                /**< 1 when double shot is on. */
    zprmSyncb = 20,                     /**< SyncB output, one of zsyncb.... */
    zprmMetronaShutterDelay = 21,       /**< Shutter delay of the OEM model. */
    zprmIntensifierGain = 22,           /**< Intensifier gain. */
    zprmTriggerDelay = 23,              /**< Trigger delay, nanoseconds. */
    zprmCameraMode = 24,                /**< One of zmode.... */
    zprmNormalizedGain = 25,            /**< Normalised gain, millionths. */
    zprmNormIntensGaindB = 26,          /**< Normalised intensifier gain, millionths of a dB. */
    zprmDoPostProcessing = 27,          /**< 1 when post-processing is on. */
    zprmPostProcessGainRed = 28,        /**< Red scale times 1000. */
    zprmPostProcessGainGreen = 29,      /**< Green scale times 1000. */
    zprmPostProcessGainBlue = 30,       /**< Blue scale times 1000. */
    zprmPostProcessBayerAlgorithm = 31, /**< One of zbayer.... */
    zprmPostProcessImageFormat = 32,    /**< Output format of post-processing, one of zfmt.... */
    zprmFan = 33,                       /**< Fan speed, one of zfan.... */
    zprmBlackoutMode = 34,              /**< 1 when blackout mode is on. */
    zprmHighSensitivityMode = 35,       /**< 1 when high sensitivity is on. */
    zprmReadoutPort = 36,               /**< Readout port. */
    zprmEMGain = 37,                    /**< Electron-multiplying gain. */
    zprmOpenDelay = 38,                 /**< No use. */
    zprmCloseDelay = 39,                /**< Shutter close delay. */
    zprmCCDClearingMode = 40,           /**< No use. */
    zprmOverSample = 41,                /**< No use. */
    zprmDither = 42,                    /**< 1 when dither is on. */
    zprmHighGainMode = 43,              /**< 1 when high gain is on. */
    zprmVClockPeriod = 44,              /**< Vertical clock period. */
    zprmRevisionTwoReserved = 45,       /**< No use. */
    zprmRegisterTweak = 46              /**< Register tweak word. */
};

/** Keys of the signed parameters of a settings block. */
enum {
    zprmS32NormalizedGaindB = 0,    /**< Normalised gain, millionths of a dB. */
    zprmS32AbsoluteOffset = 1,      /**< Absolute offset. */
    zprmS32RegulatedCoolingTemp = 2 /**< Target of the regulated cooling, degrees Celsius. */
};

/** Keys of the 64-bit parameters of a settings block. */
enum {
    zprm64Exposure = 0,      /**< Exposure, nanoseconds. */
    zprm64ExposureRed = 1,   /**< Red exposure, nanoseconds. */
    zprm64ExposureBlue = 2,  /**< Blue exposure, nanoseconds. */
    zprm64NormIntensGain = 3 /**< Normalised intensifier gain, millionths. */
};

/** Readout speeds of zprmReadoutSpeed. Any other index stands for no speed (0 MHz). */
enum {
    zspeed20MHz = 0,
    zspeed10MHz = 1,
    zspeed5MHz = 2,
    zspeed2500kHz = 3,
    zspeed40MHz = 7,
    zspeed30MHz = 8
};

/** Trigger modes of zprmTriggerType, by the trigger type and polarity that the camera is given. */
enum {
    ztrigFreeRun = 0,        /**< Exposes one frame after the other. */
    ztrigType2Polarity0 = 1, /**< External. */
    ztrigType2Polarity1 = 2, /**< External. */
    ztrigType3Polarity0 = 3, /**< External. */
    ztrigType3Polarity1 = 4, /**< External. */
    ztrigSoftware = 5,       /**< One frame for each Zentara_Trigger. */
    ztrigType5Polarity0 = 6, /**< External. */
    ztrigType5Polarity1 = 7  /**< External. */
};

/** Colours of zprmColorWheel. */
enum { zwheelRed = 0, zwheelGreen = 1, zwheelBlack = 2, zwheelBlue = 3 };

/** Outputs of zprmSyncb. */
enum { zsyncbTriggerMask = 0, zsyncbExpose = 1 };

/** Camera modes of zprmCameraMode. */
enum { zmodeStandard = 0, zmodeRealTimeVideo = 1, zmodeOversample = 2 };

/** Algorithms of zprmPostProcessBayerAlgorithm. */
enum { zbayerAverage = 1, zbayerFast = 2, zbayerBicubic = 3, zbayerBicubicFaster = 4 };

/** Speeds of zprmFan. */
enum { zfanLow = 1, zfanMedium = 2, zfanHigh = 3, zfanFull = 4 };

/** Keys of Zentara_GetInfo. A yes or no arrives as 1 or 0. */
enum {
    zinfCameraType = 0,         /**< Model, one of zmodel.... */
    zinfSerialNumber = 1,       /**< Always 0; see Zentara_GetSerialString. */
    zinfHardwareVersion = 2,    /**< Version of the camera's hardware. */
    zinfFirmwareVersion = 3,    /**< Version of the camera's firmware. */
    zinfCcd = 4,                /**< Sensor id. */
    zinfBitDepth = 5,           /**< Greatest bit depth. */
    zinfCooled = 6,             /**< Has a cooler. */
    zinfReserved7 = 7,          /**< Always 0. */
    zinfImageWidth = 8,         /**< Width of the region of interest, pixels. */
    zinfImageHeight = 9,        /**< Height of the region of interest, pixels. */
    zinfImageSize = 10,         /**< Bytes of an image as it is set now, without post-processing. */
    zinfCcdType = 11,           /**< 0 monochrome, 1 colour mosaic; untouched if neither. */
    zinfCcdWidth = 12,          /**< Width of the sensor, pixels. */
    zinfCcdHeight = 13,         /**< Height of the sensor, pixels. */
    zinfFirmwareBuild = 14,     /**< Build number of the firmware. */
    zinfUniqueId = 15,          /**< Low 32 bits of the unique id. */
    zinfIsModelB = 16,          /**< Always 1. */
    zinfIntensifierModel = 17,  /**< Model of the intensifier, if there is one. */
    zinfExposureRes = 18,       /**< Resolution of the exposure. */
    zinfTriggerDelayRes = 19,   /**< Resolution of the trigger delay; written with code 1 too. */
    zinfStreamVersion = 20,     /**< Version of the stream format. */
    zinfNormGainSigFigs = 21,   /**< Significant figures of the normalised gain. */
    zinfNormGaindBRes = 22,     /**< Resolution of the gain in dB, millionths of a dB. */
    zinfNormITGainSigFigs = 23, /**< The same of the intensifier, if there is one. */
    zinfNormITGaindBRes = 24,   /**< The same of the intensifier, if there is one. */
    zinfRegulatedCooling = 25,  /**< Has regulated cooling. */
    zinfRegulatedCoolingLock = 26, /**< The target temperature is reached. Reads the camera. */
    zinfReserved27 = 27,           /**< Not supported. */
    zinfReserved28 = 28,           /**< Not supported. */
    zinfFanControl = 29,           /**< Has a fan control. */
    zinfHighSensitivityMode = 30,  /**< Has a high sensitivity mode. */
    zinfBlackoutMode = 31,         /**< Has a blackout mode. */
    zinfPostProcessImageSize = 32, /**< Bytes of an image after post-processing. */
    zinfAsymmetricalBinning = 33,  /**< Bins the two directions separately. */
    zinfEMGain = 34,               /**< Has an electron-multiplying gain. */
    zinfReserved35 = 35,           /**< Not supported. */
    zinfCloseDelay = 36,           /**< Has a shutter close delay. */
    zinfColorWheelSupported = 37,  /**< Supports a colour filter wheel. */
    zinfReserved2 = 38,            /**< Has a dither control; the name is kept. */
    zinfReserved3 = 39,            /**< Has a high gain mode; the name is kept. */
    zinfReserved4 = 40             /**< Has a vertical clock control; the name is kept. */
};

/** One camera of Zentara_ListCameras; 56 bytes. */
typedef struct Zentara_CamListItem {
    uint32_t cameraId;     /**< Argument of Zentara_OpenCamera. */
    uint32_t cameraType;   /**< One of zmodel.... */
    uint32_t uniqueId;     /**< Low 32 bits of the unique id; written only while isOpen is 0. */
    uint32_t isOpen;       /**< 0 or 1. */
    uint32_t reserved[10]; /**< Never written. */
} Zentara_CamListItem;

/**
 * The settings of a camera; 260 bytes. A client never looks inside: a block is filled by
 * Zentara_ReadSettingsFromCam or Zentara_ReadDefaultSettings and belongs to the camera that filled
 * it.
 */
typedef struct Zentara_Settings {
    uint32_t size; /**< Written as 260; not compared. */
    uint32_t privateWords[64];
} Zentara_Settings;

/** One image; 80 bytes. The client fills pBuffer and bufferSize, a delivery fills the rest. */
typedef struct Zentara_Frame {
    void* pBuffer;         /**< The client's pixel buffer; null counts as one of 0 bytes. */
    uint32_t bufferSize;   /**< Its size, bytes. */
    uint32_t format;       /**< One of zfmt.... */
    uint32_t width;        /**< Pixels. */
    uint32_t height;       /**< Pixels. */
    uint32_t size;         /**< Bytes of pixels in the buffer; 0 if the image did not fit. */
    uint16_t bits;         /**< Bits per sample. */
    uint16_t frameNumber;  /**< Rolling number from the camera. */
    uint32_t bayerPattern; /**< One of zpat.... */
    uint32_t errorCode;    /**< What is wrong with this image, or zerrNone. */
    uint32_t timeStamp;    /**< Always 0. */
    uint32_t privateCamera[2];
    uint32_t privateBinning;
    uint32_t privateRealTime;
    uint32_t privatePattern;
    uint32_t reserved64[2]; /**< Never written. */
    uint32_t privateFilled;
    uint32_t reserved76; /**< Never written. */
} Zentara_Frame;

/**
 * Called on an event of a queued entry. `userPrivate` and `userData` are those of the queueing
 * call.
 *
 *     event               errorCode                  flags
 *     exposure finished   0                          zcbExposeDone
 *     frame delivered     errorCode of the frame     zcbFrameDone
 *     settings applied    result of the change       as given when queued
 *
 * See the rules at the top for what a callback may not do.
 */
typedef void (*ZentaraAsyncCallback)(uint64_t userPrivate, uint32_t userData, uint32_t errorCode,
                                     uint32_t flags);

/** Signature that Zentara_RegisterUnpluggedCallback takes; never called. */
typedef void (*ZentaraUnpluggedCallback)(uint64_t userPrivate);

/* The records' layout, checked while compiling in C99 and in C++ alike. */
#define ZENTARA_ASSERT_LAYOUT(name, condition) \
    typedef char zentaraLayout##name[(condition) ? 1 : -1]
ZENTARA_ASSERT_LAYOUT(ItemSize, sizeof(Zentara_CamListItem) == 56);
ZENTARA_ASSERT_LAYOUT(ItemType, offsetof(Zentara_CamListItem, cameraType) == 4);
ZENTARA_ASSERT_LAYOUT(ItemUniqueId, offsetof(Zentara_CamListItem, uniqueId) == 8);
ZENTARA_ASSERT_LAYOUT(ItemIsOpen, offsetof(Zentara_CamListItem, isOpen) == 12);
ZENTARA_ASSERT_LAYOUT(ItemReserved, offsetof(Zentara_CamListItem, reserved) == 16);
ZENTARA_ASSERT_LAYOUT(SettingsSize, sizeof(Zentara_Settings) == 260);
ZENTARA_ASSERT_LAYOUT(SettingsWords, offsetof(Zentara_Settings, privateWords) == 4);
ZENTARA_ASSERT_LAYOUT(FrameSize, sizeof(Zentara_Frame) == 80);
ZENTARA_ASSERT_LAYOUT(FrameBuffer, offsetof(Zentara_Frame, pBuffer) == 0);
ZENTARA_ASSERT_LAYOUT(FrameBufferSize, offsetof(Zentara_Frame, bufferSize) == 8);
ZENTARA_ASSERT_LAYOUT(FrameFormat, offsetof(Zentara_Frame, format) == 12);
ZENTARA_ASSERT_LAYOUT(FrameWidth, offsetof(Zentara_Frame, width) == 16);
ZENTARA_ASSERT_LAYOUT(FrameHeight, offsetof(Zentara_Frame, height) == 20);
ZENTARA_ASSERT_LAYOUT(FrameBytes, offsetof(Zentara_Frame, size) == 24);
ZENTARA_ASSERT_LAYOUT(FrameBits, offsetof(Zentara_Frame, bits) == 28);
ZENTARA_ASSERT_LAYOUT(FrameNumber, offsetof(Zentara_Frame, frameNumber) == 30);
ZENTARA_ASSERT_LAYOUT(FramePattern, offsetof(Zentara_Frame, bayerPattern) == 32);
ZENTARA_ASSERT_LAYOUT(FrameError, offsetof(Zentara_Frame, errorCode) == 36);
ZENTARA_ASSERT_LAYOUT(FrameTime, offsetof(Zentara_Frame, timeStamp) == 40);
ZENTARA_ASSERT_LAYOUT(FrameCamera, offsetof(Zentara_Frame, privateCamera) == 44);
ZENTARA_ASSERT_LAYOUT(FrameBinning, offsetof(Zentara_Frame, privateBinning) == 52);
ZENTARA_ASSERT_LAYOUT(FrameRealTime, offsetof(Zentara_Frame, privateRealTime) == 56);
ZENTARA_ASSERT_LAYOUT(FrameRawPattern, offsetof(Zentara_Frame, privatePattern) == 60);
ZENTARA_ASSERT_LAYOUT(FrameReserved64, offsetof(Zentara_Frame, reserved64) == 64);
ZENTARA_ASSERT_LAYOUT(FrameFilled, offsetof(Zentara_Frame, privateFilled) == 72);
ZENTARA_ASSERT_LAYOUT(FrameReserved76, offsetof(Zentara_Frame, reserved76) == 76);
#undef ZENTARA_ASSERT_LAYOUT

/* ---- Lifetime and cameras ---- */

/**
 * Loads the library and opens the bus. The library's switches are read from the system's settings
 * store at each call.
 *
 * zerrAlreadyLoaded (7) when it is loaded; it stays so.
 */
ZENTARA_API ZentaraResult Zentara_LoadDriver(void);

/**
 * Releases the library: closes the cameras that are still open, ends their threads, gives back what
 * they hold of the bus, and makes every handle invalid. Nothing happens when the library is not
 * loaded. Waits for a callback that is running; must not be called from one.
 */
ZENTARA_API void Zentara_ReleaseDriver(void);

/**
 * Stores the version in two parts: 2 and 0.
 *
 * 8 not loaded; 2 `major` null; 2 `minor` null.
 */
ZENTARA_API ZentaraResult Zentara_Version(uint16_t* major, uint16_t* minor);

/**
 * Stores the version in three parts: 2, 0 and 8.
 *
 * 8 not loaded; 2 `major` null; 2 `minor` null; 2 `build` null.
 */
ZENTARA_API ZentaraResult Zentara_LibVersion(uint16_t* major, uint16_t* minor, uint16_t* build);

/**
 * Looks for cameras, reads each one and sets it up, and fills `items`.
 *
 * `*length` holds the number of records in `items` (0 is allowed) and becomes the number of cameras
 * found, at most 10, which may be larger: records beyond the array are not written, so a client
 * that finds more than it had room for asks again. The cameras of the former list are given up and
 * their handles end, except those that are open, which keep working but are not listed. A camera
 * that another process has open is left out.
 *
 * 8 not loaded; 2 `items` null; 2 `length` null; a camera's failure (15, 16 or 30). After a
 * camera's failure `items` and `*length` tell the cameras before it, which may be used.
 */
ZENTARA_API ZentaraResult Zentara_ListCameras(Zentara_CamListItem* items, uint32_t* length);

/**
 * Opens a camera of the list and starts its two threads. Streaming is off afterwards.
 *
 * 8 not loaded; 2 `handle` null; 11 `cameraId` is not in the list; 11 the camera is open already;
 * a camera's failure (15, 16 or 30); 16 there is no memory (the camera is closed again). The second
 * 11 stores the handle all the same: the client then has a failure and a handle, which works if
 * this process opened the camera.
 */
ZENTARA_API ZentaraResult Zentara_OpenCamera(uint32_t cameraId, ZentaraHandle* handle);

/**
 * Stops streaming, ends the camera's threads, drops what is queued without calling a callback, and
 * gives the camera back. The client's frames, buffers and blocks are the client's again. What the
 * camera operations report is ignored: should the close fail, the camera answers as closed all the
 * same, and a later call of this function tries it again.
 *
 * 8 not loaded; 9 `handle` null; 9 open in another process; 9 not open. Never call it from a
 * callback of this camera: it waits for that callback for ever.
 */
ZENTARA_API ZentaraResult Zentara_CloseCamera(ZentaraHandle handle);

/**
 * Accepted and ignored: `callback` is never called. An unplugged camera shows itself by the frame
 * error zerrUnplugged alone.
 *
 * 8 not loaded.
 */
ZENTARA_API ZentaraResult Zentara_RegisterUnpluggedCallback(ZentaraHandle handle,
                                                            ZentaraUnpluggedCallback callback,
                                                            uint64_t userPrivate);

/**
 * Service access to the camera's configuration block, on the bus and at once.
 *
 * `selector` 2 reads `quadlets` words of 32 bits into `data`; `checksum` is ignored. `selector` 3
 * writes them; `checksum` must be the sum modulo 2^32 of the complements of the words. Words 80 to
 * 150 of a longer write are left out. `data` must hold `quadlets` words; the library cannot check
 * it.
 *
 * 8 not loaded; 1 anything else that fails, a wrong handle, null `data` and a wrong checksum
 * included.
 */
ZENTARA_API ZentaraResult _Zentara_factory_reserved0(ZentaraHandle handle, uint32_t selector,
                                                     void* data, uint32_t quadlets,
                                                     uint32_t checksum);

/* ---- Settings ---- */

/**
 * Fills `settings` with the camera's state. The block needs no preparation; it is not cleared
 * first, so that words which the camera does not fill (17, 18, 38, 40, 41, 45 and 46, and word 12
 * of a camera without an image format) and the reserved bytes keep what was in them. What was read
 * is from now on the state that a later change is compared with.
 *
 * 8 not loaded; 9 `handle` null; 2 `settings` null; 9 not open; 9 open in another process.
 */
ZENTARA_API ZentaraResult Zentara_ReadSettingsFromCam(ZentaraHandle handle,
                                                      Zentara_Settings* settings);

/**
 * Fills `settings` with the camera's defaults, all 260 bytes. The depth of the image format and the
 * high gain mode are the present ones. Switches post-processing off at once, before anything is
 * sent; what the next send is compared with stays.
 *
 * 8 not loaded; 9 `handle` null; 2 `settings` null; 9 not open; 9 open in another process.
 */
ZENTARA_API ZentaraResult Zentara_ReadDefaultSettings(ZentaraHandle handle,
                                                      Zentara_Settings* settings);

/** Does nothing. 8 not loaded; else 1. */
ZENTARA_API ZentaraResult Zentara_TranslateSettings(ZentaraHandle handle,
                                                    Zentara_Settings* settings);

/**
 * Mends `settings` in place so that it fits the camera, as every send does first: readout speed of
 * a 16-bit format, region of interest, exposures. Gain, offset and temperature are left to the
 * camera. The microsecond words do not follow what is changed in the 64-bit exposures.
 *
 * On a camera in real-time video a block for the standard mode makes the camera leave the mode and
 * enter it again, which stops a stream.
 *
 * 8 not loaded; 9 `handle` null; 2 `settings` null; 9 not a camera, not open, or open in another
 * process; the failure of a question for the exposure's limits, after the region of interest has
 * been mended: 3 for a block without its magic number, 3 when the camera of the block's own handle
 * is not open.
 */
ZENTARA_API ZentaraResult Zentara_PreflightSettings(ZentaraHandle handle,
                                                    Zentara_Settings* settings);

/**
 * Makes `settings` the state of the camera. The block is mended as by Zentara_PreflightSettings,
 * its values are set one after the other in a fixed order, and what the camera made of region,
 * binning and readout speed is read back into the block. Goes over the bus. Streaming that had to
 * stop goes on afterwards. A setting that the camera does not have is no failure.
 *
 * The first failure ends the call: what was set before it stays set. After a failed send, whichever
 * call made it, queued changes are no longer applied at the end of an exposure until a send
 * succeeds; those with an entry behind them are still applied when their frame is delivered. Waits
 * while another thread sends settings or queues.
 *
 * 8 not loaded; 9 `handle` null; 3 `settings` null or without its magic number; 9 not open; 9 open
 * in another process; a camera's failure (15, 16 or 30).
 */
ZENTARA_API ZentaraResult Zentara_SendSettingsToCam(ZentaraHandle handle,
                                                    Zentara_Settings* settings);

/* ---- Parameters of a settings block ---- */

/**
 * The value of a parameter, and its least and greatest value. A block is read; the camera is not.
 *
 * `key` is one of zprm..., zprmS32... or zprm64.... Gain, offset, exposures and normalised gain are
 * worked out from the values that are sent, whatever their own words hold. Where a key has a list
 * of allowed values and no range, its limits are the first and the last entry of that list.
 * zprmS32NormalizedGaindB reads back rounded to its step and brought into its limits, whatever was
 * stored.
 *
 * 8 not loaded; 2 `settings` null; 2 `value` null; 3 no magic number; 3 the block's camera is not
 * open; 1 the camera does not have the key, or the key has no such value (`*value` untouched).
 */
ZENTARA_API ZentaraResult Zentara_GetParam(Zentara_Settings* settings, uint32_t key,
                                           uint32_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParamMin(Zentara_Settings* settings, uint32_t key,
                                              uint32_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParamMax(Zentara_Settings* settings, uint32_t key,
                                              uint32_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParamS32(Zentara_Settings* settings, uint32_t key,
                                              int32_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParamS32Min(Zentara_Settings* settings, uint32_t key,
                                                 int32_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParamS32Max(Zentara_Settings* settings, uint32_t key,
                                                 int32_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParam64(Zentara_Settings* settings, uint32_t key,
                                             uint64_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParam64Min(Zentara_Settings* settings, uint32_t key,
                                                uint64_t* value);
/** See Zentara_GetParam. */
ZENTARA_API ZentaraResult Zentara_GetParam64Max(Zentara_Settings* settings, uint32_t key,
                                                uint64_t* value);

/**
 * Stores a value in a block; the camera changes when the block is sent.
 *
 * A value beyond the limits passes where the key has a range and no list: the camera's answer shows
 * when the block is sent. Gain, offset and normalised gain are stored as the signed keys that are
 * sent; exposures of 32 bits are stored in their 64-bit key as well. zprmIntensifierGain and
 * zprmNormIntensGaindB are never sent: zprm64NormIntensGain sets the gain of the intensifier.
 *
 * 8 not loaded; 2 `settings` null; 3 no magic number; 1 no such key; 3 the block's camera is not
 * open; 1 the camera does not have the key; 1 a binning that is not in the list, or a key that
 * cannot be set (nothing stored); 2 any other value that is not in its list, or a cooling target
 * beyond its limits (nothing stored); 2 an exposure beyond its limits, which is stored all the same
 * and brought to the nearest limit by the send. zprmColorWheel and zprmPostProcessBayerAlgorithm
 * are stored whatever they are, in spite of their lists.
 */
ZENTARA_API ZentaraResult Zentara_SetParam(Zentara_Settings* settings, uint32_t key,
                                           uint32_t value);
/** See Zentara_SetParam. Gain and offset are not checked. */
ZENTARA_API ZentaraResult Zentara_SetParamS32(Zentara_Settings* settings, uint32_t key,
                                              int32_t value);
/** See Zentara_SetParam. The gain of the intensifier is not checked. */
ZENTARA_API ZentaraResult Zentara_SetParam64(Zentara_Settings* settings, uint32_t key,
                                             uint64_t value);

/**
 * 0 if the camera has the parameter, 1 if not.
 *
 * 8 not loaded; 9 `handle` null; 9 not open; 9 open in another process; 1 no such key.
 */
ZENTARA_API ZentaraResult Zentara_IsParamSupported(ZentaraHandle handle, uint32_t key);
/** See Zentara_IsParamSupported. */
ZENTARA_API ZentaraResult Zentara_IsParamS32Supported(ZentaraHandle handle, uint32_t key);
/** See Zentara_IsParamSupported. */
ZENTARA_API ZentaraResult Zentara_IsParam64Supported(ZentaraHandle handle, uint32_t key);

/**
 * 0 if the key has a continuous range, 1 if not.
 *
 * 8 not loaded; 2 `settings` null; 3 no magic number; 1 no such key; 1 the camera does not have the
 * key. A block whose camera is not open is answered as if the camera had every key.
 */
ZENTARA_API ZentaraResult Zentara_IsRangeTable(Zentara_Settings* settings, uint32_t key);
/** See Zentara_IsRangeTable. */
ZENTARA_API ZentaraResult Zentara_IsRangeTableS32(Zentara_Settings* settings, uint32_t key);
/** See Zentara_IsRangeTable. */
ZENTARA_API ZentaraResult Zentara_IsRangeTable64(Zentara_Settings* settings, uint32_t key);

/** 0 if the key has a list of allowed values, 1 if not. Tests as Zentara_IsRangeTable. */
ZENTARA_API ZentaraResult Zentara_IsSparseTable(Zentara_Settings* settings, uint32_t key);
/** 8 not loaded; else 1. */
ZENTARA_API ZentaraResult Zentara_IsSparseTableS32(Zentara_Settings* settings, uint32_t key);
/** 8 not loaded; else 1. */
ZENTARA_API ZentaraResult Zentara_IsSparseTable64(Zentara_Settings* settings, uint32_t key);

/**
 * Lists the allowed values of a key. `*size` is the room in `table`, entries, and becomes the
 * number of entries written; a list that does not fit is cut without an error.
 *
 * 8 not loaded; 2 `settings`, `table` or `size` null; 3 no magic number; 3 the block's camera is
 * not open; 0 for a `*size` of 0, with nothing written; 1 for a negative one; 1 the camera does not
 * have the key, or the key has no list.
 */
ZENTARA_API ZentaraResult Zentara_GetParamSparseTable(Zentara_Settings* settings, uint32_t key,
                                                      uint32_t* table, int32_t* size);
/** 8 not loaded; else 1, and `*size` becomes 0. */
ZENTARA_API ZentaraResult Zentara_GetParamSparseTableS32(Zentara_Settings* settings, uint32_t key,
                                                         int32_t* table, int32_t* size);
/** 8 not loaded; else 1, and `*size` becomes 0. */
ZENTARA_API ZentaraResult Zentara_GetParamSparseTable64(Zentara_Settings* settings, uint32_t key,
                                                        uint64_t* table, int32_t* size);

/* ---- Information ---- */

/**
 * Stores one answer about the camera.
 *
 * `key` is one of zinf....
 *
 * 8 not loaded; 9 `handle` null; 2 `value` null; 9 not open; 9 open in another process;
 * 1 for a key that does not exist or has no answer (27, 28, 35, 41 and above: `*value` becomes 0);
 * 1 for an intensifier key on a camera without one (`*value` untouched); 1 for zinfTriggerDelayRes
 * on a camera without a trigger delay (`*value` written all the same).
 */
ZENTARA_API ZentaraResult Zentara_GetInfo(ZentaraHandle handle, uint32_t key, uint32_t* value);

/**
 * Copies the serial number's text with its terminator into `text` of `length` bytes.
 *
 * 8 not loaded; 9 `handle` null; 2 `text` null; 9 open in another process; 9 not open; 2 the text
 * and its terminator do not fit (`text` is untouched).
 */
ZENTARA_API ZentaraResult Zentara_GetSerialString(ZentaraHandle handle, char* text,
                                                  uint32_t length);

/**
 * Copies the model's name with its terminator into `text` of `length` bytes.
 *
 * 8 not loaded; 9 `handle` null; 2 `text` null; 9 not open; 9 open in another process; 2 the text
 * and its terminator do not fit (`text` is untouched).
 */
ZENTARA_API ZentaraResult Zentara_GetCameraModelString(ZentaraHandle handle, char* text,
                                                       uint32_t length);

/* ---- Capture ---- */

/**
 * Takes one image and waits for it, streaming or not. The wait has no useful limit: without images
 * it lasts for more than an hour, and Zentara_Abort from another thread ends it with code 16. While
 * a stream runs, no queued frame is served in the meantime.
 *
 * The frame's errorCode tells any trouble with the image, the result does not: an image that the
 * camera's filter wheel or post-processing made larger than bufferSize gives result 0, errorCode
 * zerrBufferTooSmall, size 0 and untouched pixels, with width, height and format telling what was
 * needed. The same code with a size that is not 0 is no matter of bufferSize: the camera has sent
 * more than the frame holds, or the library has been too short of memory for the image, which then
 * comes as far as it got, by width, height and format of a single colour of the wheel or still a
 * mosaic. It is not to be relied on. Frames of a stream tell of all this in the same way.
 *
 * 8 not loaded; 9 `handle` null; 2 `frame` null; 9 not open; 9 open in another process; 21 the
 * queue is not empty; 18 bufferSize is smaller than the camera's image; a camera's failure (15, 16
 * or 30). Never call it from a callback with zcbFrameDone.
 */
ZENTARA_API ZentaraResult Zentara_GrabFrame(ZentaraHandle handle, Zentara_Frame* frame);

/**
 * Queues a frame for an image of the stream, behind what is queued already. Frames are served in
 * the order of the calls; they may be queued before streaming starts, and stay queued when it
 * stops.
 *
 * `callback` may be null. `flags` are the events that the client wants, zcbFrameDone and
 * zcbExposeDone. `userPrivate` and `userData` go to the callback unchanged. For one frame the
 * callback with zcbExposeDone always comes before the one with zcbFrameDone, which waits up to five
 * seconds for it to return. May be called from a callback, also for the frame that it delivers.
 *
 * 8 not loaded; 9 `handle` null; 9 not open; 9 open in another process; 2 `frame` null; 22 there
 * are 100 entries in the queue; 18 bufferSize is smaller than the camera's image; 16 there is no
 * memory for the entry.
 */
ZENTARA_API ZentaraResult Zentara_QueueFrame(ZentaraHandle handle, Zentara_Frame* frame,
                                             ZentaraAsyncCallback callback, uint32_t flags,
                                             uint64_t userPrivate, uint32_t userData);

/**
 * Queues a change of settings that takes effect behind the frames queued before it, or applies it
 * at once if the queue is empty. A change of format depth, region of interest or readout speed
 * cannot be queued.
 *
 * A change that is the last entry behind its frame is applied only if the end of that frame's
 * exposure is seen before its image. Otherwise it is dropped with the next image, unsent and
 * without a callback, and that image is dropped too: queue a further frame behind each change.
 *
 * With an empty queue the change is made on this thread, the callback (if wanted by zcbFrameDone)
 * runs before the call returns, and the result is that of the change. That callback must not call
 * any queue function or change settings.
 *
 * 8 not loaded; 9 `handle` null; 9 not open; 9 open in another process; 3 `settings` null or
 * without its magic number; 22 there are 100 entries in the queue; 3 the change cannot be queued;
 * with an empty queue the result of the change, else 16 there is no memory for the entry.
 */
ZENTARA_API ZentaraResult Zentara_QueueSettings(ZentaraHandle handle, Zentara_Settings* settings,
                                                ZentaraAsyncCallback callback, uint32_t flags,
                                                uint64_t userPrivate, uint32_t userData);

/**
 * Turns streaming on (`enable` not 0) or off. To ask for what is already so is no failure. The
 * queue is not touched. Turning it off may take five seconds when no packets come.
 *
 * 8 not loaded; 9 `handle` null; 9 not open; 9 open in another process; a camera's failure (15, 16
 * or 30). A start that failed may leave streaming on: turn it off to clean up.
 */
ZENTARA_API ZentaraResult Zentara_SetStreaming(ZentaraHandle handle, uint32_t enable);

/**
 * Triggers one frame by software. Writes to the camera. Beside a call or a queued change that turns
 * streaming on, or off and on again, it may come when the camera does not wait for it, and is lost.
 *
 * 8 not loaded; 9 `handle` null; 9 not open; 24 streaming is off; 9 open in another process; 1 the
 * trigger mode is not ztrigSoftware; a camera's failure (15, 16 or 30).
 */
ZENTARA_API ZentaraResult Zentara_Trigger(ZentaraHandle handle);

/**
 * Drops what is queued without calling a callback and stops what the camera is doing: a
 * Zentara_GrabFrame that waits ends, and the next image is refused. Waits for a delivery that is in
 * progress, and up to five seconds for an exposure callback. No callback comes afterwards for what
 * was queued before; frames, buffers and blocks are the client's again. Streaming stays on.
 *
 * 8 not loaded; 9 `handle` null; 9 not open; 9 open in another process. Never call it from a
 * callback: from one that runs on the frame thread it waits for itself for ever.
 */
ZENTARA_API ZentaraResult Zentara_Abort(ZentaraHandle handle);

/** Accepted and ignored. 8 not loaded; else 1. */
ZENTARA_API ZentaraResult Zentara_GrabFrameNow(ZentaraHandle handle, Zentara_Frame* frame);

/** Accepted and ignored. 8 not loaded; else 1. */
ZENTARA_API ZentaraResult Zentara_GrabRawNow(ZentaraHandle handle, Zentara_Frame* frame);

/** Accepted and ignored. 8 not loaded; else 1. */
ZENTARA_API ZentaraResult Zentara_ProcessRaw(ZentaraHandle handle, Zentara_Frame* frame);

/** Accepted and ignored. 8 not loaded; else 1. */
ZENTARA_API ZentaraResult Zentara_SetFrameBuffers(ZentaraHandle handle, Zentara_Frame* frame);

/* ---- White balance and exposure: take images of their own ----
 *
 * Both run on the caller's thread, wait for each image as Zentara_GrabFrame does (Zentara_Abort
 * from another thread ends the wait) and go over the bus. Do not stream meanwhile, let no settings
 * be sent, and let no other call take or process images of the same camera. The region is in pixels
 * of the image; its width and height are cut to the image's (white balance: as it is finished; auto
 * exposure: as it is before its pixel ratio is corrected). `x` and `y` are not cut: a row that is
 * too long goes on in the row below, and what lies beyond the image counts as black. Of planes of
 * 16 bits every second row is taken. At the end the block goes to the camera as by
 * Zentara_SendSettingsToCam, whose result is not looked at, so `settings` should be what the camera
 * was last sent. A call waits for one that is under way on the same camera. Never call either from
 * a callback.
 */

/**
 * Finds the red and blue gains that make the mean of a region grey, and writes them, with a green
 * gain of 1000, to zprmPostProcessGainRed, -Green and -Blue of `settings`. Up to 6 images are
 * taken, until the mean of each colour lies in the middle of its range: 80 to 199 with 8 bits,
 * 20560 to 51400 with more. It is no failure when that does not come to pass. With a filter wheel
 * the scales of each image go to exposures and gains alike: they multiply the exposures, which are
 * written to the block, and those of the last image stay as gains, by which frames that are
 * post-processed are balanced once more. A colour of mean 0 makes gains of no use.
 *
 * A gain is a scale times 1000, truncated twice on its way to the camera and back: what
 * Zentara_ReadSettingsFromCam tells may be one less.
 *
 * 8 not loaded; 2 `settings` null; 3 no magic number, or the camera of the block is not open; 32
 * `width` or `height` 0, or both below 16 (one alone may be); 0 at once, without an image, when
 * zprmPostProcessImageFormat is not a format of colour (Zentara_isColor); a camera's failure (15,
 * 16 or 30); 16 for an image without three colours, such as a mosaic that the format in force does
 * not resolve; the failure of Zentara_SetParam or Zentara_SetParam64.
 */
ZENTARA_API ZentaraResult Zentara_WhiteBalance(Zentara_Settings* settings, uint32_t x, uint32_t y,
                                               uint32_t width, uint32_t height);

/**
 * Finds an exposure at which the brightest sample of a region lies near full scale, and writes it
 * to zprm64Exposure of `settings`, with the exposures of a filter wheel to zprm64ExposureRed and
 * zprm64ExposureBlue. Up to 10 images of 8 bits are taken; each moves the exposure by a factor of 4
 * at most, within the camera's limits, until it moves by no more than a tenth. A wheel that cycles
 * is held at green meanwhile; afterwards it starts with zprmColorWheel of `settings` again. Of an
 * image of one colour, an unresolved mosaic too, the region is not its rows but a run of `width` *
 * `height` consecutive samples from its first pixel on.
 *
 * A camera that fails meanwhile does not fail the call: the exposure that it has then is written
 * and sent.
 *
 * 8 not loaded; 2 `settings` null; 3 no magic number, or the camera of the block is not open; 32
 * `width` or `height` 0, or both below 16 (one alone may be); the failure of Zentara_SetParam64 of
 * zprm64Exposure.
 */
ZENTARA_API ZentaraResult Zentara_AutoExpose(Zentara_Settings* settings, uint32_t x, uint32_t y,
                                             uint32_t width, uint32_t height);

/* ---- Colours of frames that were taken before ---- */

/**
 * Finishes a frame that was taken with post-processing off: pixel ratio, colours of the mosaic and
 * white balance, with the algorithm and the format of `settings` and the present scales of the
 * white balance. Raw and monochrome frames are copied instead, their format stays.
 *
 * `inFrame` is a frame as it was delivered: its private words name the camera whose filters work,
 * which must be open; `handle` is tested and no more. The pixels of `inFrame` may be changed on the
 * way. `outFrame` may be the same record or have the same pBuffer. Format and algorithm stay in
 * force for what the camera delivers, until settings are sent or the next call of this kind.
 *
 * Copying, `outFrame` gets a new buffer of malloc if it has none, or if bufferSize is below the
 * frame's size: the old one is then given to free, so it must have come from malloc. bufferSize
 * becomes the size in both cases. All public fields follow, the private words do not.
 *
 * Finishing, `outFrame` needs a buffer for the largest image on the way, which is the result, the
 * frame itself, or its mosaic with the pixel ratio corrected; a bufferSize of 0 says that it is
 * large enough. It takes bits, format, width, height and size, its other fields stay. What goes
 * wrong in the filters is not told: 0 is returned and the record is filled all the same, as it
 * stands where the filters stopped. So it is for a format without three colours (0 to 5, the pixels
 * are the mosaic), for whole planes (6, 7), for a frame larger than the sensor, an image above 32
 * bits, and for a frame with fewer bytes than its size asks for: a ratio is not corrected then, a
 * mosaic is black where it has none. What a filter does not make needs no room. An algorithm above
 * 4 keeps the one in force.
 *
 * 8 not loaded; 2 `handle`, `inFrame` or `outFrame` null; 3 `settings` null or without its magic
 * number; 9 not a camera, not open, or open in another process. Copying: 2 `inFrame` has no buffer,
 * or one below its size (bufferSize 0 says nothing); 16 there is no memory. Finishing: the failure
 * of Zentara_GetParam for the format; 2 an image of this format would be empty; 9 the camera of
 * `inFrame` is not open; 2 `inFrame` has no buffer, or one below its size; 2 the algorithm is 0;
 * 2 `outFrame` has no buffer; 18 it is too small. The last three leave the format, and the last two
 * the algorithm, in force.
 */
ZENTARA_API ZentaraResult Zentara_PostProcessSingleFrame(ZentaraHandle handle,
                                                         Zentara_Settings* settings,
                                                         const Zentara_Frame* inFrame,
                                                         Zentara_Frame* outFrame);

/**
 * Makes the colours of a mosaic frame: `inFrame` as it was delivered, `outFrame` with its buffer
 * and with the wanted format (8 to 12; RGB48 for samples of 16 bits, the others for bytes).
 *
 * `algorithm` is one of zbayer...; one above 4 keeps the one in force. `outFrame` takes width,
 * height, bits and size; its other fields stay. It may be the same record or have the same pBuffer;
 * the same record has one format for both, with which no pixels are written. Neither the pixel
 * ratio is corrected nor are the colours scaled. Whatever the filter does not take (another
 * `inFrame` than a mosaic, another format, a frame larger than the sensor) gives 0 all the same,
 * needs no room, writes no pixels and leaves width and height as they were. Format and algorithm
 * stay in force for what the camera delivers. With algorithm 0 the format alone is set and nothing
 * else happens.
 *
 * 8 not loaded; 2 `inFrame` or `outFrame` null; 9 the camera of `inFrame` is not open; 2 `inFrame`
 * has no buffer, or one below its size (bufferSize 0 says nothing); 2 `outFrame` has no buffer; 18
 * its bufferSize is not 0 and too small. The last two leave format and algorithm in force.
 */
ZENTARA_API ZentaraResult Zentara_BayerToRgb(uint32_t algorithm, const Zentara_Frame* inFrame,
                                             Zentara_Frame* outFrame);

/**
 * Doubles the height of a mosaic frame, which stays a mosaic of the same pattern: two rows of
 * `inFrame` and two computed from samples of the same colour make four. Computed rows of frames
 * below 5 columns, or 6 rows of output, keep what the buffer held. Both frames may have one buffer,
 * which then holds the output; buffers that overlap in any other way give undefined pixels.
 *
 * The client fills height, twice that of `inFrame`, pBuffer and bufferSize of `outFrame`; a
 * bufferSize of 0 leaves the room to the client's word. `outFrame` takes width and bits; size,
 * format and pattern stay what they were. inFrame->bayerPattern is the pattern: 0 to 3, 5 to 8
 * count as these, any other as 0.
 *
 * 8 not loaded; 1 `algorithm` is not zbayerFast; 2 a frame or its pBuffer null; 0 at once, with
 * nothing written, when the format of `inFrame` is no mosaic (Zentara_isBayer); 2 the heights do
 * not fit; 2 the bufferSize of `inFrame`, unless 0, is below its size, or its size below its rows;
 * 18 the bufferSize of `outFrame` is too small.
 */
ZENTARA_API ZentaraResult Zentara_BayerZoomVert(uint32_t algorithm, const Zentara_Frame* inFrame,
                                                Zentara_Frame* outFrame);

/* ---- Image helpers: need no loaded library, reentrant ---- */

/** 1 if samples of `format` have 16 bits (1, 3, 5, 7, 10), else 0. */
ZENTARA_API uint32_t Zentara_is16bit(uint32_t format);

/** 1 if `format` has three colours per pixel (6 to 12), else 0. */
ZENTARA_API uint32_t Zentara_is3Color(uint32_t format);

/** 1 if `format` is a colour mosaic (4, 5), else 0. */
ZENTARA_API uint32_t Zentara_isBayer(uint32_t format);

/** 1 if `format` is of colour, as a mosaic or finished (4 to 12), else 0. */
ZENTARA_API uint32_t Zentara_isColor(uint32_t format);

/** 1 if `format` is monochrome (2, 3), else 0. */
ZENTARA_API uint32_t Zentara_isMonochrome(uint32_t format);

/** Bytes of an image of `width` x `height` pixels; 0 for a `format` above 12. */
ZENTARA_API uint64_t Zentara_CalcImageSize(uint32_t format, uint32_t width, uint32_t height);

#ifdef __cplusplus
}
#endif

#endif /* ZENTARA_ZENTARA_H */
