#include "tools/comgui_site/rules.h"

#include "tools/comgui_site/OpenedSite.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/import.h"
#include "tools/comgui_site/words.h"

namespace comgui_site
{
using standin::TroubleRule;

namespace
{
std::optional<TroubleRule> Parsed(std::string const& line)
try
{
    return TroubleRule::Parse(line);
}
catch (standin::TroubleError const&)
{
    return std::nullopt;
}
}  // namespace

ShownRule ShownRuleOf(std::string const& line)
{
    auto rule = Parsed(line);
    if (!rule)
        return {Cleaned(line) + "  (no rule; nobody follows it)", "wrong"};
    bool const hasEnded = rule->HasEnded(TroubleRule::Clock::now());
    std::string end;
    if (rule->until)
        end = (hasEnded ? "  ended " : "  until ") + TimeText(TroubleRule::Clock::to_time_t(*rule->until));
    rule->until.reset();
    return {Cleaned(rule->Text()) + end, hasEnded ? "ended" : "followed"};
}

bool HasEnded(std::string const& line)
{
    auto const rule = Parsed(line);
    return rule && rule->HasEnded(TroubleRule::Clock::now());
}

TroubleRule RuleOf(std::vector<std::string> const& words)
{
    std::string line;
    for (std::string const& word : words)
        line += (line.empty() ? "" : " ") + word;
    try
    {
        return TroubleRule::Parse(line);
    }
    catch (standin::TroubleError const& error)
    {
        throw WrongUse(error.what());
    }
}

void ChangeRulesOf(OpenedSite& site, std::function<void(std::vector<std::string>& rules)> const& change)
{
    standin::ChangeRules(site.Store(), change);
    WriteMirror(site.Store(), site.Folder());
}
}  // namespace comgui_site
