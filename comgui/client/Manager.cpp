#include "comgui/client/Manager.h"

#include "comgui/host/UtilityObjects.h"
#include "comgui/session/ComGUIGlobals.h"
#include <atomic>
#include <mutex>

namespace comgui::detail
{
namespace
{
// Every manager that is made writes the library's own pointer anew, without a lock: no one else may look at
// it meanwhile.
std::atomic<STicketFactory*> ticketFactory{nullptr};

Error NoPlugInThere()
{
    wxString path;
    UtilityObjects::GetPlugInsPath(path, L"" COMGUI_BUNDLE_NAME);
    return {NoPlugIn, path.utf8_string(), {}};
}

// A manager that could not open the plug-in does not say so, and its entries fault. Hence this trial, by any
// manager: these steps use nothing of its state.
bool CanOpenPlugIn(ComGUIManager& any)
{
    __CFBundle* plugIn = nullptr;
    ComGUIModuleInterface** module = nullptr;
    if (any.RegisterPlugIn(&plugIn) != 0 || any.CreateComGUIModuleInterface(plugIn, &module) != 0)
        return false;
    (*module)->Release(module);
    return true;
}
}  // namespace

Result<std::unique_ptr<ComGUIManager>> OpenManager()
{
    static std::mutex opening;
    static std::unique_ptr<ComGUIManager> first;
    std::lock_guard const lock(opening);
    if (!first)
    {
        first = std::make_unique<ComGUIManager>();
        if (!hSTicketInstance)
            return NoPlugInThere();
    }
    if (!CanOpenPlugIn(*first))
        return NoPlugInThere();
    auto manager = std::make_unique<ComGUIManager>();
    ticketFactory = hSTicketInstance;
    return manager;
}

void ForgetPassword(TLogin& record)
{
    for (char volatile& letter : record.szPassword)
        letter = 0;
}

ScratchTicket::ScratchTicket()
{
    if (STicketFactory* const factory = ticketFactory)
        m_ticket = factory->CreateTicket(nullptr);
}

ScratchTicket::~ScratchTicket()
{
    if (STicketFactory* const factory = ticketFactory)
        factory->DestroyTicket(&m_ticket);
}

bool ScratchTicket::Put(char const* key, void* pointer) const
{
    return m_ticket->SSETPARAMETER(m_ticket->Instance, key, PARAM_POINTER, pointer, -1) != 0;
}

std::string TakeReason(ComGUIManager& manager)
{
    ScratchTicket const answer;
    char command[] = "local.get.reason";
    char const* text = nullptr;
    if (!answer || manager.SendCommand(nullptr, command, 0, answer.Address()) != 0 ||
        !answer.Get("Reason/Text", text) || !text)
        return {};
    return text;
}

Error FailureOf(ComGUIManager& manager, int code, std::string about)
{
    return {code, std::move(about), TakeReason(manager)};
}
}  // namespace comgui::detail
