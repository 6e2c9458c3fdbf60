#include "tools/comgui_validate/Listener.h"

#include "comgui/ticket/SETMULTIPAR.h"
#include "tools/comgui_validate/Memory.h"
#include "tools/comgui_validate/Subject.h"
#include <algorithm>
#include <atomic>

namespace validate
{
namespace
{
// Reports that came with another pUser than was registered; theirs is nobody's listener.
std::atomic<int> g_foreign{0};
std::mutex g_listenersLock;

std::vector<std::unique_ptr<Listener>>& Listeners()
{
    static auto* const all = new std::vector<std::unique_ptr<Listener>>;
    return *all;
}

std::vector<ReportedRecord> RecordsOf(SETMULTIPAR const* table)
{
    std::vector<ReportedRecord> records;
    for (; table && table->key; ++table)
        records.push_back({table->key, table->key, table->type, table->pos,
                           comgui::detail::IsParameter(table->type) ? ValueOfWord(table->type, table->value)
                                                                    : std::nullopt});
    return records;
}
}  // namespace

Listener& Listener::Begin(Session& session)
{
    std::unique_ptr<Listener> listener(new Listener(session));
    Listener& begun = *listener;
    {
        std::lock_guard const lock(g_listenersLock);
        Listeners().push_back(std::move(listener));
    }
    begun.Register();
    return begun;
}

void Listener::Register()
{
    Trial& trial = m_session.GetTrial();
    MemoryTicket const ticket(trial);
    STICKET_ACCESS const& table = *ticket.Table();
    using CALLBACK = void (*)(void*, int, int, int, int, void*);
    CALLBACK const callback = Callback;
    if (table.SSETPARAMETER(table.Instance, "pGUI2Notification", PARAM_POINTER,
                            reinterpret_cast<void*>(callback), -1) == 0 ||
        table.SSETPARAMETER(table.Instance, "pUser", PARAM_POINTER, this, -1) == 0)
        throw Skipped("a ticket in memory takes no pointers; see memory.each-type");
    m_result = m_session.Send("local.set.callback", 0, const_cast<STICKET_ACCESS*>(&table));
    if (table.SGETPARAMETER(table.Instance, "iGUINotificationID", PARAM_INT, &m_id, -1) == 0)
        m_id = -1;
    m_session.GetRecord()->iGUINotificationID = m_id;
}

void Listener::MustBeRegistered() const
{
    if (m_result != 0 || m_id < 0)
        throw Skipped("no callback can be registered; see notifications.register");
}

int Listener::Switch(int type, int id, bool on, char const* const* keys)
{
    MTICKET_ACCESS const* const container = m_session.Container();
    m_session.GetTrial().Calling("MENDISNOTIF(" + NameOf(type, id) + ", " + std::to_string(m_id) +
                                 (on ? ", true, keys)" : ", false, null)"));
    return container->MENDISNOTIF(container->Instance, type, id, m_id, on, keys);
}

void Listener::SwitchOn(int type, int id, std::vector<std::string> const& keys)
{
    MustBeRegistered();
    std::vector<char const*> table;
    table.reserve(keys.size() + 1);
    for (std::string const& key : keys)
        table.push_back(key.c_str());
    table.push_back(nullptr);
    if (Switch(type, id, true, table.data()) == 0)
        throw Skipped("the plug-in switches no notifications on for the ticket");
}

void Listener::SwitchOff(int type, int id) { Switch(type, id, false, nullptr); }

// On a thread of the plug-in's.
void Listener::Callback(void* user, int kind, int, int, int code, void* data)
{
    std::unique_lock lock(g_listenersLock);
    bool const isKnown = std::any_of(Listeners().begin(), Listeners().end(),
                                     [user](auto const& each) { return each.get() == user; });
    lock.unlock();
    if (!isKnown)
        ++g_foreign;
    else
        static_cast<Listener*>(user)->Take(
            {kind, code,
             kind == 1 ? RecordsOf(static_cast<SETMULTIPAR const*>(data)) : std::vector<ReportedRecord>()});
}

void Listener::Take(Report report)
{
    std::lock_guard const lock(m_lock);
    m_reports.push_back(std::move(report));
    m_came.notify_all();
}

std::optional<Report> Listener::Await(std::function<bool(Report const&)> const& fits)
{
    std::unique_lock lock(m_lock);
    auto const find = [&] { return std::find_if(m_reports.begin(), m_reports.end(), fits); };
    auto const patience = m_session.GetTrial().GetOptions().limit / 2;
    if (!m_came.wait_for(lock, patience, [&] { return find() != m_reports.end(); }))
        return std::nullopt;
    auto const found = find();
    Report report = std::move(*found);
    m_reports.erase(m_reports.begin(), found + 1);
    return report;
}

std::optional<Report> Listener::AwaitChange(std::string const& key)
{
    return Await(
        [&key](Report const& report)
        {
            return std::any_of(report.records.begin(), report.records.end(),
                               [&key](ReportedRecord const& record) { return record.key == key; });
        });
}

void Listener::Forget()
{
    std::lock_guard const lock(m_lock);
    m_reports.clear();
}

std::vector<Report> Listener::All() const
{
    std::lock_guard const lock(m_lock);
    return m_reports;
}

bool Listener::HadForeignUser() const { return g_foreign != 0; }
}  // namespace validate
