// The queue of notifications as a test finds and leaves it: empty.
#pragma once

#include "tests/session/FakeModule.h"
#include "tests/support/Notifications.h"

class NotificationQueue : public WithModule
{
protected:
    ~NotificationQueue() override { TakeNotifications(); }

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
