// A sequence of steps by which a client changes a site, each of them one transaction, and what is there after
// any number of them. One side makes the steps, the other one compares.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

struct SiteHistory
{
    static constexpr int Type = 60;          // tickets with ids from 1 on, and values
    static constexpr int NumberedType = 61;  // tickets to which the server gives the ids

    enum class Deed
    {
        Create,
        SetSingle,
        SetTable,
        Append,
        AppendAgain,
        SetTableAgain,
        CreateNext,
        RemoveOrDelete,  // the single value of a ticket with an odd id, a ticket with an even one
    };
    static constexpr int Deeds = 8;

    static Deed DeedOf(int step) { return static_cast<Deed>(step % Deeds); }
    static int IdOf(int step) { return 1 + step / Deeds; }
    static bool Deletes(int step) { return IdOf(step) % 2 == 0; }
};

// A ticket as far as the tests write it.
struct TicketText
{
    std::map<std::string, std::int64_t> values;
    std::vector<std::int64_t> list;
    std::optional<std::int64_t> table;
    bool isTorn = false;  // the table

    std::string Text() const
    {
        std::string text;
        for (auto const& [key, value] : values)
            text += " " + key + "=" + std::to_string(value);
        if (!list.empty())
            text += " List=";
        for (std::int64_t const value : list)
            text += std::to_string(value) + ",";
        if (table)
            text += " Table=" + std::to_string(*table);
        return text + (isTorn ? " torn" : "");
    }
};

// What a site has after so many steps, a line for each ticket.
inline std::set<std::string> ContentAfter(int steps)
{
    using Deed = SiteHistory::Deed;
    std::map<std::pair<int, int>, TicketText> tickets;
    for (int step = 0; step < steps; ++step)
    {
        int const id = SiteHistory::IdOf(step);
        TicketText& ticket = tickets[{SiteHistory::Type, id}];
        Deed const deed = SiteHistory::DeedOf(step);
        if (deed == Deed::SetSingle)
            ticket.values["Single"] = step;
        else if (deed == Deed::SetTable || deed == Deed::SetTableAgain)
            ticket.table = step;
        else if (deed == Deed::Append || deed == Deed::AppendAgain)
            ticket.list.push_back(step);
        else if (deed == Deed::CreateNext)
            tickets[{SiteHistory::NumberedType, id}];  // one a round, so the ids go in step
        else if (deed == Deed::RemoveOrDelete && !SiteHistory::Deletes(step))
            ticket.values.erase("Single");
        else if (deed == Deed::RemoveOrDelete)
            tickets.erase({SiteHistory::Type, id});
    }
    std::set<std::string> lines;
    for (auto const& [address, ticket] : tickets)
        lines.insert("ticket " + std::to_string(address.first) + "/" + std::to_string(address.second) +
                     ticket.Text());
    return lines;
}
