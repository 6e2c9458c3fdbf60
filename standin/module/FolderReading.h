// The reading of the folders by a client's own translator: the system ticket's "System/UseFolderVariables"
// and then all folders, one after the other. While it reads, others may write, and a folder that can be
// resolved by the ticket as it is now may lean on one that was not there when the translator came by; it
// would then replace for ever, with its lock held. So whoever reads the keys in that very order, and nothing
// else in between, is not given a folder that he cannot resolve: he gets it resolved.
#pragma once

#include "comgui/ticket/PARAM_TYPE.h"
#include "standin/server/tickets/FolderTable.h"
#include <optional>
#include <string>
#include <string_view>

namespace standin
{
class FolderReading
{
public:
    // Each thread has one.
    static FolderReading& OfThisThread();

    // key was read of a ticket by this thread. text: what the client is about to get; null for nothing and
    // for what is no text. True if he cannot resolve it: Resolved tells what he is to get in its place.
    bool Note(void const* ticket, std::string_view key, PARAM_TYPE type, int number, char const* text);

    // Something else was read of the ticket.
    void Forget() { m_ticket = nullptr; }

    // Empty, as if the folder were not there, if nobody can resolve it. folders: as they are now.
    std::string Resolved(FolderSettings const& folders);

private:
    bool CanResolve(std::string_view folder);

    void const* m_ticket = nullptr;  // null while no folders are read
    bool m_decodes = false;
    std::size_t m_next = 0;  // the row that is due
    FolderTable m_table;     // of what he has read
};
}  // namespace standin
