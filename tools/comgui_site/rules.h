// The rules by which the servers of a site misbehave, as the owner sees and changes them.
#pragma once

#include "standin/server/site/RulesOfSite.h"
#include "standin/server/trouble/TroubleRule.h"
#include <string>
#include <vector>

namespace comgui_site
{
class OpenedSite;

// A rule for people: its end as a local time. Whatever else stands in its place is shown as it is.
struct ShownRule
{
    std::string text;
    char const* state;  // "followed", "ended", or "wrong" for what is no rule
};
ShownRule ShownRuleOf(std::string const& line);

bool HasEnded(std::string const& line);

// The rule of these words; throws WrongUse.
standin::TroubleRule RuleOf(std::vector<std::string> const& words);

// As standin::ChangeRules, with the system ticket's file.
void ChangeRulesOf(OpenedSite& site, std::function<void(std::vector<std::string>& rules)> const& change);
}  // namespace comgui_site
