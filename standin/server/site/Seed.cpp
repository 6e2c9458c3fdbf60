#include "standin/server/site/Seed.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/tickets/TicketXmlReader.h"
#include <algorithm>
#include <climits>

namespace standin
{
namespace
{
User ReadUser(TicketXmlReader const& reader, pugi::xml_node node)
{
    if (node.name() != std::string_view("user"))
        reader.Fail(node, std::string("unknown element <") + node.name() + ">");
    reader.ExpectAttributes(node, {"name", "role", "ticket", "hash"});
    reader.ExpectNothingIn(node);
    User user{reader.Attribute(node, "name"), reader.Attribute(node, "hash"),
              reader.Number(node, "role", INT_MAX), reader.Number(node, "ticket", 0xFFFFFF)};
    if (user.name.empty())
        reader.Fail(node, "a user without a name");
    if (!user.passwordHash.starts_with('$'))
        reader.Fail(node, "the hash of " + user.name + " is none that crypt(3) makes");
    return user;
}

void AddUsers(Seed& seed, TicketXmlReader const& reader, pugi::xml_node node)
{
    reader.ExpectAttributes(node, {});
    for (pugi::xml_node const child : reader.Elements(node))
    {
        User const user = ReadUser(reader, child);
        if (std::any_of(seed.users.begin(), seed.users.end(),
                        [&user](User const& other) { return other.name == user.name; }))
            reader.Fail(child, "the user " + user.name + " stands twice");
        seed.users.push_back(user);
    }
}

bool HasTicket(Seed const& seed, TicketAddress address)
{
    return std::any_of(seed.tickets.begin(), seed.tickets.end(),
                       [address](TicketXml const& ticket) { return ticket.address == address; });
}

void AddTicket(Seed& seed, TicketXmlReader const& reader, pugi::xml_node node)
{
    TicketXml ticket = reader.Ticket(node);
    if (!ticket.address)
        reader.Fail(node, "a ticket of a site needs type and id");
    if (HasTicket(seed, *ticket.address))
        reader.Fail(node, "the ticket " + std::to_string(ticket.address->type) + "/" +
                              std::to_string(ticket.address->id) + " stands twice");
    seed.tickets.push_back(std::move(ticket));
}
}  // namespace

Seed Seed::Read(std::filesystem::path const& file)
{
    return Parse(ReadFile(file, TicketXml::SizeLimit + 1), file.string());
}

Seed Seed::Parse(std::string_view text, std::string const& name)
{
    TicketXmlReader const reader(text, name);
    pugi::xml_node const root = reader.Root("site");
    reader.ExpectAttributes(root, {"version"});
    Seed seed;
    for (pugi::xml_node const child : reader.Elements(root))
    {
        if (child.name() == std::string_view("users"))
            AddUsers(seed, reader, child);
        else if (child.name() == std::string_view("ticket"))
            AddTicket(seed, reader, child);
        else
            reader.Fail(child, std::string("unknown element <") + child.name() + ">");
    }
    if (!HasTicket(seed, SystemTicket))
        reader.Fail(root, "the system ticket 0/0 is missing");
    for (User const& user : seed.users)
        if (!HasTicket(seed, {UserTicketType, user.ticketId}))
            reader.Fail(root, "the user " + user.name + " has no ticket 17/" + std::to_string(user.ticketId));
    return seed;
}

StoreContent Seed::Content() const
{
    StoreContent content;
    content.users = users;
    for (TicketXml const& ticket : tickets)
    {
        TicketChange& made = content.tickets.emplace_back();
        made.kind = TicketChange::Create;
        made.address = *ticket.address;
        ticket.Walk(
            [&made](std::string_view key, int pos, StoredValue const& value) {
                made.parameters.push_back({std::string(key), pos, TicketValue::FromStored(value), false});
            });
    }
    return content;
}
}  // namespace standin
