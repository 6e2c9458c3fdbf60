// Interest in events, as long as the object lives. See Connection::Subscribe.
#pragma once

#include "comgui/client/Event.h"
#include "comgui/client/Executor.h"
#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace comgui
{
namespace detail
{
class Subscriber;
}

// Which events. Events of the server are always among them.
struct Interest
{
    static Interest InTypes(std::vector<int> types, std::vector<std::string> keys = {})
    {
        return {std::move(types), {}, std::move(keys), false};
    }
    static Interest InTickets(std::vector<TicketAddress> tickets, std::vector<std::string> keys = {})
    {
        return {{}, std::move(tickets), std::move(keys), false};
    }
    static Interest InAllTypes(std::vector<std::string> keys = {})
    {
        Interest interest{{}, {}, std::move(keys), false};
        for (int type = 0; type < TicketTypes; ++type)
            interest.types.push_back(type);
        return interest;
    }
    static Interest InServer() { return {}; }
    static Interest InTransfers() { return {{}, {}, {}, true}; }

    std::vector<int> types{};              // all tickets of these types
    std::vector<TicketAddress> tickets{};  // and these; they need not exist
    std::vector<std::string> keys;  // of these tickets; none: all keys. A "*" at the end stands for any rest
    bool transfers = false;         // progress and end of this connection's transfers
};

// Ends the interest when it is destroyed, and what waits for it is dropped. After that no handler runs: the
// destructor waits for one that runs, but not if the handler itself destroys it. Move it and destroy it on
// one thread at a time.
class COMGUI_EXPORT Subscription
{
public:
    using Handler = std::function<void(Event const&)>;

    Subscription() = default;
    ~Subscription();
    Subscription(Subscription&& other) noexcept;
    Subscription& operator=(Subscription&& other) noexcept;

    void End();

private:
    friend class Connection;
    friend class LiveTicket;
    COMGUI_LOCAL explicit Subscription(std::shared_ptr<detail::Subscriber> subscriber);

    std::shared_ptr<detail::Subscriber> m_subscriber;
};
}  // namespace comgui
