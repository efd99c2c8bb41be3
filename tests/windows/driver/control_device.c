#include "driver_state.h"

static void NTAPI CancelNext(DEVICE_OBJECT* device, IRP* irp) {
    KIRQL irql;
    (void)device;
    IoReleaseCancelSpinLock(irp->CancelIrql);
    KeAcquireSpinLock(&driverState.lock, &irql);
    if (driverState.waitingNext == irp) driverState.waitingNext = NULL;
    KeReleaseSpinLock(&driverState.lock, irql);
    Complete(irp, STATUS_CANCELLED, 0);
}

static void AppendText(WCHAR* name, ULONG* length, const char* text, ULONG capacity) {
    while (*text != '\0' && *length + 1 < capacity) name[(*length)++] = (UCHAR)*text++;
    name[*length] = 0;
}

static NTSTATUS MakeCameraDevice(UINT32 index) {
    WCHAR text[64];
    ULONG length = 0;
    UNICODE_STRING name;
    const char digit[2] = {(char)('0' + index), '\0'};
    DEVICE_OBJECT* device;
    NTSTATUS status;
    AppendText(text, &length, "\\Device\\ZentaraTest", 64);
    AppendText(text, &length, digit, 64);
    RtlInitUnicodeString(&name, text);
    status = IoCreateDevice(driverState.driver, sizeof(DeviceExtension), &name, FILE_DEVICE_UNKNOWN,
                            0, FALSE, &device);
    if (!NT_SUCCESS(status)) return status;
    RtlZeroMemory(device->DeviceExtension, sizeof(DeviceExtension));
    GetExtension(device)->index = index;
    device->Flags &= ~DO_DEVICE_INITIALIZING;
    driverState.cameras[index] = device;
    return STATUS_SUCCESS;
}

static void DeleteLink(UINT32 index) {
    UNICODE_STRING link;
    if (driverState.links[index][0] == 0) return;
    RtlInitUnicodeString(&link, driverState.links[index]);
    IoDeleteSymbolicLink(&link);
    driverState.links[index][0] = 0;
}

static NTSTATUS MakeLink(UINT32 index, const char* linkName) {
    WCHAR text[64];
    ULONG length = 0;
    UNICODE_STRING name, link;
    const char digit[2] = {(char)('0' + index), '\0'};
    NTSTATUS status;
    AppendText(text, &length, "\\Device\\ZentaraTest", 64);
    AppendText(text, &length, digit, 64);
    length = 0;
    AppendText(driverState.links[index], &length, "\\??\\", ROAD_LINK_MAX + 8);
    AppendText(driverState.links[index], &length, linkName, ROAD_LINK_MAX + 8);
    RtlInitUnicodeString(&name, text);
    RtlInitUnicodeString(&link, driverState.links[index]);
    status = IoCreateSymbolicLink(&link, &name);
    if (!NT_SUCCESS(status)) driverState.links[index][0] = 0;
    return status;
}

static void SetPlugged(UINT32 index, BOOLEAN isPlugged) {
    KIRQL irql;
    KeAcquireSpinLock(&driverState.lock, &irql);
    GetExtension(driverState.cameras[index])->isPlugged = isPlugged;
    GetExtension(driverState.cameras[index])->isPrepared = FALSE;
    KeReleaseSpinLock(&driverState.lock, irql);
}

void Unplug(UINT32 index) {
    if (driverState.cameras[index] == NULL) return;
    SetPlugged(index, FALSE);
    DeleteLink(index);
    EndAll(IsOfDevice, &index, ERROR_DEVICE_NOT_CONNECTED);
}

static NTSTATUS PlugCamera(void* buffer, IRP* irp, ULONG* bytes) {
    RoadDevice* camera = buffer;
    NTSTATUS status = STATUS_SUCCESS;
    (void)irp;
    (void)bytes;
    camera->link[ROAD_LINK_MAX - 1] = '\0';
    if (camera->index >= ROAD_DEVICES_MAX) return STATUS_INVALID_PARAMETER;
    Unplug(camera->index);
    if (driverState.cameras[camera->index] == NULL) status = MakeCameraDevice(camera->index);
    if (!NT_SUCCESS(status)) return status;
    status = MakeLink(camera->index, camera->link);
    if (NT_SUCCESS(status)) SetPlugged(camera->index, TRUE);
    return status;
}

