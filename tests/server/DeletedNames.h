// What is deleted in a folder, in this order, from the making of this on.
#pragma once

#include "standin/server/files/Descriptor.h"
#include <filesystem>
#include <gtest/gtest.h>
#include <string>
#include <sys/inotify.h>
#include <unistd.h>
#include <vector>

class DeletedNames
{
public:
    explicit DeletedNames(std::filesystem::path const& folder)
    {
        EXPECT_GE(inotify_add_watch(m_watch.Number(), folder.c_str(), IN_DELETE), 0);
    }

    std::vector<std::string> SoFar()
    {
        alignas(inotify_event) char events[16384];
        auto const size = read(m_watch.Number(), events, sizeof events);
        for (char const* at = events; at < events + size;)
        {
            auto const* const event = reinterpret_cast<inotify_event const*>(at);
            if (event->mask & IN_DELETE)  // the folder's own end comes, too
                m_names.emplace_back(event->name);
            at += sizeof(inotify_event) + event->len;
        }
        return m_names;
    }

private:
    standin::Descriptor m_watch{inotify_init1(IN_CLOEXEC | IN_NONBLOCK)};
    std::vector<std::string> m_names;
};
