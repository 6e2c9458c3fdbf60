// What every store promises, as one suite that each engine passes with two handles on one site. An engine's
// test instantiates it:
//
//     INSTANTIATE_TEST_SUITE_P(Memory, StoreContract, testing::Values(STORE_ENGINE{...}));
#pragma once

#include "standin/server/store/Store.h"
#include "standin/server/store/StoreContent.h"
#include "standin/server/store/StoreLimits.h"
#include "tests/store/Changes.h"
#include <functional>
#include <gtest/gtest.h>
#include <map>
#include <memory>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

// One site of an engine, empty at first and gone with the object.
class StoreSite
{
public:
    virtual ~StoreSite() = default;

    // A handle more, which counts as a program of its own. One that is destroyed without Leave is a dead
    // program.
    virtual std::unique_ptr<standin::Store> Open() = 0;
};

struct STORE_ENGINE
{
    char const* name;
    std::unique_ptr<StoreSite> (*makeSite)(standin::StoreLimits const& limits);

    // Committed() follows other programs when the engine's bell rings, and not at once.
    bool hearsByBell = false;

    friend void PrintTo(STORE_ENGINE const& engine, std::ostream* out) { *out << engine.name; }
};

// A value that owns its bytes; compared bit by bit.
struct KEPT_VALUE
{
    KEPT_VALUE(standin::StoredValue const& from) : value(from), bytes(from.bytes) { value.bytes = {}; }
    standin::StoredValue View() const
    {
        standin::StoredValue view = value;
        view.bytes = bytes;
        return view;
    }
    bool operator==(KEPT_VALUE const& other) const { return SameValue(View(), other.View()); }
    friend void PrintTo(KEPT_VALUE const& kept, std::ostream* out)
    {
        *out << "type " << kept.value.type << ": " << kept.value.integer << kept.value.number << kept.bytes;
    }

    standin::StoredValue value;
    std::string bytes;
};
using StoreValues = std::map<std::pair<std::string, int>, KEPT_VALUE>;

inline standin::StoreContent NoContent() { return {}; }

inline standin::StoreContent OneTicket(standin::TicketAddress address, char const* key, int value)
{
    standin::StoreContent content;
    content.tickets.push_back(Creation(address).Put(key, 0, value));
    return content;
}

// what() of the StoreError that the action throws; empty if it throws none.
std::string ReasonOf(std::function<void()> const& action);

StoreValues ValuesOf(standin::Store& store, standin::TicketAddress address);

// Nothing if there is no such ticket.
std::optional<standin::TicketState> StateOf(standin::Store& store, standin::TicketAddress address);
std::vector<standin::TicketAddress> AddressesIn(standin::Store& store);

// All that the journal has behind that change.
std::vector<standin::CommittedChange> FeedOf(standin::Store& store, standin::Sequence after);

// Makes changes as a writer does: on what holds, under numbers of its own. They have to succeed.
class Writer
{
public:
    explicit Writer(standin::Store& store) : m_store(store) {}

    standin::CommitOutcome Try(standin::TicketChange const& change);
    standin::CommitOutcome Do(standin::TicketChange const& change);
    standin::CommitOutcome Make(standin::TicketAddress address) { return Do(Creation(address)); }
    standin::CommitOutcome Put(standin::TicketAddress address, std::string_view key, int pos,
                               standin::StoredValue const& value);
    standin::CommitOutcome Put(standin::TicketAddress address, std::string_view key, int pos, int value);
    standin::CommitOutcome Drop(standin::TicketAddress address, std::string_view key, int pos);
    standin::CommitOutcome Remove(standin::TicketAddress address);
    standin::TicketState State(standin::TicketAddress address);
    std::uint64_t LastNumber() const { return m_number; }

private:
    standin::Store& m_store;
    std::uint64_t m_number = 0;
};

class StoreContract : public testing::TestWithParam<STORE_ENGINE>
{
protected:
    static constexpr standin::TicketAddress Job{3, 1};
    static constexpr standin::TicketAddress OtherJob{3, 2};
    static constexpr standin::TicketAddress Printer{7, 1};

    StoreContract() { UseLimits({}); }

    // Begins anew with a site of those limits.
    void UseLimits(standin::StoreLimits const& limits);

    // Expects that the handle knows of that change, which another one has committed.
    void ExpectHeard(standin::Store& listener, standin::Sequence committed) const;

    std::unique_ptr<StoreSite> site;
    std::unique_ptr<standin::Store> store;  // two programs
    std::unique_ptr<standin::Store> other;
    std::unique_ptr<Writer> writer;  // to store and other
    std::unique_ptr<Writer> otherWriter;
};
