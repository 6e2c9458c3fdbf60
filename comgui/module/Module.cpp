#include "comgui/module/Module.h"

#include "comgui/module/Ticket.h"

namespace comgui::plugin
{
namespace
{
constexpr std::uint32_t LoopbackAddress = 0x7F000001;
}

std::uint32_t Module::LocalAddress(std::string_view, int) { return LoopbackAddress; }

int Module::Initialize(TLogin&) { return Done; }

int Module::Uninitialize(TLogin&) { return Done; }

std::unique_ptr<TicketSlots> Module::MakeTicket() { return std::make_unique<MemoryTicket>(); }

std::unique_ptr<TicketSlots> Module::OpenTicket(std::string_view) { return nullptr; }

bool Module::CloseTicket(TicketSlots&) { return true; }

int Module::Command(Session* session, char const* name, int size, void* data)
{
    if (!session)
        return UnknownSession;
    return name ? session->Command(name, size, data) : int{InvalidArgument};
}
}  // namespace comgui::plugin
