#include "desk/model/TicketIndex.h"

namespace desk
{
void TicketIndex::Show(int type, std::vector<int> ids)
{
    SortedIds& shown = m_types[type];
    m_count -= shown.Size();
    shown.Assign(std::move(ids));
    m_count += shown.Size();
}

std::optional<std::size_t> TicketIndex::Add(comgui::TicketAddress ticket)
{
    auto const index = m_types[ticket.type].Insert(ticket.id);
    m_count += index ? 1 : 0;
    return index;
}

std::optional<std::size_t> TicketIndex::Remove(comgui::TicketAddress ticket)
{
    auto const type = m_types.find(ticket.type);
    auto const index = type == m_types.end() ? std::nullopt : type->second.Erase(ticket.id);
    m_count -= index ? 1 : 0;
    return index;
}

void TicketIndex::Clear()
{
    m_types.clear();
    m_count = 0;
}

std::vector<int> TicketIndex::Types() const
{
    std::vector<int> types;
    for (auto const& [type, ids] : m_types)
        types.push_back(type);
    return types;
}

std::size_t TicketIndex::Count(int type) const
{
    auto const found = m_types.find(type);
    return found == m_types.end() ? 0 : found->second.Size();
}

std::optional<comgui::TicketAddress> TicketIndex::At(int type, std::size_t index) const
{
    auto const found = m_types.find(type);
    auto const id = found == m_types.end() ? std::nullopt : found->second.At(index);
    return id ? std::optional(comgui::TicketAddress{type, *id}) : std::nullopt;
}

std::optional<std::size_t> TicketIndex::IndexOf(comgui::TicketAddress ticket) const
{
    auto const type = m_types.find(ticket.type);
    return type == m_types.end() ? std::nullopt : type->second.IndexOf(ticket.id);
}
}  // namespace desk
