#include "comgui/testing/TicketFake.h"

#include "comgui/ticket/TICKET_OP.h"
#include <stdexcept>

namespace comgui::test
{
TicketFake& TicketFake::Of(void* instance)
{
    auto* const fake = static_cast<TicketFake*>(instance);
    if (!fake || fake->m_mark != Mark)
        throw std::logic_error("a slot of TicketFake was called with an Instance that is not its own");
    return *fake;
}

TicketFake::TicketFake()
{
    container.AddTicket(0, 0);
    m_access.Instance = this;
    m_access.SGETPARAMETER = [](void* instance, char const* key, PARAM_TYPE type, void* value, int pos)
    {
        MTICKET_ACCESS const* const access = Of(instance).container.Access();
        return access->MGETPARAMETER(access->Instance, 0, 0, key, type, value, pos);
    };
    m_access.SGETMULTIPAR = [](void* instance, GETMULTIPAR* table)
    {
        MTICKET_ACCESS const* const access = Of(instance).container.Access();
        return access->MGETMULTIPAR(access->Instance, 0, 0, table);
    };
    m_access.SWALKPARAMETERS =
        [](void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int)
    { return Of(instance).container.WalkValues(0, 0, action, context, prefix); };
    m_access.SSETPARAMETER = [](void* instance, char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        MTICKET_ACCESS const* const access = Of(instance).container.Access();
        return access->MSETPARAMETER(access->Instance, 0, 0, key, type, value, pos);
    };
    m_access.SSETMULTIPAR = [](void* instance, SETMULTIPAR* table)
    {
        MTICKET_ACCESS const* const access = Of(instance).container.Access();
        return access->MSETMULTIPAR(access->Instance, 0, 0, table);
    };
    m_access.SOPTION = OnOption;
}

int TicketFake::OnOption(void* instance, int code, void* out)
{
    TicketFake& fake = Of(instance);
    fake.options.push_back(code);
    bool const isKnown = code == STICKET_OP_FOLDER_VARIABLES || code == STICKET_OP_WHOAMI;
    bool const lacksTranslator = code == STICKET_OP_FOLDER_VARIABLES && !fake.container.folders;
    if (!out || !isKnown || lacksTranslator)
        return 0;
    if (code == STICKET_OP_WHOAMI)
        *static_cast<STICKET_OPTION_WHOAMI*>(out) = {7, 8};
    else if (fake.optionResult)
        *static_cast<clFOLDER_VARIABLES**>(out) = fake.container.folders;
    return fake.optionResult;
}
}  // namespace comgui::test
