// Takes one image of 20 ms with the first camera and writes its samples to image.raw.
// Build it for x64.
using System;
using System.IO;
using System.Runtime.InteropServices;

static class Grab
{
    // What a program does not read it need not name: the sizes are those of the records.
    [StructLayout(LayoutKind.Sequential, Size = 56)]
    struct CamListItem
    {
        public uint cameraId, cameraType, uniqueId, isOpen;
    }

    [StructLayout(LayoutKind.Sequential, Size = 80)]
    struct Frame
    {
        public IntPtr pBuffer;
        public uint bufferSize, format, width, height, size;
        public ushort bits, frameNumber;
        public uint bayerPattern, errorCode, timeStamp;
    }

    // Opaque: the library fills it, and its functions read and change it.
    [StructLayout(LayoutKind.Sequential, Size = 260)]
    struct Settings
    {
        public uint size;
    }

    const string Library = "zentara";
    const CallingConvention C = CallingConvention.Cdecl;
    const uint InfoImageSize = 10, ParamExposure = 2;

    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_LoadDriver();
    [DllImport(Library, CallingConvention = C)]
    static extern void Zentara_ReleaseDriver();
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_ListCameras([In, Out] CamListItem[] items, ref uint length);
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_OpenCamera(uint cameraId, out ulong handle);
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_CloseCamera(ulong handle);
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_ReadSettingsFromCam(ulong handle, ref Settings settings);
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_SetParam(ref Settings settings, uint key, uint value);
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_SendSettingsToCam(ulong handle, ref Settings settings);
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_GetInfo(ulong handle, uint key, out uint value);
    [DllImport(Library, CallingConvention = C)]
    static extern uint Zentara_GrabFrame(ulong handle, ref Frame frame);

    static void Check(uint result)
    {
        if (result != 0) throw new IOException("The library answered " + result);
    }

    static void SetExposure(ulong camera, uint microseconds)
    {
        var settings = new Settings();
        Check(Zentara_ReadSettingsFromCam(camera, ref settings));
        Check(Zentara_SetParam(ref settings, ParamExposure, microseconds));
        Check(Zentara_SendSettingsToCam(camera, ref settings));
    }

    static void GrabOne(ulong camera)
    {
        Check(Zentara_GetInfo(camera, InfoImageSize, out uint size));
        var frame = new Frame { pBuffer = Marshal.AllocHGlobal((int)size), bufferSize = size };
        try
        {
            Check(Zentara_GrabFrame(camera, ref frame));
            Check(frame.errorCode);
            Console.WriteLine($"{frame.width} x {frame.height} pixels, {frame.bits} bits");
            var pixels = new byte[frame.size];
            Marshal.Copy(frame.pBuffer, pixels, 0, pixels.Length);
            File.WriteAllBytes("image.raw", pixels);
        }
        finally
        {
            Marshal.FreeHGlobal(frame.pBuffer);
        }
    }

    static void Main()
    {
        Check(Zentara_LoadDriver());
        try
        {
            var items = new CamListItem[8];
            uint count = 8;
            Check(Zentara_ListCameras(items, ref count));
            if (count == 0) throw new IOException("There is no camera");
            Check(Zentara_OpenCamera(items[0].cameraId, out ulong camera));
            try
            {
                SetExposure(camera, 20000);
                GrabOne(camera);
            }
            finally
            {
                Check(Zentara_CloseCamera(camera));
            }
        }
        finally
        {
            Zentara_ReleaseDriver();
        }
    }
}
