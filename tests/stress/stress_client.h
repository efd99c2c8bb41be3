#pragma once

#include <cstdint>
#include <span>

#include "stress/split_mix.h"
#include "stress/stressed_camera.h"

namespace ZV::Test {

/// A client that calls one thing after another. Each step has numbers of its own, made from `seed`
/// and its own number: what a call gives changes nothing of what is called next.
class StressClient {
  public:
    StressClient(std::span<StressedCamera> cameras, std::uint64_t seed);

    void TakeStep();
    /// A sum over what was called with what up to now.
    std::uint64_t GetPlan() const { return plan; }

  private:
    using Step = void (StressClient::*)(StressedCamera&);
    static const Step Steps[];

    void QueueFrame(StressedCamera& camera);
    void QueueSettings(StressedCamera& camera);
    void Send(StressedCamera& camera);
    void SendGeometry(StressedCamera& camera);
    void Switch(StressedCamera& camera);
    void SwitchOn(StressedCamera& camera);
    void Abort(StressedCamera& camera);
    void Grab(StressedCamera& camera);
    void Trigger(StressedCamera& camera);
    void Read(StressedCamera& camera);
    void Ask(StressedCamera& camera);
    void Preflight(StressedCamera& camera);
    void AskForTexts(StressedCamera& camera);
    void UseParameters(StressedCamera& camera);
    void UseTables(StressedCamera& camera);
    void CallWhatIsIgnored(StressedCamera& camera);
    void ReadConfiguration(StressedCamera& camera);
    void CalculateSizes(StressedCamera& camera);
    void ProcessGrab(StressedCamera& camera);
    void ConvertGrab(StressedCamera& camera);
    void Expose(StressedCamera& camera);
    void Balance(StressedCamera& camera);

    Zentara_Frame* GrabInto(StressedCamera& camera);

    std::span<StressedCamera> cameras;
    const std::uint64_t seed;
    std::uint64_t stepsTaken = 0, plan = 0;
    SplitMix numbers;  ///< Of the step.
};

}  // namespace ZV::Test
