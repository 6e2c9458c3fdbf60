// The manager's queue of notifications, emptied by a test in the place of a ReceiverThread.
#pragma once

#include "comgui/host/NotifData.h"
#include "comgui/session/ComGUIManager.h"
#include <memory>
#include <vector>

// All that is queued, in order.
inline std::vector<std::unique_ptr<NotifData>> TakeNotifications()
{
    std::vector<std::unique_ptr<NotifData>> taken;
    wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
    for (NotifData* const notification : ComGUIManager::m_notificationList)
        taken.emplace_back(notification);
    ComGUIManager::m_notificationList.clear();
    return taken;
}
