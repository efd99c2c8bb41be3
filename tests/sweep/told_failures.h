#pragma once

#include <vector>

#include "sweep/failing_driver.h"
#include "sweep/stories.h"
#include "sweep/sweep_round.h"
#include "sweep/sweep_worlds.h"

/// Which failures a client is told of, and which are kept silent.
namespace ZV::Test {

/// Whether no call tells that this request of a story has failed.
bool IsUntold(const Story& story, const SweepCamera& camera, const CountedRequest& request);

/// Whether some call of the story answers with a code when the round's request has failed.
bool MustBeTold(const Round& round, const CountedStory& counted);

/// Whether the calls of a story must tell of memory that they have missed, or do all that they have
/// to do.
bool TellsOfMissingMemory(const Story& story);

/// Requests of callers that the story sends without a failure and has not sent now.
std::vector<CountedRequest> ListLeftOut(const CountedStory& counted);

}  // namespace ZV::Test
