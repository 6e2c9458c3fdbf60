// Rules of trouble as people write them. What is taken has a text that says the same; what is not leaves
// others alone; and whatever rules there are, a call is answered.
#include "standin/server/trouble/Troubles.h"

#include "fuzz/fuzz.h"
#include <algorithm>

using namespace standin;

namespace
{
// Without its end, which a text may give from now on.
std::string Lasting(TroubleRule rule)
{
    rule.until.reset();
    return rule.Text();
}

void CheckLine(std::string const& line)
{
    try
    {
        TroubleRule const rule = TroubleRule::Parse(line);
        COMGUI_MUST(TroubleRule::Parse(rule.Text()).Text() == rule.Text());
        COMGUI_MUST(Lasting(TroubleRule::Parse(rule.Text())) == Lasting(rule));
        COMGUI_MUST(rule.by <= TroubleRule::LongestDuration);
        COMGUI_MUST(rule.code != 0);
        COMGUI_MUST(!rule.nth || *rule.nth == 7 || !rule.IsDrawn(7));
    }
    catch (TroubleError const& error)
    {
        COMGUI_MUST(*error.what() != 0);
    }
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string const text(reinterpret_cast<char const*>(data), size);
    CheckLine(text.substr(0, text.find('\n')));

    Troubles troubles;
    troubles.Set(text);
    auto const verdict =
        troubles.OnCall({.call = "MGETPARAMETER", .ticket = TicketAddress{3, 1}, .user = "admin"});
    COMGUI_MUST(verdict.delay.count() >= 0);
    COMGUI_MUST(troubles.Any() || (verdict.code == 0 && verdict.delay.count() == 0));
    troubles.OnNotification({.ticket = TicketAddress{3, 1}, .user = "admin"});
    troubles.OnTransfer();
    troubles.Set("");
    COMGUI_MUST(troubles.OnCall({}).code == 0);
    return 0;
}
