// A storage without a disk for tests of the server: plain maps, failures on demand, and a count of what was
// asked of it. It does not lock: the server promises to use it from one thread at a time, and the thread
// sanitizer watches that.
#pragma once

#include "standin/server/sessions/Password.h"
#include "standin/server/store/Storage.h"
#include <algorithm>
#include <map>

class MemoryStorage : public standin::Storage
{
public:
    using Address = standin::TicketAddress;
    struct Stored
    {
        standin::StoredValue value;
        std::string bytes;
    };
    using Values = std::map<std::pair<std::string, int>, Stored>;

    std::map<Address, Values> tickets;
    std::map<std::string, standin::User, std::less<>> users;
    bool fail = false;  // every operation
    int loads = 0;
    int transactions = 0;

    void AddUser(std::string const& name, std::string const& password, int role, int ticketId)
    {
        users[name] = {name, standin::Password::Hash(password), role, ticketId};
    }

    void Put(Address address, std::string_view key, int pos, standin::StoredValue const& value)
    {
        Stored& stored = tickets[address][{std::string(key), pos}];
        stored.value = value;
        stored.bytes = value.bytes;
    }

    std::vector<Address> Tickets() override
    {
        FailIfTold();
        std::vector<Address> addresses;
        for (auto const& [address, values] : tickets)
            addresses.push_back(address);
        return addresses;
    }

    std::vector<Address> TicketsWith(int type, std::string_view key) override
    {
        FailIfTold();
        std::vector<Address> addresses;
        for (auto const& [address, values] : tickets)
            if (address.type == type &&
                std::any_of(values.begin(), values.end(),
                            [key](auto const& entry) { return entry.first.first == key; }))
                addresses.push_back(address);
        return addresses;
    }

    void Load(Address address,
              std::function<void(std::string_view, int, standin::StoredValue const&)> const& take) override
    {
        FailIfTold();
        ++loads;
        for (auto const& [place, stored] : tickets[address])
        {
            standin::StoredValue value = stored.value;
            value.bytes = stored.bytes;
            take(place.first, place.second, value);
        }
    }

    void Apply(std::vector<standin::Change> const& changes) override
    {
        FailIfTold();
        ++transactions;
        for (standin::Change const& change : changes)
            Make(change);
    }

    std::optional<standin::User> FindUser(std::string_view name) override
    {
        FailIfTold();
        auto const found = users.find(name);
        return found == users.end() ? std::nullopt : std::optional(found->second);
    }

private:
    void FailIfTold() const
    {
        if (fail)
            throw standin::StorageError("site.db: told to fail: tell it not to");
    }

    void Make(standin::Change const& change)
    {
        std::string const key(change.key);
        switch (change.kind)
        {
        case standin::Change::CreateTicket:
            tickets[change.address];
            break;
        case standin::Change::DeleteTicket:
            tickets.erase(change.address);
            break;
        case standin::Change::DeleteKey:
            std::erase_if(tickets.at(change.address),
                          [&](auto const& entry) { return entry.first.first == key; });
            break;
        case standin::Change::DeleteValue:
            tickets.at(change.address).erase({key, change.pos});
            break;
        case standin::Change::PutValue:
            tickets.at(change.address).erase({key, change.pos});
            if (change.value.type != PARAM_POINTER)
                Put(change.address, key, change.pos, change.value);
            break;
        }
    }
};
