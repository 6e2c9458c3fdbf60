// The queue of notifications as a test finds and leaves it: empty.
#pragma once

#include "comgui/host/NotifData.h"
#include "comgui/session/ComGUIManager.h"
#include "tests/session/FakeModule.h"
#include <memory>
#include <vector>

class NotificationQueue : public WithModule
{
protected:
    ~NotificationQueue() override { Take(); }

    // All that is queued, in order.
    static std::vector<std::unique_ptr<NotifData>> Take()
    {
        std::vector<std::unique_ptr<NotifData>> taken;
        wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
        for (NotifData* const notification : ComGUIManager::m_notificationList)
            taken.emplace_back(notification);
        ComGUIManager::m_notificationList.clear();
        return taken;
    }

    static std::size_t Size()
    {
        wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
        return ComGUIManager::m_notificationList.size();
    }

    static SETMULTIPAR Record(char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        SETMULTIPAR record = {};
        record.key = key;
        record.type = type;
        record.value = value;
        record.pos = pos;
        return record;
    }
};
