// One login at the server: who it is, and whether it still is. Several threads may use one.
#pragma once

#include "standin/server/Storage.h"
#include <atomic>
#include <utility>

namespace standin
{
inline constexpr int AdministratorRole = 16;

class Session
{
public:
    Session(unsigned long long number, User user) : m_number(number), m_user(std::move(user)) {}

    unsigned long long Number() const { return m_number; }  // 1 and up, none twice in a server's life
    User const& Who() const { return m_user; }
    bool IsAdministrator() const { return m_user.role == AdministratorRole; }

    bool Ended() const { return m_ended.load(std::memory_order_acquire); }
    bool End() { return !m_ended.exchange(true, std::memory_order_acq_rel); }  // false if it had ended before

private:
    unsigned long long const m_number;
    User const m_user;
    std::atomic<bool> m_ended{false};
};
}  // namespace standin
