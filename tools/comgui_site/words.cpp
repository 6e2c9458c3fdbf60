#include "tools/comgui_site/words.h"

#include "standin/server/tickets/TicketXmlReader.h"
#include "standin/server/tickets/TicketXmlText.h"
#include "tools/shared/text.h"
#include <array>
#include <charconv>
#include <cmath>
#include <ctime>

namespace comgui_site
{
using standin::StoredValue;
using standin::TicketAddress;

namespace
{
// The bytes at the beginning that make it not plain; 0 if it begins with a plain character. Not empty.
std::size_t ForbiddenAtTheBeginning(std::string_view text)
{
    auto const first = static_cast<unsigned char>(text[0]);
    if (first < 0x20 || first == 0x7F)
        return 1;
    if (first < 0x80)
        return 0;
    if (first == 0xC2 && text.size() > 1 && static_cast<unsigned char>(text[1]) < 0xA0)
        return static_cast<unsigned char>(text[1]) >= 0x80 ? 2 : 1;
    std::size_t const size = first >= 0xF0 ? 4 : first >= 0xE0 ? 3 : 2;
    bool const isCharacter =
        text.size() >= size && standin::FirstForbiddenInXml(text.substr(0, size)) == std::string_view::npos;
    return isCharacter ? 0 : 1;
}

std::size_t SizeOfCharacter(char first)
{
    auto const byte = static_cast<unsigned char>(first);
    return byte >= 0xF0 ? 4 : byte >= 0xE0 ? 3 : byte >= 0xC0 ? 2 : 1;
}

std::optional<int> NumberOf(std::string_view text, int largest)
{
    int number = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    bool const isNumber = error == std::errc() && end == text.data() + text.size() && text[0] != '-';
    return isNumber && number <= largest ? std::optional(number) : std::nullopt;
}
}  // namespace

bool IsPlain(std::string_view text)
{
    while (!text.empty())
    {
        if (ForbiddenAtTheBeginning(text) > 0)
            return false;
        text.remove_prefix(SizeOfCharacter(text[0]));
    }
    return true;
}

std::string Cleaned(std::string_view text)
{
    std::string cleaned;
    while (!text.empty())
    {
        std::size_t const forbidden = ForbiddenAtTheBeginning(text);
        for (std::size_t i = 0; i < forbidden; ++i)
            cleaned += "\\x" + tools::Hex(text.substr(i, 1));
        std::size_t const taken = forbidden > 0 ? forbidden : SizeOfCharacter(text[0]);
        if (forbidden == 0)
            cleaned += text.substr(0, taken);
        text.remove_prefix(taken);
    }
    return cleaned;
}

std::string TextOf(TicketAddress address)
{
    return std::to_string(address.type) + "/" + std::to_string(address.id);
}

char const* NameOfType(int type)
{
    switch (type)
    {
    case 0:
        return "system";
    case 2:
        return "devices";
    case 3:
        return "jobs";
    case 7:
        return "queues";
    case 12:
        return "papers";
    case 17:
        return "users";
    default:
        return "";
    }
}

std::string TimeText(long long secondsSince1970)
{
    auto const seconds = static_cast<std::time_t>(secondsSince1970);
    std::tm local = {};
    localtime_r(&seconds, &local);
    char text[64];
    return {text, std::strftime(text, sizeof text, "%Y-%m-%d %H:%M:%S", &local)};
}

std::string SizeText(unsigned long long bytes)
{
    constexpr std::array Units{"kB", "MB", "GB", "TB"};
    if (bytes < 1000)
        return Counted(bytes, "byte");
    auto size = static_cast<double>(bytes) / 1000;
    std::size_t unit = 0;
    for (; size >= 999.95 && unit + 1 < Units.size(); ++unit)
        size /= 1000;
    char text[32];
    int const length = std::snprintf(text, sizeof text, "%.1f %s", size, Units[unit]);
    return {text, static_cast<std::size_t>(length)};
}

std::string Counted(std::size_t number, char const* noun)
{
    return std::to_string(number) + " " + noun + (number == 1 ? "" : "s");
}

std::optional<TicketChoice> ChoiceOf(std::string_view text)
{
    auto const slash = text.find('/');
    if (text.empty() || slash == 0 || slash + 1 == text.size())
        return std::nullopt;
    auto const type = NumberOf(text.substr(0, slash), 99);
    if (!type || slash == std::string_view::npos)
        return type ? std::optional(TicketChoice{*type}) : std::nullopt;
    auto const id = NumberOf(text.substr(slash + 1), standin::LargestId);
    return id ? std::optional(TicketChoice{*type, id}) : std::nullopt;
}

std::string ShownKey(std::string_view key)
{
    bool const isClear =
        IsPlain(key) && !key.empty() && key.find_first_of(" \"=,[]") == std::string_view::npos;
    return isClear ? std::string(key) : tools::Shown(key);
}

std::string ShownValue(StoredValue const& value, std::size_t limit)
{
    switch (value.type)
    {
    case PARAM_INT:
    case PARAM_INT64:
    case PARAM_UNSIGNED:
        return std::to_string(value.integer);
    case PARAM_UNSIGNED64:
        return std::to_string(static_cast<unsigned long long>(value.integer));
    case PARAM_DOUBLE:
        return std::isfinite(value.number) ? tools::NumberText(value.number) : std::to_string(value.number);
    case PARAM_STRING:
        return tools::Shown(value.bytes, limit);
    case PARAM_BINSTRING:
        return tools::ShownBytes(value.bytes, limit);
    default:
        return "none";
    }
}

void AddValue(Json& object, StoredValue const& value)
{
    char const* const type = standin::XmlNameOf(value.type);
    object["type"] = type ? type : "none";
    switch (value.type)
    {
    case PARAM_INT:
    case PARAM_INT64:
    case PARAM_UNSIGNED:
        object["value"] = value.integer;
        break;
    case PARAM_UNSIGNED64:
        object["value"] = static_cast<unsigned long long>(value.integer);
        break;
    case PARAM_DOUBLE:
        object["value"] = std::isfinite(value.number) ? Json(value.number) : Json(ShownValue(value));
        break;
    case PARAM_STRING:
        if (tools::Quoted(value.bytes))
            object["value"] = value.bytes;
        else
            object["hex"] = tools::Hex(value.bytes);
        break;
    case PARAM_BINSTRING:
        object["hex"] = tools::Hex(value.bytes);
        break;
    default:
        break;
    }
}

Json JsonOf(std::string_view text) { return tools::Quoted(text) ? Json(text) : Json(Cleaned(text)); }

std::string LineOf(Json const& json) { return json.dump(-1, ' ', true) + '\n'; }

std::string LinesOf(Json const& json) { return json.dump(2, ' ', true) + '\n'; }
}  // namespace comgui_site
