#ifndef ZENTARA_ROAD_PROTOCOL_H
#define ZENTARA_ROAD_PROTOCOL_H

/* What the test driver and the programs above it say to each other. The driver makes camera devices
 * on demand and hands each request to a helper program, which asks for the next one and posts the
 * answers. Read by C and C++, in the kernel and outside; all records are packed by their order. */

#include <stdint.h>

/** Name of the driver's service, and of the device through which it is controlled. */
#define ROAD_SERVICE_NAME "ZentaraTest"
#define ROAD_CONTROL_PATH "\\\\.\\ZentaraTestControl"

/** Cameras that the driver holds at most, and the length of a link's name with its end. */
#define ROAD_DEVICES_MAX 8
#define ROAD_LINK_MAX 256

/** Data of a prepared answer. */
#define ROAD_PREPARED_BYTES_MAX 64

/** Codes of the control device: device type 0x22, buffered, any access. */
#define ROAD_CODE(function) ((0x22u << 16) | ((function) << 2))

/** Input: RoadDevice. Makes a camera device and its link below \??, replacing one of that index. */
#define ROAD_PLUG ROAD_CODE(0x901u)
/** Input: RoadDevice, of which the index counts. Takes the link away, ends what is pended and fails
 * what comes; the device itself goes with the driver. */
#define ROAD_UNPLUG ROAD_CODE(0x902u)
/** Output: RoadRequest and the request's input. Pended until there is a request. The file that asks
 * is the helper; when it goes, everything that is pended ends with a failure. */
#define ROAD_NEXT ROAD_CODE(0x903u)
/** Input: RoadAnswer and the data. An answer to a request that has ended is ignored. */
#define ROAD_ANSWER ROAD_CODE(0x904u)
/** Input: RoadPrepared. The next request with this code is answered within the driver's dispatch
 * routine, without the helper. */
#define ROAD_PREPARE ROAD_CODE(0x905u)
/** Output: RoadState. */
#define ROAD_STATE ROAD_CODE(0x906u)

typedef struct RoadDevice {
    uint32_t index;
    uint32_t reserved;
    char link[ROAD_LINK_MAX];
} RoadDevice;

enum RoadRequestKind {
    RoadOpen = 1,
    RoadControl = 2,
    /** Not answered: the file is closed, and its requests have ended. */
    RoadClose = 3,
    /** Not answered: the request `id` has ended early, and its answer is not awaited any longer. */
    RoadCancel = 4
};

typedef struct RoadRequest {
    uint64_t id;
    /** The open file of the device. */
    uint64_t file;
    uint32_t kind;
    uint32_t device;
    uint32_t code;
    uint32_t inputBytes;
    uint32_t outputBytes;
    uint32_t reserved;
} RoadRequest;

typedef struct RoadAnswer {
    uint64_t id;
    /** 0 or a system error number. */
    uint32_t error;
    /** Length of the answer; as many bytes follow at most. */
    uint32_t bytes;
} RoadAnswer;

typedef struct RoadPrepared {
    uint32_t device;
    uint32_t code;
    uint32_t error;
    uint32_t bytes;
    uint8_t data[ROAD_PREPARED_BYTES_MAX];
} RoadPrepared;

typedef struct RoadState {
    /** Requests that wait for the helper's answer. */
    uint32_t pended;
    /** Requests that were ended by a cancellation, since the driver started. */
    uint32_t cancelled;
    /** Files of the cameras that are open. */
    uint32_t openFiles;
    /** Whether a helper serves. */
    uint32_t isServed;
} RoadState;

#endif
