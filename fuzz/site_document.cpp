// What comgui_site imports, from any bytes as a file. What is accepted has tickets within their limits, each
// with an address, in ascending order, none twice; and the seed's reader, which is another one, finds the
// same tickets in a document that it takes.
#include "fuzz/TicketXmlOracle.h"
#include "standin/server/site/Seed.h"
#include "tests/server/MemoryFolder.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/import.h"
#include <algorithm>
#include <fstream>

using namespace standin;

namespace
{
using TICKETS = std::vector<TicketXml>;

std::string FileWith(std::string_view text)
{
    static MemoryFolder const folder;
    return folder.Write("input.xml", text).string();
}

std::optional<TICKETS> Imported(std::string_view text)
{
    std::string const file = FileWith(text);
    try
    {
        return comgui_site::ReadTickets({file});
    }
    catch (XmlError const& error)
    {
        MustBeOneLine(error.what(), file, text);
    }
    catch (comgui_site::Trouble const& trouble)  // a ticket that comes twice
    {
        std::string const line = trouble.what();
        COMGUI_MUST(!line.empty() && line.find('\n') == std::string::npos);
    }
    return std::nullopt;
}

bool IsBefore(TicketXml const& left, TicketXml const& right) { return *left.address < *right.address; }
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string_view const text(reinterpret_cast<char const*>(data), size);
    auto const tickets = Imported(text);
    if (tickets)
        for (TicketXml const& ticket : *tickets)
            MustBeSound(ticket);
    bool const isAscending =
        !tickets || std::is_sorted(tickets->begin(), tickets->end(),
                                   [](auto& left, auto& right) { return !IsBefore(right, left); });
    COMGUI_MUST(isAscending);
    auto seed = ReadUnlessRefused(text, [text](std::string const& name) { return Seed::Parse(text, name); });
    if (!seed)
        return 0;
    if (!tickets)
    {
        COMGUI_MUST(text.find("<users") != std::string_view::npos);  // which nobody imports
        return 0;
    }
    std::sort(seed->tickets.begin(), seed->tickets.end(), IsBefore);
    COMGUI_MUST(std::equal(seed->tickets.begin(), seed->tickets.end(), tickets->begin(), tickets->end(),
                           [](TicketXml const& one, TicketXml const& other)
                           { return AreEqual(one, other); }));
    return 0;
}
