// The users of a site. What several owners do at the same time comes one after another, see UsersTurn.
#pragma once

#include "standin/server/store/SiteStore.h"
#include <optional>
#include <string>

namespace comgui_site
{
inline constexpr int Administrator = 16;
inline constexpr int Operator = 1;

// While it lives no other program like this one changes users, so that two that look first and write then
// cannot remove the last two administrators. Of a site that is open. Throws Trouble if another has the turn
// for long.
class UsersTurn
{
public:
    explicit UsersTurn(standin::SiteStore& store);

private:
    std::unique_ptr<standin::SiteStore::UsersTurn> m_turn;
};

struct NewUser
{
    std::string name;
    int role = Operator;
    std::optional<int> ticket{};  // the id of the user's own; nothing: a new one
};

// All of them throw Trouble, with nothing changed, for what cannot be done, and StoreError.

// For what is known before the password: name and ticket are good, and not taken.
void CheckNewUser(standin::Store& store, NewUser const& user);

// Makes the user's own ticket, too, if it is missing. The result is the user as made.
standin::User AddUser(standin::Store& store, NewUser const& user, std::string const& passwordHash);

// With the user's own ticket, unless another user has the same or it is to be kept. The result: whether a
// ticket was deleted.
bool RemoveUser(standin::Store& store, std::string const& name, bool keepTicket);

// Of the ticket, too, if that has the role.
void SetRole(standin::Store& store, std::string const& name, int role);

void SetPasswordHash(standin::Store& store, std::string const& name, std::string const& passwordHash);

standin::User MustBeUser(standin::Store& store, std::string const& name);
}  // namespace comgui_site
