#include "standin/module/OpenTicket.h"

#include "comgui/ticket/TICKET_OP.h"
#include <bit>

namespace standin
{
bool OpenTicket::Get(char const* key, PARAM_TYPE type, void* value, int pos)
{
    return m_server.Get(m_session, m_address, key, type, value, pos, Which());
}

bool OpenTicket::GetTable(GETMULTIPAR* table)
{
    return m_server.GetTable(m_session, m_address, table, Which());
}

bool OpenTicket::Set(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    return m_server.Set(m_session, m_address, key, type, value, pos, Which());
}

bool OpenTicket::SetTable(SETMULTIPAR* table)
{
    return m_server.SetTable(m_session, m_address, table, Which());
}

// Over the ticket as it is at the beginning, with nothing locked while the action runs. The limit goes by: a
// walk that left out values would lose them for good where a ticket is copied by walking over it.
bool OpenTicket::Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int)
{
    if (!action)
        return false;
    auto const values = m_server.Values(m_session, m_address, prefix ? prefix : "", Which());
    if (!values)
        return false;
    for (WalkedValue const& value : *values)
    {
        BIN_STRING binary;
        // The action may have ended the session, and the texts with it.
        if (m_session.Ended() ||
            !action(context, value.key->c_str(), value.type, WordOf(value, binary), value.pos))
            break;
    }
    return true;
}

void const* OpenTicket::WordOf(WalkedValue const& value, BIN_STRING& binary)
{
    if (value.type == PARAM_POINTER)
        return std::bit_cast<void const*>(value.word);
    if (value.type == PARAM_STRING)
        return value.text->bytes.c_str();
    if (value.type == PARAM_BINSTRING)
    {
        binary = {value.text->bytes.data(), value.text->bytes.size()};
        return &binary;
    }
    std::lock_guard const lock(m_lock);
    return &*m_numbers.insert(value.word).first;  // little-endian: a short number's bytes come first
}

bool OpenTicket::Option(int code, void* out)
{
    bool const isThere = !m_session.Ended() && m_server.BirthOf(m_address) == Which() && Which() != NoBirth;
    if (!isThere)
        return false;
    if (code == STICKET_OP_FOLDER_VARIABLES)
        return m_folders.HandOut(out);
    return code == STICKET_OP_WHOAMI && TellWhoAmI(m_address, out);
}
}  // namespace standin
