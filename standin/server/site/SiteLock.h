// One process owns a site at a time. The lock is the operating system's, on the file site.lock in the
// site's folder; it goes with the process, however that ends, and the file stays. It holds the number and
// the name of the owner, for people and for the message that a second process gets.
#pragma once

#include <filesystem>

namespace standin
{
class SiteLock
{
public:
    // Throws StorageError when another process, or another SiteLock of this one, has the site.
    explicit SiteLock(std::filesystem::path const& folder);
    ~SiteLock();
    SiteLock(SiteLock const&) = delete;
    SiteLock& operator=(SiteLock const&) = delete;

private:
    int m_descriptor;  // closed in programs that this process starts, so that they do not hold the site
};
}  // namespace standin
