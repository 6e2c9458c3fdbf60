// What the targets that read tickets from XML share: the values of a ticket as a plain list, what holds for
// each of them, and the ticket written and read again.
#pragma once

#include "fuzz/fuzz.h"
#include "standin/server/tickets/TicketXml.h"
#include <optional>
#include <string>
#include <string_view>
#include <vector>

struct PLACED_VALUE
{
    std::string key;
    int pos;
    PARAM_TYPE type;
    long long integer;
    double number;
    std::string bytes;

    // Numbers by their bits; but of a NaN only that it is one.
    friend bool operator==(PLACED_VALUE const& left, PLACED_VALUE const& right);
};

std::vector<PLACED_VALUE> ValuesOf(standin::TicketXml const& ticket);

bool AreEqual(standin::TicketXml const& left, standin::TicketXml const& right);

// A ticket of which the file was accepted: address, keys, positions and values are such as a ticket can have;
// what is written of it reads as the same ticket and is written the same again, also by way of a ticket in
// memory.
void MustBeSound(standin::TicketXml const& ticket);

// "NAME:LINE: reason" on one line, with a line that the text has.
void MustBeOneLine(std::string const& message, std::string const& name, std::string_view text);

// What read(name) makes of the text; nothing if it refuses the text in the way it should.
template <typename Read>
auto ReadUnlessRefused(std::string_view text, Read const& read)
    -> std::optional<decltype(read(std::string()))>
{
    std::string const name = "input.xml";
    try
    {
        return read(name);
    }
    catch (standin::XmlError const& error)
    {
        MustBeOneLine(error.what(), name, text);
        return std::nullopt;
    }
}
