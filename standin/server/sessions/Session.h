// One login at the server: who it is, whether it still is, and which keys of its tickets it wants to see.
// Several threads may use one.
#pragma once

#include "standin/server/store/Store.h"
#include "standin/server/tickets/KeyFilter.h"
#include "standin/server/tickets/TextReader.h"
#include <atomic>
#include <filesystem>
#include <map>
#include <memory>
#include <mutex>
#include <utility>

namespace standin
{
inline constexpr int AdministratorRole = 16;

class Session
{
public:
    Session(unsigned long long number, User user) : m_number(number), m_user(std::move(user)) {}

    unsigned long long Number() const { return m_number; }  // 1 and up, none twice in the life of a site
    User const& Who() const { return m_user; }
    bool IsAdministrator() const { return m_user.role == AdministratorRole; }

    bool Ended() const { return m_ended.load(std::memory_order_acquire); }
    bool End() { return !m_ended.exchange(true, std::memory_order_acq_rel); }  // false if it had ended before

    // Of the texts of tickets. They are kept for the session while anybody holds them: the session itself, to
    // the end of the logout, and calls that use more than one text. Null once it has let go.
    TextReader& Reader() const { return m_reader; }
    void KeepTexts(std::shared_ptr<TextReader const> lease);
    std::shared_ptr<TextReader const> HoldTexts() const;
    void ReleaseTexts() { KeepTexts(nullptr); }

    // Where the client is, as "address:port"; empty until it is told.
    void SetEndPoint(std::string endPoint);
    std::string EndPoint() const;

    // The client's own folders for what the server draws of its jobs; empty until they are told.
    enum ClientFolder
    {
        PreviewFolder,
        ThumbnailFolder,
    };
    void SetFolder(ClientFolder which, std::filesystem::path folder);
    std::filesystem::path Folder(ClientFolder which) const;

    // Limits what the session reads, walks over and writes of whatever ticket has that address. A filter that
    // selects every key lifts the limit.
    void Limit(TicketAddress address, KeyFilter keys);

    bool IsLimited() const { return m_limited.load(std::memory_order_acquire); }  // of any ticket

    // Null if the session sees the ticket whole.
    std::shared_ptr<KeyFilter const> LimitOf(TicketAddress address) const;

private:
    unsigned long long const m_number;
    User const m_user;
    std::atomic<bool> m_ended{false};
    TextReader mutable m_reader;

    mutable std::mutex m_lock;
    std::map<TicketAddress, std::shared_ptr<KeyFilter const>> m_limits;
    std::shared_ptr<TextReader const> m_texts;
    std::string m_endPoint;
    std::map<ClientFolder, std::filesystem::path> m_folders;
    std::atomic<bool> m_limited{false};  // spares sessions without limits the lock
};
}  // namespace standin
