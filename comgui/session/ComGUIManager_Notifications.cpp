// The queue between the plug-in's thread and the receiver. What is still queued at the end of the process
// is not freed: its owner would have been the receiver.
#include "comgui/session/ComGUIManager.h"

std::list<NotifData*> ComGUIManager::m_notificationList;
wxCriticalSection ComGUIManager::m_csNotificationList;
