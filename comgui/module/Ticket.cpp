#include "comgui/module/Ticket.h"

#include "comgui/module/Answers.h"
#include "comgui/ticket/TICKET_OP.h"

namespace comgui::plugin
{
int Ticket::Count(std::string_view key) { return IsNone(Read(key, 0)) ? 0 : 1; }

bool Ticket::Write(std::string_view, Value const&, int) { return false; }

std::vector<Parameter> Ticket::All(std::string_view) { return {}; }

bool Ticket::Get(char const* key, PARAM_TYPE type, void* value, int pos)
{
    return AnswerRead(*this, m_kept, key, type, value, pos);
}

bool Ticket::GetTable(GETMULTIPAR* table) { return AnswerTableRead(*this, *this, m_kept, table); }

bool Ticket::Set(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    return AnswerWrite(*this, key, type, value, pos);
}

bool Ticket::SetTable(SETMULTIPAR* table) { return AnswerTableWrite(*this, *this, table); }

bool Ticket::Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int)
{
    return AnswerWalk(*this, m_kept, action, context, prefix);
}

bool Ticket::Option(int code, void* out) { return AnswerOption(code, out, WhoAmI(), Folders()); }
}  // namespace comgui::plugin
