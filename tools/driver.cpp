#include "driver.h"

#include <algorithm>
#include <array>

#include "output.h"

#include <fmt/format.h>

namespace ZentaraProgram {
namespace {

struct ResultText {
    ZentaraResult result;
    const char* text;
};

constexpr std::array ResultTexts{
    ResultText{zerrNotSupported, "this camera does not support it"},
    ResultText{zerrBadParameter, "a parameter is not valid"},
    ResultText{zerrBadSettings, "the settings block is not valid"},
    ResultText{zerrNotLoaded, "the library is not loaded"},
    ResultText{zerrBadHandle, "the camera is not open"},
    ResultText{zerrBadCameraId, "there is no camera of this number"},
    ResultText{zerrCameraFault, "the camera failed"},
    ResultText{zerrDriverFault, "the driver failed"},
    ResultText{zerrBufferTooSmall, "the image does not fit its buffer"},
    ResultText{zerrBusy, "the camera is at work"},
    ResultText{zerrQueueFull, "the queue is full"},
    ResultText{zerrFrameIncomplete, "the frame is incomplete"},
    ResultText{zerrNotStreaming, "the camera is not streaming"},
    ResultText{zerrOutOfSync, "the frame is out of sync"},
    ResultText{zerrMissingData, "data of the frame are missing and were filled with black"},
    ResultText{zerrUnplugged, "the camera was unplugged or turned off"},
    ResultText{zerrCameraBusy, "the camera or its bus is busy"},
};

using TextFunction = ZentaraResult (*)(ZentaraHandle, char*, std::uint32_t);

std::string ReadText(ZentaraHandle handle, TextFunction function) {
    std::array<char, 512> text{};
    if (function(handle, text.data(), text.size()) != zerrNone) return {};
    return MakeHarmless(text.data());  // It may be the camera's, and is printed.
}

}  // namespace

std::string DescribeResult(ZentaraResult result) {
    for (const ResultText& row : ResultTexts) {
        if (row.result == result) return fmt::format("{} (code {})", row.text, result);
    }
    return fmt::format("the library failed (code {})", result);
}

ExitCode GetExitCode(ZentaraResult result) {
    if (result == zerrCameraBusy) return ExitCameraBusy;
    return result == zerrBadCameraId ? ExitNoCamera : ExitFailed;
}

Driver::Driver() : loadResult(Zentara_LoadDriver()) {}

Driver::~Driver() {
    Zentara_ReleaseDriver();
}

ZentaraResult Driver::List(std::vector<Zentara_CamListItem>* cameras) {
    cameras->assign(64, Zentara_CamListItem{});
    auto count = static_cast<std::uint32_t>(cameras->size());
    const ZentaraResult result = Zentara_ListCameras(cameras->data(), &count);
    cameras->resize(std::min<std::size_t>(count, cameras->size()));
    return result;
}

Camera::~Camera() {
    Close();
}

ZentaraResult Camera::Open(std::uint32_t cameraId) {
    return Zentara_OpenCamera(cameraId, &handle);
}

void Camera::Close() {
    if (handle != 0) (void)Zentara_CloseCamera(handle);  // Nothing is left to do about a failure.
    handle = 0;
}

std::optional<std::uint32_t> Camera::GetInfo(std::uint32_t key) const {
    // Success may leave the word untouched (the sensor kind of a sensor of neither kind): what
    // keeps two different words as they were is no answer.
    std::uint32_t value = 0;
    if (Zentara_GetInfo(handle, key, &value) != zerrNone) return std::nullopt;
    if (value != 0) return value;
    std::uint32_t other = 1;
    if (Zentara_GetInfo(handle, key, &other) != zerrNone || other != 0) return std::nullopt;
    return value;
}

std::string Camera::GetModelName() const {
    return ReadText(handle, &Zentara_GetCameraModelString);
}

std::string Camera::GetSerialNumber() const {
    return ReadText(handle, &Zentara_GetSerialString);
}

ExitCode OpenListedCamera(Driver& driver, std::uint32_t cameraId, Camera* camera,
                          std::uint32_t* uniqueId) {
    if (driver.GetLoadResult() != zerrNone) {
        PrintError("the library cannot be loaded: " + DescribeResult(driver.GetLoadResult()));
        return ExitFailed;
    }
    std::vector<Zentara_CamListItem> cameras;
    const ZentaraResult listed = driver.List(&cameras);
    if (cameraId >= cameras.size()) {
        if (listed != zerrNone) {
            PrintError("the cameras cannot be listed: " + DescribeResult(listed));
            return GetExitCode(listed);
        }
        PrintError(
            fmt::format("there is no camera {}; the list holds {}", cameraId, cameras.size()));
        return ExitNoCamera;
    }
    *uniqueId = cameras[cameraId].uniqueId;
    const ZentaraResult opened = camera->Open(cameraId);
    if (opened == zerrNone) return ExitDone;
    PrintError(fmt::format("camera {} cannot be opened: {}", cameraId, DescribeResult(opened)));
    return ExitCameraBusy;
}

ExitCode JudgeFailure(Driver& driver, Camera& camera, std::uint32_t uniqueId,
                      ZentaraResult result) {
    camera.Close();
    std::vector<Zentara_CamListItem> cameras;
    (void)driver.List(&cameras);  // What can still be listed answers the question.
    const bool isThere =
        std::any_of(cameras.begin(), cameras.end(),
                    [&](const Zentara_CamListItem& item) { return item.uniqueId == uniqueId; });
    if (isThere) return GetExitCode(result);
    PrintError("the camera is gone from the bus");
    return ExitCameraGone;
}

ExitCode Session::Open(std::uint32_t cameraId) {
    return OpenListedCamera(driver, cameraId, &camera, &uniqueId);
}

ExitCode Session::Judge(ZentaraResult result) {
    return JudgeFailure(driver, camera, uniqueId, result);
}

}  // namespace ZentaraProgram