static NTSTATUS UnplugCamera(void* buffer, IRP* irp, ULONG* bytes) {
    const RoadDevice* camera = buffer;
    (void)irp;
    (void)bytes;
    if (camera->index >= ROAD_DEVICES_MAX) return STATUS_INVALID_PARAMETER;
    Unplug(camera->index);
    return STATUS_SUCCESS;
}

static NTSTATUS PrepareAnswer(void* buffer, IRP* irp, ULONG* bytes) {
    const RoadPrepared* prepared = buffer;
    KIRQL irql;
    (void)irp;
    (void)bytes;
    if (prepared->device >= ROAD_DEVICES_MAX || driverState.cameras[prepared->device] == NULL ||
        prepared->bytes > ROAD_PREPARED_BYTES_MAX) {
        return STATUS_INVALID_PARAMETER;
    }
    KeAcquireSpinLock(&driverState.lock, &irql);
    GetExtension(driverState.cameras[prepared->device])->prepared = *prepared;
    GetExtension(driverState.cameras[prepared->device])->isPrepared = TRUE;
    KeReleaseSpinLock(&driverState.lock, irql);
    return STATUS_SUCCESS;
}

static NTSTATUS GetState(void* buffer, IRP* irp, ULONG* bytes) {
    RoadState* state = buffer;
    LIST_ENTRY* entry;
    KIRQL irql;
    (void)irp;
    KeAcquireSpinLock(&driverState.lock, &irql);
    state->pended = 0;
    for (entry = driverState.pended.Flink; entry != &driverState.pended; entry = entry->Flink) {
        if (CONTAINING_RECORD(entry, Message, pendedEntry)->irp != NULL) state->pended++;
    }
    state->cancelled = driverState.cancelledCount;
    state->openFiles = driverState.openFileCount;
    state->isServed = driverState.helper != NULL;
    KeReleaseSpinLock(&driverState.lock, irql);
    *bytes = sizeof *state;
    return STATUS_SUCCESS;
}

static Message* TakeAnswered(UINT64 id) {
    LIST_ENTRY* entry;
    for (entry = driverState.pended.Flink; entry != &driverState.pended; entry = entry->Flink) {
        Message* message = CONTAINING_RECORD(entry, Message, pendedEntry);
        if (message->irp == NULL || message->record.id != id || message->isQueued) continue;
        return TakeForEnd(message) ? message : NULL;
    }
    return NULL;
}

static NTSTATUS EndAnswered(void* buffer, IRP* irp, ULONG* bytes) {
    const RoadAnswer* answer = buffer;
    const IO_STACK_LOCATION* stack = IoGetCurrentIrpStackLocation(irp);
    const ULONG given = stack->Parameters.DeviceIoControl.InputBufferLength - sizeof *answer;
    ULONG_PTR written = 0;
    KIRQL irql;
    Message* message;
    (void)bytes;
    KeAcquireSpinLock(&driverState.lock, &irql);
    message = TakeAnswered(answer->id);
    KeReleaseSpinLock(&driverState.lock, irql);
    if (message == NULL) return STATUS_SUCCESS;
    if (answer->error != 0) {
        EndTaken(message, answer->error);
        return STATUS_SUCCESS;
    }
    written = answer->bytes < given ? answer->bytes : given;
    if (message->record.kind == RoadControl) {
        written = CopyOutput(message->irp, &message->record, answer + 1, (ULONG)written);
    }
    Complete(message->irp, STATUS_SUCCESS, written);
    ExFreePoolWithTag(message, ROAD_TAG);
    return STATUS_SUCCESS;
}

static NTSTATUS WaitForMessage(IRP* irp) {
    if (driverState.waitingNext != NULL) return STATUS_DEVICE_BUSY;
    IoSetCancelRoutine(irp, CancelNext);
    if (irp->Cancel && IoSetCancelRoutine(irp, NULL) != NULL) return STATUS_CANCELLED;
    IoMarkIrpPending(irp);
    driverState.waitingNext = irp;
    return STATUS_PENDING;
}

