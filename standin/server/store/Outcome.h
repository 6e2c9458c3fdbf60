// What becomes of a commit whose connection broke before the answer.
#pragma once

#include "standin/server/store/Store.h"

namespace standin
{
// So long an outcome is waited for: a standby takes over meanwhile, also where a person has to promote it.
constexpr std::chrono::seconds OutcomeLimit(60);

// Asks after a commit of the store that has answered Unknown until that is known; nothing if it was not made.
// Throws UnknownOutcome, with what was changed in its words, when the time is over, the store of no more use,
// or hasEnded true and the store does not answer.
std::optional<CommitOutcome> AwaitOutcome(Store& store, std::uint64_t number, TicketAddress changed,
                                          std::chrono::milliseconds limit = OutcomeLimit,
                                          std::atomic<bool> const* hasEnded = nullptr);
}  // namespace standin
