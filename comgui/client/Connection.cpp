#include "comgui/client/Connection.h"

#include "comgui/client/Client.h"

namespace comgui
{
Connection::Connection() : m_client(detail::Client::Make()) {}
Connection::~Connection() { m_client->End(); }

Outcome Connection::FindPlugIn() { return m_client->FindPlugIn(); }
Outcome Connection::Test(Server const& server) { return m_client->Test(server); }
Result<User> Connection::LogIn(Server const& server, Account const& account)
{
    return m_client->LogIn(server, account);
}
Outcome Connection::LogOut() { return m_client->LogOut(); }

bool Connection::IsLoggedIn() const { return m_client->IsLoggedIn(); }
bool Connection::IsServerThere() const { return m_client->IsServerThere(); }
std::string Connection::LocalEndPoint() const { return m_client->LocalEndPoint(); }

Tickets Connection::GetTickets() const { return Tickets(m_client); }
Transfers Connection::GetTransfers() const { return Transfers(m_client); }

Subscription Connection::Subscribe(Interest interest, Executor executor, Subscription::Handler handler,
                                   std::chrono::milliseconds interval)
{
    auto [subscriber, turn] =
        m_client->Subscribe(std::move(interest), std::move(executor), std::move(handler), interval);
    m_client->AwaitReports(turn);
    return Subscription(std::move(subscriber));
}

Subscription::Subscription(std::shared_ptr<detail::Subscriber> subscriber)
    : m_subscriber(std::move(subscriber))
{
}
Subscription::~Subscription() { End(); }
Subscription::Subscription(Subscription&& other) noexcept = default;

Subscription& Subscription::operator=(Subscription&& other) noexcept
{
    End();
    m_subscriber = std::move(other.m_subscriber);
    return *this;
}

void Subscription::End()
{
    if (auto const subscriber = std::move(m_subscriber))
        subscriber->End();
}
}  // namespace comgui
