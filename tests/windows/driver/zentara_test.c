/* A kernel-mode driver for tests: camera devices whose requests a helper program answers.
 *
 * Every open, close and control request of a camera device is pended and queued. The helper takes
 * them in their order by ROAD_NEXT on the control device and ends them by ROAD_ANSWER (an inverted
 * call). */

#include "driver_state.h"

DriverState driverState;

static NTSTATUS NTAPI Dispatch(DEVICE_OBJECT* device, IRP* irp) {
    return GetExtension(device)->isControl ? DispatchControl(irp) : DispatchCamera(device, irp);
}

static NTSTATUS MakeControlDevice(void) {
    UNICODE_STRING name, link;
    NTSTATUS status;
    RtlInitUnicodeString(&name, L"\\Device\\ZentaraTestControl");
    RtlInitUnicodeString(&link, L"\\??\\ZentaraTestControl");
    status = IoCreateDevice(driverState.driver, sizeof(DeviceExtension), &name, FILE_DEVICE_UNKNOWN,
                            0, FALSE, &driverState.controlDevice);
    if (!NT_SUCCESS(status)) return status;
    RtlZeroMemory(driverState.controlDevice->DeviceExtension, sizeof(DeviceExtension));
    GetExtension(driverState.controlDevice)->isControl = TRUE;
    driverState.controlDevice->Flags &= ~DO_DEVICE_INITIALIZING;
    status = IoCreateSymbolicLink(&link, &name);
    if (!NT_SUCCESS(status)) IoDeleteDevice(driverState.controlDevice);
    return status;
}

static void NTAPI Unload(DRIVER_OBJECT* object) {
    UNICODE_STRING link;
    UINT32 index;
    (void)object;
    DismissHelper();
    for (index = 0; index < ROAD_DEVICES_MAX; ++index) Unplug(index);
    EndAll(IsAny, NULL, ERROR_DEVICE_NOT_CONNECTED);
    for (index = 0; index < ROAD_DEVICES_MAX; ++index) {
        if (driverState.cameras[index] != NULL) IoDeleteDevice(driverState.cameras[index]);
    }
    RtlInitUnicodeString(&link, L"\\??\\ZentaraTestControl");
    IoDeleteSymbolicLink(&link);
    IoDeleteDevice(driverState.controlDevice);
}

NTSTATUS NTAPI DriverEntry(DRIVER_OBJECT* object, UNICODE_STRING* registryPath) {
    (void)registryPath;
    driverState.driver = object;
    KeInitializeSpinLock(&driverState.lock);
    InitializeListHead(&driverState.pended);
    InitializeListHead(&driverState.queued);
    object->MajorFunction[IRP_MJ_CREATE] = Dispatch;
    object->MajorFunction[IRP_MJ_CLEANUP] = Dispatch;
    object->MajorFunction[IRP_MJ_CLOSE] = Dispatch;
    object->MajorFunction[IRP_MJ_DEVICE_CONTROL] = Dispatch;
    object->DriverUnload = Unload;
    return MakeControlDevice();
}
