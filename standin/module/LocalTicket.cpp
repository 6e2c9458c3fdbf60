#include "standin/module/LocalTicket.h"

#include "comgui/ticket/TICKET_OP.h"
#include "standin/server/store/Storage.h"
#include <algorithm>
#include <utility>

namespace standin
{
namespace
{
TicketXml ContentOf(std::filesystem::path const& file)
{
    // Reading a pipe would wait for whoever writes to it.
    std::error_code error;
    auto const status = std::filesystem::status(file, error);
    if (exists(status) && !is_regular_file(status))
        throw StorageError(file.string() + ": cannot be read: no regular file; correct the path");
    return TicketXml::Read(file);
}
}  // namespace

LocalTicket::LocalTicket(std::filesystem::path file) : m_file(std::move(file)), m_ticket(ContentOf(m_file)) {}

std::optional<std::filesystem::path> LocalTicket::FileToOpen(std::string path)
{
    std::replace(path.begin(), path.end(), '\\', '/');
    if (path.empty())
        return std::nullopt;
    std::filesystem::path file = std::filesystem::absolute(path);
    std::error_code error;
    // What cannot be looked at counts as being there: opening it tells why it cannot be read.
    bool const isMissing =
        std::filesystem::status(file, error).type() == std::filesystem::file_type::not_found;
    return isMissing ? std::nullopt : std::optional(std::move(file));
}

void LocalTicket::Save() const
{
    if (!m_file.empty() && m_ticket.Changed())
        m_ticket.Content().Write(m_file);
}

bool LocalTicket::Get(char const* key, PARAM_TYPE type, void* value, int pos)
{
    return m_ticket.Get(key, type, value, pos);
}

bool LocalTicket::GetTable(GETMULTIPAR* table) { return m_ticket.GetTable(table); }

bool LocalTicket::Set(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    return m_ticket.Set(key, type, value, pos);
}

bool LocalTicket::SetTable(SETMULTIPAR* table) { return m_ticket.SetTable(table); }

// The limit goes by: whatever it was meant to bound, a walk that left out values would lose them for good
// where a ticket is copied by walking over it.
bool LocalTicket::Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int)
{
    return m_ticket.Walk(action, context, prefix);
}

bool LocalTicket::Option(int code, void* out)
{
    return code == STICKET_OP_WHOAMI && TellWhoAmI(m_ticket.Address(), out);
}
}  // namespace standin
