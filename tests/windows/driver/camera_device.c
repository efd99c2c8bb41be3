#include "driver_state.h"

static Message* FindOfIrp(const IRP* irp) {
    LIST_ENTRY* entry;
    for (entry = driverState.pended.Flink; entry != &driverState.pended; entry = entry->Flink) {
        Message* message = CONTAINING_RECORD(entry, Message, pendedEntry);
        if (message->irp == irp) return message;
    }
    return NULL;
}

/* Looks at the message alone: the device may go while this runs. */
static void NTAPI CancelCameraRequest(DEVICE_OBJECT* device, IRP* irp) {
    KIRQL irql;
    Message* message;
    BOOLEAN wasTaken = FALSE;
    (void)device;
    IoReleaseCancelSpinLock(irp->CancelIrql);
    KeAcquireSpinLock(&driverState.lock, &irql);
    message = FindOfIrp(irp);
    if (message != NULL) {
        wasTaken = !message->isQueued;
        Unlink(message);
        driverState.cancelledCount++;
    }
    KeReleaseSpinLock(&driverState.lock, irql);
    if (message != NULL && wasTaken) {
        Tell(RoadCancel, message->record.device, message->record.id, message->record.file);
    }
    if (message != NULL) {
        EndTaken(message, ERROR_OPERATION_ABORTED);
    } else {
        Complete(irp, STATUS_CANCELLED, 0);
    }
}

/* Lists the request of `message` with a routine for its cancellation, unless nobody would answer.
 * The caller holds the lock. */
static UINT32 Pend(Message* message, const DeviceExtension* camera) {
    IRP* irp = message->irp;
    if (driverState.helper == NULL || !camera->isPlugged) return ERROR_DEVICE_NOT_CONNECTED;
    message->record.id = ++driverState.lastId;
    IoSetCancelRoutine(irp, CancelCameraRequest);
    if (irp->Cancel && IoSetCancelRoutine(irp, NULL) != NULL) return ERROR_OPERATION_ABORTED;
    IoMarkIrpPending(irp);
    Enqueue(message);
    return 0;
}

/* Who leaves a stream ends its thread next, which cancels the requests of that thread. Wine does
 * not bear that a request is completed while its cancellation is on the way. */
static void NoteStream(DeviceExtension* camera, UINT32 code) {
    if (code == ATTACH_BUFFER) camera->isLeft = FALSE;
    if (code == STREAM_LEAVE) camera->isLeft = TRUE;
}

static NTSTATUS PendCameraRequest(DeviceExtension* camera, Message* message) {
    KIRQL irql;
    UINT32 error;
    KeAcquireSpinLock(&driverState.lock, &irql);
    NoteStream(camera, message->record.code);
    error = Pend(message, camera);
    KeReleaseSpinLock(&driverState.lock, irql);
    if (error != 0) {
        EndTaken(message, error);
        return GetStatusOfError(error);
    }
    ServeHelper();
    return STATUS_PENDING;
}

static NTSTATUS SendToHelper(DEVICE_OBJECT* device, IRP* irp, UINT32 kind) {
    DeviceExtension* camera = GetExtension(device);
    const IO_STACK_LOCATION* stack = IoGetCurrentIrpStackLocation(irp);
    Message* message = MakeMessage(kind, camera->index);
    if (message == NULL) {
        if (kind == RoadOpen) CountFile(stack->FileObject, FALSE);
        return Complete(irp, STATUS_INSUFFICIENT_RESOURCES, 0);
    }
    message->irp = irp;
    message->record.file = (UINT64)(ULONG_PTR)stack->FileObject;
    if (kind == RoadControl) {
        message->record.code = stack->Parameters.DeviceIoControl.IoControlCode;
        message->record.inputBytes = stack->Parameters.DeviceIoControl.InputBufferLength;
        message->record.outputBytes = stack->Parameters.DeviceIoControl.OutputBufferLength;
    }
    return PendCameraRequest(camera, message);
}

/* Answers a request for which an answer was prepared. The caller holds no lock. */
static BOOLEAN AnswerPrepared(DEVICE_OBJECT* device, IRP* irp, NTSTATUS* status) {
    DeviceExtension* camera = GetExtension(device);
    const IO_STACK_LOCATION* stack = IoGetCurrentIrpStackLocation(irp);
    RoadRequest record = {0};
    RoadPrepared prepared;
    KIRQL irql;
    BOOLEAN isMeant;
    record.code = stack->Parameters.DeviceIoControl.IoControlCode;
    record.outputBytes = stack->Parameters.DeviceIoControl.OutputBufferLength;
    KeAcquireSpinLock(&driverState.lock, &irql);
    isMeant = camera->isPrepared && camera->prepared.code == record.code;
    if (isMeant) {
        prepared = camera->prepared;
        camera->isPrepared = FALSE;
    }
    KeReleaseSpinLock(&driverState.lock, irql);
    if (!isMeant) return FALSE;
    if (prepared.error != 0) {
        *status = Complete(irp, GetStatusOfError(prepared.error), 0);
    } else {
        *status =
            Complete(irp, STATUS_SUCCESS, CopyOutput(irp, &record, prepared.data, prepared.bytes));
    }
    return TRUE;
}

/* The last handle has gone. Requests that are pended hold their file, so that its close would come
 * only after their end. */
static NTSTATUS CleanUpCamera(IRP* irp) {
    EndAll(IsOfFile, IoGetCurrentIrpStackLocation(irp)->FileObject, ERROR_OPERATION_ABORTED);
    return Complete(irp, STATUS_SUCCESS, 0);
}

static NTSTATUS CloseCamera(DEVICE_OBJECT* device, IRP* irp) {
    FILE_OBJECT* file = IoGetCurrentIrpStackLocation(irp)->FileObject;
    CountFile(file, FALSE);
    EndAll(IsOfFile, file, ERROR_OPERATION_ABORTED);
    Tell(RoadClose, GetExtension(device)->index, 0, (UINT64)(ULONG_PTR)file);
    return Complete(irp, STATUS_SUCCESS, 0);
}

/* How the system passes the buffers of a control request. */
static UINT32 GetMethod(IRP* irp) {
    return IoGetCurrentIrpStackLocation(irp)->Parameters.DeviceIoControl.IoControlCode & 3;
}

NTSTATUS DispatchCamera(DEVICE_OBJECT* device, IRP* irp) {
    NTSTATUS status;
    switch (IoGetCurrentIrpStackLocation(irp)->MajorFunction) {
        case IRP_MJ_CREATE:
            CountFile(IoGetCurrentIrpStackLocation(irp)->FileObject, TRUE);
            return SendToHelper(device, irp, RoadOpen);
        case IRP_MJ_CLEANUP:
            return CleanUpCamera(irp);
        case IRP_MJ_CLOSE:
            return CloseCamera(device, irp);
        case IRP_MJ_DEVICE_CONTROL:
            if (GetMethod(irp) == METHOD_NEITHER) {
                return Complete(irp, STATUS_INVALID_DEVICE_REQUEST, 0);
            }
            if (AnswerPrepared(device, irp, &status)) return status;
            return SendToHelper(device, irp, RoadControl);
        default:
            return Complete(irp, STATUS_SUCCESS, 0);
    }
}
