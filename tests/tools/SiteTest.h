// A site in memory for the tests of comgui_site, with the users and tickets that most of them want.
#pragma once

#include "standin/server/store/memory/MemoryStore.h"
#include "tests/server/StoredValues.h"
#include "tools/comgui_site/TicketCommits.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/words.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>

class SiteTest : public testing::Test
{
protected:
    SiteTest()
    {
        site->AddTicket({0, 0});
        HaveUser("admin", 16, 1);
        HaveUser("operator", 1, 2);
    }

    void HaveUser(std::string const& name, int role, int ticket)
    {
        site->AddTicket({17, ticket});
        site->PutUser({name, "$y$hash", role, ticket});
    }
    void Put(standin::TicketAddress address, std::string_view key, standin::StoredValue const& value,
             int pos = 0)
    {
        site->AddTicket(address);
        site->Put(address, key, pos, value);
    }

    // "KEY[POS]=VALUE ..." of a ticket, "none" for one that is not there.
    std::string Ticket(standin::TicketAddress address)
    {
        auto const loaded = comgui_site::Load(store, address);
        if (!loaded)
            return "none";
        std::string text;
        loaded->values.Walk(
            [&](std::string_view key, int pos, standin::StoredValue const& value)
            {
                text += (text.empty() ? "" : " ") + std::string(key) + "[" + std::to_string(pos) +
                        "]=" + comgui_site::ShownValue(value);
            });
        return text;
    }

    // What the action is refused with.
    template <typename Action>
    static std::string TroubleOf(Action const& action)
    try
    {
        action();
        return "";
    }
    catch (std::runtime_error const& trouble)
    {
        return trouble.what();
    }

    std::shared_ptr<standin::MemorySite> const site = std::make_shared<standin::MemorySite>();
    standin::MemoryStore store{site, "comgui_site"};
};
