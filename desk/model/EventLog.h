// Live events as rows of a virtual list. A ring: when it is full, the oldest rows go. For one thread at a
// time.
#pragma once

#include "comgui/client/Event.h"
#include <chrono>
#include <cstddef>
#include <deque>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

namespace desk
{
enum class EventKind
{
    KeyChanged,
    KeyDeleted,
    KeyToRead,      // changed; its value did not come along
    MoreKeys,       // of the ticket, too many to list: `count` of them
    TicketChanged,  // as a whole
    TicketCreated,
    TicketDeleted,
    ManyTicketsChanged,  // of the type
    TransferProgressed,
    TransferEnded,
    TransferFailed,
    ServerLost,
    ServerBack,
    ServerBackAnew,  // with another session
};

// Fields that the kind does not need are empty.
struct EventRow
{
    std::chrono::system_clock::time_point time;
    EventKind kind = EventKind::KeyChanged;
    std::optional<int> type;  // of the ticket
    std::optional<int> id;    // not if it is about many tickets of the type
    std::string key;          // whole, as it is
    std::string text;         // the value, or why it failed; cut, and harmless in a cell
    std::optional<int> transfer;
    std::optional<int> job;
    long long count = 0;             // keys left out, or bytes done
    std::optional<long long> total;  // bytes
};

struct EventFilter
{
    // Whether a key or a text is wanted; an empty function: every row.
    std::function<bool(std::string_view)> isWanted;
    std::optional<comgui::TicketAddress> ticket;  // rows about many tickets of its type are wanted, too
};

class EventLog
{
public:
    using Time = std::chrono::system_clock::time_point;

    struct Limits
    {
        std::size_t rows = 100'000;
        std::size_t bytes = 64U << 20;  // of the rows' texts
        std::size_t keysOfEvent =
            100;  // rows that one event makes; one more tells how many keys it had besides
    };

    // What came of the shown rows since the last call: first these went at the front, then these came at the
    // end. isReset: all may be others; `RowCount()` tells how many they are.
    struct Changes
    {
        std::size_t gone = 0;
        std::size_t came = 0;
        bool isReset = false;
    };

    EventLog() = default;
    explicit EventLog(Limits limits) : m_limits(limits) {}

    // Amortised O(rows that it makes).
    void Append(comgui::Event const& event, Time now);

    // While paused the rows stand still. What comes is kept, within the same limits, and shown by Resume().
    void Pause() { m_isPaused = true; }
    void Resume();
    bool IsPaused() const { return m_isPaused; }
    std::size_t CameMeanwhile() const { return m_cameMeanwhile; }  // rows, before any filter

    void SetFilter(EventFilter filter);  // O(all rows)
    void Clear();                        // what waits, too

    // Of the rows that the filter wants; the latest is the last. O(1).
    std::size_t RowCount() const { return m_shown.size(); }
    EventRow const& RowAt(std::size_t row) const { return m_rows.rows[m_shown[row] - m_gone]; }

    // A row's number stays its own, whatever comes and goes.
    std::size_t NumberOf(std::size_t row) const { return m_shown[row]; }
    std::optional<std::size_t> IndexOf(std::size_t number) const;  // nothing: not shown; O(log rows)

    std::size_t AllRows() const { return m_rows.rows.size(); }

    Changes TakeChanges();

private:
    // A queue that keeps its limits.
    struct ROWS
    {
        std::deque<EventRow> rows;
        std::size_t bytes = 0;

        void Push(EventRow row);
        void Pop();
        bool IsOver(Limits limits) const;
    };

    void Add(EventRow row);
    void AddShown(EventRow row);
    void AppendKeys(comgui::TicketChanged const& event, Time now);
    void Find();
    bool IsWanted(EventRow const& row) const;

    Limits m_limits;
    ROWS m_rows;
    ROWS m_waiting;
    std::size_t m_cameMeanwhile = 0;
    bool m_isPaused = false;
    EventFilter m_filter;

    // Rows are numbered by their coming; the first in m_rows is number m_gone.
    std::size_t m_gone = 0;
    std::deque<std::size_t> m_shown;

    // Shown rows by their coming, too: those in m_shown begin with the first of these.
    std::size_t m_shownGone = 0;
    std::size_t m_toldGone = 0;
    std::size_t m_toldEnd = 0;
    bool m_isReset = false;
};
}  // namespace desk
