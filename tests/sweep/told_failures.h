#pragma once

#include <vector>

#include "sweep/failing_driver.h"
#include "sweep/stories.h"
#include "sweep/sweep_round.h"
#include "sweep/sweep_worlds.h"

/// Which failures a client is told of, and which are kept silent.
namespace ZV::Test {

/// The story must go on as if nothing had happened: the failure is one of time alone.
bool IsHarmless(const Round& round);

/// The driver takes back what a camera has reserved that can never be freed.
bool LeavesReservations(const Round& round, const Story& story);

/// Whether the camera must go on without being listed and opened anew.
bool LeavesAWorkingCamera(const Round& round, const Story& story);

/// Whether no call tells that this request of a story has failed.
bool IsUntold(const Story& story, const SweepCamera& camera, const CountedRequest& request);

/// Whether the camera streams images in it for long.
bool HasStreamed(const Story& story);

/// Of the stream that has just run: whether it may end, or lose frames, by the round's failure
/// without a word.
bool MayEndStream(const Round& round);
/// Whether no call and no change tells of it.
bool IsUntoldInStream(const Round& round);
/// Whether a change had stopped the stream when it came.
bool IsStreamStopped(const Round& round);

/// Whether some call of the story answers with a code when the round's request has failed.
bool MustBeTold(const Round& round, const CountedStory& counted);

/// Whether the calls of a story must tell of memory that they have missed, or do all that they have
/// to do.
bool TellsOfMissingMemory(const Story& story);

/// Of the story that has just run without some memory: whether an image may fail to come without a
/// word.
bool MayMissImage(const Story& story);

/// Whether a start has been sent whole behind the last stop. Kept: a change that has stopped the
/// stream does not tell of a start that has failed.
bool IsStreamStarted();

/// Requests of callers that the story sends without a failure and has not sent now.
std::vector<CountedRequest> ListLeftOut(const CountedStory& counted);

}  // namespace ZV::Test
