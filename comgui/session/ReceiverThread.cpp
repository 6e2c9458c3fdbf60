#include "comgui/session/ReceiverThread.h"

#include "comgui/host/CEventManager.h"
#include "comgui/host/NotifData.h"
#include "comgui/host/ServerNotificationEvent.h"
#include "comgui/session/ComGUIManager.h"
#include "comgui/session/NotificationEvents.h"
#include <cstdio>
#include <wx/utils.h>

namespace
{
constexpr unsigned long PollInterval = 2;  // milliseconds

void TakeNext(NotifData*& inHand)
{
    std::list<NotifData*>& queue = ComGUIManager::m_notificationList;
    if (queue.empty())
        return;
    inHand = queue.front();  // what was still in hand is lost: a notification of kind 0, or one that threw
    queue.pop_front();
}

void Publish(NotifData const& notification, std::string const& localEndPoint)
{
    if (auto const id = comgui::detail::EventIdOf(notification, localEndPoint))
    {
        ServerNotificationEvent event(*id, notification);
        CEventManager::GetInstance()->PublishEvent(event);
    }
}

void HandleNext(NotifData*& inHand, std::string const& localEndPoint)
{
    wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);  // held while handlers run
    TakeNext(inHand);
    if (!inHand)
        return;
    Publish(*inHand, localEndPoint);
    if (inHand->NotifKind == 0)  // kept in hand, and freed by nobody: no such kind is sent
        return;
    inHand->NotifKind = 0;
    delete inHand;
    inHand = nullptr;
}
}  // namespace

ReceiverThread::ReceiverThread() : wxThread(wxTHREAD_DETACHED), m_pManager(ComGUIManager::GetInstance()) {}

ReceiverThread::~ReceiverThread() = default;

void* ReceiverThread::Entry()
{
    // Static on purpose: a later thread keeps this one, though another session may be logged in by then.
    static std::string const szLocalEndPoint = m_pManager->GetLocalEndPoint().utf8_string();

    NotifData* inHand = nullptr;
    while (!__atomic_load_n(&m_bStop, __ATOMIC_ACQUIRE))
    {
        wxMilliSleep(PollInterval);
        try
        {
            HandleNext(inHand, szLocalEndPoint);
        }
        catch (...)
        {
            std::printf("\nUnhandled Exception found in ReceiverThread...");
        }
        if (TestDestroy())
            return nullptr;
    }
    std::puts("\nReceiverThread Stopped!");
    return nullptr;
}

bool ReceiverThread::ShutDown()
{
    // Release, and acquire in the loop: the thread deletes itself after it has seen this.
    __atomic_store_n(&m_bStop, true, __ATOMIC_RELEASE);
    return true;
}

void ReceiverThread::OnExit()
{
    std::puts("\nOnExit:: ReceiverThread Stopped!");
    ShutDown();
}
