// A connection to a print server: finds the plug-in, logs in and out, and hears of changes. The way into the
// rest of the kit: Tickets, Transfers, Subscription.
//
//     comgui::Connection connection;
//     if (auto user = connection.LogIn({"localhost", 50000}, {"admin", "admin"}); !user)
//         ShowError(user.GetError().Text());
//
// Every operation may be called from any thread, also from handlers of events, and blocks as long as the
// plug-in takes to answer; reads and writes of tickets do not wait for a login or logout. Several
// connections, also to different servers, do not affect each other. Threads do not survive a fork: the child
// may only call exec or _exit, and must not use or destroy a connection of its parent.
#pragma once

#include "comgui/client/Subscription.h"
#include "comgui/client/Tickets.h"
#include "comgui/client/Transfers.h"
#include <memory>

namespace comgui
{
namespace detail
{
class Client;
}

struct Server
{
    std::string host = "localhost";  // name or address, at most 127 bytes of UTF-8
    int port = 50000;                // 1 to 65535
};

struct Account
{
    std::string user;      // at most 127 bytes of UTF-8, as the password
    std::string password;  // kept in memory while logged in, to log in again after a loss of the server
};

struct User
{
    std::string name;
    TicketAddress ticket;
    bool isAdministrator = false;
};

class COMGUI_EXPORT Connection
{
public:
    Connection();

    // Logs out and ends all subscriptions and transfers. Nothing of the kit runs afterwards. Does not wait
    // for anything but running handlers and calls of the plug-in. Not from a handler.
    ~Connection();
    Connection(Connection const&) = delete;
    Connection& operator=(Connection const&) = delete;

    // Whether the plug-in can be opened. Other operations do so themselves. The host decides where plug-ins
    // are: see UtilityObjects.h.
    Outcome FindPlugIn();

    // Whether a server answers there; needs no session. Errors: NoPlugIn, BadServer, TooLong, ServerAway.
    Outcome Test(Server const& server);

    // Logs in, after a logout if there is a session already. After a refusal just try again: nothing is lost
    // by it, the local port included. Errors: those of Test, NoContainer, CallbackRefused, the plug-in's.
    Result<User> LogIn(Server const& server, Account const& account);

    // Cancels transfers and ends the session; also when the server does not answer. Events of the session are
    // not delivered afterwards: handlers that run are waited for, but not the one that calls this.
    Outcome LogOut();

    bool IsLoggedIn() const;
    bool IsServerThere() const;  // as far as known: asked once a second while logged in

    // Names this client to the server, "address:port"; empty while logged out.
    std::string LocalEndPoint() const;

    // Of the session at the time of each call. They may outlive the connection, and then answer NotLoggedIn.
    Tickets GetTickets() const;
    Transfers GetTransfers() const;

    // The handler is called by the executor with what happens from now on, until the subscription ends.
    // Before a login, too: the interest lasts through logouts. Changes that come faster than the handler is
    // called are merged: by key for each ticket, the latest value counts. interval: the least time between
    // two deliveries, for instance between two repaints; the first event after a pause comes at once.
    // What the handler throws reaches whoever runs the executor's tasks; later events still come.
    // The plug-in is asked to report it on a thread of the kit's, and waited for, but no longer than a
    // quarter of a second. One that takes longer costs no change: as soon as it reports, a TicketChanged with
    // isWhole comes for each ticket of the interest, and a ManyTicketsChanged for each type. Throws
    // std::system_error if the kit cannot start its threads.
    [[nodiscard]] Subscription Subscribe(Interest interest, Executor executor, Subscription::Handler handler,
                                         std::chrono::milliseconds interval = std::chrono::milliseconds(20));

private:
    friend class LiveTicket;  // has its worker wait

    std::shared_ptr<detail::Client> m_client;
};
}  // namespace comgui
