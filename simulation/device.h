#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "hal/platform/kernel_driver.h"
#include "simulation/bus.h"
#include "simulation/faults.h"
#include "simulation/file_handle.h"
#include "simulation/packet_stream.h"
#include "simulation/register_file.h"
#include "simulation/scenario.h"
#include "simulation/sensor.h"
#include "simulation/settings.h"
#include "simulation/trace.h"
#include "simulation/zentara_simulation.h"

namespace ZV::Simulation {

/// A simulated camera with the kernel driver's side of it.
///
/// Threads: callers of the driver's table; `requestThread` answers pended register requests in
/// their order; `streamThread` exposes frames and fills attached buffers. All state is guarded by
/// `mutex`; completions are collected as EndedRequests under it and called without it, `inFlight`
/// of the handle counting them until they have returned, so that a close can wait for them. The
/// mutexes of Bus and Trace are leaves.
class Device {
  public:
    Device(const CameraScenario& scenario, std::uint32_t position, std::shared_ptr<Bus> bus,
           std::shared_ptr<Trace> trace, std::unique_ptr<Scene> scene);
    ~Device();
    Device(const Device&) = delete;
    Device& operator=(const Device&) = delete;

    const std::string& GetPath() const { return camera.path; }
    bool IsPlugged() const;

    /// Null when the device is not on the bus.
    static std::shared_ptr<FileHandle> Open(const std::shared_ptr<Device>& device);
    void Close(const std::shared_ptr<FileHandle>& handle);
    std::uint32_t Control(const std::shared_ptr<FileHandle>& handle, KernelRequest* request,
                          std::uint32_t* bytes);
    void Cancel(const std::shared_ptr<FileHandle>& handle, KernelRequest* request);

    void Unplug();
    void Plug();
    /// Ends what is pended with error 995 and joins the threads. Handles answer errors from then
    /// on.
    void End();

    void AddFault(const FaultDescription& fault);
    void AddState(ZentaraSimulationState* state) const;
    bool Peek(std::uint32_t address, std::uint32_t* value) const;
    bool Poke(std::uint32_t address, std::uint32_t value);

  private:
    using Handle = std::shared_ptr<FileHandle>;
    using Ended = std::vector<EndedRequest>;
    using Clock = std::chrono::steady_clock;

    enum class RequestKind { Answered, Transaction, Waiting };
    struct Operation;
    static const Operation Operations[];
    static const Operation* FindOperation(std::uint32_t code);

    // device.cpp: handles and requests. `...Locked` members want `mutex` held.
    std::uint32_t ControlLocked(std::unique_lock<std::mutex>& lock, Call& call);
    void CarryOutEvents(const Handle& handle, const std::vector<FaultDescription>& matches);
    std::uint32_t CarryOut(std::unique_lock<std::mutex>& lock, Call& call,
                           const std::vector<FaultDescription>& matches);
    std::uint32_t Pend(const Handle& handle, const PendedRequest& pended, bool isTransaction);
    std::uint32_t Block(std::unique_lock<std::mutex>& lock, const Handle& handle);
    void EndPended(const Handle& handle, std::uint64_t id, std::uint32_t error,
                   std::uint32_t bytes);
    void EndAllPended(const Handle& handle, std::uint32_t error);
    void Deliver(std::unique_lock<std::mutex>& lock);
    void WriteTrace(const KernelRequest& request, const std::string& input, bool wasPended,
                    std::uint32_t error, std::uint32_t bytes);
    void RunRequests();
    void RunTransaction(const Handle& handle, std::uint64_t id);
    void KillHandles(std::uint32_t error);
    void UnplugLocked();
    void PlugLocked();
    void ReleaseReservations(const Handle& handle);

    // device_requests.cpp: one member per control code; 0 or a system error number.
    std::uint32_t AsyncRead(Call& call);
    std::uint32_t AsyncWrite(Call& call);
    std::uint32_t NotifyEnable(Call& call);
    std::uint32_t NotifyDisable(Call& call);
    std::uint32_t NotifyWait(Call& call);
    std::uint32_t StreamEnter(Call& call);
    std::uint32_t StreamLeave(Call& call);
    std::uint32_t QueryBusy(Call& call);
    std::uint32_t AllocateBandwidth(Call& call);
    std::uint32_t FreeBandwidth(Call& call);
    std::uint32_t AllocateChannel(Call& call);
    std::uint32_t FreeChannel(Call& call);
    std::uint32_t AllocateResources(Call& call);
    std::uint32_t FreeResources(Call& call);
    std::uint32_t AttachBuffer(Call& call);
    std::uint32_t DetachBuffers(Call& call);
    std::uint32_t Listen(Call& call);
    std::uint32_t Stop(Call& call);
    /// Returns how many there were that would not have failed anyway.
    std::uint32_t EndWaiting(const Handle& handle, std::uint32_t code, std::uint32_t error);
    void CountFailed(std::uint32_t code, std::uint32_t count);
    void StopListening(const Handle& handle);
    void ObeyWrite(std::uint32_t address, std::uint32_t value);
    void RefreshStatus();
    std::uint32_t GetSpeed() const;

