#include "tools/comgui_validate/Check.h"

namespace validate
{
std::vector<OptionName> const& OptionNames()
{
    static std::vector<OptionName> const names{
        {"ticket-type", "the type in which tickets may be made and deleted"},
        {"ticket", "TYPE/ID of a ticket that may be written to, where none can be made"},
        {"ticket-file", "a ticket file; a copy of it is opened and changed"},
        {"server-folder", "where on the server files may be put; $(TEMP) if not given"},
        {"put", "local-first (the default) or server-first: the order of the two texts of PutFileEntry"},
        {"jobs", "yes: a job may be sent, which a real server may print"},
        {"dead-port", "a port of this machine at which no server answers; 1 if not given"},
    };
    return names;
}

std::vector<Check> const& Checks()
{
    static std::vector<Check> const checks = []
    {
        std::vector<Check> all;
        for (auto const group : {BundleChecks, ServerChecks, SessionChecks, ContainerChecks, ValueChecks,
                                 TableChecks, WalkChecks, TicketChecks, NotificationChecks, MemoryChecks,
                                 CommandChecks, TransferChecks, ThreadChecks})
            for (Check& check : group())
                all.push_back(std::move(check));
        return all;
    }();
    return checks;
}
}  // namespace validate
