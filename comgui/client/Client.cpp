#include "comgui/client/Client.h"

#include "comgui/client/TransferPool.h"
#include "comgui/foundation/stracpy.h"
#include "comgui/session/TCommandRecord.h"
#include <algorithm>
#include <cstdlib>
#include <system_error>

namespace comgui::detail
{
namespace
{
constexpr int Stamp = 20261122;  // the kit's mark of its sessions; the plug-in only carries it
constexpr int NotReachable = -2005;
constexpr std::chrono::seconds LookInterval(1);

template <std::size_t Size>
void Assign(char (&field)[Size], std::string const& text)
{
    stracpy(field, text.c_str(), Size);
}

std::string NameOf(Server const& server) { return server.host + ":" + std::to_string(server.port); }

Outcome Check(Server const& server)
{
    if (server.host.empty() || server.port < 1 || server.port > 65535)
        return Error{BadServer, NameOf(server), {}};
    if (server.host.size() >= sizeof TLogin::szServerHost)
        return Error{TooLong, server.host, {}};
    return {};
}

Outcome Check(Account const& account)
{
    if (account.user.size() >= sizeof TLogin::szUser)
        return Error{TooLong, account.user, {}};
    if (account.password.size() >= sizeof TLogin::szPassword)
        return Error{TooLong, {}, {}};
    return {};
}

TLogin* NewRecord()
{
    auto* const record = static_cast<TLogin*>(std::calloc(1, sizeof(TLogin)));
    if (!record)
        throw std::bad_alloc();
    record->nSize = sizeof(TLogin);
    record->iGUINotificationID = -1;
    return record;
}

// Whether the server answers this session.
Outcome Ask(ComGUIManager& manager, TLogin& record)
{
    char command[] = "remote.system.isalive";
    TCommandRecord question{};
    question.nMagic = static_cast<unsigned int>(manager.GetEndian());
    question.nSize = sizeof question;
    question.iArgB = 1;
    question.iResult = -1;
    std::string const server = NameOf({record.szServerHost, record.iServerPort});
    if (int const code = manager.SendCommand(&record, command, sizeof question, &question); code != 0)
        return FailureOf(manager, code, server);
    return question.iResult >= 0 ? Outcome() : Outcome(Error{ServerAway, server, {}});
}
}  // namespace

void Client::FREE::operator()(TLogin* record) const { std::free(record); }

std::shared_ptr<Client> Client::Make()
{
    std::shared_ptr<Client> client(new Client);
    client->m_pool = std::make_shared<TransferPool>(
        [weak = std::weak_ptr<Client>(client)]
        {
            auto const owner = weak.lock();
            return owner && owner->IsLoggedIn();
        },
        [weak = std::weak_ptr<Client>(client)]
        {
            auto const owner = weak.lock();
            return owner ? owner->RecordWithPassword() : std::nullopt;
        },
        [weak = std::weak_ptr<EventHub>(client->m_hub)](Event const& event)
        {
            if (auto const hub = weak.lock())
                hub->Publish(event);
        });
    return client;
}

Client::~Client() = default;

Outcome Client::FindPlugIn()
{
    auto const found = m_helper.With([](ComGUIManager&) { return true; });
    return found ? Outcome() : found.GetError();
}

Outcome Client::Test(Server const& server)
{
    if (Outcome checked = Check(server); !checked)
        return checked;
    auto const answer = m_tester.With(
        [&server](ComGUIManager& manager)
        {
            TLogin record{};
            record.nSize = sizeof record;
            Assign(record.szServerHost, server.host);
            record.iServerPort = server.port;
            return manager.IsAlive(&record) == 0 ? Outcome()
                                                 : Outcome(FailureOf(manager, ServerAway, NameOf(server)));
        });
    return answer ? *answer : answer.GetError();
}

Result<User> Client::LogIn(Server const& server, Account const& account)
{
    if (Outcome const checked = Check(server); !checked)
        return checked.GetError();
    if (Outcome const checked = Check(account); !checked)
        return checked.GetError();
    // The end of a session waits for its handlers, and they may log out: so not in one hold of the lock with
    // the login, and another thread may have logged in between.
    std::unique_lock lifecycle(m_lifecycle);
    while (IsLoggedIn())
    {
        lifecycle.unlock();
        (void)LogOut();
        lifecycle.lock();
    }
    {
        std::lock_guard const watching(m_watching);
        m_isWatchOver = false;
    }
    std::unique_lock lock(m_calls);
    if (Outcome const prepared = Prepare(server); !prepared)
        return prepared.GetError();
    Assign(m_record->szUser, account.user);
    Assign(m_record->szPassword, account.password);
    if (Outcome const entered = Enter(*m_manager); !entered)
    {
        ForgetPassword(*m_record);
        return entered.GetError();
    }
    User const user{
        m_record->szUser, {UserTickets, m_record->iClientStamp}, m_manager->IsCurrentUserAdmin(m_record)};
    lock.unlock();

    m_switch.Await(m_switch.Ask(), SwitchPatience);
    m_entry = {};
    m_switching = {};
    try
    {
        m_watch = std::thread([this] { Watch(); });
    }
    catch (std::system_error const&)
    {
        m_container = nullptr;
        Leave();
        return Error{OutOfMemory, {}, {}};
    }
    return user;
}

// A manager and a record for that server. Those of a login that was refused there are good for the next one:
// with them, the local port stays.
Outcome Client::Prepare(Server const& server)
{
    if (!m_manager || server.host != m_record->szServerHost || server.port != m_record->iServerPort)
    {
        auto opened = OpenManager();
        if (!opened)
            return opened.GetError();
        m_record = nullptr;
        m_manager = *std::move(opened);
        m_ownRecord.reset(NewRecord());
        m_record = m_ownRecord.get();
        Assign(m_record->szServerHost, server.host);
        m_record->iServerPort = server.port;
    }
    if (m_manager->IsAlive(m_record) != 0)
        return FailureOf(*m_manager, ServerAway, NameOf(server));
    if (int const code = m_manager->Initialize(m_record, Stamp); code != 0)
        return FailureOf(*m_manager, code, NameOf(server));
    return {};
}

// Logs in with what the record holds. Without success there is no new session: ender ends it.
Outcome Client::Enter(ComGUIManager& ender)
{
    (void)m_ownRecord.release();  // the manager's from here on, whatever comes
    if (int const code = m_manager->Login(m_record); code != 0)
        return FailureOf(*m_manager, code, m_record->szUser);
    MTICKET_ACCESS const* const container = m_manager->GetClientContainer();
    Outcome outcome = container ? Outcome() : Outcome(Error{NoContainer, m_record->szUser, {}});
    if (outcome && IsWatchOver())
        outcome = Error{Cancelled, m_record->szUser, {}};
    if (outcome)
        outcome = Register();
    if (!outcome)
    {
        m_hub->EndSession();
        ender.Logout(m_record);
        return outcome;
    }
    m_switch.BeginSession(container, m_record->iGUINotificationID);
    m_container = container;
    m_isServerThere = true;
    std::lock_guard const copying(m_copying);
    m_copy = *m_record;
    return {};
}

// Has the plug-in call the hub.
Outcome Client::Register()
{
    void* const token = m_hub->BeginSession();
    ScratchTicket const ticket;
    char command[] = "local.set.callback";
    int id = -1;
    if (!ticket)
        return Error{OutOfMemory, {}, {}};
    if (!ticket.Put("pGUI2Notification", reinterpret_cast<void*>(EventHub::GetCallback())) ||
        !ticket.Put("pUser", token))
        return Error{BadAnswer, command, {}};
    if (int const code = m_manager->SendCommand(m_record, command, 0, ticket.Address()); code != 0)
        return FailureOf(*m_manager, CallbackRefused, {});
    if (!ticket.Get("iGUINotificationID", id))
        return Error{CallbackRefused, {}, {}};
    m_record->iGUINotificationID = id;
    return {};
}

Outcome Client::LogOut()
{
    {
        std::lock_guard const lifecycle(m_lifecycle);
        if (!m_container.exchange(nullptr))
            return Error{NotLoggedIn, {}, {}};
        m_pool->CancelAll();
        StopWatching();
        m_isServerThere = false;
        Leave();
    }
    m_pool->WaitForAll();
    m_hub->WaitForHandlers();
    return {};
}

void Client::Leave()
{
    std::lock_guard const lock(m_calls);
    m_switch.EndSession();
    m_hub->LeaveServer();
    m_manager->Logout(m_record);
    m_container = nullptr;  // the watch may have logged in anew in the middle of a logout
    m_record->iGUINotificationID = -1;
    ForgetPassword(*m_record);
    std::lock_guard const copying(m_copying);
    if (m_copy)
        ForgetPassword(*m_copy);
    m_copy.reset();
}

void Client::End()
{
    (void)LogOut();
    m_switch.Stop();
    m_pool->Stop();
    m_hub->Stop();
}

std::string Client::LocalEndPoint() const
{
    auto const record = Record();
    return record ? record->szLocalEndPoint : std::string();
}

std::optional<TLogin> Client::Record() const
{
    auto record = RecordWithPassword();
    if (record)
        ForgetPassword(*record);
    return record;
}

std::optional<TLogin> Client::RecordWithPassword() const
{
    std::lock_guard const lock(m_copying);
    return IsLoggedIn() ? m_copy : std::nullopt;
}

namespace
{
// The size may grow between the question and the answer.
Result<std::string> XmlOf(ComGUIManager& manager, TLogin& record, TicketAddress ticket)
{
    constexpr int Xml = 0;
    constexpr int BufferTooSmall = 110;
    std::string const name = std::to_string(ticket.type) + "/" + std::to_string(ticket.id);
    std::string data;
    for (int tries = 0, size = 0; tries < 8; ++tries)
    {
        int const code = manager.GetTicketData(&record, ticket.type, ticket.id, Xml, &size, data.data());
        bool const isTooSmall = code == BufferTooSmall && size > static_cast<int>(data.size());
        if (code != 0 && !isTooSmall)
            return FailureOf(manager, code, name);
        if (size < 0 || (code == 0 && size > static_cast<int>(data.size())))
            return Error{BadAnswer, name, {}};
        data.resize(static_cast<std::size_t>(size));
        if (code == 0)
            return data;
    }
    return Error{BadAnswer, name, {}};
}
}  // namespace

// With a manager of its own: the plug-in may take long, and neither the watch nor a logout waits for it.
Result<std::string> Client::TicketData(TicketAddress ticket)
{
    auto record = Record();
    if (!record)
        return Error{NotLoggedIn, {}, {}};
    auto data = m_writer.With([&](ComGUIManager& manager) { return XmlOf(manager, *record, ticket); });
    if (!data)
        return data.GetError();
    if (!*data && !IsLoggedIn())
        return Error{NotLoggedIn, {}, {}};
    return *std::move(data);
}

Error Client::Failure(int code, std::string about)
{
    auto const reason = m_helper.With([](ComGUIManager& manager) { return TakeReason(manager); });
    return {code, std::move(about), reason ? *reason : std::string()};
}

Client::SUBSCRIBED Client::Subscribe(Interest interest, Executor executor, Subscription::Handler handler,
                                     std::chrono::milliseconds interval)
{
    m_switch.Start();  // first, since it may throw
    auto subscriber = m_hub->Add(std::move(interest), std::move(executor), std::move(handler), interval);
    subscriber->onEnd = [weak = weak_from_this()]
    {
        if (auto const client = weak.lock())
            client->m_switch.Ask();
    };
    return {std::move(subscriber), m_switch.Ask()};
}

void Client::StopWatching()
{
    {
        std::lock_guard const lock(m_watching);
        m_isWatchOver = true;
        m_watchEnds.notify_all();
    }
    m_switch.Interrupt();
    if (m_watch.joinable())
        m_watch.join();
}

bool Client::IsWatchOver() const
{
    std::lock_guard const lock(m_watching);
    return m_isWatchOver;
}

// Once a second, on a thread and with a manager of its own: an answer may take long.
void Client::Watch()
{
    std::unique_lock lock(m_watching);
    while (!m_watchEnds.wait_for(lock, LookInterval, [this] { return m_isWatchOver; }))
    {
        lock.unlock();
        (void)m_watcher.With(
            [this](ComGUIManager& watcher)
            {
                Look(watcher);
                return true;
            });
        lock.lock();
    }
}

// The end of the watch waits for one call of the plug-in at most: hence the many questions.
void Client::Look(ComGUIManager& watcher)
{
    auto record = Record();
    if (!record)
        return;
    bool const isThere = m_isServerThere;
    Outcome const answer = Ask(watcher, *record);
    if (IsWatchOver())
        return;
    if (answer)
    {
        m_isServerThere = true;
        if (!isThere)
            m_hub->Publish(ServerBack{false});
        SwitchAgain();
        return;
    }
    Error const& error = answer.GetError();
    bool const isReachable = watcher.IsAlive(&*record) != NotReachable;
    if (IsWatchOver())
        return;
    NoteLoss(isReachable ? error : Error{ServerAway, error.about, error.reason});
    auto const entered = isReachable ? EnterAgain(watcher) : std::nullopt;
    if (entered && *entered)
        m_hub->Publish(ServerBack{true});  // the server was there, and the session was not
    else if (entered && !IsWatchOver())
        NoteRefusal(entered->GetError());
}

void Client::NoteLoss(Error error)
{
    if (!m_isServerThere.exchange(false))
        return;
    m_loss = error.code;
    m_hub->Publish(ServerLost{std::move(error)});
}

// Why the session is not back yet, once.
void Client::NoteRefusal(Error error)
{
    if (std::exchange(m_loss, error.code) != error.code)
        m_hub->Publish(ServerLost{std::move(error)});
}

// Who was refused once would hear nothing for the rest of the session.
void Client::SwitchAgain()
{
    if (!m_switch.IsRefused())
        m_switching = {};
    else if (m_switching.IsDue())
        m_switch.Ask();
}

// With growing pauses: servers answer ever later whom they have refused often. The old session ends when
// there is a new one, since tickets may still be read in it, and through the watcher, since a logout by the
// manager gives the local port away.
std::optional<Outcome> Client::EnterAgain(ComGUIManager& watcher)
{
    if (!m_entry.IsDue())
        return std::nullopt;
    {
        std::lock_guard const lock(m_calls);
        TLogin old = *m_record;
        Outcome entered = Enter(watcher);
        if (entered)
            watcher.Logout(&old);
        else
            *m_record = old;
        ForgetPassword(old);
        if (!entered)
            return entered;
    }
    m_entry = {};
    m_switching = {};  // what the old session was refused is another matter
    m_switch.Await(m_switch.Ask(), SwitchPatience);
    return Outcome();
}
}  // namespace comgui::detail
