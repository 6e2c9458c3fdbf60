#include "comgui/host/CEventManager.h"

#include <condition_variable>
#include <map>
#include <mutex>
#include <utility>
#include <vector>

namespace
{
struct SUBSCRIPTION
{
    explicit SUBSCRIPTION(CEventManager::Handler function) : handler(std::move(function)) {}

    CEventManager::Handler handler;
    bool ended = false;
    int running = 0;  // calls of the handler at this moment, on all threads
};

// How many handlers are running on this thread, one inside the other.
thread_local int handlersOnThisThread = 0;
}  // namespace

struct CEventManager::STATE
{
    std::mutex lock;  // guards everything here; never held while a handler runs
    std::condition_variable returned;
    std::map<unsigned long long, std::shared_ptr<SUBSCRIPTION>> subscriptions;  // in order of subscription
    unsigned long long lastToken = 0;
};

namespace
{
// Marks a handler as running, if its subscription has not ended meanwhile.
class RUNNING_HANDLER
{
public:
    RUNNING_HANDLER(std::mutex& lock, std::condition_variable& returned, SUBSCRIPTION& subscription)
        : m_lock(lock), m_returned(returned), m_subscription(subscription)
    {
        std::lock_guard const guard(m_lock);
        m_entered = !m_subscription.ended;
        if (!m_entered)
            return;
        ++m_subscription.running;
        ++handlersOnThisThread;
    }
    ~RUNNING_HANDLER()
    {
        if (!m_entered)
            return;
        std::lock_guard const guard(m_lock);
        --m_subscription.running;
        --handlersOnThisThread;
        m_returned.notify_all();
    }
    RUNNING_HANDLER(RUNNING_HANDLER const&) = delete;
    RUNNING_HANDLER& operator=(RUNNING_HANDLER const&) = delete;

    bool Entered() const { return m_entered; }

private:
    std::mutex& m_lock;
    std::condition_variable& m_returned;
    SUBSCRIPTION& m_subscription;
    bool m_entered = false;
};
}  // namespace

CEventManager::CEventManager() : m_state(std::make_unique<STATE>()) {}

CEventManager::~CEventManager() = default;

CEventManagerPtr CEventManager::GetInstance()
{
    static CEventManagerPtr const instance = std::make_shared<CEventManager>();
    return instance;
}

void CEventManager::PublishEvent(wxEvent& event)
{
    // A list of this moment: what subscribes from here on hears the next event.
    std::vector<std::shared_ptr<SUBSCRIPTION>> subscriptions;
    {
        std::lock_guard const guard(m_state->lock);
        for (auto const& [token, subscription] : m_state->subscriptions)
            subscriptions.push_back(subscription);
    }
    for (auto const& subscription : subscriptions)
    {
        RUNNING_HANDLER const running(m_state->lock, m_state->returned, *subscription);
        if (running.Entered())
            subscription->handler(event);
    }
}

unsigned long long CEventManager::Subscribe(Handler handler)
{
    auto subscription = std::make_shared<SUBSCRIPTION>(std::move(handler));
    std::lock_guard const guard(m_state->lock);
    m_state->subscriptions.emplace(++m_state->lastToken, std::move(subscription));
    return m_state->lastToken;
}

bool CEventManager::Unsubscribe(unsigned long long token)
{
    std::shared_ptr<SUBSCRIPTION> subscription;  // goes after the lock: its handler may own anything
    std::unique_lock guard(m_state->lock);
    auto const found = m_state->subscriptions.find(token);
    if (found == m_state->subscriptions.end())
        return false;
    subscription = std::move(found->second);
    m_state->subscriptions.erase(found);
    subscription->ended = true;
    if (handlersOnThisThread == 0)
        m_state->returned.wait(guard, [&] { return subscription->running == 0; });
    return true;
}
