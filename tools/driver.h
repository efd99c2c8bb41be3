#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "exit_codes.h"
#include "zentara/zentara.h"

namespace ZentaraProgram {

/// Plain words for a result code of the library.
std::string DescribeResult(ZentaraResult result);

/// The exit code that a failed call stands for.
ExitCode GetExitCode(ZentaraResult result);

/// The loaded library, released at the end of its scope.
class Driver {
  public:
    Driver();
    ~Driver();
    Driver(const Driver&) = delete;
    Driver& operator=(const Driver&) = delete;

    [[nodiscard]] ZentaraResult GetLoadResult() const { return loadResult; }

    /// The cameras that nobody holds; those found before a failure are in `cameras` too.
    ZentaraResult List(std::vector<Zentara_CamListItem>* cameras);

  private:
    ZentaraResult loadResult;
};

/// An open camera, closed at the end of its scope.
class Camera {
  public:
    Camera() = default;
    ~Camera();
    Camera(const Camera&) = delete;
    Camera& operator=(const Camera&) = delete;

    ZentaraResult Open(std::uint32_t cameraId);
    void Close();

    [[nodiscard]] ZentaraHandle GetHandle() const { return handle; }
    /// Nothing when the library refuses the key or succeeds without an answer.
    [[nodiscard]] std::optional<std::uint32_t> GetInfo(std::uint32_t key) const;
    [[nodiscard]] std::string GetModelName() const;
    [[nodiscard]] std::string GetSerialNumber() const;

  private:
    ZentaraHandle handle = 0;
};

/// Finds the camera `cameraId` in a new list and opens it; says on standard error why it cannot.
/// `uniqueId` receives the low half of its unique id.
ExitCode OpenListedCamera(Driver& driver, std::uint32_t cameraId, Camera* camera,
                          std::uint32_t* uniqueId);

/// The exit code after a failed capture: the camera is closed and looked for in a new list.
ExitCode JudgeFailure(Driver& driver, Camera& camera, std::uint32_t uniqueId, ZentaraResult result);

/// The loaded library with one open camera.
class Session {
  public:
    /// As OpenListedCamera.
    ExitCode Open(std::uint32_t cameraId);
    /// As JudgeFailure.
    ExitCode Judge(ZentaraResult result);

    [[nodiscard]] const Camera& GetCamera() const { return camera; }
    void Close() { camera.Close(); }

  private:
    Driver driver;
    Camera camera;  // behind the driver, so that it is closed first
    std::uint32_t uniqueId = 0;
};

}  // namespace ZentaraProgram
