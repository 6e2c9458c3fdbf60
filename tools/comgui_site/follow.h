// The changes of a site as they are committed, by whichever program, a line each.
#pragma once

#include "standin/server/store/Store.h"
#include "tools/comgui_site/words.h"
#include "tools/shared/Output.h"
#include <map>
#include <optional>
#include <string>

namespace comgui_site
{
// Names programs by what the store knows of them; those that are gone have their number only.
class ProgramNames
{
public:
    explicit ProgramNames(standin::Store& store) : m_store(store) {}
    std::string const& Of(standin::ProgramId program);  // "" for one that is not known

private:
    standin::Store& m_store;
    std::map<standin::ProgramId, std::string> m_names;
};

// "1042  program 7 (ticket_desk 4711)  write  3/12  Job/Copies=2, Job/Name="A4""
std::string LineOf(standin::CommittedChange const& change, std::string const& program);
Json JsonOf(standin::CommittedChange const& change, std::string const& program);

// Writes the changes behind that one, or those from now on, until somebody wants the program to end or the
// output is closed. Where the journal begins later, a line on stderr, or in JSON an object with "lost", says
// so. Goes on when a store is back that could not be reached; a line on stderr says that it is away. Throws
// Trouble if there is no such change yet.
void Follow(standin::Store& store, std::optional<standin::Sequence> since, bool isJson, tools::Output& out);
}  // namespace comgui_site
