#include "comgui/host/ServerNotificationEvent.h"

wxEventTypeTag<ServerNotificationEvent> const EVT_SERVER_NOTIFICATION(wxNewEventType());

ServerNotificationEvent::ServerNotificationEvent(int id, NotifData const& data)
    : wxEvent(id, EVT_SERVER_NOTIFICATION), m_data(&data)
{
}

ServerNotificationEvent::ServerNotificationEvent(ServerNotificationEvent const& other)
    : wxEvent(other), m_own(std::make_unique<NotifData>(*other.m_data)), m_data(m_own.get())
{
}

ServerNotificationEvent::~ServerNotificationEvent() = default;

wxEvent* ServerNotificationEvent::Clone() const { return new ServerNotificationEvent(*this); }
