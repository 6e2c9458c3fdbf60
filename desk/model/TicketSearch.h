// Finds the tickets that hold a text, in steps that a worker's thread takes one after the other. Tickets are
// read by a function of the caller's, one at a time. For one thread at a time, but for Cancel().
#pragma once

#include "comgui/client/Result.h"
#include "comgui/client/Snapshot.h"
#include "comgui/client/TicketAddress.h"
#include "desk/model/TextMatch.h"
#include <atomic>
#include <chrono>
#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace desk
{
enum class SearchIn
{
    Keys,
    Values,  // as comgui::ToText shows them, and each value of a list by itself
    Both,    // and "Job/Copies=3" also finds the whole key with the whole value
};

struct SearchQuery
{
    std::string text;  // UTF-8; the empty one finds nothing
    SearchIn where = SearchIn::Both;
    std::size_t most = 10'000;  // tickets; a wider search helps nobody
};

// A ticket that holds the text. A ticket of 100,000 matching keys is one match.
struct SearchMatch
{
    comgui::TicketAddress ticket;
    std::string key;       // the first of those that match
    std::size_t keys = 0;  // how many match
};

enum class SearchState
{
    Running,
    Finished,
    Cancelled,
    Enough,       // as many are found as are wanted, and not all are looked at
    Interrupted,  // the server is away; the next step goes on with the ticket that could not be read
};

struct SearchBatch
{
    std::vector<SearchMatch> matches;  // of this step, in the order of the tickets
    SearchState state = SearchState::Running;
    std::optional<comgui::Error> error;  // why it is interrupted

    // Of all steps so far.
    std::size_t found = 0;
    std::size_t done = 0;  // tickets looked at, gone and unreadable ones included
    std::size_t total = 0;
    std::size_t gone = 0;        // deleted before they could be read
    std::size_t unreadable = 0;  // refused for a reason of their own
};

using SearchReader = std::function<comgui::Result<comgui::Snapshot>(comgui::TicketAddress)>;

class TicketSearch
{
public:
    TicketSearch(SearchQuery const& query, std::vector<comgui::TicketAddress> tickets, SearchReader reader);

    // Looks at so many tickets, or at as many as the time is enough for; at least one. After the last, with
    // enough found and once cancelled, it reads nothing.
    SearchBatch Step(std::size_t tickets, std::chrono::nanoseconds time = std::chrono::nanoseconds::max());

    // From any thread: a step that is under way ends before the next key. What it has found so far it still
    // reports.
    void Cancel() noexcept { m_isCancelled.store(true, std::memory_order_relaxed); }

private:
    bool IsCancelled() const { return m_isCancelled.load(std::memory_order_relaxed); }
    bool Matches(comgui::SnapshotEntry const& entry) const;
    bool MatchesValue(comgui::Value const& value) const;
    bool MatchesEquation(comgui::SnapshotEntry const& entry) const;
    bool LookAt(comgui::TicketAddress ticket, comgui::Snapshot const& snapshot, SearchBatch& batch) const;
    bool Skip(comgui::Error const& error);

    TextMatch const m_text;
    SearchIn const m_where;
    std::vector<comgui::TicketAddress> const m_tickets;
    SearchReader const m_reader;
    std::size_t const m_most;
    std::size_t m_found = 0;
    std::size_t m_done = 0;
    std::size_t m_gone = 0;
    std::size_t m_unreadable = 0;
    std::atomic<bool> m_isCancelled{false};
};
}  // namespace desk
