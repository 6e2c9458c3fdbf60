// The XML of tickets, both ways. Any bytes as a file: what is accepted is within the limits of tickets and
// comes back when it is written; what is refused is refused in one line. Any values: they come back from the
// file that is written of them, and equal a plain map.
#include "fuzz/TicketXmlOracle.h"
#include <bit>
#include <map>

using namespace standin;

namespace
{
using MODEL = std::map<std::pair<std::string, int>, PLACED_VALUE>;

PLACED_VALUE NextValue(INPUT& input)
{
    constexpr PARAM_TYPE types[] = {PARAM_INT,        PARAM_DOUBLE, PARAM_STRING,
                                    PARAM_BINSTRING,  PARAM_INT64,  PARAM_UNSIGNED,
                                    PARAM_UNSIGNED64, PARAM_NONE,   PARAM_POINTER};
    PLACED_VALUE value{"k" + input.Text(input.Among(8)), 0, types[input.Among(9)], 0, 0, {}};
    if (input.Among(2) == 1)
        value.pos = static_cast<int>(input.Take<std::uint32_t>() & 0xFFFFFF) >> input.Among(24);
    switch (value.type)
    {
    case PARAM_INT:
        value.integer = input.Take<int>();
        break;
    case PARAM_UNSIGNED:
        value.integer = input.Take<unsigned>();
        break;
    case PARAM_DOUBLE:
        value.number = input.Take<double>();
        break;
    case PARAM_STRING:
        value.bytes = input.Text(input.Among(40));
        break;
    case PARAM_BINSTRING:
        value.bytes = input.Bytes(input.Among(40));
        break;
    default:
        value.integer = input.Take<long long>();
    }
    return value;
}

void Put(TicketXml& ticket, MODEL& model, PLACED_VALUE const& value)
{
    StoredValue stored;
    stored.type = value.type;
    stored.integer = value.integer;
    stored.number = value.number;
    stored.bytes = value.bytes;
    ticket.Put(value.key, value.pos, stored);
    if (value.type == PARAM_NONE || value.type == PARAM_POINTER)
        model.erase({value.key, value.pos});
    else
        model.insert_or_assign({value.key, value.pos}, value);
}

void AsValues(INPUT input)
{
    TicketXml ticket;
    MODEL model;
    if (input.Among(2) == 1)
        ticket.address = {static_cast<int>(input.Among(100)),
                          static_cast<int>(input.Take<std::uint32_t>() & 0xFFFFFF)};
    while (!input.IsEmpty() && model.size() < 50)
        Put(ticket, model, NextValue(input));
    std::vector<PLACED_VALUE> expected;
    for (auto const& [place, value] : model)
        expected.push_back(value);
    COMGUI_MUST(ValuesOf(ticket) == expected);
    MustBeSound(ticket);
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string_view const text(reinterpret_cast<char const*>(data), size);
    auto const ticket =
        ReadUnlessRefused(text, [text](std::string const& name) { return TicketXml::Parse(text, name); });
    if (ticket)
        MustBeSound(*ticket);
    AsValues({data, size});
    return 0;
}
