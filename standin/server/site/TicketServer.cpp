#include "standin/server/site/TicketServer.h"

#include "standin/server/jobs/JobFolder.h"
#include "standin/server/jobs/JobIntake.h"
#include "standin/server/sessions/Password.h"
#include "standin/server/tickets/TicketWrites.h"
#include "standin/server/transfer/TransferService.h"
#include <cstdio>
#include <shared_mutex>

namespace standin
{
namespace
{
void Report(char const* line) { std::fprintf(stderr, "%s\n", line); }

// What the steps will have changed, one for one; the keys are filled in where they have. Made before the
// change, so that nothing can fail after it.
ChangedParameters NewsOf(TicketWrites& writes)
{
    ChangedParameters news;
    news.reserve(writes.Steps().size());
    for (TicketWrites::Step const& step : writes.Steps())
    {
        bool const isOfTheKey =
            step.kind == TicketWrites::Step::StartAnew || step.kind == TicketWrites::Step::EraseKey;
        news.push_back({nullptr, isOfTheKey ? -1 : step.pos, TicketValue::FromStored(step.value.ToStored())});
    }
    return news;
}
}  // namespace

TicketServer::TicketServer(Storage& storage, std::function<void()> systemTicketChanged)
    : m_storage(storage), m_systemTicketChanged(std::move(systemTicketChanged)),
      m_transfers(std::make_unique<TransferService>(*this)), m_jobs(std::make_unique<JobIntake>(*this))
{
    auto const addresses = m_storage.Tickets();
    m_tickets.reserve(addresses.size());
    for (TicketAddress const address : addresses)
    {
        if (!IsValid(address))
            continue;  // no slot can name it
        m_tickets[address].birth = ++m_newestBirth;
        auto& ids = m_ids[static_cast<std::size_t>(address.type)];
        ids.insert(ids.end(), address.id);
    }
}

TicketServer::~TicketServer() = default;

std::shared_ptr<Session> TicketServer::Login(std::string const& user, std::string const& password)
{
    std::optional<User> known;
    {
        std::lock_guard const lock(m_change);
        known = m_storage.FindUser(user);
    }
    // Slow by intent, so nothing is locked meanwhile; and as slow for a user who does not exist.
    if (!known)
    {
        Password::VerifyNobody(password);
        return nullptr;
    }
    if (!Password::Verify(password, known->passwordHash))
        return nullptr;
    return std::make_shared<Session>(m_sessions.Open(), std::move(*known));
}

bool TicketServer::Logout(Session& session)
{
    if (!session.End())
        return false;
    m_transfers->End(session);
    m_jobs->End(session);
    m_notifications.Remove(session);
    m_sessions.Close(session.Number());
    return true;
}

TicketServer::ServedTicket* TicketServer::Find(TicketAddress address, Birth birth)
{
    auto const found = m_tickets.find(address);
    bool const isIt = found != m_tickets.end() && (birth == AnyBirth || birth == found->second.birth);
    return isIt ? &found->second : nullptr;
}

bool TicketServer::Get(Session const& session, TicketAddress address, char const* key, PARAM_TYPE type,
                       void* value, int pos, Birth birth)
{
    if (session.Ended() || !key)
        return false;
    auto const limit = session.LimitOf(address);
    return (!limit || limit->Selects(key)) && Read(address, birth, key, type, value, pos);
}

std::optional<int> TicketServer::Int(TicketAddress address, char const* key)
{
    int value = 0;
    return Read(address, AnyBirth, key, PARAM_INT, &value, -1) ? std::optional(value) : std::nullopt;
}

bool TicketServer::Read(TicketAddress address, Birth birth, std::string_view key, PARAM_TYPE type,
                        void* value, int pos)
{
    for (;;)
    {
        {
            std::shared_lock const lock(m_memory);
            Ticket const* const ticket = Find(address, birth);
            if (!ticket)
                return false;
            if (ticket->loaded)
            {
                KeyValues const* const values = ticket->Find(m_keys.Find(key));
                return values && ReadValue(*values, type, value, pos);
            }
        }
        std::lock_guard const lock(m_change);
        if (!Loaded(address, birth))
            return false;
    }
}

bool TicketServer::GetTable(Session const& session, TicketAddress address, GETMULTIPAR* table, Birth birth)
{
    if (!table)
        return false;
    for (GETMULTIPAR* record = table; record->key; ++record)
        record->ok = Get(session, address, record->key, record->type, record->value, record->pos, birth);
    return !session.Ended();
}

Ticket* TicketServer::Loaded(TicketAddress address, Birth birth)
{
    Ticket* const ticket = Find(address, birth);
    if (!ticket || ticket->loaded)
        return ticket;
    std::vector<std::pair<std::string, KeyValues>> keys;
    TicketTexts none;  // positions are new: nothing is taken out
    try
    {
        m_storage.Load(address,
                       [&](std::string_view key, int pos, StoredValue const& value)
                       {
                           if (keys.empty() || keys.back().first != key)
                               keys.emplace_back(key, KeyValues());
                           keys.back().second.Put(pos, TicketValue::FromStored(value), none);
                       });
    }
    catch (StorageError const& error)
    {
        Report(error.what());
        return nullptr;
    }
    std::lock_guard const lock(m_memory);
    ticket->keys.reserve(keys.size());
    for (auto& [key, values] : keys)
        ticket->keys.insert_or_assign(m_keys.Intern(key), std::move(values));
    ticket->loaded = true;
    return ticket;
}

bool TicketServer::MayWrite(Session const& session, TicketAddress address)
{
    if (session.Ended())
        return false;
    if (address.type == SystemTicket.type)
        return session.IsAdministrator();
    if (address.type == UserTicketType)
        return session.IsAdministrator() || address.id == session.Who().ticketId;
    return true;
}

bool TicketServer::Set(Session const& session, TicketAddress address, char const* key, PARAM_TYPE type,
                       void const* value, int pos, Birth birth)
{
    SETMULTIPAR table[2] = {};
    table[0].key = key;
    table[0].type = type;
    table[0].value = value;
    table[0].pos = pos;
    return SetTable(session, address, table, birth) &&
           table[0].ok;  // a null key ends the table: ok stays false
}

bool TicketServer::SetTable(Session const& session, TicketAddress address, SETMULTIPAR* table, Birth birth)
{
    if (!table)
        return false;
    for (SETMULTIPAR* record = table; record->key; ++record)
        record->ok = false;
    if (!MayWrite(session, address))
        return false;

    auto const limit = session.LimitOf(address);
    std::lock_guard const lock(m_change);
    Ticket* const ticket = Loaded(address, birth);
    if (!ticket)
        return false;
    return WriteHere(address, *ticket, table, limit.get());
}

bool TicketServer::WriteHere(TicketAddress address, Ticket& ticket, SETMULTIPAR* table,
                             KeyFilter const* limit)
{
    std::optional<FolderSettings> folders;
    if (address == SystemTicket)
        folders = FoldersHere();
    TicketWrites writes(address, ticket, m_keys, table, limit, folders ? &*folders : nullptr);
    ChangedParameters news;
    if (m_notifications.AreWanted(address))
        news = NewsOf(writes);
    if (!Store(writes.Changes()))
        return false;
    CarryOut(ticket, writes, news);
    if (!writes.Steps().empty())
        Changed(address);
    m_notifications.Post(ParametersChanged, address, std::move(news));
    return true;
}

FolderSettings TicketServer::FoldersHere()
{
    FolderSettings settings;
    Ticket const* const ticket = Loaded(SystemTicket);
    auto const take = [&](char const* key)
    {
        KeyValues const* const values = ticket->Find(m_keys.Find(key));
        if (TicketValue const* const value = values ? values->At(0) : nullptr)
            settings.Put(key, value->ToStored());
    };
    if (!ticket)
        return settings;
    take(UseFolderVariablesKey);
    for (FolderRow const row : FolderRows)
        take(row.key);
    return settings;
}

// Empty if the ticket tells of none.
std::string TicketServer::JobMarkHere(TicketAddress job)
{
    Ticket const* const ticket = Loaded(job);
    KeyValues const* const values = ticket ? ticket->Find(m_keys.Find(JobMarkKey)) : nullptr;
    TicketValue const* const value = values ? values->At(0) : nullptr;
    return value && value->type == PARAM_STRING ? std::string(value->ToStored().bytes) : std::string();
}

FolderTable TicketServer::Folders()
{
    std::lock_guard const lock(m_change);
    return FolderTable(FoldersHere().values);
}

std::optional<TicketServer::MadeTicket> TicketServer::Make(int type, SETMULTIPAR* table)
{
    std::lock_guard const lock(m_change);
    TicketAddress const address{type, NextId(type)};
    Ticket const nothing;
    TicketWrites writes(address, nothing, m_keys, table);
    std::vector<Change> changes{Change{Change::CreateTicket, address}};
    changes.insert(changes.end(), writes.Changes().begin(), writes.Changes().end());
    ChangedParameters news;
    if (m_notifications.AreWanted(address))
        news = NewsOf(writes);
    if (!IsValid(address) || !Store(changes))
        return std::nullopt;
    ServedTicket& ticket = Insert(address);
    CarryOut(ticket, writes, news);
    m_notifications.Post(TicketCreated, address);
    m_notifications.Post(ParametersChanged, address, std::move(news));
    return MadeTicket{address, ticket.birth};
}

bool TicketServer::Write(MadeTicket const& ticket, SETMULTIPAR* table)
{
    std::lock_guard const lock(m_change);
    Ticket* const found = Loaded(ticket.address, ticket.birth);
    if (!found || !WriteHere(ticket.address, *found, table, nullptr))
        return false;
    for (SETMULTIPAR const* record = table; record->key; ++record)
        if (!record->ok)
            return false;
    return true;
}

bool TicketServer::WhileItLasts(MadeTicket const& ticket,
                                std::function<void(FolderTable const& folders)> const& work)
{
    std::lock_guard const lock(m_change);
    if (!Find(ticket.address, ticket.birth))
        return false;
    work(FolderTable(FoldersHere().values));
    return true;
}

bool TicketServer::Remove(MadeTicket const& ticket)
{
    std::lock_guard const lock(m_change);
    return Find(ticket.address, ticket.birth) && RemoveHere(ticket.address);
}

bool TicketServer::Store(std::vector<Change> const& changes)
{
    if (changes.empty())
        return true;
    try
    {
        m_storage.Apply(changes);
        return true;
    }
    catch (StorageError const& error)
    {
        Report(error.what());
        return false;
    }
}

void TicketServer::CarryOut(Ticket& ticket, TicketWrites& writes, ChangedParameters& news)
{
    TicketTexts removed;
    for (std::size_t i = 0; i < writes.Steps().size(); ++i)
    {
        TicketWrites::Step& step = writes.Steps()[i];
        std::lock_guard const lock(m_memory);
        bool const changed = TicketWrites::CarryOut(step, ticket, m_keys, removed);
        if (changed && !news.empty())
            news[i].key = m_keys.Find(step.record->key);
    }
    m_sessions.Retire(std::move(removed));
}

void TicketServer::Changed(TicketAddress address)
{
    if (address != SystemTicket)
        return;
    m_systemTicketChanges.fetch_add(1, std::memory_order_release);
    if (!m_systemTicketChanged)
        return;
    try
    {
        m_systemTicketChanged();
    }
    catch (std::exception const& error)
    {
        Report(error.what());  // the change itself is safe
    }
}

Birth TicketServer::BirthOf(TicketAddress address) const
{
    std::shared_lock const lock(m_memory);
    auto const found = m_tickets.find(address);
    return found == m_tickets.end() ? NoBirth : found->second.birth;
}

int TicketServer::NextTicket(int type, int after) const
{
    if (!IsValid({type, 0}))
        return -1;
    std::shared_lock const lock(m_memory);
    auto const& ids = m_ids[static_cast<std::size_t>(type)];
    auto const next = ids.upper_bound(after);
    return next == ids.end() ? -1 : *next;
}

bool TicketServer::Create(Session const& session, TicketAddress address)
{
    if (!IsValid(address) || !MayWrite(session, address))
        return false;
    std::lock_guard const lock(m_change);
    return CreateHere(address);
}

int TicketServer::CreateNext(Session const& session, int type)
{
    if (!IsValid({type, 0}))
        return -1;
    std::lock_guard const lock(m_change);
    int const id = NextId(type);
    return IsValid({type, id}) && MayWrite(session, {type, id}) && CreateHere({type, id}) ? id : -1;
}

int TicketServer::NextId(int type) const
{
    auto const& ids = m_ids[static_cast<std::size_t>(type)];
    int id = ids.empty() ? 1 : *ids.rbegin() + 1;
    if (id > LargestId)
        for (id = 0; ids.contains(id);)
            ++id;
    return id;
}

bool TicketServer::CreateHere(TicketAddress address)
{
    if (Find(address) || !Store({Change{Change::CreateTicket, address}}))
        return false;
    Insert(address);
    m_notifications.Post(TicketCreated, address);
    return true;
}

TicketServer::ServedTicket& TicketServer::Insert(TicketAddress address)
{
    std::lock_guard const memory(m_memory);
    m_ids[static_cast<std::size_t>(address.type)].insert(address.id);
    ServedTicket& ticket = m_tickets[address];
    ticket.loaded = true;
    ticket.birth = ++m_newestBirth;
    return ticket;
}

bool TicketServer::Delete(Session const& session, TicketAddress address)
{
    if (address.type == SystemTicket.type || !MayWrite(session, address))
        return false;
    if (address.type == UserTicketType && !session.IsAdministrator())
        return false;  // a user's ticket goes with the user, and that is not the user's to decide
    std::lock_guard const lock(m_change);
    return RemoveHere(address);
}

bool TicketServer::RemoveHere(TicketAddress address)
{
    if (!Find(address))
        return false;
    bool const isJob = address.type == JobTicketType;
    std::string const mark = isJob ? JobMarkHere(address) : std::string();
    if (!Store({Change{Change::DeleteTicket, address}}))
        return false;
    decltype(m_tickets)::node_type ticket;
    {
        std::lock_guard const memory(m_memory);
        m_ids[static_cast<std::size_t>(address.type)].erase(address.id);
        ticket = m_tickets.extract(address);
    }
    TicketTexts removed;  // nobody finds the ticket any more, so this needs no lock
    for (auto& [key, values] : ticket.mapped().keys)
        values.Clear(removed);
    m_sessions.Retire(std::move(removed));
    if (isJob)  // before the next job may get the id, and with it the folder
        RemoveJobFolder(FolderTable(FoldersHere().values), address.id, mark);
    m_notifications.Post(TicketDeleted, address);
    return true;
}

bool TicketServer::Visit(Session const& session, TicketAddress address, Take const& take)
{
    if (session.Ended())
        return false;
    std::lock_guard const lock(m_change);  // nobody writes meanwhile, so readers need not be kept waiting
    Ticket const* const ticket = Loaded(address);
    if (!ticket)
        return false;
    auto const limit = session.LimitOf(address);
    for (Key const key : ticket->SortedKeys())
        for (KeyValues::Entry const& value : ticket->Find(key)->Entries())
            if (!limit || limit->Selects(*key))
                take(*key, value.pos, value.value.ToStored());
    return true;
}

std::optional<std::vector<WalkedValue>> TicketServer::Values(Session const& session, TicketAddress address,
                                                             std::string_view prefix, Birth birth)
{
    if (session.Ended())
        return std::nullopt;
    auto const limit = session.LimitOf(address);
    std::lock_guard const lock(m_change);
    Ticket const* const ticket = Loaded(address, birth);
    if (!ticket)
        return std::nullopt;
    std::vector<WalkedValue> values;
    for (Key const key : ticket->SortedKeys(prefix))
        for (KeyValues::Entry const& entry : ticket->Find(key)->Entries())
            if (!limit || limit->Selects(*key))
            {
                TicketText* const text = entry.value.text.get();
                if (text)
                    text->handedOut.store(true, std::memory_order_relaxed);
                values.push_back({key, entry.pos, entry.value.type, entry.value.word, text});
            }
    return values;
}
}  // namespace standin
