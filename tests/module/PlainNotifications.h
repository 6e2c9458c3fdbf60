// What the clients of one program should be told, as a model has it: who asked for what, and the calls that
// are due. While the callbacks are held up, what is due waits, and can be taken back.
#pragma once

#include "tests/module/PlainTicket.h"
#include <utility>

using PLAIN_ADDRESS = std::pair<int, int>;  // type and id

// Whole keys, and beginnings of keys with a "*" behind them; none: every key.
struct PLAIN_FILTER
{
    std::vector<std::string> keys{};

    bool Selects(std::string const& key) const;
};

class PLAIN_NOTIFICATIONS
{
public:
    // Gives the number of the client; one after the other is numbered from 0, and its id is told.
    std::size_t Add(int id);
    void End(std::size_t client);  // takes back what waits

    void Enable(std::size_t client, PLAIN_ADDRESS tickets, PLAIN_FILTER keys);
    void Disable(std::size_t client, PLAIN_ADDRESS tickets);  // takes back what nobody wants any more

    void Created(PLAIN_ADDRESS ticket) { Post({"created", ticket, {}}); }
    void Deleted(PLAIN_ADDRESS ticket) { Post({"deleted", ticket, {}}); }
    void Written(PLAIN_ADDRESS ticket, std::vector<PLAIN_CHANGE> const& changes);
    void TransferEnded(std::size_t client, int code, std::vector<PLAIN_CHANGE> const& records);

    void Hold() { m_isHeld = true; }
    void Release();
    bool IsHeld() const { return m_isHeld; }

    // What has come since it was last asked for, a line each, by client.
    std::string News();

private:
    struct NOTIFICATION
    {
        std::string kind;
        PLAIN_ADDRESS ticket;
        std::vector<PLAIN_CHANGE> changes;

        bool IsTransfer() const { return kind == "ended"; }
        std::string Text() const;
    };
    struct CLIENT_MODEL
    {
        int id;
        bool isGone = false;
        std::map<PLAIN_ADDRESS, PLAIN_FILTER> wanted{};
        std::string news{};

        bool Wants(PLAIN_ADDRESS ticket) const;
        bool Wants(PLAIN_ADDRESS ticket, std::string const& key) const;
    };

    void Post(NOTIFICATION const& notification);
    void Withdraw(std::size_t client);
    void Give(std::size_t client, NOTIFICATION notification);

    std::vector<CLIENT_MODEL> m_clients;
    std::vector<std::pair<std::size_t, NOTIFICATION>> m_waiting;
    bool m_isHeld = false;
};
