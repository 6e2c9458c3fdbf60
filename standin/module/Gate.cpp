#include "standin/module/Gate.h"

#include "comgui/module/Codes.h"
#include "standin/server/files/RefusableCall.h"
#include <thread>

namespace standin
{
namespace
{
[[noreturn]] void Refuse(Occasion const& call, int code)
{
    RefusableRead read;
    RefusableCall::Note(
        {call.command.empty() ? call.call : call.command, ": refused, as ", TroubleKey, " says"});
    read.Refuse();
    throw comgui::plugin::Refused(code);
}
}  // namespace

void PassTroubled(Troubles& troubles, Occasion const& call)
{
    Troubles::Verdict const verdict = troubles.OnCall(call);
    std::this_thread::sleep_for(verdict.delay);
    if (verdict.code != 0)
        Refuse(call, verdict.code);
}

void Gate::PassTroubledCall(Occasion const& call) const
{
    m_tickets.CatchUp();  // they may have been taken back
    PassTroubled(m_troubles, call);
    if (HasLostSession())
        Refuse(call, comgui::plugin::UnknownSession);
}
}  // namespace standin
