#include "desk/model/TicketTitle.h"

#include "comgui/client/TicketAddress.h"

namespace desk
{
namespace
{
bool IsInsideCharacter(char byte) { return (static_cast<unsigned char>(byte) & 0xC0) == 0x80; }

// Bytes that are no UTF-8 may lie inside for ever, so no more is given up than one character can have.
void CutTo(std::size_t size, std::string& text)
{
    if (text.size() <= size)
        return;
    std::size_t end = size;
    while (end > size - 3 && IsInsideCharacter(text[end]))
        --end;
    text.resize(IsInsideCharacter(text[end]) ? size : end);
}
}  // namespace

char const* TitleKeyOf(int type)
{
    switch (type)
    {
    case comgui::SystemTickets:
        return "System/Name";
    case comgui::DeviceTickets:
        return "Device/Name";
    case comgui::JobTickets:
        return "Job/Identification/Name";
    case comgui::QueueTickets:
        return "Queue/Name";
    case comgui::PaperTickets:
        return "Paper/Name";
    case comgui::UserTickets:
        return "User/Name";
    default:
        return nullptr;
    }
}

std::optional<std::string> TitleOf(comgui::Value const& value)
{
    std::string title = comgui::ToText(value);
    CutTo(LongestTitle, title);
    return title.empty() ? std::nullopt : std::optional(std::move(title));
}
}  // namespace desk
