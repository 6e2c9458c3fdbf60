#include "standin/server/site/TroubleListener.h"

#include "standin/server/files/Report.h"

namespace standin
{
// The rules are a single value.
void TroubleListener::Noticed(TicketAddress, ChangedParameters const& parameters) noexcept
{
    try
    {
        for (ChangedParameter const& change : parameters)
            if (change.key->Text() == TroubleKey && change.pos <= 0)
                m_troubles.Set(change.value.type == PARAM_STRING ? change.value.text->bytes : std::string());
    }
    catch (std::exception const& error)
    {
        Report({TroubleKey, ": cannot be followed: ", error.what()});
    }
}
}  // namespace standin
