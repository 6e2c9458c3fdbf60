#include "fuzz/TicketXmlOracle.h"

#include "standin/server/tickets/OwnedTicket.h"
#include <algorithm>
#include <bit>
#include <climits>
#include <cmath>

using standin::TicketXml;

namespace
{
bool AreEqual(double left, double right)
{
    return std::isnan(left) ? std::isnan(right)
                            : std::bit_cast<std::uint64_t>(left) == std::bit_cast<std::uint64_t>(right);
}

void MustBeInRange(PLACED_VALUE const& value)
{
    COMGUI_MUST(!value.key.empty() && value.key.find('\0') == std::string::npos);
    COMGUI_MUST(value.pos >= 0 && value.pos <= 0xFFFFFF);
    switch (value.type)
    {
    case PARAM_INT:
        return COMGUI_MUST(value.integer >= INT_MIN && value.integer <= INT_MAX);
    case PARAM_UNSIGNED:
        return COMGUI_MUST(value.integer >= 0 && value.integer <= UINT_MAX);
    case PARAM_STRING:
        return COMGUI_MUST(value.bytes.find('\0') == std::string::npos);
    default:
        COMGUI_MUST(value.type == PARAM_DOUBLE || value.type == PARAM_BINSTRING ||
                    value.type == PARAM_INT64 || value.type == PARAM_UNSIGNED64);
    }
}
}  // namespace

bool operator==(PLACED_VALUE const& left, PLACED_VALUE const& right)
{
    return left.key == right.key && left.pos == right.pos && left.type == right.type &&
           left.integer == right.integer && AreEqual(left.number, right.number) && left.bytes == right.bytes;
}

std::vector<PLACED_VALUE> ValuesOf(TicketXml const& ticket)
{
    std::vector<PLACED_VALUE> values;
    ticket.Walk(
        [&values](std::string_view key, int pos, standin::StoredValue const& value)
        {
            values.push_back(
                {std::string(key), pos, value.type, value.integer, value.number, std::string(value.bytes)});
        });
    return values;
}

bool AreEqual(TicketXml const& left, TicketXml const& right)
{
    return left.address == right.address && ValuesOf(left) == ValuesOf(right);
}

void MustBeSound(TicketXml const& ticket)
{
    COMGUI_MUST(!ticket.address || (ticket.address->type >= 0 && ticket.address->type <= 99 &&
                                    ticket.address->id >= 0 && ticket.address->id <= 0xFFFFFF));
    for (PLACED_VALUE const& value : ValuesOf(ticket))
        MustBeInRange(value);
    std::string const text = ticket.Text();
    TicketXml const again = TicketXml::Parse(text, "again.xml");
    COMGUI_MUST(AreEqual(again, ticket));
    COMGUI_MUST(again.Text() == text);
    COMGUI_MUST(standin::OwnedTicket(ticket).Content().Text() == text);
}

void MustBeOneLine(std::string const& message, std::string const& name, std::string_view text)
{
    auto const isControl = [](unsigned char byte) { return byte < 0x20 || byte == 0x7F; };
    COMGUI_MUST(std::none_of(message.begin(), message.end(), isControl));
    COMGUI_MUST(message.starts_with(name + ":"));
    std::string const behind = message.substr(name.size() + 1);
    auto const digits = behind.find_first_not_of("0123456789");
    COMGUI_MUST(digits != 0 && digits < 9 && behind.compare(digits, 2, ": ") == 0);
    COMGUI_MUST(behind.size() > digits + 2);
    int const line = std::stoi(behind.substr(0, digits));
    COMGUI_MUST(line >= 1 && line <= 1 + std::count(text.begin(), text.end(), '\n'));
}
