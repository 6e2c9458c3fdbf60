// The two connections of a SqliteStore, with their statements and transactions. For its own sources.
#pragma once

#include "standin/server/store/sqlite/Schema.h"
#include "standin/server/store/sqlite/SqliteStore.h"

namespace standin
{
struct SqliteStore::Writer
{
    Writer(std::filesystem::path const& file, bool mayMake) : database(file, mayMake) {}

    void Prepare()
    {
        lastSequence = database.Prepare(schema::SelectLastSequence);
        isAsPlannedOn = database.Prepare(
            "SELECT 1 FROM ticket WHERE type = ? AND id = ? AND incarnation = ? AND revision = ?");
        write = database.Prepare("UPDATE ticket SET revision = ?5 "
                                 "WHERE type = ?1 AND id = ?2 AND incarnation = ?3 AND revision = ?4");
        writeAndOwn = database.Prepare("UPDATE ticket SET revision = ?5, owner = ?6 "
                                       "WHERE type = ?1 AND id = ?2 AND incarnation = ?3 AND revision = ?4");
        create = database.Prepare("INSERT INTO ticket VALUES (?, ?, ?, ?, ?) ON CONFLICT DO NOTHING");
        remove = database.Prepare("DELETE FROM ticket WHERE type = ? AND id = ? AND incarnation = ? "
                                  "AND revision = ?");
        removeAny = database.Prepare("DELETE FROM ticket WHERE type = ? AND id = ? AND incarnation = ?");
        removeParameters = database.Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ?");
        largestId = database.Prepare("SELECT max(id) FROM ticket WHERE type = ?");
        ids = database.Prepare("SELECT id FROM ticket WHERE type = ? ORDER BY id");
        putParameter = database.Prepare("REPLACE INTO parameter VALUES (?, ?, ?, ?, ?, ?)");
        dropKey =
            database.Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ? AND key = ?");
        dropValue =
            database.Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ? AND key = ? "
                             "AND pos = ?");
        addRecord = database.Prepare("INSERT INTO journal VALUES (?, ?, ?, ?, ?, ?, ?)");
        putUser = database.Prepare("REPLACE INTO user VALUES (?, ?, ?, ?)");
    }

    Database database;
    Database::Statement lastSequence, isAsPlannedOn, write, writeAndOwn, create, remove, removeAny,
        removeParameters, largestId, ids, putParameter, dropKey, dropValue, addRecord, putUser;
    std::string record;  // the one that is being written
};

struct SqliteStore::Reader
{
    explicit Reader(std::filesystem::path const& file)
        : database(file, false), lastSequence(database.Prepare(schema::SelectLastSequence)),
          tickets(database.Prepare("SELECT type, id, incarnation, revision FROM ticket ORDER BY type, id")),
          ticket(database.Prepare("SELECT incarnation, revision FROM ticket WHERE type = ? AND id = ?")),
          parameters(database.Prepare("SELECT key, pos, value_type, value FROM parameter "
                                      "WHERE ticket_type = ? AND ticket_id = ? ORDER BY key, pos")),
          pruned(database.Prepare("SELECT value FROM site WHERE name = 'pruned'")),
          journal(database.Prepare("SELECT sequence, program, number, kind, type, id, record FROM journal "
                                   "WHERE sequence > ? ORDER BY sequence LIMIT ?")),
          findUser(database.Prepare("SELECT name, password_hash, role, ticket_id FROM user WHERE name = ?"))
    {
    }

    Database database;
    Database::Statement lastSequence, tickets, ticket, parameters, pruned, journal, findUser;
};

// A transaction of the writer in its turn, for who holds m_writing. Undone at its end unless committed.
class SqliteStore::Writing
{
public:
    explicit Writing(SqliteStore& store)
        : m_store(store), m_turn(*store.m_page, store.m_options.turnLimit),
          m_transaction(store.m_writer->database, Database::Transaction::Write)
    {
        if (m_turn.IsAfterFailure())
            store.m_page->RaiseCommitted(
                store.LastSequence(store.m_writer->database, store.m_writer->lastSequence));
    }

    // newest: the number of the change that this is, if it is one.
    void Commit(Sequence newest = 0)
    {
        m_transaction.Commit();
        m_store.m_page->RaiseCommitted(newest);
        m_turn.End();
        if (newest != 0)
            m_store.m_page->Ring(SharedPage::For::Others);
    }

    void Cancel()
    {
        m_transaction.RollBack();
        m_turn.End();
    }

private:
    SqliteStore& m_store;
    SharedPage::Turn m_turn;
    Database::Transaction m_transaction;
};

// A moment of the database, for who holds m_reading.
class SqliteStore::Reading
{
public:
    explicit Reading(SqliteStore& store)
        : m_transaction(store.m_reader->database, Database::Transaction::Read)
    {
    }

private:
    Database::Transaction m_transaction;
};
}  // namespace standin
