// A network between a client and a server that can lose packets: a port on this machine, and a thread that
// passes on what comes. What it swallows it only keeps, as the sender's system does, and passes on later.
#pragma once

#include "standin/server/files/Descriptor.h"
#include <atomic>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

class NetworkProxy
{
public:
    // server: the socket that is spoken to for whoever connects. Throws std::system_error.
    explicit NetworkProxy(std::filesystem::path server);

    // Begins to pass on; who connects before that waits. A process makes copies of itself best before.
    void Start();
    ~NetworkProxy();
    NetworkProxy(NetworkProxy const&) = delete;
    NetworkProxy& operator=(NetworkProxy const&) = delete;

    std::string Port() const { return m_port; }  // at 127.0.0.1

    // What is swallowed from now on, while both ends take the connection for a good one.
    enum Loss
    {
        None,
        ToServer,
        ToClient,
        Both,
    };
    void Lose(Loss loss);

    // From now on no more than so many bytes pass in one direction in a hundredth of a second.
    void Slow(std::size_t bytes);

    int Accepted() const { return m_accepted; }  // connections so far

    // How often so far a client has sent something after the server had: round trips, if each waits for the
    // other.
    int Turns() const { return m_turns; }

    // Ends the connections that there are, for both ends.
    void CloseAll();

private:
    struct LINK
    {
        standin::Descriptor client, server;
        std::string toServer, toClient;  // not written yet
        bool isClientsTurn = true;       // the server was the last to send something
    };
    void Run();
    void Accept();
    void AddTo(std::vector<struct pollfd>& waiting, LINK const& link) const;
    template <typename Taken>
    bool Pass(standin::Descriptor const& from, standin::Descriptor const& to, std::string& waiting,
              Taken const& taken) const;
    void Wake() const;

    std::filesystem::path const m_server;
    standin::Descriptor m_listener, m_wakingEnd, m_wokenEnd;
    std::string m_port;
    std::atomic<int> m_loss{None}, m_accepted{0}, m_turns{0};
    std::atomic<std::size_t> m_largest{0};  // 0: no limit
    std::atomic<bool> m_isClosing{false}, m_isOver{false};
    std::vector<LINK> m_links;  // the thread's own
    std::thread m_thread;
};
