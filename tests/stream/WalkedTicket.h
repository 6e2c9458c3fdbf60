// A ticket that can be walked: it delivers the records that it was made of, and writes down how it was asked.
#pragma once

#include "comgui/testing/TicketFake.h"
#include "tests/support/StreamOracle.h"
#include <string>
#include <vector>

using comgui::test::TicketFake;

class WalkedTicket : public TicketFake
{
public:
    explicit WalkedTicket(std::vector<StreamOracle::RECORD> const& records) : m_table(records)
    {
        Access()->SWALKPARAMETERS =
            [](void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
        {
            auto& ticket = static_cast<WalkedTicket&>(*static_cast<TicketFake*>(instance));
            ticket.prefixes.emplace_back(prefix);
            ticket.limits.push_back(limit);
            for (SETMULTIPAR const* record = ticket.m_table.Records(); record->key; ++record)
            {
                ++ticket.delivered;
                std::string const key = record->key;  // gone before the next
                if (!action(context, key.c_str(), record->type, record->value, record->pos))
                    return 0;
            }
            return 1;
        };
    }

    std::vector<std::string> prefixes;
    std::vector<int> limits;
    int delivered = 0;  // records

private:
    StreamOracle::TABLE m_table;
};
