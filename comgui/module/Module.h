// A communication plug-in as a whole: what a host can ask before anybody is logged in, the login, and tickets
// outside any session. An author derives one class from it and names it in COMGUI_PLUGIN (PlugIn.h).
//
// There is one object in a process, made when a host first needs it and never destroyed. Any thread may call.
#pragma once

#include "comgui/module/Called.h"
#include "comgui/module/Codes.h"
#include "comgui/module/Notifications.h"
#include "comgui/module/Session.h"
#include "comgui/module/TicketSlots.h"
#include "comgui/session/TLogin.h"
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

namespace comgui::plugin
{
// What a client logs in with.
struct Credentials
{
    std::string user;
    std::string password;
    std::string host;
    int port = 0;
    int stamp = 0;  // of the client
    std::string localAddress;
    unsigned int localPort = 0;
};

// The answer. Without a session the login is refused.
struct LoggedIn
{
    static constexpr int Administrator = 16;

    std::unique_ptr<Session> session{};
    int userTicket = 0;      // the id of the user's ticket
    int role = 0;            // Administrator, or anything else
    std::string endPoint{};  // names the client's end point; cut at 127 bytes
};

class Module : public Called
{
public:
    // 0 if a server answers there, else a code.
    virtual int IsAlive(std::string_view host, int port) = 0;

    // The IPv4 address by which this machine reaches that host, first octet in the top byte.
    virtual std::uint32_t LocalAddress(std::string_view host, int port);

    // A host prepares the record for a login, or has done with it: codes. The kit keeps account of the
    // records.
    virtual int Initialize(TLogin& record);
    virtual int Uninitialize(TLogin& record);

    // May throw Refused with a code of the author's own.
    virtual LoggedIn LogIn(Credentials const& credentials) = 0;

    // A ticket in memory: an empty one, unless overridden.
    virtual std::unique_ptr<TicketSlots> MakeTicket();

    // The ticket of a file. Null if there is none, or none that can be read.
    virtual std::unique_ptr<TicketSlots> OpenTicket(std::string_view path);

    // A ticket of one of these goes: the last chance to save it. False if it could not be saved.
    virtual bool CloseTicket(TicketSlots& ticket);

    // Any command, with the session or without (null). Passes it to the session, unless overridden.
    virtual int Command(Session* session, char const* name, int size, void* data);

    // Where the author tells of changes, from any thread.
    Notifications& GetNotifications() { return m_notifications; }

private:
    Notifications m_notifications;
};
}  // namespace comgui::plugin
