#include "tools/comgui_site/users.h"

#include "standin/server/sessions/TicketService.h"
#include "tools/comgui_site/TicketCommits.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/words.h"
#include <algorithm>

namespace comgui_site
{
using standin::Store;
using standin::StoredValue;
using standin::TicketAddress;
using standin::TicketXml;
using standin::User;
using standin::UserTicketType;

namespace
{
constexpr char RoleKey[] = "User/Role";
constexpr std::size_t LongestName = 127;  // bytes; the record of a login has room for so many

std::string Shown(std::string const& name) { return "\"" + Cleaned(name) + "\""; }

void CheckName(std::string const& name)
{
    if (name.empty())
        throw Trouble("the name of a user is empty; give one");
    if (!IsPlain(name))
        throw Trouble("the name of a user has control characters or is not UTF-8: " + Shown(name) +
                      "; choose another");
    if (name.front() == ' ' || name.back() == ' ')
        throw Trouble("the name of a user begins or ends with a space: " + Shown(name) + "; choose another");
    if (name.size() > LongestName)
        throw Trouble("the name of a user has more than 127 bytes: " + Shown(name) +
                      "; choose a shorter one");
}

std::optional<User> OwnerOf(Store& store, int ticket)
{
    auto const users = store.Users();
    auto const found =
        std::find_if(users.begin(), users.end(), [&](User const& user) { return user.ticketId == ticket; });
    return found == users.end() ? std::nullopt : std::optional(*found);
}

void MustNotBeTheLast(Store& store, User const& user, char const* deed)
{
    auto const users = store.Users();
    bool const hasOther = std::any_of(users.begin(), users.end(),
                                      [&](User const& other)
                                      { return other.role == Administrator && other.name != user.name; });
    if (user.role == Administrator && !hasOther)
        throw Trouble(Shown(user.name) + " is the last administrator and cannot be " + deed +
                      "; make another user one first: users role NAME 16");
}

TicketXml OwnTicketOf(NewUser const& user)
{
    TicketXml ticket;
    StoredValue name;
    name.type = PARAM_STRING;
    name.bytes = user.name;
    ticket.Put("User/Name", 0, name);
    StoredValue role;
    role.type = PARAM_INT;
    role.integer = user.role;
    ticket.Put(RoleKey, 0, role);
    return ticket;
}
}  // namespace

UsersTurn::UsersTurn(standin::SiteStore& store) : m_turn(store.TakeUsersTurn(std::chrono::seconds(10)))
{
    if (!m_turn)
        throw Trouble("another comgui_site has been changing users all the time; end it, then try again");
}

User MustBeUser(Store& store, std::string const& name)
{
    if (auto const user = store.FindUser(name))
        return *user;
    throw Trouble("no user has the name " + Shown(name) + "; users lists those there are");
}

void CheckNewUser(Store& store, NewUser const& user)
{
    CheckName(user.name);
    if (store.FindUser(user.name))
        throw Trouble("there is a user " + Shown(user.name) +
                      " already; choose another name, or use passwd or users role");
    if (!user.ticket)
        return;
    if (auto const owner = OwnerOf(store, *user.ticket))
        throw Trouble("the ticket 17/" + std::to_string(*user.ticket) + " is " + Shown(owner->name) +
                      "'s own; choose another id, or leave it out to get a new one");
}

User AddUser(Store& store, NewUser const& user, std::string const& passwordHash)
{
    CheckNewUser(store, user);
    TicketCommits commits(store);
    User made{user.name, passwordHash, user.role, user.ticket.value_or(0)};
    bool const isMissing = !user.ticket || !Load(store, {UserTicketType, *user.ticket});
    if (isMissing && user.ticket)
        commits.Bring({UserTicketType, *user.ticket}, OwnTicketOf(user), TicketCommits::Mode::Merge);
    else if (isMissing)
        made.ticketId = commits.CreateNext(UserTicketType, OwnTicketOf(user)).id;
    try
    {
        store.PutUser(made);
    }
    catch (standin::UnknownOutcome const&)
    {
        throw;  // the user may be there, and then needs the ticket
    }
    catch (standin::StoreError const&)
    {
        if (isMissing)
            commits.Delete({UserTicketType, made.ticketId});
        throw;
    }
    return made;
}

bool RemoveUser(Store& store, std::string const& name, bool keepTicket)
{
    User const user = MustBeUser(store, name);
    MustNotBeTheLast(store, user, "removed");
    store.RemoveUser(name);
    if (keepTicket || OwnerOf(store, user.ticketId))
        return false;
    return TicketCommits(store).Delete({UserTicketType, user.ticketId});
}

void SetRole(Store& store, std::string const& name, int role)
{
    User user = MustBeUser(store, name);
    if (role != Administrator)
        MustNotBeTheLast(store, user, "given another role");
    user.role = role;
    store.PutUser(user);
    TicketAddress const own{UserTicketType, user.ticketId};
    auto const ticket = Load(store, own);
    TicketXml wanted;
    if (ticket)
        ticket->values.Walk(
            [&](std::string_view key, int, StoredValue value)
            {
                if (key != RoleKey || value.type != PARAM_INT)
                    return;
                value.integer = role;
                wanted.Put(key, 0, value);
            });
    if (ticket)
        TicketCommits(store).Bring(own, wanted, TicketCommits::Mode::Merge);
}

void SetPasswordHash(Store& store, std::string const& name, std::string const& passwordHash)
{
    User user = MustBeUser(store, name);
    user.passwordHash = passwordHash;
    store.PutUser(user);
}
}  // namespace comgui_site
