// What a ticket holds, kept up to date: read once, then followed, and read anew by itself where events do not
// tell enough. The way to show a ticket.
#pragma once

#include "comgui/client/Connection.h"
#include "comgui/client/Worker.h"
#include <functional>
#include <memory>
#include <vector>

namespace comgui
{
// What has become of the ticket since the last time.
struct TicketUpdate
{
    Outcome outcome;                              // a failure: nothing is known of it now; NoSuchTicket: gone
    std::vector<SnapshotDifference> differences;  // by key, bytewise; often none
};

// For the thread of the worker's results.
class COMGUI_EXPORT LiveTicket
{
public:
    // Called on that thread: first with all that the ticket holds, or why it cannot be read, then with what
    // changes. It may destroy the LiveTicket.
    using Handler = std::function<void(TicketUpdate const&)>;

    // worker: where it is read; it must live longer, as must the connection. A ticket that is not there yet,
    // or gone, is waited for; one that could not be read is read again
    // when it changes. Folder paths are as stored. Throws as Connection::Subscribe.
    LiveTicket(Connection& connection, Worker const& worker, TicketAddress ticket, Handler handler);

    // No call of the handler comes any more.
    ~LiveTicket();
    LiveTicket(LiveTicket const&) = delete;
    LiveTicket& operator=(LiveTicket const&) = delete;

    TicketAddress Address() const;
    Snapshot const& Now() const;  // empty while nothing is known

    // Reads it anew, as after a login of one's own; after a loss of the server that happens by itself.
    void Refresh();

private:
    struct STATE;
    std::shared_ptr<STATE> m_state;
};
}  // namespace comgui
