#include "desk/model/TicketName.h"

#include <charconv>

namespace desk
{
namespace
{
constexpr int LargestId = 16'777'215;

std::optional<int> NumberFromText(std::string_view text, int largest)
{
    int number = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    bool const isWhole = error == std::errc() && end == text.data() + text.size();
    return isWhole && number >= 0 && number <= largest ? std::optional(number) : std::nullopt;
}

std::string_view Trimmed(std::string_view text)
{
    while (!text.empty() && text.front() == ' ')
        text.remove_prefix(1);
    while (!text.empty() && text.back() == ' ')
        text.remove_suffix(1);
    return text;
}
}  // namespace

std::optional<comgui::TicketAddress> TicketFromText(std::string_view text, int type)
{
    text = Trimmed(text);
    auto const slash = text.find('/');
    auto const named = slash == text.npos ? std::optional(type)
                                          : NumberFromText(text.substr(0, slash), comgui::TicketTypes - 1);
    auto const id = NumberFromText(slash == text.npos ? text : text.substr(slash + 1), LargestId);
    return named && id ? std::optional(comgui::TicketAddress{*named, *id}) : std::nullopt;
}
}  // namespace desk
