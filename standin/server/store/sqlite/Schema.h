// The tables of a site's database, version 2: made, checked, and brought up from version 1.
#pragma once

#include "standin/server/store/sqlite/Database.h"
#include "standin/server/tickets/StoredValue.h"
#include <optional>

namespace standin::schema
{
// The number of the newest change, of which the journal may know no more.
inline constexpr char SelectLastSequence[] = "SELECT max(coalesce((SELECT max(sequence) FROM journal), 0), "
                                             "(SELECT value FROM site WHERE name = 'pruned'))";

// Whether nothing has been made in the file yet. Also true for what a process leaves behind that is killed
// before its first commit.
bool IsNew(Database& database);

// Throws DamagedStore for a database of another program, StoreError for one of a newer version.
void CheckMarks(Database& database);

// Whether every table and column is there. Throws DamagedStore.
void CheckTables(Database& database);

// Every page and the order of the rows, which takes about a second for 300 MB. A flipped bit inside a value
// goes unseen. Throws DamagedStore.
void CheckPages(Database& database, bool hasJournal);

// For who has the site alone, in a transaction of theirs.
void Make(Database& database);
bool IsOfVersion1(Database& database);

// All tickets begin with change number 1, and prepared jobs belong to a dead program, so that they are buried
// with it: nobody else knows any more who has prepared them.
void Upgrade(Database& database);

// A value from a row that has value_type and value in two columns from that one on, checked: a database can
// be edited by hand. Nothing, or damage, if they do not fit. Bytes live until the next step.
std::optional<StoredValue> FittingValueOf(Database::Run const& row, int column);
StoredValue ValueOf(Database const& database, Database::Run const& row, int column);
}  // namespace standin::schema
