#ifndef ZENTARA_TEST_DRIVER_STATE_H
#define ZENTARA_TEST_DRIVER_STATE_H

#include <ddk/wdm.h>

#include "road_protocol.h"

/* What the driver's sources share. One spin lock guards all of it; no request is completed while it
 * is held. A request leaves the list `pended` exactly once, and whoever took it off completes it.
 */

#define ROAD_TAG 0x5A524F44

/* Codes of which the driver takes note itself. */
#define STREAM_LEAVE 0x22A090
#define ATTACH_BUFFER 0x22A0BA

#define ERROR_OPERATION_ABORTED 995
#define ERROR_DEVICE_NOT_CONNECTED 1167

typedef struct DeviceExtension {
    BOOLEAN isControl;
    BOOLEAN isPlugged;
    BOOLEAN isLeft; /* no buffer is completed from STREAM_LEAVE to the next ATTACH_BUFFER */
    UINT32 index;
    RoadPrepared prepared;
    BOOLEAN isPrepared;
} DeviceExtension;

/* One message to the helper. A request to be answered is in `pended` until it ends, and in `queued`
 * until the helper takes it. */
typedef struct Message {
    LIST_ENTRY pendedEntry;
    LIST_ENTRY queuedEntry;
    RoadRequest record;
    IRP* irp; /* null when nothing is to be ended */
    BOOLEAN isQueued;
} Message;
typedef struct DriverState {
    DRIVER_OBJECT* driver;
    DEVICE_OBJECT* controlDevice;
    DEVICE_OBJECT* cameras[ROAD_DEVICES_MAX];
    WCHAR links[ROAD_DEVICES_MAX][ROAD_LINK_MAX + 8];

    KSPIN_LOCK lock; /* guards what follows, and the extensions of the cameras */
    LIST_ENTRY pended;
    LIST_ENTRY queued;
    IRP* waitingNext; /* the helper's ROAD_NEXT */
    FILE_OBJECT* helper;
    UINT64 lastId;
    UINT32 cancelledCount;
    UINT32 openFileCount;
} DriverState;

extern DriverState driverState;

/* ---- requests.c: ending requests ---- */

/* A system error number as a status that the system turns back into that number. */
NTSTATUS GetStatusOfError(UINT32 error);
NTSTATUS Complete(IRP* irp, NTSTATUS status, ULONG_PTR bytes);
DeviceExtension* GetExtension(DEVICE_OBJECT* device);
/* Writes an answer within the length of the caller's output; returns the bytes written. */
ULONG CopyOutput(IRP* irp, const RoadRequest* record, const void* data, ULONG bytes);
/* Takes `message` off the lists. The caller holds the lock. */
void Unlink(Message* message);
/* Counts the files of the cameras that are open, each once, however often it is told. */
void CountFile(FILE_OBJECT* file, BOOLEAN isOpen);
/* Takes the request of `message` for the caller to complete. False when a cancellation has it
 * already. The caller holds the lock. */
BOOLEAN TakeForEnd(Message* message);

/* Ends each pended request that `isMeant` takes, one at a time and without the lock. */
typedef BOOLEAN (*MessageTest)(const Message* message, const void* context);
void EndAll(MessageTest isMeant, const void* context, UINT32 error);
BOOLEAN IsAny(const Message* message, const void* context);
BOOLEAN IsOfDevice(const Message* message, const void* context);
BOOLEAN IsOfFile(const Message* message, const void* context);
void EndTaken(Message* message, UINT32 error);

/* ---- requests.c: handing requests to the helper ---- */

Message* MakeMessage(UINT32 kind, UINT32 device);
/* The caller holds the lock. */
void Enqueue(Message* message);
/* Tells the helper something that it does not answer. */
void Tell(UINT32 kind, UINT32 device, UINT64 id, UINT64 file);
/* Completes the helper's request if it waits and there is a message for it. */
void ServeHelper(void);

/* ---- camera_device.c, control_device.c ---- */

NTSTATUS DispatchCamera(DEVICE_OBJECT* device, IRP* irp);
NTSTATUS DispatchControl(IRP* irp);
/* Ends the helper's request; nobody serves from then on. What is pended stays. */
void DismissHelper(void);
/* Takes the camera's link away, ends what is pended and fails what comes. */
void Unplug(UINT32 index);

#endif
