// The bundle's module over one site in memory, which stays open to the end of the process, and the way back
// to what it began with. Sessions see each other's changes; the observer's is no client's.
#pragma once

#include "fuzz/TicketModel.h"
#include "tests/module/ModuleUnderTest.h"
#include "tests/server/MemoryFolder.h"
#include <set>
#include <string>
#include <vector>

class MODULE_SITE
{
public:
    static MODULE_SITE& Get();

    // The site with no tickets but those of its seed and 3/1, which is empty, and with no values but the
    // seed's; the files of the client.
    void Reset();

    // Writes so often that the server frees what it has put off.
    void TurnOver() const;

    void* LogIn(char const* user) const;  // the password is "secret"; null if refused
    MTICKET_ACCESS const* Container(void* hSession) const
    {
        return module->GetClientContainerEntry(module.Instance(), hSession);
    }

    // As the observer finds them.
    std::vector<int> TicketsOf(int type) const;
    std::optional<MODEL_TICKET> Content(int type, int id) const;  // nothing for no such ticket
    std::optional<std::string> Data(int type, int id) const;      // by GetTicketData
    std::optional<std::string> FileOf(std::string const& serverPath) const;

    std::string Client(std::string const& name) const { return m_folder / ("client/" + name); }
    std::set<std::string> NamesInSite() const;

private:
    MODULE_SITE();
    void DeleteTickets(int type) const;
    void WriteValues(int type, int id) const;

    MemoryFolder const m_folder;  // first: removed when the module has left it

public:
    MODULE const module;

private:
    void* m_session = nullptr;
    MTICKET_ACCESS const* m_observer = nullptr;
    int m_resets = 0;
};
