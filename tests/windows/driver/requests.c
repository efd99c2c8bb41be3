#include "driver_state.h"

NTSTATUS GetStatusOfError(UINT32 error) {
    if (error == ERROR_OPERATION_ABORTED) return STATUS_CANCELLED;
    return (NTSTATUS)(0xC0010000u | (error & 0xFFFFu));
}

NTSTATUS Complete(IRP* irp, NTSTATUS status, ULONG_PTR bytes) {
    irp->IoStatus.Status = status;
    irp->IoStatus.Information = bytes;
    IoCompleteRequest(irp, IO_NO_INCREMENT);
    return status;
}

DeviceExtension* GetExtension(DEVICE_OBJECT* device) {
    return (DeviceExtension*)device->DeviceExtension;
}

static UINT32 GetMethod(UINT32 code) {
    return code & 3;
}

/* Where the data of an answer go: the system's buffer, or the caller's own pages. */
static void* GetOutput(IRP* irp, UINT32 code) {
    if (GetMethod(code) == METHOD_BUFFERED) return irp->AssociatedIrp.SystemBuffer;
    if (irp->MdlAddress == NULL) return NULL;
    return MmGetSystemAddressForMdlSafe(irp->MdlAddress, NormalPagePriority);
}

ULONG CopyOutput(IRP* irp, const RoadRequest* record, const void* data, ULONG bytes) {
    void* output = GetOutput(irp, record->code);
    if (bytes > record->outputBytes) bytes = record->outputBytes;
    if (output == NULL || bytes == 0) return 0;
    RtlCopyMemory(output, data, bytes);
    return bytes;
}

void Unlink(Message* message) {
    RemoveEntryList(&message->pendedEntry);
    if (message->isQueued) RemoveEntryList(&message->queuedEntry);
    message->isQueued = FALSE;
}

BOOLEAN TakeForEnd(Message* message) {
    if (message->irp != NULL && IoSetCancelRoutine(message->irp, NULL) == NULL) return FALSE;
    Unlink(message);
    return TRUE;
}

void CountFile(FILE_OBJECT* file, BOOLEAN isOpen) {
    KIRQL irql;
    KeAcquireSpinLock(&driverState.lock, &irql);
    if ((file->FsContext != NULL) != isOpen) {
        file->FsContext = isOpen ? &driverState : NULL;
        driverState.openFileCount += isOpen ? 1 : -1;
    }
    KeReleaseSpinLock(&driverState.lock, irql);
}

void EndTaken(Message* message, UINT32 error) {
    /* A file that could not be opened is not closed. */
    if (message->irp != NULL && message->record.kind == RoadOpen) {
        CountFile((FILE_OBJECT*)(ULONG_PTR)message->record.file, FALSE);
    }
    if (message->irp != NULL) Complete(message->irp, GetStatusOfError(error), 0);
    ExFreePoolWithTag(message, ROAD_TAG);
}

static Message* TakeFirst(MessageTest isMeant, const void* context) {
    LIST_ENTRY* entry;
    for (entry = driverState.pended.Flink; entry != &driverState.pended; entry = entry->Flink) {
        Message* message = CONTAINING_RECORD(entry, Message, pendedEntry);
        if (isMeant(message, context) && TakeForEnd(message)) return message;
    }
    return NULL;
}

void EndAll(MessageTest isMeant, const void* context, UINT32 error) {
    for (;;) {
        KIRQL irql;
        Message* message;
        KeAcquireSpinLock(&driverState.lock, &irql);
        message = TakeFirst(isMeant, context);
        KeReleaseSpinLock(&driverState.lock, irql);
        if (message == NULL) return;
        EndTaken(message, error);
    }
}

BOOLEAN IsAny(const Message* message, const void* context) {
    (void)message;
    (void)context;
    return TRUE;
}

BOOLEAN IsOfDevice(const Message* message, const void* context) {
    return message->irp != NULL && message->record.device == *(const UINT32*)context;
}

BOOLEAN IsOfFile(const Message* message, const void* context) {
    return message->irp != NULL && message->record.file == (UINT64)(ULONG_PTR)context;
}

static const void* GetInput(const Message* message) {
    return message->irp == NULL ? NULL : message->irp->AssociatedIrp.SystemBuffer;
}

/* Writes the message into the buffer of the helper's request. */
static NTSTATUS FillNext(IRP* next, const Message* message, ULONG* written) {
    const IO_STACK_LOCATION* stack = IoGetCurrentIrpStackLocation(next);
    const ULONG capacity = stack->Parameters.DeviceIoControl.OutputBufferLength;
    const ULONG input = message->record.inputBytes;
    UCHAR* output = next->AssociatedIrp.SystemBuffer;
    *written = 0;
    if (capacity < sizeof message->record || capacity - sizeof message->record < input) {
        return STATUS_BUFFER_TOO_SMALL;
    }
    RtlCopyMemory(output, &message->record, sizeof message->record);
    if (input != 0) RtlCopyMemory(output + sizeof message->record, GetInput(message), input);
    *written = sizeof message->record + input;
    return STATUS_SUCCESS;
}

/* Takes the helper's request if it waits and there is a message for it; null else. The message is
 * no longer queued then. The caller holds the lock. */
static IRP* TakeNextWithMessage(NTSTATUS* status, ULONG* written) {
    IRP* next = driverState.waitingNext;
    Message* message;
    if (next == NULL || IsListEmpty(&driverState.queued)) return NULL;
    if (IoSetCancelRoutine(next, NULL) == NULL) return NULL;
    driverState.waitingNext = NULL;
    message = CONTAINING_RECORD(driverState.queued.Flink, Message, queuedEntry);
    *status = FillNext(next, message, written);
    if (NT_SUCCESS(*status)) {
        RemoveEntryList(&message->queuedEntry);
        message->isQueued = FALSE;
        if (message->irp == NULL) {
            RemoveEntryList(&message->pendedEntry);
            ExFreePoolWithTag(message, ROAD_TAG);
        }
    }
    return next;
}

void ServeHelper(void) {
    KIRQL irql;
    NTSTATUS status = STATUS_SUCCESS;
    ULONG written = 0;
    IRP* next;
    KeAcquireSpinLock(&driverState.lock, &irql);
    next = TakeNextWithMessage(&status, &written);
    KeReleaseSpinLock(&driverState.lock, irql);
    if (next != NULL) Complete(next, status, written);
}

Message* MakeMessage(UINT32 kind, UINT32 device) {
    Message* message = ExAllocatePoolWithTag(NonPagedPool, sizeof *message, ROAD_TAG);
    if (message == NULL) return NULL;
    RtlZeroMemory(message, sizeof *message);
    message->record.kind = kind;
    message->record.device = device;
    return message;
}

void Enqueue(Message* message) {
    message->isQueued = TRUE;
    InsertTailList(&driverState.pended, &message->pendedEntry);
    InsertTailList(&driverState.queued, &message->queuedEntry);
}

void Tell(UINT32 kind, UINT32 device, UINT64 id, UINT64 file) {
    KIRQL irql;
    Message* message = MakeMessage(kind, device);
    if (message == NULL) return;
    message->record.id = id;
    message->record.file = file;
    KeAcquireSpinLock(&driverState.lock, &irql);
    if (driverState.helper != NULL) {
        Enqueue(message);
        message = NULL;
    }
    KeReleaseSpinLock(&driverState.lock, irql);
    if (message != NULL) ExFreePoolWithTag(message, ROAD_TAG);
    ServeHelper();
}
