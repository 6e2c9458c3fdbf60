// The event by which a host hears of a notification. Declared here, supplied by the host's event library, or
// by libcomgui_host.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/host/NotifData.h"
#include <memory>
#include <wx/event.h>

class COMGUI_EXPORT ServerNotificationEvent : public wxEvent
{
public:
    // Refers to data, which must live as long as the event is published, and no longer. GetId() is the id.
    ServerNotificationEvent(int id, NotifData const& data);
    ~ServerNotificationEvent() override;

    NotifData const& GetNotifData() const { return *m_data; }

    // A copy that owns its data, and so may outlive the publishing: what wxQueueEvent sends to a GUI thread.
    wxEvent* Clone() const override;

private:
    ServerNotificationEvent(ServerNotificationEvent const& other);

    std::unique_ptr<NotifData const> m_own;  // only in a clone
    NotifData const* m_data;
};

COMGUI_EXPORT extern wxEventTypeTag<ServerNotificationEvent> const EVT_SERVER_NOTIFICATION;
