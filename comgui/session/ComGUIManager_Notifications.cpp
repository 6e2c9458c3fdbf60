// The road of a notification from the plug-in into the queue, and how the plug-in is told to use it.
#include "comgui/session/ComGUIManager.h"

#include "comgui/access/FromUtf8.h"
#include "comgui/access/MTICKET_ADMIN.h"
#include "comgui/access/STICKET_MODIFY.h"
#include "comgui/access/STICKET_READ.h"
#include "comgui/host/NotifData.h"
#include "comgui/session/LocalTicket.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include <memory>

// What is still queued at the end of the process is not freed: its owner would have been the receiver.
std::list<NotifData*> ComGUIManager::m_notificationList;
wxCriticalSection ComGUIManager::m_csNotificationList;

namespace
{
constexpr int ParameterChange = 1;  // the kind that comes with a table
constexpr int TextIsAKey = 7;       // the kind whose texts do not count as its key
constexpr int NoNotification = -1;
constexpr int AllNotifications = -3;

// By exchange, since an assignment would copy the text once more.
void Take(wxString& text, void const* utf8)
{
    comgui::detail::FromUtf8(static_cast<char const*>(utf8)).swap(text);
}

// The lock is held for a splice only, not for the allocation of the list's node.
void Append(std::unique_ptr<NotifData> notification)
{
    std::list<NotifData*> one(1, notification.get());
    wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
    ComGUIManager::m_notificationList.splice(ComGUIManager::m_notificationList.end(), one);
    static_cast<void>(notification.release());  // the queue's from here on
}

// The record behind a run: a run ends where the key pointer changes, since the plug-in gives all records of
// one key the same. Equal texts at two addresses are two runs.
SETMULTIPAR const* EndOfRun(SETMULTIPAR const* first)
{
    SETMULTIPAR const* record = first + 1;
    while (record->key == first->key)
        ++record;
    return record;
}

void FillWithValue(NotifData& notification, SETMULTIPAR const& record)
{
    notification.NotifValueType = record.type;
    notification.NotifPos = record.pos;
    if (!record.value)
        return;
    if (record.type == PARAM_STRING)
        Take(notification.NotifText, record.value);
    else if (record.type == PARAM_DOUBLE)
        notification.NotifNumber = *static_cast<double const*>(record.value);
    else if (record.type == PARAM_INT)
        notification.NotifNumber = *static_cast<int const*>(record.value);
}

// One notification a key. It carries a single value; where there are several, hosts read the ticket.
void QueueTable(NotifData const& pattern, SETMULTIPAR const* first)
{
    while (first->key)
    {
        SETMULTIPAR const* const end = EndOfRun(first);
        auto notification = std::make_unique<NotifData>(pattern);
        Take(notification->NotifKey, first->key);
        if (end - first == 1)
            FillWithValue(*notification, *first);
        else
            notification->NotifValueType = PARAM_COUNT;
        Append(std::move(notification));
        first = end;
    }
}

// A text value takes the place of the key, except for the one kind whose key counts.
void FillWithRecord(NotifData& notification, int kind, SETMULTIPAR const& record)
{
    notification.NotifValueType = record.type;
    bool const isText = record.type == PARAM_STRING && kind != TextIsAKey;
    if (void const* const text = isText ? record.value : record.key)
        Take(notification.NotifKey, text);
}
}  // namespace

void ComGUIManager::fGUI2NOTIFICATION(void* pUser, int kind, int argA, int argB, int code, void* data)
{
    auto const* const records = static_cast<SETMULTIPAR const*>(data);
    if (kind == ParameterChange)
    {
        if (!records)
            return;
        try
        {
            QueueTable(NotifData(pUser, kind, argA, argB, code, PARAM_NONE, nullptr), records);
        }
        catch (...)  // no memory: what is queued by now stays, and the plug-in must not notice
        {
        }
        return;
    }
    auto notification = std::make_unique<NotifData>(pUser, kind, argA, argB, code, PARAM_NONE, nullptr);
    if (records)
        FillWithRecord(*notification, kind, *records);
    Append(std::move(notification));
}

int ComGUIManager::SetCallback(void* pUser)
{
    // Faults without a plug-in, unlike the form below, and keeps the id where nothing reads it.
    return RegisterCallback(m_pLogin->hSession, CreateTicket(nullptr), pUser, m_iGUINotificationID);
}

int ComGUIManager::SetCallback(TLogin* login, void* pUser)
{
    DisableNotifications(login, AllNotifications);
    STICKET_ACCESS const* const ticket = CreateTicket(nullptr);
    if (!ticket)
        return -1;
    return RegisterCallback(login->hSession, ticket, pUser, login->iGUINotificationID);
}

// The ticket carries the request, and the plug-in's answer; it is destroyed here.
int ComGUIManager::RegisterCallback(void* hSession, STICKET_ACCESS const* ticket, void* pUser,
                                    int& notificationId)
{
    STICKET_MODIFY const& request = *STICKET_MODIFY::Of(ticket);
    request.SetParameter("pGUI2Notification", reinterpret_cast<void*>(&fGUI2NOTIFICATION), -1);
    request.SetParameter("pUser", pUser, -1);

    char command[] = "local.set.callback";
    int const result = m_interface.SendCommandEntry(m_hModuleInstance, hSession, command, 0,
                                                    const_cast<STICKET_ACCESS*>(ticket));
    if (result == 0)
        notificationId = STICKET_READ::Of(ticket)->GetIntParameter("iGUINotificationID", NoNotification);
    DestroyTicket(ticket);
    return result;
}

int ComGUIManager::EnableNotifications(TLogin* login, int type, char const* const* keys)
{
    return EnableNotifications(login, type, TICKET_ID_ALL, keys);
}

// Calls the operation with the container's administration and the id of a session that can be notified.
template <typename Switch>
static int SwitchNotifications(MTICKET_ACCESS const* container, TLogin const& login, Switch operation)
{
    if (container && login.iGUINotificationID != NoNotification)
        operation(*MTICKET_ADMIN::Of(container), login.iGUINotificationID);
    return 0;  // whatever the slot said
}

int ComGUIManager::EnableNotifications(TLogin* login, int type, int id, char const* const* keys)
{
    TLogin* const record = login ? login : m_pLogin;
    return SwitchNotifications(GetHandleToClientContainer(record), *record,
                               [=](MTICKET_ADMIN const& admin, int notification)
                               { admin.EnableNotification(type, id, notification, keys); });
}

int ComGUIManager::DisableNotifications(TLogin* login, int type)
{
    TLogin* const record = login ? login : m_pLogin;
    return SwitchNotifications(GetHandleToClientContainer(record), *record,
                               [=](MTICKET_ADMIN const& admin, int notification)
                               { admin.DisableNotification(type, TICKET_ID_ALL, notification); });
}
