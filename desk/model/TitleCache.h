// Titles of tickets, read only for those that somebody sees, and never more than fit. It reads nothing
// itself: a worker takes requests and brings titles back, in any order and as late as it likes. For one
// thread at a time, that of the window: the worker's titles are put here by it.
#pragma once

#include "comgui/client/TicketAddress.h"
#include <cstddef>
#include <list>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace desk
{
struct TitleRequest
{
    comgui::TicketAddress ticket;
    unsigned long long stamp = 0;  // of this reading; a later change of the ticket makes it worthless
};

class TitleCache
{
public:
    explicit TitleCache(std::size_t capacity);  // tickets, at least 1

    // Null: not read yet, or the ticket has no title. Dies with the next call that is not const.
    std::string const* Find(comgui::TicketAddress ticket) const;

    // The tickets that are in sight, from the top; those in sight before are no longer asked for. More than
    // the capacity are cut.
    void SetVisible(std::vector<comgui::TicketAddress> const& tickets);

    // So many of the visible tickets, at most, whose title is to be read; each is given once.
    std::vector<TitleRequest> Take(std::size_t most);

    // The title that was read, or that there is none. False if it came too late: the ticket has changed
    // since, or is forgotten. It should then be taken again.
    bool Put(TitleRequest const& request, std::optional<std::string> title);

    // What is shown stays until the new title is there, so that nothing flickers. Whether it knows the
    // ticket: its title is read again once it is in sight.
    bool Changed(comgui::TicketAddress ticket);

    void Forget(comgui::TicketAddress ticket);  // it was deleted
    void Clear();                               // another session

    std::size_t Size() const { return m_titles.size(); }

private:
    enum class Reading
    {
        Wanted,
        UnderWay,
        Done,
    };
    struct Entry
    {
        std::optional<std::string> title;
        Reading reading = Reading::Wanted;
        unsigned long long stamp = 0;
        std::list<comgui::TicketAddress>::iterator use;
    };

    void Use(comgui::TicketAddress ticket);

    std::size_t const m_capacity;
    std::map<comgui::TicketAddress, Entry> m_titles;
    std::list<comgui::TicketAddress> m_uses;  // the one seen last first
    std::vector<comgui::TicketAddress> m_visible;
    unsigned long long m_lastStamp = 0;
};
}  // namespace desk
