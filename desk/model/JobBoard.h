// The jobs and files of this program on their way and done, and the jobs that others send, a row each. For
// the window's thread. Time is given by the caller, in seconds since a moment of his choice.
//
// A transfer's own news count more than those of the ticket of its job, which lag behind. A job's ticket
// tells of the others: "Job/State" (0 on its way, above: arrived), "Job/Progress" (percent) and
// "Job/Identification/Name"; values of another type are as if they were not there.
#pragma once

#include "desk/model/TimeSeries.h"
#include <chrono>
#include <comgui/client/Event.h>
#include <comgui/client/Snapshot.h>
#include <comgui/client/Transfers.h>
#include <cstdint>
#include <deque>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace desk
{
enum class JobState
{
    Waiting,
    Sending,
    Arrived,
    Failed,
    Cancelled,
};

using RowNumber = std::uint64_t;  // never used twice

struct JobRow
{
    RowNumber number = 0;
    std::optional<int> transfer;  // of this program
    std::optional<int> job;       // the id of its ticket, while there is one
    std::string name;             // from others, not fit to be shown as it is; may be empty
    JobState state = JobState::Waiting;
    comgui::TransferProgress progress;  // tamed: 0 <= done <= total, rate >= 0
    std::optional<int> percent;         // 0 to 100
    comgui::Error error;                // of a failure
    TimeSeries rates{};                 // bytes a second
    TimeSeries percents{};

    bool IsOver() const { return state >= JobState::Arrived; }
    bool IsCancellable() const { return transfer && !IsOver(); }
};

class JobBoard
{
public:
    enum class Change
    {
        None,
        Row,   // one row has other contents
        Rows,  // rows have come or gone
    };

    // limit: of rows. Beyond it the oldest goes that is over, else the oldest job of others; the transfers of
    // this program that are on their way always stay.
    explicit JobBoard(std::size_t limit = 1000);

    // A transfer that has been begun; as far as it is by now, its end included.
    Change Add(comgui::Transfer const& transfer, double now);
    Change Add(int transfer, std::string name);

    // Events of transfers that are not on the board are not its matter.
    Change Take(comgui::TransferProgressed const& event, double now);
    Change Take(comgui::TransferEnded const& event, double now);

    // That job is the transfer's; known before its end. A row for the job alone goes.
    Change Identify(int transfer, int job);

    // A ticket that tells nothing of its job makes no row.
    Change TakeJob(int job, comgui::Snapshot const& ticket, double now);
    Change TakeJob(int job, comgui::KeyChange const& change, double now);
    Change RemoveJob(int job);  // the ticket has gone; what this program has sent stays as a memory

    static bool IsTold(std::string_view key);  // whether it is a key of a job's ticket that counts here
    std::vector<int> Jobs() const;             // that have rows

    // Rows that are over, as the user wants. Nothing that is told of their jobs later on brings them back.
    Change RemoveOver();
    void Clear();

    // In the order in which they were first heard of. Index: below Count().
    std::size_t Count() const { return m_rows.size(); }
    JobRow const& At(std::size_t index) const { return m_rows[index]; }
    std::optional<std::size_t> IndexOf(RowNumber number) const;
    JobRow const* Find(RowNumber number) const;  // null: not there any more

private:
    using Index = std::unordered_map<int, RowNumber>;

    JobRow& Append(JobRow row);
    JobRow* Find(Index const& index, int key);
    JobRow* FindAny(RowNumber number);
    void Erase(std::size_t index);
    void MakeRoom();
    static bool Set(JobRow& row, std::string_view key, comgui::Value const& value, double now);

    std::size_t m_limit;
    RowNumber m_next = 1;
    std::deque<JobRow> m_rows;  // by number
    Index m_byTransfer;
    Index m_byJob;
    std::unordered_set<int> m_forgotten;  // jobs of removed rows, as long as they have a ticket
};
}  // namespace desk
