#include "standin/module/OpenTicket.h"

#include "standin/module/FolderReading.h"
#include "standin/module/ValueWords.h"

namespace standin
{
bool ReadTicket(TicketService& tickets, Session const& session, TicketAddress address,
                Incarnation incarnation, char const* key, PARAM_TYPE type, void* value, int pos)
{
    return key && tickets.LookAtKey(session, address, incarnation, key,
                                    [&](KeyValues const& values)
                                    { return ReadValue(values, type, value, pos, session.Reader()); });
}

// All of it from the ticket of one moment.
bool ReadTable(TicketService& tickets, Session const& session, TicketAddress address, Incarnation incarnation,
               GETMULTIPAR* table)
{
    if (!table)
        return false;
    auto const answer = [&](TicketSnapshot const& ticket, KeyFilter const* limit)
    {
        KeyValues const* values = nullptr;
        char const* known = nullptr;
        for (GETMULTIPAR* record = table; record->key; ++record)
        {
            if (record->key != known)  // the records of a list share its key
            {
                known = record->key;
                std::string_view const key = known;
                values = !limit || limit->Selects(key) ? ticket.Find(key) : nullptr;
            }
            record->ok =
                values && ReadValue(*values, record->type, record->value, record->pos, session.Reader());
        }
        return true;
    };
    if (!tickets.Look(session, address, incarnation, answer))
        for (GETMULTIPAR* record = table; record->key; ++record)
            record->ok = false;
    return !session.Ended();
}

bool WriteTicket(TicketService& tickets, Session const& session, TicketAddress address,
                 Incarnation incarnation, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    SETMULTIPAR record{};
    record.key = key;
    record.type = type;
    record.value = value;
    record.pos = pos;
    if (!key)
        return false;
    TicketWrite write = WriteOf(record);
    return tickets.Write(session, address, incarnation, {&write, 1}) && write.ok;
}

bool WriteTable(TicketService& tickets, Session const& session, TicketAddress address,
                Incarnation incarnation, SETMULTIPAR* table)
{
    if (!table)
        return false;
    auto writes = WritesOf(table);
    bool const isDone = tickets.Write(session, address, incarnation, writes);
    Answer(writes, table);
    return isDone;
}

bool OpenTicket::Get(char const* key, PARAM_TYPE type, void* value, int pos)
{
    if (!MayRead())
        return false;
    m_gate.PassFresh("SGETPARAMETER", m_address);
    if (m_address == SystemTicket && key && value && (type == PARAM_STRING || type == PARAM_INT)) [[unlikely]]
        return GetFolder(key, type, value, pos);
    EndFolderReading();
    return ReadTicket(m_tickets, m_session, m_address, Which(), key, type, value, pos);
}

// A folder, perhaps, or whether folders are used at all.
bool OpenTicket::GetFolder(char const* key, PARAM_TYPE type, void* value, int pos)
{
    char const* text = nullptr;
    int number = 0;
    void* const out = type == PARAM_STRING ? static_cast<void*>(&text) : &number;
    bool isRead = ReadTicket(m_tickets, m_session, m_address, Which(), key, type, out, pos);
    auto& folders = FolderReading::OfThisThread();
    std::string_view const read = pos <= 0 ? key : "";  // no folder is at another position
    if (folders.Note(this, read, type, number, text))
    {
        auto const texts = m_session.HoldTexts();
        isRead = texts != nullptr;
        if (isRead)
            text = m_tickets.HandOut(m_session, folders.Resolved(m_tickets.Folders()));
    }
    if (isRead && type == PARAM_STRING)
        *static_cast<char const**>(value) = text;
    else if (isRead)
        *static_cast<int*>(value) = number;
    return isRead;
}

// Something else is read through this table.
void OpenTicket::EndFolderReading() const
{
    if (m_address == SystemTicket)
        FolderReading::OfThisThread().Forget();
}

bool OpenTicket::GetTable(GETMULTIPAR* table)
{
    if (!MayRead())
        return false;
    m_gate.PassFresh("SGETMULTIPAR", m_address);
    EndFolderReading();
    return ReadTable(m_tickets, m_session, m_address, Which(), table);
}

bool OpenTicket::Set(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    m_gate.PassFresh("SSETPARAMETER", m_address);
    return WriteTicket(m_tickets, m_session, m_address, Which(), key, type, value, pos);
}

bool OpenTicket::SetTable(SETMULTIPAR* table)
{
    m_gate.PassFresh("SSETMULTIPAR", m_address);
    return WriteTable(m_tickets, m_session, m_address, Which(), table);
}

// Over the ticket as it is at the beginning, with nothing locked while the action runs. The limit goes by: a
// walk that left out values would lose them for good where a ticket is copied by walking over it.
bool OpenTicket::Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int)
{
    m_gate.PassFresh("SWALKPARAMETERS", m_address);
    EndFolderReading();
    // The session may end meanwhile, in the action or elsewhere, and the action may take any time.
    auto const texts = m_session.HoldTexts();
    auto const numbers = m_numbers.lock();
    TextReader::Walk const walk(m_session.Reader());
    if (!action || !texts || !numbers)
        return false;
    auto const walked = m_tickets.Values(m_session, m_address, Which(), prefix ? prefix : "");
    if (!walked)
        return false;
    for (WalkedValues::Value const& value : walked->Values())
    {
        BIN_STRING binary;
        void const* const word = WordOfWalked(value.element, *numbers, binary);
        if (m_session.Ended() ||
            !action(context, walked->KeyOf(value), value.element.type, word, value.element.pos))
            break;
    }
    return true;
}

bool OpenTicket::Option(int code, void* out)
{
    m_gate.PassFresh("SOPTION", m_address);
    bool const isThere = !m_session.Ended() && m_tickets.IncarnationOf(m_address) == Which();
    return isThere && comgui::plugin::AnswerOption(code, out, {m_address.type, m_address.id}, &m_folders);
}
}  // namespace standin
