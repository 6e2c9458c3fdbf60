// What the kit needs of the library beside the slots of a container: managers, each for one thread at a time,
// and commands that are answered in a ticket.
#pragma once

#include "comgui/client/Result.h"
#include "comgui/session/ComGUIManager.h"
#include <memory>
#include <string>

namespace comgui::detail
{
// A manager of its own. Several may exist, and each is a session's worth of state. Opens the plug-in the
// first time. For any thread. Error: NoPlugIn.
Result<std::unique_ptr<ComGUIManager>> OpenManager();

// Overwrites the password, also where the compiler sees nobody read it afterwards.
void ForgetPassword(TLogin& record);

// A ticket in memory, from the plug-in's factory; null without memory.
class ScratchTicket
{
public:
    ScratchTicket();
    ~ScratchTicket();
    ScratchTicket(ScratchTicket const&) = delete;
    ScratchTicket& operator=(ScratchTicket const&) = delete;

    explicit operator bool() const { return m_ticket != nullptr; }
    void* Address() const { return const_cast<STICKET_ACCESS*>(m_ticket); }  // as commands take it

    bool Put(char const* key, void* pointer) const;
    template <typename T>
    bool Get(char const* key, T& value) const
    {
        return m_ticket->SGETPARAMETER(m_ticket->Instance, key, GetParamType<T>(), &value, -1) != 0;
    }

private:
    STICKET_ACCESS const* m_ticket = nullptr;
};

// The plug-in's own words for what it has just refused on this thread; empty if it has none. UTF-8.
std::string TakeReason(ComGUIManager& manager);

// The failure of a call that the manager has made on this thread.
Error FailureOf(ComGUIManager& manager, int code, std::string about);
}  // namespace comgui::detail
