#include "standin/server/sessions/Session.h"

namespace standin
{
void Session::Limit(TicketAddress address, KeyFilter keys)
{
    std::lock_guard const lock(m_lock);
    if (keys.SelectsAll())
        m_limits.erase(address);
    else
        m_limits[address] = std::make_shared<KeyFilter const>(std::move(keys));
    m_limited.store(!m_limits.empty(), std::memory_order_release);
}

void Session::KeepTexts(std::shared_ptr<TextReader const> lease)
{
    std::lock_guard const lock(m_lock);
    m_texts.swap(lease);
}

std::shared_ptr<TextReader const> Session::HoldTexts() const
{
    std::lock_guard const lock(m_lock);
    return m_texts;
}

void Session::SetEndPoint(std::string endPoint)
{
    std::lock_guard const lock(m_lock);
    m_endPoint = std::move(endPoint);
}

std::string Session::EndPoint() const
{
    std::lock_guard const lock(m_lock);
    return m_endPoint;
}

void Session::SetFolder(ClientFolder which, std::filesystem::path folder)
{
    std::lock_guard const lock(m_lock);
    m_folders[which] = std::move(folder);
}

std::filesystem::path Session::Folder(ClientFolder which) const
{
    std::lock_guard const lock(m_lock);
    auto const folder = m_folders.find(which);
    return folder == m_folders.end() ? std::filesystem::path() : folder->second;
}

std::shared_ptr<KeyFilter const> Session::LimitOf(TicketAddress address) const
{
    if (!IsLimited())
        return nullptr;
    std::lock_guard const lock(m_lock);
    auto const limit = m_limits.find(address);
    return limit == m_limits.end() ? nullptr : limit->second;
}
}  // namespace standin
