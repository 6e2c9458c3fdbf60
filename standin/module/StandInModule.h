// The plug-in as a whole, over the sites of this process. What it answers stands in ModuleCodes.h.
#pragma once

#include "comgui/module/Module.h"
#include "standin/module/HostCalls.h"

namespace standin
{
class StandInModule : public HostCalls<comgui::plugin::Module>
{
public:
    int IsAlive(std::string_view host, int port) override;
    int Initialize(TLogin& record) override;
    comgui::plugin::LoggedIn LogIn(comgui::plugin::Credentials const& credentials) override;

    // Null for a file that is not there, of which nothing is said: clients ask for files that may be missing
    // as a matter of course. Null with a line on stderr for one that cannot be read.
    std::unique_ptr<comgui::plugin::TicketSlots> OpenTicket(std::string_view path) override;
    std::unique_ptr<comgui::plugin::TicketSlots> MakeTicket() override;

    // Saves it. One that cannot be saved is a line on stderr, and gone as well.
    bool CloseTicket(comgui::plugin::TicketSlots& ticket) override;

    // "local.get.reason", without a session too, puts the string "Reason/Text" into the STICKET_ACCESS const*
    // that is its data: RefusableCall::TakeReason. Without a reason the key is deleted.
    int Command(comgui::plugin::Session* session, char const* name, int size, void* data) override;
};
}  // namespace standin
