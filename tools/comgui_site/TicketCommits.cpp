#include "tools/comgui_site/TicketCommits.h"

#include "standin/server/site/SiteFolders.h"
#include "standin/server/store/Outcome.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/words.h"
#include <map>

namespace comgui_site
{
using standin::CommitOutcome;
using standin::ParameterChange;
using standin::StoredValue;
using standin::TicketAddress;
using standin::TicketChange;
using standin::TicketValue;
using standin::TicketXml;

namespace
{
constexpr std::string_view InstallFolderKey = "System/InstallFolder";  // the server's own business

using Values = std::map<std::string, std::map<int, StoredValue>, std::less<>>;

// bytes point into the ticket.
Values ValuesOf(TicketXml const& ticket)
{
    Values values;
    ticket.Walk([&](std::string_view key, int pos, StoredValue const& value)
                { values[std::string(key)].emplace(pos, value); });
    return values;
}

bool HasOthersThan0(std::map<int, StoredValue> const& values) { return values.rbegin()->first > 0; }

// What turns the values of one key into others.
void AddChanges(std::vector<ParameterChange>& changes, std::string const& key,
                std::map<int, StoredValue> const& before, std::map<int, StoredValue> const& after)
{
    bool const isSingle = after.size() == 1 && after.begin()->first == 0;
    if (isSingle && (before.empty() || HasOthersThan0(before)))
    {
        TicketValue value = TicketValue::FromStored(after.at(0));
        changes.push_back({key, -1, std::move(value), !before.empty()});
        return;
    }
    for (auto const& [pos, value] : before)
        if (!after.contains(pos))
            changes.push_back({key, pos, {}, true});
    for (auto const& [pos, value] : after)
    {
        auto const old = before.find(pos);
        if (old == before.end() || !IsSame(old->second, value))
            changes.push_back({key, pos, TicketValue::FromStored(value), true});
    }
}

std::vector<ParameterChange> ChangesBetween(Values const& before, Values const& after,
                                            TicketCommits::Mode mode)
{
    std::vector<ParameterChange> changes;
    if (mode == TicketCommits::Mode::Replace)
        for (auto const& [key, values] : before)
            if (!after.contains(key))
                changes.push_back({key, -1, {}, HasOthersThan0(values)});
    for (auto const& [key, values] : after)
    {
        auto const old = before.find(key);
        AddChanges(changes, key, old == before.end() ? std::map<int, StoredValue>() : old->second, values);
    }
    return changes;
}

// The folders of the system ticket must stay such that clients come to an end when they read them.
void CheckFolders(Values const& before, std::vector<ParameterChange> const& changes)
{
    standin::FolderSettings settings;
    for (auto const& [key, values] : before)
        if (values.contains(0))
            settings.Put(key, values.at(0));
    for (ParameterChange const& change : changes)
        if (change.pos <= 0 && standin::FolderSettings::Concern(change.key, 0))
            settings.Put(change.key, change.value.ToStored());
    auto const faults = standin::FaultsOf(settings);
    if (!faults.empty())
        throw Trouble(
            "clients could not read the folders any more: " + std::string(faults[0].key) +
            " begins with a variable that is not resolved; give it an absolute path, or the variable "
            "of a folder that stands above it");
}
}  // namespace

std::optional<LoadedTicket> Load(standin::Store& store, TicketAddress address)
{
    LoadedTicket ticket;
    ticket.values.address = address;
    auto const loaded = store.Load(address, [&](std::string_view key, int pos, StoredValue const& value)
                                   { ticket.values.Put(key, pos, value); });
    if (!loaded)
        return std::nullopt;
    ticket.state = loaded->state;
    return ticket;
}

TicketCommits::Done TicketCommits::Bring(TicketAddress address, TicketXml const& wanted, Mode mode)
{
    for (;;)
    {
        auto const found = Load(m_store, address);
        Values const before = found ? ValuesOf(found->values) : Values();
        Values after = ValuesOf(wanted);
        if (address == standin::SystemTicket)
        {
            after.erase(std::string(InstallFolderKey));
            if (auto const own = before.find(InstallFolderKey); own != before.end())
                after.insert(*own);
        }
        TicketChange change;
        change.kind = found ? TicketChange::Write : TicketChange::Create;
        change.address = address;
        change.parameters = ChangesBetween(before, after, mode);
        if (found)
        {
            change.incarnation = found->state.incarnation;
            change.revision = found->state.revision;
        }
        if (found && change.parameters.empty())
            return {};
        if (address == standin::SystemTicket)
            CheckFolders(before, change.parameters);
        std::size_t const count = change.parameters.size();
        if (Commit(change))
            return {found ? Done::Changed : Done::Created, count};
    }
}

TicketAddress TicketCommits::CreateNext(int type, TicketXml const& values)
{
    TicketChange change;
    change.kind = TicketChange::Create;
    change.address = {type, TicketChange::NextId};
    change.parameters = ChangesBetween({}, ValuesOf(values), Mode::Merge);
    for (;;)
        if (auto const outcome = Commit(change))
            return outcome->address;
}

bool TicketCommits::Delete(TicketAddress address)
{
    for (;;)
    {
        auto const found = Load(m_store, address);
        if (!found)
            return false;
        TicketChange change;
        change.kind = TicketChange::Delete;
        change.address = address;
        change.incarnation = found->state.incarnation;
        if (Commit(change))
            return true;
    }
}

std::optional<CommitOutcome> TicketCommits::Commit(TicketChange const& change)
{
    std::uint64_t const number = ++m_number;
    CommitOutcome outcome = m_store.Commit(change, number);
    if (outcome.kind == CommitOutcome::Unknown)
        outcome = standin::AwaitOutcome(m_store, number, change.address)
                      .value_or(CommitOutcome{CommitOutcome::Conflict});
    if (outcome.kind == CommitOutcome::NoFreeId)
        throw Trouble("no id is free among the tickets of type " + std::to_string(change.address.type) +
                      "; delete some, then try again");
    return outcome.kind == CommitOutcome::Committed ? std::optional(outcome) : std::nullopt;
}
}  // namespace comgui_site
