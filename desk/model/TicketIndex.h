// All tickets of the server by type, with counts. A type that was shown once stays, so that a branch that
// somebody looks at does not disappear with its last ticket. For one thread at a time.
#pragma once

#include "comgui/client/TicketAddress.h"
#include "desk/model/SortedIds.h"
#include <cstddef>
#include <map>
#include <optional>
#include <vector>

namespace desk
{
class TicketIndex
{
public:
    // Replaces the ids of a type.
    void Show(int type, std::vector<int> ids);

    // The index within its type at which the ticket stands from now on, or stood; none if nothing changed.
    std::optional<std::size_t> Add(comgui::TicketAddress ticket);
    std::optional<std::size_t> Remove(comgui::TicketAddress ticket);

    void Clear();

    std::vector<int> Types() const;  // ascending
    std::size_t Count() const { return m_count; }
    std::size_t Count(int type) const;

    std::optional<comgui::TicketAddress> At(int type, std::size_t index) const;
    std::optional<std::size_t> IndexOf(comgui::TicketAddress ticket) const;  // within its type

private:
    std::map<int, SortedIds> m_types;
    std::size_t m_count = 0;
};
}  // namespace desk
