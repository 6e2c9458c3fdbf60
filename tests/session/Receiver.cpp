#include "tests/session/Receiver.h"

#include "comgui/foundation/stracpy.h"
#include "comgui/host/CEventManager.h"
#include "comgui/host/ServerNotificationEvent.h"
#include <csignal>
#include <thread>
#include <unistd.h>
#include <wx/init.h>

namespace
{
constexpr int MarkerKind = 6;  // published whatever its code
constexpr int MarkerCode = 0x4D41524B;
}  // namespace

class Receiver::THREAD : public ReceiverThread
{
public:
    explicit THREAD(Receiver& test) : m_test(test) {}
    ~THREAD() override
    {
        std::lock_guard const guard(m_test.m_lock);
        m_test.m_ended = true;
        m_test.m_threadId = gettid();
        m_test.m_changed.notify_all();
    }

private:
    Receiver& m_test;
};

Receiver::Receiver()
{
    static wxInitializer const wx;  // threads need it
    SetEndPoint(EndPoint);
    m_subscription = CEventManager::GetInstance()->Subscribe([this](wxEvent& event) { Handle(event); });
}

Receiver::~Receiver()
{
    ShutDown();
    CEventManager::GetInstance()->Unsubscribe(m_subscription);
}

void Receiver::SetEndPoint(char const* text)
{
    module.onLogin = [text](TLogin& login)
    { stracpy(login.szLocalEndPoint, text, sizeof login.szLocalEndPoint); };
    ComGUIManager::GetInstance()->Login("u", "p", "h", 1);
}

void Receiver::Queue(int kind, int code, char const* key, char const* text)
{
    auto* const notification = new NotifData(nullptr, kind, 0, 0, code, PARAM_STRING, key);
    notification->NotifText = wxString::FromUTF8(text);
    Queue(notification);
}

void Receiver::Queue(NotifData* notification)
{
    wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
    ComGUIManager::m_notificationList.push_back(notification);
}

void Receiver::Run()
{
    m_ended = false;
    m_thread = new THREAD(*this);
    ASSERT_EQ(m_thread->Run(), wxTHREAD_NO_ERROR);
}

void Receiver::ShutDown()
{
    if (!m_thread)
        return;
    EXPECT_TRUE(m_thread->ShutDown());
    WaitForTheEnd();
}

void Receiver::Delete()
{
    m_thread->Delete();
    WaitForTheEnd();
}

void Receiver::WaitForTheEnd()
{
    std::unique_lock guard(m_lock);
    m_changed.wait(guard, [this] { return m_ended; });
    m_thread = nullptr;
    // wxWidgets goes on for a moment behind the thread's end, in data that the end of the program destroys.
    while (tgkill(getpid(), m_threadId, 0) == 0)
        std::this_thread::yield();
}

void Receiver::WaitUntilHandled()
{
    ++m_markersSent;
    Queue(MarkerKind, MarkerCode);
    std::unique_lock guard(m_lock);
    m_changed.wait(guard, [this] { return m_markersSeen == m_markersSent; });
}

std::vector<Receiver::EVENT> Receiver::Events()
{
    std::lock_guard const guard(m_lock);
    return m_events;
}

std::vector<int> Receiver::EventIds()
{
    std::vector<int> ids;
    for (EVENT const& event : Events())
        ids.push_back(event.id);
    return ids;
}

void Receiver::Handle(wxEvent& event)
{
    auto const& notified = dynamic_cast<ServerNotificationEvent&>(event);
    NotifData const& data = notified.GetNotifData();
    bool const isMarker = data.NotifKind == MarkerKind && data.NotifCode == MarkerCode;
    {
        std::lock_guard const guard(m_lock);
        if (isMarker)
            ++m_markersSeen;
        else
            m_events.push_back({notified.GetId(), data.NotifKind, data.NotifKey.utf8_string()});
        m_changed.notify_all();
    }
    if (!isMarker && onEvent)
        onEvent(data);
}
