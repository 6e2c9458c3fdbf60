// The table of a session's tickets as a whole.
#include "tools/comgui_validate/Session.h"
#include "tools/comgui_validate/Value.h"

namespace validate
{
namespace
{
MTICKET_ACCESS const* Fetch(Session& session)
{
    Module& module = session.GetTrial().GetModule();
    session.GetTrial().Calling("GetClientContainerEntry(instance, session)");
    return module.table.GetClientContainerEntry(module.instance, session.Handle());
}

void There(Trial& trial)
{
    Session session(trial);
    trial.Expect("C1", Fetch(session), "null", "a container");
}

void Stays(Trial& trial)
{
    Session session(trial);
    MTICKET_ACCESS const* const first = session.Container();
    MTICKET_ACCESS const words = *first;
    for (int i = 0; i < 3; ++i)
        trial.Expect("C1", Fetch(session), "null, asked again", "a container");
    trial.Calling("MGETPARAMETER(0, 0, ...) of the table that came first");
    bool const isSame = words.Instance == first->Instance && words.MGETPARAMETER == first->MGETPARAMETER &&
                        words.MOPERATION == first->MOPERATION;
    trial.Expect("C1", isSame, "a table with other words", "the table as it was");
    ReadPlace place;
    (void)first->MGETPARAMETER(first->Instance, 0, 0, "ComGUIValidate/Missing", PARAM_INT, place.Get(), -1);
}

void Slots(Trial& trial)
{
    Session session(trial);
    MTICKET_ACCESS const& table = *session.Container();
    trial.Calling("nothing: the slots of the container");
    auto const expect = [&trial](char const* name, bool isThere)
    { trial.Expect("C2", isThere, std::string(name) + " is null", "a function"); };
    expect("MGETPARAMETER", table.MGETPARAMETER);
    expect("MGETMULTIPAR", table.MGETMULTIPAR);
    expect("MWALKTICKETS", table.MWALKTICKETS);
    expect("MSETPARAMETER", table.MSETPARAMETER);
    expect("MSETMULTIPAR", table.MSETMULTIPAR);
    expect("MOPERATION", table.MOPERATION);
    expect("MENDISNOTIF", table.MENDISNOTIF);
}

void SystemTicket(Trial& trial)
{
    Session session(trial);
    MTICKET_ACCESS const* const table = session.Container();
    STICKET_ACCESS const* ticket = nullptr;
    bool open = false;
    trial.Calling("MOPERATION(0, 0, MTICKET_OP_OPEN, &ticket)");
    trial.ExpectSuccess("C3", table->MOPERATION(table->Instance, 0, 0, MTICKET_OP_OPEN, &ticket));
    trial.Expect("C3", ticket, "null", "a table");
    table->MOPERATION(table->Instance, 0, 0, MTICKET_OP_CLOSE, &open);
}
}  // namespace

std::vector<Check> ContainerChecks()
{
    return {{"container.there", There},
            {"container.stays", Stays},
            {"container.slots", Slots},
            {"container.system-ticket", SystemTicket}};
}
}  // namespace validate
