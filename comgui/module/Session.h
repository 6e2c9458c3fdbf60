// What a client does once it is logged in. An author derives from it; each function that he does not override
// answers NotOffered.
//
// An object is never destroyed once it is logged in: clients hold its tables longer than the session lives,
// and may be within a slot on another thread. End is the place to let go of what a session holds.
#pragma once

#include "comgui/module/Callback.h"
#include "comgui/module/Codes.h"
#include "comgui/module/ContainerSlots.h"
#include "comgui/module/Notifications.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include <atomic>
#include <string_view>

namespace comgui::plugin
{
enum class ClientFolder
{
    Preview,
    Thumbnail,
};

// Whether a transfer is to be over when the call returns.
enum class Transfer
{
    Complete,
    Begun,
};

class Session
{
public:
    Session() = default;
    Session(Session const&) = delete;
    Session& operator=(Session const&) = delete;
    virtual ~Session() = default;

    // The session's tickets, the same at every call; null if it has none.
    virtual ContainerSlots* GetContainer() { return nullptr; }

    // The client has logged out: no function of the session or its container begins any more, but one may be
    // under way on another thread. Called also if it has ended by itself. False if it had ended already.
    virtual bool End() { return true; }

    // Whether the session has ended by itself, for instance with its server. It is then an unknown one.
    virtual bool HasEnded() const { return false; }

    // Codes, 0 for success. What a function throws becomes one, too.
    virtual int TicketData(Address ticket, int format, int* size, void* buffer);
    virtual int PutFile(std::string_view first, std::string_view second, Transfer wanted);
    virtual int GetFile(std::string_view first, std::string_view second, Transfer wanted);
    virtual int SendJob(TJobIdentification const& job, std::string_view path, std::string_view name);

    // The commands that clients know, and all others. Command finds out which one it is, and whether what
    // comes with it is what it should be.
    virtual int SetCallback(Callback callback, STICKET_ACCESS const& answer);
    virtual int IsAlive(TCommandRecord& record);     // the answer goes into record.iResult
    virtual int PrepareJob(TCommandRecord& record);  // likewise
    virtual int SetFolder(ClientFolder folder, std::string_view path);
    virtual int OtherCommand(std::string_view name, int size, void* data);
    virtual int Command(std::string_view name, int size, void* data);

    // The module's; null before the login.
    Notifications* GetNotifications() const { return m_notifications; }

    // For the kit, at the login and the logout. After the second nothing of the session is told any more.
    void Begin(Notifications& notifications) { m_notifications = &notifications; }
    void Silence();

private:
    Notifications* m_notifications = nullptr;
    std::atomic<bool> m_isSilent{false};
};
}  // namespace comgui::plugin
