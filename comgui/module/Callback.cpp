#include "comgui/module/Callback.h"

#include "comgui/module/Words.h"
#include <map>
#include <string_view>

namespace comgui::plugin
{
namespace
{
void* PointerIn(STICKET_ACCESS const& ticket, char const* key)
{
    void* pointer = nullptr;
    ticket.SGETPARAMETER(ticket.Instance, key, PARAM_POINTER, &pointer, -1);
    return pointer;
}
}  // namespace

std::optional<Callback> Callback::In(STICKET_ACCESS const& ticket)
{
    auto const function = reinterpret_cast<Function>(PointerIn(ticket, "pGUI2Notification"));
    if (!function)
        return std::nullopt;
    return Callback(function, PointerIn(ticket, "pUser"));
}

bool Callback::PutId(STICKET_ACCESS const& ticket, int id)
{
    return ticket.SSETPARAMETER(ticket.Instance, "iGUINotificationID", PARAM_INT, &id, -1) != 0;
}

void Callback::Tell(int kind, int argA, int argB, int code, std::vector<Parameter> const& parameters) const
{
    std::vector<SETMULTIPAR> table(parameters.size() + 1);
    std::vector<BIN_STRING> bytes(parameters.size());
    std::map<std::string_view, char const*>
        keys;  // a client takes records for one key's by the key's address
    for (std::size_t i = 0; i < parameters.size(); ++i)
    {
        Parameter const& parameter = parameters[i];
        table[i].key = keys.emplace(parameter.key, parameter.key.c_str()).first->second;
        table[i].type = TypeOf(parameter.value);
        table[i].value = WordOf(parameter.value, bytes[i]);
        table[i].pos = parameter.pos;
        table[i].ok = true;
    }
    Tell(kind, argA, argB, code, parameters.empty() ? nullptr : table.data());
}

void Callback::Tell(int kind, int argA, int argB, int code, SETMULTIPAR* table) const
{
    m_function(m_user, kind, argA, argB, code, table);
}
}  // namespace comgui::plugin