static NTSTATUS PendNext(IRP* irp) {
    FILE_OBJECT* file = IoGetCurrentIrpStackLocation(irp)->FileObject;
    NTSTATUS status = STATUS_DEVICE_BUSY;
    KIRQL irql;
    KeAcquireSpinLock(&driverState.lock, &irql);
    if (driverState.helper == NULL) driverState.helper = file;
    if (driverState.helper == file) status = WaitForMessage(irp);
    KeReleaseSpinLock(&driverState.lock, irql);
    if (status != STATUS_PENDING) return Complete(irp, status, 0);
    ServeHelper();
    return STATUS_PENDING;
}

static const struct ControlRequest {
    UINT32 code;
    ULONG inputBytesMin;
    ULONG outputBytesMin;
    NTSTATUS (*run)(void* buffer, IRP* irp, ULONG* bytes);
} controlRequests[] = {
    {ROAD_ANSWER, sizeof(RoadAnswer), 0, EndAnswered},
    {ROAD_PLUG, sizeof(RoadDevice), 0, PlugCamera},
    {ROAD_UNPLUG, sizeof(RoadDevice), 0, UnplugCamera},
    {ROAD_PREPARE, sizeof(RoadPrepared), 0, PrepareAnswer},
    {ROAD_STATE, 0, sizeof(RoadState), GetState},
};

static NTSTATUS RunControl(IRP* irp) {
    const IO_STACK_LOCATION* stack = IoGetCurrentIrpStackLocation(irp);
    const UINT32 code = stack->Parameters.DeviceIoControl.IoControlCode;
    ULONG bytes = 0;
    ULONG i;
    for (i = 0; i < sizeof controlRequests / sizeof controlRequests[0]; ++i) {
        const struct ControlRequest* request = &controlRequests[i];
        NTSTATUS status = STATUS_INVALID_PARAMETER;
        if (request->code != code) continue;
        if (stack->Parameters.DeviceIoControl.InputBufferLength >= request->inputBytesMin &&
            stack->Parameters.DeviceIoControl.OutputBufferLength >= request->outputBytesMin) {
            status = request->run(irp->AssociatedIrp.SystemBuffer, irp, &bytes);
        }
        return Complete(irp, status, bytes);
    }
    return Complete(irp, STATUS_INVALID_DEVICE_REQUEST, 0);
}

void DismissHelper(void) {
    IRP* next;
    KIRQL irql;
    KeAcquireSpinLock(&driverState.lock, &irql);
    driverState.helper = NULL;
    next = driverState.waitingNext;
    if (next != NULL && IoSetCancelRoutine(next, NULL) == NULL) next = NULL;
    if (next != NULL) driverState.waitingNext = NULL;
    KeReleaseSpinLock(&driverState.lock, irql);
    if (next != NULL) Complete(next, STATUS_CANCELLED, 0);
}

/* A helper that has gone answers nothing more. */
static void ForgetHelper(const FILE_OBJECT* file) {
    BOOLEAN isHelper;
    KIRQL irql;
    KeAcquireSpinLock(&driverState.lock, &irql);
    isHelper = driverState.helper == file;
    KeReleaseSpinLock(&driverState.lock, irql);
    if (!isHelper) return;
    DismissHelper();
    EndAll(IsAny, NULL, ERROR_DEVICE_NOT_CONNECTED);
}

NTSTATUS DispatchControl(IRP* irp) {
    const IO_STACK_LOCATION* stack = IoGetCurrentIrpStackLocation(irp);
    if (stack->MajorFunction == IRP_MJ_CLEANUP || stack->MajorFunction == IRP_MJ_CLOSE) {
        ForgetHelper(stack->FileObject);
    }
    if (stack->MajorFunction != IRP_MJ_DEVICE_CONTROL) return Complete(irp, STATUS_SUCCESS, 0);
    if (stack->Parameters.DeviceIoControl.IoControlCode == ROAD_NEXT) return PendNext(irp);
    return RunControl(irp);
}
