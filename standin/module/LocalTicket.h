// A single ticket outside any container: in memory, or out of a ticket file, which it saves to when it has
// changed. For one thread at a time; several tickets, also of one file, are independent of each other.
#pragma once

#include "comgui/module/TicketSlots.h"
#include "standin/module/HostCalls.h"
#include "standin/module/WalkedNumbers.h"
#include "standin/server/tickets/OwnedTicket.h"
#include "standin/server/tickets/TextReader.h"
#include <filesystem>

namespace standin
{
class LocalTicket : public HostCalls<comgui::plugin::TicketSlots>
{
public:
    LocalTicket() = default;  // in memory

    // Throws XmlError and FileError. A file that is not there is told by FileToOpen, and not here.
    explicit LocalTicket(std::filesystem::path file);

    // The file that a client means by a path: absolute, so that the ticket is saved to where it came from
    // even if the current folder changes, and with backslashes as separators, since that is what clients
    // written for other systems send. Nothing if no such file is there.
    static std::optional<std::filesystem::path> FileToOpen(std::string path);

    // Puts the changes into the file, if there are any and if there is a file; throws FileError, with the
    // old file as it was.
    void Save() const;

    bool Get(char const* key, PARAM_TYPE type, void* value, int pos) override;
    bool GetTable(GETMULTIPAR* table) override;
    bool Set(char const* key, PARAM_TYPE type, void const* value, int pos) override;
    bool SetTable(SETMULTIPAR* table) override;
    bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit) override;
    bool Option(int code, void* out) override;

private:
    std::filesystem::path const m_file;  // empty in memory
    OwnedTicket m_ticket;
    TextReader m_reader{1};  // the only one, so that any mark will do
    WalkedNumbers m_numbers;
};
}  // namespace standin
