#include "tests/support/NetworkProxy.h"

#include <algorithm>
#include <arpa/inet.h>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <system_error>
#include <unistd.h>

using standin::Descriptor;

namespace
{
constexpr std::size_t LargestWaiting = 65536;

int Must(int result)
{
    if (result < 0)
        throw std::system_error(errno, std::generic_category(), "cannot make a proxy");
    return result;
}

void NeverWait(Descriptor const& descriptor) { Must(fcntl(descriptor.Number(), F_SETFL, O_NONBLOCK)); }

// Addresses are of one type for the system, whatever their kind.
template <typename Address>
sockaddr* Plain(Address& address)
{
    return reinterpret_cast<sockaddr*>(&address);
}
}  // namespace

NetworkProxy::NetworkProxy(std::filesystem::path server)
    : m_server(std::move(server)), m_listener(Must(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)))
{
    sockaddr_in address{};
    socklen_t size = sizeof address;
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    Must(bind(m_listener.Number(), Plain(address), size));
    Must(listen(m_listener.Number(), 64));
    Must(getsockname(m_listener.Number(), Plain(address), &size));
    m_port = std::to_string(ntohs(address.sin_port));
    NeverWait(m_listener);
    int ends[2];
    Must(pipe(ends));
    m_wokenEnd = Descriptor(ends[0]);
    m_wakingEnd = Descriptor(ends[1]);
    NeverWait(m_wokenEnd);
}

void NetworkProxy::Start()
{
    m_thread = std::thread([this] { Run(); });
}

NetworkProxy::~NetworkProxy()
{
    m_isOver = true;
    Wake();
    if (m_thread.joinable())
        m_thread.join();
}

void NetworkProxy::Lose(Loss loss)
{
    m_loss = loss;
    Wake();
}

void NetworkProxy::Slow(std::size_t bytes) { m_largest = std::min(bytes, LargestWaiting); }

void NetworkProxy::CloseAll()
{
    m_isClosing = true;
    for (Wake(); m_isClosing;)
        std::this_thread::yield();
}

void NetworkProxy::Wake() const
{
    [[maybe_unused]] ssize_t const ignored = write(m_wakingEnd.Number(), "", 1);
}

void NetworkProxy::Run()
{
    while (!m_isOver)
    {
        std::vector<pollfd> waiting{{m_wokenEnd.Number(), POLLIN, 0}, {m_listener.Number(), POLLIN, 0}};
        for (LINK const& link : m_links)
            AddTo(waiting, link);
        poll(waiting.data(), waiting.size(), -1);
        char bytes[64];
        while (read(m_wokenEnd.Number(), bytes, sizeof bytes) > 0)
            ;
        if (m_isClosing)
            m_links.clear();
        m_isClosing = false;
        int const loss = m_loss;
        std::erase_if(m_links,
                      [this, loss](LINK& link)
                      {
                          auto const fromClient = [&]
                          {
                              m_turns += link.isClientsTurn ? 1 : 0;
                              link.isClientsTurn = false;
                          };
                          auto const fromServer = [&] { link.isClientsTurn = true; };
                          return ((loss & ToServer) == 0 &&
                                  !Pass(link.client, link.server, link.toServer, fromClient)) ||
                                 ((loss & ToClient) == 0 &&
                                  !Pass(link.server, link.client, link.toClient, fromServer));
                      });
        if (m_largest != 0)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        Accept();
    }
}

// One that is swallowed, or full, is not waited for.
void NetworkProxy::AddTo(std::vector<pollfd>& waiting, LINK const& link) const
{
    int const loss = m_loss;
    auto const add = [&waiting](Descriptor const& from, Descriptor const& to, std::string const& kept)
    {
        if (kept.empty())
            waiting.push_back({from.Number(), POLLIN, 0});
        else
            waiting.push_back({to.Number(), POLLOUT, 0});
    };
    if ((loss & ToServer) == 0)
        add(link.client, link.server, link.toServer);
    if ((loss & ToClient) == 0)
        add(link.server, link.client, link.toClient);
}

// False at the end of the connection. Says what it takes before it passes it on.
template <typename Taken>
bool NetworkProxy::Pass(Descriptor const& from, Descriptor const& to, std::string& waiting,
                        Taken const& taken) const
{
    if (waiting.empty())
    {
        char bytes[LargestWaiting];
        ssize_t const size =
            recv(from.Number(), bytes, m_largest != 0 ? m_largest.load() : sizeof bytes, MSG_DONTWAIT);
        if (size == 0 || (size < 0 && errno != EAGAIN && errno != EINTR))
            return false;
        if (size < 0)
            return true;
        taken();
        waiting.append(bytes, static_cast<std::size_t>(size));
    }
    ssize_t const size = send(to.Number(), waiting.data(), waiting.size(), MSG_DONTWAIT | MSG_NOSIGNAL);
    if (size > 0)
        waiting.erase(0, static_cast<std::size_t>(size));
    return size >= 0 || errno == EAGAIN || errno == EINTR;
}

// Whom the server does not answer is not answered either.
void NetworkProxy::Accept()
{
    Descriptor client(accept4(m_listener.Number(), nullptr, nullptr, SOCK_CLOEXEC));
    if (client.Number() < 0)
        return;
    ++m_accepted;
    Descriptor server(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::strncpy(address.sun_path, m_server.c_str(), sizeof address.sun_path - 1);
    if (connect(server.Number(), Plain(address), sizeof address) == 0)
        m_links.push_back({std::move(client), std::move(server), {}, {}, true});
}
