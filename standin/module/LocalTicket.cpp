#include "standin/module/LocalTicket.h"

#include "comgui/ticket/TICKET_ID.h"
#include "standin/module/ValueWords.h"
#include "standin/server/files/FileError.h"
#include "standin/server/files/Report.h"
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
        throw FileError(ForMessages(file.string()) + ": cannot be read: no regular file; correct the path");
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
    KeyValues const* const values = key && MayRead() ? m_ticket.Now().Find(std::string_view(key)) : nullptr;
    return values && ReadValue(*values, type, value, pos, m_reader);
}

bool LocalTicket::GetTable(GETMULTIPAR* table)
{
    if (!table || !MayRead())
        return false;
    for (GETMULTIPAR* record = table; record->key; ++record)
        record->ok = Get(record->key, record->type, record->value, record->pos);
    return true;
}

bool LocalTicket::Set(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    SETMULTIPAR table[2] = {};
    table[0].key = key;
    table[0].type = type;
    table[0].value = value;
    table[0].pos = pos;
    return SetTable(table) && table[0].ok;  // a null key ends the table: ok stays false
}

bool LocalTicket::SetTable(SETMULTIPAR* table)
{
    if (!table)
        return false;
    auto writes = WritesOf(table);
    m_ticket.Write(writes);
    Answer(writes, table);
    return true;
}

// The keys of the beginning, and the values behind each that it has when its turn comes, since the action may
// write. The limit goes by: whatever it was meant to bound, a walk that left out values would lose them for
// good where a ticket is copied by walking over it.
bool LocalTicket::Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int)
{
    if (!action)
        return false;
    std::vector<HeldKey> keys;
    for (KeyValues const* const values : m_ticket.Now().Sorted(prefix ? prefix : ""))
        keys.push_back(values->Name());
    for (HeldKey const& key : keys)
        for (int pos = 0;;)
        {
            KeyValues const* const values = m_ticket.Now().Find(key.Get());
            TicketElement const* const found = values ? values->From(pos) : nullptr;
            if (!found)
                break;
            TicketElement const element = *found;  // the action may write to the key
            pos = element.pos + 1;
            if (element.IsText())
                element.text->HandOut(m_reader.Mark());
            BIN_STRING binary;
            void const* const word = WordOfWalked(element, m_numbers, binary);
            if (!action(context, key->CStr(), element.type, word, element.pos))
                return true;
        }
    return true;
}

bool LocalTicket::Option(int code, void* out)
{
    TicketAddress const told = m_ticket.Address().value_or(TicketAddress{TICKET_ID_NONE, TICKET_ID_NONE});
    return comgui::plugin::AnswerOption(code, out, {told.type, told.id}, nullptr);
}
}  // namespace standin
