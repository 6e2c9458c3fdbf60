// The seed of a site from any bytes. What is accepted is a site that can be opened: the system ticket, users
// with names, hashes and tickets of their own, nothing twice. It comes back from a seed that is written of
// it, and its changes are those of its tickets. What is refused is refused in one line.
#include "fuzz/TicketXmlOracle.h"
#include "standin/server/site/Seed.h"
#include <climits>
#include <set>

using namespace standin;

namespace
{
// As the value of an attribute.
std::string Escaped(std::string const& text)
{
    std::string escaped;
    for (char const byte : text)
        if (static_cast<unsigned char>(byte) < 0x20 ||
            std::string_view("<&\"").find(byte) != std::string_view::npos)
            escaped += "&#" + std::to_string(byte) + ";";
        else
            escaped += byte;
    return escaped;
}

std::string Written(Seed const& seed)
{
    std::string text = "<site version=\"1\"><users>";
    for (User const& user : seed.users)
        text += "<user name=\"" + Escaped(user.name) + "\" hash=\"" + Escaped(user.passwordHash) +
                "\" role=\"" + std::to_string(user.role) + "\" ticket=\"" + std::to_string(user.ticketId) +
                "\"/>";
    text += "</users>";
    for (TicketXml const& ticket : seed.tickets)
    {
        std::string const file = ticket.Text();
        text += file.substr(file.find("<ticket"));
    }
    return text + "</site>";
}

void MustBeASite(Seed const& seed)
{
    std::set<TicketAddress> addresses;
    for (TicketXml const& ticket : seed.tickets)
    {
        COMGUI_MUST(ticket.address && addresses.insert(*ticket.address).second);
        MustBeSound(ticket);
    }
    COMGUI_MUST(addresses.contains({0, 0}));
    std::set<std::string> names;
    for (User const& user : seed.users)
    {
        COMGUI_MUST(!user.name.empty() && names.insert(user.name).second);
        COMGUI_MUST(user.passwordHash.starts_with('$') && user.role >= 0);
        COMGUI_MUST(addresses.contains({17, user.ticketId}));
    }
}

bool AreSeedsEqual(Seed const& left, Seed const& right)
{
    auto const areUsersEqual = [](User const& one, User const& other)
    {
        return one.name == other.name && one.passwordHash == other.passwordHash && one.role == other.role &&
               one.ticketId == other.ticketId;
    };
    auto const areTicketsEqual = [](TicketXml const& one, TicketXml const& other)
    { return AreEqual(one, other); };
    return std::equal(left.users.begin(), left.users.end(), right.users.begin(), right.users.end(),
                      areUsersEqual) &&
           std::equal(left.tickets.begin(), left.tickets.end(), right.tickets.begin(), right.tickets.end(),
                      areTicketsEqual);
}

// The changes that make the site, put together to tickets again.
void MustMakeItsTickets(Seed const& seed)
{
    StoreContent const content = seed.Content();
    COMGUI_MUST(content.users.size() == seed.users.size() && content.tickets.size() == seed.tickets.size());
    for (std::size_t i = 0; i < seed.tickets.size(); ++i)
    {
        TicketChange const& made = content.tickets[i];
        COMGUI_MUST(made.kind == TicketChange::Create);
        TicketXml ticket;
        ticket.address = made.address;
        for (ParameterChange const& parameter : made.parameters)
            ticket.Put(parameter.key, parameter.pos, parameter.value.ToStored());
        COMGUI_MUST(AreEqual(ticket, seed.tickets[i]));
    }
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string_view const text(reinterpret_cast<char const*>(data), size);
    auto const seed =
        ReadUnlessRefused(text, [text](std::string const& name) { return Seed::Parse(text, name); });
    if (!seed)
        return 0;
    MustBeASite(*seed);
    MustMakeItsTickets(*seed);
    COMGUI_MUST(AreSeedsEqual(Seed::Parse(Written(*seed), "again.xml"), *seed));
    return 0;
}
