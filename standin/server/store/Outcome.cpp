#include "standin/server/store/Outcome.h"

#include <thread>

namespace standin
{
namespace
{
constexpr std::chrono::milliseconds PauseBetweenQuestions(100);

UnknownOutcome NotKnown(StoreError const& reason, TicketAddress changed)
{
    std::string const type = std::to_string(changed.type);
    std::string const which = changed.id == TicketChange::NextId
                                  ? "a ticket of type " + type + " was made"
                                  : "ticket " + type + "/" + std::to_string(changed.id) + " was changed";
    return UnknownOutcome(std::string(reason.what()) + "; whether " + which +
                          " is not known: look before you repeat the change");
}
}  // namespace

std::optional<CommitOutcome> AwaitOutcome(Store& store, std::uint64_t number, TicketAddress changed,
                                          std::chrono::milliseconds limit, std::atomic<bool> const* hasEnded)
{
    for (auto const end = std::chrono::steady_clock::now() + limit;;)
    {
        try
        {
            return store.FindCommit(number);
        }
        catch (UnusableStore const& error)
        {
            throw NotKnown(error, changed);
        }
        catch (StoreError const& error)
        {
            if (std::chrono::steady_clock::now() >= end || (hasEnded && *hasEnded))
                throw NotKnown(error, changed);
        }
        std::this_thread::sleep_for(PauseBetweenQuestions);
    }
}
}  // namespace standin
