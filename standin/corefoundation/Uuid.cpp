#include "standin/corefoundation/Uuid.h"

namespace
{
// The value of one hexadecimal digit, -1 for any other character.
int DigitValue(char digit)
{
    if (digit >= '0' && digit <= '9')
        return digit - '0';
    if (digit >= 'A' && digit <= 'F')
        return digit - 'A' + 10;
    if (digit >= 'a' && digit <= 'f')
        return digit - 'a' + 10;
    return -1;
}
}  // namespace

namespace comgui::detail
{
std::optional<Uuid> ParseUuid(std::string_view text)
{
    constexpr std::string_view form = "xxxxxxxx-xxxx-xxxx-xxxx-xxxxxxxxxxxx";
    if (text.size() != form.size())
        return std::nullopt;
    Uuid uuid{};
    std::size_t digits = 0;
    for (std::size_t at = 0; at < form.size(); ++at)
    {
        if (form[at] == '-')
        {
            if (text[at] != '-')
                return std::nullopt;
            continue;
        }
        int const value = DigitValue(text[at]);
        if (value < 0)
            return std::nullopt;
        UInt8& byte = uuid[digits++ / 2];
        byte = static_cast<UInt8>(byte << 4 | value);
    }
    return uuid;
}
}  // namespace comgui::detail
