// The tables and functions of a site in a PostgreSQL database: made, checked, and brought up from version to
// version.
#pragma once

#include "standin/server/store/postgres/Connection.h"
#include <functional>

namespace standin::postgres
{
// What commit_change answers.
enum class CommitAnswer : int
{
    Committed = 0,
    Conflict = 1,
    NoFreeId = 2,
};

// What an error says behind the name of the database if another program has that right all the time.
inline constexpr char const* BeingOpened =
    ": another program is opening or replacing the site; wait until that "
    "is done, then try again";

// Keeps every other program from opening the site in that schema, and from coming back to it, until the
// connection goes. False if one has been doing so all the time.
bool KeepFromOpening(Connection& connection, std::string const& schema, Clock::time_point deadline);

// Makes the schema if there is none, or it is empty, and fills it then, and brings an older one up to this
// version: one program at a time, each step in one transaction. Throws StoreError, and changes nothing, if
// the schema is somebody else's or of a newer version. What fill throws passes through, and the site stays
// new. Begins registering.
void OpenSchema(Connection& connection, std::string const& schema, std::function<void()> const& fill,
                Clock::time_point deadline);

// Until the end of it, nobody replaces the site. False, and it has not begun, if somebody is about to.
bool BeginRegistering(Connection& connection, std::string const& schema, Clock::time_point deadline);
void EndRegistering(Connection& connection, std::string const& schema, Clock::time_point deadline);
}  // namespace standin::postgres