    // device_stream.cpp: the camera's sender.
    enum class Phase { Idle, Exposing, Sending };
    enum class CycleResult { Done, NoRoom, Expose, Stop };
    struct Sender {
        bool isOn = false;
        std::uint32_t channel = 0;
        std::uint64_t serial = 0;  // Changes with each event that ends an exposure under way.
        Phase phase = Phase::Idle;
        std::uint64_t cyclesLeft = 0;  // Of the exposure.
        std::uint32_t triggers = 0;
        bool wasTriggered = false;
        std::unique_ptr<PacketStream> packets;
        std::uint32_t payloadBytes = 0;
        FrameRecord record;
        OutgoingFrame restart;  // Copy of the frame while a fault may want to begin it anew.
        bool wasRestarted = false;
        std::uint64_t packet = 0;          // Next packet of the frame.
        std::vector<std::uint8_t> repeat;  // Payload that is to be sent once more.
    };
    void SwitchSender(std::uint32_t value);
    void StopFrame();
    void TakeOverSettings();
    void DecodeInForce();
    void UpdateTrigger();
    bool CanExpose() const;
    void BeginExposure();
    std::uint64_t GetExposureNs() const;
    std::uint32_t GetWheelColour() const;
    std::uint32_t GetPlane() const;
    double GetTemperature() const;

    void RunStream();
    void RunBatch(std::unique_lock<std::mutex>& lock, const Handle& listener);
    void WaitForRoom(std::unique_lock<std::mutex>& lock);
    Handle FindListener() const;
    bool PreparePackets(const FileHandle& listener);
    bool IsTimed() const;
    Clock::duration GetCycleTime() const;
    std::uint64_t CountDueCycles();
    bool HasRoom(const FileHandle& listener) const;
    bool LosesPackets() const;

    CycleResult RunCycle(const Handle& listener);
    CycleResult SendIdle(const Handle& listener);
    CycleResult SendRepeat(const Handle& listener);
    CycleResult SendPacket(const Handle& listener);
    bool CarryOutFrameEvents(const Handle& listener, const std::vector<FaultDescription>& matches);
    void DamagePacket(const std::vector<FaultDescription>& matches, std::uint8_t* payload,
                      std::uint32_t* length) const;
    void RestartFrame();
    void ResetBus(const Handle& listener);
    std::uint8_t* GetPayload(const FileHandle& listener);
    void FillSlot(const Handle& listener, std::uint32_t length);
    void Expose(std::unique_lock<std::mutex>& lock);
    std::vector<std::uint8_t> ExposeOrRepeat(ExposureSettings exposure);
    void BeginFrame(std::vector<std::uint8_t> pixels);
    void FinishFrame();

    const CameraScenario camera;
    const std::uint32_t position;
    const std::shared_ptr<Bus> bus;
    const std::shared_ptr<Trace> trace;
    const Sensor sensor;

    mutable std::mutex mutex;
    std::condition_variable requestWork, streamWork, released;
    // The rest is guarded by mutex.
    RegisterFile registers;
    std::vector<std::uint32_t> inForce;  // Control block as it was taken over.
    FaultPlan faults;
    std::vector<Handle> handles;
    struct Job {
        Handle handle;
        std::uint64_t id;
    };
    std::deque<Job> jobs;
    std::thread requestThread, streamThread;
    std::uint64_t lastId = 0;
    std::uint64_t openings = 0;
    bool isPlugged = true;
    bool isEnding = false;
    std::uint32_t requestsServed = 0, requestsFailed = 0;
    std::uint32_t registerRequestsFailed = 0, buffersRefused = 0, buffersFailed = 0;
    std::uint32_t packetsCorrupted = 0;
    std::uint64_t framesExposed = 0, framesSent = 0, framesBegun = 0;
    std::uint32_t wheelStep = 0;
    std::uint64_t cycles = 0;
    CameraSettings settings;  // Decoded from inForce.
    Sender sender;
    std::vector<std::uint8_t> lostPayload;  // Where packets go that nobody receives.
    std::uint32_t extraWindow = 0;          // Requests beyond the window, for a host that lags.
    // Touched by streamThread alone: the last image of a sensor without noise.
    ExposureSettings lastExposure;
    std::vector<std::uint8_t> lastPixels;
    Ended ended;  // Ended requests whose completions the holder of the lock has still to call.
    Clock::time_point paceStart;
    std::uint64_t paceCycles = 0;
    bool isPaced = false;
    Clock::time_point lastTrigger;  // Of the hardware trigger.
    Clock::time_point cooledSince;
    double cooledFrom = 20;
};

}  // namespace ZV::Simulation
