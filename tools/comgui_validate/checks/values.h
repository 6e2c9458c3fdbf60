// The checks of values and tables, which hold for every kind of ticket.
#pragma once

#include "tools/comgui_validate/Subject.h"

namespace validate
{
using SubjectCheck = void (*)(Subject&);

struct NamedSubjectCheck
{
    char const* name;  // behind the dot
    SubjectCheck run;
};

std::vector<NamedSubjectCheck> const& SubjectChecksOfValues();
std::vector<NamedSubjectCheck> const& SubjectChecksOfTables();

// As checks of a ticket in a session's container.
std::vector<Check> InAContainer(char const* group, std::vector<NamedSubjectCheck> const& checks);

// Those that look at walks; they need a table of the ticket's own. other: an empty ticket.
void WalkGivesEachValue(WithTable& ticket);
void WalkCanBeCopied(WithTable& ticket, WithTable& other);

void ExpectEachTypeBack(Subject& ticket, bool hasPointers);
void Append(Subject& ticket);
}  // namespace validate
